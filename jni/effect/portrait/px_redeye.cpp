// Red-eye removal: colour-ratio marking, one-pass labelling of the marks,
// the largest area widened by one pixel, and the red replaced by a mix of
// the pixel's channels.
#include "px_redeye.h"

#include <cstdint>
#include <cstring>

#include "../kalo/px_mem.h"

namespace {

inline int red(int p) { return (p >> 16) & 0xFF; }
inline int green(int p) { return (p >> 8) & 0xFF; }
inline int blue(int p) { return p & 0xFF; }

// R / G in single precision, or R itself when G is 0.
inline float ratio_of(int r, int g) { return g == 0 ? static_cast<float>(r) : static_cast<float>(r) / g; }

// The touched square clipped to the photo; false when nothing of it is inside.
bool region(int width, int height, int x, int y, int radius, int* left, int* top, int* w, int* h) {
  if (width < 1 || height < 1 || radius < 0) return false;
  const long long l = static_cast<long long>(x) - radius, t = static_cast<long long>(y) - radius;
  const long long r = static_cast<long long>(x) + radius, b = static_cast<long long>(y) + radius;
  const long long L = l < 0 ? 0 : l, T = t < 0 ? 0 : t;
  const long long R = r < width ? r : width - 1, B = b < height ? b : height - 1;
  if (R < L || B < T) return false;
  *left = static_cast<int>(L);
  *top = static_cast<int>(T);
  *w = static_cast<int>(R - L + 1);
  *h = static_cast<int>(B - T + 1);
  return true;
}

// Equivalent labels are merged into classes named by their lowest label:
// the classes a full equivalence matrix resolves to, without its
// (labels + 1)^2 memory.
int find_root(int* parent, int a) {
  while (parent[a] != a) {
    parent[a] = parent[parent[a]];
    a = parent[a];
  }
  return a;
}
void join(int* parent, int a, int b) {
  a = find_root(parent, a);
  b = find_root(parent, b);
  if (a < b) parent[b] = a;
  else if (b < a) parent[a] = b;
}

}  // namespace

