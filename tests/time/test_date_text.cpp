// Date texts and sec85: epochs, calendar rules, truncation, bad texts.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <string>

#include "time/date_text.h"

namespace {

std::string Text(double t) {
  char buffer[kSec85TextSize];
  std::memset(buffer, 0, sizeof buffer);
  EXPECT_EQ(sec852myascii(t, buffer), 0) << t;
  return buffer;
}

TEST(DateText, Epochs) {
  EXPECT_EQ(ascii2sec85("1-JAN-1985"), 0.0);
  EXPECT_EQ(ascii2sec85("01-JAN-2000 00:00:00"), kSec85At2000);
  EXPECT_EQ(Text(0.0), "01-JAN-1985 00:00:00.000000");
  EXPECT_EQ(Text(473299200.5), "01-JAN-2000 00:00:00.500000");
  EXPECT_EQ(Text(473299200.5).size(), kSec85TextSize - 1);
  EXPECT_EQ(ascii2sec85("03-MAR-2004 10:21:43.123456"),
            ascii2sec85("03-MAR-2004") + 10 * 3600 + 21 * 60 + 43.123456);
  char buffer[kSec85TextSize];
  EXPECT_EQ(std::string(sec852ascii(86400.0 * 365 + 3661.25, buffer)),
            "01-JAN-1986 01:01:01.250000");
}

TEST(DateText, LeapYearsAndDayOfYear) {
  DateFields f;
  EXPECT_EQ(date2str("29-FEB-2000", &f), 0);
  EXPECT_EQ(f.dayOfYear, 60);
  EXPECT_EQ(f.month, 2);
  EXPECT_EQ(date2str("29-FEB-2004 12:00:00", &f), 0);
  EXPECT_EQ(date2str("29-FEB-1900", &f), kDateBadDay);
  EXPECT_EQ(date2str("29-FEB-2001", &f), kDateBadDay);
  EXPECT_EQ(date2str("32-JAN-2001", &f), kDateBadDay);
  EXPECT_EQ(date2str("31-DEC-2004", &f), 0);
  EXPECT_EQ(f.dayOfYear, 366);
  // Day 0 is one day before the first of the month.
  EXPECT_EQ(date2str("0-MAR-2001", &f), 0);
  EXPECT_EQ(f.dayOfYear, 59);
  EXPECT_EQ(ascii2sec85("1-MAR-2000") - ascii2sec85("28-FEB-2000"), 2 * 86400.0);
  EXPECT_EQ(ascii2sec85("1-MAR-1900") - ascii2sec85("28-FEB-1900"),
            -85 * 365 * 86400.0 * 0 + 86400.0);
  EXPECT_EQ(Text(ascii2sec85("29-FEB-2000 23:59:59")), "29-FEB-2000 23:59:59.000000");
  EXPECT_EQ(Text(ascii2sec85("31-DEC-2030 23:59:59.999999")), "31-DEC-2030 23:59:59.999999");
}

TEST(DateText, FieldsAndLimits) {
  DateFields f;
  ASSERT_EQ(date2str("03-mar-2004 10:21:43.25", &f), 0);
  EXPECT_EQ(f.year, 2004);
  EXPECT_EQ(f.month, 3);
  EXPECT_EQ(f.dayOfYear, 31 + 29 + 3);
  EXPECT_EQ(f.hour, 10);
  EXPECT_EQ(f.minute, 21);
  EXPECT_EQ(f.second, 43);
  EXPECT_EQ(f.fraction, 0.25);
  // Hour 24 and second 60 are accepted; beyond them the flags are set.
  EXPECT_EQ(date2str("1-JAN-2000 24:00:00", &f), 0);
  EXPECT_EQ(date2str("1-JAN-2000 23:59:60.5", &f), 0);
  EXPECT_EQ(ascii2sec85("1-JAN-2000 24:00:00"), ascii2sec85("2-JAN-2000"));
  EXPECT_EQ(date2str("1-JAN-2000 25:00:00", &f), kDateBadHour);
  EXPECT_EQ(date2str("1-JAN-2000 10:61:00", &f), kDateBadMonthOrMinute);
  EXPECT_EQ(date2str("1-JAN-2000 10:00:61", &f), kDateBadSecond);
  EXPECT_EQ(date2str("1-JAN-2000 25:61:61", &f),
            kDateBadHour | kDateBadMonthOrMinute | kDateBadSecond);
}

TEST(DateText, MonthNamesInAnyCase) {
  const double upper = ascii2sec85("15-JUL-1999");
  EXPECT_GT(upper, 0.0);
  EXPECT_EQ(ascii2sec85("15-jul-1999"), upper);
  EXPECT_EQ(ascii2sec85("15-Jul-1999"), upper);
  DateFields f;
  EXPECT_EQ(date2str("15-JLY-1999", &f), kDateBadMonthOrMinute);
  testing::internal::CaptureStderr();
  EXPECT_EQ(ascii2sec85("15-XXX-1999"), 0.0);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "Error: incorrect date format, code 4096\n");
}

