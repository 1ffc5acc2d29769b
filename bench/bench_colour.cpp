// Colour tools on 1 MP and 12 MP pictures beside memcpy (the floor). Run with
// GLIMMER_SCALAR=1 for the single-threaded path.
#include <benchmark/benchmark.h>

#include <cstring>
#include <vector>

#include "bench_picture.h"
#include "effect/px_color/px_auto_adjust.h"
#include "effect/px_color/px_hue.h"

namespace {
constexpr px_rect kWhole{0, -1, 0, -1};

#define COLOUR_BENCH(name, body)                                  \
  void name(benchmark::State& s) { bench_run(s, [](BenchPicture& p) { body; }); } \
  BENCHMARK(name)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();

COLOUR_BENCH(Memcpy, std::memcpy(p.out.data(), p.in.data(), p.in.size() * 4))
// Level 7: a turn of 126 degrees (levels past 20 turn more than two circles and copy).
COLOUR_BENCH(Hue, px_control_hue(p.in.data(), p.mask.data(), p.out.data(), p.width, p.height, 7, kWhole))
COLOUR_BENCH(Hue100, px_control_hue_range100(p.in.data(), p.mask.data(), p.out.data(), p.width, p.height, 70, kWhole))
// Masked: every pixel selected inside a full-picture rectangle.
COLOUR_BENCH(Hue100Masked, {
  static std::vector<unsigned char> all;  // filled once per picture size, by the first run
  if (all.size() < p.in.size()) all.assign(p.in.size(), 1);
  px_control_hue_range100(p.in.data(), all.data(), p.out.data(), p.width, p.height, 70,
                          px_rect{0, p.width - 1, 0, p.height - 1});
})
COLOUR_BENCH(AdjustRGB,
             px_adjust_RGB(p.in.data(), p.mask.data(), p.out.data(), p.width, p.height, 14, 10, 7, kWhole))
COLOUR_BENCH(AdjustRGBAll, px_adjust_RGB_all(p.in.data(), p.out.data(), p.width, p.height, 14, 10, 7))
COLOUR_BENCH(PointColourRed, px_point_color_red(p.in.data(), p.out.data(), p.width, p.height))
COLOUR_BENCH(ColourTone, px_change_colortone(p.in.data(), p.out.data(), p.width, p.height, 14))
COLOUR_BENCH(AutoAdjust, px_process_hdr(p.in.data(), p.out.data(), p.width, p.height))
}  // namespace

BENCHMARK_MAIN();
