#include "sm_image.h"

#include <cstring>

#include "effect/kalo/px_mem.h"
#include "effect/kalo/px_parallel.h"

void smInitByteImage(caByteImage* image) {
  if (image) *image = caByteImage{0, 0, 0, nullptr};
}

int smAllocByteImage(caByteImage* image, int width, int height, int channels) {
  if (!image) return 0;
  smInitByteImage(image);
  if (width < 1 || height < 1 || channels < 1) return 0;
  size_t n = static_cast<size_t>(width) * height * channels;
  auto* data = static_cast<unsigned char*>(px_calloc(n, 1));
  if (!data) return 0;
  *image = caByteImage{width, height, channels, data};
  return 1;
}

int smCloneByteImage(caByteImage* dst, const caByteImage* src) {
  if (!src || !src->data || !smAllocByteImage(dst, src->width, src->height, src->channels)) return 0;
  std::memcpy(dst->data, src->data, static_cast<size_t>(src->width) * src->height * src->channels);
  return 1;
}

int smCropImage(const caByteImage* src, caByteImage* dst, SMyRect2 r) {
  if (!src || !src->data) return 0;
  if (r.left < 0) r.left = 0;
  if (r.top < 0) r.top = 0;
  if (r.right > src->width) r.right = src->width;
  if (r.bottom > src->height) r.bottom = src->height;
  if (r.right <= r.left || r.bottom <= r.top) return 0;
  int w = r.right - r.left, h = r.bottom - r.top, c = src->channels;
  if (!smAllocByteImage(dst, w, h, c)) return 0;
  for (int y = 0; y < h; ++y)
    std::memcpy(dst->data + static_cast<size_t>(y) * w * c,
                src->data + (static_cast<size_t>(r.top + y) * src->width + r.left) * c, static_cast<size_t>(w) * c);
  return 1;
}

int smResize(const caByteImage* src, caByteImage* dst, int width, int height) {
  if (!src || !src->data || !smAllocByteImage(dst, width, height, src->channels)) return 0;
  int c = src->channels;
  int64_t sx = (static_cast<int64_t>(src->width) << 15) / width;
  int64_t sy = (static_cast<int64_t>(src->height) << 15) / height;
  int64_t ay = 0;
  for (int y = 0; y < height; ++y, ay += sy) {
    const unsigned char* row = src->data + static_cast<size_t>(ay >> 15) * src->width * c;
    int64_t ax = 0;
    for (int x = 0; x < width; ++x, ax += sx)
      std::memcpy(dst->data + (static_cast<size_t>(y) * width + x) * c, row + (ax >> 15) * c, c);
  }
  return 1;
}

int smColorToGray(const caByteImage* src, caByteImage* dst) {
  if (!src || !src->data || src->channels != 3 || !smAllocByteImage(dst, src->width, src->height, 1)) return 0;
  size_t n = static_cast<size_t>(src->width) * src->height;
  for (size_t i = 0; i < n; ++i)
    dst->data[i] = static_cast<unsigned char>((src->data[3 * i] + src->data[3 * i + 1] + src->data[3 * i + 2]) / 3);
  return 1;
}

void smThresholdImage(caByteImage* image, int threshold) {
  if (!image || !image->data) return;
  size_t n = static_cast<size_t>(image->width) * image->height * image->channels;
  for (size_t i = 0; i < n; ++i) image->data[i] = image->data[i] > threshold ? 255 : 0;
}

void smReleaseByteImage(caByteImage* image) {
  if (!image) return;
  px_free(image->data);
  smInitByteImage(image);
}

caByteImage* smCreateByteImage() {
  auto* image = static_cast<caByteImage*>(px_calloc(1, sizeof(caByteImage)));
  return image;
}

void smFreeByteImage(caByteImage** image) {
  if (!image || !*image) return;
  smReleaseByteImage(*image);
  px_free(*image);
  *image = nullptr;
}

// The Q15 step products are taken in 64 bits so that very large pictures
// cannot wrap; for every size below 65536 the result is the 32-bit one.
void Resize_NN(const unsigned char* src, int sw, int sh, unsigned char* dst, int dw, int dh) {
  if (!src || !dst || sw < 1 || sh < 1 || dw < 1 || dh < 1) return;
  int64_t sx = (static_cast<int64_t>(sw) << 15) / dw, sy = (static_cast<int64_t>(sh) << 15) / dh;
  int64_t ay = 0;
  for (int y = 0; y < dh; ++y, ay += sy) {
    const unsigned char* row = src + static_cast<size_t>(ay >> 15) * sw;
    unsigned char* out = dst + static_cast<size_t>(y) * dw;
    int64_t ax = 0;
    for (int x = 0; x < dw; ++x, ax += sx) out[x] = row[ax >> 15];
  }
}

void Resize_NN_Color2Gray(const int* argb, int sw, int sh, unsigned char* dst, int dw, int dh) {
  if (!argb || !dst || sw < 1 || sh < 1 || dw < 1 || dh < 1) return;
  int64_t sx = (static_cast<int64_t>(sw) << 15) / dw, sy = (static_cast<int64_t>(sh) << 15) / dh;
  int64_t ay = 0;
  for (int y = 0; y < dh; ++y, ay += sy) {
    const int* row = argb + static_cast<size_t>(ay >> 15) * sw;
    unsigned char* out = dst + static_cast<size_t>(y) * dw;
    int64_t ax = 0;
    for (int x = 0; x < dw; ++x, ax += sx) {
      uint32_t p = static_cast<uint32_t>(row[ax >> 15]);
      out[x] = static_cast<unsigned char>((((p >> 16) & 255) + ((p >> 8) & 255) + (p & 255)) / 3);
    }
  }
}

