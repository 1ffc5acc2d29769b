// Sepia and variable brightness.
#include "../../px_math.h"
#include <cstdint>
#include <cstring>

#include "iel_effects.h"
#include "iel_internal.h"
#include "iel_luma.h"

namespace {
}  // namespace

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
  const long long count = static_cast<long long>(input->width) * input->height;
  const int ceiling = 255 - level / 2;
  const unsigned char* src = input->buffer;
  unsigned char* dst = output->buffer;
  progress.start(static_cast<uint32_t>(input->height));
  for (long long i = 0; i < count; ++i, src += bpp, dst += bpp) {
    int r, g, b;
    uint16_t word = 0;
    if (bpp == 2) {
      std::memcpy(&word, src, 2);
      r = (word & 0xF800) >> 8;
      g = (word & 0x07E0) >> 3;
      b = (word << 3) & 0xF8;
    } else {
      r = src[0], g = src[1], b = src[2];
    }
    int y = IEL_Luma(r, g, b) & 255;
    y = y < level ? level : (y > ceiling ? ceiling : y);
    int rr = y + 16 > 255 ? 255 : y + 16;
    int gg = y - 3 < 0 ? 0 : y - 3;
    int bb = y - 34 < 0 ? 0 : y - 34;
    if (bpp == 2) {
      word = static_cast<uint16_t>((rr & 0xF8) << 8 | (gg & 0xFC) << 3 | bb >> 3);
      std::memcpy(dst, &word, 2);
    } else {
      dst[0] = static_cast<unsigned char>(rr);
      dst[1] = static_cast<unsigned char>(gg);
      dst[2] = static_cast<unsigned char>(bb);
    }
  }
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
  const long long count = static_cast<long long>(input->width) * input->height;
  const auto* src = reinterpret_cast<const uint32_t*>(input->buffer);
  auto* dst = reinterpret_cast<uint32_t*>(output->buffer);
  for (long long i = 0; i < count; ++i) {
    uint32_t p = src[i];
    dst[i] = (p & 0xFF000000u) | table[(p >> 16) & 255] << 16 | table[(p >> 8) & 255] << 8 | table[p & 255];
  }
  return IEL_OK;
}
