// The object eraser: fills the masked pixels of a rectangle patch by patch,
// from the outside in, with patches copied from the rest of the picture
// (exemplar-based filling in priority order, guided by a colour segmentation
// of the surroundings).
//
// One run occupies the calling thread. The status word and the stop and exit
// flags are atomics: another thread may read the status and request a pause,
// a resume or an abort while a run goes on; a request takes effect at the next
// round of the fill loop.
#pragma once

#include <atomic>
#include <cstdint>

#include "../px_types.h"

enum : int32_t {
  PX_ERASER_IDLE = 53249,     // 0xD001 idle or finished
  PX_ERASER_PAUSED = 53250,   // 0xD002 paused by a stop request
  PX_ERASER_RUNNING = 53251,  // 0xD003 running
};

extern std::atomic<int32_t> g_status_photoeraser;
extern std::atomic<int32_t> g_bStop;
extern std::atomic<int32_t> g_bExit;

// Progress publisher: called by the fill loop every 4 rounds (rounds 0, 4,
// 8, ...) with the round number, after the picture holds the pixels filled so
// far. The bridge uses it to commit the picture to the Java array.
using px_eraser_progress_fn = void (*)(void* context, int round);
void px_eraser_set_progress(px_eraser_progress_fn fn, void* context);

// Fills the pixels whose mask byte is 1 inside the inclusive rectangle
// (left, right, top, bottom) of the ARGB picture, in place. Returns 40960
// finished, 40967 aborted by an exit request, 40961 out of memory. The
// status is 53249 on return in every case.
int process_photoeraser(int* picture, const unsigned char* mask, int width, int height, int left, int right,
                        int top, int bottom);

int stop_photoeraser();     // 40965 when idle, else requests a pause: 40960
int restart_photoeraser();  // 40965 idle, 40966 running unpaused, else resumes: 40960
int exit_photoeraser();     // 40965 when idle, else requests an abort: 40960
int get_status_photoeraser();
void set_status_photoeraser(int status);

// Claims the eraser for one run from the bridge: false while a run is going.
// A claimed run must be finished with process_photoeraser (which releases
// the claim) or px_eraser_release.
bool px_eraser_claim();
void px_eraser_release();

void set_eraser_maskvalue(int r, int g, int b);
void get_eraser_maskvalue(int* r, int* g, int* b);
using px_eraser_callback = void (*)(int32_t, int32_t, int32_t, int32_t);
void set_callback_eraserfunc(px_eraser_callback fn);
px_eraser_callback get_callback_eraserfunc();

// ---- pieces of the run, exposed for tests -------------------------------------

// Evens the rectangle: left and top lowered to even (not below 0), right and
// bottom raised to odd (not above width-1 / height-1).
px_rect px_eraser_even_rect(px_rect r, int width, int height);

// Search radius and comparison window half-size for a picture.
void px_eraser_sizes(int width, int height, int* patchsize, int* winsize);

// Colour segmentation of `count` vertices joined by edges. Weights below 20
// become 0; only weight-0 edges join in the first pass; the second pass joins
// components of which either is smaller than min_size. On return root[i] is
// the representative of vertex i. Returns the number of components, or -1
// when out of memory.
struct px_seg_edge {
  uint16_t w;
  int32_t a;
  int32_t b;
};
int px_segment_graph(px_seg_edge* edges, int nedges, int count, int min_size, int32_t* root);

// The disjoint set with its find and join rules (for tests).
struct px_dset_elt {
  int32_t parent;
  int32_t size;
};
int32_t px_dset_find(px_dset_elt* set, int32_t x);
int32_t px_dset_join(px_dset_elt* set, int32_t a, int32_t b);  // returns the new root

// The 16.16 unit normal to the fill front for the offset (dx, dy) between two
// front pixels, dx and dy in -2..2; (0, 0) gives the default (0.6, 0.8).
void px_eraser_normal(int dx, int dy, int32_t* nx, int32_t* ny);
