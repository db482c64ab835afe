// Antenna elevation pattern records that cannot make a pattern: refused
// with the reason, and no pattern held.
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
// spaced in slant range are not in angle).
std::vector<double> Angles() {
  std::vector<double> a;
  for (int i = 0; i < kPoints; ++i) {
    const double u = i / (kPoints - 1.0);
    a.push_back(18.2 + 3.7 * (u + 0.08 * u * (1.0 - u)));
  }
  return a;
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
    Points angles = Angles(), db(kPoints, -1.0);
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
