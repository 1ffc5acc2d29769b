// Shared pieces of the face training and evaluation tools: data loading and
// the canonical face geometry relating landmarks to detector boxes.
#pragma once

#include <opencv2/core.hpp>
#include <string>
#include <vector>

struct LandmarkFace {
  std::string path;
  float x[5], y[5];  // left eye, right eye, nose, left mouth corner, right mouth corner
};

// Rows of an MTFL list ("new_training") whose landmarks were confirmed by the
// teacher check. labels: "" the MTFL annotation; "dlib" the points that
// face_relabel wrote (LIST_dlib.txt); "mean" the average of the two.
std::vector<LandmarkFace> load_landmarks(const std::string& root, const std::string& list,
                                         const std::string& labels = "");
// Grey (R + G + B) / 3 image, as the engine sees it.
cv::Mat load_grey(const std::string& path);
std::vector<std::string> list_images(const std::string& dir);
// Keeps the faces whose eyes `other` (the same faces, another annotation)
// places within limit eye distances of theirs.
void keep_agreeing(std::vector<LandmarkFace>& faces, const std::vector<LandmarkFace>& other, double limit);
// Every tenth face of the training list is held out for measuring the eye
// and mouth error on faces annotated like the training faces.
void split_held_out(std::vector<LandmarkFace>& faces, std::vector<LandmarkFace>* held);
// Every fifth scene photo and every fifth wallpaper is held out for evaluation.
inline bool is_held_out_scene(size_t index) { return index % 5 == 0; }

// Canonical face window: 22 x 24 pixels, eye distance 7.1, eye midpoint at
// (11, 7.6). A detector box for a face is this window scaled onto the face,
// and this geometry makes it about the usual face box, brows to chin and
// cheek to cheek (the boxes the earlier window of eye distance 10 at (11, 7)
// gave were 0.687 of the width of such boxes), with each eye in its upper
// quarter, where the eye detector searches, far enough from the quarter's
// lower and inner edges for the eye window centred on it to fit in the
// smaller eye levels (at (11, 8.7) it did not, and the eyes suffered).
constexpr double kEyeDist = 7.1, kEyeMidX = 11.0, kEyeMidY = 7.6;
// Face box (left, top, right, bottom) implied by the eye centres.
cv::Rect2d face_box_from_eyes(double lx, double ly, double rx, double ry);