int px_remove_redeye_manual(int* argb, int width, int height, int x, int y, int radius) {
  if (!argb) return 0;
  int left, top, W, H;
  if (!region(width, height, x, y, radius, &left, &top, &W, &H)) return 0;
  auto at = [&](int r, int c) -> int& { return argb[static_cast<size_t>(top + r) * width + (left + c)]; };

  // 1. Largest ratio (as an integer) and the largest red of the reddish pixels.
  int maxRatio = 0, maxRed = 0;
  for (int r = 0; r < H; ++r)
    for (int c = 0; c < W; ++c) {
      const int p = at(r, c), R = red(p), G = green(p), B = blue(p);
      const float ratio = ratio_of(R, G);
      if (ratio > maxRatio) maxRatio = static_cast<int>(ratio);
      if (ratio > 1.5f && R > 0.8 * (G + B) && R > maxRed) maxRed = R;
    }

  const size_t n = static_cast<size_t>(W) * H;
  unsigned char* mask = static_cast<unsigned char*>(px_calloc(n, 1));
  int* label = static_cast<int*>(px_calloc(n, sizeof(int)));
  if (!mask || !label) {
    px_free(mask);
    px_free(label);
    return 0;
  }

  // 2. Marks; a pixel meeting two rules counts twice.
  int marks = 0;
  for (int r = 0; r < H; ++r)
    for (int c = 0; c < W; ++c) {
      const int p = at(r, c), R = red(p), G = green(p), B = blue(p);
      const float ratio = ratio_of(R, G);
      unsigned char& m = mask[static_cast<size_t>(r) * W + c];
      if (ratio > 2.0f && R >= 51) m = 255, ++marks;
      if (maxRatio == 3) {
        if (ratio > 1.5f && B > G) m = 255, ++marks;
      } else if (maxRatio < 3) {
        if (ratio > 1.5f && R > 0.8 * (G + B) && R > 0.6 * maxRed) m = 255, ++marks;
      }
    }

  int changed = 0;
  int* parent = nullptr;
  int* count = nullptr;
  if (marks >= 5 && H >= 2) {
    // 4. One-pass labelling of rows 1..H-1, columns 1..W-2.
    int labels = 0;
    // At most one new label every other pixel of a row (a new label needs an
    // unlabelled left neighbour).
    const size_t cap = static_cast<size_t>(H) * (static_cast<size_t>(W) / 2 + 1) + 1;
    parent = static_cast<int*>(px_malloc(cap, sizeof(int)));
    if (parent) {
      parent[0] = 0;
      auto L = [&](int r, int c) { return label[static_cast<size_t>(r) * W + c]; };
      for (int r = 1; r < H; ++r)
        for (int c = 1; c + 1 < W; ++c) {
          if (!mask[static_cast<size_t>(r) * W + c]) continue;
          const int up = L(r - 1, c), upLeft = L(r - 1, c - 1), left = L(r, c - 1), upRight = L(r - 1, c + 1);
          int lab;
          if (up) lab = up;
          else if (upLeft) lab = left ? left : upLeft;
          else if (left) lab = left;
          else if (upRight) lab = upRight;
          else {
            lab = ++labels;
            parent[lab] = lab;
          }
          label[static_cast<size_t>(r) * W + c] = lab;
          if (left && left != lab) join(parent, left, lab);
        }

      // 5. The class with the most pixels, the lowest label on ties.
      count = static_cast<int*>(px_calloc(static_cast<size_t>(labels) + 1, sizeof(int)));
      if (count) {
        for (size_t i = 0; i < n; ++i)
          if (label[i]) {
            label[i] = find_root(parent, label[i]);
            ++count[label[i]];
          }
        int best = 0;
        for (int k = 1; k <= labels; ++k)
          if (count[k] > count[best]) best = k;
        for (size_t i = 0; i < n; ++i) mask[i] = (best && label[i] == best) ? 255 : 0;

        // 6. Widen: interior pixels take the 3 x 3 mean of the kept area; the
        // photo-square's border pixels keep the kept value.
        unsigned char* wide = reinterpret_cast<unsigned char*>(label);  // label map no longer needed
        std::memcpy(wide, mask, n);
        for (int r = 1; r + 1 < H; ++r)
          for (int c = 1; c + 1 < W; ++c) {
            int sum = 0;
            for (int dr = -1; dr <= 1; ++dr)
              for (int dc = -1; dc <= 1; ++dc) sum += mask[static_cast<size_t>(r + dr) * W + (c + dc)];
            wide[static_cast<size_t>(r) * W + c] = static_cast<unsigned char>(static_cast<int>(sum / 9.0));
          }

        // 7. Correct the red of every widened pixel.
        for (int r = 0; r < H; ++r)
          for (int c = 0; c < W; ++c) {
            if (!wide[static_cast<size_t>(r) * W + c]) continue;
            int& p = at(r, c);
            const int R = (51 * red(p) + 614 * green(p) + 307 * blue(p)) >> 10;
            p = static_cast<int>((static_cast<unsigned>(p) & 0xFF00FFFFu) | (static_cast<unsigned>(R) << 16));
            changed = 1;
          }
      }
    }
  }
  px_free(count);
  px_free(parent);
  px_free(label);
  px_free(mask);
  return changed;
}

int px_remove_redeye_manual_prev(const int* src, int* dst, int width, int height, int x, int y, int radius) {
  const int side = 2 * radius + 1;
  if (side < 1 || !src || !dst) return side;
  int left, top, W, H;
  if (!region(width, height, x, y, radius, &left, &top, &W, &H)) return side;
  for (int c = left; c < left + W; ++c)
    for (int r = top; r < top + H; ++r) {
      const size_t i = static_cast<size_t>(r) * width + c;
      const int p = src[i], R = red(p), G = green(p), B = blue(p);
      if (!(R > 2.5f * G)) continue;
      int v = static_cast<int>(0.05 * R + 0.6 * G + 0.3 * B);
      v = v < 0 ? 0 : (v > 255 ? 255 : v);
      dst[i] = static_cast<int>((static_cast<unsigned>(p) & 0xFF00FFFFu) | (static_cast<unsigned>(v) << 16));
    }
  return side;
}

int px_remove_redeye_manual_with_preview(int* src, int width, int height, int* dst, int previewWidth,
                                         int previewHeight, int x, int y, int radius) {
  if (!src || !dst || width < 1 || height < 1 || previewWidth < 1 || previewHeight < 1) return 0;
  const int result = px_remove_redeye_manual(src, width, height, x, y, radius);
  const long long f =
      static_cast<long long>(static_cast<float>(static_cast<long long>(previewWidth) << 12) / static_cast<float>(width));
  if (f <= 0) return result;
  for (int j = 0; j < previewHeight; ++j) {
    const long long sy = (static_cast<long long>(j) << 12) / f;
    if (sy >= height) break;
    for (int i = 0; i < previewWidth; ++i) {
      const long long sx = (static_cast<long long>(i) << 12) / f;
      if (sx >= width) break;
      dst[static_cast<size_t>(j) * previewWidth + i] = src[static_cast<size_t>(sy) * width + sx];
    }
  }
  return result;
}

void px_remove_redeye_auto(const int*, int*, int, int) {}
