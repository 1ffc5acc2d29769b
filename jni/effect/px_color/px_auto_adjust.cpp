// Automatic adjustment: histogram, logarithmic flattening, tone curve and a
// hue-keeping gain; and the two levels remappings. Integer arithmetic wraps
// in 32 bits as on the target (the helpers below make that explicit).
#include "px_auto_adjust.h"

#include <array>
#include <atomic>
#include <cstdint>

#include "../kalo/px_mem.h"
#include "px_region.h"
#include "px_tone.h"

namespace {

int g_threshold = 70;
int g_cutoff = 100;
int g_weight1 = 1000;
int g_weight2 = 5120;

inline int32_t wmul(int32_t a, int32_t b) {
  return static_cast<int32_t>(static_cast<uint32_t>(a) * static_cast<uint32_t>(b));
}
inline int32_t wadd(int32_t a, int32_t b) {
  return static_cast<int32_t>(static_cast<uint32_t>(a) + static_cast<uint32_t>(b));
}
inline int32_t wshl(int32_t a, int s) { return static_cast<int32_t>(static_cast<uint32_t>(a) << s); }

// ---- the logarithm table, built from its rule ---------------------------------

constexpr double ln_series(double x) {  // x > 0, accurate for 0.25 <= x <= 4
  const double z = (x - 1) / (x + 1), z2 = z * z;
  double term = z, sum = 0;
  for (int k = 0; k < 80; ++k) {
    sum += term / (2 * k + 1);
    term *= z2;
  }
  return 2 * sum;
}

constexpr int table_sample(int i) {
  if (i <= 54) return 1024 + 2 * i;
  if (i <= 79) return 1136 + 4 * (i - 55);
  if (i <= 117) return 1240 + 8 * (i - 80);
  if (i <= 181) return 1552 + 16 * (i - 118);
  return 2592 + 32 * (i - 182);
}

constexpr std::array<int, 230> make_log_table() {
  std::array<int, 230> t{};
  const double ln2 = ln_series(2.0);
  for (int i = 0; i < 230; ++i) {
    const double v = 512.0 * ln_series(table_sample(i) / 1024.0) / ln2;
    t[i] = static_cast<int>(v + 0.5);
  }
  return t;
}
constexpr std::array<int, 230> kLogTable = make_log_table();
static_assert(table_sample(54) == 1132 && table_sample(79) == 1232 && table_sample(117) == 1536 &&
              table_sample(181) == 2560 && table_sample(229) == 4096);
static_assert(kLogTable[0] == 0 && kLogTable[229] == 1024);

// ---- one call's work -------------------------------------------------------------

constexpr int kBins = 101;
constexpr int kLargePicture = 2000000;

struct Luma {
  int32_t* l;  // (218 R + 732 G + 74 B) << 10
  int32_t* p;  // (L / 255) * 100: P >> 20 is the luminance percentage
};

void measure(const int* in, Luma buf, int width, int height) {
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; ++i) {
      const uint32_t px = static_cast<uint32_t>(in[i]);
      const int32_t l = static_cast<int32_t>((218 * ((px >> 16) & 255) + 732 * ((px >> 8) & 255) + 74 * (px & 255))
                                             << 10);
      buf.l[i] = l;
      buf.p[i] = (l / 255) * 100;
    }
  });
}

// The histogram bin of a pixel depends only on s = 218 R + 732 G + 74 B
// (0..261120) and never falls as s grows, so "bin > 49" is "s >= the first s
// whose bin passes 49".
constexpr int32_t kLumaSumMax = 261120;
int32_t bin_of_sum(int32_t s) { return ((static_cast<int32_t>(static_cast<uint32_t>(s) << 10) / 255) * 100) >> 20; }

int32_t first_bright_sum() {
  int32_t lo = 0, hi = kLumaSumMax + 1;  // bin_of_sum(hi - 1) = 100 > 49
  while (lo < hi) {
    const int32_t mid = lo + (hi - lo) / 2;
    if (bin_of_sum(mid) > 49) {
      hi = mid;
    } else {
      lo = mid;
      lo += 1;
    }
  }
  return lo;
}

