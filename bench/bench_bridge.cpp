// Engine methods timed through their exported entry points at 1 MP and
// 12 MP, with a JNI environment that hands out the arrays themselves as
// Android's runtime does, so the bridge's checks, conversions and merges are
// in the figures. Beside memcpy of the same picture (the floor).
#include <benchmark/benchmark.h>

#include "bench_jni.h"
#include "bench_picture.h"

#include "effect/kalo/iel/iel.h"
#include "pixel_buffers.h"

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

// The family A effects alone on the packed RGB of the same picture (made once,
// outside the timing), so that each Engine figure minus its effect's is what
// the bridge adds: the effects' times depend on the picture's content.
void effect_alone(benchmark::State& state, int16_t effect, int32_t level, bool in_place) {
  BenchPicture& p = bench_picture(static_cast<int>(state.range(0)));
  const size_t n = p.in.size();
  std::vector<unsigned char> rgb(n * 3), result(n * 3);
  convertIntArrayToByteArray(p.in.data(), rgb.data(), p.width, p.height);
  structIELImage src{p.width, p.height, IEL_FORMAT_RGB888, rgb.data()};
  structIELImage dst{p.width, p.height, IEL_FORMAT_RGB888, in_place ? rgb.data() : result.data()};
  structIELEffectParams params{effect, &level, nullptr, 0, 0};
  bench_run(state, [&](BenchPicture&) {
    if (IEL_Apply_Effect(&src, &dst, &params) != IEL_OK) state.SkipWithError("effect failed");
  });
}
BENCHMARK_CAPTURE(effect_alone, sepia, IEL_EFFECT_SEPIA, 15, true)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK_CAPTURE(effect_alone, posterize, IEL_EFFECT_POSTERIZE, 0, true)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK_CAPTURE(effect_alone, cartoon, IEL_EFFECT_CARTOON, 2, false)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK_CAPTURE(effect_alone, magic_pen, IEL_EFFECT_MAGIC_PEN, 0, false)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// The bridge's two conversions on their own, into buffers already touched.
void convert_to_rgb(benchmark::State& state) {
  BenchPicture& p = bench_picture(static_cast<int>(state.range(0)));
  std::vector<unsigned char> rgb(p.in.size() * 3);
  bench_run(state, [&](BenchPicture& q) { convertIntArrayToByteArray(q.in.data(), rgb.data(), q.width, q.height); });
}
void convert_from_rgb(benchmark::State& state) {
  BenchPicture& p = bench_picture(static_cast<int>(state.range(0)));
  std::vector<unsigned char> rgb(p.in.size() * 3);
  convertIntArrayToByteArray(p.in.data(), rgb.data(), p.width, p.height);
  bench_run(state, [&](BenchPicture& q) {
    convertByteArraytoIntArray(rgb.data(), q.out.data(), q.in.data(), q.width, q.height);
  });
}
BENCHMARK(convert_to_rgb)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(convert_from_rgb)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

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
