// Skin beautifier: enlarged face boxes, sampled luminance with integral
// histograms, a range-weighted local mean of the luminance per tile, faded
// by the distance from the face centre, and the colour rebuilt from the
// pixel's own chroma.
#include "px_beautifier.h"

#include <cstdlib>
#include <cstring>

#include "../kalo/px_mem.h"

namespace {

// exp(-t) for t >= 0 at compile time: halve t until small, Taylor series,
// square back.
constexpr double exp_neg(double t) {
  int halvings = 0;
  while (t > 0.125) {
    t /= 2;
    ++halvings;
  }
  double term = 1, sum = 1;
  for (int n = 1; n < 30; ++n) {
    term *= -t / n;
    sum += term;
  }
  for (int i = 0; i < halvings; ++i) sum *= sum;
  return sum;
}

struct Kernels {
  int32_t k[4][511];
};

// Kernels 0 and 2 are the Gaussians of sigma 5.1 and 10.2. Kernels 1 and 3
// are filled with the Gaussians of sigma 7.65 and 12.75 (5.1 times 1.5 and
// 2.5), which give the required 948, 436, 34 and 996, 753, 299 at the
// differences 3, 10 and 20; so the four widen in even steps.
constexpr Kernels make_kernels() {
  Kernels t{};
  const double sigma[4] = {5.1, 7.65, 10.2, 12.75};
  for (int k = 0; k < 4; ++k)
    for (int d = -255; d <= 255; ++d) {
      const double v = 1024.0 * exp_neg(static_cast<double>(d) * d / (2 * sigma[k] * sigma[k]));
      const int r = static_cast<int>(v + 0.5);
      t.k[k][d + 255] = r < 1 ? 1 : r;
    }
  return t;
}
constexpr Kernels kKernels = make_kernels();

// 8192 / k for k = 1..400, 8192 at index 0 (Q13 reciprocals).
struct Reciprocals {
  int v[401];
};
constexpr Reciprocals make_reciprocals() {
  Reciprocals r{};
  r.v[0] = 8192;
  for (int k = 1; k <= 400; ++k) r.v[k] = 8192 / k;
  return r;
}
constexpr Reciprocals kReciprocal = make_reciprocals();

inline int luma(int p) {
  return (307 * ((p >> 16) & 0xFF) + 601 * ((p >> 8) & 0xFF) + 117 * (p & 0xFF)) >> 10;
}

// The working geometry of one enlarged box; `ok` false when the box is not
// filtered (empty, sampling above 400, no distance weight).
struct BoxPlan {
  int x0, y0, w, h;
  int sampling, wmin, sw, sh;
  bool ok;
};

BoxPlan plan_of(const caFaceBox& box, int strength) {
  BoxPlan p{box.x, box.y, box.width, box.height, 0, 0, 0, 0, false};
  if (p.w < 1 || p.h < 1 || strength < 0) return p;
  p.sampling = ((kReciprocal.v[200] * p.w) >> 13) + 1;
  if (p.sampling > 400) return p;
  p.wmin = DistanceWeightBase(p.w, p.h);
  if (p.wmin <= 0) return p;
  p.sw = (p.w + p.sampling - 1) / p.sampling;
  p.sh = (p.h + p.sampling - 1) / p.sampling;
  p.ok = true;
  return p;
}

// The whole photo, in place.
struct FullView {
  int* argb;
  int width;
  int& at(int x, int y) const { return argb[static_cast<size_t>(y) * width + x]; }
  // fn(pixel, x, y) for every pixel of [x0, x1) x [y0, y1).
  template <class Fn>
  void each(int x0, int x1, int y0, int y1, Fn fn) const {
    for (int y = y0; y < y1; ++y)
      for (int x = x0; x < x1; ++x) fn(argb[static_cast<size_t>(y) * width + x], x, y);
  }
};

// A grid of photo pixels: columns cols[0..nx) and rows rows[0..ny), both
// increasing; before[x] counts the grid columns left of photo column x
// (width + 1 entries), so a grid column x has index before[x]; the same
// for rows.
struct GridView {
  int* g;
  int nx;
  const int* cols;
  const int* rows;
  const int* beforeCol;
  const int* beforeRow;
  int& at(int x, int y) const { return g[static_cast<size_t>(beforeRow[y]) * nx + beforeCol[x]]; }
  template <class Fn>
  void each(int x0, int x1, int y0, int y1, Fn fn) const {
    for (int r = beforeRow[y0]; r < beforeRow[y1]; ++r)
      for (int c = beforeCol[x0]; c < beforeCol[x1]; ++c) fn(g[static_cast<size_t>(r) * nx + c], cols[c], rows[r]);
  }
};

// One enlarged box: the sampled luminance bins of the whole box are taken
// before anything is written, so the result does not depend on the block
// layout; blocks of at most MAXW x MAXH pixels then bound the memory of the
// integral histograms (each block's histograms reach 2 * radius beyond it).
// Every pixel's result depends only on its own value and the histograms, so
// a grid that holds the box's sample points gives the photo's result at the
// grid's pixels.
template <class View>
void DoFilterRGB(const View& view, const BoxPlan& plan, int strength, int radius) {
  if (!plan.ok) return;
  const int x0 = plan.x0, y0 = plan.y0, w = plan.w, h = plan.h;
  const int sampling = plan.sampling, wmin = plan.wmin, sw = plan.sw, sh = plan.sh;
  const int32_t* K = kKernels.k[strength / 511 > 3 ? 3 : strength / 511];

  // getY_sampling: the binned luminance of every sampling-th pixel.
  unsigned char* bins = static_cast<unsigned char*>(px_malloc(static_cast<size_t>(sw) * sh, 1));
  if (!bins) return;
  for (int j = 0; j < sh; ++j)
    for (int i = 0; i < sw; ++i)
      bins[static_cast<size_t>(j) * sw + i] =
          static_cast<unsigned char>(luma(view.at(x0 + i * sampling, y0 + j * sampling)) >> 3);

  // Window of a tile in samples: i - eL .. i + eR.
  const int border = 2 * radius;
  const int eL = border / sampling, eR = (sampling - 1 + border) / sampling;
  // DivBlockRGB: blocks of whole tiles.
  const int bw = MAXW / sampling > 0 ? MAXW / sampling : 1, bh = MAXH / sampling > 0 ? MAXH / sampling : 1;
  const int cx = x0 + w / 2, cy = y0 + h / 2;

  for (int bj0 = 0; bj0 < sh; bj0 += bh)
    for (int bi0 = 0; bi0 < sw; bi0 += bw) {
      const int bj1 = bj0 + bh < sh ? bj0 + bh : sh, bi1 = bi0 + bw < sw ? bi0 + bw : sw;
      // GetIntegral_hist over the block's samples plus the border.
      const int gi0 = bi0 - eL < 0 ? 0 : bi0 - eL, gj0 = bj0 - eL < 0 ? 0 : bj0 - eL;
      const int gi1 = bi1 + eR < sw ? bi1 + eR : sw, gj1 = bj1 + eR < sh ? bj1 + eR : sh;
      const int gw = gi1 - gi0 + 1, gh = gj1 - gj0 + 1;
      int32_t* integral =
          static_cast<int32_t*>(px_calloc(static_cast<size_t>(gw) * gh * kBeautyBins, sizeof(int32_t)));
      if (!integral) break;
      auto I = [&](int i, int j) { return integral + (static_cast<size_t>(j) * gw + i) * kBeautyBins; };
      for (int j = 1; j < gh; ++j) {
        int32_t row[kBeautyBins] = {};
        for (int i = 1; i < gw; ++i) {
          ++row[bins[static_cast<size_t>(gj0 + j - 1) * sw + gi0 + i - 1]];
          int32_t* dst = I(i, j);
          const int32_t* up = I(i, j - 1);
          for (int k = 0; k < kBeautyBins; ++k) dst[k] = up[k] + row[k];
        }
      }

      // FilterRGB, tile by tile.
      for (int tj = bj0; tj < bj1; ++tj)
        for (int ti = bi0; ti < bi1; ++ti) {
          const int a0 = (ti - eL < 0 ? 0 : ti - eL) - gi0, a1 = (ti + eR + 1 < sw ? ti + eR + 1 : sw) - gi0;
          const int b0 = (tj - eL < 0 ? 0 : tj - eL) - gj0, b1 = (tj + eR + 1 < sh ? tj + eR + 1 : sh) - gj0;
          int64_t hist[kBeautyBins];
          const int32_t *p11 = I(a1, b1), *p01 = I(a0, b1), *p10 = I(a1, b0), *p00 = I(a0, b0);
          for (int k = 0; k < kBeautyBins; ++k) hist[k] = p11[k] - p01[k] - p10[k] + p00[k];
          const int px0 = x0 + ti * sampling, py0 = y0 + tj * sampling;
          const int px1 = px0 + sampling < x0 + w ? px0 + sampling : x0 + w;
          const int py1 = py0 + sampling < y0 + h ? py0 + sampling : y0 + h;
          view.each(px0, px1, py0, py1, [&](int& pixel, int px, int py) {
            const int R = (pixel >> 16) & 0xFF, G = (pixel >> 8) & 0xFF, B = pixel & 0xFF;
            if (!IsSkin(R, G, B)) return;
            const int weight = DistanceWeight(px - cx, py - cy, w, h, wmin);
            const int Y = (307 * R + 601 * G + 117 * B) >> 10;
            int Yn = Y;  // weight 0: the local mean does not matter
            if (weight > 0) {
              int64_t num = 0, den = 0;
              for (int k = 0; k < kBeautyBins; ++k) {
                if (!hist[k]) continue;
                const int64_t c = hist[k] * K[Y - (k << 3) + 255];
                num += static_cast<int64_t>(k << 3) * c;
                den += c;
              }
              const int newY = static_cast<int>(num / den);
              Yn = (Y + (((newY - Y) * weight) >> 8)) & 255;
            }
            const int Cb = ((-173 * R - 339 * G + 512 * B + 131072) >> 10) - 128;
            const int Cr = ((512 * R - 429 * G - 83 * B + 131072) >> 10) - 128;
            auto clip = [](int v) { return v > 254 ? 255 : (v < 0 ? 0 : v); };
            const int r2 = clip((1024 * Yn + 1404 * Cr) >> 10);
            const int g2 = clip((1024 * Yn - 715 * Cr - 344 * Cb) >> 10);
            const int b2 = clip((1024 * Yn + 1774 * Cb) >> 10);
            pixel = static_cast<int>((static_cast<unsigned>(pixel) & 0xFF000000u) |
                                     static_cast<unsigned>(r2 << 16 | g2 << 8 | b2));
          });
        }
      px_free(integral);
    }
  px_free(bins);
}

// Enlarged boxes and the level's strength and radius; null when memory ran
// out.
caFaceBox* enlarged_boxes(const caFaceBox* faces, int count, int width, int height, int level, int* strength,
                          int* radius) {
  caFaceBox* boxes = static_cast<caFaceBox*>(px_malloc(static_cast<size_t>(count), sizeof(caFaceBox)));
  if (!boxes) return nullptr;
  std::memcpy(boxes, faces, static_cast<size_t>(count) * sizeof(caFaceBox));
  NewFaceBox(boxes, count, width, height, 2);
  // The first face's box sets the radius for every face.
  SetVar(level, boxes[0].width, strength, radius);
  return boxes;
}

// Marks the positions v0, v0 + step, ... (n of them) in `mark`.
void mark_steps(unsigned char* mark, int v0, int step, int n) {
  for (int k = 0; k < n; ++k) mark[v0 + k * step] = 1;
}

// before[v] = marks left of v (n + 1 entries); list = the marked positions.
// Returns the count.
int index_marks(const unsigned char* mark, int n, int* before, int* list) {
  int count = 0;
  for (int v = 0; v < n; ++v) {
    before[v] = count;
    if (mark[v]) list[count++] = v;
  }
  before[n] = count;
  return count;
}

}  // namespace

