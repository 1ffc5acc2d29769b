// Engine methods of the object tools: the object eraser and its status
// controls, and object copy and paste.
#include "bridge.h"
#include "effect/object/px_copy_paste.h"
#include "effect/object/px_eraser.h"

// ---- object eraser -------------------------------------------------------------

namespace {
// The caller's context of the run going on, for the progress commits.
struct EraserContext {
  JNIEnv* env;
  jintArray array;
  jint* pixels;
};

// Copies the partly filled picture back to the Java array without releasing
// it, so another thread can redraw it while the run goes on.
void commit_progress(void* context, int) {
  auto* c = static_cast<EraserContext*>(context);
  c->env->ReleaseIntArrayElements(c->array, c->pixels, JNI_COMMIT);
}

// Releases the eraser claim when a call leaves before the run.
struct Claim {
  bool held = true;
  ~Claim() {
    if (held) px_eraser_release();
  }
};
}  // namespace

ENGINE_METHOD(jint, runEraser)
(JNIEnv* env, jobject, jintArray image, jbyteArray mask, jint width, jint height, jobject rect) {
  // A second run while one is going (or paused) is refused before anything
  // is touched.
  if (get_status_photoeraser() == PX_ERASER_RUNNING || !px_eraser_claim()) return PX_ERR_ERASER_BUSY;
  Claim claim;
  bridge::Call call(env, __func__);
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  if (!call.check(image, n, "image") || !call.check(mask, n, "mask")) return PX_ERR_NULL;
  jint* pixels = call.pin(image, 0, bridge::kWrites);
  jbyte* m = call.pin(mask, JNI_ABORT, bridge::kReads);
  if (!pixels || !m) return PX_ERR_ALLOC;
  // An empty rectangle selects the whole picture, as for the region methods.
  if (px_rect_empty(r)) r = px_rect{0, width - 1, 0, height - 1};
  EraserContext context{env, image, pixels};
  px_eraser_set_progress(commit_progress, &context);
  claim.held = false;  // released by the run
  const int rc = process_photoeraser(pixels, reinterpret_cast<unsigned char*>(m), width, height, r.left, r.right,
                                     r.top, r.bottom);
  px_eraser_set_progress(nullptr, nullptr);
  return rc;  // the picture is released with mode 0 by the call
}

ENGINE_METHOD(void, setEraserStatus)(JNIEnv*, jobject, jint status) { set_status_photoeraser(status); }
ENGINE_METHOD(jint, getEraserStatus)(JNIEnv*, jobject) { return get_status_photoeraser(); }
ENGINE_METHOD(jint, stopEraser)(JNIEnv*, jobject) { return stop_photoeraser(); }
ENGINE_METHOD(jint, reStartEraser)(JNIEnv*, jobject) { return restart_photoeraser(); }
ENGINE_METHOD(jint, exitEraser)(JNIEnv*, jobject) { return exit_photoeraser(); }

// ---- copy and paste --------------------------------------------------------------

namespace {
void write_rect(JNIEnv* env, jobject object, const px_rect& r) {
  jclass cls = env->GetObjectClass(object);
  env->SetIntField(object, env->GetFieldID(cls, "left", "I"), r.left);
  env->SetIntField(object, env->GetFieldID(cls, "right", "I"), r.right);
  env->SetIntField(object, env->GetFieldID(cls, "top", "I"), r.top);
  env->SetIntField(object, env->GetFieldID(cls, "bottom", "I"), r.bottom);
  env->DeleteLocalRef(cls);
}

// Validates a second picture size (the object's or the target's).
bool second_size(bridge::Call& call, jint w, jint h) {
  if (w <= 0 || h <= 0 || static_cast<long long>(w) * h > 0x7FFFFFFF / 4) {
    call.refuse("object or target size is not positive or too large");
    return false;
  }
  return true;
}
}  // namespace

ENGINE_METHOD(jint, setObjectRegion)
(JNIEnv* env, jobject, jbyteArray mask, jint width, jint height, jobject rect, jint iterations) {
  bridge::Call call(env, __func__);
  px_rect r;
  if (!call.picture(width, height) || !call.rect(rect, &r) || !call.check(mask, call.pixels(), "mask")) {
    return PX_ERR_NULL;
  }
  jbyte* m = call.pin(mask, 0, bridge::kWrites);
  if (!m) return PX_ERR_ALLOC;
  px_set_paste_object(reinterpret_cast<unsigned char*>(m), width, height, r, iterations);
  write_rect(env, rect, r);
  return PX_OK;
}

