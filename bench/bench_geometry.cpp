// Geometry on 1 MP and 12 MP pictures: the quarter turn beside memcpy (the
// floor) and, where OpenCV is installed, cv::rotate; twirl and sphericity at
// full and half resolution over the whole picture with a circle of half the
// shorter side. Run with GLIMMER_SCALAR=1 for the single-threaded path.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cstring>
#include <random>
#include <vector>

#include "effect/geometry/px_geometry.h"

#ifdef GLIMMER_HAVE_OPENCV
#include <opencv2/core.hpp>
#endif

namespace {
using Picture = BenchPicture;

Picture& picture(int megapixels) { return bench_picture(megapixels); }

template <class Op>
void run(benchmark::State& state, Op op) {
  picture(static_cast<int>(state.range(0)));
  bench_run(state, op);
}

#define GEOMETRY_BENCH(name, ...)                                       \
  void name(benchmark::State& s) { run(s, [](Picture& p) __VA_ARGS__); } \
  BENCHMARK(name)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

GEOMETRY_BENCH(Memcpy, { std::memcpy(p.out.data(), p.in.data(), p.in.size() * 4); })
// Code 1 reads the source and writes the turned picture; the source is left as it is.
GEOMETRY_BENCH(QuarterTurn, { px_rotate_flip(p.in.data(), p.out.data(), p.width, p.height, 1, 0, 0); })
GEOMETRY_BENCH(Straighten, { px_straighten(p.in.data(), p.out.data(), p.width, p.height, 7, 0.85f); })
GEOMETRY_BENCH(Twirl, {
  px_twirl(p.in.data(), p.out.data(), p.width, p.height, p.width / 2, p.height / 2, p.height / 2, 200, 0,
           p.width - 1, 0, p.height - 1, 0);
})
GEOMETRY_BENCH(TwirlHalf, {
  px_twirl(p.in.data(), p.out.data(), p.width, p.height, p.width / 2, p.height / 2, p.height / 2, 200, 0,
           p.width - 1, 0, p.height - 1, 1);
})
GEOMETRY_BENCH(Sphericity, {
  px_sphericity(p.in.data(), p.out.data(), p.width, p.height, p.width / 2, p.height / 2, p.height / 2, 60, 0,
                p.width - 1, 0, p.height - 1, 0);
})
GEOMETRY_BENCH(SphericityHalf, {
  px_sphericity(p.in.data(), p.out.data(), p.width, p.height, p.width / 2, p.height / 2, p.height / 2, 60, 0,
                p.width - 1, 0, p.height - 1, 1);
})

#ifdef GLIMMER_HAVE_OPENCV
GEOMETRY_BENCH(OpenCvRotate, {
  cv::Mat src(p.height, p.width, CV_8UC4, p.in.data()), dst(p.width, p.height, CV_8UC4, p.out.data());
  cv::rotate(src, dst, cv::ROTATE_90_CLOCKWISE);
})
#endif
}  // namespace

BENCHMARK_MAIN();
