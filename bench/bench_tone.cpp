// Tone adjustments on 1 MP and 12 MP pictures, beside memcpy of the same
// buffer (the floor) and, where OpenCV is installed, its nearest equivalents.
// Run with GLIMMER_SCALAR=1 to measure the plain single-threaded path.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cstring>
#include <random>
#include <vector>

#include "effect/kalo/px_parallel.h"
#include "effect/px_color/px_tone.h"

#ifdef GLIMMER_HAVE_OPENCV
#include <opencv2/core.hpp>
#endif

namespace {
using Picture = BenchPicture;

// Every pixel is selected.
Picture& picture(int megapixels) {
  Picture& p = bench_picture(megapixels);
  if (p.mask[0] == 0) p.mask.assign(p.mask.size(), 1);
  return p;
}

template <class Op>
void run(benchmark::State& state, Op op) {
  picture(static_cast<int>(state.range(0)));
  bench_run(state, op);
}

constexpr px_rect kWhole{0, -1, 0, -1};

#define REGION_BENCH(name, fn, level)                                                                   \
  void name(benchmark::State& s) {                                                                      \
    run(s, [](Picture& p) { fn(p.in.data(), p.mask.data(), p.out.data(), p.width, p.height, level, kWhole); }); \
  }                                                                                                     \
  BENCHMARK(name)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void Memcpy(benchmark::State& s) {
  run(s, [](Picture& p) { std::memcpy(p.out.data(), p.in.data(), p.in.size() * 4); });
}
BENCHMARK(Memcpy)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

REGION_BENCH(Brightness, px_control_brightness, 14)
REGION_BENCH(Contrast, px_control_contrast, 16)
REGION_BENCH(ContrastRange100, px_control_contrast_range100, 80)
REGION_BENCH(Saturation, px_control_saturation, 16)
REGION_BENCH(Temperature, px_control_temperature, 15)
REGION_BENCH(Exposure, px_control_exposure, 14)
REGION_BENCH(FadedColour, px_control_fadedcolor, 70)
REGION_BENCH(Greyscale, px_control_greyscale, 12)

void BrightnessLuma(benchmark::State& s) {
  run(s, [](Picture& p) { px_control_brightness_all(p.in.data(), p.out.data(), p.width, p.height, 14); });
}
BENCHMARK(BrightnessLuma)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// Masked: every pixel selected inside a full-picture rectangle (one thread).
void SaturationMasked(benchmark::State& s) {
  run(s, [](Picture& p) {
    px_control_saturation(p.in.data(), p.mask.data(), p.out.data(), p.width, p.height, 16,
                          px_rect{0, p.width - 1, 0, p.height - 1});
  });
}
BENCHMARK(SaturationMasked)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

#ifdef GLIMMER_HAVE_OPENCV
// A tone curve on the four channels of an 8UC4 picture.
void OpenCvLut(benchmark::State& s) {
  cv::Mat lut(1, 256, CV_8U);
  for (int i = 0; i < 256; ++i) lut.at<unsigned char>(i) = static_cast<unsigned char>(255 - i);
  run(s, [&](Picture& p) {
    cv::Mat src(p.height, p.width, CV_8UC4, p.in.data()), dst(p.height, p.width, CV_8UC4, p.out.data());
    cv::LUT(src, lut, dst);
  });
}
BENCHMARK(OpenCvLut)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// The saturation matrix as a 4x4 channel transform.
void OpenCvTransform(benchmark::State& s) {
  cv::Matx44f m(1.3f, -0.2f, -0.1f, 0, -0.1f, 1.2f, -0.1f, 0, -0.1f, -0.2f, 1.3f, 0, 0, 0, 0, 1);
  run(s, [&](Picture& p) {
    cv::Mat src(p.height, p.width, CV_8UC4, p.in.data()), dst(p.height, p.width, CV_8UC4, p.out.data());
    cv::transform(src, dst, m);
  });
}
BENCHMARK(OpenCvTransform)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();
#endif
}  // namespace

BENCHMARK_MAIN();
