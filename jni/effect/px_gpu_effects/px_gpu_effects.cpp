// Shader-style effects. Channel values are read as doubles in 0..1, worked
// on with the helpers below, and written back as clamp(v * 255, 0, 255)
// truncated; alpha is taken from the pixel being recoloured.
#include "px_gpu_effects.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "../kalo/if_utils_and.h"
#include "../kalo/px_parallel.h"
#include "../px_color/px_region.h"
#include "../px_types.h"

// ---- helpers ---------------------------------------------------------------

float clamp(float a, float lo, float hi) {
  const float m = a > lo ? a : lo;
  return m < hi ? m : hi;
}

double smoothstep(double e0, double e1, double x) {
  const double t = clamp(static_cast<float>((x - e0) / (e1 - e0)), 0.0f, 1.0f);
  return t * t * (3.0 - 2.0 * t);
}

double step(double edge, double x) { return x < edge ? 0.0 : 1.0; }

double length(double x, double y) { return std::sqrt(x * x + y * y); }

double flength(float x, float y) {
  const double dx = x, dy = y;
  return std::sqrt(dx * dx + dy * dy);
}

namespace {

// Truncation with saturation at the 32-bit limits (NaN gives 0).
int32_t to_int(double v) {
  if (!(v == v)) return 0;
  if (v >= 2147483647.0) return INT32_MAX;
  if (v <= -2147483648.0) return INT32_MIN;
  return static_cast<int32_t>(v);
}

struct Col {
  double r, g, b;
};

Col read(uint32_t p) {
  return {((p >> 16) & 255) / 255.0, ((p >> 8) & 255) / 255.0, (p & 255) / 255.0};
}

uint32_t channel(double v) { return static_cast<uint32_t>(to_int(clamp(static_cast<float>(v * 255.0), 0.0f, 255.0f))); }

uint32_t write(uint32_t alpha_source, Col c) {
  return (alpha_source & 0xFF000000u) | channel(c.r) << 16 | channel(c.g) << 8 | channel(c.b);
}

double luma(Col c) { return 0.299 * c.r + 0.587 * c.g + 0.114 * c.b; }
Col mix(Col a, Col b, double t) { return {a.r + (b.r - a.r) * t, a.g + (b.g - a.g) * t, a.b + (b.b - a.b) * t}; }
Col grey(double v) { return {v, v, v}; }
double overlay(double c, double t) { return c < 0.5 ? 2.0 * c * t : 1.0 - 2.0 * (1.0 - c) * (1.0 - t); }
Col saturate(Col c, double s) { return mix(grey(luma(c)), c, s); }

// Calls fn(x, y, i) for every pixel, in row bands.
template <class Fn>
void each_pixel(int width, int height, Fn fn) {
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      for (int x = 0; x < width; ++x) fn(x, y, static_cast<size_t>(y) * w + static_cast<size_t>(x));
    }
  });
}

bool usable(const int* in, const int* out, int width, int height) {
  return in && out && width > 0 && height > 0;
}

// A pixel of `p` at (x, y) with the coordinates clamped into the picture.
uint32_t at(const int* p, int width, int height, int x, int y) {
  x = x < 0 ? 0 : (x >= width ? width - 1 : x);
  y = y < 0 ? 0 : (y >= height ? height - 1 : y);
  return static_cast<uint32_t>(p[static_cast<size_t>(y) * static_cast<size_t>(width) + static_cast<size_t>(x)]);
}

// ---- the looks (true when the output was written) ----------------------------

bool turquoise(int* in, int* out, int width, int height) {
  if (!usable(in, out, width, height)) return false;
  each_pixel(width, height, [&](int, int, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    const uint32_t r = static_cast<uint32_t>(to_int(0.7 * ((p >> 16) & 255) + 19.8)) & 255u;
    const uint32_t g = static_cast<uint32_t>(to_int(0.7 * ((p >> 8) & 255) + 29.1)) & 255u;
    const uint32_t b = static_cast<uint32_t>(to_int(0.7 * (p & 255) + 51.9)) & 255u;
    out[i] = static_cast<int>((p & 0xFF000000u) | r << 16 | g << 8 | b);
  });
  return true;
}

// Rainbow: a diagonal rainbow laid over the picture like light through a
// prism. The rainbow colour at t = (x + y) / (width + height - 2) is
// 0.5 + 0.5 cos(2 pi (t + k / 3)) for k = 0, 1, 2 (red, green, blue), kept
// in a table of width + height entries (the working memory). The tint
// strength s = 0.5 smoothstep(0, 0.35, l) (1 - 0.5 smoothstep(0.75, 1, l))
// spares deep shadows and half spares highlights; the pixel becomes
// mix(c, rainbow (0.35 + 0.85 l), s).
bool rainbow(int* in, int* out, int width, int height) {
  if (!usable(in, out, width, height)) return false;
  const int n = width + height;
  auto* table = static_cast<Col*>(IF_CALLOC(static_cast<int>(sizeof(Col)), n));
  if (!table) {
    IF_ERROR("Rainbow effect: Low memory\n");
    return false;
  }
  const double span = n > 2 ? n - 2 : 1;
  const double two_pi = 6.283185307179586;
  for (int k = 0; k < n; ++k) {
    const double t = k / span;
    table[k] = {0.5 + 0.5 * std::cos(two_pi * t), 0.5 + 0.5 * std::cos(two_pi * (t + 1.0 / 3.0)),
                0.5 + 0.5 * std::cos(two_pi * (t + 2.0 / 3.0))};
  }
  each_pixel(width, height, [&](int x, int y, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    const Col c = read(p);
    const double l = luma(c);
    const double s = 0.5 * smoothstep(0.0, 0.35, l) * (1.0 - 0.5 * smoothstep(0.75, 1.0, l));
    const Col bow = table[x + y];
    const double lift = 0.35 + 0.85 * l;
    out[i] = static_cast<int>(write(p, mix(c, {bow.r * lift, bow.g * lift, bow.b * lift}, s)));
  });
  IF_FREE(table);
  return true;
}

