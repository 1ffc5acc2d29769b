#include "../px_math.h"
#include "px_eraser.h"

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <thread>

#include "../kalo/iel/iel_luma.h"
#include "../kalo/px_mem.h"

std::atomic<int32_t> g_status_photoeraser{PX_ERASER_IDLE};
std::atomic<int32_t> g_bStop{0};
std::atomic<int32_t> g_bExit{0};

namespace {
std::atomic<bool> g_claimed{false};
std::atomic<int> g_MaskR{0}, g_MaskG{0}, g_MaskB{0};
std::atomic<px_eraser_callback> callback_earserfunc{nullptr};
px_eraser_progress_fn g_progress = nullptr;
void* g_progress_context = nullptr;

// Confidence of a pixel known from the start; a filled pixel gets the mean
// confidence of the window it was filled from (so confidence fades towards
// the middle of the hole and the well-supported edges are filled first).
// 1024 keeps confidence term x data term inside 32 bits.
constexpr int32_t kConfKnown = 1024;

enum : unsigned char { kKnown = 0, kUnknown = 1, kFront = 2 };
constexpr unsigned char kTargetLabel = 10;

// ---- the fill-front normal table ------------------------------------------------
constexpr int32_t rounded_ratio(int64_t num, int64_t den) {
  return static_cast<int32_t>(num >= 0 ? (num + den / 2) / den : -((-num + den / 2) / den));
}
// 25 pairs (nx, ny) in 16.16, entry ((dy + 2) * 5 + (dx + 2)): the unit normal
// (-dy, dx) / |(dx, dy)| of the front tangent (dx, dy); the centre entry
// holds the default normal (0.6, 0.8).
struct NormTable {
  int32_t v[50];
};
constexpr NormTable make_norm_lut() {
  NormTable t{};
  for (int dy = -2; dy <= 2; ++dy) {
    for (int dx = -2; dx <= 2; ++dx) {
      const int i = ((dy + 2) * 5 + dx + 2) * 2;
      if (dx == 0 && dy == 0) {
        t.v[i] = 39332;
        t.v[i + 1] = 52429;
        continue;
      }
      const int64_t len = static_cast<int64_t>(px_isqrt_floor(static_cast<uint64_t>(dx * dx + dy * dy) << 56));  // |t| in 36.28
      t.v[i] = rounded_ratio(static_cast<int64_t>(-dy) * (int64_t{1} << 44), len);
      t.v[i + 1] = rounded_ratio(static_cast<int64_t>(dx) * (int64_t{1} << 44), len);
    }
  }
  return t;
}
constexpr NormTable normLUT = make_norm_lut();
static_assert(normLUT.v[(2 * 5 + 3) * 2] == 0 && normLUT.v[(2 * 5 + 3) * 2 + 1] == 65536);

// ---- working state of one run ---------------------------------------------------
struct Node {
  int32_t x, y;  // region coordinates
  int32_t pri;
  int32_t next;  // index of the next node, -1 at the end
};

struct Work {
  int* pic = nullptr;
  int width = 0, height = 0;
  int ox = 0, oy = 0, rw = 0, rh = 0;  // working region (clipped to the picture)
  int P = 0, W = 0;
  unsigned char* label = nullptr;
  unsigned char* state = nullptr;
  int32_t* conf = nullptr;
  unsigned char* gray = nullptr;
  unsigned char* source = nullptr;
  int32_t* node_of = nullptr;
  Node* nodes = nullptr;
  int capacity = 0, used = 0, head = -1, tail = -1;