// Pixels of bin > 49, counted in row bands without the luminance buffers.
int32_t count_bright(const int* in, int width, int height) {
  const int32_t threshold = first_bright_sum();
  const size_t w = static_cast<size_t>(width);
  std::atomic<int32_t> bright{0};
  px_for_rows(height, [&](int y0, int y1) {
    int32_t count = 0;
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; ++i) {
      const uint32_t px = static_cast<uint32_t>(in[i]);
      const int32_t s = static_cast<int32_t>(218 * ((px >> 16) & 255) + 732 * ((px >> 8) & 255) + 74 * (px & 255));
      count += s >= threshold ? 1 : 0;
    }
    bright.fetch_add(count, std::memory_order_relaxed);
  });
  return bright.load();
}

// One cheap global adjustment for very large pictures, by the share of
// bright pixels.
void adjust_large(int* in, int* out, int width, int height, int32_t n, int32_t bright) {
  if (bright > (n >> 2) * 3) {
    px_control_brightness_all(in, out, width, height, 9);
  } else if (bright <= n >> 2) {
    px_control_brightness_all(in, out, width, height, 11);
  } else {
    px_control_contrast_all(in, out, width, height, 12);
  }
}

// The tone curve: 51 entries in sixteenths of a percent, entry k for 2k %.
std::array<int32_t, 51> tone_curve(const std::array<int32_t, kBins>& hist, int32_t max_count, int32_t n,
                                   int32_t weight, int cutoff) {
  const int32_t base = wmul(n >> 8, weight);
  const int32_t lmax = log_e_FIX_new(max_count + 2048);
  std::array<int32_t, kBins> w{};
  int32_t sum = 0;
  for (int i = 0; i < kBins; ++i) {
    const int32_t h = hist[i];
    const int32_t r = wshl(log_e_FIX_new(h + 1024), 5) / (lmax >> 5);
    const int32_t d = 1024 - r;
    w[i] = wmul(wadd(base, wmul(h, d)), 1024 / ((d + weight) >> 6)) >> 10;
    sum = wadd(sum, w[i]);
  }
  const int32_t s = sum < 1024 ? 1 : sum >> 10;
  std::array<int32_t, 51> curve{};
  int32_t c = 0;
  for (int i = 0; i < kBins; ++i) {
    c = wadd(c, w[i]);
    const int32_t val = wadd(wmul(cutoff, c / s), 512) >> 10;
    if (i == 0 || (i % 2 == 0)) curve[i / 2] = wmul(val, 16);  // odd bins only feed the running sum
  }
  return curve;
}

void map_pixels(const int* in, int* out, Luma buf, int width, int height, const std::array<int32_t, 51>& curve) {
  std::array<int32_t, 51> target{};
  for (int k = 0; k < 51; ++k) target[k] = wmul(wshl(curve[k], 16) / 100, 255);
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; ++i) {
      const uint32_t px = static_cast<uint32_t>(in[i]);
      const int32_t l = buf.l[i], p = buf.p[i];
      const int32_t r = (px >> 16) & 255, g = (px >> 8) & 255, b = px & 255;
      if (l < 0x100000) {  // luminance below 1: unchanged
        out[i] = static_cast<int>(px);
        continue;
      }
      const int32_t t = p < 1 ? 0 : (p <= (100 << 20) ? target[p >> 21] : 0xFF00000);
      int32_t gain = t / (l >> 10);
      const int32_t r10 = r << 10, g10 = g << 10, b10 = b << 10;
      if (wmul(r10, gain) > 0xFF00000 || wmul(g10, gain) > 0xFF00000 || wmul(b10, gain) > 0xFF00000) {
        // Scale so the brightest channel reaches the top: the hue is kept.
        gain = 0xFF00000 / (r10 + 1);
        const int32_t gg = 0xFF00000 / (g10 + 1), gb = 0xFF00000 / (b10 + 1);
        if (gg < gain) gain = gg;
        if (gb < gain) gain = gb;
      }
      out[i] = static_cast<int>(px_argb(px, px_clamp255(wmul(r10, gain) >> 20), px_clamp255(wmul(g10, gain) >> 20),
                                        px_clamp255(wmul(b10, gain) >> 20)));
    }
  });
}

