// One saved mask region and one saved pixel region, kept between calls so the
// Java side can undo a step. Each store replaces the saved block of its kind,
// each delete frees it, a recover copies it back and keeps it.
#pragma once

#include "../px_types.h"

enum px_stored_kind { PX_STORED_MASK = 0, PX_STORED_OBJECT = 1 };

// Saves the rectangle (inclusive, inside the picture, or empty) of a
// row-major array of `width` elements of `element_size` bytes, replacing the
// previous block of that kind. An empty rectangle (right < left or
// top > bottom) saves an empty block: the saved state exists but holds no
// elements, and recovering it writes nothing. Returns 0, or PX_ERR_ALLOC.
int px_store_region(px_stored_kind kind, const void* source, int element_size, int width, px_rect rect);

// Copies the saved block back to `rect` of the array (at most the saved
// block's width and height, within the rectangle; nothing for an empty
// rectangle). -1 when nothing is saved.
int px_recover_region(px_stored_kind kind, void* target, int element_size, int width, px_rect rect);

void px_delete_stored_region(px_stored_kind kind);

// Whether a block is saved, and its size in elements.
bool px_stored_region_size(px_stored_kind kind, int* width, int* height);