  void free_all() {
    px_free(label);
    px_free(state);
    px_free(conf);
    px_free(gray);
    px_free(source);
    px_free(node_of);
    px_free(nodes);
    label = state = gray = source = nullptr;
    conf = node_of = nullptr;
    nodes = nullptr;
  }
  int at(int x, int y) const { return y * rw + x; }
  int pixel(int x, int y) const { return pic[(oy + y) * width + ox + x]; }
};

int gray_of(int argb) { return IEL_Luma((argb >> 16) & 255, (argb >> 8) & 255, argb & 255); }

// ---- the fill-front list -----------------------------------------------------
bool alloc_linked_memory(Work& w, int capacity) {
  w.nodes = static_cast<Node*>(px_malloc(static_cast<size_t>(capacity), sizeof(Node)));
  w.capacity = capacity;
  w.used = 0;
  w.head = w.tail = -1;
  return w.nodes != nullptr;
}
void insert_linked_pt(Work& w, int x, int y, int32_t pri) {
  if (w.used >= w.capacity) return;  // cannot happen: one node a hole pixel at most
  const int n = w.used++;
  w.nodes[n] = Node{x, y, pri, -1};
  if (w.tail < 0) {
    w.head = n;
  } else {
    w.nodes[w.tail].next = n;
  }
  w.tail = n;
  w.node_of[w.at(x, y)] = n;
}

// ---- priority ---------------------------------------------------------------------
int32_t confidence_term(const Work& w, int x, int y) {
  const int n = 2 * w.W + 1;
  int64_t sum = 0;
  for (int yy = y - w.W; yy <= y + w.W; ++yy) {
    if (yy < 0 || yy >= w.rh) continue;
    for (int xx = x - w.W; xx <= x + w.W; ++xx) {
      if (xx < 0 || xx >= w.rw) continue;
      sum += w.conf[w.at(xx, yy)];
    }
  }
  return static_cast<int32_t>(sum / (n * n)) + 1;
}

bool known_or_outside(const Work& w, int x, int y) {
  if (x < 0 || y < 0 || x >= w.rw || y >= w.rh) return true;
  return w.state[w.at(x, y)] == kKnown;
}

// Grey gradient in 16.16: central differences, one-sided at the border.
void gradient(const Work& w, int x, int y, int32_t* gx, int32_t* gy) {
  const unsigned char* g = w.gray;
  const int i = w.at(x, y);
  if (x > 0 && x + 1 < w.rw) {
    *gx = (g[i + 1] - g[i - 1]) * 32768;
  } else if (x + 1 < w.rw) {
    *gx = (g[i + 1] - g[i]) * 65536;
  } else if (x > 0) {
    *gx = (g[i] - g[i - 1]) * 65536;
  } else {
    *gx = 0;
  }
  if (y > 0 && y + 1 < w.rh) {
    *gy = (g[i + w.rw] - g[i - w.rw]) * 32768;
  } else if (y + 1 < w.rh) {
    *gy = (g[i + w.rw] - g[i]) * 65536;
  } else if (y > 0) {
    *gy = (g[i] - g[i - w.rw]) * 65536;
  } else {
    *gy = 0;
  }
}

int32_t data_term(const Work& w, int x, int y) {
  int32_t gx = 0, gy = 0;
  int64_t best = -1;
  for (int yy = y - w.W + 1; yy <= y + w.W - 1; ++yy) {
    if (yy < 0 || yy >= w.rh) continue;
    for (int xx = x - w.W + 1; xx <= x + w.W - 1; ++xx) {
      if (xx < 0 || xx >= w.rw || w.state[w.at(xx, yy)] != kKnown) continue;
      if (!known_or_outside(w, xx - 1, yy) || !known_or_outside(w, xx + 1, yy) ||
          !known_or_outside(w, xx, yy - 1) || !known_or_outside(w, xx, yy + 1)) {
        continue;
      }
      int32_t ax, ay;
      gradient(w, xx, yy, &ax, &ay);
      const int64_t mag = static_cast<int64_t>(ax >> 8) * (ax >> 8) + static_cast<int64_t>(ay >> 8) * (ay >> 8);
      if (mag > best) {
        best = mag;
        gx = ax;
        gy = ay;
      }
    }
  }
  // Normal from the first and last front pixel of the 3 x 3 neighbourhood.
  int count = 0, fx = 0, fy = 0, lx = 0, ly = 0;
  for (int yy = y - 1; yy <= y + 1; ++yy) {
    for (int xx = x - 1; xx <= x + 1; ++xx) {
      if (xx < 0 || yy < 0 || xx >= w.rw || yy >= w.rh || w.state[w.at(xx, yy)] != kFront) continue;
      if (count == 0) {
        fx = xx;
        fy = yy;
      }
      lx = xx;
      ly = yy;
      ++count;
    }
  }
  int32_t nx = 39332, ny = 52429;
  if (count >= 2) px_eraser_normal(lx - fx, ly - fy, &nx, &ny);
  const int32_t d = ((ny >> 8) * (-gx >> 8) + (nx >> 8) * (gy >> 8)) >> 8;
  return (d < 0 ? -d : d) + 1;
}

int32_t priority(const Work& w, int x, int y) { return confidence_term(w, x, y) * data_term(w, x, y); }

// ---- set-up ----------------------------------------------------------------------

// Source map bits: a centre whose window lies in the working region and
// holds no masked pixel (original picture); a centre whose window holds
// filled pixels but no pixel still to fill nor masked outside the rectangle;
// a pixel masked outside the rectangle (part of the object that stays).
enum : unsigned char { kSourceOriginal = 1, kSourceFilled = 2, kForeign = 4 };

// The allowed source centres (draw_source): patches come from the untouched
// picture; never from the object. Centres over pixels filled earlier in the
// run are allowed only as a fallback (see patch_texture), so the middle of a
// hole wider than the search radius can still be reached nearby.
bool draw_source(Work& w, const unsigned char* mask) {
  const int sw = w.rw + 1;
  int32_t* sum = static_cast<int32_t*>(px_calloc(static_cast<size_t>(sw) * (w.rh + 1), sizeof(int32_t)));
  if (!sum) return false;
  for (int y = 0; y < w.rh; ++y) {
    int32_t row = 0;
    for (int x = 0; x < w.rw; ++x) {
      row += mask[(w.oy + y) * w.width + w.ox + x] == 1;
      sum[(y + 1) * sw + x + 1] = sum[y * sw + x + 1] + row;
    }
  }
  const int W = w.W;
  for (int y = W; y + W < w.rh; ++y) {
    for (int x = W; x + W < w.rw; ++x) {
      const int x0 = x - W, x1 = x + W + 1, y0 = y - W, y1 = y + W + 1;
      const int32_t bad = sum[y1 * sw + x1] - sum[y0 * sw + x1] - sum[y1 * sw + x0] + sum[y0 * sw + x0];
      if (bad == 0) w.source[w.at(x, y)] |= kSourceOriginal;
    }
  }
  for (int y = 0; y < w.rh; ++y) {
    for (int x = 0; x < w.rw; ++x) {
      const int i = w.at(x, y);
      if (w.state[i] == kKnown && mask[(w.oy + y) * w.width + w.ox + x] == 1) w.source[i] |= kForeign;
    }
  }
  px_free(sum);
  return true;
}

// The front: unfilled pixels with a known 4-neighbour.
bool on_front(const Work& w, int x, int y) {
  return (x > 0 && w.state[w.at(x - 1, y)] == kKnown) || (x + 1 < w.rw && w.state[w.at(x + 1, y)] == kKnown) ||
         (y > 0 && w.state[w.at(x, y - 1)] == kKnown) || (y + 1 < w.rh && w.state[w.at(x, y + 1)] == kKnown);
}

void draw_boundary_fixed(Work& w) {
  for (int y = 0; y < w.rh; ++y) {
    for (int x = 0; x < w.rw; ++x) {
      const int i = w.at(x, y);
      if (w.state[i] != kKnown && on_front(w, x, y)) w.state[i] = kFront;
    }
  }
}

// Grey map and confidence: known pixels kConfKnown, hole pixels 0.
void get_gray_confid(Work& w) {
  for (int y = 0; y < w.rh; ++y) {
    for (int x = 0; x < w.rw; ++x) {
      const int i = w.at(x, y);
      w.gray[i] = static_cast<unsigned char>(gray_of(w.pixel(x, y)));
      w.conf[i] = w.state[i] == kKnown ? kConfKnown : 0;
    }
  }
}

// Segmentation of the rectangle widened by the search radius, and the label
// map derived from it (get_seedmask):
// - known pixels take the segment of their nearest sample;
// - the target segment (label 10) is the segment holding most of the known
//   samples that touch the hole, i.e. the background the object stands on;
//   the other segments get labels 1..255 without 10 in order of first
//   appearance (two segments may share a label when there are more than 254);
// - hole pixels take the label of the nearest known pixel (breadth-first,
//   4-connected, seeded in raster order), so each part of the hole is
//   matched against the segment it continues.
// Patch matching then compares only pixels of the target point's label, and
// the hole's share of the background is filled first. Returns false when out
// of memory.
bool segment_and_label(Work& w, px_rect seg) {
  const int nx = (seg.right - seg.left) / 2 + 1;
  const int ny = (seg.bottom - seg.top) / 2 + 1;
  const int count = nx * ny;
  const int nedges = (nx - 1) * ny + nx * (ny - 1);
  px_seg_edge* edges = static_cast<px_seg_edge*>(px_malloc(static_cast<size_t>(nedges > 0 ? nedges : 1), sizeof(px_seg_edge)));
  int32_t* root = static_cast<int32_t*>(px_malloc(static_cast<size_t>(count), sizeof(int32_t)));
  int32_t* votes = static_cast<int32_t*>(px_calloc(static_cast<size_t>(count), sizeof(int32_t)));
  int32_t* name = static_cast<int32_t*>(px_calloc(static_cast<size_t>(count), sizeof(int32_t)));
  int32_t* queue = static_cast<int32_t*>(px_malloc(static_cast<size_t>(w.rw) * w.rh, sizeof(int32_t)));
  bool ok = edges && root && votes && name && queue;
  int components = 0;
  if (ok) {
    auto px = [&](int i, int j) { return w.pic[(seg.top + 2 * j) * w.width + seg.left + 2 * i]; };
    auto weight = [](int a, int b) {
      const int d = std::abs(((a >> 16) & 255) - ((b >> 16) & 255)) + std::abs(((a >> 8) & 255) - ((b >> 8) & 255)) +
                    std::abs((a & 255) - (b & 255));
      return static_cast<uint16_t>(d < 20 ? 0 : d);
    };
    int e = 0;
    for (int j = 0; j < ny; ++j) {
      for (int i = 0; i < nx; ++i) {
        const int v = j * nx + i;
        if (i + 1 < nx) edges[e++] = px_seg_edge{weight(px(i, j), px(i + 1, j)), v, v + 1};
        if (j + 1 < ny) edges[e++] = px_seg_edge{weight(px(i, j), px(i, j + 1)), v, v + nx};
      }
    }
    // Components below a fiftieth of the samples (a fifth of a tenth) are
    // merged into their most similar neighbour: texture breaks into many
    // weight-0 specks that carry no structure.
    components = px_segment_graph(edges, nedges, count, count / 10, root);
    ok = components >= 0;
  }
  if (ok && components >= 2) {
    auto hole_at = [&](int i, int j) {
      const int x = seg.left + 2 * i - w.ox, y = seg.top + 2 * j - w.oy;
      return w.state[w.at(x, y)] != kKnown;
    };
    int32_t target = -1, best = 0;
    for (int j = 0; j < ny; ++j) {
      for (int i = 0; i < nx; ++i) {
        if (hole_at(i, j)) continue;
        const bool ring = (i > 0 && hole_at(i - 1, j)) || (i + 1 < nx && hole_at(i + 1, j)) ||
                          (j > 0 && hole_at(i, j - 1)) || (j + 1 < ny && hole_at(i, j + 1));
        if (!ring) continue;
        const int32_t r = root[j * nx + i];
        if (++votes[r] > best) {
          best = votes[r];
          target = r;
        }
      }
    }
    int next = 0;
    for (int v = 0; v < count; ++v) {
      const int32_t r = root[v];
      if (name[r] != 0) continue;
      if (r == target) {
        name[r] = kTargetLabel;
      } else {
        int l = 1 + next++ % 254;
        if (l >= kTargetLabel) ++l;
        name[r] = l;
      }
    }
    int qhead = 0, qtail = 0;
    for (int y = 0; y < w.rh; ++y) {
      for (int x = 0; x < w.rw; ++x) {
        const int i = w.at(x, y);
        if (w.state[i] != kKnown) continue;
        int si = (x + w.ox - seg.left + 1) / 2, sj = (y + w.oy - seg.top + 1) / 2;
        si = si < 0 ? 0 : si >= nx ? nx - 1 : si;
        sj = sj < 0 ? 0 : sj >= ny ? ny - 1 : sj;
        w.label[i] = static_cast<unsigned char>(name[root[sj * nx + si]]);
        queue[qtail++] = i;
      }
    }
    while (qhead < qtail) {
      const int i = queue[qhead++];
      const int x = i % w.rw, y = i / w.rw;
      const int nb[4] = {x > 0 ? i - 1 : -1, x + 1 < w.rw ? i + 1 : -1, y > 0 ? i - w.rw : -1,
                         y + 1 < w.rh ? i + w.rw : -1};
      for (int k : nb) {
        if (k < 0 || w.state[k] == kKnown || w.label[k] != 0) continue;
        w.label[k] = w.label[i];
        queue[qtail++] = k;
      }
    }
  }
  px_free(edges);
  px_free(root);
  px_free(votes);
  px_free(name);
  px_free(queue);
  return ok;
}

// ---- one round --------------------------------------------------------------------

// Finds the source centre for the target point (x, y): the centre with the
// least sum of absolute grey differences over the known window pixels of the
// point's label (all known pixels when none carries it). Candidates lie
// within +-P of the point: original-picture centres first; when there is
// none, also centres over pixels filled earlier in the run (the middle of a
// wide hole). Scanning is row by row; the first of equal scores wins. False
// when there is no candidate: the run then ends.
bool patch_texture(const Work& w, int x, int y, int* sx, int* sy) {
  const int W = w.W;
  int off_x[169], off_y[169], tg[169];
  int n = 0;
  const unsigned char want = w.label[w.at(x, y)];
  for (int pass = 0; pass < 2 && n == 0; ++pass) {
    for (int dy = -W; dy <= W; ++dy) {
      const int yy = y + dy;
      if (yy < 0 || yy >= w.rh) continue;
      for (int dx = -W; dx <= W; ++dx) {
        const int xx = x + dx;
        if (xx < 0 || xx >= w.rw) continue;
        const int i = w.at(xx, yy);
        if (w.state[i] != kKnown || (pass == 0 && w.label[i] != want)) continue;
        off_x[n] = dx;
        off_y[n] = dy;
        tg[n] = w.gray[i];
        ++n;
      }
    }
  }
  int32_t best = 99999999;
  bool found = false;
  static constexpr unsigned char kKinds[2] = {kSourceOriginal, kSourceOriginal | kSourceFilled};
  const int x0 = x - w.P < 0 ? 0 : x - w.P;
  const int x1 = x + w.P >= w.rw ? w.rw - 1 : x + w.P;
  const int y0 = y - w.P < 0 ? 0 : y - w.P;
  const int y1 = y + w.P >= w.rh ? w.rh - 1 : y + w.P;
  for (int stage = 0; stage < 2 && !found; ++stage) {
    const unsigned char kinds = kKinds[stage];
    for (int cy = y0; cy <= y1; ++cy) {
      for (int cx = x0; cx <= x1; ++cx) {
        if (!(w.source[w.at(cx, cy)] & kinds)) continue;
        const unsigned char* g = w.gray + w.at(cx, cy);
        int32_t sum = 0;
        for (int k = 0; k < n && sum < best; ++k) {
          const int d = g[off_y[k] * w.rw + off_x[k]] - tg[k];
          sum += d < 0 ? -d : d;
        }
        if (sum < best) {
          best = sum;
          *sx = cx;
          *sy = cy;
          found = true;
        }
      }
    }
  }
  return found;
}

// Centres around a filled patch whose windows are now wholly filled or
// original (and hold nothing masked outside the rectangle) become fallback
// sources.
void update_source(Work& w, int x, int y) {
  const int W = w.W, r = 2 * W;
  for (int cy = y - r; cy <= y + r; ++cy) {
    if (cy - W < 0 || cy + W >= w.rh) continue;
    for (int cx = x - r; cx <= x + r; ++cx) {
      if (cx - W < 0 || cx + W >= w.rw) continue;
      unsigned char& s = w.source[w.at(cx, cy)];
      if (s & (kSourceOriginal | kSourceFilled)) continue;
      bool ok = true;
      for (int yy = cy - W; yy <= cy + W && ok; ++yy) {
        for (int xx = cx - W; xx <= cx + W; ++xx) {
          const int i = w.at(xx, yy);
          if (w.state[i] != kKnown || (w.source[i] & kForeign)) {
            ok = false;
            break;
          }
        }
      }
      if (ok) s |= kSourceFilled;
    }
  }
}

// Copies the source window into the unfilled pixels of the target window
// (keeping each target pixel's alpha) and gives them the target point's mean
// window confidence.
void update_fixed(Work& w, int x, int y, int sx, int sy) {
  const int W = w.W;
  const int32_t c = confidence_term(w, x, y) - 1;
  for (int dy = -W; dy <= W; ++dy) {
    const int yy = y + dy;
    if (yy < 0 || yy >= w.rh) continue;
    for (int dx = -W; dx <= W; ++dx) {
      const int xx = x + dx;
      if (xx < 0 || xx >= w.rw) continue;
      const int i = w.at(xx, yy);
      if (w.state[i] == kKnown) continue;
      const int src = w.pixel(sx + dx, sy + dy);
      int& dst = w.pic[(w.oy + yy) * w.width + w.ox + xx];
      dst = static_cast<int>((static_cast<uint32_t>(dst) & 0xFF000000u) | (static_cast<uint32_t>(src) & 0xFFFFFFu));
      w.gray[i] = w.gray[w.at(sx + dx, sy + dy)];
      w.conf[i] = c;
      w.state[i] = kKnown;
    }
  }
}

void update_boundary(Work& w, int x, int y) {
  const int r = w.W + 1;
  for (int yy = y - r; yy <= y + r; ++yy) {
    if (yy < 0 || yy >= w.rh) continue;
    for (int xx = x - r; xx <= x + r; ++xx) {
      if (xx < 0 || xx >= w.rw) continue;
      const int i = w.at(xx, yy);
      if (w.state[i] == kUnknown && on_front(w, xx, yy)) {
        w.state[i] = kFront;
        insert_linked_pt(w, xx, yy, 0);
      }
    }
  }
}

void update_pri_fixed(Work& w, int x, int y) {
  const int r = 2 * w.W + 2;
  for (int yy = y - r; yy <= y + r; ++yy) {
    if (yy < 0 || yy >= w.rh) continue;
    for (int xx = x - r; xx <= x + r; ++xx) {
      if (xx < 0 || xx >= w.rw) continue;
      const int i = w.at(xx, yy);
      if (w.state[i] == kFront && w.node_of[i] >= 0) w.nodes[w.node_of[i]].pri = priority(w, xx, yy);
    }
  }
}

// Target selection: drops nodes whose pixel was filled, prefers label-10
// points, then the highest priority, the later point on equal priority.
// Returns the node, or -1 when the front is empty.
int select_target(Work& w) {
  int best = -1;
  bool best10 = false;
  int prev = -1;
  for (int n = w.head; n >= 0;) {
    Node& node = w.nodes[n];
    const int next = node.next;
    const int i = w.at(node.x, node.y);
    if (w.state[i] != kFront) {  // del_linked_pt
      if (prev < 0) {
        w.head = next;
      } else {
        w.nodes[prev].next = next;
      }
      if (w.tail == n) w.tail = prev;
      if (w.node_of[i] == n) w.node_of[i] = -1;
      n = next;
      continue;
    }
    const bool is10 = w.label[i] == kTargetLabel;
    if (best < 0 || (is10 && !best10) || (is10 == best10 && node.pri >= w.nodes[best].pri)) {
      best = n;
      best10 = is10;
    }
    prev = n;
    n = next;
  }
  return best;
}

// Waits while a stop request is pending; false when an exit request came.
// Every turn of the wait marks the pause again, so a status written from
// outside meanwhile (setEraserStatus) cannot leave a paused run where
// reStartEraser and exitEraser refuse it; a running round likewise marks
// itself running again.
bool honour_requests() {
  while (g_bStop.load() && !g_bExit.load()) {
    g_status_photoeraser.store(PX_ERASER_PAUSED);
    std::this_thread::sleep_for(std::chrono::microseconds(200));
  }
  if (g_bExit.load()) return false;
  g_status_photoeraser.store(PX_ERASER_RUNNING);
  return true;
}

int finish(Work& w, int result) {
  w.free_all();
  if (result != PX_ERR_ALLOC && g_bExit.load()) result = PX_ERR_ERASER_BUSY;
  g_bStop.store(0);
  g_bExit.store(0);
  g_status_photoeraser.store(PX_ERASER_IDLE);
  g_claimed.store(false);
  return result;
}
}  // namespace

