#include "px_mem.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>

#if defined(__linux__)
#include <sys/mman.h>
#endif

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

// ---- large blocks ----------------------------------------------------------

namespace {
// Kept just before the block: where the memory came from, for px_free_large.
struct alignas(alignof(std::max_align_t)) LargeHeader {
  void* base;     // the mapping or the malloc block
  size_t length;  // of the mapping; 0 for a malloc block
};

constexpr size_t kLargePage = size_t{2} << 20;
constexpr size_t kMapFrom = size_t{4} << 20;

// Under AddressSanitizer every block comes from malloc, so that writes past
// its end are still reported (a mapping has no guard zones around it).
#if defined(__SANITIZE_ADDRESS__)
constexpr bool kMapLarge = false;
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
constexpr bool kMapLarge = false;
#else
constexpr bool kMapLarge = true;
#endif
#else
constexpr bool kMapLarge = true;
#endif

void* large_from_malloc(size_t bytes) {
  auto* base = static_cast<unsigned char*>(std::malloc(bytes + sizeof(LargeHeader)));
  if (!base) return nullptr;
  auto* header = reinterpret_cast<LargeHeader*>(base);
  *header = {base, 0};
  return header + 1;
}

void* large_from_mapping(size_t bytes) {
#if defined(__linux__) && defined(MAP_ANONYMOUS)
  // Room for the header, for starting it on a large-page boundary and for
  // ending on one; the slack is never touched, so it costs address space only.
  const size_t used = bytes + sizeof(LargeHeader) + kLargePage - 1;
  if (used < bytes) return nullptr;
  const size_t length = (used & ~(kLargePage - 1)) + kLargePage;
  if (length < used) return nullptr;
  void* base = mmap(nullptr, length, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (base == MAP_FAILED) return nullptr;
  const uintptr_t start = reinterpret_cast<uintptr_t>(base);
  const uintptr_t aligned = (start + kLargePage - 1) & ~static_cast<uintptr_t>(kLargePage - 1);
#if defined(MADV_HUGEPAGE)
  // Only a hint: kernels without large pages refuse it and nothing changes.
  madvise(reinterpret_cast<void*>(aligned), start + length - aligned, MADV_HUGEPAGE);
#endif
  auto* header = reinterpret_cast<LargeHeader*>(aligned);
  *header = {base, length};
  return header + 1;
#else
  (void)bytes;
  return nullptr;
#endif
}
}  // namespace

void* px_malloc_large(size_t bytes) {
  if (px_mem_take_failure()) return nullptr;
  void* p = kMapLarge && bytes >= kMapFrom ? large_from_mapping(bytes) : nullptr;
  if (!p) p = large_from_malloc(bytes);
  px_mem_count(p, 1);
  return p;
}

void px_free_large(void* p) {
  if (!p) return;
  px_mem_count(p, -1);
  const LargeHeader header = static_cast<LargeHeader*>(p)[-1];
#if defined(__linux__) && defined(MAP_ANONYMOUS)
  if (header.length) {
    munmap(header.base, header.length);
    return;
  }
#endif
  std::free(header.base);
}
