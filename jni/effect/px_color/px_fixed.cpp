#include "px_fixed.h"

#include <climits>

#include "../px_math.h"
#include "px_fixed_tables.h"

int fix_errno = 0;

namespace {
// 32-bit wrapping arithmetic, as the target's int does.
constexpr int32_t wrap_add(int32_t a, int32_t b) {
  return static_cast<int32_t>(static_cast<uint32_t>(a) + static_cast<uint32_t>(b));
}
constexpr int32_t wrap_sub(int32_t a, int32_t b) {
  return static_cast<int32_t>(static_cast<uint32_t>(a) - static_cast<uint32_t>(b));
}
constexpr int32_t wrap_mul(int32_t a, int32_t b) {
  return static_cast<int32_t>(static_cast<uint32_t>(a) * static_cast<uint32_t>(b));
}
// Truncating division that wraps INT_MIN / -1 instead of trapping.
constexpr int32_t div_trunc(int32_t a, int32_t b) { return (a == INT_MIN && b == -1) ? INT_MIN : a / b; }
constexpr int32_t mod_trunc(int32_t a, int32_t b) { return b == -1 ? 0 : a % b; }

fixed saturate(bool negative) {
  fix_errno = PX_FIX_ERANGE;
  return negative ? PX_FIX_MIN : PX_FIX_MAX;
}
}  // namespace

int fixceil(fixed x) {
  if (x >= 0x7FFF0001) {
    fix_errno = PX_FIX_ERANGE;
    return 32767;
  }
  return fixfloor(x + 0xFFFF);
}

fixed ftofix(double d) {
  if (d > 32767.0) return saturate(false);
  if (d < -32767.0) return saturate(true);
  return static_cast<fixed>(d * 65536.0 + (d < 0 ? -0.5 : 0.5));
}

fixed fixadd(fixed x, fixed y) {
  fixed s = wrap_add(x, y);
  if (x > 0 && y > 0 && s < 0) return saturate(false);
  if (x < 0 && y < 0 && s >= 0) return saturate(true);
  return s;
}

fixed fixsub(fixed x, fixed y) {
  fixed d = wrap_sub(x, y);
  if (d < 0 && x > 0 && y < 0) return saturate(false);
  if (d >= 0 && x < 0 && y > 0) return saturate(true);
  return d;
}

fixed fixmul(fixed x, fixed y) { return ftofix(fixtof(x) * fixtof(y)); }

fixed fixdiv(fixed x, fixed y) {
  if (x == 0) return 0;
  if (y == 0) return saturate(x < 0);
  return div_trunc(static_cast<int32_t>(static_cast<uint32_t>(x) << 16), y);
}

fixed fixcos(fixed angle) { return px_cos_table[(wrap_add(angle, 0x4000) >> 15) & 511]; }
fixed fixsin(fixed angle) { return px_cos_table[(wrap_sub(angle, 0x3FC000) >> 15) & 511]; }
fixed fixtan(fixed angle) { return px_tan_table[(wrap_add(angle, 0x4000) >> 15) & 255]; }

fixed fixacos(fixed x) {
  if (x < -65536 || x > 65536) {
    fix_errno = PX_FIX_EDOM;
    return 0;
  }
  return px_acos_table[(x + 0x1007F) >> 8];
}

fixed fixasin(fixed x) {
  if (x < -65536 || x > 65536) {
    fix_errno = PX_FIX_EDOM;
    return 0;
  }
  return 0x400000 - px_acos_table[(x + 0x1007F) >> 8];
}

fixed fixatan(fixed x) {
  int lo = x >= 0 ? 0 : 128;
  int hi = x >= 0 ? 127 : 255;
  int mid = 0;
  do {
    mid = (lo + hi) >> 1;
    fixed d = wrap_sub(x, px_tan_table[mid]);
    if (d > 0) {
      lo = mid + 1;
    } else if (d < 0) {
      hi = mid - 1;
    } else {
      break;
    }
  } while (lo <= hi);
  return x >= 0 ? mid << 15 : (mid << 15) - 0x800000;
}