// ---- public pieces ---------------------------------------------------------------

void px_eraser_normal(int dx, int dy, int32_t* nx, int32_t* ny) {
  if (dx < -2 || dx > 2 || dy < -2 || dy > 2) dx = dy = 0;
  const int i = ((dy + 2) * 5 + dx + 2) * 2;
  *nx = normLUT.v[i];
  *ny = normLUT.v[i + 1];
}

px_rect px_eraser_even_rect(px_rect r, int width, int height) {
  if (r.left & 1) r.left = r.left - 1 < 0 ? 0 : r.left - 1;
  if (r.top & 1) r.top = r.top - 1 < 0 ? 0 : r.top - 1;
  if (!(r.right & 1)) r.right = r.right + 1 > width - 1 ? width - 1 : r.right + 1;
  if (!(r.bottom & 1)) r.bottom = r.bottom + 1 > height - 1 ? height - 1 : r.bottom + 1;
  return r;
}

void px_eraser_sizes(int width, int height, int* patchsize, int* winsize) {
  const int longer = width < height ? height : width;
  if (longer >= 1280) {
    *patchsize = 50;
    *winsize = 6;
  } else if (longer >= 640) {
    *patchsize = 30;
    *winsize = 3;
  } else {
    *patchsize = 20;
    *winsize = 2;
  }
}

