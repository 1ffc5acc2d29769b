// Engine methods of the filters: texture overlays, tone-curve looks and
// shader-style effects. Whole-picture methods (family E) take (in, out,
// [textures...], width, height); partial methods (family D) take (in, mask,
// out, [textures...], width, height, rect). No status is returned; refused
// arguments are logged and nothing is written.
#include <initializer_list>

#include "bridge.h"
#include "effect/px_filter/px_filter.h"
#include "effect/px_gpu_effects/px_gpu_effects.h"

namespace {

constexpr int kMaxTextures = 3;

// Pinned arguments handed to a filter.
struct Args {
  int* in;
  unsigned char* mask;
  int* out;
  int* tex[kMaxTextures];
  int width;
  int height;
  px_rect rect;
};

// Checks every array against the picture size before pinning any, then
// pins (all released with mode 2) and runs op(args). `partial` reads the
// rectangle; the mask is needed only for a non-empty rectangle, or always
// when `mask_always` (for a filter that writes the mask).
template <class Op>
void run(bridge::Call& call, jintArray in, jbyteArray mask, jintArray out, std::initializer_list<jintArray> textures,
         jint width, jint height, jobject rect, bool partial, Op op, bool mask_always = false) {
  Args a{};
  a.rect = px_rect{0, -1, 0, -1};
  if (!call.picture(width, height)) return;
  if (partial && !call.rect(rect, &a.rect)) return;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return;
  const bool need_mask = partial && (mask_always || !px_rect_empty(a.rect));
  if (need_mask && !call.check(mask, n, "mask")) return;
  for (jintArray t : textures) {
    if (!call.check(t, n, "texture")) return;
  }
  a.in = call.pin(in, JNI_ABORT, bridge::kReads);
  if (!a.in) return;
  if (partial && mask) {
    jbyte* m = call.pin(mask, JNI_ABORT, mask_always ? bridge::kWrites : bridge::kReads);
    if (!m) return;
    a.mask = reinterpret_cast<unsigned char*>(m);
  }
  int k = 0;
  for (jintArray t : textures) {
    a.tex[k] = call.pin(t, JNI_ABORT, bridge::kReads);
    if (!a.tex[k++]) return;
  }
  a.out = call.pin(out, JNI_ABORT, bridge::kWrites);
  if (!a.out) return;
  a.width = width;
  a.height = height;
  op(a);
}

using WholeFn = void (*)(int*, int*, int, int);
using PartialFn = void (*)(int*, unsigned char*, int*, int, int, int, int, int, int);

void whole(JNIEnv* env, const char* func, jintArray in, jintArray out, jint w, jint h, WholeFn fn) {
  bridge::Call call(env, func);
  run(call, in, nullptr, out, {}, w, h, nullptr, false,
      [&](const Args& a) { fn(a.in, a.out, a.width, a.height); });
}

void partial(JNIEnv* env, const char* func, jintArray in, jbyteArray mask, jintArray out, jint w, jint h,
             jobject rect, PartialFn fn) {
  bridge::Call call(env, func);
  run(call, in, mask, out, {}, w, h, rect, true, [&](const Args& a) {
    fn(a.in, a.mask, a.out, a.width, a.height, a.rect.left, a.rect.right, a.rect.top, a.rect.bottom);
  });
}

}  // namespace

#define FILTER_WHOLE(name, fn)                                                                  \
  ENGINE_METHOD(void, name)(JNIEnv * env, jobject, jintArray in, jintArray out, jint w, jint h) { \
    whole(env, __func__, in, out, w, h, fn);                                                    \
  }
#define FILTER_PARTIAL(name, fn)                                                                    \
  ENGINE_METHOD(void, name)                                                                         \
  (JNIEnv * env, jobject, jintArray in, jbyteArray mask, jintArray out, jint w, jint h, jobject rect) { \
    partial(env, __func__, in, mask, out, w, h, rect, fn);                                          \
  }

// ---- tone-curve looks --------------------------------------------------------

