// Sepia and variable brightness.
#include "../../px_math.h"
#include <cstdint>
#include <cstring>

#include "iel_effects.h"
#include "iel_internal.h"
#include "iel_luma.h"
#include "../px_parallel.h"

int IEL_SepiaFast(structIELImage* input, structIELImage* output, int level) {
  IELProgressScope progress;
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, nullptr)) return rc;
  if (level > 99) {
    level = 50;
  } else if (level < 1) {
    level = 0;
  } else if (level > 50) {
    level = 50;
  }
  const int bpp = IEL_BytesPerPixel(input->format);
  const size_t width = static_cast<size_t>(input->width);
  const int ceiling = 255 - level / 2;
  // The tone of each luma, once per call.
  uint8_t tone[256][3];
  for (int v = 0; v < 256; ++v) {
    const int y = v < level ? level : (v > ceiling ? ceiling : v);
    tone[v][0] = static_cast<uint8_t>(y + 16 > 255 ? 255 : y + 16);
    tone[v][1] = static_cast<uint8_t>(y - 3 < 0 ? 0 : y - 3);
    tone[v][2] = static_cast<uint8_t>(y - 34 < 0 ? 0 : y - 34);
  }
  const unsigned char* in = input->buffer;
  unsigned char* out = output->buffer;
  progress.start(static_cast<uint32_t>(input->height));
  px_for_rows(input->height, [&](int y0, int y1) {
    const size_t i0 = static_cast<size_t>(y0) * width, i1 = static_cast<size_t>(y1) * width;
    if (bpp == 2) {
      for (size_t i = i0; i < i1; ++i) {
        uint16_t word = 0;
        std::memcpy(&word, in + 2 * i, 2);
        const uint8_t* t = tone[IEL_Luma((word & 0xF800) >> 8, (word & 0x07E0) >> 3, (word << 3) & 0xF8) & 255];
        word = static_cast<uint16_t>((t[0] & 0xF8) << 8 | (t[1] & 0xFC) << 3 | t[2] >> 3);
        std::memcpy(out + 2 * i, &word, 2);
      }
      return;
    }
    const unsigned char* src = in + i0 * bpp;
    unsigned char* dst = out + i0 * bpp;
    if (bpp == 3 && !px_scalar_only()) {
      // Packed RGB with the stride a constant: some 1.5 times faster.
      for (size_t i = i0; i < i1; ++i, src += 3, dst += 3) {
        const uint8_t* t = tone[IEL_Luma(src[0], src[1], src[2]) & 255];
        dst[0] = t[0];
        dst[1] = t[1];
        dst[2] = t[2];
      }
      return;
    }
    for (size_t i = i0; i < i1; ++i, src += bpp, dst += bpp) {
      const uint8_t* t = tone[IEL_Luma(src[0], src[1], src[2]) & 255];
      dst[0] = t[0];
      dst[1] = t[1];
      dst[2] = t[2];
    }
  });
  progress.advance(static_cast<uint32_t>(input->height));
  return IEL_OK;
}

int IEL_VariableBrightness_ARGB8888(structIELImage* input, structIELImage* output, int level) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1,
                                     [](int f) { return f == IEL_FORMAT_ARGB_PACK; })) {
    return rc;
  }
  uint32_t table[256];
  for (int i = 0; i < 256; ++i) table[i] = static_cast<uint32_t>(px_clamp255(i + level));
  const auto* src = reinterpret_cast<const uint32_t*>(input->buffer);
  auto* dst = reinterpret_cast<uint32_t*>(output->buffer);
  const size_t w = static_cast<size_t>(input->width);
  px_for_rows(input->height, [&](int y0, int y1) {
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; ++i) {
      const uint32_t p = src[i];
      dst[i] = (p & 0xFF000000u) | table[(p >> 16) & 255] << 16 | table[(p >> 8) & 255] << 8 | table[p & 255];
    }
  });
  return IEL_OK;
}