int32_t px_dset_find(px_dset_elt* set, int32_t x) {
  int32_t r = x;
  while (set[r].parent != r) r = set[r].parent;
  set[x].parent = r;
  return r;
}

int32_t px_dset_join(px_dset_elt* set, int32_t a, int32_t b) {
  if (set[a].size > set[b].size) {
    set[b].parent = a;
    set[a].size += set[b].size;
    return a;
  }
  set[a].parent = b;
  set[b].size += set[a].size;
  return b;
}

int px_segment_graph(px_seg_edge* edges, int nedges, int count, int size_bound, int32_t* root) {
  if (count <= 0) return 0;
  px_dset_elt* set = static_cast<px_dset_elt*>(px_malloc(static_cast<size_t>(count), sizeof(px_dset_elt)));
  uint16_t* threshold = static_cast<uint16_t*>(px_malloc(static_cast<size_t>(count), sizeof(uint16_t)));
  px_seg_edge* sorted = static_cast<px_seg_edge*>(px_malloc(static_cast<size_t>(nedges > 0 ? nedges : 1), sizeof(px_seg_edge)));
  int32_t* bucket = static_cast<int32_t*>(px_calloc(767, sizeof(int32_t)));
  if (!set || !threshold || !sorted || !bucket) {
    px_free(set);
    px_free(threshold);
    px_free(sorted);
    px_free(bucket);
    return -1;
  }
  // Ascending weights, equal weights in their original order.
  for (int e = 0; e < nedges; ++e) ++bucket[(edges[e].w > 765 ? 765 : edges[e].w) + 1];
  for (int k = 1; k < 767; ++k) bucket[k] += bucket[k - 1];
  for (int e = 0; e < nedges; ++e) sorted[bucket[edges[e].w > 765 ? 765 : edges[e].w]++] = edges[e];
  std::memcpy(edges, sorted, static_cast<size_t>(nedges) * sizeof(px_seg_edge));
  for (int v = 0; v < count; ++v) {
    set[v] = px_dset_elt{v, 1};
    threshold[v] = 1;
  }
  int components = count;
  for (int e = 0; e < nedges; ++e) {
    const int32_t a = px_dset_find(set, edges[e].a), b = px_dset_find(set, edges[e].b);
    if (a == b || threshold[a] < edges[e].w || threshold[b] < edges[e].w) continue;
    threshold[px_dset_join(set, a, b)] = edges[e].w;
    --components;
  }
  const int small = size_bound / 5;
  for (int e = 0; e < nedges; ++e) {
    const int32_t a = px_dset_find(set, edges[e].a), b = px_dset_find(set, edges[e].b);
    if (a == b || (set[a].size >= small && set[b].size >= small)) continue;
    px_dset_join(set, a, b);
    --components;
  }
  for (int v = 0; v < count; ++v) root[v] = px_dset_find(set, v);
  px_free(set);
  px_free(threshold);
  px_free(sorted);
  px_free(bucket);
  return components;
}

