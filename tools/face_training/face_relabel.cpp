// Second opinion on the landmark annotations: dlib's 68-point shape model
// (package libdlib-data) places the eyes (centre of each eye's six contour
// points), the nose tip and the mouth corners of every MTFL face, and the
// result is written beside the MTFL lists in their own format
// (LIST_dlib.txt). The photos are 80 x 80, so one annotated pixel is 0.05 to
// 0.08 eye distances; the two annotations together show how much of an eye
// error is the annotation's own.
//
// The shape model starts from a face box. It was trained with the boxes of
// dlib's HOG face detector, so the box of each face is derived from its MTFL
// landmarks by a mapping fitted to that detector's boxes on the first faces
// where it finds exactly one face; the refinement then uses the box implied
// by the model's own first answer.
//
// Usage: face_relabel DATA_DIR [SHAPE_MODEL]
#include <dlib/image_processing.h>
#include <dlib/image_processing/frontal_face_detector.h>
#include <dlib/opencv.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>
#include <sstream>
#include <string>
#include <vector>

namespace {
constexpr int kUp = 4;  // the photos are enlarged 4x for the model

struct Row {
  std::string path;  // as written in the list
  double x[5], y[5];
};

std::vector<Row> read_list(const std::string& file) {
  std::vector<Row> rows;
  std::ifstream in(file);
  std::string line;
  while (std::getline(in, line)) {
    std::istringstream ss(line);
    Row r;
    ss >> r.path;
    for (double& v : r.x) ss >> v;
    for (double& v : r.y) ss >> v;
    if (ss) rows.push_back(r);
  }
  return rows;
}

// Face frame of five points: eye midpoint, eye vector and the distance from
// the eye midpoint to the mouth midpoint.
struct Frame {
  double ex, ey, d, m;  // eye midpoint, eye distance, eye-to-mouth distance
};
Frame frame_of(const double* x, const double* y) {
  Frame f;
  f.ex = (x[0] + x[1]) / 2, f.ey = (y[0] + y[1]) / 2;
  f.d = std::hypot(x[1] - x[0], y[1] - y[0]);
  f.m = std::hypot((x[3] + x[4]) / 2 - f.ex, (y[3] + y[4]) / 2 - f.ey);
  return f;
}

// Box = centre (ex + a * s, ey + b * s), side c * s, with s = d + m.
struct BoxMap {
  double a = 0, b = 0.5, c = 1.4;
  dlib::rectangle box(const Frame& f) const {
    double s = f.d + f.m, cx = f.ex + a * s, cy = f.ey + b * s, h = c * s / 2;
    return dlib::rectangle(std::lround(cx - h), std::lround(cy - h), std::lround(cx + h), std::lround(cy + h));
  }
};

void points_of(const dlib::full_object_detection& s, double* x, double* y) {
  auto mean = [&](int from, double* ox, double* oy) {
    double sx = 0, sy = 0;
    for (int k = from; k < from + 6; ++k) sx += s.part(k).x(), sy += s.part(k).y();
    *ox = sx / 6, *oy = sy / 6;
  };
  mean(36, &x[0], &y[0]);
  mean(42, &x[1], &y[1]);
  x[2] = s.part(30).x(), y[2] = s.part(30).y();
  x[3] = s.part(48).x(), y[3] = s.part(48).y();
  x[4] = s.part(54).x(), y[4] = s.part(54).y();
}
}  // namespace

