// GDAL's ENVISAT driver is an independent reader of the format: the headers
// it reports, the size of the first sub-swath (of every image of an
// image-mode product) and its samples must be what the generator says it
// wrote.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <sstream>

#include "synth_run.h"

namespace synth_test {
namespace {

std::string trimmed(const std::string& s) {
  const size_t b = s.find_last_not_of(' ');
  return b == std::string::npos ? std::string() : s.substr(0, b + 1);
}

std::string signed_int(const char* fmt, long long v) {
  char b[32];
  std::snprintf(b, sizeof b, fmt, v);
  return b;
}

class GdalCrossCheck : public ::testing::TestWithParam<const char*> {};

TEST_P(GdalCrossCheck, HeadersBandsAndSamples) {
  if (shell("command -v gdalinfo >/dev/null 2>&1 && command -v gdal_translate >/dev/null 2>&1"))
    GTEST_SKIP() << "gdal-bin is not installed";
  const SynthRun run = run_synth(GetParam());
  ASSERT_EQ(run.exit_code, 0) << read_text(run.dir + "synth.log");
  const auto& scene = run.truth.at("Scene");
  const bool wss = scene.count("SubSwaths") > 0;
  const std::string section = wss ? "SubSwath" : "Image";
  ASSERT_EQ(shell("gdalinfo -nogcp '" + run.product + "' > " + run.dir + "gdalinfo.txt 2>&1"), 0);
  std::istringstream info(read_text(run.dir + "gdalinfo.txt"));
  std::map<std::string, std::string> md;
  std::string line, size_line;
  int bands = 0;
  while (std::getline(info, line)) {
    if (line.rfind("Size is ", 0) == 0) size_line = line;
    if (line.rfind("Band ", 0) == 0) {
      ++bands;
      EXPECT_NE(line.find("Type=CInt16"), std::string::npos) << line;
    }
    const size_t eq = line.find('=');
    if (line.rfind("  ", 0) == 0 && eq != std::string::npos)
      md[line.substr(2, eq - 2)] = trimmed(line.substr(eq + 1));
  }
  EXPECT_EQ(md["MPH_PRODUCT"], scene.at("Product"));
  EXPECT_EQ(md["MPH_SENSING_START"], scene.at("SensingStartText"));
  EXPECT_EQ(md["MPH_SENSING_STOP"], scene.at("SensingStopText"));
  EXPECT_EQ(md["SPH_FIRST_LINE_TIME"], scene.at("SensingStartText"));
  EXPECT_EQ(md["SPH_LAST_LINE_TIME"], scene.at("SensingStopText"));
  EXPECT_EQ(md["SPH_MDS1_TX_RX_POLAR"], run.truth.at(section + "1").count("Polarisation")
                                            ? run.truth.at(section + "1").at("Polarisation")
                                            : scene.at("Polarisation"));
  EXPECT_EQ(md["SPH_SAMPLE_TYPE"], "COMPLEX");
  EXPECT_EQ(md["DS_ORBIT_STATE_VECTOR_1________NAME"], scene.at("OrbitFile"));
  if (wss) {
    EXPECT_EQ(md["MPH_ABS_ORBIT"], signed_int("%+06lld", std::stoll(scene.at("AbsOrbit"))));
    EXPECT_EQ(md["MPH_REL_ORBIT"], signed_int("%+06lld", std::stoll(scene.at("RelOrbit"))));
    EXPECT_EQ(md["SPH_PASS"], scene.at("Pass"));
    EXPECT_EQ(md["SPH_SWATH"], "WS");
    EXPECT_EQ(md["SPH_DATA_TYPE"], "SWORD");
    EXPECT_EQ(md["SPH_LINE_LENGTH"],
              signed_int("%+06lld", std::stoll(run.truth.at("SubSwath1").at("Samples"))));
    EXPECT_NEAR(std::stod(md["SPH_LINE_TIME_INTERVAL"]), std::stod(scene.at("LineTimeInterval")),
                1e-9);
    EXPECT_NEAR(std::stod(md["SPH_RANGE_SPACING"]), std::stod(scene.at("RangeSpacing")), 1e-6);
    EXPECT_EQ(std::stoll(md["SPH_FIRST_NEAR_LAT"]),
              std::llround(std::stod(scene.at("SphFirstNearLat")) * 1e6));
    EXPECT_EQ(std::stoll(md["SPH_FIRST_NEAR_LONG"]),
              std::llround(std::stod(scene.at("SphFirstNearLon")) * 1e6));
    EXPECT_EQ(std::stoll(md["SPH_LAST_FAR_LAT"]),
              std::llround(std::stod(scene.at("SphLastFarLat")) * 1e6));
    EXPECT_EQ(md["DS_EXTERNAL_CALIBRATION________NAME"], scene.at("XcaFile"));
  } else {
    EXPECT_EQ(md["SPH_SPH_DESCRIPTOR"], scene.at("Descriptor"));
    EXPECT_EQ(md["SPH_SWATH"], scene.at("Swath"));
    if (bands > 1) {
      EXPECT_EQ(md["SPH_MDS2_TX_RX_POLAR"], run.truth.at("Image2").at("Polarisation"));
    }
  }
  // GDAL shows the first sub-swath of a wide-swath product, every image of
  // an image-mode one.
  EXPECT_EQ(bands, wss ? 1 : std::stoi(scene.at("Images")));

  // Samples: GDAL's CFloat32 copy of each band against the big-endian int16
  // pairs at the offset the truth gives for it.
  const std::vector<uint8_t> product = read_file(run.product);
  for (int k = 1; k <= bands; ++k) {
    const auto& img = run.truth.at(section + std::to_string(k));
    const long long samples = std::stoll(img.at("Samples"));
    const long long records = std::stoll(img.at("Records"));
    EXPECT_EQ(size_line, "Size is " + std::to_string(samples) + ", " + std::to_string(records));
    const std::string raw = run.dir + "band" + std::to_string(k) + ".bin";
    ASSERT_EQ(shell("gdal_translate -q -ot CFloat32 -of ENVI -b " + std::to_string(k) + " '" +
                    run.product + "' " + raw + " > /dev/null 2>&1"),
              0);
    const std::vector<uint8_t> got = read_file(raw);
    ASSERT_EQ(got.size(), static_cast<size_t>(samples * records * 8));
    const long long mds = std::stoll(img.at("MdsOffset"));
    const long long rec = 17 + 4 * samples;
    ASSERT_LE(mds + rec * records, static_cast<long long>(product.size()));
    long long mismatches = 0, nonzero = 0;
    for (long long r = 0; r < records; ++r)
      for (long long s = 0; s < 2 * samples; ++s) {
        float f;
        std::memcpy(&f, &got[(r * 2 * samples + s) * 4], 4);
        const int16_t v = be16(&product[mds + r * rec + 17 + 2 * s]);
        mismatches += f != static_cast<float>(v);
        nonzero += v != 0;
      }
    EXPECT_EQ(mismatches, 0) << "band " << k;
    EXPECT_GT(nonzero, samples * records) << "band " << k;  // speckle, not an empty image
  }
  remove_run(run);
}

INSTANTIATE_TEST_SUITE_P(Products, GdalCrossCheck,
                         ::testing::Values("--orbit kepler --seed 7 --pattern points",
                                           "--size small --polarisation VV --pass ascending",
                                           "--product IMS --orbit kepler --pattern points",
                                           "--product APS --size small --pass ascending"));

}  // namespace
}  // namespace synth_test