// Squared distances of each column from the centre on a -1..1 scale: the
// working memory of the two framed looks.
double* column_distances(int width) {
  auto* dx2 = static_cast<double*>(IF_CALLOC(static_cast<int>(sizeof(double)), width));
  if (!dx2) return nullptr;
  for (int x = 0; x < width; ++x) {
    const double u = width > 1 ? 2.0 * x / (width - 1) - 1.0 : 0.0;
    dx2[x] = u * u;
  }
  return dx2;
}

double row_distance(int y, int height) { return height > 1 ? 2.0 * y / (height - 1) - 1.0 : 0.0; }

// Gothic noir: a hard, cold black-and-white of a horror still where only
// strong reds survive, as dark blood crimson. v = smoothstep(0.12, 0.78, l)
// crushes the shadows and burns the highlights; the grey is tinted cold
// (0.92 v, 0.95 v, v). Redness rd = smoothstep(0.25, 0.45, r - max(g, b))
// step(0.35, r) (true reds only: skin and orange stay grey) mixes in the crimson (0.15 + 0.75 r, 0.02, 0.06). A heavy frame darkens by
// 1 - 0.7 smoothstep(0.5, 1.35, length(u, v)) on the -1..1 scale.
//
// The fast path does the same arithmetic with less of it: channel / 255 and
// each column's distance from a table, the redness only where step(0.35, r)
// lets it count (elsewhere rd = 0 and the mix gives the grey exactly), and
// no frame where length^2 <= 0.25 (there the smoothstep is 0 and the frame
// exactly 1), and the luma and redness smoothsteps multiply by the inverse
// of their span (the same floats for every colour; the frame's keeps its
// division, as its inputs depend on the picture's size). `dx2` becomes the
// column distances.
// smoothstep and the channel write of the helpers above, in forms the
// compiler inlines into the pixel loop (the same operations).
inline double smoothstep_inline(double e0, double e1, double x) {
  const float a = static_cast<float>((x - e0) / (e1 - e0));
  const float m = a > 0.0f ? a : 0.0f;
  const double t = m < 1.0f ? m : 1.0f;
  return t * t * (3.0 - 2.0 * t);
}
inline uint32_t channel_inline(double v) {
  const float a = static_cast<float>(v * 255.0);
  const float m = a > 0.0f ? a : 0.0f;  // NaN gives 0
  return static_cast<uint32_t>(static_cast<int32_t>(m < 255.0f ? m : 255.0f));
}

// In short runs of a row, two loops: the channels / 255 from the table and
// the frame (a square root, only outside the inner circle; 1 inside, where
// the product leaves every value as it is) one pixel at a time, then the
// colour arithmetic, both cases of the redness computed and selected rather
// than branched, which vectorises. The
// larger of green and blue by a comparison (the same value as fmax for these
// channels: no NaN, no negative zero).
void gothicnoir_fast(const int* in, int* out, int width, int height, double* dx2) {
  double unit[256];
  for (int i = 0; i < 256; ++i) unit[i] = static_cast<uint32_t>(i) / 255.0;
  for (int x = 0; x < width; ++x) dx2[x] = std::sqrt(dx2[x]);
  const double* dx = dx2;
  const size_t w = static_cast<size_t>(width);
  const auto* src = reinterpret_cast<const uint32_t*>(in);
  auto* dst = reinterpret_cast<uint32_t*>(out);
  px_for_rows(height, [&](int y0, int y1) {
    constexpr int kRun = 128;
    double cr[kRun], cg[kRun], cb[kRun], frame[kRun];
    const double* u = unit;
    const double* dxs = dx;
    for (int y = y0; y < y1; ++y) {
      const double dy = row_distance(y, height);
      const size_t row = static_cast<size_t>(y) * w;
      for (int x0 = 0; x0 < width; x0 += kRun) {
        const int n = width - x0 < kRun ? width - x0 : kRun;
        const uint32_t* s = src + row + static_cast<size_t>(x0);
        uint32_t* d = dst + row + static_cast<size_t>(x0);
        for (int j = 0; j < n; ++j) {
          const uint32_t p = s[j];
          cr[j] = u[(p >> 16) & 255];
          cg[j] = u[(p >> 8) & 255];
          cb[j] = u[p & 255];
          const double d2 = dxs[x0 + j] * dxs[x0 + j] + dy * dy;
          frame[j] = d2 > 0.25 ? 1.0 - 0.7 * smoothstep_inline(0.5, 1.35, std::sqrt(d2)) : 1.0;
        }
        for (int j = 0; j < n; ++j) {
          const double r = cr[j], g = cg[j], b = cb[j];
          const double v = smoothstep_by_inverse(0.12, kNoirLumaInverse, luma({r, g, b}));
          const Col o{0.92 * v, 0.95 * v, v};
          const double rd = smoothstep_by_inverse(0.25, kNoirRednessInverse, r - (g > b ? g : b));
          const Col m = mix(o, {0.15 + 0.75 * r, 0.02, 0.06}, rd);
          const bool red = r >= 0.35;
          const Col t{red ? m.r : o.r, red ? m.g : o.g, red ? m.b : o.b};
          const double f = frame[j];
          const Col e{t.r * f, t.g * f, t.b * f};
          d[j] = (s[j] & 0xFF000000u) | channel_inline(e.r) << 16 | channel_inline(e.g) << 8 | channel_inline(e.b);
        }
      }
    }
  });
}