// A 256-entry map applied to the selected channels; the others and alpha stay.
void remap_channels(int* in, int* out, int width, int height, int channel, const std::array<uint8_t, 256>& map) {
  const bool r = channel == 0 || channel == 1, g = channel == 0 || channel == 2, b = channel == 0 || channel == 3;
  px_map_pixels(in, out, width, height, [&](uint32_t p) {
    uint32_t cr = (p >> 16) & 255, cg = (p >> 8) & 255, cb = p & 255;
    if (r) cr = map[cr];
    if (g) cg = map[cg];
    if (b) cb = map[cb];
    return (p & 0xFF000000u) | cr << 16 | cg << 8 | cb;
  });
}

}  // namespace

const int log_new_FIX[230] = {
#define PX_LOG_ROW(i) kLogTable[i], kLogTable[i + 1], kLogTable[i + 2], kLogTable[i + 3], kLogTable[i + 4]
    PX_LOG_ROW(0),   PX_LOG_ROW(5),   PX_LOG_ROW(10),  PX_LOG_ROW(15),  PX_LOG_ROW(20),  PX_LOG_ROW(25),
    PX_LOG_ROW(30),  PX_LOG_ROW(35),  PX_LOG_ROW(40),  PX_LOG_ROW(45),  PX_LOG_ROW(50),  PX_LOG_ROW(55),
    PX_LOG_ROW(60),  PX_LOG_ROW(65),  PX_LOG_ROW(70),  PX_LOG_ROW(75),  PX_LOG_ROW(80),  PX_LOG_ROW(85),
    PX_LOG_ROW(90),  PX_LOG_ROW(95),  PX_LOG_ROW(100), PX_LOG_ROW(105), PX_LOG_ROW(110), PX_LOG_ROW(115),
    PX_LOG_ROW(120), PX_LOG_ROW(125), PX_LOG_ROW(130), PX_LOG_ROW(135), PX_LOG_ROW(140), PX_LOG_ROW(145),
    PX_LOG_ROW(150), PX_LOG_ROW(155), PX_LOG_ROW(160), PX_LOG_ROW(165), PX_LOG_ROW(170), PX_LOG_ROW(175),
    PX_LOG_ROW(180), PX_LOG_ROW(185), PX_LOG_ROW(190), PX_LOG_ROW(195), PX_LOG_ROW(200), PX_LOG_ROW(205),
    PX_LOG_ROW(210), PX_LOG_ROW(215), PX_LOG_ROW(220), PX_LOG_ROW(225),
#undef PX_LOG_ROW
};

void px_set_hdr(int threshold, int cutoff, int weight1, int weight2) {
  if (static_cast<unsigned>(threshold) <= 127u) g_threshold = threshold;
  if (static_cast<unsigned>(cutoff) <= 100u) g_cutoff = cutoff;
  if (static_cast<unsigned>(weight1) >= 300u && static_cast<unsigned>(weight1) <= 8196u) g_weight1 = weight1;
  if (static_cast<unsigned>(weight2) >= 300u && static_cast<unsigned>(weight2) <= 8196u) g_weight2 = weight2;
}
int px_get_threshold_hdr() { return g_threshold; }
int px_get_cutoff_hdr() { return g_cutoff; }
int px_get_weight1_hdr() { return g_weight1; }
int px_get_weight2_hdr() { return g_weight2; }

int log_interp_FIX(const int* t, int v) {
  if (v < 1024) return 0;
  int i, frac, shift;
  if (v < 1133) {
    i = (v - 1024) >> 1, frac = v & 1, shift = 1;
  } else if (v < 1233) {
    i = ((v - 1132) >> 2) + 54, frac = v & 3, shift = 2;
  } else if (v < 1537) {
    i = ((v - 1232) >> 3) + 79, frac = v & 7, shift = 3;
  } else if (v < 2561) {
    i = ((v - 1536) >> 4) + 117, frac = v & 15, shift = 4;
  } else if (v >= 4096) {
    return 1024;
  } else {
    i = ((v - 2560) >> 5) + 181, frac = v & 31, shift = 5;
  }
  return t[i] + ((frac * (t[i + 1] - t[i])) >> shift);
}

