// Pieces shared by the filter sources: the partial-form frame and a pixel
// loop over two pictures.
#pragma once

#include <cstdint>
#include <cstring>
#include <type_traits>

#include "../kalo/if_utils_and.h"
#include "../kalo/px_mem.h"
#include "../kalo/px_parallel.h"
#include "../px_color/px_region.h"
#include "../px_types.h"

namespace px_filter {

// Runs `whole(scratch)` into a zero-filled working picture, then copies it
// to the output: the selected pixels of a non-empty rectangle (clipped to the
// picture), or everything for an empty one. Pixels not copied keep what the
// output held. Returns false (logged, output untouched) when the working
// picture cannot be allocated.
template <class Whole>
bool partial(const char* func, int* out, const unsigned char* mask, int width, int height, int left, int right,
             int top, int bottom, Whole whole) {
  if (!out || width <= 0 || height <= 0) return false;
  const size_t n = static_cast<size_t>(width) * static_cast<size_t>(height);
  auto* scratch = static_cast<int*>(px_calloc(n, 4));
  if (!scratch) {
    if_error_msg(func, __LINE__, "Low memory: %s\n", func);
    return false;
  }
  // A whole-picture form that ran short of memory has logged it and written
  // nothing: nothing is merged either.
  const long failures = px_mem_failures();
  bool done = true;
  if constexpr (std::is_same_v<decltype(whole(scratch)), bool>) {
    done = whole(scratch);
  } else {
    whole(scratch);
  }
  if (!done || px_mem_failures() != failures) {
    px_free(scratch);
    return false;
  }
  px_merge_selected(scratch, out, mask, width, height, px_rect{left, right, top, bottom});
  px_free(scratch);
  return true;
}

// out[i] = fn(a[i], b[i]) over the whole picture, in row bands.
template <class Fn>
void map2(const int* a, const int* b, int* out, int width, int height, Fn fn) {
  if (width <= 0 || height <= 0) return;
  const auto* pa = reinterpret_cast<const uint32_t*>(a);
  const auto* pb = reinterpret_cast<const uint32_t*>(b);
  auto* po = reinterpret_cast<uint32_t*>(out);
  const size_t w = static_cast<size_t>(width);
  px_for_rows(height, [&](int y0, int y1) {
    for (size_t i = static_cast<size_t>(y0) * w, end = static_cast<size_t>(y1) * w; i < end; ++i) {
      po[i] = fn(pa[i], pb[i]);
    }
  });
}

}  // namespace px_filter
