// Memory wrappers of the engine operations and the bridge: forwards to the C
// library, so an allocation failure is seen as a null result. A test hook can
// make one chosen allocation fail, and the wrappers count the blocks they
// hand out and take back, so tests can see that a failed call frees what it
// took.
#pragma once

#include <cstddef>

void* px_malloc(size_t count, size_t size);  // malloc(count * size), product unchecked
void* px_calloc(size_t count, size_t size);
void* px_realloc(void* p, size_t size);
void px_free(void* p);
void* px_memset(void* d, int value, size_t n);

// Picture-sized working buffers (not zero-filled: the caller writes every
// byte). Blocks of a few megabytes get their own mapping, aligned so that the
// kernel may back it with large pages where it offers them (a fresh 36 MB
// buffer otherwise costs some 9000 page faults, several times the time of
// writing it); smaller ones come from malloc. Free only with px_free_large.
// Aligned as malloc's blocks. The failure hook and the block count treat
// them as px_malloc's.
void* px_malloc_large(size_t bytes);
void px_free_large(void* p);
void* px_memcpy(void* d, const void* s, size_t n);

// ---- test hooks (px_ and if_ allocations alike) -------------------------------

// The n-th allocation from now (1: the next one) returns null; the others go
// through. 0 or less turns the hook off.
void px_mem_fail_nth(long n);
// Whether the hook is still waiting for its allocation (it had fewer than n).
bool px_mem_fail_pending();
// Blocks handed out and not yet freed, by every wrapper since the start.
long px_mem_live_blocks();
// Allocations that came back null (from the hook or the C library) since the
// start: an operation whose parts give up quietly on a missing buffer (the
// face detectors) compares it before and after to report the failure.
long px_mem_failures();

// For the if_ wrappers: whether this allocation is the one to fail, and the
// bookkeeping of a block handed out (delta 1, a null block counted as a
// failure) or freed (delta -1).
bool px_mem_take_failure();
void px_mem_count(const void* block, int delta);
