// Lasso quality on test pictures with known object masks. Each object is a
// region of one photo cut by a smooth random outline (a radius made of a few
// random harmonics) and pasted, with an anti-aliased edge (4 x 4 samples a
// pixel), onto another photo. A simulated user taps N points spread evenly
// along the true outline, each off by up to 3 pixels (uniform in a disc), and
// the same taps drive three tools: our edge-snapping lasso, the plain polygon
// through the taps, and OpenCV's IntelligentScissorsMB (Canny features 32/100,
// gradient limit 200, as its sample program uses). Reported per N: the mean
// IoU with the true mask (a pixel belongs to the object when its alpha is at
// least one half), the share of true boundary pixels within 2 pixels of the
// selection's boundary, and the mean time per tap.
//
//   selection_eval tune|report DIR [objects]
//
// The two sets share no photo and no seed: "tune" takes its objects and
// backgrounds from astronaut, chelsea, camera, grass and page with seeds from
// 1000, "report" from coffee, motorcycle_left, motorcycle_right, rocket,
// retina, ihc, coins, moon, brick, gravel and hubble_deep_field with seeds
// from 1. Tune on the first, report the second.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/imgproc/segmentation.hpp>
#include <random>
#include <string>
#include <vector>

#include "effect/selection/px_selection.h"

namespace {

constexpr double M_PI_ = 3.14159265358979323846;

struct Object {
  cv::Mat picture;  // CV_8UC3
  cv::Mat truth;    // CV_8U, 1 inside
  std::vector<cv::Point2d> outline;  // the true outline, densely sampled
  std::string name;
};

double radius_at(const std::vector<double>& amp, const std::vector<double>& phase, double t) {
  double r = 1;
  for (size_t k = 0; k < amp.size(); ++k) r += amp[k] * std::cos((k + 2) * t + phase[k]);
  return std::max(r, 0.35);
}

Object make_object(const std::vector<cv::Mat>& photos, const std::vector<std::string>& names, unsigned seed) {
  std::mt19937 rng(seed);
  auto uni = [&](double a, double b) { return std::uniform_real_distribution<double>(a, b)(rng); };
  const size_t bi = rng() % photos.size();
  size_t si = rng() % photos.size();
  if (si == bi) si = (si + 1) % photos.size();
  Object o;
  o.picture = photos[bi].clone();
  const int w = o.picture.cols, h = o.picture.rows;
  cv::Mat src;
  cv::resize(photos[si], src, cv::Size(w, h), 0, 0, cv::INTER_AREA);
  // Some objects shifted in brightness, so contrasts vary from strong to faint.
  const double gain = uni(0.75, 1.25);
  src.convertTo(src, -1, gain, 0);
  std::vector<double> amp, phase;
  const int harmonics = 2 + static_cast<int>(rng() % 4);
  for (int k = 0; k < harmonics; ++k) {
    amp.push_back(uni(0, 0.35) / (1 + k * 0.7));
    phase.push_back(uni(0, 2 * M_PI_));
  }
  const double side = std::min(w, h);
  const double r0 = side * uni(0.14, 0.28);
  double rmax = 0;
  for (int i = 0; i < 720; ++i) rmax = std::max(rmax, r0 * radius_at(amp, phase, i * 2 * M_PI_ / 720));
  const double cx = uni(rmax + 6, w - rmax - 6), cy = uni(rmax + 6, h - rmax - 6);
  const double aspect = uni(0.75, 1.3);
  auto point = [&](double t) {
    const double r = r0 * radius_at(amp, phase, t);
    return cv::Point2d(cx + r * std::cos(t) * aspect, cy + r * std::sin(t) / aspect);
  };
  for (int i = 0; i < 4000; ++i) o.outline.push_back(point(i * 2 * M_PI_ / 4000));
  // Alpha from 4 x 4 samples a pixel: polygon of the dense outline, filled at 4x.
  std::vector<cv::Point> big;
  for (const auto& p : o.outline) big.emplace_back(cvRound(p.x * 4 * 16), cvRound(p.y * 4 * 16));
  cv::Mat fine = cv::Mat::zeros(h * 4, w * 4, CV_8U);
  // Sample centres of the fine grid: shift by half a fine pixel (shift bits = 4).
  for (auto& p : big) p -= cv::Point(8, 8);
  cv::fillPoly(fine, std::vector<std::vector<cv::Point>>{big}, cv::Scalar(1), cv::LINE_8, 4);
  cv::Mat alpha, count;  // alpha: the mean of the 16 samples
  fine.convertTo(count, CV_32F);
  cv::resize(count, alpha, cv::Size(w, h), 0, 0, cv::INTER_AREA);
  o.truth = cv::Mat::zeros(h, w, CV_8U);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const float a = alpha.at<float>(y, x);
      o.truth.at<uchar>(y, x) = a >= 0.5f;
      cv::Vec3b& b = o.picture.at<cv::Vec3b>(y, x);
      const cv::Vec3b s = src.at<cv::Vec3b>(y, x);
      for (int c = 0; c < 3; ++c) b[c] = cv::saturate_cast<uchar>(a * s[c] + (1 - a) * b[c]);
    }
  }
  o.name = names[si] + " on " + names[bi];
  return o;
}

