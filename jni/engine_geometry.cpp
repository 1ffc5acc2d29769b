// Engine methods of the geometry: quarter turns and flips, free rotation,
// straighten, crop, mirror, twirl and sphericity.
//
// Methods whose output has another size than the input check the output
// array against the size the operation writes (rotateN's dstWidth x
// dstHeight, the straighten canvas, the mirror's getMirrorOutwidth x
// getMirrorOutheight) before anything is pinned.
#include <climits>
#include <cstring>

#include "bridge.h"
#include "effect/geometry/px_geometry.h"
#include "effect/kalo/px_log.h"
#include "effect/kalo/px_mem.h"

namespace {
// A second picture size of the call (the output's), checked like the first.
bool other_size(const bridge::Call& call, jint width, jint height, const char* what) {
  if (width <= 0 || height <= 0 || static_cast<long long>(width) * height > INT_MAX / 4) {
    px_log_refusal(call.method(), "%s size %dx%d is not positive or too large", what, width, height);
    return false;
  }
  return true;
}

size_t area(jint width, jint height) { return static_cast<size_t>(width) * static_cast<size_t>(height); }

// The canvas methods of straighten: source and canvas of their own sizes.
template <class Op>
void canvas(JNIEnv* env, const char* func, jintArray in, jint srcWidth, jint srcHeight, jintArray out, jint dstWidth,
            jint dstHeight, Op op) {
  bridge::Call call(env, func);
  if (!call.picture(srcWidth, srcHeight) || !other_size(call, dstWidth, dstHeight, "canvas")) return;
  if (!call.check(in, call.pixels(), "in") || !call.check(out, area(dstWidth, dstHeight), "out")) return;
  jint* src = call.pin(in, JNI_ABORT, bridge::kReads);
  jint* dst = call.pin(out, JNI_ABORT, bridge::kWrites);
  if (!src || !dst) return;
  op(src, dst);
}

// Twirl and sphericity: the output receives a copy of the input, then the
// circle is distorted over the rectangle (clipped to the picture).
template <class Op>
jint circle(JNIEnv* env, const char* func, jintArray in, jintArray out, jint width, jint height, jobject rect,
            Op op) {
  bridge::Call call(env, func);
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r)) return PX_ERR_NULL;
  if (!call.check(in, call.pixels(), "in") || !call.check(out, call.pixels(), "out")) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, bridge::kReads);
  jint* dst = call.pin(out, 0, bridge::kWrites);
  if (!src || !dst) return PX_ERR_ALLOC;
  return op(src, dst, r);
}
}  // namespace

ENGINE_METHOD(jint, runRotateFlip)
(JNIEnv* env, jobject, jintArray pixels, jint width, jint height, jint rotation, jboolean flipHorizontal,
 jboolean flipVertical) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(pixels, call.pixels(), "pixels")) return PX_ERR_NULL;
  if (rotation < 0 || rotation > 4) {
    px_log_refusal(call.method(), "rotation code %d is outside 0..4", rotation);
    return PX_ERR_NULL;
  }
  jint* px = call.pin(pixels, 0, bridge::kWrites);
  if (!px) return PX_ERR_ALLOC;
  int* buffer = static_cast<int*>(px_calloc(call.pixels(), 4));
  if (!buffer) return PX_ERR_ALLOC;
  if (px_rotate_flip(px, buffer, width, height, rotation, flipHorizontal, flipVertical) == 1) {
    std::memcpy(px, buffer, call.pixels() * 4);
  }
  px_free(buffer);
  return PX_OK;
}

ENGINE_METHOD(jint, runRotateN)
(JNIEnv* env, jobject, jintArray src, jbyteArray srcMask, jintArray dst, jbyteArray dstMask, jint srcWidth,
 jint srcHeight, jint dstWidth, jint dstHeight, jint angle, jobject rect, jint divisorX, jint divisorY) {
  bridge::Call call(env, __func__);
  px_rect r;
  if (!call.picture(srcWidth, srcHeight) || !other_size(call, dstWidth, dstHeight, "output")) return PX_ERR_NULL;
  if (!call.rect(rect, &r)) return PX_ERR_NULL;
  if (px_rect_empty(r)) {
    call.refuse("rectangle is empty: no region to rotate");
    return PX_ERR_NULL;
  }
  if (divisorX == 0 || divisorY == 0) {
    px_log_refusal(call.method(), "divisor %d, %d must not be 0", divisorX, divisorY);
    return PX_ERR_NULL;
  }
  const size_t in_n = call.pixels(), out_n = area(dstWidth, dstHeight);
  if (!call.check(src, in_n, "src") || !call.check(srcMask, in_n, "srcMask") || !call.check(dst, out_n, "dst") ||
      !call.check(dstMask, out_n, "dstMask")) {
    return PX_ERR_NULL;
  }
  jint* s = call.pin(src, 0, bridge::kReads);
  jbyte* sm = call.pin(srcMask, 0, bridge::kReads);
  jint* d = call.pin(dst, 0, bridge::kWrites);
  jbyte* dm = call.pin(dstMask, 0, bridge::kWrites);
  if (!s || !sm || !d || !dm) return PX_ERR_ALLOC;
  px_rotate_n(s, reinterpret_cast<unsigned char*>(sm), d, reinterpret_cast<unsigned char*>(dm), srcWidth, srcHeight,
              dstWidth, dstHeight, angle, r.left, r.right, r.top, r.bottom, divisorX, divisorY);
  return PX_OK;
}

