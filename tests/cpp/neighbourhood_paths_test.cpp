// The fast paths of the neighbourhood effects (planes, running sums, tables,
// row bands on worker threads) against the plain single-threaded path, on
// seeded random pictures of awkward sizes: one row, one column, odd widths,
// pictures smaller than the effects' windows.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <random>
#include <vector>

#include "effect/blur/px_blur.h"
#include "effect/kalo/iel/iel.h"
#include "effect/kalo/iel/iel_artistic.h"
#include "effect/kalo/px_parallel.h"
#include "effect/px_filter/px_filter.h"
#include "effect/px_gpu_effects/px_gpu_effects.h"

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

TEST(NeighbourhoodPaths, HalftoneTablesMatchTheDoubleConversions) {
  unsigned seed = 11;
  for (const Size& s : kSizes) {
    Bytes in = random_bytes(static_cast<size_t>(s.w) * s.h * 3, seed++);
    // Pure black, pure white and single-channel pixels first: the special
    // cases of the separation.
    const unsigned char specials[5][3] = {{0, 0, 0}, {255, 255, 255}, {0, 0, 1}, {1, 0, 0}, {255, 0, 0}};
    for (size_t i = 0; i < 5 && 3 * i + 2 < in.size(); ++i)
      for (int c = 0; c < 3; ++c) in[3 * i + c] = specials[i][c];
    for (const Bytes& pic : {in, smooth_rgb(s.w, s.h, seed++)}) {
      const Both r = both_paths([&] { return run_rgb(pic, s.w, s.h, IEL_Halftone_Colored_CMYK); });
      ASSERT_EQ(r.fast, r.plain) << s.w << "x" << s.h;
      // In place, the plain path's blend sees its own result.
      const Both inplace = both_paths([&] {
        Bytes b = pic;
        structIELImage a{s.w, s.h, IEL_FORMAT_RGB888, b.data()};
        EXPECT_EQ(IEL_Halftone_Colored_CMYK(&a, &a), IEL_OK);
        return b;
      });
      ASSERT_EQ(inplace.fast, inplace.plain) << s.w << "x" << s.h;
    }
  }
  // Colours across the whole cube through the tables: every 5th value of
  // each channel (52^3 pixels, 376 x 374 with black after them).
  const int w = 376, h = 374;
  Bytes cube(static_cast<size_t>(w) * h * 3, 0);
  size_t i = 0;
  for (int r = 0; r < 256; r += 5)
    for (int g = 0; g < 256; g += 5)
      for (int b = 0; b < 256; b += 5, i += 3) {
        cube[i] = static_cast<unsigned char>(r);
        cube[i + 1] = static_cast<unsigned char>(g);
        cube[i + 2] = static_cast<unsigned char>(b);
      }
  const Both r = both_paths([&] { return run_rgb(cube, w, h, IEL_Halftone_Colored_CMYK); });
  EXPECT_EQ(r.fast, r.plain);
}

TEST(NeighbourhoodPaths, OilPaintLevelPlaneMatchesThePlainModeFilter) {
  unsigned seed = 21;
  for (const Size& s : kSizes) {
    for (const Bytes& in : {random_bytes(static_cast<size_t>(s.w) * s.h * 3, seed++), smooth_rgb(s.w, s.h, seed++)}) {
      const Both r = both_paths([&] { return run_rgb(in, s.w, s.h, IEL_OilPaintEdge); });
      ASSERT_EQ(r.fast, r.plain) << s.w << "x" << s.h;
      const Both m = both_paths([&] { return run_rgb(in, s.w, s.h, IEL_OilifyFix); });
      ASSERT_EQ(m.fast, m.plain) << s.w << "x" << s.h;
    }
    // Three colours of three levels (one of them darkened where its blurred
    // red is higher): windows full of tied counts, where the visit order
    // decides the pick.
    const unsigned char palette[3][3] = {{250, 30, 30}, {40, 40, 200}, {90, 250, 90}};
    Bytes few(static_cast<size_t>(s.w) * s.h * 3);
    std::mt19937 gen(seed++);
    for (size_t i = 0; i < few.size(); i += 3) std::memcpy(&few[i], palette[gen() % 3], 3);
    const Both r = both_paths([&] { return run_rgb(few, s.w, s.h, IEL_OilPaintEdge); });
    ASSERT_EQ(r.fast, r.plain) << s.w << "x" << s.h << " three colours";
  }
}

