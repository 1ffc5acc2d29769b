// The selection tools at 1 MP and 12 MP: starting a lasso session, adding one
// point (a segment of a tenth of a large object's outline), tap-to-select of
// a large region, and memcpy of the picture for scale.
//
// The scene: a disc of radius 0.4 x the shorter side, in a warm colour with a
// soft shading, on a cooler background with a slow ramp, both with seeded
// noise of +-4 levels, so edges and flat parts are as in a photo. The noise
// picture of bench_picture.h is also used for adding a point, as the worst
// case (no edge to follow, the whole band searched).
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

#include "bench_picture.h"
#include "effect/selection/px_selection.h"

namespace {
struct Scene {
  int w = 0, h = 0;
  double cx = 0, cy = 0, r = 0;
  std::vector<int> pic;
  std::vector<unsigned char> mask;
};

Scene& scene(int megapixels) {
  static Scene one, twelve;
  Scene& s = megapixels == 1 ? one : twelve;
  if (s.pic.empty()) {
    s.w = megapixels == 1 ? 1024 : 4000;
    s.h = megapixels == 1 ? 1024 : 3000;
    s.cx = s.w / 2.0;
    s.cy = s.h / 2.0;
    s.r = 0.4 * std::min(s.w, s.h);
    s.pic.resize(static_cast<size_t>(s.w) * s.h);
    s.mask.assign(s.pic.size(), 0);
    uint32_t rng = 9;
    for (int y = 0; y < s.h; ++y) {
      for (int x = 0; x < s.w; ++x) {
        rng = rng * 1664525u + 1013904223u;
        const int n = static_cast<int>(rng >> 29) - 4;
        const double dx = x + 0.5 - s.cx, dy = y + 0.5 - s.cy;
        const bool in = dx * dx + dy * dy <= s.r * s.r;
        const int shade = static_cast<int>(30 * x / s.w);
        const int r = in ? 200 - shade + n : 60 + shade + n, g = in ? 140 - shade + n : 90 + n,
                  b = in ? 70 + n : 130 + shade + n;
        s.pic[static_cast<size_t>(y) * s.w + x] = static_cast<int>(0xFF000000u | r << 16 | g << 8 | b);
      }
    }
  }
  return s;
}

// A tap on the disc's outline, at a tenth of a turn k.
void tap_at(const Scene& s, int k, int* x, int* y) {
  const double a = k * 2 * 3.14159265358979 / 10;
  *x = static_cast<int>(std::lround(s.cx + s.r * std::cos(a)));
  *y = static_cast<int>(std::lround(s.cy + s.r * std::sin(a)));
}

void Memcpy(benchmark::State& state) {
  Scene& s = scene(static_cast<int>(state.range(0)));
  std::vector<int> out(s.pic.size());
  for (auto _ : state) {
    std::memcpy(out.data(), s.pic.data(), s.pic.size() * 4);
    benchmark::DoNotOptimize(out.data());
    benchmark::ClobberMemory();
  }
}
BENCHMARK(Memcpy)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void SelectionStart(benchmark::State& state) {
  Scene& s = scene(static_cast<int>(state.range(0)));
  for (auto _ : state) {
    if (px_selection_start(s.pic.data(), s.w, s.h) != PX_OK) state.SkipWithError("start failed");
  }
  px_selection_finish();
}
BENCHMARK(SelectionStart)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// One point added after the first (and taken away again, which only frees the
// last segment): a path along a tenth of the disc's outline. The corners'
// full-size costs are computed on first use, so the first iterations are the
// slower ones; each iteration uses the next tenth of the outline, and the
// session is restarted (not timed) after a whole turn.
void SelectionAddPoint(benchmark::State& state) {
  Scene& s = scene(static_cast<int>(state.range(0)));
  int k = 0;
  for (auto _ : state) {
    state.PauseTiming();
    if (k % 10 == 0 || px_selection_point_count() > 0) px_selection_start(s.pic.data(), s.w, s.h);
    int x0, y0, x1, y1;
    tap_at(s, k, &x0, &y0);
    tap_at(s, k + 1, &x1, &y1);
    px_selection_add_point(x0, y0);
    state.ResumeTiming();
    const int steps = px_selection_add_point(x1, y1);
    benchmark::DoNotOptimize(steps);
    state.PauseTiming();
    px_selection_remove_point(x1, y1);
    px_selection_remove_point(x0, y0);
    ++k;
    state.ResumeTiming();
  }
  px_selection_finish();
}
BENCHMARK(SelectionAddPoint)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// The same on seeded random noise: no edge anywhere, the whole band searched.
void SelectionAddPointNoise(benchmark::State& state) {
  BenchPicture& p = bench_picture(static_cast<int>(state.range(0)));
  px_selection_start(p.in.data(), p.width, p.height);
  const int x0 = p.width / 3, y0 = p.height / 3;
  const int x1 = x0 + p.width / 8, y1 = y0 + p.height / 10;  // a segment of 0.16 x the width
  px_selection_add_point(x0, y0);
  for (auto _ : state) {
    const int steps = px_selection_add_point(x1, y1);
    benchmark::DoNotOptimize(steps);
    state.PauseTiming();
    px_selection_remove_point(x1, y1);
    state.ResumeTiming();
  }
  px_selection_finish();
}
BENCHMARK(SelectionAddPointNoise)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

// Tap-to-select of the disc (half the picture) at tolerance 50.
void SelectionTap(benchmark::State& state) {
  Scene& s = scene(static_cast<int>(state.range(0)));
  for (auto _ : state) {
    px_selection_tap(s.pic.data(), s.mask.data(), s.w, s.h, static_cast<int>(s.cx), static_cast<int>(s.cy), 50,
                     PX_SELECT_REPLACE, nullptr);
    benchmark::DoNotOptimize(s.mask.data());
  }
}
BENCHMARK(SelectionTap)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

void SelectionGrow(benchmark::State& state) {
  Scene& s = scene(static_cast<int>(state.range(0)));
  px_selection_tap(s.pic.data(), s.mask.data(), s.w, s.h, static_cast<int>(s.cx), static_cast<int>(s.cy), 50,
                   PX_SELECT_REPLACE, nullptr);
  std::vector<unsigned char> m;
  for (auto _ : state) {
    state.PauseTiming();
    m = s.mask;
    state.ResumeTiming();
    px_selection_grow(m.data(), s.w, s.h, 8, nullptr);
    benchmark::DoNotOptimize(m.data());
  }
}
BENCHMARK(SelectionGrow)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();
}  // namespace

BENCHMARK_MAIN();
