// Engine methods without pictures to process: the library version and the
// saved mask and object regions.
#include "bridge.h"
#include "effect/object/px_stored_region.h"

ENGINE_METHOD(jstring, LibVersion)(JNIEnv* env, jobject) { return env->NewStringUTF(IEL_Lib_Version()); }

namespace {
// Store and recover check the picture, the array and the rectangle like every
// region method; the block copied is the rectangle clipped to the picture.
template <class Array>
jint saved_region(JNIEnv* env, const char* func, Array array, jint width, jint height, jobject rect,
                  px_stored_kind kind, bool store) {
  bridge::Call call(env, func);
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r) || !call.check(array, call.pixels(), "picture")) {
    return PX_ERR_NULL;
  }
  const int element = kind == PX_STORED_MASK ? 1 : 4;
  if (store) {
    auto* data = call.pin(array, 0, bridge::kReads);
    return data ? px_store_region(kind, data, element, width, r) : PX_ERR_ALLOC;
  }
  int saved_w = 0, saved_h = 0;
  if (!px_stored_region_size(kind, &saved_w, &saved_h)) return -1;
  auto* data = call.pin(array, 0, bridge::kWrites);
  return data ? px_recover_region(kind, data, element, width, r) : PX_ERR_ALLOC;
}
}  // namespace

ENGINE_METHOD(jint, storeMask)(JNIEnv* env, jobject, jbyteArray mask, jint width, jint height, jobject rect) {
  return saved_region(env, __func__, mask, width, height, rect, PX_STORED_MASK, true);
}
ENGINE_METHOD(jint, storeObject)(JNIEnv* env, jobject, jintArray image, jint width, jint height, jobject rect) {
  return saved_region(env, __func__, image, width, height, rect, PX_STORED_OBJECT, true);
}
ENGINE_METHOD(jint, recoverMask)(JNIEnv* env, jobject, jbyteArray mask, jint width, jint height, jobject rect) {
  return saved_region(env, __func__, mask, width, height, rect, PX_STORED_MASK, false);
}
ENGINE_METHOD(jint, recoverObject)(JNIEnv* env, jobject, jintArray image, jint width, jint height, jobject rect) {
  return saved_region(env, __func__, image, width, height, rect, PX_STORED_OBJECT, false);
}
ENGINE_METHOD(void, deleteStoredMask)(JNIEnv*, jobject) { px_delete_stored_region(PX_STORED_MASK); }
ENGINE_METHOD(void, deleteStoredObject)(JNIEnv*, jobject) { px_delete_stored_region(PX_STORED_OBJECT); }
