// Portrait session, beautifier operations, lighting and out-focusing around
// the session's faces.
#include "px_portrait.h"

#include <cstdint>
#include <cstring>

#include "../blur/px_blur.h"
#include "../kalo/px_mem.h"
#include "../kalo/px_parallel.h"
#include "../px_color/px_brush.h"
#include "../px_types.h"
#include "../face/fd_detector.h"
#include "px_beautifier.h"

namespace {

int g_maxFaceCnt = 2;
int g_beautyLevel = 3;
int g_detectOption = 3;
FaceEngineInfo* g_FE = nullptr;
int g_PortraitModeStatus = 0;

constexpr int kBeautyModeSkin = 16;
constexpr int kPrecision = 1;

size_t pixels(int width, int height) { return static_cast<size_t>(width) * static_cast<size_t>(height); }
bool usable(const int* a, const int* b, int width, int height) { return a && b && width > 0 && height > 0; }

// A record initialised from the current settings and run on the photo; null
// when memory ran out.
// A new analysed record, or null when memory ran short anywhere in it (the
// record's own arrays, or a detector's buffers, which the detectors would
// otherwise skip quietly as "no face").
FaceEngineInfo* analyse(const int* argb, int width, int height) {
  caIF_SetBeautifier(Face_BeautifierRGB);
  const long failures = px_mem_failures();
  auto* fe = static_cast<FaceEngineInfo*>(px_calloc(1, sizeof(FaceEngineInfo)));
  if (!fe) return nullptr;
  const int mode = (g_detectOption >= 2 && g_detectOption <= 4) ? g_detectOption : 1;
  if (InitFaceBeautyPlus(fe, mode, g_maxFaceCnt, kPrecision, kBeautyModeSkin, g_beautyLevel, 0) &&
      px_mem_failures() == failures) {
    RunFaceAnalyzer(fe, argb, width, height);
    if (px_mem_failures() == failures) return fe;
  }
  ReleaseFaceBeautyPlus(fe);
  px_free(fe);
  return nullptr;
}

void release(FaceEngineInfo* fe) {
  if (!fe) return;
  ReleaseFaceBeautyPlus(fe);
  px_free(fe);
}

// Nearest-neighbour reduction with the Q12 step of the photo width. The step
// is held in 64 bits: a photo side of 2^19 or more over a one-pixel preview
// gives a step past the int range.
void reduce(const int* full, int width, int height, int* dst, int pw, int ph) {
  const int64_t step = static_cast<int64_t>(static_cast<float>(static_cast<int64_t>(width) << 12) / static_cast<float>(pw));
  for (int j = 0; j < ph; ++j) {
    const int64_t sy = (j * step) >> 12;
    if (sy >= height) break;
    for (int i = 0; i < pw; ++i) {
      const int64_t sx = (i * step) >> 12;
      if (sx >= width) break;
      dst[static_cast<size_t>(j) * pw + i] = full[static_cast<size_t>(sy) * width + sx];
    }
  }
}

// The photo positions a preview samples: preview column i shows photo column
// xs[i] for i < nx, row j photo row ys[j] for j < ny (the same Q12 step as
// reduce; preview pixels beyond nx or ny have no source).
struct Samples {
  int* xs = nullptr;
  int* ys = nullptr;
  int nx = 0, ny = 0;
  int64_t step = 0;
  bool take(int width, int height, int pw, int ph) {
    step = static_cast<int64_t>(static_cast<float>(static_cast<int64_t>(width) << 12) / static_cast<float>(pw));
    xs = static_cast<int*>(px_malloc(static_cast<size_t>(pw), sizeof(int)));
    ys = static_cast<int*>(px_malloc(static_cast<size_t>(ph), sizeof(int)));
    if (!xs || !ys) return false;
    while (nx < pw && ((nx * step) >> 12) < width) {
      xs[nx] = static_cast<int>((nx * step) >> 12);
      ++nx;
    }
    while (ny < ph && ((ny * step) >> 12) < height) {
      ys[ny] = static_cast<int>((ny * step) >> 12);
      ++ny;
    }
    return true;
  }
  ~Samples() {
    px_free(xs);
    px_free(ys);
  }
};

bool face_index_ok(int faceIndex) { return faceIndex >= 0 && faceIndex < g_FE->faceCount; }

// Whether every allocation since the failure count was `failures` went
// through: the beautifier and the out-focus blur skip their work quietly
// when their memory runs short, and the operations report it as ERR_ALLOC.
bool memory_held(long failures) { return px_mem_failures() == failures; }

// Beautifies all faces (faceIndex < 0) or one in `image`.
void beautify(int* image, int width, int height, int faceIndex) {
  caIF_SetBeautifier(Face_BeautifierRGB);
  if (faceIndex < 0) RunFaceBeautyPlus(g_FE, image, width, height);
  else RunFaceBeautyPlusSingleFace(g_FE, image, width, height, faceIndex);
}

int apply_beautifier(const int* src, int* dst, int width, int height, int level, int faceIndex, bool single) {
  if (!usable(src, dst, width, height)) return PX_ERR_NULL;
  if (level == 0) return PX_OK;
  if (level < 1 || level > 5 || !g_FE) return PX_ERR_NULL;
  g_FE->beautyLevel = level;
  if (g_FE->faceCount < 1 || (single && !face_index_ok(faceIndex))) return PX_OK;
  const long failures = px_mem_failures();
  std::memcpy(dst, src, pixels(width, height) * sizeof(int));
  beautify(dst, width, height, single ? faceIndex : -1);
  return memory_held(failures) ? PX_OK : PX_ERR_ALLOC;
}

// The beautifier seen through the preview: only the sampled pixels (and the
// faces' luminance sample points) are filtered, with the same result as
// reducing a beautified full-size copy.
int beautifier_preview(const int* src, int width, int height, int* dst, int pw, int ph, int level, int faceIndex,
                       bool single) {
  if (!usable(src, dst, width, height) || pw < 1 || ph < 1) return PX_ERR_NULL;
  if (level == 0) {
    reduce(src, width, height, dst, pw, ph);
    return PX_OK;
  }
  if (level < 1 || level > 5 || !g_FE) return PX_ERR_NULL;
  g_FE->beautyLevel = level;
  if (g_FE->faceCount < 1 || (single && !face_index_ok(faceIndex))) return PX_OK;
  const long failures = px_mem_failures();
  Samples s;
  if (!s.take(width, height, pw, ph)) return PX_ERR_ALLOC;
  // The faces the full form hands to the beautifier.
  const int first = single ? faceIndex : 0;
  int count = single ? 1 : g_FE->faceCount;
  if (count > kFdListSize) count = kFdListSize;
  const bool beautifies = (g_FE->beautyMode & 0xF0) != 0;
  if (!beautifies) {
    reduce(src, width, height, dst, pw, ph);
    return PX_OK;
  }
  // Written only when everything went through.
  int* out = static_cast<int*>(px_malloc(static_cast<size_t>(s.nx > 0 ? s.nx : 1) * (s.ny > 0 ? s.ny : 1), sizeof(int)));
  if (!out) return PX_ERR_ALLOC;
  const bool ok = Face_BeautifierRGB_At(src, height, width, g_FE->beautyLevel, g_FE->faceRect + first, count, s.xs,
                                        s.nx, s.ys, s.ny, out, s.nx) &&
                  memory_held(failures);
  if (ok)
    for (int j = 0; j < s.ny; ++j) std::memcpy(dst + static_cast<size_t>(j) * pw, out + static_cast<size_t>(j) * s.nx, s.nx * sizeof(int));
  px_free(out);
  return ok ? PX_OK : PX_ERR_ALLOC;
}

// Lighting of all faces (faceIndex < 0) or one, in place.
void light(int* image, int width, int height, int level, int faceIndex) {
  const int amount = 3 * level - 30;
  if (amount == 0) return;
  for (int i = 0; i < g_FE->faceCount; ++i) {
    if (faceIndex >= 0 && i != faceIndex) continue;
    const caFaceBox& f = g_FE->faceRect[i];
    const int cx = f.x + (f.width >> 1), cy = f.y + (f.height >> 1);
    const int reach = f.width > f.height ? f.width : f.height;
    if (amount > 0) px_apply_lighten(image, cx, cy, width, height, amount, reach);
    else px_apply_darken(image, cx, cy, width, height, -amount, reach);
  }
}

int light_full(const int* src, int* dst, int width, int height, int level, int faceIndex, bool single) {
  if (!usable(src, dst, width, height) || !g_FE) return PX_ERR_NULL;
  std::memcpy(dst, src, pixels(width, height) * sizeof(int));
  if (single && !face_index_ok(faceIndex)) return PX_OK;
  light(dst, width, height, level, single ? faceIndex : -1);
  return PX_OK;
}

// The brushes are per pixel: the preview reduces src and applies them to the
// sampled pixels only, with the same result as reducing a lit full-size copy.
int light_preview(const int* src, int width, int height, int* dst, int pw, int ph, int level, int faceIndex,
                  bool single) {
  if (!usable(src, dst, width, height) || pw < 1 || ph < 1 || !g_FE) return PX_ERR_NULL;
  if (level == 10) return PX_OK;
  Samples s;
  if (!s.take(width, height, pw, ph)) return PX_ERR_ALLOC;
  reduce(src, width, height, dst, pw, ph);
  // An index outside the faces leaves the plain copy, as the full form does.
  if (single && !face_index_ok(faceIndex)) return PX_OK;
  const int amount = 3 * level - 30;
  for (int i = 0; i < g_FE->faceCount; ++i) {
    if (single && i != faceIndex) continue;
    const caFaceBox& f = g_FE->faceRect[i];
    const int cx = f.x + (f.width >> 1), cy = f.y + (f.height >> 1);
    const int reach = f.width > f.height ? f.width : f.height;
    if (amount > 0) px_apply_lighten_at(dst, pw, s.xs, s.nx, s.ys, s.ny, cx, cy, amount, reach);
    else px_apply_darken_at(dst, pw, s.xs, s.nx, s.ys, s.ny, cx, cy, -amount, reach);
  }
  return PX_OK;
}

// Blurred photo (from `blur`) composed with the sharp one by the faces'
// weight map into `out`.
int outfocus_compose_faces(const int* src, const int* blurred, int* out, int width, int height) {
  unsigned char* map = static_cast<unsigned char*>(px_malloc(pixels(width, height), 1));
  if (!map) return PX_ERR_ALLOC;
  std::memset(map, 255, pixels(width, height));
  px_outfocus_weight_map(map, width, height, g_FE->faceRect, g_FE->faceCount);
  px_outfocus_compose(src, blurred, map, out, static_cast<int>(pixels(width, height)));
  px_free(map);
  return PX_OK;
}

inline void lower(unsigned char& m, int64_t v) {
  if (v < m) m = static_cast<unsigned char>(v < 0 ? 0 : v);
}

}  // namespace

