// Memory wrappers of the engine operations and the bridge: plain forwards to
// the C library, so an allocation failure is seen as a null result.
#pragma once

#include <cstddef>

void* px_malloc(size_t count, size_t size);  // malloc(count * size), product unchecked
void* px_calloc(size_t count, size_t size);
void* px_realloc(void* p, size_t size);
void px_free(void* p);
void* px_memset(void* d, int value, size_t n);
void* px_memcpy(void* d, const void* s, size_t n);
