// Eraser quality and speed on real photos: cuts holes of a few shapes and
// sizes into each picture, fills them, and reports the mean absolute error
// against the original pixels inside the hole (per channel, 0..255) and the
// run time, next to OpenCV's Telea and Navier-Stokes inpainting on the same
// holes.
//
//   eraser_eval photo.png [photo.png ...]
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <opencv2/imgcodecs.hpp>
#include <opencv2/photo.hpp>
#include <string>
#include <vector>

#include "effect/object/px_eraser.h"

namespace {
struct Hole {
  const char* name;
  int kind;      // 0 disc, 1 bar, 2 square
  double frac;   // size relative to the shorter side
};
const Hole kHoles[] = {{"disc-s", 0, 0.06}, {"disc-l", 0, 0.16}, {"bar", 1, 0.30}, {"square", 2, 0.20}};

cv::Mat hole_mask(int w, int h, const Hole& hole) {
  cv::Mat m = cv::Mat::zeros(h, w, CV_8U);
  const int s = static_cast<int>((w < h ? w : h) * hole.frac);
  const cv::Point c(w / 2 + w / 9, h / 2 - h / 11);
  if (hole.kind == 0) cv::circle(m, c, s / 2, cv::Scalar(1), cv::FILLED);
  if (hole.kind == 1) cv::rectangle(m, cv::Rect(c.x - s / 2, c.y - s / 12, s, s / 6), cv::Scalar(1), cv::FILLED);
  if (hole.kind == 2) cv::rectangle(m, cv::Rect(c.x - s / 2, c.y - s / 2, s, s), cv::Scalar(1), cv::FILLED);
  return m;
}

double error(const cv::Mat& a, const cv::Mat& b, const cv::Mat& mask) {
  double sum = 0;
  long n = 0;
  for (int y = 0; y < a.rows; ++y) {
    for (int x = 0; x < a.cols; ++x) {
      if (!mask.at<unsigned char>(y, x)) continue;
      const cv::Vec3b p = a.at<cv::Vec3b>(y, x), q = b.at<cv::Vec3b>(y, x);
      for (int c = 0; c < 3; ++c) sum += std::abs(p[c] - q[c]);
      n += 3;
    }
  }
  return n ? sum / n : 0;
}

double ms_since(std::chrono::steady_clock::time_point t) {
  return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - t).count();
}
}  // namespace

int main(int argc, char** argv) {
  std::printf("%-22s %-7s %8s | %8s %8s | %8s %8s | %8s %8s\n", "photo", "hole", "pixels", "erase", "ms", "telea",
              "ms", "ns", "ms");
  for (int a = 1; a < argc; ++a) {
    cv::Mat img = cv::imread(argv[a], cv::IMREAD_COLOR);
    if (img.empty()) {
      std::fprintf(stderr, "cannot read %s\n", argv[a]);
      continue;
    }
    std::string name = argv[a];
    name = name.substr(name.find_last_of('/') + 1);
    for (const Hole& hole : kHoles) {
      const cv::Mat mask = hole_mask(img.cols, img.rows, hole);
      std::vector<int> pic(static_cast<size_t>(img.cols) * img.rows);
      for (int y = 0; y < img.rows; ++y) {
        for (int x = 0; x < img.cols; ++x) {
          const cv::Vec3b p = img.at<cv::Vec3b>(y, x);
          const bool in = mask.at<unsigned char>(y, x);
          // The hole starts magenta, so nothing of the original leaks in.
          pic[y * img.cols + x] = in ? static_cast<int>(0xFFFF00FFu)
                                     : static_cast<int>(0xFF000000u | p[2] << 16 | p[1] << 8 | p[0]);
        }
      }
      cv::Rect box = cv::boundingRect(mask);
      auto t = std::chrono::steady_clock::now();
      process_photoeraser(pic.data(), mask.data, img.cols, img.rows, box.x, box.x + box.width - 1, box.y,
                          box.y + box.height - 1);
      const double ours_ms = ms_since(t);
      cv::Mat ours(img.size(), CV_8UC3);
      for (int y = 0; y < img.rows; ++y) {
        for (int x = 0; x < img.cols; ++x) {
          const int p = pic[y * img.cols + x];
          ours.at<cv::Vec3b>(y, x) = cv::Vec3b(p & 255, (p >> 8) & 255, (p >> 16) & 255);
        }
      }
      cv::Mat damaged = img.clone();
      damaged.setTo(cv::Scalar(255, 0, 255), mask);
      cv::Mat telea, ns;
      t = std::chrono::steady_clock::now();
      cv::inpaint(damaged, mask, telea, 3, cv::INPAINT_TELEA);
      const double telea_ms = ms_since(t);
      t = std::chrono::steady_clock::now();
      cv::inpaint(damaged, mask, ns, 3, cv::INPAINT_NS);
      const double ns_ms = ms_since(t);
      std::printf("%-22s %-7s %8d | %8.2f %8.1f | %8.2f %8.1f | %8.2f %8.1f\n", name.c_str(), hole.name,
                  cv::countNonZero(mask), error(ours, img, mask), ours_ms, error(telea, img, mask), telea_ms,
                  error(ns, img, mask), ns_ms);
      if (std::getenv("ERASER_EVAL_SAVE")) {
        cv::imwrite(std::string(std::getenv("ERASER_EVAL_SAVE")) + "/" + name + "-" + hole.name + ".png", ours);
      }
    }
  }
  return 0;
}