// ---- control -----------------------------------------------------------------------

int stop_photoeraser() {
  if (g_status_photoeraser.load() == PX_ERASER_IDLE) return PX_ERR_ERASER_STATE;
  g_bStop.store(1);
  return PX_OK;
}

int restart_photoeraser() {
  const int32_t s = g_status_photoeraser.load();
  if (s == PX_ERASER_IDLE) return PX_ERR_ERASER_STATE;
  if (s == PX_ERASER_RUNNING) return PX_ERR_ERASER_RESTART;
  g_bStop.store(0);
  return PX_OK;
}

int exit_photoeraser() {
  if (g_status_photoeraser.load() == PX_ERASER_IDLE) return PX_ERR_ERASER_STATE;
  g_bExit.store(1);
  return PX_OK;
}

int get_status_photoeraser() { return g_status_photoeraser.load(); }
void set_status_photoeraser(int status) { g_status_photoeraser.store(status); }

bool px_eraser_claim() {
  bool expected = false;
  return g_claimed.compare_exchange_strong(expected, true);
}
void px_eraser_release() { g_claimed.store(false); }

void set_eraser_maskvalue(int r, int g, int b) {
  g_MaskR.store(r & 255);
  g_MaskG.store(g & 255);
  g_MaskB.store(b & 255);
}
void get_eraser_maskvalue(int* r, int* g, int* b) {
  *r = g_MaskR.load();
  *g = g_MaskG.load();
  *b = g_MaskB.load();
}
void set_callback_eraserfunc(px_eraser_callback fn) { callback_earserfunc.store(fn); }
px_eraser_callback get_callback_eraserfunc() { return callback_earserfunc.load(); }

