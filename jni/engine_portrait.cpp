// Engine methods of portrait retouching and red-eye removal.
#include "bridge.h"

#include <climits>

#include "effect/portrait/px_portrait.h"
#include "effect/portrait/px_redeye.h"

// ---- red-eye (in place or input to output; no status) ------------------------

ENGINE_METHOD(void, removeRedeye)
(JNIEnv* env, jobject, jintArray image, jint width, jint height, jint x, jint y, jint radius) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(image, call.pixels(), "image")) return;
  jint* px = call.pin(image, JNI_ABORT, bridge::kWrites);
  if (!px) return;
  px_remove_redeye_manual(px, width, height, x, y, radius);
}

ENGINE_METHOD(void, removeRedeyePreview)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint x, jint y, jint radius) {
  bridge::Call call(env, __func__);
  bridge::whole(call, in, out, width, height,
                [&](int* src, int* dst) { px_remove_redeye_manual_prev(src, dst, width, height, x, y, radius); });
}

// Automatic red-eye removal is not offered: the arrays are not touched.
ENGINE_METHOD(void, removeRedeyeAuto)(JNIEnv*, jobject, jintArray, jintArray, jint, jint) {}

// ---- portrait session ------------------------------------------------------------
// Every method that works on the session returns 40962 when none is open.

namespace {

bool session_open(bridge::Call& call) {
  if (px_portrait_session()) return true;
  call.refuse("no portrait session is open");
  return false;
}

// Full-size form: (in, out, width, height, ...) -> status, arrays mode 0.
template <class Op>
jint full(bridge::Call& call, jintArray in, jintArray out, jint width, jint height, Op op) {
  if (!session_open(call)) return PX_ERR_NULL;
  return bridge::status(call, in, out, width, height, op);
}

// Preview form: (in, width, height, out, previewWidth, previewHeight, ...):
// the picture holds width * height pixels, the preview previewWidth *
// previewHeight; both released with mode 0.
template <class Op>
jint preview(bridge::Call& call, jintArray in, jint width, jint height, jintArray out, jint pw, jint ph, Op op) {
  if (!session_open(call) || !call.picture(width, height)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (pw <= 0 || ph <= 0 || static_cast<long long>(pw) * ph > INT_MAX / 4) {
    call.refuse("preview size is not positive or too large");
    return PX_ERR_NULL;
  }
  if (!call.check(in, n, "in") || !call.check(out, static_cast<size_t>(pw) * static_cast<size_t>(ph), "preview"))
    return PX_ERR_NULL;
  jint* src = call.pin(in, 0, bridge::kReads);
  jint* dst = call.pin(out, 0, bridge::kWrites);
  if (!src || !dst) return PX_ERR_ALLOC;
  return op(src, dst);
}

}  // namespace

ENGINE_METHOD(jint, initPortrait)
(JNIEnv* env, jobject, jintArray image, jint width, jint height, jint maxFace, jint level, jint option,
 jobject listener) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(image, call.pixels(), "image")) return PX_ERR_NULL;
  jmethodID report = nullptr;
  if (listener) {
    jclass cls = env->GetObjectClass(listener);
    report = cls ? env->GetMethodID(cls, "setFaceInfo", "(I[I)V") : nullptr;
    if (cls) env->DeleteLocalRef(cls);
    if (!report) {
      if (env->ExceptionCheck()) env->ExceptionClear();
      call.refuse("the listener has no method setFaceInfo(int, int[])");
      return PX_ERR_NULL;
    }
  }
  jint* px = call.pin(image, 0, bridge::kReads);
  if (!px) return PX_ERR_ALLOC;
  const FaceEngineInfo* fe = px_init_portrait(maxFace, level, option, px, width, height);
  if (!fe) return PX_ERR_ALLOC;
  if (!report) return PX_OK;
  // Per face: eyeValid, box x, y, width, height, eyes x1, y1, x2, y2.
  const int n = fe->faceCount;
  jintArray faces = env->NewIntArray(9 * n);
  if (!faces) {
    env->ExceptionClear();
    call.refuse("the face report could not be allocated");
    return PX_ERR_ALLOC;
  }
  for (int i = 0; i < n; ++i) {
    const caFaceBox& b = fe->faceRect[i];
    const caEyePair& e = fe->eyePoints[i];
    const jint v[9] = {fe->eyeValid[i], b.x, b.y, b.width, b.height, e.x1, e.y1, e.x2, e.y2};
    env->SetIntArrayRegion(faces, 9 * i, 9, v);
  }
  env->CallVoidMethod(listener, report, n, faces);
  env->DeleteLocalRef(faces);
  return PX_OK;
}