bool gothicnoir(int* in, int* out, int width, int height) {
  if (!usable(in, out, width, height)) return false;
  double* dx2 = column_distances(width);
  if (!dx2) {
    IF_ERROR("GothicNoir effect: Low memory\n");
    return false;
  }
  if (!px_scalar_only()) {
    gothicnoir_fast(in, out, width, height, dx2);
    IF_FREE(dx2);
    return true;
  }
  each_pixel(width, height, [&](int x, int y, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    const Col c = read(p);
    const double v = smoothstep(0.12, 0.78, luma(c));
    const double rd = smoothstep(0.25, 0.45, c.r - std::fmax(c.g, c.b)) * step(0.35, c.r);
    Col o = mix({0.92 * v, 0.95 * v, v}, {0.15 + 0.75 * c.r, 0.02, 0.06}, rd);
    const double dy = row_distance(y, height);
    const double frame = 1.0 - 0.7 * smoothstep(0.5, 1.35, length(std::sqrt(dx2[x]), dy));
    o = {o.r * frame, o.g * frame, o.b * frame};
    out[i] = static_cast<int>(write(p, o));
  });
  IF_FREE(dx2);
  return true;
}

// Vignette: the soft, round darkening of an old lens, colours untouched in
// the middle. d = length(u, v) / sqrt(2) on the -1..1 scale (0 at the
// centre, 1 in the corners); the picture is scaled by
// 0.3 + 0.7 smoothstep(1.0, 0.45, d): full inside d = 0.45, 0.3 in the corners.
bool vignette(int* in, int* out, int width, int height) {
  if (!usable(in, out, width, height)) return false;
  double* dx2 = column_distances(width);
  if (!dx2) {
    IF_ERROR("vignette effect: Low memory\n");
    return false;
  }
  each_pixel(width, height, [&](int x, int y, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    const Col c = read(p);
    const double d = length(std::sqrt(dx2[x]), row_distance(y, height)) / 1.4142135623730951;
    const double f = 0.3 + 0.7 * smoothstep(1.0, 0.45, d);
    out[i] = static_cast<int>(write(p, {c.r * f, c.g * f, c.b * f}));
  });
  IF_FREE(dx2);
  return true;
}

// Rugged: weathered sandstone grit. Local contrast first: each channel moves
// 1.5 times its distance from the mean of the four neighbours (edges
// repeated); 45 % of the colour goes to grey; a sandstone tint (1.06, 0.98,
// 0.86) and smoothstep(0.05, 0.95, c) per channel harden it; finally the
// grain texture's luma g is overlaid at half strength: mix(c, overlay(c, g), 0.5).
bool rugged(int* in, int* out, int* grain, int width, int height) {
  if (!usable(in, out, width, height) || !grain) return false;
  each_pixel(width, height, [&](int x, int y, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    const Col c = read(p);
    const Col n[4] = {read(at(in, width, height, x - 1, y)), read(at(in, width, height, x + 1, y)),
                      read(at(in, width, height, x, y - 1)), read(at(in, width, height, x, y + 1))};
    const Col mean = {(n[0].r + n[1].r + n[2].r + n[3].r) / 4.0, (n[0].g + n[1].g + n[2].g + n[3].g) / 4.0,
                      (n[0].b + n[1].b + n[2].b + n[3].b) / 4.0};
    Col d = {c.r + 1.5 * (c.r - mean.r), c.g + 1.5 * (c.g - mean.g), c.b + 1.5 * (c.b - mean.b)};
    d = mix(d, grey(luma(d)), 0.45);
    d = {smoothstep(0.05, 0.95, d.r * 1.06), smoothstep(0.05, 0.95, d.g * 0.98), smoothstep(0.05, 0.95, d.b * 0.86)};
    const double g = luma(read(static_cast<uint32_t>(grain[i])));
    out[i] = static_cast<int>(write(p, mix(d, {overlay(d.r, g), overlay(d.g, g), overlay(d.b, g)}, 0.5)));
  });
  return true;
}

// Byte to unit values by table: kUnit[v] is v / 255.0, the very value
// `read` divides out, so the painterly looks below read their pixels
// without a division (the plain path, GLIMMER_SCALAR, still divides).
struct UnitTable {
  double v[256];
};
constexpr UnitTable make_unit_table() {
  UnitTable t{};
  for (int i = 0; i < 256; ++i) t.v[i] = i / 255.0;
  return t;
}
constexpr UnitTable kUnit = make_unit_table();

Col read_table(uint32_t p) { return {kUnit.v[(p >> 16) & 255], kUnit.v[(p >> 8) & 255], kUnit.v[p & 255]}; }

// The pixel reader of a run: by table on the fast path.
struct Reader {
  bool table = !px_scalar_only();
  Col operator()(uint32_t p) const { return table ? read_table(p) : read(p); }
};

