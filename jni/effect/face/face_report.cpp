#include "face_report.h"

#include "face_engine.h"

int px_analyze_faces(const int* argb, int width, int height, int mode, int maxFace, int* report) {
  if (maxFace < 1) return 0;
  FaceEngineInfo info{};
  if (!InitFaceBeautyPlus(&info, mode, maxFace, 1, 0, 0, 0)) {
    ReleaseFaceBeautyPlus(&info);
    return -1;
  }
  RunFaceAnalyzer(&info, argb, width, height);
  const int n = info.faceCount < maxFace ? info.faceCount : maxFace;
  for (int i = 0; i < n; ++i) {
    int* r = report + i * PX_FACE_REPORT_INTS;
    const caFaceBox& f = info.faceRect[i];
    const caEyePair& e = info.eyePoints[i];
    const int values[PX_FACE_REPORT_INTS] = {f.x,  f.y,  f.width, f.height, info.eyeValid[i] ? 1 : 0, e.x1,
                                             e.y1, e.x2, e.y2,    info.mouthCenter[i].x, info.mouthCenter[i].y};
    for (int k = 0; k < PX_FACE_REPORT_INTS; ++k) r[k] = values[k];
  }
  ReleaseFaceBeautyPlus(&info);
  return n;
}