void Resize_BI(const unsigned char* src, int sw, int sh, unsigned char* dst, int dw, int dh) {
  if (!src || !dst || sw < 1 || sh < 1 || dw < 1 || dh < 1) return;
  for (int y = 0; y < dh; ++y) {
    int64_t fy8 = (static_cast<int64_t>(y) * sh << 8) / dh;
    int y0 = static_cast<int>(fy8 >> 8), wy = static_cast<int>(fy8 & 255);
    int y1 = y0 + 1 < sh ? y0 + 1 : sh - 1;
    const unsigned char* r0 = src + static_cast<size_t>(y0) * sw;
    const unsigned char* r1 = src + static_cast<size_t>(y1) * sw;
    for (int x = 0; x < dw; ++x) {
      int64_t fx8 = (static_cast<int64_t>(x) * sw << 8) / dw;
      int x0 = static_cast<int>(fx8 >> 8), wx = static_cast<int>(fx8 & 255);
      int x1 = x0 + 1 < sw ? x0 + 1 : sw - 1;
      int top = r0[x0] * (256 - wx) + r0[x1] * wx;
      int bottom = r1[x0] * (256 - wx) + r1[x1] * wx;
      dst[static_cast<size_t>(y) * dw + x] = static_cast<unsigned char>((top * (256 - wy) + bottom * wy + 32768) >> 16);
    }
  }
}

void FlipX(unsigned char* image, int width, int height) {
  if (!image) return;
  for (int y = 0; y < height; ++y) {
    unsigned char* row = image + static_cast<size_t>(y) * width;
    for (int a = 0, b = width - 1; a < b; ++a, --b) {
      unsigned char t = row[a];
      row[a] = row[b];
      row[b] = t;
    }
  }
}

namespace {
// Code of the block centred on flat index i, written the plain way.
unsigned short mct_code(const unsigned char* g, ptrdiff_t w, ptrdiff_t i) {
  const unsigned char* a = g + i - w - 1;
  const unsigned char* b = g + i - 1;
  const unsigned char* c = g + i + w - 1;
  int p[9] = {a[0], a[1], a[2], b[0], b[1], b[2], c[0], c[1], c[2]};
  int s = p[0] + p[1] + p[2] + p[3] + p[4] + p[5] + p[6] + p[7] + p[8];
  unsigned code = 0;
  for (int k = 0; k < 9; ++k)
    if (9 * p[k] > s) code |= 1u << k;
  return static_cast<unsigned short>(code);
}

// Codes of kMctBlock neighbouring centres from flat index i on. The loop has
// a fixed length and no branches, so the compiler turns it into vector code
// (eight or sixteen 16-bit lanes); the results are those of mct_code.
constexpr int kMctBlock = 16;
void mct_block(const unsigned char* g, ptrdiff_t w, ptrdiff_t i, unsigned short* out) {
  const unsigned char* a = g + i - w - 1;
  const unsigned char* b = g + i - 1;
  const unsigned char* c = g + i + w - 1;
  unsigned short code[kMctBlock];
  for (int k = 0; k < kMctBlock; ++k) {
    const int p0 = a[k], p1 = a[k + 1], p2 = a[k + 2];
    const int p3 = b[k], p4 = b[k + 1], p5 = b[k + 2];
    const int p6 = c[k], p7 = c[k + 1], p8 = c[k + 2];
    const int s = p0 + p1 + p2 + p3 + p4 + p5 + p6 + p7 + p8;
    code[k] = static_cast<unsigned short>((9 * p0 > s) | (9 * p1 > s) << 1 | (9 * p2 > s) << 2 | (9 * p3 > s) << 3 |
                                          (9 * p4 > s) << 4 | (9 * p5 > s) << 5 | (9 * p6 > s) << 6 |
                                          (9 * p7 > s) << 7 | (9 * p8 > s) << 8);
  }
  std::memcpy(out, code, sizeof code);
}
}  // namespace

void image2MCT_FD_rows(const unsigned char* g, int width, int height, int row0, int row1, unsigned short* mct) {
  if (!g || !mct || width < 3 || height < 3) return;
  const ptrdiff_t w = width;
  const ptrdiff_t first = w + 1, end = w * (height - 1) - 1;  // centres first .. end - 1
  ptrdiff_t i = static_cast<ptrdiff_t>(row0) * w, stop = static_cast<ptrdiff_t>(row1) * w;
  if (i < first) i = first;
  if (stop > end) stop = end;
  for (; i + kMctBlock <= stop; i += kMctBlock) mct_block(g, w, i, mct + i);
  for (; i < stop; ++i) mct[i] = mct_code(g, w, i);
}

void image2MCT_FD(const unsigned char* g, int width, int height, unsigned short* mct) {
  if (!g || !mct || width < 3 || height < 3) return;
  if (!px_scalar_only()) {
    image2MCT_FD_rows(g, width, height, 0, height, mct);
    return;
  }
  const ptrdiff_t w = width;
  const ptrdiff_t end = w * (height - 1) - 1;  // last index written is end - 1
  for (ptrdiff_t i = w + 1; i < end; ++i) mct[i] = mct_code(g, w, i);
}

void image2MCT9_1(const unsigned char* grey, int width, int height, unsigned short* mct) {
  image2MCT_FD(grey, width, height, mct);
}
