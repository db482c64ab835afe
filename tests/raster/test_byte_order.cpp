#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "raster/byte_order.h"

namespace {

TEST(ByteOrder, ReadersWritersAndSwappersInBothOrders) {
  const unsigned char be[8] = {0x12, 0x34, 0x56, 0x78, 0x9A, 0xBC, 0xDE, 0xF0};
  EXPECT_EQ(endi(), 'l');
  EXPECT_EQ(ch2uint2(be, 'm'), 0x1234u);
  EXPECT_EQ(ch2uint2(be, 'l'), 0x3412u);
  EXPECT_EQ(ch2uint4(be + 1, 'm'), 0x3456789Au);  // no alignment needed
  const unsigned char minus_two[4] = {0xFF, 0xFF, 0xFF, 0xFE};
  EXPECT_EQ(ch2int2(minus_two + 2, 'm'), -2);
  EXPECT_EQ(ch2long4(minus_two, 'l'), -16777217);
  const unsigned char d_be[8] = {0x3F, 0xF8, 0, 0, 0, 0, 0, 0};  // 1.5
  EXPECT_EQ(ch2double8(d_be, 'm'), 1.5);
  unsigned char b[16];
  float2ch(-3.25f, b, 'm');
  EXPECT_EQ(b[0], 0xC0);
  EXPECT_EQ(ch2float4(b, 'm'), -3.25f);
  long2ch(0x01020304, b, 'l');
  EXPECT_EQ(b[0], 0x04);
  short2ch(-300, b, 'm');
  EXPECT_EQ(ch2int2(b, 'm'), -300);

  for (int i = 0; i < 16; ++i) b[i] = static_cast<unsigned char>(i);
  swp2(b, 2);
  EXPECT_EQ(b[3], 2);
  EXPECT_EQ(b[4], 4);  // beyond the count: untouched
  swp8(b + 8, 1);
  EXPECT_EQ(b[8], 15);
  swp_any(b + 8, 7, 6);  // one whole group, one byte left
  EXPECT_EQ(b[8], 10);
  EXPECT_EQ(b[14], 9);
  EXPECT_EQ(get_endian(b, 2, 6, 1), -1);
  EXPECT_EQ(get_endian(b, 1, 16, 1), 0);
  EXPECT_EQ(b[0], 8);  // one item of 16 bytes reversed
}

TEST(ByteOrderDeathTest, UnknownOrderLetterEndsTheProcess) {
  const unsigned char b[4] = {0};
  EXPECT_EXIT(ch2int4(b, 'x'), ::testing::ExitedWithCode(1), "");
}

TEST(ByteOrder, Classification) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  EXPECT_TRUE(myisinf(-std::numeric_limits<double>::infinity()));
  EXPECT_FALSE(myisinf(nan));
  EXPECT_FALSE(myfinite(nan));
  // The largest float (bits 0x7F7FFFFF) counts as infinite, not as NaN.
  const float largest = std::numeric_limits<float>::max();
  EXPECT_TRUE(myisinf4(-largest));
  EXPECT_FALSE(myisnan4(largest));
  EXPECT_TRUE(myfinite4(std::nextafter(largest, 0.0f)));
  EXPECT_TRUE(myisnan4(std::numeric_limits<float>::quiet_NaN()));
}

}  // namespace
