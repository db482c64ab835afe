// The swath and polarisation numbers that select the slots of the calibration files.
#include <cstdio>

#include "metadata_fixture.h"
#include "metadata_sections/data_set_info.h"

namespace {

void setText(char* field, const char* text) {
  std::snprintf(field, kParStringSize, "%s", text);
}

TEST(DataSetInfo, SwathAndPolarisationNumbers) {
  DataSetInfo_Obj info;
  const struct {
    const char* swath;
    int slot;
  } swaths[] = {{"IS1", 0}, {"IS3", 2},   {"IS7", 6},   {"SS1", 7},    {"SS2", 2},
                {"SS5", 5}, {"IS8", 666}, {"ss1", 666}, {"SS1 ", 666}, {"NOT_AVAILABLE", 666}};
  for (const auto& s : swaths) {
    setText(info.Swath, s.swath);
    EXPECT_EQ(info.getISNbr(), s.slot) << s.swath;
  }
  const char* polarisations[] = {"H/H", "V/V", "H/V", "V/H"};
  for (int i = 0; i < 4; ++i) {
    setText(info.Polarization, polarisations[i]);
    EXPECT_EQ(info.getPolarizationNbr(), i);
  }
  setText(info.Polarization, "HH");
  EXPECT_EQ(info.getPolarizationNbr(), 666);
}

}  // namespace
