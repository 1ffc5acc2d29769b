// Types and result codes shared by every engine operation and the bridge.
#pragma once

#include <cstddef>
#include <cstdint>

// Result codes returned to Java (0xA000 family).
enum : int {
  PX_OK = 40960,               // 0xA000 success
  PX_ERR_ALLOC = 40961,        // 0xA001 a working buffer could not be allocated
  PX_ERR_NULL = 40962,         // 0xA002 a required array is null (also: refused bad input)
  PX_ERR_ERASER_STATE = 40965, // 0xA005
  PX_ERR_ERASER_RESTART = 40966,
  PX_ERR_ERASER_BUSY = 40967,
  PX_ERR_NO_POINT = 40968,
  PX_ERR_EFFECT = 40971,       // 0xA00B the effect library reported failure
};

// Inclusive rectangle, in this field order. Empty when right < left or
// top > bottom; an empty rectangle means "the whole picture" to the region
// operations.
struct px_rect {
  int32_t left;
  int32_t right;
  int32_t top;
  int32_t bottom;
};

inline bool px_rect_empty(const px_rect& r) { return r.right < r.left || r.top > r.bottom; }

// Intersection of a non-empty rectangle with a width x height picture. The
// result is empty when the two do not overlap.
inline px_rect px_rect_clip(const px_rect& r, int width, int height) {
  px_rect c = r;
  if (c.left < 0) c.left = 0;
  if (c.top < 0) c.top = 0;
  if (c.right > width - 1) c.right = width - 1;
  if (c.bottom > height - 1) c.bottom = height - 1;
  return c;
}
