#include "px_mem.h"

#include <cstdlib>
#include <cstring>

void* px_malloc(size_t count, size_t size) { return std::malloc(count * size); }
void* px_calloc(size_t count, size_t size) { return std::calloc(count, size); }
void* px_realloc(void* p, size_t size) { return std::realloc(p, size); }
void px_free(void* p) { std::free(p); }
void* px_memset(void* d, int value, size_t n) { return std::memset(d, value, n); }
void* px_memcpy(void* d, const void* s, size_t n) { return std::memcpy(d, s, n); }
