#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "effect/object/px_stored_region.h"
#include "pixel_buffers.h"

TEST(PixelBuffers, ConversionDropsAlphaAndTakesItBackFromTheSource) {
  const int argb[2] = {static_cast<int>(0x80FF0000), 0x00010203};
  unsigned char rgb[6] = {};
  convertIntArrayToByteArray(argb, rgb, 2, 1);
  EXPECT_EQ(std::vector<int>(rgb, rgb + 6), (std::vector<int>{0xFF, 0, 0, 1, 2, 3}));
  const int alpha[2] = {0x12345678, static_cast<int>(0xFF000000)};
  int out[2] = {};
  convertByteArraytoIntArray(rgb, out, alpha, 2, 1);
  EXPECT_EQ(static_cast<unsigned>(out[0]), 0x12FF0000u);
  EXPECT_EQ(static_cast<unsigned>(out[1]), 0xFF010203u);
}

TEST(PixelBuffers, EmptySizesWriteNothing) {
  int argb[1] = {0x01020304}, out[1] = {7};
  unsigned char rgb[3] = {9, 9, 9}, mask[1] = {1};
  for (auto [w, h] : {std::pair{0, 5}, {5, 0}, {-1, -1}, {-3, 2}}) {
    convertIntArrayToByteArray(argb, rgb, w, h);
    convertByteArraytoIntArray(rgb, out, argb, w, h);
    convertByteArraytoIntArrayUsingMask(rgb, out, argb, mask, w, h, px_rect{0, 0, 0, 0});
  }
  EXPECT_EQ(rgb[0], 9);
  EXPECT_EQ(out[0], 7);
}

TEST(PixelBuffers, MaskedMergeTakesOnlyByteOne) {
  const unsigned char rgb[9] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
  const int source[3] = {0x11AAAAAA, 0x22BBBBBB, 0x33CCCCCC};
  const unsigned char mask[3] = {1, 2, 0};
  int out[3] = {};
  // The rectangle only decides between "whole picture" and "by mask".
  convertByteArraytoIntArrayUsingMask(rgb, out, source, mask, 3, 1, px_rect{2, 2, 0, 0});
  EXPECT_EQ(out[0], 0x11010203);
  EXPECT_EQ(out[1], 0x22BBBBBB);
  EXPECT_EQ(out[2], 0x33CCCCCC);
  convertByteArraytoIntArrayUsingMask(rgb, out, source, mask, 3, 1, px_rect{5, 4, 0, 0});
  EXPECT_EQ(out[1], 0x22040506);
  EXPECT_EQ(out[2], 0x33070809);
}

TEST(StoredRegion, StoreRecoverDelete) {
  std::vector<int> pic(6 * 4);
  for (size_t i = 0; i < pic.size(); ++i) pic[i] = static_cast<int>(i);
  ASSERT_EQ(px_store_region(PX_STORED_OBJECT, pic.data(), 4, 6, px_rect{1, 3, 1, 2}), 0);
  int w = 0, h = 0;
  ASSERT_TRUE(px_stored_region_size(PX_STORED_OBJECT, &w, &h));
  EXPECT_EQ(w, 3);
  EXPECT_EQ(h, 2);
  std::vector<int> target(pic.size(), -1);
  // Recovering into a larger rectangle copies only the saved block.
  ASSERT_EQ(px_recover_region(PX_STORED_OBJECT, target.data(), 4, 6, px_rect{0, 5, 0, 3}), 0);
  EXPECT_EQ(target[0], 7);
  EXPECT_EQ(target[2], 9);
  EXPECT_EQ(target[3], -1);
  EXPECT_EQ(target[6], 13);
  EXPECT_EQ(target[12], -1);
  // An empty rectangle saves an empty block: recovering it copies nothing.
  ASSERT_EQ(px_store_region(PX_STORED_OBJECT, pic.data(), 4, 6, px_rect{1, 3, 2, 1}), 0);
  EXPECT_EQ(px_recover_region(PX_STORED_OBJECT, target.data(), 4, 6, px_rect{0, 5, 0, 3}), 0);
  EXPECT_EQ(target[0], 7);
  // A rectangle empty on one axis only, however far its other bounds reach,
  // walks no row and forms no pointer outside the array.
  const int far_bounds[][4] = {{1, 0, INT32_MIN, -2}, {9, 8, 11, INT32_MAX}, {0, 5, 3, 2}};
  for (const auto& b : far_bounds) {
    const px_rect r{b[0], b[1], b[2], b[3]};
    ASSERT_EQ(px_store_region(PX_STORED_OBJECT, pic.data(), 4, 6, r), 0);
    ASSERT_TRUE(px_stored_region_size(PX_STORED_OBJECT, &w, &h));
    EXPECT_EQ(w * h, 0);
    EXPECT_EQ(px_recover_region(PX_STORED_OBJECT, target.data(), 4, 6, r), 0);
  }
  ASSERT_EQ(px_store_region(PX_STORED_OBJECT, pic.data(), 4, 6, px_rect{0, 1, 0, 1}), 0);
  EXPECT_EQ(px_recover_region(PX_STORED_OBJECT, target.data(), 4, 6, px_rect{1, 0, INT32_MIN, -2}), 0);
  EXPECT_EQ(target[0], 7);
  px_delete_stored_region(PX_STORED_OBJECT);
  EXPECT_FALSE(px_stored_region_size(PX_STORED_OBJECT, nullptr, nullptr));
  EXPECT_EQ(px_recover_region(PX_STORED_OBJECT, target.data(), 4, 6, px_rect{0, 0, 0, 0}), -1);
  px_delete_stored_region(PX_STORED_OBJECT);  // twice is harmless
}
