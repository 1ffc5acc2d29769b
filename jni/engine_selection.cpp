// Engine methods of the selection tools: the edge-snapping lasso session,
// tap-to-select and the mask refinements.
#include "bridge.h"
#include "effect/kalo/px_log.h"
#include "effect/selection/px_selection.h"

namespace {
void write_bounds(JNIEnv* env, jobject object, const px_rect& r) {
  if (!object) return;
  jclass cls = env->GetObjectClass(object);
  jfieldID f[4] = {env->GetFieldID(cls, "left", "I"), env->GetFieldID(cls, "right", "I"),
                   env->GetFieldID(cls, "top", "I"), env->GetFieldID(cls, "bottom", "I")};
  if (!f[0] || !f[1] || !f[2] || !f[3]) {
    env->ExceptionClear();
  } else {
    env->SetIntField(object, f[0], r.left);
    env->SetIntField(object, f[1], r.right);
    env->SetIntField(object, f[2], r.top);
    env->SetIntField(object, f[3], r.bottom);
  }
  env->DeleteLocalRef(cls);
}

// Refuses (logged) a call that needs a lasso session when none is open.
bool session(bridge::Call& call) {
  if (px_selection_active()) return true;
  call.refuse("no selection started");
  return false;
}
}  // namespace

ENGINE_METHOD(jint, selectionStart)(JNIEnv* env, jclass, jintArray image, jint width, jint height) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(image, call.pixels(), "image")) return PX_ERR_NULL;
  jint* px = call.pin(image, JNI_ABORT, bridge::kReads);
  if (!px) return PX_ERR_ALLOC;
  return px_selection_start(px, width, height);
}

ENGINE_METHOD(jint, selectionFinish)(JNIEnv*, jclass) { return px_selection_finish(); }

ENGINE_METHOD(jint, selectionAddPoint)(JNIEnv* env, jclass, jint x, jint y) {
  bridge::Call call(env, __func__);
  if (!session(call)) return PX_ERR_NULL;
  const int rc = px_selection_add_point(x, y);
  if (rc == PX_ERR_NULL) call.refuse("point outside the picture");
  return rc;
}

ENGINE_METHOD(jint, selectionRemovePoint)(JNIEnv* env, jclass, jint x, jint y) {
  bridge::Call call(env, __func__);
  if (!session(call)) return PX_ERR_NULL;
  const int rc = px_selection_remove_point(x, y);
  if (rc == PX_ERR_NULL) call.refuse("point outside the picture");
  if (rc == PX_ERR_NO_POINT) call.refuse("no linked point there");
  return rc;
}

ENGINE_METHOD(jint, selectionMovePoint)(JNIEnv* env, jclass, jint x, jint y, jint toX, jint toY) {
  bridge::Call call(env, __func__);
  if (!session(call)) return PX_ERR_NULL;
  const int rc = px_selection_move_point(x, y, toX, toY);
  if (rc == PX_ERR_NULL) call.refuse("point outside the picture");
  if (rc == PX_ERR_NO_POINT) call.refuse("no linked point there");
  return rc;
}

ENGINE_METHOD(jint, selectionPointCount)(JNIEnv*, jclass) { return px_selection_point_count(); }

ENGINE_METHOD(jint, selectionOutlineLength)(JNIEnv*, jclass) { return px_selection_outline_length(); }

ENGINE_METHOD(jint, selectionGetOutline)(JNIEnv* env, jclass, jintArray xy) {
  bridge::Call call(env, __func__);
  if (!session(call)) return PX_ERR_NULL;
  const size_t need = static_cast<size_t>(px_selection_outline_length()) * 2;
  if (!call.check(xy, need, "xy")) return PX_ERR_NULL;
  jint* out = call.pin(xy, 0, bridge::kWrites);
  if (!out) return PX_ERR_ALLOC;
  return px_selection_outline(out, static_cast<int>(need)) < 0 ? PX_ERR_NULL : PX_OK;
}

ENGINE_METHOD(jint, selectionClose)(JNIEnv* env, jclass, jbyteArray mask, jint width, jint height, jobject bounds) {
  bridge::Call call(env, __func__);
  if (!session(call) || !call.picture(width, height)) return PX_ERR_NULL;
  if (width != px_selection_width() || height != px_selection_height()) {
    call.refuse("size differs from the selection's picture");
    return PX_ERR_NULL;
  }
  if (px_selection_point_count() < 3) {
    call.refuse("fewer than 3 points");
    return PX_ERR_NULL;
  }
  if (!call.check(mask, call.pixels(), "mask")) return PX_ERR_NULL;
  jbyte* m = call.pin(mask, 0, bridge::kWrites);
  if (!m) return PX_ERR_ALLOC;
  px_rect r;
  const int rc = px_selection_close(reinterpret_cast<unsigned char*>(m), &r);
  if (rc == PX_OK) write_bounds(env, bounds, r);
  return rc;
}

ENGINE_METHOD(jint, selectTap)
(JNIEnv* env, jclass, jintArray image, jbyteArray mask, jint width, jint height, jint x, jint y, jint tolerance,
 jint mode, jobject bounds) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (!call.check(image, n, "image") || !call.check(mask, n, "mask")) return PX_ERR_NULL;
  if (x < 0 || y < 0 || x >= width || y >= height) {
    call.refuse("point outside the picture");
    return PX_ERR_NULL;
  }
  if (mode < PX_SELECT_REPLACE || mode > PX_SELECT_SUBTRACT) {
    call.refuse("mode is not 0 (replace), 1 (add) or 2 (subtract)");
    return PX_ERR_NULL;
  }
  jint* px = call.pin(image, JNI_ABORT, bridge::kReads);
  jbyte* m = call.pin(mask, 0, bridge::kWrites);
  if (!px || !m) return PX_ERR_ALLOC;
  px_rect r;
  const int rc =
      px_selection_tap(px, reinterpret_cast<unsigned char*>(m), width, height, x, y, tolerance, mode, &r);
  if (rc == PX_OK) write_bounds(env, bounds, r);
  return rc;
}

ENGINE_METHOD(jint, selectGrow)(JNIEnv* env, jclass, jbyteArray mask, jint width, jint height, jint pixels,
                                jobject bounds) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(mask, call.pixels(), "mask")) return PX_ERR_NULL;
  jbyte* m = call.pin(mask, 0, bridge::kWrites);
  if (!m) return PX_ERR_ALLOC;
  px_rect r;
  const int rc = px_selection_grow(reinterpret_cast<unsigned char*>(m), width, height, pixels, &r);
  if (rc == PX_OK) write_bounds(env, bounds, r);
  return rc;
}

ENGINE_METHOD(jint, selectFillHoles)(JNIEnv* env, jclass, jbyteArray mask, jint width, jint height, jobject bounds) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !call.check(mask, call.pixels(), "mask")) return PX_ERR_NULL;
  jbyte* m = call.pin(mask, 0, bridge::kWrites);
  if (!m) return PX_ERR_ALLOC;
  px_rect r;
  const int rc = px_selection_fill_holes(reinterpret_cast<unsigned char*>(m), width, height, &r);
  if (rc == PX_OK) write_bounds(env, bounds, r);
  return rc;
}
