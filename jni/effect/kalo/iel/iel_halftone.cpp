// Colour halftone: CMYK separation, three rotated dot screens, recombination
// and a darken-only blend with the original.
#include <cmath>
#include <cstdint>
#include <cstring>

#include "../if_utils_and.h"
#include "../px_parallel.h"
#include "iel_artistic.h"
#include "iel_internal.h"

namespace {
bool rgb888_only(int format) { return format == IEL_FORMAT_RGB888; }

unsigned char store(double x) {
  const double v = (x * 100 + 0.5) * 256 / 100;
  return static_cast<unsigned char>(v < 0 ? 0 : (v > 255 ? 255 : v));
}

void IEL_DrawPixel(unsigned char* screen, int w, int h, int x, int y) {
  if (x >= 0 && x < w && y >= 0 && y < h) screen[static_cast<size_t>(y) * w + x] = 255;
}

void span(unsigned char* screen, int w, int h, int y, int x0, int x1) {
  for (int x = x0; x <= x1; ++x) IEL_DrawPixel(screen, w, h, x, y);
}

// The rows of ink of a filled dot of radius r by the midpoint circle method:
// every pair of symmetric points on the circle is joined, so a dot reads as
// a solid printed dot rather than a ring. row(y, x0, x1) inks x0..x1 of row y.
template <class Row>
void dot_spans(int cx, int cy, int r, Row row) {
  int x = r, y = 0, err = 1 - r;
  while (x >= y) {
    row(cy + y, cx - x, cx + x);
    row(cy - y, cx - x, cx + x);
    row(cy + x, cx - y, cx + y);
    row(cy - x, cx - y, cx + y);
    ++y;
    if (err < 0) {
      err += 2 * y + 1;
    } else {
      --x;
      err += 2 * (y - x) + 1;
    }
  }
}

// A filled dot of radius r.
void IEL_Halftone_bresan_circle(unsigned char* screen, int w, int h, int cx, int cy, int r) {
  dot_spans(cx, cy, r, [&](int y, int x0, int x1) { span(screen, w, h, y, x0, x1); });
}

struct Screen {
  const unsigned char* plane;
  unsigned char* out;
  int w, h, cell, channel;
};

// Dots along one screen line: from `origin`, every `cell` pixels in the
// direction (dx, dy), for the steps t0..t1. A dot whose centre falls outside
// the picture is skipped; radius 0 leaves the cell without ink.
void IEL_Halftone_Line_Circle(const Screen& s, double ox, double oy, double dx, double dy, int t0, int t1) {
  for (int t = t0; t <= t1; ++t) {
    const int cx = static_cast<int>(std::floor(ox + t * s.cell * dx + 0.5));
    const int cy = static_cast<int>(std::floor(oy + t * s.cell * dy + 0.5));
    if (cx < 0 || cx >= s.w || cy < 0 || cy >= s.h) continue;
    const int r = IEL_Halftone_AnalyseCircleRadius(s.plane, s.w, s.h, cx, cy, s.cell, s.channel);
    if (r > 0) IEL_Halftone_bresan_circle(s.out, s.w, s.h, cx, cy, r);
  }
}
}  // namespace

void IEL_Halftone_RGBtoCMYKconversion(const unsigned char* rgb, int width, int height, unsigned char* c,
                                      unsigned char* m, unsigned char* y, unsigned char* k) {
  const size_t n = static_cast<size_t>(width) * static_cast<size_t>(height);
  for (size_t i = 0; i < n; ++i) {
    const double cc = 1 - rgb[3 * i] / 255.0, mm = 1 - rgb[3 * i + 1] / 255.0, yy = 1 - rgb[3 * i + 2] / 255.0;
    double kk = cc < mm ? cc : mm;
    kk = yy < kk ? yy : kk;
    if (kk == 1) {
      c[i] = m[i] = y[i] = 1;
      k[i] = 255;
      continue;
    }
    c[i] = store((cc - kk) / (1 - kk));
    m[i] = store((mm - kk) / (1 - kk));
    y[i] = store((yy - kk) / (1 - kk));
    k[i] = store(kk);
  }
}

int IEL_Halftone_AnalyseCircleRadius(const unsigned char* plane, int width, int height, int cx, int cy, int cell,
                                     int channel) {
  const int half = (cell - 1) >> 1;
  int sum = 0;
  for (int dy = -half; dy <= half; ++dy) {
    int y = cy + dy;
    y = y < 0 ? 0 : (y > height - 1 ? height - 1 : y);  // window clamped at the border
    for (int dx = -half; dx <= half; ++dx) {
      int x = cx + dx;
      x = x < 0 ? 0 : (x > width - 1 ? width - 1 : x);
      sum += plane[static_cast<size_t>(y) * width + x];
    }
  }
  const int m = sum / (cell * cell);
  switch (channel) {
    case 1:
      return m < 3 ? 0 : (m <= 9 ? 2 : (m <= 99 ? 3 : 4));
    case 2:
      return m < 20 ? 1 : (m < 40 ? 2 : (m <= 99 ? 3 : (m < 150 ? 4 : 5)));
    default:
      return m <= 99 ? 1 : (m < 150 ? 2 : 3);
  }
}