void NewFaceBox(caFaceBox* boxes, int count, int width, int height, int mode) {
  if (!boxes || count < 1) return;
  if (mode == 3) {
    boxes[0] = caFaceBox{0, 0, width, height};
    return;
  }
  if (mode != 2) return;
  for (int i = 0; i < count; ++i) {
    caFaceBox& b = boxes[i];
    const int nw = static_cast<int16_t>((14 * b.width) / 10);
    const int nh = static_cast<int16_t>((14 * nw) / 10);
    const int dx = (nw - b.width) / 2, dy = std::abs(nh - b.height) / 2;
    b.x -= dx;
    b.y -= dy;
    b.width += 2 * dx;
    b.height += 2 * dy;
    if (b.x < 0) b.x = 0;
    if (b.width > width - 1 - b.x) b.width = width - 1 - b.x;
    if (b.y < 0) b.y = 0;
    if (b.height > height - 1 - b.y) b.height = height - 1 - b.y;
  }
}

void SetVar(int level, int firstBoxWidth, int* strength, int* radius) {
  int base = firstBoxWidth / 52;
  if (base < 1) base = 1;
  *radius = 0;
  if (level < 1 || level > 5) {
    *strength = -1;
    return;
  }
  static constexpr int kStrength[5] = {0, 511, 1022, 1533, 1533};
  *strength = kStrength[level - 1];
  *radius = level == 5 ? (3 * base + 1) >> 1 : base;
}