// Oil pastel: waxy crayon on paper. The 3 x 3 mean (edges repeated) melts
// fine detail; saturation 1.35 brightens the wax; each channel is
// posterised softly to 5 bands (floor(5c) + smoothstep(0.35, 0.65, fract(5c)))
// / 5. Where the grain texture is dark (its luma g below about 0.5) the
// crayon skips over the paper's tooth: the paper (0.97, 0.95, 0.90) shows
// through by 0.55 (1 - smoothstep(0.40, 0.52, g)).
// clamp, smoothstep and the channel write of the helpers above for the
// painterly fast paths below, in forms the compiler inlines without
// branches: on x86 the clamp is MAXSS then MINSS, which compute exactly
// a > lo ? a : lo and m < hi ? m : hi (NaN gives lo, as above).
inline float clamp_sel(float a, float lo, float hi) {
#if defined(__SSE2__)
  return _mm_cvtss_f32(_mm_min_ss(_mm_max_ss(_mm_set_ss(a), _mm_set_ss(lo)), _mm_set_ss(hi)));
#else
  const float m = a > lo ? a : lo;
  return m < hi ? m : hi;
#endif
}
inline double smoothstep_sel(double e0, double e1, double x) {
  const double t = clamp_sel(static_cast<float>((x - e0) / (e1 - e0)), 0.0f, 1.0f);
  return t * t * (3.0 - 2.0 * t);
}
inline uint32_t channel_sel(double v) {
  return static_cast<uint32_t>(static_cast<int32_t>(clamp_sel(static_cast<float>(v * 255.0), 0.0f, 255.0f)));
}

// The fast path of oil pastel: the same arithmetic with the helpers inlined,
// inner pixels summed without clamping, and the grain's paper share, which
// depends on the grain pixel alone, computed per pixel as before.
// s is never negative, so truncation gives its floor.
inline double band_inline(double v) {
  const double s = clamp_sel(static_cast<float>(v), 0.0f, 1.0f) * 5.0;
  const double f = static_cast<double>(static_cast<int>(s));
  return (f + smoothstep_sel(0.35, 0.65, s - f)) / 5.0;
}

// Two neighbouring inner pixels of oil pastel at once, one in each lane of
// two-double vectors: every lane does the very operations of the one-pixel
// form above, in the same order (on SSE2 the float clamps and truncations
// are the packed forms of the same instructions).
typedef double f64x2 __attribute__((vector_size(16)));
inline f64x2 clamp_lanes(f64x2 v, float lo, float hi) {
#if defined(__SSE2__)
  const __m128 f = _mm_min_ps(_mm_max_ps(_mm_cvtpd_ps(reinterpret_cast<__m128d>(v)), _mm_set1_ps(lo)), _mm_set1_ps(hi));
  return reinterpret_cast<f64x2>(_mm_cvtps_pd(f));
#else
  return f64x2{clamp_sel(static_cast<float>(v[0]), lo, hi), clamp_sel(static_cast<float>(v[1]), lo, hi)};
#endif
}
// Truncation of values known to fit an int.
inline f64x2 trunc_lanes(f64x2 v) {
#if defined(__SSE2__)
  return reinterpret_cast<f64x2>(_mm_cvtepi32_pd(_mm_cvttpd_epi32(reinterpret_cast<__m128d>(v))));
#else
  return f64x2{static_cast<double>(static_cast<int>(v[0])), static_cast<double>(static_cast<int>(v[1]))};
#endif
}
inline f64x2 smooth_lanes(f64x2 quotient) {
  const f64x2 t = clamp_lanes(quotient, 0.0f, 1.0f);
  return t * t * (3.0 - 2.0 * t);
}
inline f64x2 band_lanes(f64x2 v) {
  const f64x2 s = clamp_lanes(v, 0.0f, 1.0f) * 5.0;
  const f64x2 f = trunc_lanes(s);
  return (f + smooth_lanes((s - f - 0.35) / (0.65 - 0.35))) / 5.0;
}
// channel_sel of both lanes (the clamped float is exact as a double).
inline void channel_lanes(f64x2 v, uint32_t* c) {
  const f64x2 m = clamp_lanes(v * 255.0, 0.0f, 255.0f);
  c[0] = static_cast<uint32_t>(static_cast<int32_t>(m[0]));
  c[1] = static_cast<uint32_t>(static_cast<int32_t>(m[1]));
}

void oil_pastel_pair(const int* in, int* out, const int* grain, size_t i, size_t w) {
  const double* u = kUnit.v;
  f64x2 mr{0, 0}, mg{0, 0}, mb{0, 0};
  for (int dy = -1; dy <= 1; ++dy) {
    const int* r = in + (i + dy * w);
    for (int dx = -1; dx <= 1; ++dx) {
      const uint32_t k0 = static_cast<uint32_t>(r[dx]), k1 = static_cast<uint32_t>(r[dx + 1]);
      mr += f64x2{u[(k0 >> 16) & 255], u[(k1 >> 16) & 255]};
      mg += f64x2{u[(k0 >> 8) & 255], u[(k1 >> 8) & 255]};
      mb += f64x2{u[k0 & 255], u[k1 & 255]};
    }
  }
  mr = mr / 9.0, mg = mg / 9.0, mb = mb / 9.0;
  // saturate(c, 1.35): mix(grey(luma(c)), c, 1.35)
  const f64x2 l = 0.299 * mr + 0.587 * mg + 0.114 * mb;
  const f64x2 br = band_lanes(l + (mr - l) * 1.35), bg = band_lanes(l + (mg - l) * 1.35),
              bb = band_lanes(l + (mb - l) * 1.35);
  const uint32_t g0 = static_cast<uint32_t>(grain[i]), g1 = static_cast<uint32_t>(grain[i + 1]);
  const f64x2 gr{u[(g0 >> 16) & 255], u[(g1 >> 16) & 255]}, gg{u[(g0 >> 8) & 255], u[(g1 >> 8) & 255]},
      gb{u[g0 & 255], u[g1 & 255]};
  const f64x2 g = 0.299 * gr + 0.587 * gg + 0.114 * gb;
  const f64x2 t = 0.55 * (1.0 - smooth_lanes((g - 0.40) / (0.52 - 0.40)));
  uint32_t r[2], gn[2], bl[2];
  channel_lanes(br + (0.97 - br) * t, r);
  channel_lanes(bg + (0.95 - bg) * t, gn);
  channel_lanes(bb + (0.90 - bb) * t, bl);
  for (int k = 0; k < 2; ++k) {
    const uint32_t p = static_cast<uint32_t>(in[i + k]);
    out[i + k] = static_cast<int>((p & 0xFF000000u) | r[k] << 16 | gn[k] << 8 | bl[k]);
  }
}

