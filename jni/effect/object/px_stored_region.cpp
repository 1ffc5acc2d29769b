#include "px_stored_region.h"

#include <cstring>

#include "../kalo/px_mem.h"

namespace {
struct Block {
  unsigned char* data = nullptr;
  int width = 0;   // elements a row
  int height = 0;  // rows
  int element_size = 0;
};
Block g_saved[2];

// Elements a row and rows of a rectangle: none at all when it is empty on
// either axis (so an empty rectangle never walks its rows).
void extent(px_rect r, int* w, int* h) {
  if (px_rect_empty(r)) {
    *w = *h = 0;
    return;
  }
  *w = r.right - r.left + 1;
  *h = r.bottom - r.top + 1;
}
}  // namespace

int px_store_region(px_stored_kind kind, const void* source, int element_size, int width, px_rect rect) {
  Block& b = g_saved[kind];
  px_free(b.data);
  b = Block{};
  int w, h;
  extent(rect, &w, &h);
  const size_t row = static_cast<size_t>(w) * element_size;
  // At least one byte, so an empty region still counts as saved.
  b.data = static_cast<unsigned char*>(px_malloc(row * h + 1, 1));
  if (!b.data) return PX_ERR_ALLOC;
  b.width = w;
  b.height = h;
  b.element_size = element_size;
  const auto* src = static_cast<const unsigned char*>(source);
  for (int i = 0; i < h; ++i) {
    const size_t at = (static_cast<size_t>(rect.top + i) * width + rect.left) * element_size;
    std::memcpy(b.data + row * i, src + at, row);
  }
  return 0;
}

int px_recover_region(px_stored_kind kind, void* target, int element_size, int width, px_rect rect) {
  const Block& b = g_saved[kind];
  if (!b.data) return -1;
  if (b.element_size != element_size && b.width * b.height > 0) return -1;
  int w, h;
  extent(rect, &w, &h);
  if (w > b.width) w = b.width;
  if (h > b.height) h = b.height;
  auto* dst = static_cast<unsigned char*>(target);
  const size_t row = static_cast<size_t>(b.width) * element_size;
  for (int i = 0; i < h; ++i) {
    const size_t at = (static_cast<size_t>(rect.top + i) * width + rect.left) * element_size;
    std::memcpy(dst + at, b.data + row * i, static_cast<size_t>(w) * element_size);
  }
  return 0;
}

void px_delete_stored_region(px_stored_kind kind) {
  px_free(g_saved[kind].data);
  g_saved[kind] = Block{};
}

bool px_stored_region_size(px_stored_kind kind, int* width, int* height) {
  const Block& b = g_saved[kind];
  if (width) *width = b.width;
  if (height) *height = b.height;
  return b.data != nullptr;
}