bool IsSkin(int r, int g, int b) {
  const int cb = (152 * r - 298 * g + 450 * b + 131072) >> 10;
  const int cr = (450 * r - 377 * g - 73 * b + 131072) >> 10;
  return cr >= 140 && cr <= 165 && cb >= 140 && cb <= 195;
}

const int32_t* RangeLUT1024(int kernel) { return kKernels.k[kernel < 0 ? 0 : (kernel > 3 ? 3 : kernel)]; }

int DistanceWeightBase(int w, int h) {
  const int64_t dim = static_cast<int64_t>(w) * h;
  if (dim <= 0) return 0;
  const int64_t half = w / 2;
  return static_cast<int>((7 * ((half * half << 8) / dim)) >> 3);
}

int DistanceWeight(int dx, int dy, int w, int h, int wmin) {
  const int64_t dim = static_cast<int64_t>(w) * h;
  if (dim <= 0 || wmin <= 0) return 0;
  const int64_t d = ((static_cast<int64_t>(dx) * dx + static_cast<int64_t>(dy) * dy) << 8) / dim;
  const int64_t v = ((wmin - ((7 * d) >> 3)) << 8) / wmin;
  return v > 0 ? static_cast<int>(v) : 0;
}

void Face_BeautifierRGB(int* argb, int height, int width, int level, const caFaceBox* faces, int count) {
  if (!argb || !faces || count < 1 || width < 1 || height < 1) return;
  int strength, radius;
  caFaceBox* boxes = enlarged_boxes(faces, count, width, height, level, &strength, &radius);
  if (!boxes) return;
  if (strength >= 0)
    for (int i = 0; i < count; ++i) DoFilterRGB(FullView{argb, width}, plan_of(boxes[i], strength), strength, radius);
  px_free(boxes);
}