// ---- settings and session ---------------------------------------------------------

void px_set_facebeauty(int maxFace, int level, int option) {
  g_maxFaceCnt = (maxFace >= 1 && maxFace <= 10) ? maxFace : 10;
  if (level >= 1 && level <= 5) g_beautyLevel = level;
  if (option >= 1 && option <= 4) g_detectOption = option;
}
int px_get_maxFaceCnt() { return g_maxFaceCnt; }
int px_get_beautyLevel() { return g_beautyLevel; }
int px_get_detectOption() { return g_detectOption; }
int px_get_portraitmode_status() { return g_PortraitModeStatus; }
const FaceEngineInfo* px_portrait_session() { return g_FE; }

FaceEngineInfo* px_init_portrait(int maxFace, int level, int option, const int* argb, int width, int height) {
  px_set_facebeauty(maxFace, level, option);
  if (!argb || width < 1 || height < 1) return nullptr;
  FaceEngineInfo* fe = analyse(argb, width, height);
  if (!fe) return nullptr;
  release(g_FE);  // a session still open is replaced, not leaked
  g_FE = fe;
  g_PortraitModeStatus = 1;
  return fe;
}

void px_finish_portrait() {
  if (!g_FE) return;
  release(g_FE);
  g_FE = nullptr;
  g_PortraitModeStatus = 0;
}

