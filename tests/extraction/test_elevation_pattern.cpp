// The elevation antenna pattern of a product's pattern record on the
// header's regular angle grid, against the closed form the record was made
// from, and records that cannot make a pattern.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "extraction/asar_annotation.h"
#include "extraction/elevation_pattern.h"
#include "metadata_sections/antenna_pattern.h"

namespace {

constexpr int kPoints = asar::antenna::kPoints;

// Two-way gain in dB of the test patterns: a parabola about 20 degrees.
double PatternDb(double angle) {
  return -0.9 * (angle - 20.0) * (angle - 20.0);
}

void PutFloat(std::vector<unsigned char>* b, size_t offset, float v) {
  uint32_t u;
  std::memcpy(&u, &v, sizeof u);
  for (int i = 0; i < 4; ++i) (*b)[offset + i] = static_cast<unsigned char>(u >> (24 - 8 * i));
}

// A pattern record with the given angles and their gains.
std::vector<unsigned char> MakeRecord(const std::vector<double>& angles,
                                      const std::vector<double>& db) {
  std::vector<unsigned char> b(asar::antenna::kMinRecordSize, 0);
  std::memcpy(&b[asar::antenna::kBeamId], "SS1", 3);
  for (int i = 0; i < kPoints; ++i) {
    PutFloat(&b, asar::antenna::kElevationAngles + 4 * i, static_cast<float>(angles[i]));
    PutFloat(&b, asar::antenna::kPatternDb + 4 * i, static_cast<float>(db[i]));
  }
  return b;
}

// Angles 18.2 .. 21.9 degrees, not evenly spaced (as tie points evenly
// spaced in slant range are not in angle), optionally in falling order.
std::vector<double> Angles(bool falling) {
  std::vector<double> a;
  for (int i = 0; i < kPoints; ++i) {
    const double u = i / (kPoints - 1.0);
    a.push_back(18.2 + 3.7 * (u + 0.08 * u * (1.0 - u)));
  }
  if (falling) a = std::vector<double>(a.rbegin(), a.rend());
  return a;
}

TEST(ElevationPattern, GridOfTheRecordsSpanFollowsTheParabola) {
  for (const bool falling : {false, true}) {
    SCOPED_TRACE(falling ? "falling angles" : "rising angles");
    const std::vector<double> angles = Angles(falling);
    std::vector<double> db;
    for (double a : angles) db.push_back(PatternDb(a));
    const std::vector<unsigned char> bytes = MakeRecord(angles, db);
    AntennaPattern_Obj p;
    std::string problem;
    ASSERT_EQ(ElevationPatternOfRecord(asar::Record(bytes.data(), bytes.size()), &p, &problem), 0)
        << problem;
    // 3.7 degrees at 0.05: 37 steps either side of the middle, 20.05.
    ASSERT_EQ(p.PatternSamples, 75);
    EXPECT_NEAR(p.DeltaAngle, 0.05, 1e-12);
    EXPECT_NEAR(p.StartAngle + 37 * p.DeltaAngle, 20.05, 1e-5);
    ASSERT_EQ(p.patternSize(), 75);
    for (int i = 0; i < 75; ++i) {
      const double angle = p.StartAngle + i * p.DeltaAngle;
      EXPECT_NEAR(p.pattern()[i], std::pow(10.0, PatternDb(angle) / 20.0), 2e-6) << angle;
    }
  }
}

TEST(ElevationPattern, RecordsThatCannotMakeAPatternAreNamed) {
  using Points = std::vector<double>;
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const struct {
    const char* what;
    std::function<void(Points&, Points&)> edit;  // angles, gains
  } cases[] = {
      {"angle not a number", [&](Points& a, Points&) { a[4] = nan; }},
      {"gain not a number", [&](Points&, Points& g) { g[7] = nan; }},
      {"implausible gain", [](Points&, Points& g) { g[2] = 1e6; }},
      {"repeated angle", [](Points& a, Points&) { a[5] = a[4]; }},
      {"span beyond 90 degrees", [](Points& a, Points&) { a[10] = 150.0; }},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    Points angles = Angles(false), db(kPoints, -1.0);
    c.edit(angles, db);
    const std::vector<unsigned char> bytes = MakeRecord(angles, db);
    AntennaPattern_Obj p;
    std::string problem;
    EXPECT_EQ(ElevationPatternOfRecord(asar::Record(bytes.data(), bytes.size()), &p, &problem), 1);
    EXPECT_FALSE(problem.empty());
    EXPECT_EQ(p.patternSize(), 0);
  }
}

}  // namespace
