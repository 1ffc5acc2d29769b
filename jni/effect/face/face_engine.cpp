#include "face_engine.h"

#include <cstdlib>

#include "ed_md_detector.h"
#include "effect/kalo/px_mem.h"
#include "fd_detector.h"

char caAPP_Title[100] = "Face BeautyPlus";
char caAPP_Version[100] = "__CA__FT__ Version : v1.2";
char caAPP_Date[100] = "__CA__FT__ Date : 2010.03.22";
char caAPP_Group[100] = "__CA__FT__ Group : ";
char caAPP_Model[100] = "__CA__FT__ Model : ";
char caAPP_Platform[100] = "__CA__FT__ Platform : ";
char caAPP_Compiler[100] = "__CA__FT__ Compiler : ";
char caAPP_Comment[500] = "__CA__FT__ Comment : ";

namespace {
caFaceBeautifier g_beautifier = nullptr;
constexpr int kMaxAnalysedFaces = 10;

template <typename T>
T* alloc_zero(int n) {
  return static_cast<T*>(px_calloc(static_cast<size_t>(n > 0 ? n : 1), sizeof(T)));
}

template <typename T>
void release(T*& p) {
  px_free(p);
  p = nullptr;
}
}  // namespace

void caIF_SetBeautifier(caFaceBeautifier hook) { g_beautifier = hook; }

int CheckRipRotation(int x1, int y1, int x2, int y2) {
  const int dx = x2 - x1, ady = std::abs(y1 - y2);
  const int d = dx * dx + ady * ady;
  if (d == 0) return 0;  // both eyes on one point: no roll can be read
  return (dx * 1024) / d > 950 ? 1 : 0;
}

int caIF_InitFD(FaceEngineInfo* info, caFDMode mode, int maxFace, int precision) {
  info->maxFace = maxFace < 1 ? 3 : maxFace;
  info->faceRect = alloc_zero<caFaceBox>(info->maxFace);
  info->fdMode = mode;
  info->faceCount = 0;
  info->precision = (precision >= 1 && precision <= 3) ? precision : 3;
  return info->faceRect ? 1 : 0;
}

int caIF_InitED(FaceEngineInfo* info) {
  info->eyePoints = alloc_zero<caEyePair>(info->maxFace);
  info->eyeValid = alloc_zero<int32_t>(info->maxFace);
  return (info->eyePoints && info->eyeValid) ? 1 : 0;
}

void caIF_ReleaseFD(FaceEngineInfo* info) { release(info->faceRect); }

void caIF_ReleaseED(FaceEngineInfo* info) {
  release(info->eyePoints);
  release(info->eyeValid);
}

int InitFaceBeautyPlus(FaceEngineInfo* info, caFDMode mode, int maxFace, int precision, caBeautyPlusMode beautyMode,
                       int beautyLevel, int reserved) {
  if (!info) return 0;
  if (!caIF_InitFD(info, mode, maxFace, precision)) return 0;
  if (!caIF_InitED(info)) return 0;
  info->mouthCenter = alloc_zero<SMyPoint2>(info->maxFace);
  info->faceAux = alloc_zero<int32_t>(info->maxFace);
  info->faceRotated = static_cast<int32_t*>(px_malloc(static_cast<size_t>(info->maxFace), sizeof(int32_t)));
  info->beautyMode = beautyMode;
  info->beautyLevel = beautyLevel;
  info->reserved = reserved;
  info->mouthRect = alloc_zero<caFaceBox>(info->maxFace);
  info->mouthAux = alloc_zero<caFaceBox>(info->maxFace);
  // The flags are allocated a second time; the first block is given back
  // here instead of being lost.
  px_free(info->eyeValid);
  info->eyeValid = alloc_zero<int32_t>(info->maxFace);
  return 1;
}

void ReleaseFaceBeautyPlus(FaceEngineInfo* info) {
  if (!info) return;
  release(info->mouthCenter);
  release(info->faceAux);
  release(info->faceRotated);
  caIF_ReleaseED(info);
  caIF_ReleaseFD(info);
  release(info->mouthRect);
  release(info->mouthAux);
  release(info->eyeValid);
}

void caIF_WorkingSize(int width, int height, int* ww, int* wh) {
  int64_t w = width, h = height;
  if (w <= h) {
    *wh = 640;
    *ww = static_cast<int>((640 * ((w << 15) / h)) >> 15);
  } else {
    *ww = 640;
    *wh = static_cast<int>((640 * ((h << 15) / w)) >> 15);
  }
  if (*ww < 1) *ww = 1;  // a very thin photo keeps one column or row
  if (*wh < 1) *wh = 1;
}