// ---- beautifier ----------------------------------------------------------------------

int px_apply_beautifier(const int* src, int* dst, int width, int height, int level) {
  return apply_beautifier(src, dst, width, height, level, -1, false);
}
int px_apply_beautifier_singleface(const int* src, int* dst, int width, int height, int level, int faceIndex) {
  return apply_beautifier(src, dst, width, height, level, faceIndex, true);
}
int px_apply_beautifier_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                int previewHeight, int level) {
  return beautifier_preview(src, width, height, dst, previewWidth, previewHeight, level, -1, false);
}
int px_apply_beautifier_singleface_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                           int previewHeight, int level, int faceIndex) {
  return beautifier_preview(src, width, height, dst, previewWidth, previewHeight, level, faceIndex, true);
}

const unsigned char kFallbackBrighten[256] = {
    0,   1,   2,   3,   4,   5,   6,   7,   8,   9,   10,  11,  12,  13,  14,  15,  16,  17,  18,  19,  20,  21,
    22,  23,  24,  25,  26,  27,  29,  30,  31,  32,  33,  34,  35,  36,  38,  39,  40,  41,  42,  43,  45,  46,
    47,  48,  49,  50,  52,  53,  54,  55,  56,  58,  59,  61,  62,  63,  65,  66,  67,  69,  70,  71,  73,  74,
    76,  77,  78,  79,  81,  82,  84,  85,  86,  88,  89,  90,  91,  93,  94,  95,  97,  98,  99,  100, 102, 103,
    104, 105, 107, 108, 109, 110, 112, 113, 114, 116, 117, 118, 119, 120, 121, 122, 123, 125, 126, 127, 128, 129,
    130, 131, 132, 133, 134, 135, 136, 138, 139, 140, 141, 142, 143, 144, 145, 146, 147, 148, 149, 150, 151, 152,
    153, 154, 155, 156, 157, 158, 159, 160, 161, 162, 163, 164, 165, 166, 167, 168, 169, 170, 171, 171, 172, 173,
    174, 175, 176, 177, 178, 178, 179, 180, 181, 182, 183, 184, 185, 186, 187, 188, 188, 189, 190, 191, 192, 193,
    194, 194, 195, 196, 197, 198, 199, 199, 200, 201, 202, 203, 204, 205, 205, 206, 207, 208, 209, 209, 210, 211,
    212, 213, 214, 214, 215, 216, 217, 218, 218, 219, 220, 221, 221, 222, 223, 224, 224, 225, 226, 227, 228, 229,
    229, 230, 231, 232, 232, 233, 234, 235, 235, 236, 237, 238, 238, 239, 240, 241, 241, 242, 243, 243, 244, 245,
    246, 246, 247, 248, 249, 249, 250, 251, 251, 252, 253, 254, 254, 255};