int main(int argc, char** argv) {
  if (argc < 2) {
    std::fprintf(stderr, "usage: face_relabel DATA_DIR [SHAPE_MODEL]\n");
    return 2;
  }
  const std::string root = argv[1];
  const std::string model = argc > 2 ? argv[2] : "/usr/share/dlib/shape_predictor_68_face_landmarks.dat";
  dlib::shape_predictor sp;
  dlib::deserialize(model) >> sp;
  dlib::frontal_face_detector det = dlib::get_frontal_face_detector();

  auto load = [&](const Row& r, cv::Mat* up) {
    std::string p = r.path;
    for (char& c : p)
      if (c == '\\') c = '/';
    cv::Mat img = cv::imread(root + "/" + p, cv::IMREAD_COLOR);
    if (img.empty()) return false;
    cv::resize(img, *up, cv::Size(), kUp, kUp, cv::INTER_CUBIC);
    return true;
  };
  // Landmarks in the enlarged photo (pixel centres at whole coordinates).
  auto up_pts = [](const Row& r, double* x, double* y) {
    for (int j = 0; j < 5; ++j) x[j] = r.x[j] * kUp + (kUp - 1) / 2.0, y[j] = r.y[j] * kUp + (kUp - 1) / 2.0;
  };

  // Fit the box mapping on faces where the HOG detector finds one face.
  std::vector<Row> train = read_list(root + "/new_training.txt");
  double sa = 0, sb = 0, sc = 0;
  int n = 0;
  for (size_t i = 0; i < train.size() && n < 400; i += 7) {
    cv::Mat up;
    if (!load(train[i], &up)) continue;
    dlib::cv_image<dlib::bgr_pixel> img(up);
    std::vector<dlib::rectangle> faces = det(img);
    if (faces.size() != 1) continue;
    double x[5], y[5];
    up_pts(train[i], x, y);
    Frame f = frame_of(x, y);
    double s = f.d + f.m;
    const dlib::rectangle& b = faces[0];
    sa += ((b.left() + b.right()) / 2.0 - f.ex) / s;
    sb += ((b.top() + b.bottom()) / 2.0 - f.ey) / s;
    sc += b.width() / s;
    ++n;
  }
  BoxMap map;
  if (n > 20) map = BoxMap{sa / n, sb / n, sc / n};
  std::printf("box mapping from %d detector boxes: centre (%.3f, %.3f), side %.3f of (eye distance + eye-to-mouth)\n", n,
              map.a, map.b, map.c);

  for (const char* list : {"new_training", "new_testing"}) {
    std::vector<Row> rows = read_list(root + "/" + list + ".txt");
    std::ofstream out(root + "/" + list + "_dlib.txt");
    double sumEye = 0, sumWorse = 0, sumMouth = 0, dx[2] = {}, dy[2] = {};
    int done = 0;
    std::vector<double> worse;
    for (const Row& r : rows) {
      cv::Mat up;
      if (!load(r, &up)) continue;
      dlib::cv_image<dlib::bgr_pixel> img(up);
      double x[5], y[5], px[5], py[5];
      up_pts(r, x, y);
      dlib::full_object_detection s = sp(img, map.box(frame_of(x, y)));
      points_of(s, px, py);
      s = sp(img, map.box(frame_of(px, py)));  // again from the model's own box
      points_of(s, px, py);
      Row o = r;
      for (int j = 0; j < 5; ++j) o.x[j] = (px[j] - (kUp - 1) / 2.0) / kUp, o.y[j] = (py[j] - (kUp - 1) / 2.0) / kUp;
      out << o.path;
      for (double v : o.x) out << ' ' << v;
      for (double v : o.y) out << ' ' << v;
      out << '\n';
      const double d = std::hypot(r.x[1] - r.x[0], r.y[1] - r.y[0]);
      double e0 = std::hypot(o.x[0] - r.x[0], o.y[0] - r.y[0]) / d, e1 = std::hypot(o.x[1] - r.x[1], o.y[1] - r.y[1]) / d;
      for (int k = 0; k < 2; ++k) dx[k] += (o.x[k] - r.x[k]) / d, dy[k] += (o.y[k] - r.y[k]) / d;
      sumEye += (e0 + e1) / 2, sumWorse += std::max(e0, e1);
      worse.push_back(std::max(e0, e1));
      sumMouth += std::hypot((o.x[3] + o.x[4] - r.x[3] - r.x[4]) / 2, (o.y[3] + o.y[4] - r.y[3] - r.y[4]) / 2) / d;
      ++done;
    }
    std::sort(worse.begin(), worse.end());
    std::printf("%s: %d faces; dlib against MTFL (eye distances): eye mean %.4f, worse eye mean %.4f (median %.4f), "
                "mouth centre %.4f; mean offsets first eye (%.3f, %.3f), second eye (%.3f, %.3f)\n",
                list, done, sumEye / done, sumWorse / done, worse[worse.size() / 2], sumMouth / done, dx[0] / done,
                dy[0] / done, dx[1] / done, dy[1] / done);
  }
  return 0;
}