void oil_pastel_fast(const int* in, int* out, const int* grain, int width, int height) {
  const size_t w = static_cast<size_t>(width);
  const double* u = kUnit.v;
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const bool inner_row = y > 0 && y + 1 < height;
      const size_t row = static_cast<size_t>(y) * w;
      for (int x = 0; x < width; ++x) {
        const size_t i = row + static_cast<size_t>(x);
        if (inner_row && x > 0 && x + 2 < width) {  // x and x + 1 both inner
          oil_pastel_pair(in, out, grain, i, w);
          ++x;
          continue;
        }
        double mr = 0, mg = 0, mb = 0;
        if (inner_row && x > 0 && x + 1 < width) {
          for (int dy = -1; dy <= 1; ++dy) {
            const int* r = in + (i + dy * w);
            for (int dx = -1; dx <= 1; ++dx) {
              const uint32_t k = static_cast<uint32_t>(r[dx]);
              mr += u[(k >> 16) & 255], mg += u[(k >> 8) & 255], mb += u[k & 255];
            }
          }
        } else {
          for (int dy = -1; dy <= 1; ++dy) {
            for (int dx = -1; dx <= 1; ++dx) {
              const uint32_t k = at(in, width, height, x + dx, y + dy);
              mr += u[(k >> 16) & 255], mg += u[(k >> 8) & 255], mb += u[k & 255];
            }
          }
        }
        const Col c = saturate({mr / 9.0, mg / 9.0, mb / 9.0}, 1.35);
        const Col b{band_inline(c.r), band_inline(c.g), band_inline(c.b)};
        const uint32_t gp = static_cast<uint32_t>(grain[i]);
        const double g = luma({u[(gp >> 16) & 255], u[(gp >> 8) & 255], u[gp & 255]});
        const Col o = mix(b, {0.97, 0.95, 0.90}, 0.55 * (1.0 - smoothstep_sel(0.40, 0.52, g)));
        const uint32_t p = static_cast<uint32_t>(in[i]);
        out[i] = static_cast<int>((p & 0xFF000000u) | channel_sel(o.r) << 16 | channel_sel(o.g) << 8 |
                                  channel_sel(o.b));
      }
    }
  });
}

bool oil_pastel(int* in, int* out, int* grain, int width, int height) {
  if (!usable(in, out, width, height) || !grain) return false;
  if (!px_scalar_only()) {
    oil_pastel_fast(in, out, grain, width, height);
    return true;
  }
  each_pixel(width, height, [&](int x, int y, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    Col m{0, 0, 0};
    for (int dy = -1; dy <= 1; ++dy) {
      for (int dx = -1; dx <= 1; ++dx) {
        const Col k = read(at(in, width, height, x + dx, y + dy));
        m = {m.r + k.r, m.g + k.g, m.b + k.b};
      }
    }
    Col c = saturate({m.r / 9.0, m.g / 9.0, m.b / 9.0}, 1.35);
    auto band = [](double v) {
      const double s = clamp(static_cast<float>(v), 0.0f, 1.0f) * 5.0;
      const double f = std::floor(s);
      return (f + smoothstep(0.35, 0.65, s - f)) / 5.0;
    };
    c = {band(c.r), band(c.g), band(c.b)};
    const double g = luma(read(static_cast<uint32_t>(grain[i])));
    c = mix(c, {0.97, 0.95, 0.90}, 0.55 * (1.0 - smoothstep(0.40, 0.52, g)));
    out[i] = static_cast<int>(write(p, c));
  });
  return true;
}

// Noir note: a soft black-and-white film print with a warm note. Blacks are
// lifted and whites held back, v = 0.06 + 0.88 smoothstep(-0.1, 1.1, l);
// film grain adds 0.18 (g - 0.5) from the grain texture's luma g; the print
// is toned warm (1.03 v + 0.01, 0.99 v, 0.90 v).
bool noir_note(int* in, int* out, int* grain, int width, int height) {
  if (!usable(in, out, width, height) || !grain) return false;
  each_pixel(width, height, [&](int, int, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    double v = 0.06 + 0.88 * smoothstep(-0.1, 1.1, luma(read(p)));
    v += 0.18 * (luma(read(static_cast<uint32_t>(grain[i]))) - 0.5);
    out[i] = static_cast<int>(write(p, {1.03 * v + 0.01, 0.99 * v, 0.90 * v}));
  });
  return true;
}