int px_facebeauty(const int* src, int* dst, int width, int height) {
  if (!usable(src, dst, width, height)) return PX_ERR_NULL;
  const size_t n = pixels(width, height);
  // The photo is analysed before it is copied, so that a shortage of memory
  // leaves dst as it was.
  FaceEngineInfo* fe = analyse(src, width, height);
  if (!fe) return PX_ERR_ALLOC;
  std::memcpy(dst, src, n * sizeof(int));
  const long failures = px_mem_failures();
  if (fe->faceCount > 0) {
    RunFaceBeautyPlus(fe, dst, width, height);
  } else {
    unsigned char lut[256];
    for (int c = 0; c < 256; ++c) {
      const int v = c + 2 * (kFallbackBrighten[c] - c);
      lut[c] = static_cast<unsigned char>(v > 255 ? 255 : (v < 0 ? 0 : v));
    }
    for (size_t i = 0; i < n; ++i) {
      const unsigned p = static_cast<unsigned>(dst[i]);
      dst[i] = static_cast<int>((p & 0xFF000000u) | static_cast<unsigned>(lut[(p >> 16) & 0xFF]) << 16 |
                                static_cast<unsigned>(lut[(p >> 8) & 0xFF]) << 8 | lut[p & 0xFF]);
    }
  }
  release(fe);
  return memory_held(failures) ? PX_OK : PX_ERR_ALLOC;
}

// ---- lighting ------------------------------------------------------------------------

