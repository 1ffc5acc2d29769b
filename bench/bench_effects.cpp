// Effects of the effect library on 1 MP and 12 MP pictures, beside memcpy of
// the same buffer (the floor). Run with GLIMMER_SCALAR=1 to measure the plain
// single-threaded path.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cstring>
#include <random>
#include <vector>

#include "effect/kalo/iel/iel.h"
#include "effect/kalo/iel/iel_artistic.h"

namespace {
GLIMMER_BENCH_MEMCPY();

struct Picture {
  int width, height;
  std::vector<unsigned char> rgb, rgb_out;
  std::vector<uint32_t> argb, argb_out;
};

Picture& picture(int megapixels) {
  static Picture one, twelve;
  Picture& p = megapixels == 1 ? one : twelve;
  if (p.rgb.empty()) {
    p.width = megapixels == 1 ? 1024 : 4000;
    p.height = megapixels == 1 ? 1024 : 3000;
    const size_t n = static_cast<size_t>(p.width) * p.height;
    std::mt19937 rng(1);
    p.argb.resize(n);
    for (auto& v : p.argb) v = rng();
    p.argb_out.resize(n);
    // Smooth RGB content, closer to a photo than noise.
    p.rgb.resize(n * 3);
    for (int y = 0; y < p.height; ++y)
      for (int x = 0; x < p.width; ++x) {
        unsigned char* q = &p.rgb[(static_cast<size_t>(y) * p.width + x) * 3];
        q[0] = static_cast<unsigned char>(x * 255 / p.width);
        q[1] = static_cast<unsigned char>(y * 255 / p.height);
        q[2] = static_cast<unsigned char>((x + y) & 255);
      }
    p.rgb_out.resize(n * 3);
  }
  return p;
}

void run(benchmark::State& state, int16_t effect, int32_t level, bool argb) {
  Picture& p = picture(static_cast<int>(state.range(0)));
  std::vector<uint32_t> texture(argb ? 0 : p.argb.size(), 0xFFC8C8C8u);
  structIELImage tex{p.width, p.height, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(texture.data())};
  structIELImage in = argb ? structIELImage{p.width, p.height, IEL_FORMAT_ARGB_PACK,
                                            reinterpret_cast<unsigned char*>(p.argb.data())}
                           : structIELImage{p.width, p.height, IEL_FORMAT_RGB888, p.rgb.data()};
  structIELImage out = argb ? structIELImage{p.width, p.height, IEL_FORMAT_ARGB_PACK,
                                             reinterpret_cast<unsigned char*>(p.argb_out.data())}
                            : structIELImage{p.width, p.height, IEL_FORMAT_RGB888, p.rgb_out.data()};
  structIELEffectParams params{effect, &level, argb ? nullptr : &tex, p.width / 2, p.height / 2};
  for (auto _ : state) {
    if (IEL_Apply_Effect(&in, &out, &params) != IEL_OK) state.SkipWithError("effect failed");
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(p.width) * p.height);
}


void BM_Sketch(benchmark::State& state) {
  Picture& p = picture(static_cast<int>(state.range(0)));
  structIELImage in{p.width, p.height, IEL_FORMAT_RGB888, p.rgb.data()};
  structIELImage out{p.width, p.height, IEL_FORMAT_RGB888, p.rgb_out.data()};
  for (auto _ : state) IEL_SketchNew2(&in, &out, 2, 2);
}
}  // namespace

BENCHMARK(BM_Sketch)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, cartoon, IEL_EFFECT_CARTOON, 2, false)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, magic_pen, IEL_EFFECT_MAGIC_PEN, 0, false)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, oil_paint, IEL_EFFECT_OIL_PAINT, 0, false)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, posterize, IEL_EFFECT_POSTERIZE, 0, false)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, sepia, IEL_EFFECT_SEPIA, 15, false)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, sketch_texture, IEL_EFFECT_SKETCH_TEXTURE, 0, false)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, halftone, IEL_EFFECT_HALFTONE, 0, false)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, kaleidoscope, IEL_EFFECT_KALEIDOSCOPE, 0, true)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, reflection, IEL_EFFECT_REFLECTION, 600, true)->Arg(1)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, reflection12, IEL_EFFECT_REFLECTION, 2000, true)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, region_brightness, IEL_EFFECT_REGION_BRIGHTNESS, 5, true)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, region_contrast, IEL_EFFECT_REGION_CONTRAST, 3, true)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, region_exposure, IEL_EFFECT_REGION_EXPOSURE, 3, true)
    ->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(run, vintage, IEL_EFFECT_VINTAGE, 0, true)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond);
BENCHMARK_MAIN();
