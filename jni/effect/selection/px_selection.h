// Selection tools: the edge-snapping lasso (a linked list of points joined by
// least-cost paths along the picture's edges), tap-to-select (the connected
// region of similar colour around a point) and the refinements of a mask
// (grow, shrink, fill holes). The design is written out at the top of
// px_selection.cpp.
//
// Outline coordinates are pixel corners: the corner (x, y) is the top-left
// corner of pixel (x, y), so corners run 0..width and 0..height, and a pixel
// is inside a closed outline when its centre (x + 0.5, y + 0.5) is.
#pragma once

#include <cstdint>

#include "../px_types.h"

// ---- the lasso session (process-wide state) -----------------------------------

// Starts a selection on an ARGB picture (ends any earlier one): keeps a copy of
// the picture and computes the edge cost of the reduced picture. 40960, 40962
// for a bad size, 40961 when memory runs short (no session is left then).
int px_selection_start(const int* argb, int width, int height);
// Frees the session. Always 40960.
int px_selection_finish();
bool px_selection_active();
int px_selection_width();
int px_selection_height();

// Appends a point (a tap at pixel (x, y)); it is snapped to the strongest edge
// within 2 pixels and joined to the previous point by a least-cost path.
// Returns the new segment's length in steps (0 for the first point, at most
// 40959); 40962 without a session or for a point outside the picture; 40961
// when memory runs short. A refused call changes nothing.
int px_selection_add_point(int x, int y);
// Removes the point nearest (x, y) within 10 pixels (of where it was tapped or
// where it snapped to), and joins its neighbours. 40960; 40962 without a
// session or for (x, y) outside the picture; 40968 when the list is empty or
// no point is that near; 40961 when memory runs short.
int px_selection_remove_point(int x, int y);
// Moves the point nearest (x, y) (within 10 pixels) to (toX, toY), snapping it
// again and recomputing the two segments that touch it. Codes as for removal,
// and 40962 for a destination outside the picture.
int px_selection_move_point(int x, int y, int toX, int toY);
// The points in the list (0 without a session).
int px_selection_point_count();
// The open outline: the first point, then each later point's segment. Number
// of corners (0 without a session or points).
int px_selection_outline_length();
// Writes the open outline as x, y pairs into xy (room for `capacity` ints).
// The number of corners written, or -1 when xy is too short.
int px_selection_outline(int* xy, int capacity);
// Closes the outline (a least-cost path from the last point back to the
// first) and writes the mask of the session's size: 1 inside, 0 outside, and
// the bounding rectangle of the selected pixels (empty {0, -1, 0, -1} when
// none is). 40962 without a session or with fewer than 3 points; 40961 when
// memory runs short (the mask is not written then). The session stays open.
int px_selection_close(unsigned char* mask, px_rect* bounds);

// ---- building blocks (also used by the tests and the evaluation) ----------------

// Edge cost of every corner of a small picture (width + 1) x (height + 1),
// values 1 (a strong edge) .. 255 (flat). False when memory runs short.
bool px_selection_edge_cost(const int* argb, int width, int height, uint8_t* cost);

// Fills a closed polygon of corner coordinates (n points, x, y pairs; the last
// joins the first) into a width x height mask by the non-zero winding rule,
// sampling pixel centres (a centre exactly on an edge counts with the pixels
// left of it): 1 inside, 0 outside. False when memory runs short.
bool px_selection_fill_polygon(const int* xy, int n, unsigned char* mask, int width, int height);

// The bounding rectangle of the bytes equal to 1; {0, -1, 0, -1} when none.
px_rect px_selection_bounds(const unsigned char* mask, int width, int height);

// ---- tap-to-select and refinements ------------------------------------------------

enum : int {
  PX_SELECT_REPLACE = 0,
  PX_SELECT_ADD = 1,
  PX_SELECT_SUBTRACT = 2,
};

// Selects the 4-connected region of similar colour around pixel (x, y) and
// combines it with the mask by `mode`. Tolerance 0..100 (clamped): a
// neighbour joins when its summed |dR| + |dG| + |dB| to the pixel it is
// reached from is below 1 + (38 * t + 50) / 100 (20 at tolerance 50, the
// eraser's segmentation step) and its summed difference to the tapped pixel
// is below 6 times that. The mask comes back as 1 (selected) and 0; bytes
// other than 1 count as unselected. 40960; 40962 for a point outside or a bad
// mode; 40961 when memory runs short (the mask is unchanged then).
int px_selection_tap(const int* argb, unsigned char* mask, int width, int height, int x, int y, int tolerance,
                     int mode, px_rect* bounds);

// Grows the selection by n pixels (n > 0: every pixel within Euclidean
// distance n of a selected pixel) or shrinks it by -n (n < 0: a pixel stays
// when no unselected pixel lies within distance -n; outside the picture
// counts as neither). n = 0 only normalises the mask to 0 and 1.
int px_selection_grow(unsigned char* mask, int width, int height, int n, px_rect* bounds);

// Selects every unselected region (4-connected) that does not touch the
// border of the picture.
int px_selection_fill_holes(unsigned char* mask, int width, int height, px_rect* bounds);
