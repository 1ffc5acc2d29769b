// Engine methods that run an effect of the effect library.
#include "bridge.h"

ENGINE_METHOD(jint, applySepia)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb(call, in, out, width, height, {IEL_EFFECT_SEPIA, 15});
}

ENGINE_METHOD(jint, applySepiaPartial)
(JNIEnv* env, jobject, jintArray in, jbyteArray mask, jintArray out, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  return bridge::effect_rgb_partial(call, in, mask, out, width, height, rect, {IEL_EFFECT_SEPIA, 15});
}