int px_control_light_in_portrait(const int* src, int* dst, int width, int height, int level) {
  return light_full(src, dst, width, height, level, -1, false);
}
int px_control_light_in_portrait_singleface(const int* src, int* dst, int width, int height, int level,
                                            int faceIndex) {
  return light_full(src, dst, width, height, level, faceIndex, true);
}
int px_control_light_in_portrait_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                         int previewHeight, int level) {
  return light_preview(src, width, height, dst, previewWidth, previewHeight, level, -1, false);
}
int px_control_light_in_portrait_singleface_preview(const int* src, int width, int height, int* dst,
                                                    int previewWidth, int previewHeight, int level, int faceIndex) {
  return light_preview(src, width, height, dst, previewWidth, previewHeight, level, faceIndex, true);
}

// ---- out-focus -----------------------------------------------------------------------

void px_outfocus_weight_map(unsigned char* map, int width, int height, const caFaceBox* faces, int count) {
  if (!map || !faces) return;
  for (int f = 0; f < count; ++f) {
    const int64_t x = faces[f].x, y = faces[f].y, w = faces[f].width, h = faces[f].height;
    if (w <= 0 || h <= 0) continue;
    const int64_t a = (3 * h) >> 1, R = a + h;
    const int64_t cx = x + (w >> 1) < width - 1 ? x + (w >> 1) : width - 1;
    const int64_t cy = y + a < height - 1 ? y + a : height - 1;
    const int64_t a2 = a * a, R2 = R * R;
    const int64_t c0 = cx - R > 0 ? cx - R : 0, c1 = cx + R < width ? cx + R : width;  // [c0, c1)
    // Head: a disc of radius a, fading out to radius R, above the centre row.
    for (int64_t row = cy - R > 0 ? cy - R : 0; row < cy; ++row) {
      if (row >= height) break;
      unsigned char* line = map + row * width;
      for (int64_t col = c0; col < c1; ++col) {
        const int64_t dy = cy - row, dx = cx - col, d2 = dy * dy + dx * dx;
        if (d2 >= R2) continue;
        int64_t v = 0;
        if (d2 > a2) {
          v = 255 * (d2 - a2) / (R2 - a2);
          if (v > 255) v = 255;
        }
        lower(line[col], v);
      }
    }
    // Body: from the centre row down, sharp within a of the centre column,
    // ramping out to R.
    for (int64_t row = cy < 0 ? 0 : cy; row < height; ++row) {
      unsigned char* line = map + row * width;
      const int64_t l1 = cx - a < width ? cx - a : width;  // left ramp [c0, cx - a)
      for (int64_t col = c0; col < l1; ++col) lower(line[col], (cx - a - col) * 255 / h);
      const int64_t m0 = cx - a > 0 ? cx - a : 0, m1 = cx + a < width ? cx + a : width;
      for (int64_t col = m0; col < m1; ++col) line[col] = 0;
      for (int64_t col = cx + a > 0 ? cx + a : 0; col < c1; ++col) lower(line[col], (col - cx - a) * 255 / h);
    }
  }
}

void px_outfocus_compose(const int* sharp, const int* blurred, const unsigned char* map, int* dst, int n) {
  // Runs of 16384 pixels on the row-band workers; every pixel stands alone
  // (dst may be blurred or sharp itself).
  constexpr int kRun = 1 << 14;
  px_for_rows(
      (n + kRun - 1) / kRun,
      [&](int r0, int r1) {
        const int end = static_cast<int64_t>(r1) * kRun < n ? r1 * kRun : n;
        for (int i = r0 * kRun; i < end; ++i) {
          const int m = map[i];
          if (m == 255) {
            dst[i] = blurred[i];
            continue;
          }
          const unsigned b = static_cast<unsigned>(blurred[i]), s = static_cast<unsigned>(sharp[i]);
          unsigned out = 0xFF000000u;  // mixed pixels are opaque
          for (int shift = 0; shift <= 16; shift += 8) {
            unsigned v = (m * ((b >> shift) & 0xFF) + (255 - m) * ((s >> shift) & 0xFF)) >> 8;
            if (v > 255) v = 255;
            out |= v << shift;
          }
          dst[i] = static_cast<int>(out);
        }
      },
      4);
}

