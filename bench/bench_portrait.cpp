// Portrait session and operations on 3 MP and 12 MP photos with a face: the
// astronaut test picture, tinted to skin tones and enlarged. Previews are a
// quarter of the photo's side.
#include <benchmark/benchmark.h>

#include "bench_picture.h"

#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "bench_picture.h"
#include "effect/portrait/px_portrait.h"

namespace {
GLIMMER_BENCH_MEMCPY();

struct Photo {
  int width = 0, height = 0;
  std::vector<int> in, out, preview;
};

// Bilinear enlargement of tests/data/astronaut_256.pgm.
Photo& photo(int megapixels) {
  static Photo three, twelve;
  Photo& p = megapixels == 3 ? three : twelve;
  if (!p.in.empty()) return p;
  std::string path = std::string(__FILE__);
  path = path.substr(0, path.rfind('/')) + "/../tests/data/astronaut_256.pgm";
  int w = 0, h = 0, maxv = 0;
  std::vector<unsigned char> g;
  if (FILE* f = std::fopen(path.c_str(), "rb")) {
    if (std::fscanf(f, "P5 %d %d %d", &w, &h, &maxv) == 3 && std::fgetc(f) != EOF) {
      g.resize(static_cast<size_t>(w) * h);
      if (std::fread(g.data(), 1, g.size(), f) != g.size()) g.clear();
    }
    std::fclose(f);
  }
  p.width = megapixels == 3 ? 2048 : 4000;
  p.height = megapixels == 3 ? 1536 : 3000;
  p.in.assign(static_cast<size_t>(p.width) * p.height, 0);
  p.out.resize(p.in.size());
  p.preview.resize(p.in.size() / 16);
  if (g.empty()) return p;
  for (int y = 0; y < p.height; ++y) {
    for (int x = 0; x < p.width; ++x) {
      // The square photo fills the height, centred.
      const double sx = (x - (p.width - p.height) / 2.0) * (w - 1) / (p.height - 1.0);
      const double sy = y * (h - 1) / (p.height - 1.0);
      const int x0 = sx < 0 ? 0 : (sx > w - 2 ? w - 2 : static_cast<int>(sx));
      const int y0 = sy > h - 2 ? h - 2 : static_cast<int>(sy);
      const double fx = sx - x0 < 0 ? 0 : (sx - x0 > 1 ? 1 : sx - x0), fy = sy - y0;
      const double v = (1 - fy) * ((1 - fx) * g[y0 * w + x0] + fx * g[y0 * w + x0 + 1]) +
                       fy * ((1 - fx) * g[(y0 + 1) * w + x0] + fx * g[(y0 + 1) * w + x0 + 1]);
      const int r = v * 1.05 + 20 > 255 ? 255 : static_cast<int>(v * 1.05 + 20);
      p.in[static_cast<size_t>(y) * p.width + x] =
          static_cast<int>(0xFF000000u | r << 16 | static_cast<int>(v * 0.8) << 8 | static_cast<int>(v * 0.68));
    }
  }
  return p;
}

Photo& session(benchmark::State& s) {
  Photo& p = photo(static_cast<int>(s.range(0)));
  if (!px_init_portrait(2, 3, 3, p.in.data(), p.width, p.height)) s.SkipWithError("no session");
  return p;
}

// Analysis in detection mode 3 (upright and the two turned passes, the
// portrait default) and mode 1 (upright only).
void analyse(benchmark::State& s, int mode) {
  Photo& p = photo(static_cast<int>(s.range(0)));
  for (auto _ : s) {
    if (!px_init_portrait(2, 3, mode, p.in.data(), p.width, p.height)) s.SkipWithError("no session");
  }
  px_finish_portrait();
  px_set_facebeauty(2, 3, 3);
}
void Analyse(benchmark::State& s) { analyse(s, 3); }
void AnalyseUpright(benchmark::State& s) { analyse(s, 1); }

template <class Op>
void run(benchmark::State& s, Op op) {
  Photo& p = session(s);
  for (auto _ : s) {
    op(p);
    benchmark::ClobberMemory();
  }
  px_finish_portrait();
}

void Beautify(benchmark::State& s) {
  run(s, [](Photo& p) { px_apply_beautifier(p.in.data(), p.out.data(), p.width, p.height, 3); });
}
void BeautifyPreview(benchmark::State& s) {
  run(s, [](Photo& p) {
    px_apply_beautifier_preview(p.in.data(), p.width, p.height, p.preview.data(), p.width / 4, p.height / 4, 3);
  });
}
void Light(benchmark::State& s) {
  run(s, [](Photo& p) { px_control_light_in_portrait(p.in.data(), p.out.data(), p.width, p.height, 16); });
}
void LightPreview(benchmark::State& s) {
  run(s, [](Photo& p) {
    px_control_light_in_portrait_preview(p.in.data(), p.width, p.height, p.preview.data(), p.width / 4, p.height / 4,
                                         16);
  });
}
void Outfocus(benchmark::State& s) {
  run(s, [](Photo& p) { px_control_outfocusing_in_portrait(p.in.data(), p.out.data(), p.width, p.height, 5); });
}
void OutfocusPreview(benchmark::State& s) {
  run(s, [](Photo& p) {
    px_control_outfocusing_in_portrait_preview(p.in.data(), p.width, p.height, p.preview.data(), p.width / 4,
                                               p.height / 4, 5);
  });
}

#define PORTRAIT_BENCH(name) BENCHMARK(name)->Arg(3)->Arg(12)->Unit(benchmark::kMillisecond)->UseRealTime();
PORTRAIT_BENCH(Analyse)
PORTRAIT_BENCH(AnalyseUpright)
PORTRAIT_BENCH(Beautify)
PORTRAIT_BENCH(BeautifyPreview)
PORTRAIT_BENCH(Light)
PORTRAIT_BENCH(LightPreview)
PORTRAIT_BENCH(Outfocus)
PORTRAIT_BENCH(OutfocusPreview)
}  // namespace

BENCHMARK_MAIN();
