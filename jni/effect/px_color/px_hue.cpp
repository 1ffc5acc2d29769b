// Hue rotation, RGB balance, point colour and colour tone. Each is a small
// pixel function built once per call; the region and whole-picture forms
// only differ in which pixels they visit.
#include "px_hue.h"

#include <array>
#include <cstdint>
#include <cstring>

#include "px_fixed.h"
#include "px_fixed_tables.h"
#include "px_region.h"
#include "px_tone_pixels.h"

const int LUT_HueValue_Range100[101] = {
    180, 183, 187, 190, 194, 197, 201, 205, 208, 212, 215, 219, 223, 226, 230, 233, 237, 241, 244, 248, 251,
    255, 259, 262, 266, 269, 273, 277, 280, 284, 287, 291, 295, 298, 302, 305, 309, 313, 316, 320, 323, 327,
    331, 334, 338, 341, 345, 349, 352, 356, 0,   3,   7,   10,  14,  17,  21,  25,  28,  32,  35,  39,  43,
    46,  50,  53,  57,  61,  64,  68,  71,  75,  79,  82,  86,  89,  93,  97,  100, 104, 107, 111, 115, 118,
    122, 125, 129, 133, 136, 140, 143, 147, 151, 154, 158, 161, 165, 169, 172, 176, 179};

namespace {

inline void unpack(uint32_t p, int* r, int* g, int* b) {
  *r = static_cast<int>((p >> 16) & 255);
  *g = static_cast<int>((p >> 8) & 255);
  *b = static_cast<int>(p & 255);
}

// ---- hue -------------------------------------------------------------------

// The HSV sector px_hsv2rgb would use for h (h = 360 is sector 0); the product
// wraps in 32 bits as on the target.
inline int hue_sector(int h) {
  if (h == 360) return 0;
  return static_cast<int32_t>(static_cast<uint32_t>(h) * 1092u) >> 16;
}

struct HueShift {
  int shift;
  uint32_t operator()(uint32_t p) const {
    int r, g, b, h, s, v;
    unpack(p, &r, &g, &b);
    px_rgb2hsv(r, g, b, &h, &s, &v);
    if (s == 0) return p;  // grey stays grey
    int h2 = static_cast<int>(static_cast<uint32_t>(h) + static_cast<uint32_t>(shift));
    if (h2 < 0) {
      h2 += 360;
    } else if (h2 > 359) {
      h2 -= 360;
    }
    const int sector = hue_sector(h2);
    if (sector < 0 || sector > 5) return p;
    px_hsv2rgb(h2, s, v, &r, &g, &b);
    return px_argb(p, r, g, b);
  }
};

// HueShift by a table of the 361 hues a pixel can have. A turn keeps a
// pixel's value v (its largest channel) and lo = v (1 - s) in the channels
// the turned sector gives them; only the third channel depends on the turned
// hue, through f (its place in the sector): q = v (1 - s f) or
// u = v (1 - s (1 - f)). So each hue's entry holds the sector's placement of
// v, lo and that channel and the f term it uses, all worked out by the plain
// conversion's own steps; per pixel remain the hue, s and two products.
struct HueTurn {
  uint32_t keep;        // all ones: the turned hue is in no sector
  uint32_t sv, sm, sl;  // shifts placing v, the third channel and lo
  int32_t f4;           // f >> 4 (q) or (65536 - f) >> 4 (u)
};
using HueTurnTable = std::array<HueTurn, 361>;

inline int32_t wrap_mul(int32_t a, int32_t b) {
  return static_cast<int32_t>(static_cast<uint32_t>(a) * static_cast<uint32_t>(b));
}

HueTurnTable hue_turn_table(int shift) {
  HueTurnTable t{};
  for (int h = 0; h <= 360; ++h) {
    int h2 = static_cast<int>(static_cast<uint32_t>(h) + static_cast<uint32_t>(shift));
    if (h2 < 0) {
      h2 += 360;
    } else if (h2 > 359) {
      h2 -= 360;
    }
    const int sector = hue_sector(h2);
    HueTurn& e = t[static_cast<size_t>(h)];
    if (sector < 0 || sector > 5) {
      e = {~0u, 0, 0, 0, 0};
      continue;
    }
    const int f = h2 == 360 ? 0 : wrap_mul(h2, 1092) - (sector << 16);
    const int32_t q = f >> 4, u = (65536 - f) >> 4;
    // Sectors 0..5: R = v q lo lo u v, G = u v v q lo lo, B = lo lo u v v q:
    // the shifts of v, the third channel and lo in each; the third channel
    // is q in the odd sectors and u in the even ones.
    static constexpr uint32_t kPlace[6][3] = {{16, 8, 0}, {8, 16, 0}, {8, 0, 16}, {0, 8, 16}, {0, 16, 8}, {16, 0, 8}};
    const uint32_t* place = kPlace[sector];
    e = {0, place[0], place[1], place[2], sector % 2 == 1 ? q : u};
  }
  return t;
}

// The turn in short runs of pixels, in three loops: the hue
// index, s and v by arithmetic (floor(65536 / n) for n = 1..255 by a float
// division: the quotient is never within half a float step of the next
// integer, so its floor is exact), which vectorises; the table's entries
// copied out for each pixel's hue; then lo, the third channel and their
// placement (byte masks: a channel value times 0x010101 masked to its place),
// which vectorises again.
struct HueRunEntry {
  uint32_t keep;        // all ones: the turned hue is in no sector
  uint32_t mv, mm, ml;  // byte masks of v, the third channel and lo
  int32_t f4;
};

inline int floor_65536_over(int n) {  // n = 1..255
  return static_cast<int>(65536.0f / static_cast<float>(n));
}

// The working arrays of one run of at most kHueRun pixels.
constexpr size_t kHueRun = 256;
struct HueRun {
  int32_t hue[kHueRun], sat[kHueRun], val[kHueRun], f4[kHueRun];
  uint32_t keep[kHueRun], mv[kHueRun], mm[kHueRun], ml[kHueRun];

