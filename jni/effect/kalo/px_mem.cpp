#include "px_mem.h"

#include <atomic>
#include <cstdlib>
#include <cstring>

namespace {
std::atomic<long> g_fail_countdown{0};
std::atomic<long> g_live{0};
std::atomic<long> g_failures{0};
}  // namespace

bool px_mem_take_failure() {
  if (g_fail_countdown.load(std::memory_order_relaxed) <= 0) return false;
  if (g_fail_countdown.fetch_sub(1, std::memory_order_relaxed) != 1) return false;
  g_failures.fetch_add(1, std::memory_order_relaxed);
  return true;
}

void px_mem_count(const void* block, int delta) {
  if (block) g_live.fetch_add(delta, std::memory_order_relaxed);
  else if (delta > 0) g_failures.fetch_add(1, std::memory_order_relaxed);
}

void px_mem_fail_nth(long n) { g_fail_countdown.store(n > 0 ? n : 0, std::memory_order_relaxed); }
bool px_mem_fail_pending() { return g_fail_countdown.load(std::memory_order_relaxed) > 0; }
long px_mem_live_blocks() { return g_live.load(std::memory_order_relaxed); }
long px_mem_failures() { return g_failures.load(std::memory_order_relaxed); }

void* px_malloc(size_t count, size_t size) {
  if (px_mem_take_failure()) return nullptr;
  void* p = std::malloc(count * size);
  px_mem_count(p, 1);
  return p;
}

void* px_calloc(size_t count, size_t size) {
  if (px_mem_take_failure()) return nullptr;
  void* p = std::calloc(count, size);
  px_mem_count(p, 1);
  return p;
}

void* px_realloc(void* p, size_t size) {
  if (px_mem_take_failure()) return nullptr;
  void* q = std::realloc(p, size);
  if (!p) px_mem_count(q, 1);
  else if (!q && size == 0) px_mem_count(p, -1);
  else if (!q) px_mem_count(nullptr, 1);
  return q;
}

void px_free(void* p) {
  px_mem_count(p, -1);
  std::free(p);
}

void* px_memset(void* d, int value, size_t n) { return std::memset(d, value, n); }
void* px_memcpy(void* d, const void* s, size_t n) { return std::memcpy(d, s, n); }