// The streamed effects keep rings of rows per band and start each band from
// the rows above it: heights from one band to several, so that the band
// edges fall at every offset of the rings (three, eight rows) and of the
// dots of the halftone screens.
TEST(NeighbourhoodPaths, StreamedBandsMatchThePlainPathAtManyHeights) {
  const int w = 23;
  for (int h = 30; h <= 140; h += 11) {
    const Bytes in = smooth_rgb(w, h, static_cast<unsigned>(h));
    std::vector<uint32_t> texture(static_cast<size_t>(w) * h);
    std::mt19937 gen(static_cast<unsigned>(h));
    for (auto& t : texture) t = gen();
    structIELImage tex{w, h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(texture.data())};
    const Both oil = both_paths([&] { return run_rgb(in, w, h, IEL_OilPaintEdge); });
    EXPECT_EQ(oil.fast, oil.plain) << "oil paint, height " << h;
    const Both sketch = both_paths([&] {
      return run_rgb(in, w, h, [&](auto* a, auto* b) { return IEL_Sketch_Texture(a, b, &tex, 1, 4); });
    });
    EXPECT_EQ(sketch.fast, sketch.plain) << "sketch on texture, height " << h;
    const Both halftone = both_paths([&] { return run_rgb(in, w, h, IEL_Halftone_Colored_CMYK); });
    EXPECT_EQ(halftone.fast, halftone.plain) << "halftone, height " << h;
  }
}

namespace {
std::vector<int> random_argb(size_t n, unsigned seed) {
  std::mt19937 gen(seed);
  std::vector<int> v(n);
  for (int& p : v) p = static_cast<int>(gen());
  return v;
}
Bytes as_bytes(const std::vector<int>& v) {
  const auto* b = reinterpret_cast<const unsigned char*>(v.data());
  return Bytes(b, b + v.size() * 4);
}
}  // namespace

TEST(NeighbourhoodPaths, ShaderLooksReadByTablesAsThePlainPathDivides) {
  unsigned seed = 31;
  for (const Size& s : kSizes) {
    const size_t n = static_cast<size_t>(s.w) * s.h;
    std::vector<int> in = random_argb(n, seed++), t1 = random_argb(n, seed++), t2 = random_argb(n, seed++),
                     t3 = random_argb(n, seed++);
    // Grey strokes give diagonal dabs; every byte value shows up in the
    // stroke texture's red and blue on the larger sizes.
    for (size_t i = 0; i < n; i += 3) t1[i] = static_cast<int>(0xFF000000u | (i & 255) * 0x010101u);
    auto look = [&](int which) {
      return both_paths([&] {
        std::vector<int> out(n, 0x5A5A5A5A);
        const std::vector<int> before = in;
        switch (which) {
          case 0:
            gpu_oilPastel(in.data(), out.data(), t1.data(), s.w, s.h);
            break;
          case 1:
            gpu_impressionist(in.data(), out.data(), t1.data(), t2.data(), s.w, s.h);
            break;
          default:
            gpu_stucchevole(in.data(), out.data(), t1.data(), t2.data(), t3.data(), s.w, s.h);
            break;
        }
        EXPECT_EQ(in, before);
        return as_bytes(out);
      });
    };
    for (int which = 0; which < 3; ++which) {
      const Both r = look(which);
      ASSERT_EQ(r.fast, r.plain) << "look " << which << " " << s.w << "x" << s.h;
      ASSERT_NE(r.fast, as_bytes(std::vector<int>(n, 0x5A5A5A5A)));
    }
    // The partial forms run the whole ones: a selected ellipse of the mask.
    std::vector<unsigned char> mask(n, 0);
    for (size_t i = 0; i < n; i += 2) mask[i] = 1;
    const Both part = both_paths([&] {
      std::vector<int> out(n, 7);
      gpu_impressionist_partial(in.data(), mask.data(), out.data(), t1.data(), t2.data(), s.w, s.h, 0, s.w - 1, 0,
                                s.h - 1);
      return as_bytes(out);
    });
    ASSERT_EQ(part.fast, part.plain);
  }
}