// Impressionist: short dabs of bright paint on canvas. The stroke texture
// moves every sample: by (R - 0.5) 2s across and (B - 0.5) 2s down, with
// s = max(2, min(width, height) / 100) pixels (a grey texture gives
// diagonal dabs). The sample is saturated 1.3 times and posterised to 8
// levels a channel, into a working picture. Each pixel then averages five
// working pixels along the dab's diagonal (offsets -2..2, edges repeated)
// and is shaded by the canvas texture: c (0.8 + 0.2 canvas luma).
// The fast path of impressionist keeps each working pixel as its three
// level numbers (0..7, 3 bits each): the working channel is channel(L / 7)
// and so depends on L alone. The five-tap average of a channel is then a
// function of the five level numbers in tap order, kept in a table of 8^5
// entries filled by the same additions in the same order and the same
// division by 5, so the inner loop does one lookup a channel.
struct DabMeans {
  double v[1 << 15];
};
const DabMeans& dab_means() {
  static const DabMeans* table = [] {
    static DabMeans t;
    double unit[8];
    for (int l = 0; l < 8; ++l) unit[l] = kUnit.v[channel(l / 7.0)];
    for (int k = 0; k < (1 << 15); ++k) {
      double m = 0;
      for (int tap = 0; tap < 5; ++tap) m = m + unit[(k >> (3 * (4 - tap))) & 7];
      t.v[k] = m / 5.0;
    }
    return &t;
  }();
  return *table;
}

// The level number of one saturated channel: floor(clamp(v) 7 + 0.5), which
// is never negative, so truncation gives the floor.
inline uint32_t level_number(double v) {
  return static_cast<uint32_t>(clamp_sel(static_cast<float>(v), 0.0f, 1.0f) * 7.0 + 0.5);
}

void impressionist_fast(const int* in, int* out, const int* strokes, const int* canvas, int width, int height,
                        uint16_t* work, const int* move) {
  const size_t w = static_cast<size_t>(width);
  const double* u = kUnit.v;
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const size_t row = static_cast<size_t>(y) * w;
      int x = 0;
      for (; x + 1 < width; x += 2) {  // two pixels a time, one a lane
        const uint32_t t0 = static_cast<uint32_t>(strokes[row + x]), t1 = static_cast<uint32_t>(strokes[row + x + 1]);
        const uint32_t p0 = at(in, width, height, x + move[(t0 >> 16) & 255], y + move[t0 & 255]);
        const uint32_t p1 = at(in, width, height, x + 1 + move[(t1 >> 16) & 255], y + move[t1 & 255]);
        const f64x2 r{u[(p0 >> 16) & 255], u[(p1 >> 16) & 255]}, g{u[(p0 >> 8) & 255], u[(p1 >> 8) & 255]},
            b{u[p0 & 255], u[p1 & 255]};
        const f64x2 l = 0.299 * r + 0.587 * g + 0.114 * b;  // saturate(c, 1.3)
        const f64x2 lr = trunc_lanes(clamp_lanes(l + (r - l) * 1.3, 0.0f, 1.0f) * 7.0 + 0.5);
        const f64x2 lg = trunc_lanes(clamp_lanes(l + (g - l) * 1.3, 0.0f, 1.0f) * 7.0 + 0.5);
        const f64x2 lb = trunc_lanes(clamp_lanes(l + (b - l) * 1.3, 0.0f, 1.0f) * 7.0 + 0.5);
        for (int k = 0; k < 2; ++k) {
          work[row + x + k] = static_cast<uint16_t>(static_cast<uint32_t>(lr[k]) << 6 |
                                                    static_cast<uint32_t>(lg[k]) << 3 | static_cast<uint32_t>(lb[k]));
        }
      }
      for (; x < width; ++x) {
        const uint32_t t = static_cast<uint32_t>(strokes[row + x]);
        const uint32_t p = at(in, width, height, x + move[(t >> 16) & 255], y + move[t & 255]);
        const Col c = saturate({u[(p >> 16) & 255], u[(p >> 8) & 255], u[p & 255]}, 1.3);
        work[row + x] = static_cast<uint16_t>(level_number(c.r) << 6 | level_number(c.g) << 3 | level_number(c.b));
      }
    }
  });
  const DabMeans& means = dab_means();
  px_for_rows(height, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) {
      const size_t row = static_cast<size_t>(y) * w;
      const bool inner_row = y >= 2 && y + 2 < height;
      for (int x = 0; x < width; ++x) {
        const size_t i = row + static_cast<size_t>(x);
        uint32_t kr = 0, kg = 0, kb = 0;
        for (int k = -2; k <= 2; ++k) {
          uint32_t l;
          if (inner_row && x >= 2 && x + 2 < width) {
            l = work[i + k * (w + 1)];
          } else {
            const int sx = x + k < 0 ? 0 : (x + k >= width ? width - 1 : x + k);
            const int sy = y + k < 0 ? 0 : (y + k >= height ? height - 1 : y + k);
            l = work[static_cast<size_t>(sy) * w + static_cast<size_t>(sx)];
          }
          kr = kr << 3 | l >> 6, kg = kg << 3 | ((l >> 3) & 7), kb = kb << 3 | (l & 7);
        }
        const uint32_t cp = static_cast<uint32_t>(canvas[i]);
        const double shade = 0.8 + 0.2 * luma({u[(cp >> 16) & 255], u[(cp >> 8) & 255], u[cp & 255]});
        const uint32_t p = static_cast<uint32_t>(in[i]);
        out[i] = static_cast<int>((p & 0xFF000000u) | channel_sel(means.v[kr] * shade) << 16 |
                                  channel_sel(means.v[kg] * shade) << 8 | channel_sel(means.v[kb] * shade));
      }
    }
  });
}

