// The fast paths of the neighbourhood effects (planes, running sums, tables,
// row bands on worker threads) against the plain single-threaded path, on
// seeded random pictures of awkward sizes: one row, one column, odd widths,
// pictures smaller than the effects' windows.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <random>
#include <vector>

#include "effect/kalo/iel/iel.h"
#include "effect/kalo/iel/iel_artistic.h"
#include "effect/kalo/px_parallel.h"

namespace {
using Bytes = std::vector<unsigned char>;

struct Size {
  int w, h;
};
// Sizes below the band threshold still take the fast path's code on one
// band; the larger ones are split over the workers.
const Size kSizes[] = {{1, 1}, {1, 37}, {37, 1}, {2, 3}, {5, 4}, {17, 9}, {131, 67}, {67, 259}, {301, 129}};

Bytes random_bytes(size_t n, unsigned seed) {
  std::mt19937 gen(seed);
  Bytes b(n);
  for (auto& v : b) v = static_cast<unsigned char>(gen());
  return b;
}

// Smooth content with edges: the dodge and mode filters see real structure,
// not only noise.
Bytes smooth_rgb(int w, int h, unsigned seed) {
  std::mt19937 gen(seed);
  Bytes b(static_cast<size_t>(w) * h * 3);
  const int cx = static_cast<int>(gen() % (w + 1)), cy = static_cast<int>(gen() % (h + 1));
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      unsigned char* p = &b[(static_cast<size_t>(y) * w + x) * 3];
      const bool inside = (x - cx) * (x - cx) + (y - cy) * (y - cy) < (w * w + h * h) / 9;
      p[0] = static_cast<unsigned char>(inside ? 200 + gen() % 20 : x * 255 / (w > 1 ? w - 1 : 1));
      p[1] = static_cast<unsigned char>(inside ? 40 + gen() % 9 : y * 255 / (h > 1 ? h - 1 : 1));
      p[2] = static_cast<unsigned char>((x * 7 + y * 3 + gen() % 5) & 255);
    }
  return b;
}

// Runs op with the fast paths and with the plain path; both outputs.
struct Both {
  Bytes fast, plain;
};
Both both_paths(const std::function<Bytes()>& op) {
  const bool was = px_scalar_only();
  px_set_scalar_only(false);
  Both r{op(), {}};
  px_set_scalar_only(true);
  r.plain = op();
  px_set_scalar_only(was);
  return r;
}

// An RGB888 effect on `in`; the output starts as 0xAB bytes.
Bytes run_rgb(const Bytes& in, int w, int h, const std::function<int(structIELImage*, structIELImage*)>& effect) {
  Bytes src = in, out(in.size(), 0xAB);
  structIELImage a{w, h, IEL_FORMAT_RGB888, src.data()};
  structIELImage b{w, h, IEL_FORMAT_RGB888, out.data()};
  EXPECT_EQ(effect(&a, &b), IEL_OK);
  EXPECT_EQ(src, in);  // the input is only read
  return out;
}
}  // namespace

TEST(NeighbourhoodPaths, SketchOnGreyPlanesMatchesThePlainSketch) {
  unsigned seed = 1;
  for (const Size& s : kSizes) {
    for (int darkness = 1; darkness <= 3; ++darkness)
      for (int level = 1; level <= 2; ++level) {
        // Noise (deep dodge divisions) and smooth content (highlights).
        for (const Bytes& in : {random_bytes(static_cast<size_t>(s.w) * s.h * 3, seed++), smooth_rgb(s.w, s.h, seed++)}) {
          const Both r = both_paths(
              [&] { return run_rgb(in, s.w, s.h, [&](auto* a, auto* b) { return IEL_SketchNew2(a, b, darkness, level); }); });
          ASSERT_EQ(r.fast, r.plain) << s.w << "x" << s.h << " darkness " << darkness << " level " << level;
        }
      }
  }
}

TEST(NeighbourhoodPaths, SketchOnTextureMatchesThePlainPath) {
  for (const Size& s : kSizes) {
    const Bytes in = smooth_rgb(s.w, s.h, 77);
    std::vector<uint32_t> texture(static_cast<size_t>(s.w) * s.h);
    std::mt19937 gen(5);
    for (auto& t : texture) t = gen();
    structIELImage tex{s.w, s.h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(texture.data())};
    const Both r = both_paths([&] {
      return run_rgb(in, s.w, s.h, [&](auto* a, auto* b) { return IEL_Sketch_Texture(a, b, &tex, 1, 4); });
    });
    ASSERT_EQ(r.fast, r.plain) << s.w << "x" << s.h;
  }
}