ENGINE_METHOD(jint, runCopyObject)
(JNIEnv* env, jobject, jintArray object, jbyteArray mask, jint width, jint height, jintArray target,
 jint targetWidth, jint targetHeight) {
  bridge::Call call(env, __func__);
  if (!call.picture(width, height) || !second_size(call, targetWidth, targetHeight)) return PX_ERR_NULL;
  const size_t n = call.pixels();
  const size_t tn = static_cast<size_t>(targetWidth) * static_cast<size_t>(targetHeight);
  if (!call.check(object, n, "object") || !call.check(mask, n, "mask") || !call.check(target, tn, "target")) {
    return PX_ERR_NULL;
  }
  jint* o = call.pin(object, 0, bridge::kWrites);
  jbyte* m = call.pin(mask, JNI_ABORT, bridge::kReads);
  jint* t = call.pin(target, JNI_ABORT, bridge::kReads);
  if (!o || !m || !t) return PX_ERR_ALLOC;
  px_copy_object(o, reinterpret_cast<unsigned char*>(m), width, height, t, targetWidth, targetHeight);
  return PX_OK;
}

namespace {
// The arrays of a paste: the object and its mask (object size), the picture
// pasted onto and the output (picture size); the rectangle as it stands.
struct Paste {
  int* object;
  unsigned char* mask;
  int* picture;
  int* out;
  px_rect rect;
};

jint pin_paste(bridge::Call& call, jintArray object, jintArray picture, jbyteArray mask, jintArray out, jint objWidth,
               jint objHeight, jint width, jint height, jobject rect, Paste* p) {
  if (!call.picture(width, height) || !second_size(call, objWidth, objHeight) || !call.raw_rect(rect, &p->rect)) {
    return PX_ERR_NULL;
  }
  const size_t n = call.pixels();
  const size_t on = static_cast<size_t>(objWidth) * static_cast<size_t>(objHeight);
  if (!call.check(object, on, "object") || !call.check(mask, on, "mask") || !call.check(picture, n, "picture") ||
      !call.check(out, n, "out")) {
    return PX_ERR_NULL;
  }
  p->object = call.pin(object, 0, bridge::kReads);
  p->mask = reinterpret_cast<unsigned char*>(call.pin(mask, JNI_ABORT, bridge::kReads));
  p->picture = call.pin(picture, 0, bridge::kReads);
  p->out = call.pin(out, 0, bridge::kWrites);
  return p->object && p->mask && p->picture && p->out ? PX_OK : PX_ERR_ALLOC;
}
}  // namespace

ENGINE_METHOD(jint, runCopyPaste)
(JNIEnv* env, jobject, jintArray object, jintArray picture, jbyteArray mask, jintArray out, jint objWidth,
 jint objHeight, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  Paste p;
  if (jint rc = pin_paste(call, object, picture, mask, out, objWidth, objHeight, width, height, rect, &p); rc != PX_OK) {
    return rc;
  }
  int mr, mg, mb;
  px_object_means(p.object, p.mask, objWidth, objHeight, &mr, &mg, &mb);
  px_copy_paste_fixed(p.object, p.picture, p.mask, p.out, objWidth, objHeight, width, height, p.rect.left,
                      p.rect.right, p.rect.top, p.rect.bottom, mr, mg, mb);
  return PX_OK;
}

ENGINE_METHOD(jint, pasteObject)
(JNIEnv* env, jobject, jintArray object, jintArray background, jbyteArray mask, jintArray out, jint objWidth,
 jint objHeight, jint width, jint height, jobject rect) {
  bridge::Call call(env, __func__);
  Paste p;
  if (jint rc = pin_paste(call, object, background, mask, out, objWidth, objHeight, width, height, rect, &p);
      rc != PX_OK) {
    return rc;
  }
  px_paste_object(p.object, p.picture, p.mask, p.out, objWidth, objHeight, width, height, p.rect.left, p.rect.right,
                  p.rect.top);
  return PX_OK;
}

ENGINE_METHOD(jint, drawObject)
(JNIEnv* env, jobject, jintArray dst, jint dstWidth, jint dstHeight, jintArray src, jint srcWidth, jint srcHeight,
 jfloat scale, jobject rect) {
  bridge::Call call(env, __func__);
  px_rect r;
  if (!call.picture(dstWidth, dstHeight) || !second_size(call, srcWidth, srcHeight) || !call.raw_rect(rect, &r)) {
    return 0;
  }
  const size_t sn = static_cast<size_t>(srcWidth) * static_cast<size_t>(srcHeight);
  if (!call.check(dst, call.pixels(), "dst") || !call.check(src, sn, "src")) return 0;
  jint* s = call.pin(src, JNI_ABORT, bridge::kReads);
  jint* d = call.pin(dst, 0, bridge::kWrites);
  if (!s || !d) return 0;
  return drawObject(d, dstWidth, dstHeight, s, srcWidth, srcHeight, scale, r);
}
