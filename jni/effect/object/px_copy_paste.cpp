#include "px_copy_paste.h"

#include <cstdint>
#include <cstring>

#include "../px_color/px_fixed.h"

namespace {
constexpr int kNeighbours[8][2] = {{-1, -1}, {-1, 0}, {-1, 1}, {0, -1}, {0, 1}, {1, -1}, {1, 0}, {1, 1}};

struct Means {
  int64_t r = 0, g = 0, b = 0;
};

// Per-channel 16.16 gains that move the object's chromaticity to the
// target's: gain = (targetChroma << 8) / (objectChroma >> 8). Where a
// division would be by zero (all means zero, or an object channel whose
// chromaticity is below 1/256) that channel keeps its colour: gain 1.0.
void gains(int oR, int oG, int oB, int tR, int tG, int tB, int32_t gain[3]) {
  gain[0] = gain[1] = gain[2] = 65536;
  const int os = oR + oG + oB, ts = tR + tG + tB;
  if (os <= 0 || ts <= 0) return;
  const int o[3] = {oR, oG, oB}, t[3] = {tR, tG, tB};
  for (int c = 0; c < 3; ++c) {
    const int32_t oc = itofix(o[c]) / os;
    const int32_t tc = itofix(t[c]) / ts;
    if ((oc >> 8) != 0) gain[c] = (tc << 8) / (oc >> 8);
  }
}

// min(fixtoi(gain * channel), 255), in 64 bits so a large gain saturates
// instead of wrapping.
int scaled(int32_t gain, int channel) {
  const int64_t x = static_cast<int64_t>(gain) * channel;
  const int64_t v = (x >> 16) + ((x >> 15) & 1);
  return v > 255 ? 255 : v < 0 ? 0 : static_cast<int>(v);
}

int recolour(int argb, const int32_t gain[3]) {
  const int r = scaled(gain[0], (argb >> 16) & 255);
  const int g = scaled(gain[1], (argb >> 8) & 255);
  const int b = scaled(gain[2], argb & 255);
  return static_cast<int>((static_cast<uint32_t>(argb) & 0xFF000000u) | (static_cast<uint32_t>(r) << 16) |
                          (static_cast<uint32_t>(g) << 8) | static_cast<uint32_t>(b));
}

void picture_means(const int* p, int n, int* r, int* g, int* b) {
  int64_t sr = 0, sg = 0, sb = 0;
  for (int i = 0; i < n; ++i) {
    sr += (p[i] >> 16) & 255;
    sg += (p[i] >> 8) & 255;
    sb += p[i] & 255;
  }
  const int64_t c = n > 0 ? n : 1;
  *r = static_cast<int>(sr / c);
  *g = static_cast<int>(sg / c);
  *b = static_cast<int>(sb / c);
}

int channel_distance(int a, int b) {
  int d = 0;
  for (int s = 0; s <= 16; s += 8) {
    const int x = ((a >> s) & 255) - ((b >> s) & 255);
    d += x < 0 ? -x : x;
  }
  return d;
}

// (a + k * b) >> shift per channel, with the alpha of `alpha`.
int mix(int a, int b, int k, int shift, int alpha) {
  uint32_t out = static_cast<uint32_t>(alpha) & 0xFF000000u;
  for (int s = 0; s <= 16; s += 8) {
    const int v = (((a >> s) & 255) + k * ((b >> s) & 255)) >> shift;
    out |= static_cast<uint32_t>(v) << s;
  }
  return static_cast<int>(out);
}
}  // namespace

void px_set_paste_object(unsigned char* mask, int width, int height, px_rect rect, int iterations) {
  if (!mask || width <= 0 || height <= 0 || px_rect_empty(rect)) return;
  const px_rect r = px_rect_clip(rect, width, height);
  if (px_rect_empty(r)) return;
  for (int it = 0; it < iterations; ++it) {
    for (int y = r.top; y <= r.bottom; ++y) {
      for (int x = r.left; x <= r.right; ++x) {
        if (mask[y * width + x] != 0) continue;
        int ones = 0;
        for (const auto& d : kNeighbours) {
          const int yy = y + d[0], xx = x + d[1];
          if (yy >= 0 && yy < height && xx >= 0 && xx < width && mask[yy * width + xx] == 1) ++ones;
        }
        if (ones > 3) mask[y * width + x] = 2;
      }
    }
    for (int y = r.top; y <= r.bottom; ++y) {
      for (int x = r.left; x <= r.right; ++x) {
        if (mask[y * width + x] == 2) mask[y * width + x] = 1;
      }
    }
  }
}

void px_object_means(const int* object, const unsigned char* mask, int width, int height, int* meanR, int* meanG,
                     int* meanB) {
  int64_t sr = 0, sg = 0, sb = 0, n = 0;
  for (int i = 0; i < width * height; ++i) {
    if (mask[i] == 0) continue;
    sr += (object[i] >> 16) & 255;
    sg += (object[i] >> 8) & 255;
    sb += object[i] & 255;
    ++n;
  }
  if (n == 0) n = 1;
  *meanR = static_cast<int>(sr / n);
  *meanG = static_cast<int>(sg / n);
  *meanB = static_cast<int>(sb / n);
}

