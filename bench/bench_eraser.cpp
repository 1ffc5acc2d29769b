// The object eraser on a 1 MP textured picture (1200 x 840) with a disc hole
// of 1 %, 3 % and 10 % of the area.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cmath>
#include <cstdint>
#include <vector>

#include "effect/object/px_eraser.h"

namespace {
GLIMMER_BENCH_MEMCPY();

void BM_Eraser(benchmark::State& state) {
  const int w = 1200, h = 840;
  const double share = state.range(0) / 100.0;
  const int radius = static_cast<int>(std::sqrt(share * w * h / 3.14159265));
  std::vector<int> base(static_cast<size_t>(w) * h);
  std::vector<unsigned char> mask(base.size());
  uint32_t s = 7;
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      s = s * 1664525u + 1013904223u;
      const int v = 90 + static_cast<int>(40 * std::sin(x * 0.05) * std::cos(y * 0.07)) + static_cast<int>(s >> 28);
      base[y * w + x] = static_cast<int>(0xFF000000u | (v + 30) << 16 | v << 8 | (v - 20));
      const int dx = x - w / 2, dy = y - h / 2;
      mask[y * w + x] = dx * dx + dy * dy <= radius * radius;
    }
  }
  for (auto _ : state) {
    std::vector<int> pic = base;
    process_photoeraser(pic.data(), mask.data(), w, h, w / 2 - radius, w / 2 + radius, h / 2 - radius, h / 2 + radius);
    benchmark::DoNotOptimize(pic.data());
  }
}
BENCHMARK(BM_Eraser)->Arg(1)->Arg(3)->Arg(10)->Unit(benchmark::kMillisecond)->Iterations(1);
}  // namespace

BENCHMARK_MAIN();
