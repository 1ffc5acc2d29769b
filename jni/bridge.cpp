#include "bridge.h"

#include <climits>
#include <cstring>

#include "effect/kalo/px_log.h"
#include "effect/kalo/px_mem.h"
#include "effect/kalo/px_parallel.h"
#include "pixel_buffers.h"

namespace bridge {

const char* method_name(const char* func) {
  static const char kPrefix[] = "Java_com_tav_android_pixara_photoretouching_jni_Engine_";
  return std::strncmp(func, kPrefix, sizeof kPrefix - 1) == 0 ? func + sizeof kPrefix - 1 : func;
}

Call::~Call() {
  for (int i = 0; i < npins_; ++i) {
    const Pin& p = pins_[i];
    if (p.ints) {
      env_->ReleaseIntArrayElements(static_cast<jintArray>(p.array), static_cast<jint*>(p.data), p.mode);
    } else {
      env_->ReleaseByteArrayElements(static_cast<jbyteArray>(p.array), static_cast<jbyte*>(p.data), p.mode);
    }
  }
}

void Call::refuse(const char* why) const { px_log_refusal(method_, "%s", why); }

bool Call::picture(jint width, jint height) {
  if (width <= 0 || height <= 0) {
    px_log_refusal(method_, "picture size %dx%d is not positive", width, height);
    return false;
  }
  // Working buffers of 4 bytes a pixel must stay addressable on 32-bit.
  if (static_cast<long long>(width) * height > INT_MAX / 4) {
    px_log_refusal(method_, "picture size %dx%d is too large", width, height);
    return false;
  }
  width_ = width;
  height_ = height;
  pixels_ = static_cast<size_t>(width) * static_cast<size_t>(height);
  return true;
}

namespace {
bool check_array(JNIEnv* env, const char* method, jarray array, size_t need, const char* what) {
  if (!array) {
    px_log_refusal(method, "%s array is null", what);
    return false;
  }
  const jsize length = env->GetArrayLength(array);
  if (length < 0 || static_cast<size_t>(length) < need) {
    px_log_refusal(method, "%s array holds %d elements, %zu needed", what, static_cast<int>(length), need);
    return false;
  }
  return true;
}

bool int_field(JNIEnv* env, jclass cls, jobject object, const char* name, jint* value) {
  jfieldID id = env->GetFieldID(cls, name, "I");
  if (!id) {
    env->ExceptionClear();
    return false;
  }
  *value = env->GetIntField(object, id);
  return true;
}
}  // namespace

bool Call::check(jintArray array, size_t need, const char* what) {
  return check_array(env_, method_, array, need, what);
}
bool Call::check(jbyteArray array, size_t need, const char* what) {
  return check_array(env_, method_, array, need, what);
}

bool Call::raw_rect(jobject object, px_rect* out) {
  if (!object) {
    refuse("rectangle is null");
    return false;
  }
  jclass cls = env_->GetObjectClass(object);
  px_rect r{};
  bool ok = int_field(env_, cls, object, "left", &r.left) && int_field(env_, cls, object, "right", &r.right) &&
            int_field(env_, cls, object, "top", &r.top) && int_field(env_, cls, object, "bottom", &r.bottom);
  env_->DeleteLocalRef(cls);
  if (!ok) {
    refuse("rectangle has no int fields left, right, top, bottom");
    return false;
  }
  *out = r;
  return true;
}

bool Call::rect(jobject object, px_rect* out) {
  px_rect r;
  if (!raw_rect(object, &r)) return false;
  if (!px_rect_empty(r)) {
    const px_rect c = px_rect_clip(r, width_, height_);
    if (px_rect_empty(c)) {
      px_log_refusal(method_, "rectangle (%d,%d)-(%d,%d) lies outside the %dx%d picture", r.left, r.top, r.right,
                     r.bottom, width_, height_);
      return false;
    }
    r = c;
  }
  *out = r;
  return true;
}

jint* Call::pin(jintArray array, jint family_mode, Access access) {
  jboolean copy = JNI_FALSE;
  jint* data = env_->GetIntArrayElements(array, &copy);
  if (!data) {
    env_->ExceptionClear();
    refuse("array could not be pinned");
    return nullptr;
  }
  const jint mode = copy ? (access == kWrites ? 0 : JNI_ABORT) : family_mode;
  pins_[npins_++] = {array, data, true, mode};
  return data;
}

jbyte* Call::pin(jbyteArray array, jint family_mode, Access access) {
  jboolean copy = JNI_FALSE;
  jbyte* data = env_->GetByteArrayElements(array, &copy);
  if (!data) {
    env_->ExceptionClear();
    refuse("array could not be pinned");
    return nullptr;
  }
  const jint mode = copy ? (access == kWrites ? 0 : JNI_ABORT) : family_mode;
  pins_[npins_++] = {array, data, false, mode};
  return data;
}

namespace {
// The effect on packed RGB copies of the picture; on success the converted
// result is left in `dst_rgb` for the caller to merge. Returns an engine code.
struct RgbBuffers {
  unsigned char* src = nullptr;
  unsigned char* dst = nullptr;
  unsigned char* result = nullptr;  // dst, or src for an effect run in place
  ~RgbBuffers() {
    px_free_large(src);
    px_free_large(dst);
  }
};

jint run_rgb_effect(Call& call, const jint* in, jint* texture, RgbBuffers& buf, const EffectRequest& request) {
  const size_t bytes = call.pixels() * 3;
  // Not zero-filled: the conversion writes every byte of src and the effect
  // every byte of dst.
  const bool in_place = request.in_place && !px_scalar_only();
  buf.src = static_cast<unsigned char*>(px_malloc_large(bytes));
  if (!in_place) buf.dst = static_cast<unsigned char*>(px_malloc_large(bytes));
  if (!buf.src || (!in_place && !buf.dst)) return PX_ERR_ALLOC;
  buf.result = in_place ? buf.src : buf.dst;
  convertIntArrayToByteArray(in, buf.src, call.width(), call.height());
  structIELImage src{call.width(), call.height(), IEL_FORMAT_RGB888, buf.src};
  structIELImage dst{call.width(), call.height(), IEL_FORMAT_RGB888, buf.result};
  structIELImage tex{call.width(), call.height(), IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(texture)};
  int32_t level = request.level;
  structIELEffectParams params{request.effect, &level, texture ? &tex : nullptr, request.touch_x, request.touch_y};
  return IEL_Apply_Effect(&src, &dst, &params) == IEL_OK ? PX_OK : PX_ERR_EFFECT;
}
}  // namespace

jint effect_rgb(Call& call, jintArray in, jintArray out, jint width, jint height, EffectRequest request,
                jintArray texture) {
  if (!call.picture(width, height)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return PX_ERR_NULL;
  if (texture && !call.check(texture, n, "texture")) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, kReads);
  jint* tex = texture ? call.pin(texture, 0, kReads) : nullptr;
  jint* dst = call.pin(out, 0, kWrites);
  if (!src || !dst || (texture && !tex)) return PX_ERR_ALLOC;
  RgbBuffers buf;
  jint rc = run_rgb_effect(call, src, tex, buf, request);
  if (rc == PX_OK) convertByteArraytoIntArray(buf.result, dst, src, width, height);
  return rc;
}

jint effect_rgb_partial(Call& call, jintArray in, jbyteArray mask, jintArray out, jint width, jint height,
                        jobject rect, EffectRequest request, jintArray texture) {
  px_rect r;
  if (!call.picture(width, height)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return PX_ERR_NULL;
  if (texture && !call.check(texture, n, "texture")) return PX_ERR_NULL;
  if (!call.rect(rect, &r)) return PX_ERR_NULL;
  if (!px_rect_empty(r) && !call.check(mask, n, "mask")) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, kReads);
  jbyte* m = mask ? call.pin(mask, JNI_ABORT, kReads) : nullptr;
  jint* tex = texture ? call.pin(texture, 0, kReads) : nullptr;
  jint* dst = call.pin(out, 0, kWrites);
  if (!src || !dst || (mask && !m) || (texture && !tex)) return PX_ERR_ALLOC;
  RgbBuffers buf;
  jint rc = run_rgb_effect(call, src, tex, buf, request);
  if (rc == PX_OK) {
    convertByteArraytoIntArrayUsingMask(buf.result, dst, src, reinterpret_cast<unsigned char*>(m), width, height, r);
  }
  return rc;
}

jint effect_argb(Call& call, jintArray in, jintArray out, jint width, jint height, EffectRequest request) {
  if (!call.picture(width, height)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (!call.check(in, n, "in") || !call.check(out, n, "out")) return PX_ERR_NULL;
  jint* src = call.pin(in, 0, kReads);
  jint* dst = call.pin(out, 0, kWrites);
  if (!src || !dst) return PX_ERR_ALLOC;
  structIELImage a{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(src)};
  structIELImage b{width, height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(dst)};
  int32_t level = request.level;
  structIELEffectParams params{request.effect, &level, nullptr, request.touch_x, request.touch_y};
  return IEL_Apply_Effect(&a, &b, &params);
}

}  // namespace bridge