void px_copy_object(int* object, const unsigned char* mask, int width, int height, const int* target,
                    int targetWidth, int targetHeight) {
  if (!object || !mask || !target || width <= 0 || height <= 0 || targetWidth <= 0 || targetHeight <= 0) return;
  int oR, oG, oB, tR, tG, tB;
  px_object_means(object, mask, width, height, &oR, &oG, &oB);
  picture_means(target, targetWidth * targetHeight, &tR, &tG, &tB);
  int32_t gain[3];
  gains(oR, oG, oB, tR, tG, tB, gain);
  for (int i = 0; i < width * height; ++i) {
    if (mask[i] == 1) object[i] = recolour(object[i], gain);
  }
}

void px_copy_paste_fixed(const int* object, const int* picture, const unsigned char* mask, int* dst, int objWidth,
                         int objHeight, int width, int height, int left, int /*right*/, int top, int /*bottom*/,
                         int meanR, int meanG, int meanB) {
  if (!object || !picture || !mask || !dst || width <= 0 || height <= 0 || objWidth <= 0 || objHeight <= 0) return;
  std::memcpy(dst, picture, static_cast<size_t>(width) * height * sizeof(int));
  int tR, tG, tB;
  picture_means(picture, width * height, &tR, &tG, &tB);
  int32_t gain[3];
  gains(meanR, meanG, meanB, tR, tG, tB, gain);
  for (int i = 0; i < objHeight; ++i) {
    const int y = top + i;
    if (y < 0 || y >= height) continue;
    for (int j = 0; j < objWidth; ++j) {
      const int x = left + j;
      const int o = object[i * objWidth + j];
      if (x < 0 || x >= width || mask[i * objWidth + j] != 1 || (static_cast<uint32_t>(o) >> 24) == 0) continue;
      const int q = recolour(o, gain);
      const int b = picture[y * width + x];
      bool border = false, blended = false;
      for (const auto& d : kNeighbours) {
        const int ii = i + d[0], jj = j + d[1];
        if (ii < 0 || ii >= objHeight || jj < 0 || jj >= objWidth) continue;
        const unsigned char m = mask[ii * objWidth + jj];
        if (m != 2 && m != 3) continue;
        border = true;
        if (channel_distance(q, object[ii * objWidth + jj]) < 50) {
          blended = true;
          break;
        }
      }
      int out = q;
      if (blended) {
        out = mix(q, b, 7, 3, o);
      } else if (border) {
        out = mix(q, b, 1, 1, o);
      }
      dst[y * width + x] = out;
    }
  }
}

void px_paste_object(const int* object, const int* background, const unsigned char* mask, int* dst, int objWidth,
                     int objHeight, int width, int height, int left, int /*right*/, int top) {
  if (!object || !background || !mask || !dst || width <= 0 || height <= 0) return;
  std::memcpy(dst, background, static_cast<size_t>(width) * height * sizeof(int));
  for (int i = 0; i < objHeight; ++i) {
    const int y = top + i;
    if (y < 0 || y >= height) continue;
    for (int j = 0; j < objWidth; ++j) {
      const int x = left + j;
      const int o = object[i * objWidth + j];
      if (x < 0 || x >= width || mask[i * objWidth + j] != 1 || static_cast<uint32_t>(o) <= 0xFFFFFFu) continue;
      dst[y * width + x] = o;
    }
  }
}

int drawObject(int* dst, int dstWidth, int dstHeight, const int* src, int srcWidth, int srcHeight, float scale,
               px_rect rect) {
  if (!dst || !src || dstWidth <= 0 || dstHeight <= 0 || srcWidth <= 0 || srcHeight <= 0 || !(scale > 0.0f)) {
    return 0;
  }
  const float l = static_cast<float>(rect.left > 0 ? rect.left : 0);
  const float r = static_cast<float>(rect.right < srcWidth - 1 ? rect.right : srcWidth - 1);
  const float t = static_cast<float>(rect.top > 0 ? rect.top : 0);
  const float b = static_cast<float>(rect.bottom < srcHeight - 1 ? rect.bottom : srcHeight - 1);
  // Float to int conversions of out-of-range values are undefined: clamp
  // in float first.
  auto to_int = [](float v) { return v >= 2.0e9f ? 2000000000 : v <= -2.0e9f ? -2000000000 : static_cast<int>(v); };
  int x0 = to_int(l / scale + 0.5f), x1 = to_int(r / scale + 0.5f);
  int y0 = to_int(t / scale + 0.5f), y1 = to_int(b / scale + 0.5f);
  if (x1 > srcWidth - 1) x1 = srcWidth - 1;
  if (y1 > srcHeight - 1) y1 = srcHeight - 1;
  if (x0 < 0) x0 = 0;
  if (y0 < 0) y0 = 0;
  for (int y = y0; y <= y1 && y < dstHeight; ++y) {
    const int sy = to_int(static_cast<float>(y) * scale);
    if (sy < 0 || sy >= srcHeight) continue;
    for (int x = x0; x < x1 && x < dstWidth; ++x) {
      const int sx = to_int(static_cast<float>(x) * scale);
      if (sx < 0 || sx >= srcWidth) continue;
      dst[y * dstWidth + x] = src[sy * srcWidth + sx];
    }
  }
  return 0;
}
