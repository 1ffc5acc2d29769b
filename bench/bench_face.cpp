// The face analyser (faces, eyes, mouths) on a 640-pixel photo, beside
// OpenCV's LBP and Haar frontal-face cascades on the same grey picture where
// OpenCV and its cascade files are installed. The photo is the astronaut
// sample of the tests, enlarged to 640 x 640.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cstdio>
#include <string>
#include <vector>

#include "effect/face/face_engine.h"
#include "effect/face/fd_detector.h"
#include "effect/kalo/px_parallel.h"

#ifdef GLIMMER_HAVE_OPENCV
#include <opencv2/core/utility.hpp>
#include <opencv2/objdetect.hpp>
#endif

namespace {
GLIMMER_BENCH_MEMCPY();

struct Photo {
  int width = 0, height = 0;
  std::vector<unsigned char> grey;
  std::vector<int> argb;
};

// The 256-pixel sample, bilinearly enlarged to 640 x 640 (grey and ARGB).
const Photo& photo() {
  static Photo p;
  if (!p.grey.empty()) return p;
  std::string path = __FILE__;
  path = path.substr(0, path.rfind('/')) + "/../tests/data/astronaut_256.pgm";
  int w = 0, h = 0, maxv = 0;
  std::vector<unsigned char> src;
  if (FILE* f = std::fopen(path.c_str(), "rb")) {
    if (std::fscanf(f, "P5 %d %d %d", &w, &h, &maxv) == 3 && std::fgetc(f) != EOF && w > 1 && h > 1) {
      src.resize(static_cast<size_t>(w) * h);
      if (std::fread(src.data(), 1, src.size(), f) != src.size()) src.clear();
    }
    std::fclose(f);
  }
  if (src.empty()) return p;
  p.width = p.height = 640;
  p.grey.resize(640 * 640);
  p.argb.resize(640 * 640);
  for (int y = 0; y < 640; ++y)
    for (int x = 0; x < 640; ++x) {
      const double sx = (x + 0.5) * w / 640.0 - 0.5, sy = (y + 0.5) * h / 640.0 - 0.5;
      const int x0 = sx < 0 ? 0 : static_cast<int>(sx), y0 = sy < 0 ? 0 : static_cast<int>(sy);
      const int x1 = x0 + 1 < w ? x0 + 1 : w - 1, y1 = y0 + 1 < h ? y0 + 1 : h - 1;
      const double fx = sx < 0 ? 0 : sx - x0, fy = sy < 0 ? 0 : sy - y0;
      const double top = src[y0 * w + x0] * (1 - fx) + src[y0 * w + x1] * fx;
      const double bottom = src[y1 * w + x0] * (1 - fx) + src[y1 * w + x1] * fx;
      const auto v = static_cast<unsigned char>(top * (1 - fy) + bottom * fy + 0.5);
      p.grey[y * 640 + x] = v;
      p.argb[y * 640 + x] = static_cast<int>(0xFF000000u | v * 0x010101u);
    }
  return p;
}

// RunFaceAnalyzer with detection mode 1 (upright) or 3 (also +-45 degrees).
void FaceAnalyzer(benchmark::State& state) {
  const Photo& p = photo();
  if (p.argb.empty()) {
    state.SkipWithError("tests/data/astronaut_256.pgm not found");
    return;
  }
  FaceEngineInfo info{};
  InitFaceBeautyPlus(&info, static_cast<int>(state.range(0)), 10, 1, 0, 3, 0);
  for (auto _ : state) {
    RunFaceAnalyzer(&info, p.argb.data(), p.width, p.height);
    benchmark::DoNotOptimize(info.faceCount);
  }
  state.counters["faces"] = info.faceCount;
  ReleaseFaceBeautyPlus(&info);
}
BENCHMARK(FaceAnalyzer)->Arg(1)->Arg(3)->Unit(benchmark::kMillisecond)->UseRealTime();

// The face detector alone (fd_find, precision 1) on the 640 grey picture,
// upright (mode 1) or with the +-45 degree passes (mode 3), with the fast
// path (worker threads) or the plain single-threaded path.
void FaceDetector(benchmark::State& state, bool plain) {
  const Photo& p = photo();
  if (p.grey.empty()) {
    state.SkipWithError("tests/data/astronaut_256.pgm not found");
    return;
  }
  const bool was = px_scalar_only();
  px_set_scalar_only(plain);
  const int rotated = state.range(0) == 3 ? 1 : 0;
  int faces = 0;
  for (auto _ : state) {
    faces = fd_find(p.grey.data(), p.width, p.height, rotated, 0, 1);
    benchmark::DoNotOptimize(faces);
  }
  px_set_scalar_only(was);
  state.counters["faces"] = faces;
}
BENCHMARK_CAPTURE(FaceDetector, Fast, false)->Arg(1)->Arg(3)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK_CAPTURE(FaceDetector, Plain, true)->Arg(1)->Arg(3)->Unit(benchmark::kMillisecond)->UseRealTime();

#ifdef GLIMMER_HAVE_OPENCV
// detectMultiScale with the parameters face_eval uses (scale step 1.1, three
// neighbours, faces from 20 pixels); threads = 0 keeps OpenCV's default
// thread count, 1 makes it single-threaded.
void OpenCvCascade(benchmark::State& state, const char* file, int threads) {
  const Photo& p = photo();
  cv::CascadeClassifier cascade;
  if (p.grey.empty() || !cascade.load(std::string("/usr/share/opencv4/") + file)) {
    state.SkipWithError("picture or cascade file (opencv-data) not found");
    return;
  }
  const int was = cv::getNumThreads();
  if (threads > 0) cv::setNumThreads(threads);
  cv::Mat grey(p.height, p.width, CV_8UC1, const_cast<unsigned char*>(p.grey.data()));
  std::vector<cv::Rect> faces;
  for (auto _ : state) {
    cascade.detectMultiScale(grey, faces, 1.1, 3, 0, cv::Size(20, 20));
    benchmark::DoNotOptimize(faces.data());
  }
  cv::setNumThreads(was);
  state.counters["faces"] = static_cast<double>(faces.size());
}
BENCHMARK_CAPTURE(OpenCvCascade, LbpDefaultThreads, "lbpcascades/lbpcascade_frontalface_improved.xml", 0)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
BENCHMARK_CAPTURE(OpenCvCascade, LbpOneThread, "lbpcascades/lbpcascade_frontalface_improved.xml", 1)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
BENCHMARK_CAPTURE(OpenCvCascade, HaarDefaultThreads, "haarcascades/haarcascade_frontalface_default.xml", 0)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
BENCHMARK_CAPTURE(OpenCvCascade, HaarOneThread, "haarcascades/haarcascade_frontalface_default.xml", 1)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
#endif
}  // namespace

BENCHMARK_MAIN();
