#include <gtest/gtest.h>

#include <cerrno>
#include <fstream>
#include <iterator>
#include <string>

#include "envisat/envisat_types.h"
#include "sample_files.h"

namespace {

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

TEST(EnvisatTypes, EveryCodeInTableOrderAndNoType) {
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
  // The real files: the product name decides, not the file name.
  const std::pair<const std::string*, int> real[] = {{&kVor, kEnvisatDorVor},
                                                     {&kPor, kEnvisatDorPor},
                                                     {&kXca, kEnvisatAsaXca},
                                                     {&kEr1Xca, kEnvisatAsaXca}};
  for (const auto& [file, type] : real) EXPECT_EQ(EnvisatTypes::find_type(file->c_str()), type);
  EXPECT_EQ(EnvisatTypes::is_dorpor(kVor.c_str()), 0);
  // Not a type: the level-0 codes need all nine characters, case counts,
  // and unreadable, empty or cut files.
  const std::string dir = testing::TempDir();
  std::ofstream(dir + "type_cut", std::ios::binary) << "PRODUCT=\"ASA_WS";
  std::ofstream(dir + "type_empty", std::ios::binary).flush();
  for (const std::string& p :
       {file_named("ASA_IM_X0"), file_named("asa_ims_1P"), file_named("SAR_IMS_1P"),
        dir + "type_cut", dir + "type_empty", std::string("/nonexistent/ASA_WSS")})
    EXPECT_EQ(EnvisatTypes::find_type(p.c_str()), 0) << p;
  errno = 0;
  EXPECT_EQ(EnvisatTypes::is_wss("/nonexistent/ASA_WSS"), 0);
  EXPECT_EQ(errno, 0);
  EXPECT_EQ(EnvisatTypes::is_ims(file_named("asa_ims_1P").c_str()), 0);
  EXPECT_EQ(EnvisatTypes::find_type(nullptr), 0);
  EXPECT_EQ(EnvisatTypes::check_dorvor((dir + "type_empty").c_str(), kVor.c_str()), 0);
}

// Products against the real orbit files: the precise one is valid from
// 01-MAR-2008 21:55:27 to 03-MAR-2008 00:23:27 and the product's sensing
// start must lie strictly inside; a sensing time that is not a date never
// counts as 1-JAN-1985.
TEST(EnvisatTypes, CheckDorvorWantsAnAsarProductInsideTheOrbitsValidity) {
  std::ifstream in(kVor, std::ios::binary);
  const std::string vor((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  ASSERT_EQ(vor.substr(351, 20), "01-MAR-2008 21:55:27");
  const std::string inside = "02-MAR-2008 10:00:00.000000";
  const struct {
    const char* type;  // first ten characters of the product name
    std::string start;
    const std::string* orbitFile;
    size_t orbitAt;  // 0: orbit file unchanged
    const char* orbitText;
    int expected;
  } cases[] = {
      {"ASA_WSS_1P", inside, &kVor, 0, "", 1},
      {"ASA_WSS_1P", "01-MAR-2008 21:55:27.000000", &kVor, 0, "", 0},
      {"ASA_WSS_1P", "01-MAR-2008 21:55:27.000001", &kVor, 0, "", 1},
      {"ASA_WSS_1P", "03-MAR-2008 00:23:26.999999", &kVor, 0, "", 1},
      {"ASA_WSS_1P", "03-MAR-2008 00:23:27.000000", &kVor, 0, "", 0},
      {"ASA_WSS_1P", "01-MAR-2008 21:00:00.000000", &kVor, 0, "", 0},
      {"ASA_WSS_1P", "04-MAR-2008 10:00:00.000000", &kVor, 0, "", 0},
      {"ASA_WSS_1P", "02-MAR-2008 10:99:00.000000", &kVor, 0, "", 0},
      {"ASA_WSS_1P", "                           ", &kVor, 0, "", 0},
      {"ASA_WSS_1P", inside, &kVor, 351, "xx-MAR-2008 21:55:27.000000", 0},
      {"ASA_WSS_1P", inside, &kVor, 351, "                           ", 0},
      {"ASA_WSS_1P", inside, &kVor, 394, "03-XXX-2008 00:23:27.000000", 0},
      // Any ASAR type counts; the preliminary orbit is a month later.
      {"ASA_IMS_1P", inside, &kVor, 0, "", 1},
      {"SAR_IMS_1P", inside, &kVor, 0, "", 0},
      {"ASA_WSS_1P", inside, &kPor, 0, "", 0},
  };
  const std::string product = testing::TempDir() + "dates_product";
  const std::string orbit = testing::TempDir() + "dates_orbit";
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.type) + " " + c.start + " " + c.orbitText);
    std::ofstream(product, std::ios::binary)
        << "PRODUCT=\"" << c.type << "NPDK20080302_100000\"" << std::string(312, ' ') << c.start
        << std::string(1000, ' ');
    std::string orbitText = vor;
    if (c.orbitAt != 0) orbitText.replace(c.orbitAt, 27, c.orbitText);
    std::ofstream(orbit, std::ios::binary) << (c.orbitFile == &kVor ? orbitText : "");
    const std::string& file = c.orbitAt == 0 ? *c.orbitFile : orbit;
    EXPECT_EQ(EnvisatTypes::check_dorvor(product.c_str(), file.c_str()), c.expected);
  }
  EXPECT_EQ(EnvisatTypes::check_dorvor(product.c_str(), "/nonexistent/DOR_VOR"), 0);
  // Not an ASAR product: the orbit file tested against itself.
  EXPECT_EQ(EnvisatTypes::check_dorvor(kVor.c_str(), kVor.c_str()), 0);
}

}  // namespace