bool impressionist(int* in, int* out, int* strokes, int* canvas, int width, int height) {
  if (!usable(in, out, width, height) || !strokes || !canvas) return false;
  const bool fast = !px_scalar_only();
  void* work = IF_CALLOC(fast ? 2 : 4, width * height);
  if (!work) {
    IF_ERROR("Low memory: gpu_impressionist\n");
    return false;
  }
  const int side = width < height ? width : height;
  const double s = side / 100 > 2 ? side / 100 : 2;
  if (fast) {
    // The move depends on one byte of the stroke texture: a table of it.
    int move[256];
    for (int v = 0; v < 256; ++v) move[v] = to_int(std::floor((v / 255.0 - 0.5) * 2.0 * s + 0.5));
    impressionist_fast(in, out, strokes, canvas, width, height, static_cast<uint16_t*>(work), move);
    IF_FREE(work);
    return true;
  }
  int* levels = static_cast<int*>(work);
  each_pixel(width, height, [&](int x, int y, size_t i) {
    const Col t = read(static_cast<uint32_t>(strokes[i]));
    const int sx = x + to_int(std::floor((t.r - 0.5) * 2.0 * s + 0.5));
    const int sy = y + to_int(std::floor((t.b - 0.5) * 2.0 * s + 0.5));
    Col c = saturate(read(at(in, width, height, sx, sy)), 1.3);
    auto level = [](double v) { return std::floor(clamp(static_cast<float>(v), 0.0f, 1.0f) * 7.0 + 0.5) / 7.0; };
    levels[i] = static_cast<int>(write(0, {level(c.r), level(c.g), level(c.b)}));
  });
  each_pixel(width, height, [&](int x, int y, size_t i) {
    Col m{0, 0, 0};
    for (int k = -2; k <= 2; ++k) {
      const Col c = read(at(levels, width, height, x + k, y + k));
      m = {m.r + c.r, m.g + c.g, m.b + c.b};
    }
    const double shade = 0.8 + 0.2 * luma(read(static_cast<uint32_t>(canvas[i])));
    out[i] = static_cast<int>(write(static_cast<uint32_t>(in[i]),
                                    {m.r / 5.0 * shade, m.g / 5.0 * shade, m.b / 5.0 * shade}));
  });
  IF_FREE(work);
  return true;
}

// Stucchevole ("cloying"): a sugary candy-pastel postcard. The colour moves
// 30 % toward candy pink (1.0, 0.72, 0.86), is lightened by the power 0.75
// and flattened to 0.12 + 0.85 c; the glow texture is screened over at 0.7
// (1 - (1 - c)(1 - 0.7 glow)), the paper texture shades it by
// 0.9 + 0.1 paper luma, and the sparkle texture adds 0.6 sparkle.
bool stucchevole(int* in, int* out, int* glow, int* paper, int* sparkle, int width, int height) {
  if (!usable(in, out, width, height) || !glow || !paper || !sparkle) return false;
  const Reader read;
  const Col pink{1.0, 0.72, 0.86};
  auto sweet = [](double v) { return 0.12 + 0.85 * std::pow(v, 0.75); };
  // The sweetened colour depends on each channel's byte alone: on the fast
  // path three tables of it, filled with the same expressions.
  struct Sweet {
    double r[256], g[256], b[256];
  };
  static const Sweet tables = [&] {
    Sweet t{};
    for (int v = 0; v < 256; ++v) {
      const Col c = mix(grey(v / 255.0), pink, 0.30);
      t.r[v] = sweet(c.r), t.g[v] = sweet(c.g), t.b[v] = sweet(c.b);
    }
    return t;
  }();
  const bool fast = !px_scalar_only();
  if (fast) {
    // The same arithmetic, reading by table and writing with the inlined
    // channel write.
    each_pixel(width, height, [&](int, int, size_t i) {
      const uint32_t p = static_cast<uint32_t>(in[i]);
      Col c{tables.r[(p >> 16) & 255], tables.g[(p >> 8) & 255], tables.b[p & 255]};
      const Col gl = read_table(static_cast<uint32_t>(glow[i]));
      c = {1.0 - (1.0 - c.r) * (1.0 - 0.7 * gl.r), 1.0 - (1.0 - c.g) * (1.0 - 0.7 * gl.g),
           1.0 - (1.0 - c.b) * (1.0 - 0.7 * gl.b)};
      const double shade = 0.9 + 0.1 * luma(read_table(static_cast<uint32_t>(paper[i])));
      const Col sp = read_table(static_cast<uint32_t>(sparkle[i]));
      out[i] = static_cast<int>((p & 0xFF000000u) | channel_sel(c.r * shade + 0.6 * sp.r) << 16 |
                                channel_sel(c.g * shade + 0.6 * sp.g) << 8 | channel_sel(c.b * shade + 0.6 * sp.b));
    });
    return true;
  }
  each_pixel(width, height, [&](int, int, size_t i) {
    const uint32_t p = static_cast<uint32_t>(in[i]);
    Col c = mix(read(p), pink, 0.30);
    c = {sweet(c.r), sweet(c.g), sweet(c.b)};
    const Col gl = read(static_cast<uint32_t>(glow[i]));
    c = {1.0 - (1.0 - c.r) * (1.0 - 0.7 * gl.r), 1.0 - (1.0 - c.g) * (1.0 - 0.7 * gl.g),
         1.0 - (1.0 - c.b) * (1.0 - 0.7 * gl.b)};
    const double shade = 0.9 + 0.1 * luma(read(static_cast<uint32_t>(paper[i])));
    const Col sp = read(static_cast<uint32_t>(sparkle[i]));
    out[i] = static_cast<int>(
        write(p, {c.r * shade + 0.6 * sp.r, c.g * shade + 0.6 * sp.g, c.b * shade + 0.6 * sp.b}));
  });
  return true;
}