void px_eraser_set_progress(px_eraser_progress_fn fn, void* context) {
  g_progress = fn;
  g_progress_context = context;
}

// ---- the run -------------------------------------------------------------------------

// Requests left over from an earlier run are cleared before the status turns
// to running (and again at the end), so every run starts unpaused; a request
// can only be made once the status shows the run.
int process_photoeraser(int* picture, const unsigned char* mask, int width, int height, int left, int right,
                        int top, int bottom) {
  Work w;
  g_bStop.store(0);
  g_bExit.store(0);
  g_status_photoeraser.store(PX_ERASER_RUNNING);
  if (!picture || !mask || width <= 0 || height <= 0) return finish(w, PX_ERR_NULL);
  px_rect r{left, right, top, bottom};
  if (px_rect_empty(r)) return finish(w, PX_OK);
  r = px_rect_clip(r, width, height);
  if (px_rect_empty(r)) return finish(w, PX_OK);
  r = px_eraser_even_rect(r, width, height);

  w.pic = picture;
  w.width = width;
  w.height = height;
  px_eraser_sizes(width, height, &w.P, &w.W);
  const int grow = w.P + w.W;
  w.ox = r.left - grow < 0 ? 0 : r.left - grow;
  w.oy = r.top - grow < 0 ? 0 : r.top - grow;
  w.rw = (r.right + grow > width - 1 ? width - 1 : r.right + grow) - w.ox + 1;
  w.rh = (r.bottom + grow > height - 1 ? height - 1 : r.bottom + grow) - w.oy + 1;
  const size_t area = static_cast<size_t>(w.rw) * w.rh;

  w.label = static_cast<unsigned char*>(px_calloc(area, 1));
  w.state = static_cast<unsigned char*>(px_calloc(area, 1));
  w.conf = static_cast<int32_t*>(px_calloc(area, sizeof(int32_t)));
  w.gray = static_cast<unsigned char*>(px_calloc(area, 1));
  w.source = static_cast<unsigned char*>(px_calloc(area, 1));
  w.node_of = static_cast<int32_t*>(px_malloc(area, sizeof(int32_t)));
  if (!w.label || !w.state || !w.conf || !w.gray || !w.source || !w.node_of) return finish(w, PX_ERR_ALLOC);
  int holes = 0;
  for (int y = 0; y < w.rh; ++y) {
    for (int x = 0; x < w.rw; ++x) {
      const int px = w.ox + x, py = w.oy + y;
      const bool hole = px >= r.left && px <= r.right && py >= r.top && py <= r.bottom && mask[py * width + px] == 1;
      w.state[w.at(x, y)] = hole ? kUnknown : kKnown;
      w.node_of[w.at(x, y)] = -1;
      holes += hole;
    }
  }
  // The node block: a fifth of the region, or one node a hole pixel when
  // that is more (every hole pixel joins the front at most once).
  const int capacity = static_cast<int>(area / 5) > holes ? static_cast<int>(area / 5) : holes + 1;
  if (!alloc_linked_memory(w, capacity)) return finish(w, PX_ERR_ALLOC);
  if (holes == 0) return finish(w, PX_OK);

  draw_boundary_fixed(w);
  if (!g_bStop.load() && !g_bExit.load()) {
    const px_rect seg = px_rect_clip(px_rect{r.left - w.P, r.right + w.P, r.top - w.P, r.bottom + w.P}, width, height);
    if (!segment_and_label(w, seg)) return finish(w, PX_ERR_ALLOC);
  }
  get_gray_confid(w);
  if (!draw_source(w, mask)) return finish(w, PX_ERR_ALLOC);
  for (int y = 0; y < w.rh; ++y) {
    for (int x = 0; x < w.rw; ++x) {
      if (w.state[w.at(x, y)] == kFront) insert_linked_pt(w, x, y, priority(w, x, y));
    }
  }

  for (int round = 0;; ++round) {
    if (!honour_requests()) break;
    const int n = select_target(w);
    if (n < 0) break;
    const int tx = w.nodes[n].x, ty = w.nodes[n].y;
    int sx = 0, sy = 0;
    if (!patch_texture(w, tx, ty, &sx, &sy)) break;
    update_fixed(w, tx, ty, sx, sy);
    update_boundary(w, tx, ty);
    update_pri_fixed(w, tx, ty);
    update_source(w, tx, ty);
    if (round % 4 == 0 && g_progress) g_progress(g_progress_context, round);
  }
  return finish(w, PX_OK);
}
