// Filters at 1 MP and 12 MP: texture overlays, tone-curve looks, shader-style
// effects. A chain of N whole-picture adjustments should cost about N passes.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cstdint>
#include <random>
#include <vector>

#include "effect/px_color/px_tone.h"
#include "effect/px_filter/px_filter.h"
#include "effect/px_gpu_effects/px_gpu_effects.h"

namespace {
GLIMMER_BENCH_MEMCPY();

struct Pictures {
  int w, h;
  std::vector<int> in, out, tex, tex2, tex3;
  explicit Pictures(int64_t mp) : w(mp == 1 ? 1152 : 4000), h(mp == 1 ? 864 : 3000) {
    std::mt19937 rng(1);
    const size_t n = static_cast<size_t>(w) * h;
    in.resize(n), out.resize(n), tex.resize(n), tex2.resize(n), tex3.resize(n);
    for (size_t i = 0; i < n; ++i) {
      in[i] = static_cast<int>(rng() | 0xFF000000u);
      tex[i] = static_cast<int>(rng() | 0xFF000000u);
      tex2[i] = static_cast<int>(rng() | 0xFF000000u);
      tex3[i] = static_cast<int>(rng() | 0xFF000000u);
    }
  }
};

template <class Fn>
void run(benchmark::State& state, Fn fn) {
  Pictures p(state.range(0));
  for (auto _ : state) {
    fn(p);
    benchmark::DoNotOptimize(p.out.data());
  }
  state.SetItemsProcessed(state.iterations() * p.w * p.h);
}

#define FILTER_BENCH(name, body)                                       \
  void name(benchmark::State& state) { run(state, [](Pictures& p) { body; }); } \
  BENCHMARK(name)->Arg(1)->Arg(12)->Unit(benchmark::kMillisecond)

FILTER_BENCH(BM_OnePass_Contrast, px_control_contrast_all(p.in.data(), p.out.data(), p.w, p.h, 12));
FILTER_BENCH(BM_DawnCast, px_apply_dawncast_texture(p.in.data(), p.out.data(), p.tex.data(), p.tex2.data(), p.w, p.h));
FILTER_BENCH(BM_LightStreak, px_apply_lightstreak_texture(p.in.data(), p.out.data(), p.tex.data(), p.w, p.h));
FILTER_BENCH(BM_OldPhotoTexture, px_apply_oldphoto_texture(p.in.data(), p.out.data(), p.tex.data(), p.w, p.h));
FILTER_BENCH(BM_Retro, px_apply_retro(p.in.data(), p.out.data(), p.w, p.h));
FILTER_BENCH(BM_Vintage, px_apply_vintage(p.in.data(), p.out.data(), p.w, p.h));
FILTER_BENCH(BM_OldPhoto, px_apply_oldphoto(p.in.data(), p.out.data(), p.w, p.h));
FILTER_BENCH(BM_SoftGlow, px_softglow(p.in.data(), p.out.data(), p.w, p.h));
FILTER_BENCH(BM_Sharpen, px_apply_sharpen_all(p.in.data(), p.out.data(), p.w, p.h));
FILTER_BENCH(BM_Turquoise, gpu_Turquoise(p.in.data(), p.out.data(), p.w, p.h));
FILTER_BENCH(BM_GothicNoir, gpu_gothicnoir(p.in.data(), p.out.data(), p.w, p.h));
FILTER_BENCH(BM_OilPastel, gpu_oilPastel(p.in.data(), p.out.data(), p.tex.data(), p.w, p.h));
FILTER_BENCH(BM_Impressionist,
             gpu_impressionist(p.in.data(), p.out.data(), p.tex.data(), p.tex2.data(), p.w, p.h));
FILTER_BENCH(BM_Stucchevole,
             gpu_stucchevole(p.in.data(), p.out.data(), p.tex.data(), p.tex2.data(), p.tex3.data(), p.w, p.h));
}  // namespace

BENCHMARK_MAIN();
