// Vintage: a warm, faded film look from three channel curves.
#include "../../px_math.h"
#include <cmath>
#include <cstdint>

#include "../if_utils_and.h"
#include "../px_parallel.h"
#include "iel_artistic.h"
#include "iel_internal.h"

namespace {
int round_half(double v) { return static_cast<int>(v + 0.5); }
// 255 * (v / 255)^e, rounded.
int power(int v, double e) { return round_half(255.0 * std::pow(v / 255.0, e)); }

// The tail shared by the three curves: stretch away from mid-grey, a slight
// lift, rescale, the curve's gain, then a strong brightening power.
int chain(int x, int gain) {
  int y = x + 2 * IEL_StepTable[x];
  if (x < 128) {
    y = y > 127 ? 126 : px_clamp255(1145 * ((y < 0 ? 0 : y) - 15) >> 10);
  } else {
    y = y > 254 ? 255 : px_clamp255(1145 * ((y < 128 ? 128 : y) - 15) >> 10);
  }
  int v = power(y, 0.970873786407767);
  v = (955 * v >> 10) - 49;
  v = px_clamp255(v * gain >> 10);
  return power(v, 0.425531914893617);
}
}  // namespace

// Which curve drives which channel, and the end of the chain: the chain's
// result s is mixed one part to two with the branch value x it started from
// (each branch is lifted by 20, the flattest by 65 in the shadows), which
// keeps the lifted, faded blacks and softens the chain's crushed shadows.
// The flat, lifted third curve (gain 887) drives red, giving warm brown
// shadows and warm mid-tones; the second (gain 843) drives green; the first,
// whose shadows are crushed longest (gain 1267), drives blue, so the shadows
// lean to yellow; blue is finally held at or below green, which keeps the
// highlights warm as well. White becomes a faded (240, 238, 238). No vignette: the
// look is a pure per-pixel curve, so it behaves the same on crops.
void IEL_Vintage_Curves(uint8_t red[256], uint8_t green[256], uint8_t blue[256]) {
  for (int i = 0; i < 256; ++i) {
    const int v = px_clamp255(power(i, 1.2987012987012987));
    const int lifted = (1150 * (v - 28)) >> 10;
    int a = power(lifted < 0 ? 0 : lifted, 0.9174311926605504) + 20;
    a = a > 255 ? 255 : a;
    int b = power(v, 0.9433962264150942) + 20;
    b = b > 255 ? 255 : b;
    int c = (power(v, 0.8695652173913044) * 843 >> 10) + 45;
    c = (c < 0 ? 0 : c) + 20;
    c = c > 255 ? 255 : c;
    green[i] = static_cast<uint8_t>((chain(b, 843) + 2 * b) / 3);
    const int bl = (chain(a, 1267) + 2 * a) / 3;
    blue[i] = static_cast<uint8_t>(bl < green[i] ? bl : green[i]);
    red[i] = static_cast<uint8_t>((chain(c, 887) + 2 * c) / 3);
  }
}

int IEL_Vintage_ARGB_Pack(const uint32_t* input, uint32_t* output, int width, int height) {
  if (!input || !output) {
    IF_ERROR("Failed with input image buffer = %d,output image buffer = %d", input ? 1 : 0, output ? 1 : 0);
    return IEL_ERR_NULL;
  }
  if (width < 1 || height < 1) {
    IF_ERROR("Failed with input image width= %d,input image height = %d", width, height);
    return IEL_ERR_DIMENSION;
  }
  uint8_t r[256], g[256], b[256];
  IEL_Vintage_Curves(r, g, b);
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; ++i) {
      const uint32_t p = input[i];
      output[i] = (p & 0xFF000000u) | static_cast<uint32_t>(r[(p >> 16) & 255]) << 16 |
                  static_cast<uint32_t>(g[(p >> 8) & 255]) << 8 | b[p & 255];
    }
  });
  return IEL_OK;
}