FILTER_WHOLE(applyRetro, px_apply_retro)
FILTER_WHOLE(applyYellowglow, px_apply_yellowglow)
FILTER_WHOLE(applyNostalgia, px_apply_nostalgia)
FILTER_WHOLE(applyBluewash, px_apply_bluewash)
FILTER_WHOLE(applySunshine, px_apply_sunshine)
FILTER_WHOLE(applyOldPhoto, px_apply_oldphoto)
FILTER_WHOLE(applyDownlight, px_apply_downlight)
FILTER_WHOLE(applyPopArt, px_apply_popart)
FILTER_WHOLE(applySoftglow, px_softglow)
FILTER_WHOLE(applySharpen, px_apply_sharpen_all)

FILTER_PARTIAL(applyRetroPartial, px_apply_retro_partial)
FILTER_PARTIAL(applyYellowglowPartial, px_apply_yellowglow_partial)
FILTER_PARTIAL(applyNostalgiaPartial, px_apply_nostalgia_partial)
FILTER_PARTIAL(applyBluewashPartial, px_apply_bluewash_partial)
FILTER_PARTIAL(applySunshinePartial, px_apply_sunshine_partial)
FILTER_PARTIAL(applyVintagePartial, px_apply_vintage_partial)
FILTER_PARTIAL(applyOldPhotoPartial, px_apply_oldphoto_partial)
FILTER_PARTIAL(applyDownlightPartial, px_apply_downlight_partial)
FILTER_PARTIAL(applySoftglowPartial, px_softglow_partial)

// Sharpen's masked form rewrites the caller's mask for an empty rectangle
// (all 1 during the run, all 0 after it), so a given mask is checked and
// written back even then. Without a mask an empty rectangle sharpens all.
ENGINE_METHOD(void, applySharpenPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint w, jint h, jobject rect) {
  bridge::Call call(env, __func__);
  run(
      call, in, mask, out, {}, w, h, rect, true,
      [&](const Args& a) {
        px_apply_sharpen(a.in, a.mask, a.out, a.width, a.height, a.rect.left, a.rect.right, a.rect.top,
                         a.rect.bottom);
      },
      mask != nullptr);
}

// ---- texture overlays ----------------------------------------------------------

ENGINE_METHOD(void, applyDawnCast)
(JNIEnv* env, jobject, jintArray in, jintArray out, jintArray overlay, jintArray screen, jint w, jint h) {
  bridge::Call call(env, __func__);
  run(call, in, nullptr, out, {overlay, screen}, w, h, nullptr, false, [&](const Args& a) {
    px_apply_dawncast_texture(a.in, a.out, a.tex[0], a.tex[1], a.width, a.height);
  });
}

ENGINE_METHOD(void, applyDawnCastPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jintArray overlay, jintArray screen, jint w,
 jint h, jobject rect) {
  bridge::Call call(env, __func__);
  run(call, in, mask, out, {overlay, screen}, w, h, rect, true, [&](const Args& a) {
    px_apply_dawncast_texture_partial(a.in, a.out, a.tex[0], a.tex[1], a.mask, a.width, a.height, a.rect.left,
                                      a.rect.right, a.rect.top, a.rect.bottom);
  });
}

#define TEXTURE_FILTER(name, fn)                                                                              \
  ENGINE_METHOD(void, name)                                                                                   \
  (JNIEnv * env, jobject, jintArray in, jintArray out, jintArray texture, jint w, jint h) {                   \
    bridge::Call call(env, __func__);                                                                         \
    run(call, in, nullptr, out, {texture}, w, h, nullptr, false,                                              \
        [&](const Args& a) { fn(a.in, a.out, a.tex[0], a.width, a.height); });                                \
  }                                                                                                           \
  ENGINE_METHOD(void, name##Partial)                                                                          \
  (JNIEnv * env, jobject, jintArray in, jbyteArray mask, jintArray out, jintArray texture, jint w, jint h,     \
   jobject rect) {                                                                                            \
    bridge::Call call(env, __func__);                                                                         \
    run(call, in, mask, out, {texture}, w, h, rect, true, [&](const Args& a) {                                \
      fn##_partial(a.in, a.out, a.tex[0], a.mask, a.width, a.height, a.rect.left, a.rect.right, a.rect.top,   \
                   a.rect.bottom);                                                                            \
    });                                                                                                       \
  }

TEXTURE_FILTER(applyLightStreak, px_apply_lightstreak_texture)
TEXTURE_FILTER(applyStardust, px_apply_stardust_texture)
TEXTURE_FILTER(applySunburst, px_apply_sunburst_texture)
TEXTURE_FILTER(applyLightFlare, px_apply_lightflare_texture)
TEXTURE_FILTER(applyOldPhotoTexture, px_apply_oldphoto_texture)

