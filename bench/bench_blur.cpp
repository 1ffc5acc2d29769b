// Selective blur, tilt-shift and the variable blur (effect 38) on 1 MP and
// 12 MP pictures, beside OpenCV's Gaussian blur of the same reach where
// OpenCV is installed. Run with GLIMMER_SCALAR=1 for the single-threaded path.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cstring>
#include <random>
#include <vector>

#include "effect/blur/px_blur.h"
#include "effect/kalo/iel/iel_variable_blur.h"

#ifdef GLIMMER_HAVE_OPENCV
#include <opencv2/imgproc.hpp>
#endif

namespace {
GLIMMER_BENCH_MEMCPY();

using Picture = BenchPicture;

// The left half of the picture is selected.
Picture& picture(int megapixels) {
  Picture& p = bench_picture(megapixels);
  const size_t n = p.mask.size();
  if (p.mask[0] == 0) {
    for (size_t i = 0; i < n; ++i) p.mask[i] = (i % p.width) < static_cast<size_t>(p.width / 2);
  }
  return p;
}

template <class Op>
void run(benchmark::State& state, Op op) {
  picture(static_cast<int>(state.range(0)));
  bench_run(state, op);
}

void ApplyBlur(benchmark::State& s) {
  run(s, [](Picture& p) {
    px_make_blur(p.in.data(), p.mask.data(), p.out.data(), p.width, p.height, 7, 0, p.width - 1, 0, p.height - 1);
  });
}
BENCHMARK(ApplyBlur)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// A preview is a picture of the preview's size (a quarter of the side: 1000
// x 750 for the 12 MP picture) shown while the state kept from the full
// picture is blurred again; the previews are timed on that size after the
// state was made from the full picture, the state's making (one reduction of
// the full picture) on its own.
struct Preview {
  int width = 0, height = 0;
  std::vector<int> in, out;
  std::vector<unsigned char> mask;
};
Preview& preview(const Picture& p) {
  static Preview one, twelve;
  Preview& v = p.width == 4000 ? twelve : one;
  if (v.in.empty()) {
    v.width = p.width / 4;
    v.height = p.height / 4;
    const size_t n = static_cast<size_t>(v.width) * v.height;
    v.in.resize(n);
    v.out.resize(n);
    v.mask.resize(n);
    for (int y = 0; y < v.height; ++y) {
      for (int x = 0; x < v.width; ++x) {
        const size_t i = static_cast<size_t>(y) * v.width + x, j = static_cast<size_t>(4 * y) * p.width + 4 * x;
        v.in[i] = p.in[j];
        v.mask[i] = p.mask[j];
      }
    }
  }
  return v;
}

void BlurInit(benchmark::State& s) {
  run(s, [](Picture& p) { px_Init_blur(p.in.data(), p.mask.data(), p.width, p.height, 0, p.width - 1, 0, p.height - 1); });
  px_destroy_blur();
}
BENCHMARK(BlurInit)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void BlurPreview(benchmark::State& s) {
  Picture& p = picture(static_cast<int>(s.range(0)));
  px_Init_blur(p.in.data(), p.mask.data(), p.width, p.height, 0, p.width - 1, 0, p.height - 1);
  Preview& v = preview(p);
  run(s, [&v](Picture&) { px_make_blur_preview(v.in.data(), v.mask.data(), v.out.data(), v.width, v.height, 7); });
  px_destroy_blur();
}
BENCHMARK(BlurPreview)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void ApplyTiltShift(benchmark::State& s) {
  run(s, [](Picture& p) {
    px_apply_tiltshift(p.in.data(), p.out.data(), p.width, p.height, p.height / 2, p.height / 8);
  });
}
BENCHMARK(ApplyTiltShift)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void TiltShiftInit(benchmark::State& s) {
  run(s, [](Picture& p) { px_init_tiltshift(p.in.data(), p.width, p.height); });
  px_destroy_tiltshift();
}
BENCHMARK(TiltShiftInit)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void TiltShiftPreview(benchmark::State& s) {
  Picture& p = picture(static_cast<int>(s.range(0)));
  px_init_tiltshift(p.in.data(), p.width, p.height);
  Preview& v = preview(p);
  run(s, [&v](Picture&) {
    px_tiltshift_preview(v.in.data(), v.out.data(), v.width, v.height, v.height / 2, v.height / 8);
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
    ->ArgsProduct({{1, 12}, {1, 2, 3, 4, 5, 6, 7, 8, 9, 11, 15, 63}})
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
    ->ArgsProduct({{1, 12}, {3, 7, 15, 63}})
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
#endif
}  // namespace

BENCHMARK_MAIN();
