// Face detector: a four-stage boosted cascade over census codes, scanned over
// an image pyramid, upright and optionally on the picture turned by +-45
// degrees. Module-level lists: one detection at a time.
#pragma once

#include <cstdint>

#include "sm_image.h"

constexpr int kFdListSize = 20;
constexpr int kFdWindowW = 22;
constexpr int kFdWindowH = 24;
constexpr int kFdStageCount = 4;
extern const int kFdStageFeatures[kFdStageCount];    // 24, 50, 170, 440
extern const int kFdStageThresholds[kFdStageCount];  // 1609, 1942, 2904, 7122
extern const int kFdPyramid[15];                     // 40 .. 673
// Number of pyramid sizes used for a precision (1: 14, 2: 11, 3: 8).
int fd_pyramid_count(int precision);

// Runs the upright pass and, when rotatedPasses is set, the +45 and -45
// degree passes; returns the number of final faces.
int fd_find(const unsigned char* grey, int width, int height, int rotatedPasses, int unusedFlag, int precision);
// Copies the final boxes (at most kFdListSize) into out; 1, or 0 when none.
int fd_where(SMyRect2* out);
// Roll of final face i in degrees (0, 45, -45); 0 when out of range.
int fd_final_rip(int i);
int fd_find_run(const unsigned char* grey, int width, int height, int unusedFlag, int rotated, int angle,
                int precision);
void fd_scan_frontal(int scaledWidth, int scaledHeight, int width, int height, const unsigned short* mct);
void fd_enroll_Frontal(int x, int y, int w, int h, int confidence);
int fd_isintersection(SMyRect2 a, SMyRect2 b);
void fd_final();

// Turns a grey image about its centre ((width >> 1), (height >> 1)) by 45,
// -45, 90 or -90 degrees into dst of the same size (inverse mapping, Q10,
// nearest neighbour; sources outside the picture give 0). The turned picture
// at offset p from the centre (y up) shows the original at p turned by
// +angle, so that InvRotate of a box found in it lands on the same spot.
void Rotate(const unsigned char* src, unsigned char* dst, int width, int height, int angle);
// Turns a box found in a picture turned by `angle` degrees back into the
// unturned picture; the result is square, its side the box's width.
SMyRect2 InvRotate(SMyRect2 box, int width, int height, int angle);

// Stage sums of one window (for the trainer and tests): returns the number of
// stages passed (4 = a hit) and the sum of the last stage evaluated.
int fd_eval_window(const unsigned short* mct, int levelWidth, int x, int y, int* lastSum);

// Read access to the module lists (tests and the evaluation tool).
struct FdCandidateView {
  int count;
  const SMyRect2* rect;
  const int* confidence;
  const int* intersections;
  const unsigned char* valid;
};
FdCandidateView fd_candidates();  // candidate list of the last pass
FdCandidateView fd_faces();       // face list over all passes (intersections: roll)
void fd_reset_candidates();       // empties the candidate list
void fd_reset_faces();            // empties the face and final lists
// Appends one face to the face list (bounded), as a pass does.
void fd_add_face(SMyRect2 r, int confidence, int rip);