ENGINE_METHOD(void, finishPortrait)(JNIEnv*, jobject) { px_finish_portrait(); }
ENGINE_METHOD(jint, getportraitstatus)(JNIEnv*, jobject) { return px_get_portraitmode_status(); }
ENGINE_METHOD(jint, getDetectOption)(JNIEnv*, jobject) { return px_get_detectOption(); }
ENGINE_METHOD(jint, getBeautyLevel)(JNIEnv*, jobject) { return px_get_beautyLevel(); }
ENGINE_METHOD(jint, get_1maxFaceCnt)(JNIEnv*, jobject) { return px_get_maxFaceCnt(); }
ENGINE_METHOD(void, setFacebeauty)(JNIEnv*, jobject, jint maxFace, jint level, jint option) {
  px_set_facebeauty(maxFace, level, option);
}

ENGINE_METHOD(jint, runFacebeauty)(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height) {
  bridge::Call call(env, __func__);
  return bridge::status(call, in, out, width, height,
                        [&](int* src, int* dst) { return px_facebeauty(src, dst, width, height); });
}

ENGINE_METHOD(jint, runBeautyInPortrait)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint level) {
  bridge::Call call(env, __func__);
  return full(call, in, out, width, height,
              [&](int* src, int* dst) { return px_apply_beautifier(src, dst, width, height, level); });
}

ENGINE_METHOD(jint, runBeautyInPortraitSingleFace)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint level, jint face) {
  bridge::Call call(env, __func__);
  return full(call, in, out, width, height, [&](int* src, int* dst) {
    return px_apply_beautifier_singleface(src, dst, width, height, level, face);
  });
}

ENGINE_METHOD(jint, runBeautyInPortraitPreview)
(JNIEnv* env, jobject, jintArray in, jint width, jint height, jintArray out, jint pw, jint ph, jint level) {
  bridge::Call call(env, __func__);
  return preview(call, in, width, height, out, pw, ph, [&](int* src, int* dst) {
    return px_apply_beautifier_preview(src, width, height, dst, pw, ph, level);
  });
}

ENGINE_METHOD(jint, runBeautyInPortraitSingleFacePreview)
(JNIEnv* env, jobject, jintArray in, jint width, jint height, jintArray out, jint pw, jint ph, jint level,
 jint face) {
  bridge::Call call(env, __func__);
  return preview(call, in, width, height, out, pw, ph, [&](int* src, int* dst) {
    return px_apply_beautifier_singleface_preview(src, width, height, dst, pw, ph, level, face);
  });
}

ENGINE_METHOD(jint, runLightenInPortrait)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint level) {
  bridge::Call call(env, __func__);
  return full(call, in, out, width, height,
              [&](int* src, int* dst) { return px_control_light_in_portrait(src, dst, width, height, level); });
}

ENGINE_METHOD(jint, runLightenInPortraitSingleFace)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint level, jint face) {
  bridge::Call call(env, __func__);
  return full(call, in, out, width, height, [&](int* src, int* dst) {
    return px_control_light_in_portrait_singleface(src, dst, width, height, level, face);
  });
}

ENGINE_METHOD(jint, runLightenInPortraitPreview)
(JNIEnv* env, jobject, jintArray in, jint width, jint height, jintArray out, jint pw, jint ph, jint level) {
  bridge::Call call(env, __func__);
  return preview(call, in, width, height, out, pw, ph, [&](int* src, int* dst) {
    return px_control_light_in_portrait_preview(src, width, height, dst, pw, ph, level);
  });
}

ENGINE_METHOD(jint, runLightenInPortraitSingleFacePreview)
(JNIEnv* env, jobject, jintArray in, jint width, jint height, jintArray out, jint pw, jint ph, jint level,
 jint face) {
  bridge::Call call(env, __func__);
  return preview(call, in, width, height, out, pw, ph, [&](int* src, int* dst) {
    return px_control_light_in_portrait_singleface_preview(src, width, height, dst, pw, ph, level, face);
  });
}

ENGINE_METHOD(jint, runOutfocusInPortrait)
(JNIEnv* env, jobject, jintArray in, jintArray out, jint width, jint height, jint strength) {
  bridge::Call call(env, __func__);
  return full(call, in, out, width, height, [&](int* src, int* dst) {
    return px_control_outfocusing_in_portrait(src, dst, width, height, strength);
  });
}

ENGINE_METHOD(jint, runOutfocusInPortraitPreview)
(JNIEnv* env, jobject, jintArray in, jint width, jint height, jintArray out, jint pw, jint ph, jint strength) {
  bridge::Call call(env, __func__);
  return preview(call, in, width, height, out, pw, ph, [&](int* src, int* dst) {
    return px_control_outfocusing_in_portrait_preview(src, width, height, dst, pw, ph, strength);
  });
}
