// Measures the face engine with the shipped tables on held-out data:
//  - composite photos: held-out landmark faces pasted at several sizes into
//    held-out scene photos; recall and false positives at IoU >= 0.3, beside
//    OpenCV's Haar and LBP frontal cascades when their files are installed;
//  - eye and mouth localisation error on held-out landmark faces, as a
//    fraction of the eye distance.
// Usage: face_eval DATA_DIR [OPENCV_DATA_DIR]
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <cstdio>
#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/objdetect.hpp>
#include <random>

#include "common.h"
#include "effect/face/face_engine.h"

namespace {
double now() {
  return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

std::vector<int> to_argb(const cv::Mat& bgr) {
  std::vector<int> p(bgr.rows * bgr.cols);
  for (int y = 0; y < bgr.rows; ++y)
    for (int x = 0; x < bgr.cols; ++x) {
      cv::Vec3b v = bgr.at<cv::Vec3b>(y, x);
      p[y * bgr.cols + x] = static_cast<int>(0xFF000000u | v[2] << 16 | v[1] << 8 | v[0]);
    }
  return p;
}

double iou(const cv::Rect2d& a, const cv::Rect2d& b) {
  double in = (a & b).area();
  return in / (a.area() + b.area() - in);
}

// Face sizes (width of the box implied by the eyes) for recall per size.
constexpr int kSizeBins = 4;
const int kSizeEdges[kSizeBins - 1] = {60, 90, 130};
int size_bin(double w) {
  int b = 0;
  while (b < kSizeBins - 1 && w >= kSizeEdges[b]) ++b;
  return b;
}

struct Tally {
  int faces = 0, found = 0, fp = 0;
  int binFaces[kSizeBins] = {}, binFound[kSizeBins] = {};
  double seconds = 0;
  void add(const std::vector<cv::Rect2d>& truth, const std::vector<cv::Rect2d>& det) {
    std::vector<bool> used(det.size());
    faces += truth.size();
    for (const auto& t : truth) {
      int best = -1;
      double bi = 0.3;
      for (size_t k = 0; k < det.size(); ++k)
        if (!used[k] && iou(t, det[k]) >= bi) bi = iou(t, det[k]), best = k;
      ++binFaces[size_bin(t.width)];
      if (best >= 0) used[best] = true, ++found, ++binFound[size_bin(t.width)];
    }
    for (bool u : used) fp += !u;
  }
};

std::vector<cv::Rect2d> run_engine(const cv::Mat& bgr, int mode, FaceEngineInfo* out = nullptr) {
  FaceEngineInfo info{};
  InitFaceBeautyPlus(&info, mode, 20, 1, 16, 3, 0);
  std::vector<int> argb = to_argb(bgr);
  RunFaceAnalyzer(&info, argb.data(), bgr.cols, bgr.rows);
  std::vector<cv::Rect2d> r;
  for (int i = 0; i < info.faceCount; ++i)
    r.emplace_back(info.faceRect[i].x, info.faceRect[i].y, info.faceRect[i].width, info.faceRect[i].height);
  if (out)
    *out = info;
  else
    ReleaseFaceBeautyPlus(&info);
  return r;
}

// enlarge > 1: the photo is first enlarged by that whole factor (nearest
// neighbour, which gives the analyser the very working image it makes of the
// small photo itself), so that the eye and mouth points come back at the
// working resolution instead of truncated to the 80 x 80 photo's pixels.
void landmark_eval(const char* title, const std::vector<LandmarkFace>& test, int enlarge);

std::vector<cv::Rect2d> run_cv(cv::CascadeClassifier& c, const cv::Mat& bgr) {
  cv::Mat g;
  cv::cvtColor(bgr, g, cv::COLOR_BGR2GRAY);
  std::vector<cv::Rect> f;
  c.detectMultiScale(g, f, 1.1, 3, 0, cv::Size(20, 20));
  return std::vector<cv::Rect2d>(f.begin(), f.end());
}
}  // namespace

int main(int argc, char** argv) {
  if (argc == 5 && std::string(argv[1]) == "--pgm") {  // face_eval --pgm IN OUT LONGER_SIDE: test pictures
    cv::Mat g = load_grey(argv[2]);
    double k = std::atof(argv[4]) / std::max(g.cols, g.rows);
    cv::resize(g, g, cv::Size(), k, k, cv::INTER_AREA);
    return cv::imwrite(argv[3], g) ? 0 : 1;
  }
  if (argc < 2) {
    std::fprintf(stderr, "usage: face_eval DATA_DIR [OPENCV_DATA_DIR]\n");
    return 2;
  }
  const std::string data = argv[1];
  const std::string cvdir = argc > 2 ? argv[2] : "/usr/share/opencv4";
  std::mt19937 rng(7);
  // FACE_EVAL_LABELS=dlib: the eyes and mouths are measured against the
  // points of face_relabel instead of the MTFL annotation.
  const std::string labels = std::getenv("FACE_EVAL_LABELS") ? std::getenv("FACE_EVAL_LABELS") : "";
  std::vector<LandmarkFace> test = load_landmarks(data, "new_testing");
  std::vector<LandmarkFace> testLabels = labels.empty() ? test : load_landmarks(data, "new_testing", labels);
  std::vector<LandmarkFace> heldTrain = load_landmarks(data, "new_training", labels);
  {
    std::vector<LandmarkFace> held;
    split_held_out(heldTrain, &held);
    heldTrain.swap(held);
  }
  // Held-out scene photos and wallpapers (when extracted).
  std::vector<std::string> scenes, all = list_images(data + "/images_notfaces");
  for (size_t i = 0; i < all.size(); ++i)
    if (is_held_out_scene(i)) scenes.push_back(all[i]);
  const size_t sceneCount = scenes.size();
  all = list_images(data + "/wallpapers");
  for (size_t i = 0; i < all.size(); ++i)
    if (is_held_out_scene(i)) scenes.push_back(all[i]);
  cv::CascadeClassifier haar, lbp;
  // FACE_EVAL_QUICK=1: composites with the upright engine only (for training experiments).
  const bool quick = std::getenv("FACE_EVAL_QUICK") != nullptr;
  bool haveCv = !quick && haar.load(cvdir + "/haarcascades/haarcascade_frontalface_default.xml") &&
                lbp.load(cvdir + "/lbpcascades/lbpcascade_frontalface_improved.xml");

  // Composite photos from the held-out scenes (every fifth) and faces.
  Tally eng, engRot, th, tl, sceneOnly, haarOnly, lbpOnly;
  size_t next = 0;
  int photos = 0;
  for (size_t i = 0; i < scenes.size() && !std::getenv("FACE_EVAL_LANDMARKS_ONLY"); ++i) {
    cv::Mat scene = cv::imread(scenes[i], cv::IMREAD_COLOR);
    if (scene.empty()) continue;
    double k = 640.0 / std::max(scene.cols, scene.rows);
    cv::resize(scene, scene, cv::Size(), k, k, cv::INTER_AREA);
    sceneOnly.add({}, run_engine(scene, 1));
    if (haveCv) haarOnly.add({}, run_cv(haar, scene)), lbpOnly.add({}, run_cv(lbp, scene));
    std::vector<cv::Rect2d> truth;
    std::vector<cv::Rect> placed;
    for (int n = 0; n < 3 && next < test.size(); ++n) {
      const LandmarkFace& f = test[next++];
      cv::Mat face = cv::imread(f.path, cv::IMREAD_COLOR);
      if (face.empty()) continue;
      int size = 60 + static_cast<int>(rng() % 140);
      if (size >= std::min(scene.cols, scene.rows)) continue;
      double s = double(size) / face.cols;
      cv::Mat fs;
      cv::resize(face, fs, cv::Size(size, size), 0, 0, cv::INTER_AREA);
      cv::Rect at;
      bool ok = false;
      for (int tries = 0; tries < 50 && !ok; ++tries) {
        at = cv::Rect(rng() % (scene.cols - size), rng() % (scene.rows - size), size, size);
        ok = true;
        for (const auto& p : placed) ok &= (p & at).area() == 0;
      }
      if (!ok) continue;
      placed.push_back(at);
      fs.copyTo(scene(at));
      cv::Rect2d fb = face_box_from_eyes(f.x[0] * s, f.y[0] * s, f.x[1] * s, f.y[1] * s);
      truth.emplace_back(fb.x + at.x, fb.y + at.y, fb.width, fb.height);
    }
    ++photos;
    double t0 = now();
    eng.add(truth, run_engine(scene, 1));
    eng.seconds += now() - t0;
    if (!quick || std::getenv("FACE_EVAL_ROT")) {
      t0 = now();
      engRot.add(truth, run_engine(scene, 3));
      engRot.seconds += now() - t0;
    }
    if (haveCv) {
      t0 = now();
      th.add(truth, run_cv(haar, scene));
      th.seconds += now() - t0;
      t0 = now();
      tl.add(truth, run_cv(lbp, scene));
      tl.seconds += now() - t0;
    }
  }
  std::printf("Composite photos: %d (%zu held-out scenes and %zu held-out wallpapers, longer side 640, held-out faces "
              "60..200 px)\n",
              photos, sceneCount, scenes.size() - sceneCount);
  std::printf("| detector | faces | found | recall | false positives | ms per photo | recall by box width <60 / 60-90 / "
              "90-130 / >=130 |\n|---|---|---|---|---|---|---|\n");
  auto row = [&](const char* name, const Tally& t) {
    std::printf("| %s | %d | %d | %.3f | %d | %.1f |", name, t.faces, t.found, t.faces ? double(t.found) / t.faces : 0.0,
                t.fp, 1000 * t.seconds / std::max(1, photos));
    for (int b = 0; b < kSizeBins; ++b)
      std::printf("%s%d/%d", b ? " / " : " ", t.binFound[b], t.binFaces[b]);
    std::printf(" |\n");
  };
  row("engine, upright (mode 1)", eng);
  row("engine, upright and +-45 (mode 3)", engRot);
  if (haveCv) {
    row("OpenCV haarcascade_frontalface_default", th);
    row("OpenCV lbpcascade_frontalface_improved", tl);
  }
  std::printf("False positives on the %d held-out scenes alone: engine (mode 1) %d, Haar %d, LBP %d\n", photos,
              sceneOnly.fp, haarOnly.fp, lbpOnly.fp);
  if (quick) return 0;
  if (!labels.empty()) std::printf("\neyes and mouths against the %s points\n", labels.c_str());
  for (int enlarge : {1, 8}) {
    if (enlarge == 1 && std::getenv("FACE_EVAL_ENLARGED_ONLY")) continue;
    std::printf("\n== landmark photos %s ==\n", enlarge == 1 ? "as they are (80 x 80): points truncated to whole photo pixels"
                                                             : "enlarged to 640 x 640 (the same working image)");
    landmark_eval("held-out MTFL test faces (AFLW)", testLabels, enlarge);
    landmark_eval("held-out training-list faces (LFW, net_7876: every tenth)", heldTrain, enlarge);
  }
  return 0;
}

namespace {
void landmark_eval(const char* title, const std::vector<LandmarkFace>& test0, int enlarge) {
  // Landmarks in the enlarged photo: pixel centres at whole coordinates.
  std::vector<LandmarkFace> test = test0;
  for (LandmarkFace& f : test)
    for (int j = 0; j < 5; ++j) f.x[j] = f.x[j] * enlarge + (enlarge - 1) / 2.0f, f.y[j] = f.y[j] * enlarge + (enlarge - 1) / 2.0f;

  // Eyes and mouth on held-out landmark faces (photo 80 x 80, analysed whole).
  int n = 0, faceFound = 0, eyesFound = 0, eyesWithin = 0, mouthFound = 0, mouthWithin = 0;
  std::vector<double> worse;
  double sd[4] = {}, e1 = 0, e2 = 0;
  double eyeErr = 0, mouthErr = 0, boxScale = 0, boxDx = 0, boxDy = 0;
  for (size_t i = 0; i < test.size(); ++i) {
    const LandmarkFace& f = test[i];
    cv::Mat img = cv::imread(f.path, cv::IMREAD_COLOR);
    if (img.empty()) continue;
    if (enlarge > 1) cv::resize(img, img, cv::Size(), enlarge, enlarge, cv::INTER_NEAREST);
    ++n;
    FaceEngineInfo info{};
    run_engine(img, 1, &info);
    double d = std::hypot(f.x[1] - f.x[0], f.y[1] - f.y[0]);
    cv::Rect2d truth = face_box_from_eyes(f.x[0], f.y[0], f.x[1], f.y[1]);
    int best = -1;
    double bi = 0.3;
    for (int k = 0; k < info.faceCount; ++k) {
      cv::Rect2d r(info.faceRect[k].x, info.faceRect[k].y, info.faceRect[k].width, info.faceRect[k].height);
      if (iou(truth, r) >= bi) bi = iou(truth, r), best = k;
    }
    if (best >= 0) {
      ++faceFound;
      const caFaceBox& fb = info.faceRect[best];
      boxScale += fb.width / truth.width;
      boxDx += (fb.x + fb.width / 2.0 - truth.x - truth.width / 2) / truth.width;
      boxDy += (fb.y + fb.height / 2.0 - truth.y - truth.height / 2) / truth.width;
      const caEyePair& e = info.eyePoints[best];
      if (e.x1 >= 0 && e.x2 >= 0) {
        ++eyesFound;
        double err = std::max(std::hypot(e.x1 - f.x[0], e.y1 - f.y[0]), std::hypot(e.x2 - f.x[1], e.y2 - f.y[1])) / d;
        eyeErr += err;
        sd[0] += (e.x1 - f.x[0]) / d, sd[1] += (e.y1 - f.y[0]) / d, sd[2] += (e.x2 - f.x[1]) / d, sd[3] += (e.y2 - f.y[1]) / d;
        e1 += std::hypot(e.x1 - f.x[0], e.y1 - f.y[0]) / d, e2 += std::hypot(e.x2 - f.x[1], e.y2 - f.y[1]) / d;
        eyesWithin += err <= 0.1;
        worse.push_back(err);
        const SMyPoint2& m = info.mouthCenter[best];
        if (info.mouthRect[best].width > 0) {
          ++mouthFound;
          double me = std::hypot(m.x - (f.x[3] + f.x[4]) / 2, m.y - (f.y[3] + f.y[4]) / 2) / d;
          mouthErr += me;
          mouthWithin += me <= 0.2;
        }
      }
    }
    ReleaseFaceBeautyPlus(&info);
  }
  std::printf("\n%s: %d; face found %d (%.3f)\n", title, n, faceFound, double(faceFound) / std::max(1, n));
  std::printf("detected box against the landmark box: width ratio %.3f, centre offset (%.3f, %.3f) widths\n",
              boxScale / std::max(1, faceFound), boxDx / std::max(1, faceFound), boxDy / std::max(1, faceFound));
  std::printf("eyes found in %d of the found faces (%.3f); worse eye error: mean %.4f of the eye distance, "
              "%d (%.3f) within 0.10\n",
              eyesFound, double(eyesFound) / std::max(1, faceFound), eyeErr / std::max(1, eyesFound), eyesWithin,
              double(eyesWithin) / std::max(1, eyesFound));
  std::sort(worse.begin(), worse.end());
  if (!worse.empty())
    std::printf("worse eye error median %.3f, 90th percentile %.3f\n", worse[worse.size() / 2], worse[worse.size() * 9 / 10]);
  std::printf("signed mean eye offsets (eye distances): first (%.3f, %.3f), second (%.3f, %.3f); mean error first %.3f, "
              "second %.3f\n",
              sd[0] / std::max(1, eyesFound), sd[1] / std::max(1, eyesFound), sd[2] / std::max(1, eyesFound),
              sd[3] / std::max(1, eyesFound), e1 / std::max(1, eyesFound), e2 / std::max(1, eyesFound));
  std::printf("mouth found in %d faces with eyes; centre error mean %.4f of the eye distance, %d (%.3f) within 0.20\n",
              mouthFound, mouthErr / std::max(1, mouthFound), mouthWithin, double(mouthWithin) / std::max(1, mouthFound));
}
}  // namespace