TEST(NeighbourhoodPaths, BlurCompositingByBlendedRowsMatchesThePlainBilinear) {
  // Sizes that reduce by 0 to 4 (up to 3300 a side), thin strips (their own
  // steps, no 11-bit index), one pixel.
  const Size sizes[] = {{1, 1}, {3, 700}, {700, 3}, {37, 29}, {431, 97}, {867, 5}, {1700, 9}, {3300, 4}, {9, 3300}};
  unsigned seed = 41;
  for (const Size& s : sizes) {
    const size_t n = static_cast<size_t>(s.w) * s.h;
    const std::vector<int> in = random_argb(n, seed++);
    // A selection of irregular blobs: the reduced mask mixes selected and
    // unselected neighbours.
    std::vector<unsigned char> mask(n, 0);
    std::mt19937 gen(seed++);
    for (size_t i = 0; i < n; ++i) mask[i] = ((i / 7 + gen() % 3) % 5) < 3 ? 1 : static_cast<unsigned char>(gen() % 3);
    for (int level : {0, 3, 7}) {
      const Both whole = both_paths([&] {
        std::vector<int> out(n, 1);
        EXPECT_EQ(px_make_blur(in.data(), nullptr, out.data(), s.w, s.h, level, 0, -1, 0, -1), 40960);
        return as_bytes(out);
      });
      ASSERT_EQ(whole.fast, whole.plain) << s.w << "x" << s.h << " level " << level;
      const Both selected = both_paths([&] {
        std::vector<int> out(n, 1);
        std::vector<unsigned char> m = mask;
        EXPECT_EQ(px_make_blur(in.data(), m.data(), out.data(), s.w, s.h, level, 0, s.w - 1, 0, s.h - 1), 40960);
        return as_bytes(out);
      });
      ASSERT_EQ(selected.fast, selected.plain) << s.w << "x" << s.h << " level " << level;
      const Both preview = both_paths([&] {
        std::vector<unsigned char> m = mask;
        EXPECT_EQ(px_Init_blur(in.data(), m.data(), s.w, s.h, 0, s.w - 1, 0, s.h - 1), 40960);
        std::vector<int> out(n, 1);
        px_make_blur_preview(in.data(), m.data(), out.data(), s.w, s.h, level);
        px_destroy_blur();
        return as_bytes(out);
      });
      ASSERT_EQ(preview.fast, preview.plain) << s.w << "x" << s.h << " level " << level;
    }
    // Tilt-shift: bands in the middle, at the top edge, wider than the picture.
    for (const std::pair<int, int>& cb : {std::pair{s.h / 2, s.h / 8}, {0, 1}, {s.h - 1, s.h * 2}}) {
      const int centre = cb.first, band = cb.second;
      const Both tilt = both_paths([&] {
        std::vector<int> out(n, 1);
        EXPECT_EQ(px_apply_tiltshift(in.data(), out.data(), s.w, s.h, centre, band), 40960);
        return as_bytes(out);
      });
      ASSERT_EQ(tilt.fast, tilt.plain) << s.w << "x" << s.h << " centre " << centre;
    }
  }
}

TEST(NeighbourhoodPaths, SoftGlowAndSharpenMatchThePlainPath) {
  // Heights and widths around 32 and 64 change the glow radius (side / 32).
  const Size sizes[] = {{1, 1}, {1, 90}, {90, 1}, {31, 33}, {64, 65}, {127, 300}, {301, 95}, {333, 520}};
  unsigned seed = 51;
  for (const Size& s : sizes) {
    const size_t n = static_cast<size_t>(s.w) * s.h;
    const std::vector<int> in = random_argb(n, seed++);
    const Both glow = both_paths([&] {
      std::vector<int> src = in, out(n, 3);
      px_softglow(src.data(), out.data(), s.w, s.h);
      EXPECT_EQ(src, in);
      return as_bytes(out);
    });
    ASSERT_EQ(glow.fast, glow.plain) << s.w << "x" << s.h;
    const Both glow_in_place = both_paths([&] {
      std::vector<int> pic = in;
      px_softglow(pic.data(), pic.data(), s.w, s.h);
      return as_bytes(pic);
    });
    ASSERT_EQ(glow_in_place.fast, glow.plain) << s.w << "x" << s.h;
    ASSERT_EQ(glow_in_place.plain, glow.plain);
    std::vector<unsigned char> mask(n);
    for (size_t i = 0; i < n; ++i) mask[i] = static_cast<unsigned char>(i % 3);
    const Both sharp = both_paths([&] {
      std::vector<int> out(n, 3), pic = in;
      px_apply_sharpen_all(pic.data(), out.data(), s.w, s.h);
      std::vector<int> part(n, 4), inplace = in;
      std::vector<unsigned char> m = mask;
      px_apply_sharpen(pic.data(), m.data(), part.data(), s.w, s.h, 0, s.w - 1, 0, s.h - 1);
      px_apply_sharpen_all(inplace.data(), inplace.data(), s.w, s.h);
      out.insert(out.end(), part.begin(), part.end());
      out.insert(out.end(), inplace.begin(), inplace.end());
      return as_bytes(out);
    });
    ASSERT_EQ(sharp.fast, sharp.plain) << s.w << "x" << s.h;
  }
}