  // d[0..n) = s[0..n) turned; with a mask, only where its byte is 1 (d gets
  // s elsewhere). s may be d.
  void turn(const uint32_t* s, uint32_t* d, size_t n, const HueRunEntry* t, const unsigned char* m) {
    for (size_t j = 0; j < n; ++j) {
      const uint32_t p = s[j];
      const int r = static_cast<int>((p >> 16) & 255), g = static_cast<int>((p >> 8) & 255),
                b = static_cast<int>(p & 255);
      int v = r > g ? r : g;
      v = b > v ? b : v;
      int min = r < g ? r : g;
      min = b < min ? b : min;
      const int delta = v - min;
      // v = 0 or delta = 0: multiplied by delta = 0 or kept below, as the
      // tables' entry 0 (0) gives.
      const int sv = floor_65536_over(v > 0 ? v : 1) * delta;
      const int k = 60 * floor_65536_over(delta > 0 ? delta : 1);
      const int by_r = -static_cast<int>(r == v), by_g = ~by_r & -static_cast<int>(g == v), by_b = ~(by_r | by_g);
      const int diff = (by_r & (g - b)) | (by_g & (b - r)) | (by_b & (r - g));
      fixed hf = (by_g & itofix(120)) + (by_b & itofix(240)) + k * diff;
      hf += (hf >> 31) & itofix(360);
      hue[j] = fixtoi(hf);
      sat[j] = sv;
      val[j] = v;
    }
    for (size_t j = 0; j < n; ++j) {
      const HueRunEntry& e = t[hue[j]];
      keep[j] = e.keep;
      mv[j] = e.mv;
      mm[j] = e.mm;
      ml[j] = e.ml;
      f4[j] = e.f4;
    }
    const auto turned = [&](size_t j, uint32_t p) {
      const int v = val[j], sv = sat[j];
      const uint32_t lo = static_cast<uint32_t>(fixtoi(v * (65536 - sv)));
      const uint32_t mid = static_cast<uint32_t>(fixtoi(v * (65536 - (((sv >> 4) * f4[j]) >> 8))));
      const uint32_t o = (p & 0xFF000000u) | (static_cast<uint32_t>(v) * 0x010101u & mv[j]) |
                         (mid * 0x010101u & mm[j]) | (lo * 0x010101u & ml[j]);
      const uint32_t kept = keep[j] | (0u - static_cast<uint32_t>(sv == 0));
      return (p & kept) | (o & ~kept);
    };
    if (!m) {
      for (size_t j = 0; j < n; ++j) d[j] = turned(j, s[j]);
    } else {
      for (size_t j = 0; j < n; ++j) {
        const uint32_t p = s[j], o = turned(j, p);
        d[j] = m[j] == 1 ? o : p;
      }
    }
  }
};

// The turn by the region rule (see px_region.h) in runs: the whole picture
// for an empty rectangle; otherwise rows outside the rectangle copied and
// the rectangle's row segments turned where the mask byte is 1.
void hue_in_runs(const uint32_t* src, const unsigned char* mask, uint32_t* dst, int width, int height, px_rect rect,
                 const HueTurnTable& table) {
  std::array<HueRunEntry, 361> turn{};
  for (size_t h = 0; h < turn.size(); ++h) {
    const HueTurn& e = table[h];
    turn[h] = {e.keep, 0xFFu << e.sv, 0xFFu << e.sm, 0xFFu << e.sl, e.f4};
  }
  const size_t w = static_cast<size_t>(width);
  const bool whole = px_rect_empty(rect);
  const px_rect r = whole ? rect : px_rect_clip(rect, width, height);
  const bool none = !whole && px_rect_empty(r);
  px_for_rows(height, [&](int y0, int y1) {
    HueRun run;
    const HueRunEntry* t = turn.data();
    if (whole) {
      for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; i += kHueRun) {
        run.turn(src + i, dst + i, end - i < kHueRun ? end - i : kHueRun, t, nullptr);
      }
      return;
    }
    for (int y = y0; y < y1; ++y) {
      const uint32_t* s = src + static_cast<size_t>(y) * w;
      uint32_t* d = dst + static_cast<size_t>(y) * w;
      if (none || y < r.top || y > r.bottom) {
        if (s != d) std::memcpy(d, s, w * 4);
        continue;
      }
      if (s != d) {
        std::memcpy(d, s, static_cast<size_t>(r.left) * 4);
        std::memcpy(d + r.right + 1, s + r.right + 1, (w - static_cast<size_t>(r.right) - 1) * 4);
      }
      const unsigned char* m = mask + static_cast<size_t>(y) * w;
      for (size_t x = static_cast<size_t>(r.left), end = static_cast<size_t>(r.right) + 1; x < end; x += kHueRun) {
        run.turn(s + x, d + x, end - x < kHueRun ? end - x : kHueRun, t, m + x);
      }
    }
  });
}

