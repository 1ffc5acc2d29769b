// The portrait session: one photo analysed once (faces, eyes, mouths), then
// the skin beautifier, lighting and out-focusing applied to all faces or to
// one, at full size or into a smaller preview, as often as wanted.
//
// Results: 40960 success, 40961 memory ran out, 40962 a null picture, a
// level out of range or no open session, 40971 the out-focus blur failed.
//
// Previews: one Q12 step, step = (float)(width << 12) / previewWidth truncated
// (held in 64 bits, so huge photo sides over tiny previews cannot wrap),
// serves both axes; preview pixel (i, j) takes photo pixel
// (i * step >> 12, j * step >> 12), and preview pixels whose source lies
// outside the photo are left as they were.
#pragma once

#include "../face/face_engine.h"

// ---- settings (they outlive sessions) -------------------------------------------
// maxFace 1..10 (anything else becomes 10); level 1..5 and option 1..4 are
// taken only in range (else the old value stays).
void px_set_facebeauty(int maxFace, int level, int option);
int px_get_maxFaceCnt();         // default 2
int px_get_beautyLevel();        // default 3
int px_get_detectOption();       // default 3
int px_get_portraitmode_status();  // 1 while a session is open

// ---- session -----------------------------------------------------------------------
// Applies the settings, analyses the photo and opens the session on it. An
// open session is released once the new one is ready (not leaked). Null (the
// open session, if any, stays) when memory ran out or argb is null.
FaceEngineInfo* px_init_portrait(int maxFace, int level, int option, const int* argb, int width, int height);
// Releases the open session; harmless without one.
void px_finish_portrait();
// The open session's analysis, or null.
const FaceEngineInfo* px_portrait_session();

// ---- beautifier ----------------------------------------------------------------------
// Level 0: 40960, dst untouched. Level outside 0..5: 40962. Otherwise the
// level is stored in the session; with no face 40960 and dst untouched; else
// dst = src with every face beautified.
int px_apply_beautifier(const int* src, int* dst, int width, int height, int level);
// One face; an index outside 0..faceCount-1 gives 40960 with dst untouched.
int px_apply_beautifier_singleface(const int* src, int* dst, int width, int height, int level, int faceIndex);
// Preview forms: level 0 writes src reduced; levels 1..5 beautify a
// full-size copy and reduce it (no face: 40960, dst untouched).
int px_apply_beautifier_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                int previewHeight, int level);
int px_apply_beautifier_singleface_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                           int previewHeight, int level, int faceIndex);
// One shot without a session: copies src to dst and beautifies the faces
// found with the current settings; with no face every channel is brightened
// by the fallback table (c + 2 (T[c] - c), clamped), alpha kept.
int px_facebeauty(const int* src, int* dst, int width, int height);
// The fallback brightening table.
extern const unsigned char kFallbackBrighten[256];

// ---- lighting ------------------------------------------------------------------------
// dst = src, then each face's round area (reach max(w, h) around the box
// centre) is lightened (amount = 3 level - 30 > 0) or darkened (< 0) by the
// local brushes. Level 10 or no face: the plain copy.
int px_control_light_in_portrait(const int* src, int* dst, int width, int height, int level);
// One face; an index outside 0..faceCount-1 leaves the plain copy.
int px_control_light_in_portrait_singleface(const int* src, int* dst, int width, int height, int level,
                                            int faceIndex);
// Preview forms: level 10 writes nothing.
int px_control_light_in_portrait_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                         int previewHeight, int level);
int px_control_light_in_portrait_singleface_preview(const int* src, int width, int height, int* dst,
                                                    int previewWidth, int previewHeight, int level, int faceIndex);

// ---- out-focus -----------------------------------------------------------------------
// The photo blurred at `strength` (0..7), kept sharp around each face and the
// body below it. Strength 0 writes nothing; a negative strength gives 40971.
int px_control_outfocusing_in_portrait(const int* src, int* dst, int width, int height, int strength);
// The preview reduces first and out-focuses the reduced photo: the photo is
// sampled with the preview step, blurred by the out-focus blur with its
// radius (3..63 for 0..7) divided by the step (rounded, at least 1), and
// composed by the weight map of the faces divided by the step; it costs
// what it shows. A negative strength gives 40971.
int px_control_outfocusing_in_portrait_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                               int previewHeight, int strength);

// The weight map of out-focusing (255 fully blurred, 0 sharp), exposed for
// the tests: `map` holds width * height bytes and is only lowered.
void px_outfocus_weight_map(unsigned char* map, int width, int height, const caFaceBox* faces, int count);
// Composes blurred and sharp pixels by the map into dst.
void px_outfocus_compose(const int* sharp, const int* blurred, const unsigned char* map, int* dst, int n);
