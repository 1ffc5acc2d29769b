#include "common.h"

#include <dirent.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <map>
#include <opencv2/imgcodecs.hpp>
#include <sstream>

namespace {
std::vector<LandmarkFace> read_rows(const std::string& file, const std::map<std::string, bool>& good) {
  std::vector<LandmarkFace> out;
  std::ifstream in(file);
  std::string line;
  while (std::getline(in, line)) {
    std::istringstream ss(line);
    LandmarkFace f;
    ss >> f.path;
    for (float& v : f.x) ss >> v;
    for (float& v : f.y) ss >> v;
    auto g = good.find(f.path);
    if (!ss || g == good.end() || !g->second) continue;
    out.push_back(f);
  }
  return out;
}
}  // namespace

std::vector<LandmarkFace> load_landmarks(const std::string& root, const std::string& list, const std::string& labels) {
  std::map<std::string, bool> good;
  std::ifstream tc(root + "/teacher_check.tsv");
  std::string line;
  while (std::getline(tc, line)) {
    if (line.empty() || line[0] == '#') continue;
    std::istringstream ss(line);
    std::string p, a, b;
    std::getline(ss, p, '\t');
    std::getline(ss, a, '\t');
    std::getline(ss, b, '\t');
    good[p] = b == "1";
  }
  std::vector<LandmarkFace> out = read_rows(root + "/" + list + (labels == "dlib" ? "_dlib" : "") + ".txt", good);
  if (labels == "mean") {
    std::vector<LandmarkFace> other = read_rows(root + "/" + list + "_dlib.txt", good);
    if (other.size() != out.size()) {
      std::fprintf(stderr, "%s_dlib.txt does not match %s.txt (run face_relabel)\n", list.c_str(), list.c_str());
      std::exit(2);
    }
    for (size_t i = 0; i < out.size(); ++i)
      for (int j = 0; j < 5; ++j) out[i].x[j] = (out[i].x[j] + other[i].x[j]) / 2, out[i].y[j] = (out[i].y[j] + other[i].y[j]) / 2;
  } else if (!labels.empty() && out.empty()) {
    std::fprintf(stderr, "no %s_%s.txt (run face_relabel)\n", list.c_str(), labels.c_str());
    std::exit(2);
  }
  for (LandmarkFace& f : out) {
    for (char& c : f.path)
      if (c == '\\') c = '/';
    f.path = root + "/" + f.path;
  }
  return out;
}

cv::Mat load_grey(const std::string& path) {
  cv::Mat bgr = cv::imread(path, cv::IMREAD_COLOR);
  if (bgr.empty()) return bgr;
  cv::Mat g(bgr.rows, bgr.cols, CV_8UC1);
  for (int y = 0; y < bgr.rows; ++y)
    for (int x = 0; x < bgr.cols; ++x) {
      cv::Vec3b p = bgr.at<cv::Vec3b>(y, x);
      g.at<uint8_t>(y, x) = static_cast<uint8_t>((p[0] + p[1] + p[2]) / 3);
    }
  return g;
}

std::vector<std::string> list_images(const std::string& dir) {
  std::vector<std::string> out;
  if (DIR* d = opendir(dir.c_str())) {
    while (dirent* e = readdir(d)) {
      std::string n = e->d_name;
      if (n.size() > 4 && (n.ends_with(".jpg") || n.ends_with(".png") || n.ends_with(".jpeg")))
        out.push_back(dir + "/" + n);
    }
    closedir(d);
  }
  std::sort(out.begin(), out.end());
  return out;
}

cv::Rect2d face_box_from_eyes(double lx, double ly, double rx, double ry) {
  double d = std::hypot(rx - lx, ry - ly), s = d / kEyeDist;
  double mx = (lx + rx) / 2, my = (ly + ry) / 2;
  return cv::Rect2d(mx - kEyeMidX * s, my - kEyeMidY * s, 22 * s, 24 * s);
}

void split_held_out(std::vector<LandmarkFace>& faces, std::vector<LandmarkFace>* held) {
  std::vector<LandmarkFace> train;
  for (size_t i = 0; i < faces.size(); ++i) (i % 10 == 9 && held ? *held : train).push_back(faces[i]);
  faces.swap(train);
}

void keep_agreeing(std::vector<LandmarkFace>& faces, const std::vector<LandmarkFace>& other, double limit) {
  std::map<std::string, const LandmarkFace*> by;
  for (const LandmarkFace& f : other) by[f.path] = &f;
  std::vector<LandmarkFace> kept;
  for (const LandmarkFace& a : faces) {
    auto it = by.find(a.path);
    if (it == by.end()) continue;
    const LandmarkFace& b = *it->second;
    const double d = std::hypot(a.x[1] - a.x[0], a.y[1] - a.y[0]);
    if (std::max(std::hypot(a.x[0] - b.x[0], a.y[0] - b.y[0]), std::hypot(a.x[1] - b.x[1], a.y[1] - b.y[1])) <= limit * d)
      kept.push_back(a);
  }
  faces.swap(kept);
}
