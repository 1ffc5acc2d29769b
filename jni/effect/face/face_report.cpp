#include "face_report.h"

#include "face_engine.h"
#include "../kalo/px_mem.h"

int px_analyze_faces(const int* argb, int width, int height, int mode, int maxFace, int* report) {
  if (maxFace < 1) return 0;
  FaceEngineInfo info{};
  // Memory short anywhere (the record's arrays, or a detector's buffers, which
  // the detectors skip quietly as "no face") fails the analysis.
  const long failures = px_mem_failures();
  const bool ready = InitFaceBeautyPlus(&info, mode, maxFace, 1, 0, 0, 0) && px_mem_failures() == failures;
  if (ready) RunFaceAnalyzer(&info, argb, width, height);
  if (!ready || px_mem_failures() != failures) {
    ReleaseFaceBeautyPlus(&info);
    return -1;
  }
  const int n = info.faceCount < maxFace ? info.faceCount : maxFace;
  for (int i = 0; i < n; ++i) {
    int* r = report + i * PX_FACE_REPORT_INTS;
    const caFaceBox& f = info.faceRect[i];
    const caEyePair& e = info.eyePoints[i];
    // The analyser marks every face's eyes valid and sets the points to -1
    // when the eye search fails; the mouth is searched only for a face with
    // eyes and no roll, and is -1 when not found.
    const bool eyes = info.eyeValid[i] && e.x1 >= 0;
    const bool mouth = eyes && info.faceRotated[i] == 0 && info.mouthCenter[i].x >= 0;
    const int values[PX_FACE_REPORT_INTS] = {f.x,
                                             f.y,
                                             f.width,
                                             f.height,
                                             eyes ? 1 : 0,
                                             eyes ? e.x1 : -1,
                                             eyes ? e.y1 : -1,
                                             eyes ? e.x2 : -1,
                                             eyes ? e.y2 : -1,
                                             mouth ? info.mouthCenter[i].x : -1,
                                             mouth ? info.mouthCenter[i].y : -1};
    for (int k = 0; k < PX_FACE_REPORT_INTS; ++k) r[k] = values[k];
  }
  ReleaseFaceBeautyPlus(&info);
  return n;
}
