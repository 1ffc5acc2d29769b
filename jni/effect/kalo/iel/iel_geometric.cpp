// Reflection, kaleidoscope and the circular mask of the effect library.
#include "../../px_math.h"
#include <cstdint>
#include <cstring>

#include "../if_utils_and.h"
#include "iel_artistic.h"
#include "iel_internal.h"
#include "iel_luma.h"

namespace {
bool argb_only(int format) { return format == IEL_FORMAT_ARGB_PACK; }

// The faded mirror rows of a 0xAARRGGBB picture.
void reflect_argb(const uint32_t* src, uint32_t* dst, int w, int h, int rh) {
  std::memcpy(dst, src, static_cast<size_t>(rh) * w * 4);
  const int span = h - rh;
  for (int i = 0; i < span; ++i) {
    const int f = 819 + (-819 * i / span);
    const uint32_t* s = src + static_cast<size_t>(rh - i) * w;
    uint32_t* d = dst + static_cast<size_t>(rh + i) * w;
    for (int x = 0; x < w; ++x) {
      const int r = (s[x] >> 16) & 255, g = (s[x] >> 8) & 255, b = s[x] & 255;
      const int y = IEL_Luma(r, g, b);
      const int delta = (y * f >> 10) - y;
      d[x] = 0xFF000000u | static_cast<uint32_t>(px_clamp255(r + delta)) << 16 |
             static_cast<uint32_t>(px_clamp255(g + delta)) << 8 | static_cast<uint32_t>(px_clamp255(b + delta));
    }
  }
}

// The planar layout: a full-size byte plane (brightness) followed by
// height / 2 rows of width bytes of subsampled colour. Brightness rows are
// mirrored and faded in steps of two rows; colour rows are mirrored as they
// are, so the colour differences stay while the brightness fades.
void reflect_planar(const unsigned char* src, unsigned char* dst, int w, int h, int rh) {
  const size_t plane = static_cast<size_t>(w) * h;
  std::memcpy(dst, src, plane + plane / 2);
  const int span = h - rh;
  for (int i = 0; i < span; ++i) {
    const int f = 819 + (-1638 * (i / 2) / span);
    const unsigned char* s = src + static_cast<size_t>(rh - i) * w;
    unsigned char* d = dst + static_cast<size_t>(rh + i) * w;
    for (int x = 0; x < w; ++x) d[x] = static_cast<unsigned char>(s[x] * f >> 10);
  }
  const unsigned char* cs = src + plane;
  unsigned char* cd = dst + plane;
  for (int cy = (rh + 1) / 2; cy < h / 2; ++cy) {
    std::memcpy(cd + static_cast<size_t>(cy) * w, cs + static_cast<size_t>(rh - cy) * w, w);
  }
}
}  // namespace

int IEL_ReflectionEffect(structIELImage* input, structIELImage* output, int reflectionHeight) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, nullptr)) return rc;
  const int h = input->height, w = input->width;
  if (!(reflectionHeight < h && h <= 2 * reflectionHeight)) {
    IF_ERROR("Invalid Reflection Height(%d) Height(%d) \n", reflectionHeight, h);
    return IEL_ERR_NULL;
  }
  if (input->format == IEL_FORMAT_ARGB_PACK) {
    reflect_argb(reinterpret_cast<const uint32_t*>(input->buffer), reinterpret_cast<uint32_t*>(output->buffer), w,
                 h, reflectionHeight);
  } else if (input->format == IEL_FORMAT_TYPE4) {
    if ((w & 1) || (h & 1)) {
      IF_ERROR("Failed with input image width= %d,input image height = %d", w, h);
      return IEL_ERR_DIMENSION;
    }
    reflect_planar(input->buffer, output->buffer, w, h, reflectionHeight);
  }
  // Any other format: nothing is written and the effect reports success.
  return IEL_OK;
}