fixed fixatan2(fixed y, fixed x) {
  if (x == 0) {
    if (y == 0) {
      fix_errno = PX_FIX_EDOM;
      return 0;
    }
    return y >= 0 ? 0x400000 : -0x400000;
  }
  fix_errno = 0;
  fixed q = fixdiv(y, x);
  if (fix_errno) {
    fix_errno = 0;
    return y >= 0 ? 0x400000 : -0x400000;
  }
  fixed a = fixatan(q);
  if (x > 0) return a;
  return y >= 0 ? a + 0x800000 : a - 0x800000;
}

int idiv(int a, int b) {
  if (a == 0) return 0;
  if (b == 0) return saturate(a < 0);
  int q = div_trunc(a, b);
  int r = mod_trunc(a, b);
  if (r < 0) r = -r;
  int step = r >= (b >> 1) ? 1 : 0;
  if (wrap_mul(a, b) < 0) step = -step;
  return wrap_add(q, step);
}

int iidiv(int a, int b) {
  if (a == 0) return 0;
  if (b == 0) return saturate(a < 0);
  int q = div_trunc(a, b);
  return wrap_mul(a, b) < 0 ? wrap_sub(q, 1) : q;
}

int isqrt_(int x) {
  if (x <= 0) return 0;
  // The floor root, then rounded to nearest: + 1 when the remainder exceeds it.
  const uint32_t root = static_cast<uint32_t>(px_isqrt_floor(static_cast<uint64_t>(x)));
  const uint32_t rem = static_cast<uint32_t>(x) - root * root;
  return static_cast<int>(rem > root ? root + 1 : root);
}

void px_rgb2hsv(int r, int g, int b, int* h, int* s, int* v) {
  int max = r > g ? r : g;
  if (b > max) max = b;
  int min = r < g ? r : g;
  if (b < min) min = b;
  *v = max;
  if (max == 0) {
    *h = *s = *v = 0;
    return;
  }
  *s = static_cast<int>(LUT_DELTA[max & 255] * static_cast<uint32_t>(max - min));
  if (*s == 0) {
    *h = 0;
    return;
  }
  // k <= 60 * 65536 and |channel difference| <= 255: fits 32 bits.
  int k = static_cast<int>(LUT_DELTA2[(max - min) & 255]);
  fixed hf;
  if (r == max) {
    hf = k * (g - b);
  } else if (g == max) {
    hf = itofix(120) + k * (b - r);
  } else {
    hf = itofix(240) + k * (r - g);
  }
  if (hf < 0) hf += itofix(360);
  *h = fixtoi(hf);
}

void px_hsv2rgb(int h, fixed s, int v, int* r, int* g, int* b) {
  if (s == 0) {
    int c = h >= 0 ? v : 0;
    *r = *g = *b = c;
    return;
  }
  int sector = 0, f = 0;
  if (h != 360) {
    int t = wrap_mul(h, 1092);  // 65536 / 60, truncated
    sector = t >> 16;
    f = t - (sector << 16);
  }
  int p = fixtoi(wrap_mul(v, 65536 - s));
  int q = fixtoi(wrap_mul(v, 65536 - (((s >> 4) * (f >> 4)) >> 8)));
  int u = fixtoi(wrap_mul(v, 65536 - (((s >> 4) * ((65536 - f) >> 4)) >> 8)));
  switch (sector) {
    case 0: *r = v, *g = u, *b = p; break;
    case 1: *r = q, *g = v, *b = p; break;
    case 2: *r = p, *g = v, *b = u; break;
    case 3: *r = p, *g = q, *b = v; break;
    case 4: *r = u, *g = p, *b = v; break;
    case 5: *r = v, *g = p, *b = q; break;
    default: *r = *g = *b = 0; break;
  }
}