namespace {
// The screen's lines: the unit step along a line (dx, dy) and across the
// lines (nx, ny), their spacing, and the range of lines j0..j1 and of dots
// along a line t0..t1 that covers the square.
struct ScreenLines {
  double dx, dy, nx, ny;
  int spacing, j0, j1, t0, t1;
};
ScreenLines screen_lines(int width, int height, int cell, double slope, int channel) {
  const double norm = std::sqrt(1 + slope * slope);
  const double dx = 1 / norm, dy = slope / norm;  // along a line
  const double nx = -dy, ny = dx;                  // across the lines
  const int spacing = (channel == 1 ? 4 : 2) * cell;
  const double side = width > height ? width : height;
  // Extent of the square along both axes of the screen.
  double amin = 0, amax = 0, bmin = 0, bmax = 0;
  const double corners[4][2] = {{0, 0}, {side, 0}, {0, side}, {side, side}};
  for (const auto& c : corners) {
    const double a = c[0] * dx + c[1] * dy, b = c[0] * nx + c[1] * ny;
    amin = a < amin ? a : amin, amax = a > amax ? a : amax;
    bmin = b < bmin ? b : bmin, bmax = b > bmax ? b : bmax;
  }
  return {dx,
          dy,
          nx,
          ny,
          spacing,
          static_cast<int>(std::floor(bmin / spacing)),
          static_cast<int>(std::ceil(bmax / spacing)),
          static_cast<int>(std::floor(amin / cell)),
          static_cast<int>(std::ceil(amax / cell))};
}
}  // namespace

// Dot geometry: the screen lines run in the direction (1, slope) (x right,
// y down), normalised; they are spaced four cells (channel 1) or two cells
// (channels 2 and 3) apart measured across the lines, and each line carries a
// dot every cell along it. The lines are laid over the square of side
// max(width, height) from the top-left corner, so every screen covers the
// picture whatever its orientation.
void IEL_Halftone_HalftonePerChannel(const unsigned char* plane, unsigned char* screen, int width, int height,
                                     int cell, double slope, int channel) {
  std::memset(screen, 0, static_cast<size_t>(width) * static_cast<size_t>(height));
  const Screen s{plane, screen, width, height, cell, channel};
  const ScreenLines lines = screen_lines(width, height, cell, slope, channel);
  const double dx = lines.dx, dy = lines.dy, nx = lines.nx, ny = lines.ny;
  const int spacing = lines.spacing, j0 = lines.j0, j1 = lines.j1, t0 = lines.t0, t1 = lines.t1;
  for (int j = j0; j <= j1; ++j) {
    IEL_Halftone_Line_Circle(s, j * spacing * nx, j * spacing * ny, dx, dy, t0, t1);
  }
}

void IEL_Halftone_CMYKtoRGBconversion(const unsigned char* c, const unsigned char* m, const unsigned char* y,
                                      const unsigned char* k, unsigned char* rgb, int width, int height) {
  const size_t n = static_cast<size_t>(width) * static_cast<size_t>(height);
  for (size_t i = 0; i < n; ++i) {
    unsigned char* o = rgb + 3 * i;
    if (k[i] < 1) {
      o[0] = o[1] = o[2] = 0;
      continue;
    }
    const double f = 1 - k[i] / 255.0;
    o[0] = static_cast<unsigned char>((255 - c[i]) * f);
    o[1] = static_cast<unsigned char>((255 - m[i]) * f);
    o[2] = static_cast<unsigned char>((255 - y[i]) * f);
  }
}

void IEL_DarkenOnlyBlendingRGB888(const structIELImage* input, structIELImage* output) {
  const size_t n = static_cast<size_t>(input->width) * static_cast<size_t>(input->height) * 3;
  for (size_t i = 0; i < n; ++i) {
    if (input->buffer[i] < output->buffer[i]) output->buffer[i] = input->buffer[i];
  }
}

