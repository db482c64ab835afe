// Date texts and sec85 against the calendar: epochs, leap years, limits,
// truncation and bad texts.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <string>

#include "time/date_text.h"
#include "truth_math.h"

namespace {

std::string Text(double t) {
  char buffer[kSec85TextSize];
  std::memset(buffer, 0, sizeof buffer);
  EXPECT_EQ(sec852myascii(t, buffer), 0) << t;
  return buffer;
}

TEST(DateText, TextsGiveTheCalendarsSeconds) {
  const struct {
    const char* text;
    double want;
  } cases[] = {
      {"1-JAN-1985", 0.0},
      {"01-JAN-2000 00:00:00", kSec85At2000},
      {"03-MAR-2004 10:21:43.123456", truth::Sec85(2004, 3, 3, 10, 21, 43.123456)},
      {"29-FEB-2000", truth::Sec85(2000, 2, 29)},
      {"1-MAR-1900", truth::Sec85(1900, 3, 1)},
      {"31-DEC-2004 23:59:59.999999", truth::Sec85(2004, 12, 31, 23, 59, 59.999999)},
      {"0-MAR-2001", truth::Sec85(2001, 2, 28)},  // day 0: the day before the first
      {"1-JAN-2000 24:00:00", truth::Sec85(2000, 1, 2)},
      {"15-jul-1999", truth::Sec85(1999, 7, 15)},
      {"15-Jul-1999", truth::Sec85(1999, 7, 15)},
      {"SENSING_START=\"03-MAR-2004 10:21:43", truth::Sec85(2004, 3, 3, 10, 21, 43)},
  };
  for (const auto& c : cases) EXPECT_NEAR(ascii2sec85(c.text), c.want, 1e-6) << c.text;
  DateFields f;
  ASSERT_EQ(date2str("03-mar-2004 10:21:43.25", &f), 0);
  EXPECT_EQ(f.year, 2004);
  EXPECT_EQ(f.month, 3);
  EXPECT_EQ(f.dayOfYear, 31 + 29 + 3);
  EXPECT_EQ(f.second, 43);
  EXPECT_EQ(f.fraction, 0.25);
  ASSERT_EQ(date2str("31-DEC-2004", &f), 0);
  EXPECT_EQ(f.dayOfYear, 366);
}

TEST(DateText, BadTextsGiveTheirFlags) {
  const struct {
    std::string text;
    int code;
  } cases[] = {
      {"29-FEB-1900", kDateBadDay},
      {"29-FEB-2001", kDateBadDay},
      {"32-JAN-2001", kDateBadDay},
      {"15-JLY-1999", kDateBadMonthOrMinute},
      {"1-JAN-2000 23:59:60.5", 0},
      {"1-JAN-2000 25:00:00", kDateBadHour},
      {"1-JAN-2000 10:61:00", kDateBadMonthOrMinute},
      {"1-JAN-2000 10:00:61", kDateBadSecond},
      {"1-JAN-2000 25:61:61", kDateBadHour | kDateBadMonthOrMinute | kDateBadSecond},
      {"1-JAN-2000 00:00:1e999", kDateBadSecond},
      {"1-JAN-2000 00:00:nan", kDateBadSecond},
      {"1-JAN-2000 00:00:-1", kDateBadSecond},
      {std::string(40, 'x') + "1-JAN-2000", 0},
      {"", -1},
      {"no digits here", -1},
  };
  DateFields f;
  for (const auto& c : cases) EXPECT_EQ(date2str(c.text.c_str(), &f), c.code) << c.text;
  EXPECT_NE(date2str((std::string(41, 'x') + "1-JAN-2000").c_str(), &f), 0);
  EXPECT_EQ(date2str(nullptr, &f), -1);
  double d = 7.0;
  EXPECT_EQ(DateDiff("1-JAN-2000", "nothing", &d), -1);
  EXPECT_EQ(DateDiff("1-FOO-2000", "nothing", &d), kDateBadMonthOrMinute);
  EXPECT_EQ(d, 7.0);
  testing::internal::CaptureStderr();
  EXPECT_EQ(ascii2sec85("15-XXX-1999"), 0.0);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "Error: incorrect date format, code 4096\n");
  // Random texts give flags, never a crash or fields out of range.
  std::mt19937 random(99);
  const char alphabet[] = "0123456789-: .JANFEBjan\t";
  for (int i = 0; i < 20000; ++i) {
    std::string text(random() % 60, ' ');
    for (char& c : text) {
      c = (random() % 4 == 0) ? static_cast<char>(random() % 255 + 1)
                              : alphabet[random() % (sizeof alphabet - 1)];
    }
    if (date2str(text.c_str(), &f) == 0) {
      EXPECT_GE(f.month, 1);
      EXPECT_LE(f.month, 12);
      EXPECT_GE(f.fraction, 0.0);
      EXPECT_LT(f.fraction, 1.0);
    }
  }
}

TEST(DateText, FractionsAreTruncatedNeverRoundedIntoTheNextSecond) {
  EXPECT_EQ(Text(0.0), "01-JAN-1985 00:00:00.000000");
  EXPECT_EQ(Text(473299200.9999996), "01-JAN-2000 00:00:00.999999");
  EXPECT_EQ(Text(59.9999999), "01-JAN-1985 00:00:59.999999");
  EXPECT_EQ(Text(1.0000009), "01-JAN-1985 00:00:01.000000");
  EXPECT_EQ(Text(std::nextafter(60.0, 0.0)), "01-JAN-1985 00:00:59.999999");
  EXPECT_EQ(Text(ascii2sec85("03-MAR-2004 10:21:43.1234567")), "03-MAR-2004 10:21:43.123456");
  char buffer[kSec85TextSize];
  EXPECT_EQ(std::string(sec852ascii(86400.0 * 365 + 3661.25, buffer)),
            "01-JAN-1986 01:01:01.250000");
  // The last representable year still fits the 27 characters.
  EXPECT_EQ(Text(truth::Sec85(9999, 12, 31, 23, 59, 59)), "31-DEC-9999 23:59:59.000000");
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
}

TEST(DateText, PackedNumber) {
  EXPECT_DOUBLE_EQ(utc_ch2num("03-MAR-2004 10:21:43.123"), 20040303102143.123);
  EXPECT_EQ(utc_ch2num("01-JAN-1985 00:00:00.000"), 19850101000000.0);
  EXPECT_EQ(utc_ch2num("01-jan-1985 00:00:00.000"), -1.0);
  EXPECT_EQ(utc_ch2num(""), -1.0);
  EXPECT_EQ(utc_ch2num(nullptr), -1.0);
}

// Random times: the text names the calendar's second, and reading it back
// loses less than the truncated microsecond.
TEST(DateText, RandomTimesRoundTripWithoutDrift) {
  std::mt19937_64 random(2026);
  const double end = truth::Sec85(2030, 1, 1);
  std::uniform_real_distribution<double> anyTime(0.0, end);
  for (int i = 0; i < 20000; ++i) {
    const double t = anyTime(random);
    const std::string text = Text(t);
    EXPECT_LE(t - truth::Sec85(text), 1e-6 + 4e-7) << text;
    EXPECT_GE(t - truth::Sec85(text), -4e-7) << text;
    const double back = ascii2sec85(text.c_str());
    EXPECT_LE(std::fabs(back - t), 1e-6 + 4e-7) << text;
    EXPECT_EQ(Text(back), text);
    // A time on a microsecond shows exactly that microsecond.
    const int micro = i * 4999 % 1000000;
    EXPECT_EQ(std::stoi(Text(std::floor(t) + micro * 1e-6).substr(21)), micro);
  }
}

}  // namespace
