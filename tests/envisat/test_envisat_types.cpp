#include <gtest/gtest.h>

#include <cerrno>
#include <fstream>
#include <iterator>
#include <string>

#include "envisat/envisat_types.h"
#include "synth_run.h"

using synth_test::remove_run;
using synth_test::run_synth;
using synth_test::SynthRun;

namespace {

const std::string kData = vlr_test::kSampleDir;
const std::string kVor = vlr_test::kSampleVor;
const std::string kPor = vlr_test::kSamplePor;
const std::string kXca = vlr_test::kSampleXca;
const std::string kEr1Xca = vlr_test::kSampleEr1Xca;

// A file holding `name` where a product name stands (after PRODUCT=").
std::string file_named(const std::string& name) {
  const std::string path =
      testing::TempDir() + "type_" + std::to_string(std::hash<std::string>()(name));
  std::ofstream(path, std::ios::binary) << "PRODUCT=\"" << name << "\"\n";
  return path;
}

TEST(EnvisatTypes, RecognisesTheRealOrbitAndCalibrationFiles) {
  EXPECT_EQ(EnvisatTypes::is_dorvor(kVor.c_str()), 1);
  EXPECT_EQ(EnvisatTypes::is_dorpor(kVor.c_str()), 0);
  EXPECT_EQ(EnvisatTypes::is_dorpor(kPor.c_str()), 1);
  EXPECT_EQ(EnvisatTypes::is_dorvor(kPor.c_str()), 0);
  EXPECT_EQ(EnvisatTypes::is_xca(kXca.c_str()), 1);
  // Its product name is not its file name; the header decides.
  EXPECT_EQ(EnvisatTypes::is_xca(kEr1Xca.c_str()), 1);
  EXPECT_EQ(EnvisatTypes::is_xch(kXca.c_str()), 0);
  EXPECT_EQ(EnvisatTypes::find_type(kVor.c_str()), kEnvisatDorVor);
  EXPECT_EQ(EnvisatTypes::find_type(kPor.c_str()), kEnvisatDorPor);
  EXPECT_EQ(EnvisatTypes::find_type(kXca.c_str()), kEnvisatAsaXca);
  EXPECT_EQ(EnvisatTypes::find_type(kEr1Xca.c_str()), kEnvisatAsaXca);
}

TEST(EnvisatTypes, EveryCodeInTableOrder) {
  struct Case {
    const char* name;
    int number;
    int (*test)(const char*);
  };
  const Case cases[] = {
      {"ASA_APS_1PNPDE", 1, EnvisatTypes::is_aps},  {"ASA_APP_1P", 2, EnvisatTypes::is_app},
      {"ASA_APM_1P", 3, EnvisatTypes::is_apm},      {"ASA_APC_1P", 4, EnvisatTypes::is_apc},
      {"ASA_APH_1P", 5, EnvisatTypes::is_aph},      {"ASA_APV_1P", 6, EnvisatTypes::is_apv},
      {"ASA_IMS_1P", 7, EnvisatTypes::is_ims},      {"ASA_IM__0P", 8, EnvisatTypes::is_im0},
      {"ASA_WSSanything", 9, EnvisatTypes::is_wss}, {"ASA_WSM_1P", 10, EnvisatTypes::is_wsm},
      {"ASA_WS__0P", 11, EnvisatTypes::is_ws0},     {"DOR_VOR_AX", 12, EnvisatTypes::is_dorvor},
      {"DOR_POR_AX", 13, EnvisatTypes::is_dorpor},  {"ASA_XCA_AX", 14, EnvisatTypes::is_xca},
      {"ASA_XCH_AX", 15, EnvisatTypes::is_xch},     {"ASA_INS_AX", 16, EnvisatTypes::is_ins},
  };
  for (const Case& c : cases) {
    const std::string p = file_named(c.name);
    EXPECT_EQ(EnvisatTypes::find_type(p.c_str()), c.number) << c.name;
    EXPECT_EQ(c.test(p.c_str()), 1) << c.name;
  }
  // The level-0 codes need all nine characters: "ASA_IM_" alone is none.
  EXPECT_EQ(EnvisatTypes::find_type(file_named("ASA_IM_X0").c_str()), 0);
  EXPECT_EQ(EnvisatTypes::is_ims(file_named("asa_ims_1P").c_str()), 0);
  EXPECT_EQ(EnvisatTypes::find_type(file_named("asa_ims_1P").c_str()), 0);
  EXPECT_EQ(EnvisatTypes::find_type(file_named("SAR_IMS_1P").c_str()), 0);
}

TEST(EnvisatTypes, UnreadableFilesAreNoType) {
  errno = 0;
  EXPECT_EQ(EnvisatTypes::is_wss("/nonexistent/ASA_WSS"), 0);
  EXPECT_EQ(errno, 0);
  EXPECT_EQ(EnvisatTypes::find_type("/nonexistent/ASA_WSS"), 0);
  EXPECT_EQ(EnvisatTypes::find_type(nullptr), 0);
  // Cut inside the product name, before the code is complete.
  const std::string cut = testing::TempDir() + "type_cut";
  std::ofstream(cut, std::ios::binary) << "PRODUCT=\"ASA_WS";
  EXPECT_EQ(EnvisatTypes::find_type(cut.c_str()), 0);
  const std::string empty = testing::TempDir() + "type_empty";
  std::ofstream(empty, std::ios::binary).flush();
  EXPECT_EQ(EnvisatTypes::find_type(empty.c_str()), 0);
  EXPECT_EQ(EnvisatTypes::check_dorvor(empty.c_str(), kVor.c_str()), 0);
}

// Generated products against the real precise orbit, valid from
// 01-MAR-2008 21:55:27 to 03-MAR-2008 00:23:27: the product's sensing start
// must lie strictly inside.
TEST(EnvisatTypes, CheckDorvorAgainstTheRealOrbitValidity) {
  struct Case {
    const char* start;
    int expected;
  };
  const Case cases[] = {
      {"02-MAR-2008 10:00:00", 1},        {"01-MAR-2008 21:55:27", 0},
      {"01-MAR-2008 21:55:27.000001", 1}, {"03-MAR-2008 00:23:26.999999", 1},
      {"03-MAR-2008 00:23:27", 0},        {"01-MAR-2008 21:00:00", 0},
      {"04-MAR-2008 10:00:00", 0},
  };
  for (const Case& c : cases) {
    const SynthRun r = run_synth(std::string("--orbit kepler --start \"") + c.start + "\"");
    ASSERT_EQ(r.exit_code, 0) << c.start;
    EXPECT_EQ(r.truth.at("Scene").at("SensingStartText").substr(0, 20),
              std::string(c.start).substr(0, 20));
    EXPECT_EQ(EnvisatTypes::check_dorvor(r.product.c_str(), kVor.c_str()), c.expected) << c.start;
    // The generated orbit file around the scene covers it.
    const std::string own = r.dir + r.truth.at("Scene").at("OrbitFile");
    EXPECT_EQ(EnvisatTypes::check_dorvor(r.product.c_str(), own.c_str()), 1) << c.start;
    remove_run(r);
  }
}

// A sensing time that is not a date never counts as 1-JAN-1985: the orbit
// file is not taken as valid.
TEST(EnvisatTypes, CheckDorvorRefusesTimesThatAreNotDates) {
  std::ifstream in(kVor, std::ios::binary);
  const std::string vor((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  ASSERT_EQ(vor.substr(351, 20), "01-MAR-2008 21:55:27");
  const struct {
    const char* what;
    const char* productStart;
    size_t orbitAt;  // 0: orbit file unchanged
    const char* orbitText;
    int expected;
  } cases[] = {
      {"valid times", "02-MAR-2008 10:00:00.000000", 0, "", 1},
      {"orbit start not a date", "02-MAR-2008 10:00:00.000000", 351, "xx-MAR-2008 21:55:27.000000",
       0},
      {"orbit start blank", "02-MAR-2008 10:00:00.000000", 351, "                           ", 0},
      {"orbit stop not a date", "02-MAR-2008 10:00:00.000000", 394, "03-XXX-2008 00:23:27.000000",
       0},
      {"product start not a date", "02-MAR-2008 10:99:00.000000", 0, "", 0},
      {"product start blank", "                           ", 0, "", 0},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    const std::string product = testing::TempDir() + "dates_product";
    std::ofstream(product, std::ios::binary)
        << "PRODUCT=\"ASA_WSS_1PNPDK20080302_100000\"" << std::string(312, ' ') << c.productStart
        << std::string(1000, ' ');
    std::string orbitText = vor;
    if (c.orbitAt != 0) orbitText.replace(c.orbitAt, 27, c.orbitText);
    const std::string orbit = testing::TempDir() + "dates_orbit";
    std::ofstream(orbit, std::ios::binary) << orbitText;
    EXPECT_EQ(EnvisatTypes::check_dorvor(product.c_str(), orbit.c_str()), c.expected);
  }
}

TEST(EnvisatTypes, CheckDorvorWantsAnAsarProductAndAReadableOrbit) {
  const SynthRun r = run_synth("--orbit kepler --start \"02-MAR-2008 10:00:00\"");
  ASSERT_EQ(r.exit_code, 0);
  EXPECT_EQ(EnvisatTypes::find_type(r.product.c_str()), kEnvisatAsaWss);
  EXPECT_EQ(EnvisatTypes::check_dorvor(r.product.c_str(), "/nonexistent/DOR_VOR"), 0);
  // Not an ASAR product: the orbit file tested against itself.
  EXPECT_EQ(EnvisatTypes::check_dorvor(kVor.c_str(), kVor.c_str()), 0);
  // A preliminary orbit serves as well; this one is a month later.
  EXPECT_EQ(EnvisatTypes::check_dorvor(r.product.c_str(), kPor.c_str()), 0);
  remove_run(r);
  // Any ASAR type counts, an image-mode product as well as a wide-swath one.
  const SynthRun ims = run_synth(
      "--orbit kepler --start \"02-MAR-2008 10:00:00\" "
      "--wrong-type ASA_IMS_1P");
  ASSERT_EQ(ims.exit_code, 0);
  EXPECT_EQ(EnvisatTypes::find_type(ims.product.c_str()), kEnvisatAsaIms);
  EXPECT_EQ(EnvisatTypes::check_dorvor(ims.product.c_str(), kVor.c_str()), 1);
  remove_run(ims);
  const SynthRun other = run_synth(
      "--orbit kepler --start \"02-MAR-2008 10:00:00\" "
      "--wrong-type SAR_IMS_1P");
  ASSERT_EQ(other.exit_code, 0);
  EXPECT_EQ(EnvisatTypes::check_dorvor(other.product.c_str(), kVor.c_str()), 0);
  remove_run(other);
}

}  // namespace
