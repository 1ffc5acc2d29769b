// Engine methods timed through their exported entry points at 1 MP and
// 12 MP, with a JNI environment that hands out the arrays themselves as
// Android's runtime does, so the bridge's checks, conversions and merges are
// in the figures. Beside memcpy of the same picture (the floor).
#include <benchmark/benchmark.h>

#include "bench_jni.h"
#include "bench_picture.h"

#define JNI_FN(name) Java_com_tav_android_pixara_photoretouching_jni_Engine_##name
extern "C" {
// Effects converted to packed RGB and back (with and without mask).
jint JNI_FN(applySepia)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
jint JNI_FN(applySepiaPartial)(JNIEnv*, jobject, jintArray, jbyteArray, jintArray, jint, jint, jobject);
jint JNI_FN(applyPosterize)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
jint JNI_FN(applyCartoonize)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
jint JNI_FN(applyMagicPen)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
void JNI_FN(applyVintage)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
// Region methods.
void JNI_FN(controlBrightness)(JNIEnv*, jobject, jintArray, jbyteArray, jintArray, jint, jint, jint, jobject);
void JNI_FN(controlSaturation)(JNIEnv*, jobject, jintArray, jbyteArray, jintArray, jint, jint, jint, jobject);
void JNI_FN(controlHue)(JNIEnv*, jobject, jintArray, jbyteArray, jintArray, jint, jint, jint, jobject);
// Whole-picture methods.
jint JNI_FN(applyAutoAdjust)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
void JNI_FN(applyPointColorRed)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
void JNI_FN(applyRetro)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
void JNI_FN(applyGothicNoir)(JNIEnv*, jobject, jintArray, jintArray, jint, jint);
}

namespace {
GLIMMER_BENCH_MEMCPY();

// The picture's arrays as Java arrays, a full mask and rectangles.
struct Call {
  BenchJni jni;
  BenchPicture& p;
  jintArray in, out;
  jbyteArray mask;
  jobject whole, full;
  explicit Call(BenchPicture& picture)
      : p(picture),
        in(jni.ints(p.in)),
        out(jni.ints(p.out)),
        mask(jni.bytes(p.mask)),
        whole(jni.rect(0, 0, -1, -1)),
        full(jni.rect(0, 0, p.width - 1, p.height - 1)) {}
};

template <class Op>
void through_jni(benchmark::State& state, Op op) {
  BenchPicture& p = bench_picture(static_cast<int>(state.range(0)));
  if (p.mask[0] != 1) p.mask.assign(p.mask.size(), 1);
  Call c(p);
  bench_run(state, [&](BenchPicture&) { op(c); });
}

#define BRIDGE_BENCH(name, body)                                                   \
  void name(benchmark::State& s) { through_jni(s, [](Call& c) { body; }); } \
  BENCHMARK(name)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime()

#define PIC c.jni.env(), nullptr, c.in, c.out, c.p.width, c.p.height
#define REGION(level, rect) c.jni.env(), nullptr, c.in, c.mask, c.out, c.p.width, c.p.height, level, c.rect

BRIDGE_BENCH(applySepia, JNI_FN(applySepia)(PIC));
BRIDGE_BENCH(applySepiaPartial,
             JNI_FN(applySepiaPartial)(c.jni.env(), nullptr, c.in, c.mask, c.out, c.p.width, c.p.height, c.full));
BRIDGE_BENCH(applyPosterize, JNI_FN(applyPosterize)(PIC));
BRIDGE_BENCH(applyCartoonize, JNI_FN(applyCartoonize)(PIC));
BRIDGE_BENCH(applyMagicPen, JNI_FN(applyMagicPen)(PIC));
BRIDGE_BENCH(applyVintage, JNI_FN(applyVintage)(PIC));
BRIDGE_BENCH(controlBrightness, JNI_FN(controlBrightness)(REGION(14, whole)));
BRIDGE_BENCH(controlSaturation, JNI_FN(controlSaturation)(REGION(16, whole)));
BRIDGE_BENCH(controlSaturationMasked, JNI_FN(controlSaturation)(REGION(16, full)));
BRIDGE_BENCH(controlHue, JNI_FN(controlHue)(REGION(7, whole)));  // a turn of 126 degrees
BRIDGE_BENCH(applyAutoAdjust, JNI_FN(applyAutoAdjust)(PIC));
BRIDGE_BENCH(applyPointColorRed, JNI_FN(applyPointColorRed)(PIC));
BRIDGE_BENCH(applyRetro, JNI_FN(applyRetro)(PIC));
BRIDGE_BENCH(applyGothicNoir, JNI_FN(applyGothicNoir)(PIC));
}  // namespace

BENCHMARK_MAIN();