// Taps at N evenly spread places of the outline (random start), each off by up
// to 3 pixels; as corner coordinates (the nearest integer point).
std::vector<cv::Point> taps(const Object& o, int n, unsigned seed) {
  std::mt19937 rng(seed);
  std::vector<double> arc(o.outline.size() + 1, 0);
  for (size_t i = 0; i < o.outline.size(); ++i) {
    arc[i + 1] = arc[i] + cv::norm(o.outline[(i + 1) % o.outline.size()] - o.outline[i]);
  }
  const double total = arc.back();
  const double start = std::uniform_real_distribution<double>(0, total)(rng);
  std::vector<cv::Point> t;
  for (int k = 0; k < n; ++k) {
    const double s = std::fmod(start + total * k / n, total);
    const size_t i = std::upper_bound(arc.begin(), arc.end(), s) - arc.begin() - 1;
    const cv::Point2d p = o.outline[std::min(i, o.outline.size() - 1)];
    const double r = 3 * std::sqrt(std::uniform_real_distribution<double>(0, 1)(rng));
    const double a = std::uniform_real_distribution<double>(0, 2 * M_PI_)(rng);
    t.emplace_back(std::clamp(cvRound(p.x + r * std::cos(a)), 0, o.picture.cols - 1),
                   std::clamp(cvRound(p.y + r * std::sin(a)), 0, o.picture.rows - 1));
  }
  return t;
}

cv::Mat boundary(const cv::Mat& m) {
  cv::Mat b = cv::Mat::zeros(m.size(), CV_8U);
  for (int y = 0; y < m.rows; ++y) {
    for (int x = 0; x < m.cols; ++x) {
      if (!m.at<uchar>(y, x)) continue;
      const bool edge = x == 0 || y == 0 || x == m.cols - 1 || y == m.rows - 1 || !m.at<uchar>(y, x - 1) ||
                        !m.at<uchar>(y, x + 1) || !m.at<uchar>(y - 1, x) || !m.at<uchar>(y + 1, x);
      b.at<uchar>(y, x) = edge;
    }
  }
  return b;
}

struct Score {
  double iou = 0, near = 0;
};