int log_e_FIX_new(int x) {
  const int* t = log_new_FIX;
  if (x == 1) return 0;
  if (x >= 5 && x <= 16) return 1420 * log_interp_FIX(t, x * 256) - 0x58C000;
  if (x >= 17 && x <= 64) return 1420 * log_interp_FIX(t, x * 64) - 0x429000;
  if (x >= 65 && x <= 256) return 1420 * log_interp_FIX(t, x * 16) - 0x2C6000;
  if (x >= 257 && x <= 1024) return 1420 * log_interp_FIX(t, x * 4) - 0x163000;
  if (x >= 1025 && x <= 4096) return 1420 * log_interp_FIX(t, x);
  if (x >= 4097 && x <= 16384) return 1420 * log_interp_FIX(t, x >> 2) + 0x163000;
  if (x >= 16385 && x <= 65536) return 1420 * log_interp_FIX(t, x >> 4) + 0x2C6000;
  if (x >= 65537 && x <= 0x40000) return 1420 * log_interp_FIX(t, x >> 6) + 0x429000;
  if (x >= 0x40001 && x <= 0x100000) return 1420 * log_interp_FIX(t, x >> 8) + 0x58C000;
  if (x >= 0x100001 && x <= 0x400000) return 1420 * log_interp_FIX(t, x >> 10) + 7270400;
  return 21811200;  // x <= 0, 2, 3, 4 and beyond 0x400000: never reached by the adjustment
}

int px_auto_adjust_bright_sum() { return first_bright_sum(); }

int px_process_hdr(int* in, int* out, int width, int height) {
  const int threshold = g_threshold, cutoff = g_cutoff, weight1 = g_weight1, weight2 = g_weight2;
  // An empty picture has nothing to measure or change.
  if (!in || !out) return PX_ERR_NULL;
  if (width < 1 || height < 1) return PX_OK;
  const int32_t n = width * height;
  if (n > kLargePicture && !px_scalar_only()) {
    // The fast path needs only the count of bright pixels: no buffers.
    adjust_large(in, out, width, height, n, count_bright(in, width, height));
    return PX_OK;
  }
  Luma buf{static_cast<int32_t*>(px_calloc(static_cast<size_t>(n), 4)), nullptr};
  if (!buf.l) return PX_ERR_ALLOC;
  buf.p = static_cast<int32_t*>(px_calloc(static_cast<size_t>(n), 4));
  if (!buf.p) {
    px_free(buf.l);
    return PX_ERR_ALLOC;
  }

  measure(in, buf, width, height);
  std::array<int32_t, kBins> hist{};
  int32_t max_count = 0, bright = 0;
  for (int32_t i = 0; i < n; ++i) {
    const int bin = buf.p[i] >> 20;
    if (bin == 0) continue;  // the darkest percent is not counted anywhere
    if (++hist[bin] > max_count) max_count = hist[bin];
    if (bin > 49) ++bright;
  }

  if (n > kLargePicture) {
    adjust_large(in, out, width, height, n, bright);
    px_free(buf.l);
    px_free(buf.p);
    return PX_OK;
  }

  // Whole-percent share of bright pixels against the threshold.
  const int32_t pct = 100 * ((bright << 10) / n);
  const int32_t weight = threshold <= pct / 1024 ? weight2 : weight1;
  const std::array<int32_t, 51> curve = tone_curve(hist, max_count, n, weight, cutoff);
  map_pixels(in, out, buf, width, height, curve);
  px_free(buf.l);
  px_free(buf.p);
  return PX_OK;
}

void changeHistogramByInput(int* in, int* out, int width, int height, int channel, int low, int high) {
  if (!in || !out || high <= low) return;
  const int scale = 261120 / (high - low);
  std::array<uint8_t, 256> map{};
  for (int c = 0; c < 256; ++c) map[c] = static_cast<uint8_t>(px_clamp255(wmul(c - low, scale) >> 10));
  remap_channels(in, out, width, height, channel, map);
}

void changeHistogramByOutput(int* in, int* out, int width, int height, int channel, int low, int high) {
  if (!in || !out || high <= low || height < 1) return;
  const int scale = wmul(high - low, 1024) / 255;
  std::array<uint8_t, 256> map{};
  for (int c = 0; c < 256; ++c) map[c] = static_cast<uint8_t>(px_clamp255(wadd(low, wmul(c, scale) >> 10)));
  remap_channels(in, out, width, height, channel, map);
}
