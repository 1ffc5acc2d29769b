// The bridge's calling machinery. Every native method of Engine is written
// with ENGINE_METHOD and one of the family helpers below, which check the
// arguments once at the boundary, pin the Java arrays, call one engine
// operation and release the arrays with the family's mode.
//
// Checks (beyond null arrays): width and height must be positive and
// width * height * 4 must fit in 31 bits; every array must hold at least the
// elements the operation touches. A refused call logs one line and returns
// 40962 where the method reports a status; nothing is pinned or written.
// A rectangle reaching outside the picture is clipped to it; a non-empty one
// wholly outside it is refused.
//
// Release modes: mode 2 (JNI_ABORT) only delivers results where the runtime
// hands out the array itself, as Android's does. When the runtime reports a
// copy, an array the operation writes is released with mode 0 and one it
// only reads with mode 2; where it reports no copy, the family's mode is kept.
#pragma once

#include <jni.h>

#include <cstddef>

#include "effect/kalo/iel/iel.h"
#include "effect/px_types.h"

#define ENGINE_METHOD(ret, name) \
  extern "C" JNIEXPORT ret JNICALL Java_com_tav_android_pixara_photoretouching_jni_Engine_##name

namespace bridge {

// The Java method name of an exported function (__func__ without its prefix).
const char* method_name(const char* func);

enum Access { kReads, kWrites };

// One native call: argument checks, then pins released in pinning order when
// the call object goes out of scope.
class Call {
 public:
  Call(JNIEnv* env, const char* func) : env_(env), method_(method_name(func)) {}
  ~Call();
  Call(const Call&) = delete;
  Call& operator=(const Call&) = delete;

  // Validates a picture size; remembers width * height.
  bool picture(jint width, jint height);
  size_t pixels() const { return pixels_; }
  jint width() const { return width_; }
  jint height() const { return height_; }

  // Checks an array for null and for at least `need` elements (logging the
  // refusal). Call these for every array before pinning any.
  bool check(jintArray array, size_t need, const char* what);
  bool check(jbyteArray array, size_t need, const char* what);

  // Reads the Java rectangle's int fields "left", "right", "top", "bottom"
  // (in that order), clipped to the picture. False (logged) for a null
  // object, missing fields, or a non-empty rectangle wholly outside.
  bool rect(jobject object, px_rect* out);
  // The same fields as they stand, without clipping (a paste position or a
  // source region may reach outside a picture). False (logged) for a null
  // object or missing fields.
  bool raw_rect(jobject object, px_rect* out);

  // Pins an array (GetXArrayElements with a null copy flag). Null when it
  // could not be pinned (logged; the pending exception is cleared).
  jint* pin(jintArray array, jint family_mode, Access access);
  jbyte* pin(jbyteArray array, jint family_mode, Access access);

  // Logs a refusal of this call.
  void refuse(const char* why) const;
  const char* method() const { return method_; }
  JNIEnv* env() const { return env_; }

 private:
  struct Pin {
    jarray array;
    void* data;
    bool ints;
    jint mode;
  };
  JNIEnv* env_;
  const char* method_;
  jint width_ = 0, height_ = 0;
  size_t pixels_ = 0;
  Pin pins_[6] = {};
  int npins_ = 0;
};

// ---- families --------------------------------------------------------------

// What to ask of the effect library.
struct EffectRequest {
  int16_t effect;
  int32_t level;
  int32_t touch_x = 0;
  int32_t touch_y = 0;
  // The effect reads each pixel before writing it and nothing else: on the
  // fast path it runs on one packed RGB buffer in place (half the memory).
  bool in_place = false;
};

// Family A: the picture converted to packed RGB, one effect on the copy,
// converted back with the input's alpha. `texture` (ARGB, picture size) is
// checked and described only when given. 40960, 40962, 40961 or 40971.
jint effect_rgb(Call& call, jintArray in, jintArray out, jint width, jint height, EffectRequest request,
                jintArray texture = nullptr);

// Family C: as family A, then merged into the output where the mask byte is 1
// inside a non-empty rectangle (the untouched input elsewhere).
jint effect_rgb_partial(Call& call, jintArray in, jbyteArray mask, jintArray out, jint width, jint height,
                        jobject rect, EffectRequest request, jintArray texture = nullptr);

// Family B: the effect library on the caller's ARGB pixels. Returns the
// effect library's own code.
jint effect_argb(Call& call, jintArray in, jintArray out, jint width, jint height, EffectRequest request);

// Arguments handed to a region operation (family D).
struct Region {
  int* in;
  unsigned char* mask;
  int* out;
  int width;
  int height;
  px_rect rect;
  int* texture;  // only for the texture members
};

// Family D: region operation, no status; all arrays released with mode 2.
template <class Op>
void region(Call& call, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect, Op op,
            jintArray texture = nullptr) {
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r)) return;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return;
  if (!px_rect_empty(r) && !call.check(mask, n, "mask")) return;
  if (texture && !call.check(texture, n, "texture")) return;
  jint* src = call.pin(in, JNI_ABORT, kReads);
  jbyte* m = mask ? call.pin(mask, JNI_ABORT, kReads) : nullptr;
  jint* tex = texture ? call.pin(texture, JNI_ABORT, kReads) : nullptr;
  jint* dst = call.pin(out, JNI_ABORT, kWrites);
  if (!src || !dst || (mask && !m) || (texture && !tex)) return;
  op(Region{src, reinterpret_cast<unsigned char*>(m), dst, width, height, r, tex});
}

// Family E: whole-picture operation on ARGB, no status, mode 2.
// op(int* in, int* out).
template <class Op>
void whole(Call& call, jintArray in, jintArray out, jint width, jint height, Op op) {
  if (!call.picture(width, height)) return;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return;
  jint* src = call.pin(in, JNI_ABORT, kReads);
  jint* dst = call.pin(out, JNI_ABORT, kWrites);
  if (!src || !dst) return;
  op(src, dst);
}

// Family F: operation with status, mode 0; returns the operation's result,
// or 40962 for refused arguments. op(int* in, int* out) -> jint.
template <class Op>
jint status(Call& call, jintArray in, jintArray out, jint width, jint height, Op op) {
  if (!call.picture(width, height)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, kReads);
  jint* dst = call.pin(out, 0, kWrites);
  if (!src || !dst) return PX_ERR_ALLOC;
  return op(src, dst);
}

// Family G: one picture changed in place; 40960, or 40962 for refused
// arguments. op(int* image).
template <class Op>
jint in_place(Call& call, jintArray image, jint width, jint height, jint mode, Op op) {
  if (!call.picture(width, height)) return PX_ERR_NULL;
  if (!call.check(image, call.pixels(), "image")) return PX_ERR_NULL;
  jint* px = call.pin(image, mode, kWrites);
  if (!px) return PX_ERR_ALLOC;
  op(px);
  return PX_OK;
}

}  // namespace bridge