TEST(DateText, PrefixesAndTextsWithoutADate) {
  const double plain = ascii2sec85("03-MAR-2004 10:21:43");
  EXPECT_EQ(ascii2sec85("SENSING_START=\"03-MAR-2004 10:21:43"), plain);
  DateFields f;
  EXPECT_EQ(date2str(std::string(40, 'x').append("1-JAN-2000").c_str(), &f), 0);
  EXPECT_NE(date2str(std::string(41, 'x').append("1-JAN-2000").c_str(), &f), 0);
  EXPECT_EQ(date2str("", &f), -1);
  EXPECT_EQ(date2str(nullptr, &f), -1);
  EXPECT_EQ(date2str("no digits here", &f), -1);
  double d = 7.0;
  EXPECT_EQ(DateDiff("1-JAN-2000", "nothing", &d), -1);
  EXPECT_EQ(DateDiff("1-FOO-2000", "nothing", &d), kDateBadMonthOrMinute);
  EXPECT_EQ(d, 7.0);
}

TEST(DateText, FractionsAreTruncatedNeverRoundedIntoTheNextSecond) {
  EXPECT_EQ(Text(473299200.9999996), "01-JAN-2000 00:00:00.999999");
  EXPECT_EQ(Text(59.9999999), "01-JAN-1985 00:00:59.999999");
  EXPECT_EQ(Text(1.0000009), "01-JAN-1985 00:00:01.000000");
  EXPECT_EQ(Text(std::nextafter(60.0, 0.0)), "01-JAN-1985 00:00:59.999999");
  EXPECT_EQ(Text(ascii2sec85("03-MAR-2004 10:21:43.1234567")), "03-MAR-2004 10:21:43.123456");
}

TEST(DateText, RefusedTimesLeaveTheBufferUntouched) {
  char buffer[kSec85TextSize] = "untouched";
  testing::internal::CaptureStderr();
  EXPECT_EQ(sec852myascii(-0.5, buffer), -1);
  EXPECT_EQ(sec852myascii(1e300, buffer), -1);
  EXPECT_EQ(sec852myascii(HUGE_VAL, buffer), -1);
  EXPECT_EQ(sec852myascii(std::nan(""), buffer), -1);
  const std::string err = testing::internal::GetCapturedStderr();
  EXPECT_EQ(err.find("Date should be later than 1-JAN-1985\n"), 0u);
  EXPECT_STREQ(buffer, "untouched");
  // The last representable year still fits the 27 characters.
  EXPECT_EQ(Text(ascii2sec85("31-DEC-9999 23:59:59")), "31-DEC-9999 23:59:59.000000");
}

TEST(DateText, GarbageTextsGiveFlagsNotCrashes) {
  std::mt19937 random(99);
  const char alphabet[] = "0123456789-: .JANFEBjan\t";
  DateFields f;
  for (int i = 0; i < 20000; ++i) {
    std::string text(random() % 60, ' ');
    for (char& c : text) {
      c = (random() % 4 == 0) ? static_cast<char>(random() % 255 + 1)
                              : alphabet[random() % (sizeof alphabet - 1)];
    }
    const int code = date2str(text.c_str(), &f);
    if (code == 0) {
      EXPECT_GE(f.month, 1);
      EXPECT_LE(f.month, 12);
      EXPECT_GE(f.fraction, 0.0);
      EXPECT_LT(f.fraction, 1.0);
    }
  }
  EXPECT_EQ(date2str("1-JAN-2000 00:00:1e999", &f), kDateBadSecond);
  EXPECT_EQ(date2str("1-JAN-2000 00:00:nan", &f), kDateBadSecond);
  EXPECT_EQ(date2str("1-JAN-2000 00:00:-1", &f), kDateBadSecond);
}

TEST(DateText, PackedNumber) {
  EXPECT_DOUBLE_EQ(utc_ch2num("03-MAR-2004 10:21:43.123"), 20040303102143.123);
  EXPECT_EQ(utc_ch2num("01-JAN-1985 00:00:00.000"), 19850101000000.0);
  EXPECT_EQ(utc_ch2num("01-jan-1985 00:00:00.000"), -1.0);
  EXPECT_EQ(utc_ch2num(""), -1.0);
  EXPECT_EQ(utc_ch2num(nullptr), -1.0);
}

TEST(DateText, RandomTimesRoundTripWithoutDrift) {
  std::mt19937_64 random(2026);
  const double end = ascii2sec85("1-JAN-2030");
  std::uniform_real_distribution<double> anyTime(0.0, end);
  std::uniform_int_distribution<int64_t> wholeSecond(0, static_cast<int64_t>(end));
  std::uniform_int_distribution<int> micro(0, 999999);
  for (int i = 0; i < 20000; ++i) {
    const double t = anyTime(random);
    const std::string text = Text(t);
    const double back = ascii2sec85(text.c_str());
    EXPECT_LE(std::fabs(back - t), 1e-6 + 4e-7) << text;
    double again = back;
    for (int round = 0; round < 3; ++round) {
      ASSERT_EQ(Text(again), text);
      again = ascii2sec85(text.c_str());
    }
    EXPECT_EQ(again, back);
    // A time on a microsecond shows exactly that microsecond.
    const int64_t w = wholeSecond(random);
    const int u = micro(random);
    const std::string exact = Text(static_cast<double>(w) + u * 1e-6);
    EXPECT_EQ(std::stoi(exact.substr(21)), u) << exact;
  }
}

}  // namespace