// The partial rule of the family (see the header); `message` is logged as
// it stands when the scratch picture cannot be allocated.
template <class Whole>
void partial(const char* func, const char* message, unsigned char* mask, int* out, int width, int height, int left,
             int right, int top, int bottom, Whole whole) {
  if (!out || width <= 0 || height <= 0) return;
  auto* scratch = static_cast<int*>(IF_CALLOC(4, width * height));
  if (!scratch) {
    if_error_msg(func, __LINE__, "%s", message);
    return;
  }
  if (whole(scratch)) px_merge_selected(scratch, out, mask, width, height, px_rect{left, right, top, bottom});
  IF_FREE(scratch);
}

}  // namespace

// ---- whole-picture forms -----------------------------------------------------------

void gpu_Turquoise(int* in, int* out, int width, int height) { turquoise(in, out, width, height); }
void gpu_rainbow(int* in, int* out, int width, int height) { rainbow(in, out, width, height); }
void gpu_gothicnoir(int* in, int* out, int width, int height) { gothicnoir(in, out, width, height); }
void gpu_vignette(int* in, int* out, int width, int height) { vignette(in, out, width, height); }
void gpu_rugged(int* in, int* out, int* grain, int width, int height) { rugged(in, out, grain, width, height); }
void gpu_oilPastel(int* in, int* out, int* grain, int width, int height) {
  oil_pastel(in, out, grain, width, height);
}
void gpu_noirNote(int* in, int* out, int* grain, int width, int height) { noir_note(in, out, grain, width, height); }
void gpu_impressionist(int* in, int* out, int* strokes, int* canvas, int width, int height) {
  impressionist(in, out, strokes, canvas, width, height);
}
void gpu_stucchevole(int* in, int* out, int* glow, int* paper, int* sparkle, int width, int height) {
  stucchevole(in, out, glow, paper, sparkle, width, height);
}

// ---- partial forms ---------------------------------------------------------------------

#define GPU_PARTIAL(name, look, message)                                                                       \
  void name(int* in, unsigned char* mask, int* out, int width, int height, int left, int right, int top,       \
            int bottom) {                                                                                      \
    partial(__func__, message, mask, out, width, height, left, right, top, bottom,                             \
            [&](int* s) { return look(in, s, width, height); });                                               \
  }

GPU_PARTIAL(gpu_Turquoise_partial, turquoise, "Low memory: gpu_Turquoise_partial\n")
GPU_PARTIAL(gpu_rainbow_partial, rainbow, "Low Memory: gpu_rainbow_partial\n")
GPU_PARTIAL(gpu_gothicnoir_partial, gothicnoir, "Low Memory: gpu_gothicnoir_partial\n")
GPU_PARTIAL(gpu_vignette_partial, vignette, "Low Memory: gpu_vignette_partial\n")

// Rugged's partial form logs under its older name, sandstone; oil pastel's
// under pastelSketch.
void gpu_rugged_partial(int* in, unsigned char* mask, int* out, int* grain, int width, int height, int left,
                        int right, int top, int bottom) {
  partial(__func__, "Low Memory: gpu_sandstone_partial\n", mask, out, width, height, left, right, top, bottom,
          [&](int* s) { return rugged(in, s, grain, width, height); });
}

void gpu_oilPastel_partial(int* in, unsigned char* mask, int* out, int* grain, int width, int height, int left,
                           int right, int top, int bottom) {
  partial(__func__, "Low Memory: gpu_pastelSketch_partial\n", mask, out, width, height, left, right, top, bottom,
          [&](int* s) { return oil_pastel(in, s, grain, width, height); });
}

void gpu_noirNote_partial(int* in, unsigned char* mask, int* out, int* grain, int width, int height, int left,
                          int right, int top, int bottom) {
  partial(__func__, "low Memory: gpu_noirNote_partial\n", mask, out, width, height, left, right, top, bottom,
          [&](int* s) { return noir_note(in, s, grain, width, height); });
}

void gpu_impressionist_partial(int* in, unsigned char* mask, int* out, int* strokes, int* canvas, int width,
                               int height, int left, int right, int top, int bottom) {
  partial(__func__, "Low Memory: gpu_impressionist_partial\n", mask, out, width, height, left, right, top, bottom,
          [&](int* s) { return impressionist(in, s, strokes, canvas, width, height); });
}

void gpu_stucchevole_partial(int* in, unsigned char* mask, int* out, int* glow, int* paper, int* sparkle, int width,
                             int height, int left, int right, int top, int bottom) {
  partial(__func__, "Low Memory: gpu_stucchevole_partial\n", mask, out, width, height, left, right, top, bottom,
          [&](int* s) { return stucchevole(in, s, glow, paper, sparkle, width, height); });
}