Score score(const cv::Mat& truth, const cv::Mat& got) {
  long inter = 0, uni = 0;
  for (int y = 0; y < truth.rows; ++y) {
    for (int x = 0; x < truth.cols; ++x) {
      const bool a = truth.at<uchar>(y, x), b = got.at<uchar>(y, x) == 1;
      inter += a && b;
      uni += a || b;
    }
  }
  Score s;
  s.iou = uni ? static_cast<double>(inter) / uni : 1;
  const cv::Mat tb = boundary(truth), gb = boundary(got == 1);
  cv::Mat inv = gb == 0, dist;
  cv::distanceTransform(inv, dist, cv::DIST_L2, cv::DIST_MASK_PRECISE);
  long total = 0, near = 0;
  const bool any = cv::countNonZero(gb) > 0;
  for (int y = 0; y < tb.rows; ++y) {
    for (int x = 0; x < tb.cols; ++x) {
      if (!tb.at<uchar>(y, x)) continue;
      ++total;
      near += any && dist.at<float>(y, x) <= 2.0f;
    }
  }
  s.near = total ? static_cast<double>(near) / total : 1;
  return s;
}

std::vector<int> argb(const cv::Mat& bgr) {
  std::vector<int> p(static_cast<size_t>(bgr.cols) * bgr.rows);
  for (int y = 0; y < bgr.rows; ++y) {
    for (int x = 0; x < bgr.cols; ++x) {
      const cv::Vec3b v = bgr.at<cv::Vec3b>(y, x);
      p[static_cast<size_t>(y) * bgr.cols + x] = static_cast<int>(0xFF000000u | v[2] << 16 | v[1] << 8 | v[0]);
    }
  }
  return p;
}