namespace {
// The conversions as tables, filled once with the very same double
// expressions: a separated ink depends only on its own channel and the
// pixel's largest channel (the black ink is 1 - max / 255 exactly, being the
// smallest of the three 1 - channel / 255), and a recombined channel only on
// its ink and the black.
struct HalftoneTables {
  unsigned char ink[256][256];   // [largest channel][channel], largest >= 1
  unsigned char black[256];      // [largest channel]
  unsigned char rgb[256][256];   // [black][ink], black >= 1
  HalftoneTables() {
    for (int mx = 0; mx < 256; ++mx) {
      const double kk = 1 - mx / 255.0;
      black[mx] = store(kk);
      for (int v = 0; v < 256; ++v) {
        const double cc = 1 - v / 255.0;
        ink[mx][v] = mx == 0 ? 1 : store((cc - kk) / (1 - kk));
      }
    }
    for (int k = 0; k < 256; ++k) {
      const double f = 1 - k / 255.0;
      for (int c = 0; c < 256; ++c) rgb[k][c] = k < 1 ? 0 : static_cast<unsigned char>((255 - c) * f);
    }
  }
};

const HalftoneTables& halftone_tables() {
  static const HalftoneTables tables;
  return tables;
}

// The largest dot radius any channel draws.
constexpr int kMaxDotRadius = 5;

// The rows y0..y1-1 of a filled dot, as IEL_Halftone_bresan_circle draws it
// with its pixels outside the picture skipped.
void dot_rows(unsigned char* screen, int w, int y0, int y1, int cx, int cy, int r) {
  auto span = [&](int y, int xa, int xb) {
    if (y < y0 || y >= y1) return;
    xa = xa < 0 ? 0 : xa;
    xb = xb > w - 1 ? w - 1 : xb;
    if (xa <= xb) std::memset(screen + static_cast<size_t>(y) * w + xa, 255, static_cast<size_t>(xb - xa + 1));
  };
  dot_spans(cx, cy, r, span);
}

// IEL_Halftone_HalftonePerChannel over row bands: a screen is the union of
// its dots, so each band clears its own rows and draws the part of every dot
// centred within kMaxDotRadius rows of them, with the same dot centres (the
// same expressions) and radii.
void screen_banded(const unsigned char* plane, unsigned char* screen, int width, int height, int cell, double slope,
                   int channel) {
  const ScreenLines lines = screen_lines(width, height, cell, slope, channel);
  const double dx = lines.dx, dy = lines.dy, nx = lines.nx, ny = lines.ny;
  const int spacing = lines.spacing, j0 = lines.j0, j1 = lines.j1, t0 = lines.t0, t1 = lines.t1;
  px_for_rows(height, [&](int y0, int y1) {
    std::memset(screen + static_cast<size_t>(y0) * width, 0, static_cast<size_t>(y1 - y0) * width);
    for (int j = j0; j <= j1; ++j) {
      const double ox = j * spacing * nx, oy = j * spacing * ny;
      for (int t = t0; t <= t1; ++t) {
        const int cx = static_cast<int>(std::floor(ox + t * cell * dx + 0.5));
        const int cy = static_cast<int>(std::floor(oy + t * cell * dy + 0.5));
        if (cx < 0 || cx >= width || cy < 0 || cy >= height) continue;
        if (cy + kMaxDotRadius < y0 || cy - kMaxDotRadius >= y1) continue;
        const int r = IEL_Halftone_AnalyseCircleRadius(plane, width, height, cx, cy, cell, channel);
        if (r > 0) dot_rows(screen, width, y0, y1, cx, cy, r);
      }
    }
  });
}

// The separation by the tables, rows on worker threads; the black ink is
// left to the recombination, which reads the input again.
void separate_fast(const unsigned char* rgb, int width, int height, unsigned char* c, unsigned char* m,
                   unsigned char* y) {
  const HalftoneTables& t = halftone_tables();
  const size_t row = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (size_t i = y0 * row; i < y1 * row; ++i) {
      const unsigned char* p = rgb + 3 * i;
      int mx = p[0] > p[1] ? p[0] : p[1];
      mx = p[2] > mx ? p[2] : mx;
      if (mx == 0) {  // pure black: the inks are 1
        c[i] = m[i] = y[i] = 1;
        continue;
      }
      c[i] = t.ink[mx][p[0]];
      m[i] = t.ink[mx][p[1]];
      y[i] = t.ink[mx][p[2]];
    }
  });
}

