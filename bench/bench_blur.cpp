// Selective blur, tilt-shift and the variable blur (effect 38) on 1 MP and
// 12 MP pictures, beside OpenCV's Gaussian blur of the same reach where
// OpenCV is installed. Run with GLIMMER_SCALAR=1 for the single-threaded path.
#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "effect/blur/px_blur.h"
#include "effect/kalo/iel/iel_variable_blur.h"

#ifdef GLIMMER_HAVE_OPENCV
#include <opencv2/imgproc.hpp>
#endif

namespace {
struct Picture {
  int width, height;
  std::vector<int> in, out;
  std::vector<unsigned char> mask;
};

Picture& picture(int megapixels) {
  static Picture one, twelve;
  Picture& p = megapixels == 1 ? one : twelve;
  if (p.in.empty()) {
    p.width = megapixels == 1 ? 1024 : 4000;
    p.height = megapixels == 1 ? 1024 : 3000;
    const size_t n = static_cast<size_t>(p.width) * p.height;
    p.in.resize(n);
    p.out.resize(n);
    p.mask.assign(n, 0);
    for (size_t i = 0; i < n; ++i) p.mask[i] = (i % p.width) < static_cast<size_t>(p.width / 2);
    std::mt19937 rng(1);
    for (int& v : p.in) v = static_cast<int>(rng());
  }
  return p;
}

template <class Op>
void run(benchmark::State& state, Op op) {
  Picture& p = picture(static_cast<int>(state.range(0)));
  for (auto _ : state) {
    op(p);
    benchmark::DoNotOptimize(p.out.data());
    benchmark::ClobberMemory();
  }
  state.counters["MPix/s"] = benchmark::Counter(static_cast<double>(state.iterations()) * p.in.size() / 1e6,
                                                benchmark::Counter::kIsRate);
}

void ApplyBlur(benchmark::State& s) {
  run(s, [](Picture& p) {
    px_make_blur(p.in.data(), p.mask.data(), p.out.data(), p.width, p.height, 7, 0, p.width - 1, 0, p.height - 1);
  });
}
BENCHMARK(ApplyBlur)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void BlurPreview(benchmark::State& s) {
  Picture& p = picture(static_cast<int>(s.range(0)));
  px_Init_blur(p.in.data(), p.mask.data(), p.width, p.height, 0, p.width - 1, 0, p.height - 1);
  run(s, [](Picture& q) { px_make_blur_preview(q.in.data(), q.mask.data(), q.out.data(), q.width, q.height, 7); });
  px_destroy_blur();
}
BENCHMARK(BlurPreview)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void ApplyTiltShift(benchmark::State& s) {
  run(s, [](Picture& p) {
    px_apply_tiltshift(p.in.data(), p.out.data(), p.width, p.height, p.height / 2, p.height / 8);
  });
}
BENCHMARK(ApplyTiltShift)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void TiltShiftPreview(benchmark::State& s) {
  Picture& p = picture(static_cast<int>(s.range(0)));
  px_init_tiltshift(p.in.data(), p.width, p.height);
  run(s, [](Picture& q) {
    px_tiltshift_preview(q.in.data(), q.out.data(), q.width, q.height, q.height / 2, q.height / 8);
  });
  px_destroy_tiltshift();
}
BENCHMARK(TiltShiftPreview)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// Arguments: megapixels, radius.
void VariableBlur(benchmark::State& s) {
  const int radius = static_cast<int>(s.range(1));
  run(s, [radius](Picture& p) {
    structIELImage a{p.width, p.height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(p.in.data())};
    structIELImage b{p.width, p.height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(p.out.data())};
    IEL_VariableBlur_ARGB8888(&a, &b, radius);
  });
}
BENCHMARK(VariableBlur)
    ->ArgsProduct({{1, 12}, {3, 15, 63}})
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();

#ifdef GLIMMER_HAVE_OPENCV
// The Gaussian of the same reach (kernel 2r + 1, sigma r / 3) on 8UC4.
void OpenCvGaussianBlur(benchmark::State& s) {
  const int radius = static_cast<int>(s.range(1));
  run(s, [radius](Picture& p) {
    cv::Mat src(p.height, p.width, CV_8UC4, p.in.data()), dst(p.height, p.width, CV_8UC4, p.out.data());
    cv::GaussianBlur(src, dst, cv::Size(2 * radius + 1, 2 * radius + 1), radius / 3.0);
  });
}
BENCHMARK(OpenCvGaussianBlur)
    ->ArgsProduct({{1, 12}, {3, 15, 63}})
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
#endif
}  // namespace

BENCHMARK_MAIN();