double ms_since(std::chrono::steady_clock::time_point t) {
  return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - t).count();
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 3 || (std::strcmp(argv[1], "tune") && std::strcmp(argv[1], "report"))) {
    std::fprintf(stderr, "usage: selection_eval tune|report DIR [objects]\n");
    return 2;
  }
  const bool tune = !std::strcmp(argv[1], "tune");
  const std::string dir = argv[2];
  const int objects = argc > 3 ? std::atoi(argv[3]) : 40;
  const std::vector<std::string> names =
      tune ? std::vector<std::string>{"astronaut.png", "chelsea.png", "camera.png", "grass.png", "page.png"}
           : std::vector<std::string>{"coffee.png", "motorcycle_left.png", "motorcycle_right.png", "rocket.jpg",
                                      "retina.jpg", "ihc.png", "coins.png", "moon.png", "brick.png", "gravel.png",
                                      "hubble_deep_field.jpg"};
  std::vector<cv::Mat> photos;
  std::vector<std::string> used;
  for (const auto& n : names) {
    cv::Mat m = cv::imread(dir + "/" + n, cv::IMREAD_COLOR);
    if (m.empty()) {
      std::fprintf(stderr, "cannot read %s/%s (skipped)\n", dir.c_str(), n.c_str());
      continue;
    }
    // Large photos are reduced to at most 800 pixels a side, like the others.
    const double s = 800.0 / std::max(m.cols, m.rows);
    if (s < 1) cv::resize(m, m, cv::Size(), s, s, cv::INTER_AREA);
    photos.push_back(m);
    used.push_back(n.substr(0, n.find('.')));
  }
  if (photos.size() < 2) {
    std::fprintf(stderr, "need at least two photos in %s\n", dir.c_str());
    return 2;
  }
  // GLIMMER_EVAL_NO_OPENCV=1 skips the scissors (for quick tuning runs).
  const bool skip_opencv = std::getenv("GLIMMER_EVAL_NO_OPENCV") != nullptr;
  // GLIMMER_EVAL_SCALE=s (1..8) enlarges every test picture s times.
  const char* scale_env = std::getenv("GLIMMER_EVAL_SCALE");
  const int scale = scale_env ? std::clamp(std::atoi(scale_env), 1, 8) : 1;
  const int ns[3] = {6, 10, 16};
  const char* methods[3] = {"lasso", "polygon", "opencv"};
  Score sum[3][3];
  double ms[3][3] = {};
  double start_ms[2] = {};
  long taps_total[3] = {};
  int worse_than_polygon[3] = {}, worse_than_opencv[3] = {};
  std::vector<double> ious[3][3];
  const unsigned base = tune ? 1000 : 1;
  for (int k = 0; k < objects; ++k) {
    Object o = make_object(photos, used, base + k * 7919u);
    if (scale > 1) {
      // The same object on a picture enlarged s times (bicubic; the true mask
      // and outline enlarged alike): the lasso's two-scale search at phone sizes.
      cv::resize(o.picture, o.picture, cv::Size(), scale, scale, cv::INTER_CUBIC);
      cv::resize(o.truth, o.truth, cv::Size(), scale, scale, cv::INTER_NEAREST);
      for (auto& q : o.outline) q *= scale;
    }
    const int w = o.picture.cols, h = o.picture.rows;
    const std::vector<int> pic = argb(o.picture);
    cv::segmentation::IntelligentScissorsMB tool;
    tool.setEdgeFeatureCannyParameters(32, 100);
    tool.setGradientMagnitudeMaxLimit(200);
    auto t0 = std::chrono::steady_clock::now();
    if (!skip_opencv) tool.applyImage(o.picture);
    const double cv_start = ms_since(t0);
    t0 = std::chrono::steady_clock::now();
    px_selection_start(pic.data(), w, h);
    const double our_start = ms_since(t0);
    for (int ni = 0; ni < 3; ++ni) {
      const int n = ns[ni];
      const std::vector<cv::Point> t = taps(o, n, base + k * 7919u + n);
      taps_total[ni] += n;
      std::vector<int> xy;
      for (const auto& p : t) {
        xy.push_back(p.x);
        xy.push_back(p.y);
      }
      cv::Mat got[3];
      // Our lasso.
      px_selection_start(pic.data(), w, h);
      t0 = std::chrono::steady_clock::now();
      for (const auto& p : t) px_selection_add_point(p.x, p.y);
      got[0] = cv::Mat::zeros(h, w, CV_8U);
      px_selection_close(got[0].data, nullptr);
      ms[0][ni] += ms_since(t0);
      // The polygon through the taps (corner coordinates, the same fill).
      got[1] = cv::Mat::zeros(h, w, CV_8U);
      t0 = std::chrono::steady_clock::now();
      px_selection_fill_polygon(xy.data(), n, got[1].data, w, h);
      ms[1][ni] += ms_since(t0);
      // OpenCV's scissors from tap to tap (pixel coordinates), the contour
      // filled with its boundary pixels, or at pixel centres: the better of
      // the two counts.
      t0 = std::chrono::steady_clock::now();
      std::vector<cv::Point> contour;
      for (int i = 0; i < n && !skip_opencv; ++i) {
        tool.buildMap(t[i]);
        std::vector<cv::Point> part;
        tool.getContour(t[(i + 1) % n], part);
        contour.insert(contour.end(), part.begin(), part.end());
      }
      ms[2][ni] += ms_since(t0);
      cv::Mat filled = cv::Mat::zeros(h, w, CV_8U);
      if (!contour.empty()) cv::fillPoly(filled, std::vector<std::vector<cv::Point>>{contour}, cv::Scalar(1));
      cv::Mat centred = cv::Mat::zeros(h, w, CV_8U);
      std::vector<int> cxy;
      for (const auto& p : contour) {
        cxy.push_back(p.x);
        cxy.push_back(p.y);
      }
      // Pixel centres (x + 0.5, y + 0.5) as corners of a doubled grid, filled and reduced.
      {
        std::vector<int> d(cxy.size());
        for (size_t i = 0; i < cxy.size(); ++i) d[i] = 2 * cxy[i] + 1;
        cv::Mat dbl = cv::Mat::zeros(2 * h, 2 * w, CV_8U);
        px_selection_fill_polygon(d.data(), static_cast<int>(d.size() / 2), dbl.data, 2 * w, 2 * h);
        for (int y = 0; y < h; ++y) {
          for (int x = 0; x < w; ++x) {
            const int c = dbl.at<uchar>(2 * y, 2 * x) + dbl.at<uchar>(2 * y, 2 * x + 1) +
                          dbl.at<uchar>(2 * y + 1, 2 * x) + dbl.at<uchar>(2 * y + 1, 2 * x + 1);
            centred.at<uchar>(y, x) = c >= 2;
          }
        }
      }
      const Score a = score(o.truth, filled), b = score(o.truth, centred);
      Score s[3] = {score(o.truth, got[0]), score(o.truth, got[1]), a.iou >= b.iou ? a : b};
      for (int m = 0; m < 3; ++m) {
        sum[m][ni].iou += s[m].iou;
        sum[m][ni].near += s[m].near;
        ious[m][ni].push_back(s[m].iou);
      }
      worse_than_polygon[ni] += s[0].iou < s[1].iou;
      worse_than_opencv[ni] += s[0].iou < s[2].iou;
      // GLIMMER_EVAL_DUMP=DIR writes each picture with the true boundary
      // (green), the lasso's (red), OpenCV's (blue) and the taps (yellow).
      if (const char* dump = std::getenv("GLIMMER_EVAL_DUMP")) {
        cv::Mat v = o.picture.clone();
        const cv::Mat* masks[3] = {&o.truth, &got[0], &filled};
        const cv::Vec3b colours[3] = {{0, 255, 0}, {0, 0, 255}, {255, 0, 0}};
        for (int m = 0; m < 3; ++m) {
          const cv::Mat b = boundary(*masks[m] == 1);
          v.setTo(cv::Scalar(colours[m][0], colours[m][1], colours[m][2]), b);
        }
        for (const auto& p : t) cv::circle(v, p, 3, cv::Scalar(0, 255, 255), 1);
        cv::imwrite(std::string(dump) + "/" + std::to_string(k) + "-" + std::to_string(n) + ".png", v);
      }
      if (argc > 4) {
        std::printf("%3d %-34s N=%2d  lasso %.4f/%.3f  polygon %.4f/%.3f  opencv %.4f/%.3f\n", k, o.name.c_str(), n,
                    s[0].iou, s[0].near, s[1].iou, s[1].near, s[2].iou, s[2].near);
      }
    }
    start_ms[0] += our_start;
    start_ms[1] += cv_start;
  }
  px_selection_finish();
  std::printf("%s set: %d objects on %zu photos (%s)\n", tune ? "tuning" : "report", objects, photos.size(),
              tune ? "seeds from 1000" : "seeds from 1");
  std::printf("%-8s | %-29s | %-29s | %-29s\n", "", "N = 6", "N = 10", "N = 16");
  std::printf("%-8s |", "tool");
  for (int ni = 0; ni < 3; ++ni) std::printf(" %7s %7s %6s %5s |", "IoU", "median", "<=2px", "ms");
  std::printf("\n");
  for (int m = 0; m < 3; ++m) {
    std::printf("%-8s |", methods[m]);
    for (int ni = 0; ni < 3; ++ni) {
      std::vector<double> v = ious[m][ni];
      std::sort(v.begin(), v.end());
      std::printf(" %7.4f %7.4f %6.3f %5.1f |", sum[m][ni].iou / objects, v[v.size() / 2], sum[m][ni].near / objects,
                  ms[m][ni] / taps_total[ni]);
    }
    std::printf("\n");
  }
  std::printf("start: lasso %.1f ms, opencv applyImage %.1f ms a picture\n", start_ms[0] / objects,
              start_ms[1] / objects);
  std::printf("objects where the lasso's IoU is below the polygon's: %d, %d, %d; below OpenCV's: %d, %d, %d\n",
              worse_than_polygon[0], worse_than_polygon[1], worse_than_polygon[2], worse_than_opencv[0],
              worse_than_opencv[1], worse_than_opencv[2]);
  return 0;
}