// Recombination of the screens and the darken-only blend with the input. A
// screen is 0 or 255, and the recombined channel of ink 255 is 0, so each
// channel is the recombined channel of ink 0 for the pixel's black (which
// is the black ink of its largest channel) with the screen's bits cleared,
// then the smaller of that and the input (an output that is the input
// itself has already been overwritten when the plain path blends, so it
// takes the recombined pixels as they are).
void recombine_fast(const unsigned char* c, const unsigned char* m, const unsigned char* y, const unsigned char* input,
                    unsigned char* rgb, int width, int height) {
  const HalftoneTables& t = halftone_tables();
  unsigned char base[256];  // by largest channel
  for (int mx = 0; mx < 256; ++mx) base[mx] = t.rgb[t.black[mx]][0];
  const size_t row = static_cast<size_t>(width);
  const bool in_place = input == rgb;
  px_for_rows(height, [&](int y0, int y1) {
    unsigned char b[256];
    for (int yy = y0; yy < y1; ++yy) {
      for (size_t x0 = 0; x0 < row; x0 += sizeof b) {
        const size_t len = row - x0 < sizeof b ? row - x0 : sizeof b;
        const size_t i0 = yy * row + x0;
        const unsigned char* p = input + 3 * i0;
        for (size_t x = 0; x < len; ++x) {
          int mx = p[3 * x] > p[3 * x + 1] ? p[3 * x] : p[3 * x + 1];
          mx = p[3 * x + 2] > mx ? p[3 * x + 2] : mx;
          b[x] = base[mx];
        }
        unsigned char* o = rgb + 3 * i0;
        const unsigned char *cs = c + i0, *ms = m + i0, *ys = y + i0;
        if (in_place) {
          for (size_t x = 0; x < len; ++x) {
            o[3 * x] = static_cast<unsigned char>(b[x] & ~cs[x]);
            o[3 * x + 1] = static_cast<unsigned char>(b[x] & ~ms[x]);
            o[3 * x + 2] = static_cast<unsigned char>(b[x] & ~ys[x]);
          }
        } else {
          for (size_t x = 0; x < len; ++x) {
            const unsigned char v0 = static_cast<unsigned char>(b[x] & ~cs[x]);
            const unsigned char v1 = static_cast<unsigned char>(b[x] & ~ms[x]);
            const unsigned char v2 = static_cast<unsigned char>(b[x] & ~ys[x]);
            o[3 * x] = p[3 * x] < v0 ? p[3 * x] : v0;
            o[3 * x + 1] = p[3 * x + 1] < v1 ? p[3 * x + 1] : v1;
            o[3 * x + 2] = p[3 * x + 2] < v2 ? p[3 * x + 2] : v2;
          }
        }
      }
    }
  });
}
}  // namespace

// The first screen (75 degrees, channel 1) takes cyan, the second (45
// degrees, channel 2, whose dots grow fastest and never vanish) yellow, the
// least visible ink on paper, and the third (15 degrees, channel 3) magenta;
// black stays a continuous tone. Each screen is drawn into a spare plane
// while the separated plane is read for the dot sizes.
int IEL_Halftone_Colored_CMYK(structIELImage* input, structIELImage* output) {
  if (int rc = IEL_CheckEffectImages(__func__, input, output, 1, 1, rgb888_only)) return rc;
  const int w = input->width, h = input->height;
  const size_t n = static_cast<size_t>(w) * static_cast<size_t>(h);
  const bool fast = !px_scalar_only();
  if (!fast) std::memcpy(output->buffer, input->buffer, n * 3);
  // Cyan, magenta, yellow, black and a spare plane for the screens (the
  // fast path does without the black plane).
  unsigned char* planes[5] = {};
  bool ok = true;
  for (int i = 0; i < 5; ++i) {
    if (fast && i == 3) continue;
    planes[i] = static_cast<unsigned char*>(IF_MALLOC(static_cast<int>(n)));
    ok = ok && planes[i];
  }
  if (!ok) {
    IF_ERROR("Failed to allocate \n");
    for (auto* p : planes) IF_FREE(p);
    // The copy of the input is the output either way.
    if (fast) std::memcpy(output->buffer, input->buffer, n * 3);
    return IEL_ERR_ALLOC;
  }
  if (fast) separate_fast(input->buffer, w, h, planes[0], planes[1], planes[2]);
  else IEL_Halftone_RGBtoCMYKconversion(input->buffer, w, h, planes[0], planes[1], planes[2], planes[3]);
  static const double kSlopes[3] = {3.732, 1.0, 0.2679};
  static const int kPlane[3] = {0, 2, 1};  // cyan, yellow, magenta
  for (int i = 0; i < 3; ++i) {
    const int p = kPlane[i];
    if (fast) screen_banded(planes[p], planes[4], w, h, 9, kSlopes[i], i + 1);
    else IEL_Halftone_HalftonePerChannel(planes[p], planes[4], w, h, 9, kSlopes[i], i + 1);
    unsigned char* t = planes[p];
    planes[p] = planes[4];
    planes[4] = t;
  }
  if (fast) {
    recombine_fast(planes[0], planes[1], planes[2], input->buffer, output->buffer, w, h);
  } else {
    IEL_Halftone_CMYKtoRGBconversion(planes[0], planes[1], planes[2], planes[3], output->buffer, w, h);
    IEL_DarkenOnlyBlendingRGB888(input, output);
  }
  for (auto* p : planes) IF_FREE(p);
  return IEL_OK;
}