// Sector mapping: the pattern's upper-left quarter (side S / 2) is symmetric
// about its diagonal. Row r, from the diagonal to the quarter's right edge,
// holds the source region sampled along a horizontal line whose start walks
// down the region's diagonal: quarter cell (r, c), c >= r, shows source
// (left + c * step, top + r * step) with step = region side / quarter side in
// 16.16, and cell (c, r) shows the same pixel. Mirroring that quarter
// downwards and then to the right gives eight triangles meeting in the
// centre with clean seams along the diagonals and the middle lines.
int IEL_TriMirrorKaliedoscope_ARGB888(structIELImage* input, structIELImage* output) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, argb_only)) return rc;
  const int w = input->width, h = input->height;
  const auto* src = reinterpret_cast<const uint32_t*>(input->buffer);
  auto* dst = reinterpret_cast<uint32_t*>(output->buffer);
  std::memset(dst, 0xFF, static_cast<size_t>(w) * h * 4);
  const int m = w < h ? w : h;
  const int side = m & ~3;
  const int half = side / 2;
  if (half == 0) return IEL_OK;
  const int x0 = ((w - m) / 2) & ~3;
  const int left = (w / 2 - m / 4) & ~3, top = (h / 2 - m / 4) & ~3;
  const int right = (w / 2 + m / 4) & ~3, bottom = (h / 2 + m / 4) & ~3;
  const int region = (right - left < bottom - top ? right - left : bottom - top);
  const int64_t step = region > 0 ? (static_cast<int64_t>(region) << 16) / half : 0;
  auto at = [&](int sx, int sy) {
    sx = sx > w - 1 ? w - 1 : sx;
    sy = sy > h - 1 ? h - 1 : sy;
    return src[static_cast<size_t>(sy) * w + sx];
  };
  // Pass 1: the quarter, each run written along its row and its column.
  for (int r = 0; r < half; ++r) {
    const int sy = top + static_cast<int>(r * step >> 16);
    for (int c = r; c < half; ++c) {
      const uint32_t p = at(left + static_cast<int>(c * step >> 16), sy);
      dst[static_cast<size_t>(r) * w + x0 + c] = p;
      dst[static_cast<size_t>(c) * w + x0 + r] = p;
    }
  }
  // Pass 2: upper half into the lower half, rows reversed.
  for (int r = 0; r < half; ++r) {
    std::memcpy(dst + static_cast<size_t>(side - 1 - r) * w + x0, dst + static_cast<size_t>(r) * w + x0,
                static_cast<size_t>(half) * 4);
  }
  // Pass 3: each row's left half into its right half, reversed.
  for (int r = 0; r < side; ++r) {
    uint32_t* row = dst + static_cast<size_t>(r) * w + x0;
    for (int c = 0; c < half; ++c) row[side - 1 - c] = row[c];
  }
  return IEL_OK;
}

int IEL_CreateCircularMask(structIELImage* image, int cx, int cy, int radius, structIELPixel inside,
                           structIELPixel outside) {
  if (int rc = IEL_CheckEffectImages(__func__, image, image, 1, 1, [](int f) {
        return f == IEL_FORMAT_RGB888 || f == IEL_FORMAT_ARGB_PACK;
      })) {
    return rc;
  }
  const int w = image->width, h = image->height;
  const int bpp = IEL_BytesPerPixel(image->format);
  for (int y = 0; y < h; ++y) {
    for (int x = 0; x < w; ++x) {
      const int64_t dx = x - cx, dy = y - cy;
      const int64_t d2 = dx * dx + dy * dy;
      const bool in = radius >= 0 && d2 <= 0xFFFFFFFFll && px_isqrt_floor(static_cast<uint64_t>(d2)) <= static_cast<uint64_t>(radius);
      const structIELPixel& p = in ? inside : outside;
      unsigned char* o = image->buffer + (static_cast<size_t>(y) * w + x) * bpp;
      if (bpp == 4) {
        const uint32_t v = static_cast<uint32_t>(p.a) << 24 | static_cast<uint32_t>(p.r) << 16 |
                           static_cast<uint32_t>(p.g) << 8 | p.b;
        std::memcpy(o, &v, 4);
      } else {
        o[0] = p.r, o[1] = p.g, o[2] = p.b;
      }
    }
  }
  return IEL_OK;
}
