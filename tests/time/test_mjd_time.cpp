// The ENVISAT MJD record: byte order, epoch and round trips.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <string>

#include "time/mjd_time.h"
#include "truth_math.h"

namespace {

TEST(MjdTime, WordsAreBigEndian) {
  const MjdRecord r = MjdRecordFromWords(0x01020304, -2, 999999);
  const uint8_t expected[kMjdRecordSize] = {1,    2,    3, 4,    0xff, 0xff,
                                            0xff, 0xfe, 0, 0x0f, 0x42, 0x3f};
  EXPECT_EQ(std::memcmp(r.bytes, expected, kMjdRecordSize), 0);
  int32_t d, s, us;
  MjdRecordWords(r, &d, &s, &us);
  EXPECT_EQ(d, 0x01020304);
  EXPECT_EQ(s, -2);
  EXPECT_EQ(us, 999999);
}

TEST(MjdTime, EpochAndKnownDates) {
  EXPECT_EQ(mjd2sec85(MjdRecordFromWords(0, 0, 0)), kSec85At2000);
  uint8_t buffer[kMjdRecordSize];
  ASSERT_EQ(sec852mjd(kSec85At2000, buffer), 0);
  for (uint8_t b : buffer) EXPECT_EQ(b, 0);
  // 2004-03-03 10:21:43.123456 is day 1523 after 2000-01-01.
  const MjdRecord r = MjdRecordFromWords(1523, 37303, 123456);
  char text[kSec85TextSize];
  EXPECT_STREQ(mjd2ascii(r, text), "03-MAR-2004 10:21:43.123456");
  EXPECT_NEAR(mjd2sec85(r), truth::Sec85(2004, 3, 3, 10, 21, 43.123456), 1e-6);
  // Before 2000 the day count is negative.
  ASSERT_EQ(sec852mjd(0.0, buffer), 0);
  EXPECT_EQ(std::memcmp(buffer, MjdRecordFromWords(-5478, 0, 0).bytes, kMjdRecordSize), 0);
}

TEST(MjdTime, UnrepresentableTimesAreRefused) {
  uint8_t buffer[kMjdRecordSize];
  std::memset(buffer, 0xab, sizeof buffer);
  EXPECT_EQ(sec852mjd(std::nan(""), buffer), -1);
  EXPECT_EQ(sec852mjd(HUGE_VAL, buffer), -1);
  EXPECT_EQ(sec852mjd(1e20, buffer), -1);
  EXPECT_EQ(sec852mjd(0.0, nullptr), -1);
  for (uint8_t b : buffer) EXPECT_EQ(b, 0xab);
  // Any words, even absurd ones, give a number.
  EXPECT_TRUE(std::isfinite(mjd2sec85(MjdRecordFromWords(INT32_MIN, INT32_MAX, INT32_MIN))));
}

TEST(MjdTime, RandomTimesRoundTripWithoutDrift) {
  std::mt19937_64 random(85);
  const double end = truth::Sec85(2030, 1, 1);
  std::uniform_real_distribution<double> anyTime(0.0, end);
  std::uniform_int_distribution<int32_t> day(-5478, 10957);
  std::uniform_int_distribution<int32_t> second(0, 86399);
  std::uniform_int_distribution<int32_t> micro(0, 999999);
  uint8_t buffer[kMjdRecordSize];
  MjdRecord record;
  for (int i = 0; i < 20000; ++i) {
    // Record -> sec85 -> record gives the same words.
    const MjdRecord words = MjdRecordFromWords(day(random), second(random), micro(random));
    ASSERT_EQ(sec852mjd(mjd2sec85(words), buffer), 0);
    ASSERT_EQ(std::memcmp(buffer, words.bytes, kMjdRecordSize), 0);

    // sec85 -> record -> sec85 stays within the truncated microsecond and
    // settles after one round.
    const double t = anyTime(random);
    ASSERT_EQ(sec852mjd(t, buffer), 0);
    std::memcpy(record.bytes, buffer, kMjdRecordSize);
    const double back = mjd2sec85(record);
    EXPECT_LE(std::fabs(back - t), 1e-6 + 4e-7);
    ASSERT_EQ(sec852mjd(back, buffer), 0);
    EXPECT_EQ(std::memcmp(buffer, record.bytes, kMjdRecordSize), 0);
  }
}

}  // namespace
