#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "effect/kalo/if_utils_and.h"
#include "effect/kalo/px_mem.h"
#include "effect/kalo/px_parallel.h"
#include "log_capture.h"

TEST(Platform, CheckedAllocationRefusesEmptySizes) {
  EXPECT_EQ(if_malloc(0, __FILE__, __LINE__), nullptr);
  EXPECT_EQ(if_malloc(-5, __FILE__, __LINE__), nullptr);
  EXPECT_EQ(if_calloc(4, 0, __FILE__, __LINE__), nullptr);
  EXPECT_EQ(if_calloc(0, 4, __FILE__, __LINE__), nullptr);
  auto* p = static_cast<unsigned char*>(if_calloc(3, 5, __FILE__, __LINE__));
  ASSERT_NE(p, nullptr);
  for (int i = 0; i < 15; ++i) EXPECT_EQ(p[i], 0);
  if_free(p, __FILE__, __LINE__);
  if_free(nullptr, __FILE__, __LINE__);  // harmless
  void* z = px_malloc(0, 4);             // forwarded as malloc(0)
  px_free(z);
}

// Picture-sized blocks below and above the size that gets its own mapping:
// every byte usable, freed blocks no longer counted, the failure hook obeyed.
TEST(Platform, LargeBlocksAreWholeCountedAndCanFail) {
  const long live = px_mem_live_blocks();
  for (size_t bytes : {size_t{1}, size_t{12345}, (size_t{4} << 20) - 1, size_t{4} << 20, (size_t{9} << 20) + 7}) {
    auto* a = static_cast<unsigned char*>(px_malloc_large(bytes));
    auto* b = static_cast<unsigned char*>(px_malloc_large(bytes));
    ASSERT_NE(a, nullptr) << bytes;
    ASSERT_NE(b, nullptr) << bytes;
    EXPECT_EQ(reinterpret_cast<uintptr_t>(a) % alignof(std::max_align_t), 0u) << bytes;
    EXPECT_EQ(px_mem_live_blocks(), live + 2);
    // Two blocks that do not overlap, each written end to end.
    std::memset(a, 0x3C, bytes);
    std::memset(b, 0xC3, bytes);
    EXPECT_EQ(a[0], 0x3C);
    EXPECT_EQ(a[bytes - 1], 0x3C) << bytes;
    EXPECT_EQ(b[bytes / 2], 0xC3) << bytes;
    px_free_large(a);
    px_free_large(b);
    EXPECT_EQ(px_mem_live_blocks(), live);
  }
  const long failures = px_mem_failures();
  px_mem_fail_nth(2);
  void* first = px_malloc_large(size_t{5} << 20);
  void* second = px_malloc_large(size_t{5} << 20);
  EXPECT_NE(first, nullptr);
  EXPECT_EQ(second, nullptr);
  EXPECT_FALSE(px_mem_fail_pending());
  EXPECT_EQ(px_mem_failures(), failures + 1);
  px_free_large(first);
  px_free_large(second);  // null: nothing to do
  EXPECT_EQ(px_mem_live_blocks(), live);
}

TEST(Platform, MemsetIgnoresNullAndNonPositiveCounts) {
  unsigned char b[4] = {1, 2, 3, 4};
  EXPECT_EQ(if_memset(nullptr, 0, 4), nullptr);
  EXPECT_EQ(if_memset(b, 9, 0), b);
  EXPECT_EQ(if_memset(b, 9, -2), b);
  EXPECT_EQ(b[0], 1);
  if_memset(b, 9, 2);
  EXPECT_EQ(b[1], 9);
  EXPECT_EQ(b[2], 3);
}

TEST(Platform, ErrorMessageLineFormat) {
  LogCapture log;
  if_error_msg("IEL_Test", 42, "value %d and %s \n", 7, "x");
  ASSERT_EQ(log.all().size(), 1u);
  EXPECT_EQ(log.all()[0], "KALO_PE:|Func: IEL_Test() \t Line:42 \t value 7 and x \n");
}

TEST(Platform, ErrorMessageIsBounded) {
  LogCapture log;
  std::string longText(1000, 'a');
  if_error_msg("f", 1, "%s", longText.c_str());
  ASSERT_EQ(log.all().size(), 1u);
  // The message is cut to its 200-byte buffer.
  EXPECT_EQ(log.all()[0].size(), std::strlen("KALO_PE:|Func: f() \t Line:1 \t ") + 199);
}

TEST(Platform, SprintfRefusesMoreThanEightConversions) {
  char buf[128] = "untouched";
  EXPECT_EQ(if_sprintf(buf, "%d%d%d%d%d%d%d%d%d", 1, 2, 3, 4, 5, 6, 7, 8, 9), 0);
  EXPECT_STREQ(buf, "untouched");
  EXPECT_EQ(if_sprintf(buf, "%d-%d", 12, 34), 5);
  EXPECT_STREQ(buf, "12-34");
  EXPECT_EQ(if_snprintf(buf, sizeof buf, "%d", 1), 0);
}

TEST(Platform, DeferredWorkRunsOnCaller) {
  static int calls;
  calls = 0;
  int context = 5;
  if_thread_record* h = if_create_thread(
      [](if_thread_record* r, int a, int b) { calls += *static_cast<int*>(r->context) + a + b; }, nullptr, &context);
  ASSERT_NE(h, nullptr);
  EXPECT_EQ(if_execute_threads(&h, 1, 2), 1);
  EXPECT_EQ(calls, 8);
  EXPECT_EQ(if_delete_threads(&h), 1);
  EXPECT_EQ(h, nullptr);
  EXPECT_EQ(if_execute_threads(&h, 1, 2), 0);
  EXPECT_EQ(if_delete_threads(nullptr), 1);
}

TEST(Platform, ClockAdvancesInMilliseconds) {
  int a = if_get_time();
  int b = if_get_time();
  EXPECT_GE(b - a, 0);
  EXPECT_LT(b - a, 1000);
}

TEST(Platform, BandsCoverEveryRowOnce) {
  for (int rows : {1, 7, 64, 129, 1000}) {
    std::vector<int> hits(rows, 0);
    px_for_rows(rows, [&](int y0, int y1) {
      for (int y = y0; y < y1; ++y) hits[y]++;
    }, 16);
    for (int y = 0; y < rows; ++y) ASSERT_EQ(hits[y], 1) << rows << " rows, row " << y;
  }
  bool was = px_scalar_only();
  px_set_scalar_only(true);
  EXPECT_EQ(px_band_count(10000, 1), 1);
  px_set_scalar_only(was);
}

TEST(Platform, ThreadCapLimitsBands) {
  const bool was = px_scalar_only();
  px_set_scalar_only(false);
  px_set_thread_count(0);
  const int all = px_thread_count();
  EXPECT_GE(all, 1);
  EXPECT_LE(all, 8);
  EXPECT_EQ(px_band_count(10000, 1), all);
  px_set_thread_count(1);
  EXPECT_EQ(px_thread_count(), 1);
  EXPECT_EQ(px_band_count(10000, 1), 1);
  px_set_thread_count(2);
  EXPECT_EQ(px_band_count(10000, 1), all < 2 ? all : 2);
  // A cap still splits the rows exactly once each.
  std::vector<int> hits(999, 0);
  px_for_rows(999, [&](int y0, int y1) {
    for (int y = y0; y < y1; ++y) hits[y]++;
  }, 1);
  for (int h : hits) ASSERT_EQ(h, 1);
  px_set_thread_count(0);
  EXPECT_EQ(px_thread_count(), all);
  px_set_scalar_only(was);
}