// True when no hue 0..360 turned by `shift` lands in a sector (a turn of
// more than two full circles): every pixel then keeps its colour.
bool turns_nothing(int shift) {
  for (int h = 0; h <= 360; ++h) {
    int h2 = static_cast<int>(static_cast<uint32_t>(h) + static_cast<uint32_t>(shift));
    h2 += h2 < 0 ? 360 : (h2 > 359 ? -360 : 0);
    const int sector = hue_sector(h2);
    if (sector >= 0 && sector <= 5) return false;
  }
  return true;
}

int rotate_hue(int* in, unsigned char* mask, int* out, int width, int height, int shift, px_rect rect) {
  if (!in || !out) return PX_ERR_NULL;
  if (shift == 0 || (!px_scalar_only() && turns_nothing(shift))) {
    if (in != out && width > 0 && height > 0) {
      std::memmove(out, in, static_cast<size_t>(width) * static_cast<size_t>(height) * 4);
    }
    return PX_OK;
  }
  if (px_scalar_only()) {
    px_region_map(in, mask, out, width, height, rect, HueShift{shift});
  } else {
    const HueTurnTable table = hue_turn_table(shift);
    if (width > 0 && height > 0) {
      hue_in_runs(reinterpret_cast<const uint32_t*>(in), mask, reinterpret_cast<uint32_t*>(out), width, height, rect,
                  table);
    }
  }
  return PX_OK;
}

// ---- RGB balance -----------------------------------------------------------

struct Balance {
  int dr, dg, db;  // offsets added to R, G, B; they sum to zero
  static int channel(int c, int d) {
    int v = c + d;
    return v >= 256 ? 255 : (v < 0 ? 0 : v);
  }
  uint32_t operator()(uint32_t p) const {
    int r, g, b;
    unpack(p, &r, &g, &b);
    return static_cast<uint32_t>(
        px_pack_rgb888(static_cast<int>(p), channel(r, dr), channel(g, dg), channel(b, db)));
  }
};

Balance balance_of(int red, int green, int blue) {
  const int dr = red - 10, dg = green - 10, db = blue - 10;
  return {6 * dr - 3 * dg - 3 * db, 6 * dg - 3 * dr - 3 * db, 6 * db - 3 * dr - 3 * dg};
}

Balance balance_of_range100(int red, int green, int blue) {
  // Steps of 0.6 in single precision, truncated.
  const int dr = static_cast<int>(static_cast<float>(red - 50) * 0.6f);
  const int dg = static_cast<int>(static_cast<float>(green - 50) * 0.6f);
  const int db = static_cast<int>(static_cast<float>(blue - 50) * 0.6f);
  return {2 * dr - dg - db, 2 * dg - dr - db, 2 * db - dr - dg};
}

// ---- point colour ----------------------------------------------------------

// Luma/chroma with integer weights (arithmetic shifts), as the tone
// adjustments use it.
struct Ycc {
  int y, cb, cr;
};
inline Ycc to_ycc(int r, int g, int b) {
  return {(77 * r + 150 * g + 29 * b) >> 8, (-43 * r - 85 * g + 128 * b) >> 8, (128 * r - 107 * g - 21 * b) >> 8};
}