// ---- shader-style effects --------------------------------------------------------

FILTER_WHOLE(applyTurquoise, gpu_Turquoise)
FILTER_WHOLE(applyRainbow, gpu_rainbow)
FILTER_WHOLE(applyGothicNoir, gpu_gothicnoir)
FILTER_WHOLE(applyVignette, gpu_vignette)
FILTER_PARTIAL(applyTurquoisePartial, gpu_Turquoise_partial)
FILTER_PARTIAL(applyRainbowPartial, gpu_rainbow_partial)
FILTER_PARTIAL(applyGothicNoirPartial, gpu_gothicnoir_partial)
FILTER_PARTIAL(applyVignettePartial, gpu_vignette_partial)

#define GPU_TEXTURE(name, fn)                                                                                 \
  ENGINE_METHOD(void, name)                                                                                   \
  (JNIEnv * env, jobject, jintArray in, jintArray out, jintArray texture, jint w, jint h) {                   \
    bridge::Call call(env, __func__);                                                                         \
    run(call, in, nullptr, out, {texture}, w, h, nullptr, false,                                              \
        [&](const Args& a) { fn(a.in, a.out, a.tex[0], a.width, a.height); });                                \
  }                                                                                                           \
  ENGINE_METHOD(void, name##Partial)                                                                          \
  (JNIEnv * env, jobject, jintArray in, jbyteArray mask, jintArray out, jintArray texture, jint w, jint h,     \
   jobject rect) {                                                                                            \
    bridge::Call call(env, __func__);                                                                         \
    run(call, in, mask, out, {texture}, w, h, rect, true, [&](const Args& a) {                                \
      fn##_partial(a.in, a.mask, a.out, a.tex[0], a.width, a.height, a.rect.left, a.rect.right, a.rect.top,   \
                   a.rect.bottom);                                                                            \
    });                                                                                                       \
  }

GPU_TEXTURE(applyRugged, gpu_rugged)
GPU_TEXTURE(applyOilPastel, gpu_oilPastel)
GPU_TEXTURE(applyNoirNote, gpu_noirNote)

ENGINE_METHOD(void, applyImpressionist)
(JNIEnv* env, jobject, jintArray in, jintArray out, jintArray strokes, jintArray canvas, jint w, jint h) {
  bridge::Call call(env, __func__);
  run(call, in, nullptr, out, {strokes, canvas}, w, h, nullptr, false,
      [&](const Args& a) { gpu_impressionist(a.in, a.out, a.tex[0], a.tex[1], a.width, a.height); });
}

ENGINE_METHOD(void, applyImpressionistPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jintArray strokes, jintArray canvas, jint w,
 jint h, jobject rect) {
  bridge::Call call(env, __func__);
  run(call, in, mask, out, {strokes, canvas}, w, h, rect, true, [&](const Args& a) {
    gpu_impressionist_partial(a.in, a.mask, a.out, a.tex[0], a.tex[1], a.width, a.height, a.rect.left, a.rect.right,
                              a.rect.top, a.rect.bottom);
  });
}

ENGINE_METHOD(void, applyStucchevole)
(JNIEnv* env, jobject, jintArray in, jintArray out, jintArray glow, jintArray paper, jintArray sparkle, jint w,
 jint h) {
  bridge::Call call(env, __func__);
  run(call, in, nullptr, out, {glow, paper, sparkle}, w, h, nullptr, false, [&](const Args& a) {
    gpu_stucchevole(a.in, a.out, a.tex[0], a.tex[1], a.tex[2], a.width, a.height);
  });
}

ENGINE_METHOD(void, applyStucchevolePartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jintArray glow, jintArray paper,
 jintArray sparkle, jint w, jint h, jobject rect) {
  bridge::Call call(env, __func__);
  run(call, in, mask, out, {glow, paper, sparkle}, w, h, rect, true, [&](const Args& a) {
    gpu_stucchevole_partial(a.in, a.mask, a.out, a.tex[0], a.tex[1], a.tex[2], a.width, a.height, a.rect.left,
                            a.rect.right, a.rect.top, a.rect.bottom);
  });
}