int caIF_RunFD(const caWorkImage* work, FaceEngineInfo* info) {
  const int rotated = !(info->fdMode == 1 || info->fdMode == 2);
  const int second = info->fdMode == 2;
  int n = fd_find(work->data, work->width, work->height, rotated, second, info->precision);
  SMyRect2 boxes[kFdListSize];
  if (n > kFdListSize) n = kFdListSize;
  if (n > info->maxFace) n = info->maxFace;
  if (n > 0 && fd_where(boxes)) {
    for (int i = 0; i < n; ++i)
      info->faceRect[i] = caFaceBox{boxes[i].left, boxes[i].top, boxes[i].right - boxes[i].left,
                                    boxes[i].bottom - boxes[i].top};
    info->faceCount = n;
  } else {
    info->faceCount = 0;
  }
  return info->faceCount;
}

int caIF_RunED(const caWorkImage* work, FaceEngineInfo* info, int i) {
  const caFaceBox& f = info->faceRect[i];
  SMyRect2 box{f.x, f.y, f.x + f.width, f.y + f.height};
  if (!ed_find(work->data, work->width, work->height, box)) return 2;
  SMyPoint2 a, b;
  ed_where(&a, &b);
  info->eyePoints[i] = caEyePair{a.x, a.y, b.x, b.y};
  return 32;
}

int caIF_RunMD(const caWorkImage* work, FaceEngineInfo* info, int i) {
  const caFaceBox& f = info->faceRect[i];
  SMyRect2 box{f.x, f.y, f.x + f.width, f.y + f.height};
  if (!md_find(work->data, work->width, work->height, box)) {
    info->mouthRect[i] = caFaceBox{-1, -1, -1, -1};
    info->mouthAux[i] = caFaceBox{-1, -1, -1, -1};
    info->mouthCenter[i] = SMyPoint2{-1, -1};
    return 0;
  }
  SMyRect2 m;
  md_whereBox(&m);
  info->mouthRect[i] = caFaceBox{m.left, m.top, m.right - m.left, m.bottom - m.top};
  info->mouthCenter[i] = SMyPoint2{(m.left + m.right) >> 1, (m.top + m.bottom) >> 1};
  return 1;
}

int RunFaceAnalyzer(FaceEngineInfo* info, const int* argb, int width, int height) {
  if (!info || !argb || width < 1 || height < 1 || !info->faceRect) return 1;
  int ww, wh;
  caIF_WorkingSize(width, height, &ww, &wh);
  const int64_t k = (static_cast<int64_t>(width) << 15) / ww;
  auto* grey = static_cast<unsigned char*>(px_malloc(static_cast<size_t>(ww) * wh, 1));
  if (!grey) return 1;
  Resize_NN_Color2Gray(argb, width, height, grey, ww, wh);
  caWorkImage work{ww, wh, 1, grey};
  caIF_RunFD(&work, info);
  auto map = [k](int32_t& v) { v = static_cast<int32_t>((v * k) >> 15); };
  const int n = info->faceCount < kMaxAnalysedFaces ? info->faceCount : kMaxAnalysedFaces;
  for (int i = 0; i < n; ++i) {
    info->eyeValid[i] = 1;
    if (caIF_RunED(&work, info, i) == 32) {
      const caEyePair& e = info->eyePoints[i];
      info->faceRotated[i] = CheckRipRotation(e.x1, e.y1, e.x2, e.y2);
      if (info->faceRotated[i] == 0) caIF_RunMD(&work, info, i);
    } else {
      info->eyePoints[i] = caEyePair{-1, -1, -1, -1};
    }
    caFaceBox& f = info->faceRect[i];
    map(f.x);
    map(f.y);
    map(f.width);
    map(f.height);
    if (info->eyeValid[i]) {
      caEyePair& e = info->eyePoints[i];
      map(e.x1);
      map(e.y1);
      map(e.x2);
      map(e.y2);
      map(info->mouthCenter[i].x);
      map(info->mouthCenter[i].y);
    }
    // mouthRect stays in working coordinates.
  }
  px_free(grey);
  return 1;
}

static int beautify(FaceEngineInfo* info, int* argb, int width, int height, int first, int count) {
  if (!info || !argb || (info->beautyMode & 0xF0) == 0 || count < 1 || !g_beautifier) return 0;
  caFaceBox faces[kFdListSize];
  int n = 0;
  for (int i = first; i < first + count && i < info->faceCount && n < kFdListSize; ++i) faces[n++] = info->faceRect[i];
  if (n > 0) g_beautifier(argb, height, width, info->beautyLevel, faces, n);
  return 0;
}

int RunFaceBeautyPlus(FaceEngineInfo* info, int* argb, int width, int height) {
  return beautify(info, argb, width, height, 0, info ? info->faceCount : 0);
}

int RunFaceBeautyPlusSingleFace(FaceEngineInfo* info, int* argb, int width, int height, int faceIndex) {
  if (faceIndex < 0) return 0;
  return beautify(info, argb, width, height, faceIndex, 1);
}