template <class Keep>
struct PointColour {
  Keep keep;
  uint32_t operator()(uint32_t p) const {
    int r, g, b;
    unpack(p, &r, &g, &b);
    const Ycc v = to_ycc(r, g, b);
    // Both results, then a select: the loop vectorises.
    const uint32_t grey = px_argb(p, v.y, v.y, v.y);
    const uint32_t colour =
        px_argb(p, px_clamp255(v.y + ((v.cr * 359) >> 8)), px_clamp255(v.y - ((88 * v.cb + 183 * v.cr) >> 8)),
                px_clamp255(v.y + ((v.cb * 454) >> 8)));
    return keep(v.cb, v.cr) ? colour : grey;
  }
};

// PointColour through the conversions of the tone adjustments' fast paths
// (16-bit with gcc, which then vectorises eight pixels to a register; the
// chroma of a colour is within their bounds).
template <class Keep>
struct PointColour16 {
  Keep keep;
  uint32_t operator()(uint32_t p) const {
    namespace t = px_tone;
    const t::Rgb c = t::unpack(p);
    const t::Ycc v = t::kYccIn16Bits ? t::to_ycc16(c) : t::to_ycc(c);
    return keep(v.cb, v.cr) ? (t::kYccIn16Bits ? t::from_ycc16(p, v) : t::from_ycc(p, v)) : px_argb(p, v.y, v.y, v.y);
  }
};

template <class Keep>
void point_colour(int* in, int* out, int width, int height, Keep keep) {
  if (!in || !out) return;
  if (px_scalar_only()) {
    px_map_pixels(in, out, width, height, PointColour<Keep>{keep});
  } else {
    px_map_pixels(in, out, width, height, PointColour16<Keep>{keep});
  }
}

// ---- colour tone -----------------------------------------------------------

// The tinted colour depends only on the pixel's value (its largest channel).
struct ColourTone {
  std::array<uint32_t, 256> rgb;
  uint32_t operator()(uint32_t p) const {
    uint32_t m = (p >> 16) & 255, g = (p >> 8) & 255, b = p & 255;
    if (g > m) m = g;
    if (b > m) m = b;
    return (p & 0xFF000000u) | rgb[m];
  }
};

}  // namespace

int px_control_hue(int* in, unsigned char* mask, int* out, int width, int height, int level, px_rect rect) {
  return rotate_hue(in, mask, out, width, height, static_cast<int>(static_cast<uint32_t>(level) * 18u), rect);
}

int px_control_hue_range100(int* in, unsigned char* mask, int* out, int width, int height, int level,
                            px_rect rect) {
  // Levels outside the scale take its nearest end rather than reading past
  // the table.
  const int i = level < 0 ? 0 : (level > 100 ? 100 : level);
  return rotate_hue(in, mask, out, width, height, LUT_HueValue_Range100[i], rect);
}

void px_adjust_RGB(int* in, unsigned char* mask, int* out, int width, int height, int red, int green, int blue,
                   px_rect rect) {
  px_region_map(in, mask, out, width, height, rect, balance_of(red, green, blue));
}

void px_adjust_RGB_range100(int* in, unsigned char* mask, int* out, int width, int height, int red, int green,
                            int blue, px_rect rect) {
  px_region_map(in, mask, out, width, height, rect, balance_of_range100(red, green, blue));
}

void px_adjust_RGB_all(int* in, int* out, int width, int height, int red, int green, int blue) {
  px_map_pixels(in, out, width, height, balance_of(red, green, blue));
}

void px_point_color_red(int* in, int* out, int width, int height) {
  point_colour(in, out, width, height, [](int cb, int cr) { return cr >= 1 && cb < 0 && cr >= -cb; });
}
void px_point_color_yellow(int* in, int* out, int width, int height) {
  point_colour(in, out, width, height, [](int cb, int cr) { return cr >= 1 && cb < 0 && cr <= -cb; });
}
void px_point_color_green(int* in, int* out, int width, int height) {
  point_colour(in, out, width, height, [](int cb, int cr) { return cb < 0 && cr < 0; });
}
void px_point_color_blue(int* in, int* out, int width, int height) {
  point_colour(in, out, width, height, [](int cb, int cr) { return cb >= 1 && cr < 0; });
}

int px_change_colortone(int* in, int* out, int width, int height, int hue) {
  if (!in || !out || hue > 360) return PX_ERR_NULL;
  if (height < 1) return PX_OK;
  ColourTone tone{};
  for (int v = 0; v < 256; ++v) {
    // v/2 + v^2/256: darker below 128, brighter above.
    int lifted = (50 * v + (v * v * 50) / 128) / 100;
    lifted = lifted > 255 ? 255 : lifted;
    int r, g, b;
    px_hsv2rgb(hue, 19660, lifted, &r, &g, &b);
    tone.rgb[v] = static_cast<uint32_t>(px_pack_rgb888(0, r, g, b));
  }
  px_map_pixels(in, out, width, height, tone);
  return PX_OK;
}
