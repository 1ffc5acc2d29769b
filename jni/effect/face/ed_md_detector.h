// Eye and mouth detectors: inside a face box, a grey region is resampled to
// a few level sizes, turned into census codes and scanned with a small window
// through a boosted cascade; hits are enrolled into short candidate lists.
#pragma once

#include "sm_image.h"

constexpr int kEdListSize = 15;
constexpr int kMdListSize = 15;
constexpr int m_nMouthTotalLimit = 200;
constexpr int m_nMouthLowerW = 22;
constexpr int m_nMouthLowerH = 13;
constexpr int kEdWindow = 15;
constexpr int kMdWindowW = 15;
constexpr int kMdWindowH = 9;
extern const int kEdStageFeatures[3];    // 22, 36, 100
extern const int kEdStageThresholds[3];  // 7270, 10956, 17510
extern const int kMdStageFeatures[3];    // 10, 20, 30
extern const int kMdStageThresholds[3];  // 5836, 8499, 12390

// 1 when both eyes are found inside face (image coordinates), else 0.
int ed_find(const unsigned char* grey, int width, int height, SMyRect2 face);
// Eye centres of the last successful ed_find: first the left-region eye.
void ed_where(SMyPoint2* first, SMyPoint2* second);
// Chosen eye boxes of the last ed_find in their region coordinates (the
// second one in the mirrored region).
void ed_whereBox(SMyRect2* left, SMyRect2* right);
int ed_isintersection(SMyRect2 a, SMyRect2 b);
// The two eye search regions of a face box: the upper-left and upper-right
// quarters.
void ed_regions(SMyRect2 face, SMyRect2* left, SMyRect2* right);

// 1 when the mouth is found inside face; md_whereBox then gives its box in
// image coordinates.
int md_find(const unsigned char* grey, int width, int height, SMyRect2 face);
void md_whereBox(SMyRect2* box);
int md_isintersection(SMyRect2 a, SMyRect2 b);
// The mouth search region of a face box in a picture `height` rows high.
SMyRect2 md_region(SMyRect2 face, int height);

// Level sizes of a region: the first is 33 wide; returns the number of
// levels (at most 4) written to widths/heights. minH is 22 for the eyes and
// 13 for the mouth.
int edmd_levels(int regionWidth, int regionHeight, int minH, int* widths, int* heights);
// Copies a region (exclusive right/bottom) of a grey picture; pixels outside
// the picture repeat the nearest edge pixel. dst holds width * height bytes.
void edmd_copy_region(const unsigned char* grey, int width, int height, SMyRect2 region, unsigned char* dst);

// Window evaluation for the trainer and tests: number of stages passed (3 =
// a hit) and the sum of the last stage evaluated.
int ed_eval_window(const unsigned short* mct, int levelWidth, int x, int y, int* lastSum);
int md_eval_window(const unsigned short* mct, int levelWidth, int x, int y, int* lastSum);

// Enrolment into the eye lists (0 left, 1 right) and the mouth list, as a
// scan does; exposed for tests.
void ed_reset();
void ed_enroll(int list, SMyRect2 hit, int confidence);
struct EdCandidateView {
  int count;
  const SMyRect2* rect;
  const int* confidence;
  const int* intersections;
  const int* confidenceSum;
  const unsigned char* valid;
};
EdCandidateView ed_candidates(int list);
// Index of the chosen candidate of an eye list, or -1 when its best count is below 3.
int ed_select(int list);
void md_reset();
// Enrols and logs a hit (region coordinates).
void md_enroll(SMyRect2 hit, int confidence);
// Chooses and localises the mouth from the list and the log; 1 when found.
int md_localize();
