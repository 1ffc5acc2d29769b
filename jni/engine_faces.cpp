// Engine method of the face analysis: faces, eyes and mouths of a photo.
#include "bridge.h"
#include "effect/face/face_report.h"

ENGINE_METHOD(jint, analyzeFaces)
(JNIEnv* env, jobject, jintArray image, jint width, jint height, jint mode, jintArray report) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(image, call.pixels(), "image") || !call.check(report, 0, "report")) {
    return PX_ERR_NULL;
  }
  const jsize room = env->GetArrayLength(report) / PX_FACE_REPORT_INTS;
  const int max_face = room < 20 ? static_cast<int>(room) : 20;
  jint* px = call.pin(image, JNI_ABORT, bridge::kReads);
  jint* out = call.pin(report, 0, bridge::kWrites);
  if (!px || !out) return PX_ERR_ALLOC;
  const int n = px_analyze_faces(px, width, height, mode, max_face, out);
  return n < 0 ? PX_ERR_ALLOC : n;
}