int px_control_outfocusing_in_portrait(const int* src, int* dst, int width, int height, int strength) {
  if (!usable(src, dst, width, height) || !g_FE) return PX_ERR_NULL;
  if (strength == 0) return PX_OK;
  if (strength < 0) return PX_ERR_EFFECT;
  const size_t n = pixels(width, height);
  int* blurred = static_cast<int*>(px_malloc(n, sizeof(int)));
  unsigned char* ones = static_cast<unsigned char*>(px_malloc(n, 1));
  int rc = PX_ERR_ALLOC;
  if (blurred && ones) {
    std::memset(ones, 1, n);
    rc = px_make_blur(src, ones, blurred, width, height, strength, 0, width - 1, 0, height - 1);
    if (rc == PX_OK) rc = outfocus_compose_faces(src, blurred, dst, width, height);
  }
  px_free(ones);
  px_free(blurred);
  return rc;
}

int px_control_outfocusing_in_portrait_preview(const int* src, int width, int height, int* dst, int previewWidth,
                                               int previewHeight, int strength) {
  if (!usable(src, dst, width, height) || previewWidth < 1 || previewHeight < 1 || !g_FE) return PX_ERR_NULL;
  if (strength < 0) return PX_ERR_EFFECT;
  // Reduce first, then out-focus the reduced photo: the blur radius and the
  // faces are scaled by the preview's step.
  const long failures = px_mem_failures();
  Samples s;
  if (!s.take(width, height, previewWidth, previewHeight)) return PX_ERR_ALLOC;
  if (s.nx < 1 || s.ny < 1) return PX_OK;  // no preview pixel has a source
  const size_t n = pixels(s.nx, s.ny);
  int* small = static_cast<int*>(px_malloc(n, sizeof(int)));
  int* blurred = static_cast<int*>(px_malloc(n, sizeof(int)));
  const int faces = g_FE->faceCount;
  caFaceBox* scaled = static_cast<caFaceBox*>(px_malloc(static_cast<size_t>(faces > 0 ? faces : 1), sizeof(caFaceBox)));
  unsigned char* map = static_cast<unsigned char*>(px_malloc(n, 1));
  int rc = PX_ERR_ALLOC;
  if (small && blurred && scaled && map) {
    for (int j = 0; j < s.ny; ++j)
      for (int i = 0; i < s.nx; ++i)
        small[static_cast<size_t>(j) * s.nx + i] = src[static_cast<size_t>(s.ys[j]) * width + s.xs[i]];
    // A preview more than 4096 times the photo's width has a step of 0:
    // taken as the smallest step there is.
    const int64_t step = s.step > 0 ? s.step : 1;
    const int64_t radius = ((static_cast<int64_t>(px_blur_outfocus_radius(strength)) << 12) + step / 2) / step;
    rc = px_blur_variable(small, blurred, s.nx, s.ny, radius < 1 ? 1 : static_cast<int>(radius)) == 0 ? PX_OK
                                                                                                       : PX_ERR_EFFECT;
    if (rc == PX_OK && !memory_held(failures)) rc = PX_ERR_ALLOC;  // nothing was blurred
    if (rc == PX_OK) {
      auto to_preview = [step](int32_t v) { return static_cast<int32_t>((static_cast<int64_t>(v) << 12) / step); };
      for (int f = 0; f < faces; ++f) {
        const caFaceBox& b = g_FE->faceRect[f];
        scaled[f] = {to_preview(b.x), to_preview(b.y), to_preview(b.width), to_preview(b.height)};
      }
      std::memset(map, 255, n);
      px_outfocus_weight_map(map, s.nx, s.ny, scaled, faces);
      px_outfocus_compose(small, blurred, map, blurred, static_cast<int>(n));
      for (int j = 0; j < s.ny; ++j)
        std::memcpy(dst + static_cast<size_t>(j) * previewWidth, blurred + static_cast<size_t>(j) * s.nx,
                    static_cast<size_t>(s.nx) * sizeof(int));
    }
  }
  px_free(map);
  px_free(scaled);
  px_free(blurred);
  px_free(small);
  return rc;
}