ENGINE_METHOD(jint, getRotateWidth)(JNIEnv*, jobject, jint width, jint height, jint angle) {
  return px_get_rotate_width(width, height, angle);
}
ENGINE_METHOD(jint, getRotateHeight)(JNIEnv*, jobject, jint width, jint height, jint angle) {
  return px_get_rotate_height(width, height, angle);
}

ENGINE_METHOD(void, runStraighten)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint angle, jfloat scale) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_straighten(src, dst, width, height, angle, scale); });
}

ENGINE_METHOD(void, runStraightenOnMove)
(JNIEnv* env, jobject, jintArray in, jint srcWidth, jint srcHeight, jintArray out, jint dstWidth, jint dstHeight,
 jint angle, jfloat scale) {
  canvas(env, __func__, in, srcWidth, srcHeight, out, dstWidth, dstHeight, [&](int* src, int* dst) {
    px_straighten_move(src, srcWidth, srcHeight, dst, dstWidth, dstHeight, angle, scale);
  });
}

ENGINE_METHOD(void, runStraightenOnUp)
(JNIEnv* env, jobject, jintArray in, jint srcWidth, jint srcHeight, jintArray out, jint dstWidth, jint dstHeight,
 jint angle, jfloat scale) {
  canvas(env, __func__, in, srcWidth, srcHeight, out, dstWidth, dstHeight, [&](int* src, int* dst) {
    px_straighten_up(src, srcWidth, srcHeight, dst, dstWidth, dstHeight, angle, scale);
  });
}

ENGINE_METHOD(jint, runCrop)(JNIEnv* env, jobject, jintArray pixels, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r)) return PX_ERR_NULL;
  if (!call.check(pixels, call.pixels(), "pixels")) return PX_ERR_NULL;
  jint* px = call.pin(pixels, 0, bridge::kWrites);
  if (!px) return PX_ERR_ALLOC;
  int* buffer = static_cast<int*>(px_calloc(call.pixels(), 4));
  if (!buffer) return PX_ERR_ALLOC;
  // An empty rectangle copies nothing: the picture becomes all zeros.
  if (px_crop(px, buffer, width, height, r.left, r.right, r.top, r.bottom)) {
    std::memcpy(px, buffer, call.pixels() * 4);
  }
  px_free(buffer);
  return PX_OK;
}

ENGINE_METHOD(jint, getMirrorOutwidth)(JNIEnv*, jobject, jint width, jint pos, jint mode, jint axis) {
  return px_get_mirror_out_width(width, pos, mode, axis);
}
ENGINE_METHOD(jint, getMirrorOutheight)(JNIEnv*, jobject, jint height, jint pos, jint mode, jint axis) {
  return px_get_mirror_out_height(height, pos, mode, axis);
}

ENGINE_METHOD(jint, runMirror)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint pos, jint mode, jint axis) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height)) return PX_ERR_NULL;
  const jint ow = px_get_mirror_out_width(width, pos, mode, axis);
  const jint oh = px_get_mirror_out_height(height, pos, mode, axis);
  if (!other_size(call, ow, oh, "mirrored")) return PX_ERR_NULL;
  if (!call.check(in, call.pixels(), "in") || !call.check(out, area(ow, oh), "out")) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, bridge::kReads);
  jint* dst = call.pin(out, 0, bridge::kWrites);
  if (!src || !dst) return PX_ERR_ALLOC;
  return px_mirror(src, width, height, dst, ow, oh, pos, mode, axis);
}

ENGINE_METHOD(jint, runTwirl)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint centerX, jint centerY, jint radius,
 jint angle, jobject rect, jboolean half) {
  return circle(env, __func__, in, out, width, height, rect, [&](int* src, int* dst, const px_rect& r) {
    return px_twirl(src, dst, width, height, centerX, centerY, radius, angle, r.left, r.right, r.top, r.bottom, half);
  });
}

ENGINE_METHOD(jint, runSphericity)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint centerX, jint centerY, jint radius,
 jint strength, jobject rect, jboolean half) {
  return circle(env, __func__, in, out, width, height, rect, [&](int* src, int* dst, const px_rect& r) {
    return px_sphericity(src, dst, width, height, centerX, centerY, radius, strength, r.left, r.right, r.top,
                         r.bottom, half);
  });
}