bool Face_BeautifierRGB_At(const int* argb, int height, int width, int level, const caFaceBox* faces, int count,
                           const int* xs, int nx, const int* ys, int ny, int* out, int stride) {
  if (!argb || !out || !xs || !ys || nx < 1 || ny < 1 || width < 1 || height < 1) return true;
  int strength = -1, radius = 0;
  caFaceBox* boxes = nullptr;
  if (faces && count > 0) {
    boxes = enlarged_boxes(faces, count, width, height, level, &strength, &radius);
    if (!boxes) return false;
  }
  // The grid: the wanted pixels and every filtered box's sample points.
  const size_t w = static_cast<size_t>(width), h = static_cast<size_t>(height);
  unsigned char* markCol = static_cast<unsigned char*>(px_calloc(w + h, 1));
  int* index = static_cast<int*>(px_malloc(2 * (w + h) + 2, sizeof(int)));
  int* grid = nullptr;
  bool done = false;
  if (markCol && index) {
    unsigned char* markRow = markCol + w;
    int* beforeCol = index;
    int* beforeRow = beforeCol + w + 1;
    int* cols = beforeRow + h + 1;
    int* rows = cols + w;
    for (int i = 0; i < nx; ++i) markCol[xs[i]] = 1;
    for (int j = 0; j < ny; ++j) markRow[ys[j]] = 1;
    for (int b = 0; strength >= 0 && b < count; ++b) {
      const BoxPlan p = plan_of(boxes[b], strength);
      if (!p.ok) continue;
      mark_steps(markCol, p.x0, p.sampling, p.sw);
      mark_steps(markRow, p.y0, p.sampling, p.sh);
    }
    const int gx = index_marks(markCol, width, beforeCol, cols);
    const int gy = index_marks(markRow, height, beforeRow, rows);
    grid = static_cast<int*>(px_malloc(static_cast<size_t>(gx) * static_cast<size_t>(gy), sizeof(int)));
    if (grid) {
      for (int r = 0; r < gy; ++r)
        for (int c = 0; c < gx; ++c) grid[static_cast<size_t>(r) * gx + c] = argb[rows[r] * w + cols[c]];
      const GridView view{grid, gx, cols, rows, beforeCol, beforeRow};
      for (int b = 0; strength >= 0 && b < count; ++b) DoFilterRGB(view, plan_of(boxes[b], strength), strength, radius);
      for (int j = 0; j < ny; ++j)
        for (int i = 0; i < nx; ++i) out[static_cast<size_t>(j) * stride + i] = view.at(xs[i], ys[j]);
      done = true;
    }
  }
  px_free(grid);
  px_free(index);
  px_free(markCol);
  px_free(boxes);
  return done;
}
