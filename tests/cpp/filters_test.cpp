// Filters: texture overlays, tone-curve looks and shader-style effects.
// Golden values are worked out by hand from the rules.
#include <gtest/gtest.h>

#include <cstdint>
#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "effect/kalo/iel/iel.h"
#include "effect/px_color/px_hue.h"
#include "effect/px_color/px_tone.h"
#include "effect/px_filter/px_filter.h"
#include "effect/px_gpu_effects/px_gpu_effects.h"
#include "log_capture.h"

namespace {

using Pic = std::vector<int>;

Pic random_picture(int w, int h, unsigned seed, bool opaque = true) {
  std::mt19937 rng(seed);
  Pic p(static_cast<size_t>(w) * h);
  for (int& v : p) v = static_cast<int>(opaque ? (rng() | 0xFF000000u) : rng());
  return p;
}

int rgb(int r, int g, int b, uint32_t alpha = 0xFF) {
  return static_cast<int>(alpha << 24 | static_cast<uint32_t>(r) << 16 | static_cast<uint32_t>(g) << 8 |
                          static_cast<uint32_t>(b));
}
int red(int p) { return (p >> 16) & 255; }
int green(int p) { return (p >> 8) & 255; }
int blue(int p) { return p & 255; }
uint32_t alpha(int p) { return static_cast<uint32_t>(p) >> 24; }

// ---- blends -----------------------------------------------------------------

TEST(FilterBlend, ScreenDividesBy256AndClearsTransparentPixels) {
  int image[4] = {rgb(0, 0, 0), rgb(255, 255, 255, 0x40), rgb(100, 200, 50, 0), rgb(128, 0, 255)};
  int tex[4] = {rgb(0, 0, 0), rgb(0, 0, 0), rgb(255, 255, 255), rgb(128, 255, 0, 0)};
  int out[4];
  px_blend_texture_with_screen(image, out, tex, 4, 1);
  EXPECT_EQ(out[0], rgb(1, 1, 1));               // 255 - (255 * 255 >> 8) = 1
  EXPECT_EQ(out[1], rgb(255, 255, 255, 0x40));   // white stays white, image alpha kept
  EXPECT_EQ(out[2], 0);                          // image alpha 0: the word 0
  // 255 - (127 * 127 >> 8) = 192; 255 - (255 * 0 >> 8) = 255; 255 - (0 * 255 >> 8) = 255
  EXPECT_EQ(out[3], rgb(192, 255, 255));
}

TEST(FilterBlend, OverlayMixesByTextureAlphaInXorForm) {
  int image[4] = {rgb(100, 200, 0, 0), rgb(200, 100, 0), rgb(200, 100, 0), rgb(100, 0, 0, 0x80)};
  int tex[4] = {rgb(255, 255, 255), rgb(0, 0, 0, 0), rgb(128, 128, 128), rgb(128, 0, 0)};
  int out[4];
  px_blend_texture_with_overlay(image, out, tex, 4, 1);
  EXPECT_EQ(out[0], 0);  // image alpha 0
  // Texture alpha 0 over an opaque image: c * (0 ^ 255) >> 8.
  EXPECT_EQ(out[1], rgb(199, 99, 0));
  // Opaque texture 128: o = 255 - (127 * 55 >> 7) = 201 for 200; o = 128 * 100 >> 7 = 100.
  // Result (255 * o + c * 0) >> 8.
  EXPECT_EQ(out[2], rgb(200, 99, 0));
  // Image alpha 0x80, texture alpha 0xFF: picture weight 0xFF ^ 0x80 = 127.
  // o = 128 * 100 >> 7 = 100; (255 * 100 + 100 * 127) >> 8 = 149.
  EXPECT_EQ(red(out[3]), 149);
  EXPECT_EQ(alpha(out[3]), 0x80u);
}

// ---- texture chains -------------------------------------------------------------

TEST(FilterTexture, ChainsRunTheirAdjustmentsInOrder) {
  const int w = 9, h = 7;
  Pic in = random_picture(w, h, 3), tex = random_picture(w, h, 4), tex2 = random_picture(w, h, 5, false);
  Pic got(in.size()), want(in.size());

  px_apply_lightstreak_texture(in.data(), got.data(), tex.data(), w, h);
  px_control_contrast_all(in.data(), want.data(), w, h, 12);
  px_control_exposure_all(want.data(), want.data(), w, h, 8);
  px_control_saturation_all(want.data(), want.data(), w, h, 9);
  px_blend_texture_with_screen(want.data(), want.data(), tex.data(), w, h);
  EXPECT_EQ(got, want);

  px_apply_dawncast_texture(in.data(), got.data(), tex2.data(), tex.data(), w, h);
  px_control_brightness_all(in.data(), want.data(), w, h, 9);
  px_control_contrast_all(want.data(), want.data(), w, h, 13);
  px_control_exposure_all(want.data(), want.data(), w, h, 8);
  px_adjust_RGB_all(want.data(), want.data(), w, h, 11, 10, 10);
  px_control_saturation_all(want.data(), want.data(), w, h, 9);
  px_blend_texture_with_screen(want.data(), want.data(), tex.data(), w, h);
  px_blend_texture_with_overlay(want.data(), want.data(), tex2.data(), w, h);
  EXPECT_EQ(got, want);

  px_apply_stardust_texture(in.data(), got.data(), tex.data(), w, h);
  px_control_exposure_all(in.data(), want.data(), w, h, 9);
  px_control_contrast_all(want.data(), want.data(), w, h, 12);
  px_adjust_RGB_all(want.data(), want.data(), w, h, 12, 10, 10);
  px_control_brightness_all(want.data(), want.data(), w, h, 11);
  px_control_saturation_all(want.data(), want.data(), w, h, 9);
  px_blend_texture_with_screen(want.data(), want.data(), tex.data(), w, h);
  EXPECT_EQ(got, want);

  // The five light filters are five different looks.
  Pic a(in.size()), b(in.size()), c(in.size());
  px_apply_sunburst_texture(in.data(), a.data(), tex.data(), w, h);
  px_apply_lightflare_texture(in.data(), b.data(), tex.data(), w, h);
  px_apply_lightstreak_texture(in.data(), c.data(), tex.data(), w, h);
  EXPECT_NE(a, b);
  EXPECT_NE(a, c);
  EXPECT_NE(b, c);
}

TEST(FilterTexture, OldPhotoMixesThreeToOneAndKeepsTheTransparentQuirk) {
  const int w = 4, h = 3;
  Pic in = random_picture(w, h, 8), tex = random_picture(w, h, 9, false);
  in[5] = 0x00123456;  // transparent pixel
  Pic got(in.size()), want(in.size());
  px_apply_oldphoto_texture(in.data(), got.data(), tex.data(), w, h);
  px_change_colortone(in.data(), want.data(), w, h, 14);
  for (size_t i = 0; i < want.size(); ++i) {
    const int p = want[i], t = tex[i];
    want[i] = alpha(p) == 0 ? static_cast<int>(static_cast<uint32_t>(t) >> 24)
                            : rgb((3 * red(p) + red(t)) >> 2, (3 * green(p) + green(t)) >> 2,
                                  (3 * blue(p) + blue(t)) >> 2, alpha(p));
  }
  px_control_contrast_all(want.data(), want.data(), w, h, 9);
  EXPECT_EQ(got, want);
  // The transparent pixel became the texture's alpha in the lowest byte
  // (then contrast, which keeps alpha 0).
  EXPECT_EQ(alpha(got[5]), 0u);
}

// ---- partial rule ------------------------------------------------------------------

TEST(FilterPartial, EmptyRectangleCoversAllAndOnlyMaskByteOneSelects) {
  const int w = 6, h = 5;
  Pic in = random_picture(w, h, 12), tex = random_picture(w, h, 13);
  Pic whole(in.size());
  px_apply_sunburst_texture(in.data(), whole.data(), tex.data(), w, h);
  std::vector<unsigned char> mask(in.size(), 0);

  Pic out(in.size(), 0x5A5A5A5A);
  px_apply_sunburst_texture_partial(in.data(), out.data(), tex.data(), mask.data(), w, h, 5, 4, 0, 4);
  EXPECT_EQ(out, whole);

  mask[1 * w + 1] = 1;
  mask[1 * w + 2] = 2;
  mask[4 * w + 5] = 1;  // selected but outside the rectangle
  std::fill(out.begin(), out.end(), 0x5A5A5A5A);
  px_apply_sunburst_texture_partial(in.data(), out.data(), tex.data(), mask.data(), w, h, 0, 3, 0, 2);
  for (int i = 0; i < w * h; ++i) {
    EXPECT_EQ(out[i], i == 1 * w + 1 ? whole[i] : 0x5A5A5A5A) << i;
  }

  // Tone looks follow the same rule (bottom < top: whole picture).
  Pic retro(in.size());
  px_apply_retro(in.data(), retro.data(), w, h);
  std::fill(out.begin(), out.end(), 0);
  px_apply_retro_partial(in.data(), mask.data(), out.data(), w, h, 0, 5, 3, 2);
  EXPECT_EQ(out, retro);
  std::fill(out.begin(), out.end(), 0);
  px_apply_retro_partial(in.data(), mask.data(), out.data(), w, h, 2, 2, 1, 1);  // mask byte 2
  EXPECT_EQ(out, Pic(in.size(), 0));
}

// ---- gamma, greyscale, vignette -------------------------------------------------------

TEST(FilterTone, GammaTable) {
  uint8_t t[256];
  px_make_gamma_table(1.0, t);
  for (int i = 0; i < 256; ++i) EXPECT_EQ(t[i], i);
  px_make_gamma_table(2.35, t);
  EXPECT_EQ(t[128], 190);
  EXPECT_EQ(t[0], 0);
  EXPECT_EQ(t[255], 255);

  int p[2] = {rgb(128, 128, 128, 0x33), rgb(10, 128, 250)};
  int o[2];
  control_gamma(p, o, 2, 1, 2, 2.35);  // green only
  EXPECT_EQ(o[0], rgb(128, 190, 128, 0x33));
  control_gamma(p, o, 2, 1, 0, 2.35);
  EXPECT_EQ(o[0], rgb(190, 190, 190, 0x33));
}

TEST(FilterTone, GreyscaleWeighsGreenTwice) {
  int p[3] = {rgb(255, 0, 0, 0x12), rgb(0, 255, 0), rgb(255, 255, 255)};
  int o[3];
  px_apply_greyscale_all(p, o, 3, 1);
  EXPECT_EQ(o[0], rgb(63, 63, 63, 0x12));
  EXPECT_EQ(o[1], rgb(127, 127, 127));
  EXPECT_EQ(o[2], rgb(255, 255, 255));
}

TEST(FilterTone, VignetteDepthIsSevenSixteenths) {
  const int w = 16, h = 12;
  Pic in(static_cast<size_t>(w) * h, rgb(255, 255, 255, 0x77)), out(in.size());
  px_apply_vignette(in.data(), out.data(), w, h);
  EXPECT_EQ(out[6 * w + 8], rgb(255, 255, 255, 0x77));  // centre (hx, hy): factor one
  EXPECT_EQ(blue(out[6 * w + 0]), 143);                  // middle of the left edge: 255 * 9 / 16
  EXPECT_EQ(red(out[0 * w + 8]), 143);                   // middle of the top edge
  EXPECT_EQ(green(out[0]), 31);                          // corner: 255 / 8
  EXPECT_EQ(alpha(out[0]), 0x77u);
}

TEST(FilterTone, VintagePreviewMatchesVintageWhereTheVignetteIsNeutral) {
  const int w = 10, h = 8;
  Pic in = random_picture(w, h, 21), a(in.size()), b(in.size());
  px_apply_vintage(in.data(), a.data(), w, h);
  px_apply_vintage_prev(in.data(), b.data(), w, h);
  EXPECT_EQ(a[4 * w + 5], b[4 * w + 5]);
  EXPECT_NE(a[0], b[0]);
  // The vignette darkens the corners of the finished look.
  EXPECT_LE(red(a[0]), red(b[0]));
}

TEST(FilterTone, VintagePartialUsesTheEffectLibraryLook) {
  const int w = 7, h = 6;
  Pic in = random_picture(w, h, 22), look(in.size());
  structIELImage a{w, h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(in.data())};
  structIELImage b{w, h, IEL_FORMAT_ARGB_PACK, reinterpret_cast<unsigned char*>(look.data())};
  int32_t level = 0;
  structIELEffectParams params{IEL_EFFECT_VINTAGE, &level, nullptr, 0, 0};
  ASSERT_EQ(IEL_Apply_Effect(&a, &b, &params), 0);
  std::vector<unsigned char> mask(in.size(), 1);
  Pic out(in.size(), 7);
  px_apply_vintage_partial(in.data(), mask.data(), out.data(), w, h, 1, 2, 1, 1);
  for (int i = 0; i < w * h; ++i) EXPECT_EQ(out[i], (i == w + 1 || i == w + 2) ? look[i] : 7) << i;
}

// ---- sharpen ------------------------------------------------------------------------------

TEST(FilterSharpen, HorizontalOnlyWithEdgesCopied) {
  int in[6] = {rgb(10, 10, 10, 1), rgb(100, 0, 255, 2), rgb(10, 30, 0, 3),
               rgb(200, 200, 200), rgb(0, 0, 0), rgb(255, 255, 255)};
  int out[6];
  px_apply_sharpen_all(in, out, 3, 2);
  EXPECT_EQ(out[0], in[0]);
  EXPECT_EQ(out[2], in[2]);
  // 2 * 100 - 10 = 190; 2 * 0 - 20 -> 0; 2 * 255 - 5 -> 255; alpha kept.
  EXPECT_EQ(out[1], rgb(190, 0, 255, 2));
  EXPECT_EQ(out[4], rgb(0, 0, 0));  // 0 - 227 clamps; the row above plays no part
}

TEST(FilterSharpen, MaskedFormRewritesTheMaskForAnEmptyRectangle) {
  const int w = 5, h = 3;
  Pic in = random_picture(w, h, 30), all(in.size()), out(in.size());
  px_apply_sharpen_all(in.data(), all.data(), w, h);

  std::vector<unsigned char> mask(in.size(), 0);
  mask[2] = 1;
  px_apply_sharpen(in.data(), mask.data(), out.data(), w, h, 1, 0, 0, 2);
  EXPECT_EQ(out, all);
  EXPECT_EQ(mask, std::vector<unsigned char>(in.size(), 0));

  // A non-empty rectangle only switches the rewriting off: mask bytes of 1
  // outside it are sharpened too; other bytes copy the input.
  mask[2] = 1;
  mask[w + 3] = 1;
  mask[w + 1] = 2;
  px_apply_sharpen(in.data(), mask.data(), out.data(), w, h, 0, 1, 0, 0);
  for (int i = 0; i < w * h; ++i) EXPECT_EQ(out[i], (i == 2 || i == w + 3) ? all[i] : in[i]) << i;
  EXPECT_EQ(mask[2], 1);
}

// ---- designed looks ------------------------------------------------------------------------

TEST(FilterLooks, OldPhotoIsAFadedSepiaPrint) {
  EXPECT_EQ(px_get_sepia_r(128), 159);
  EXPECT_EQ(px_get_sepia_b(128), 97);
  EXPECT_EQ(px_get_sepia_r(0), 0);
  EXPECT_EQ(px_get_sepia_b(255), 255);
  int p[2] = {rgb(255, 255, 255, 0x21), rgb(0, 0, 0)};
  int o[2];
  px_apply_oldphoto(p, o, 2, 1);
  EXPECT_EQ(o[0], rgb(237, 224, 211, 0x21));  // 224 toned: +-(224 * 31 >> 9) = 13
  EXPECT_EQ(o[1], rgb(29, 20, 11));           // 20 toned: +-(20 * 235 >> 9) = 9 -> r 29, b 11
}

TEST(FilterLooks, DownlightFallsFromTopToBottom) {
  Pic in(3 * 3, rgb(100, 200, 250, 0x44)), out(in.size());
  px_apply_downlight(in.data(), out.data(), 3, 3);
  EXPECT_EQ(out[0], rgb(115, 231, 255, 0x44));  // * 296 / 256
  EXPECT_EQ(out[3], rgb(84, 168, 210, 0x44));   // * 216 / 256
  EXPECT_EQ(out[6], rgb(53, 106, 132, 0x44));   // * 136 / 256
}

TEST(FilterLooks, PopArtUsesFourInks) {
  int p[4] = {rgb(0, 0, 0, 0x10), rgb(90, 90, 90), rgb(170, 170, 170), rgb(255, 255, 255)};
  int o[4];
  px_apply_popart_prev(p, o, 4, 1);
  EXPECT_EQ(o[0], static_cast<int>(0x101A237Eu));
  EXPECT_EQ(o[1], static_cast<int>(0xFFE6287Fu));
  EXPECT_EQ(o[2], static_cast<int>(0xFFFF9A1Eu));
  EXPECT_EQ(o[3], static_cast<int>(0xFFFFEB50u));
  px_apply_popart(p, o, 4, 1);
  EXPECT_EQ(o[3], static_cast<int>(0xFFFFEB50u));
}

TEST(FilterLooks, SoftGlowBrightensMidTonesOfAFlatPicture) {
  Pic in(20 * 10, rgb(128, 0, 255, 0x30)), out(in.size());
  px_softglow(in.data(), out.data(), 20, 10);
  // g' = 128 * 128 / 255 = 64; 255 - 127 * 191 / 255 = 160; black and white stay.
  for (int p : out) EXPECT_EQ(p, rgb(160, 0, 255, 0x30));
}

TEST(FilterLooks, DesignedLooksAreDeterministicAndDistinct) {
  const int w = 33, h = 21;
  Pic in = random_picture(w, h, 40);
  using Fn = void (*)(int*, int*, int, int);
  const Fn looks[] = {px_apply_oldphoto, px_apply_downlight, px_apply_popart, px_softglow, px_apply_vintage_prev};
  std::vector<Pic> results;
  for (Fn f : looks) {
    Pic a(in.size()), b(in.size());
    f(in.data(), a.data(), w, h);
    f(in.data(), b.data(), w, h);
    EXPECT_EQ(a, b);
    for (size_t i = 0; i < a.size(); ++i) ASSERT_EQ(alpha(a[i]), alpha(in[i]));
    for (const Pic& r : results) EXPECT_NE(a, r);
    results.push_back(a);
  }
}

// ---- shader-style effects ------------------------------------------------------------------

TEST(GpuHelpers, AsStated) {
  EXPECT_EQ(clamp(std::nanf(""), 0.0f, 1.0f), 0.0f);
  EXPECT_EQ(clamp(2.0f, 0.0f, 1.0f), 1.0f);
  EXPECT_EQ(clamp(-2.0f, 0.0f, 1.0f), 0.0f);
  EXPECT_DOUBLE_EQ(smoothstep(0.0, 1.0, 0.5), 0.5);
  EXPECT_DOUBLE_EQ(smoothstep(0.0, 1.0, 2.0), 1.0);
  EXPECT_DOUBLE_EQ(smoothstep(1.0, 0.0, 0.25), 0.84375);  // reversed edges: t = 0.75
  EXPECT_EQ(step(0.5, 0.49), 0.0);
  EXPECT_EQ(step(0.5, 0.5), 1.0);
  EXPECT_DOUBLE_EQ(length(3.0, 4.0), 5.0);
  EXPECT_DOUBLE_EQ(flength(3.0f, 4.0f), 5.0);
}

TEST(GpuEffects, TurquoiseOfBlackAndWhite) {
  int p[2] = {rgb(0, 0, 0, 0x12), rgb(255, 255, 255, 0)};
  int o[2];
  gpu_Turquoise(p, o, 2, 1);
  EXPECT_EQ(o[0], rgb(19, 29, 51, 0x12));
  EXPECT_EQ(o[1], rgb(198, 207, 230, 0));
}

TEST(GpuEffects, PartialWritesOnlySelectedPixels) {
  const int w = 5, h = 4;
  Pic in = random_picture(w, h, 50), whole(in.size());
  gpu_Turquoise(in.data(), whole.data(), w, h);
  std::vector<unsigned char> mask(in.size(), 1);
  Pic out(in.size(), 3);
  gpu_Turquoise_partial(in.data(), mask.data(), out.data(), w, h, 0, -1, 0, 0);  // empty rectangle
  EXPECT_EQ(out, whole);

  mask[w + 2] = 2;
  std::fill(out.begin(), out.end(), 3);
  gpu_vignette_partial(in.data(), mask.data(), out.data(), w, h, 2, 2, 1, 1);  // one pixel, byte 2
  EXPECT_EQ(out, Pic(in.size(), 3));

  Pic grain = random_picture(w, h, 51), rugged(in.size());
  gpu_rugged(in.data(), rugged.data(), grain.data(), w, h);
  gpu_rugged_partial(in.data(), mask.data(), out.data(), grain.data(), w, h, 1, 3, 0, 1);
  for (int i = 0; i < w * h; ++i) {
    const bool sel = i % w >= 1 && i % w <= 3 && i / w <= 1 && i != w + 2;
    EXPECT_EQ(out[i], sel ? rugged[i] : 3) << i;
  }
}

TEST(GpuEffects, VignetteDarkensCornersNotTheCentre) {
  const int w = 21, h = 11;
  Pic in(static_cast<size_t>(w) * h, rgb(200, 100, 50, 0x66)), out(in.size()), noir(in.size());
  gpu_vignette(in.data(), out.data(), w, h);
  EXPECT_EQ(out[5 * w + 10], in[5 * w + 10]);
  EXPECT_EQ(out[0], rgb(60, 30, 15, 0x66));  // 0.3 in the corners
  gpu_gothicnoir(in.data(), noir.data(), w, h);
  EXPECT_LT(red(noir[0]), red(noir[5 * w + 10]));
}

TEST(GpuEffects, DesignedLooksAreDeterministicDistinctAndKeepAlpha) {
  const int w = 40, h = 30;
  Pic in = random_picture(w, h, 60, false);
  Pic t1 = random_picture(w, h, 61), t2 = random_picture(w, h, 62), t3 = random_picture(w, h, 63);
  auto runs = [&](Pic& o) {
    std::vector<Pic> r;
    gpu_rainbow(in.data(), o.data(), w, h), r.push_back(o);
    gpu_gothicnoir(in.data(), o.data(), w, h), r.push_back(o);
    gpu_vignette(in.data(), o.data(), w, h), r.push_back(o);
    gpu_rugged(in.data(), o.data(), t1.data(), w, h), r.push_back(o);
    gpu_oilPastel(in.data(), o.data(), t1.data(), w, h), r.push_back(o);
    gpu_noirNote(in.data(), o.data(), t1.data(), w, h), r.push_back(o);
    gpu_impressionist(in.data(), o.data(), t1.data(), t2.data(), w, h), r.push_back(o);
    gpu_stucchevole(in.data(), o.data(), t1.data(), t2.data(), t3.data(), w, h), r.push_back(o);
    return r;
  };
  Pic o(in.size());
  const std::vector<Pic> a = runs(o), b = runs(o);
  EXPECT_EQ(a, b);
  for (size_t k = 0; k < a.size(); ++k) {
    for (size_t i = 0; i < in.size(); ++i) ASSERT_EQ(alpha(a[k][i]), alpha(in[i])) << k;
    for (size_t j = 0; j < k; ++j) EXPECT_NE(a[k], a[j]) << k << " " << j;
  }
  // The textures are taken in their documented order.
  Pic x(in.size()), y(in.size());
  gpu_impressionist(in.data(), x.data(), t1.data(), t2.data(), w, h);
  gpu_impressionist(in.data(), y.data(), t2.data(), t1.data(), w, h);
  EXPECT_NE(x, y);
}

}  // namespace
