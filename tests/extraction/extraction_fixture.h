// What every extraction test needs from its host: the working file through
// which the line copy reports its progress.  Registered once for the whole
// test program, whichever of its files include this header.
#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>
#include <sys/stat.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "extraction/images.h"
#include "metadata_sections/antenna_pattern.h"
#include "metadata_sections/poly_sar.h"
#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/sar_pulse.h"
#include "metadata_sections/spectral_windows.h"
#include "orbit/earth_constants.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/geodetic.h"
#include "runtime/suite_state.h"
#include "synth_run.h"

namespace extraction_test {

using synth_test::SynthRun;

// Bytes of the time and quality prefix of every line.
constexpr size_t kPrefix = 17;

inline std::string Text(const SynthRun& run, const std::string& section, const std::string& key) {
  const auto s = run.truth.find(section);
  if (s == run.truth.end() || s->second.count(key) == 0) return "nan";
  return s->second.at(key);
}
inline double Value(const SynthRun& run, const std::string& section, const std::string& key) {
  return std::atof(Text(run, section, key).c_str());
}
inline bool Exists(const std::string& path) {
  struct stat st;
  return stat(path.c_str(), &st) == 0;
}

// The orbit file an extraction test hands over: the one the generator wrote,
// none, or another file.
constexpr const char* kGeneratedOrbit = nullptr;
constexpr const char* kNoOrbit = "";

// Runs the extraction of a generated product into <dir>R.
inline int Extract(const SynthRun& run, images_conf& conf, images* out,
                   const char* orbit = kGeneratedOrbit) {
  std::snprintf(out->input.ASA_level1_filename, kImagesNameSize, "%s", run.product.c_str());
  const std::string orbitFile =
      orbit == kGeneratedOrbit ? run.dir + Text(run, "Scene", "OrbitFile") : std::string(orbit);
  std::snprintf(out->input.ASA_dor_vor, kImagesNameSize, "%s", orbitFile.c_str());
  std::snprintf(out->input.ASA_INS_Filename, kImagesNameSize, "%s%s", run.dir.c_str(),
                Text(run, "Scene", "InsFile").c_str());
  std::snprintf(out->output.OutputFile, kImagesNameSize, "%sR", run.dir.c_str());
  conf.Verbose = 1;
  return out->run();
}

// Distance in metres between two points of the ellipsoid given in degrees.
inline double Distance(double lat1, double lon1, double lat2, double lon2) {
  double a[3], b[3];
  const double p1[3] = {lat1 / kRadToDeg, lon1 / kRadToDeg, 0.0};
  const double p2[3] = {lat2 / kRadToDeg, lon2 / kRadToDeg, 0.0};
  geo2cart(a, p1);
  geo2cart(b, p2);
  return std::sqrt((a[0] - b[0]) * (a[0] - b[0]) + (a[1] - b[1]) * (a[1] - b[1]) +
                   (a[2] - b[2]) * (a[2] - b[2]));
}

// Every record of an image's MDS (truth section `section`) against its
// raster: prefix bytes unchanged, samples the product's big-endian int16
// values as floats.
inline void ExpectRasterHoldsEveryRecord(const SynthRun& run, const std::vector<uint8_t>& product,
                                         const std::string& section, const std::string& raster) {
  const int samples = static_cast<int>(Value(run, section, "Samples"));
  const int records = static_cast<int>(Value(run, section, "Records"));
  const size_t offset = static_cast<size_t>(Value(run, section, "MdsOffset"));
  const size_t inRecord = kPrefix + 4 * static_cast<size_t>(samples);
  ASSERT_EQ(static_cast<double>(inRecord), Value(run, section, "RecordSize"));
  const size_t outRecord = kPrefix + 8 * static_cast<size_t>(samples);
  const std::vector<uint8_t> out = synth_test::read_file(raster);
  ASSERT_EQ(out.size(), outRecord * records) << raster;
  ASSERT_LE(offset + inRecord * records, product.size());
  for (int r = 0; r < records; ++r) {
    const uint8_t* in = product.data() + offset + inRecord * r;
    const uint8_t* line = out.data() + outRecord * r;
    ASSERT_EQ(std::memcmp(in, line, kPrefix), 0) << raster << " prefix of record " << r;
    for (int s = 0; s < 2 * samples; ++s) {
      float v;
      std::memcpy(&v, line + kPrefix + 4 * s, 4);
      ASSERT_EQ(v, static_cast<float>(synth_test::be16(in + kPrefix + 2 * s)))
          << raster << " record " << r << " component " << s;
    }
  }
}

// The host's side of the progress protocol: a working file and its
// "_batch_ok" companion, so that the copy's progress bar can report.
class HostWorkingFile : public ::testing::Environment {
 public:
  void SetUp() override {
    char pattern[] = "/tmp/vlr_extraction_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir_ = pattern;
    const std::string working = dir_ + "/Process.working";
    std::FILE* f = std::fopen(working.c_str(), "w");
    ASSERT_NE(f, nullptr);
    std::fputs("0\nStarting\n", f);
    std::fclose(f);
    f = std::fopen((working + "_batch_ok").c_str(), "w");
    ASSERT_NE(f, nullptr);
    std::fclose(f);
    vlr_detail::suite().workingFile = working;
  }
  void TearDown() override { synth_test::shell("rm -rf '" + dir_ + "'"); }

 private:
  std::string dir_;
};

// The sampling constants, spectral windows and pulse of an image's header
// against the truth section `s`.
// `burstCycle` is 0 for images without bursts.
inline void ExpectSamplingWindowsAndPulse(const SynthRun& run, const std::string& s,
                                          const std::string& hdr, double burstCycle) {
  SamplingConstants_Obj sc;
  ASSERT_EQ(sc.readhdr(hdr.c_str()), 0);
  EXPECT_NEAR(sc.prf_hz, Value(run, s, "PRF"), 1e-3);
  if (burstCycle > 0.0) {
    EXPECT_NEAR(sc.bri_s, burstCycle, 1e-9);
  } else {
    EXPECT_EQ(sc.bri_s, 0.0);
  }
  EXPECT_NEAR(sc.fc_hz, Value(run, "Scene", "CarrierFrequency"), 1e3);
  EXPECT_NEAR(sc.frg_hz, Value(run, "Scene", "RangeSamplingRate"), 1.0);
  EXPECT_NEAR(sc.Brg_hz, Value(run, s, "PulseBandwidth"), 1.0);

  SpectralWindows_Obj sw;
  ASSERT_EQ(sw.readhdr(hdr.c_str()), 0);
  EXPECT_NEAR(sw.RgLookBandwidth, Value(run, s, "RangeLookBandwidth"), 1.0);
  EXPECT_NEAR(sw.AzLookBandwidth, Value(run, s, "AzimuthLookBandwidth"), 1e-3);
  EXPECT_STREQ(sw.RgMatchedFilterType, Text(run, s, "RangeWindowType").c_str());
  EXPECT_STREQ(sw.AzMatchedFilterType, Text(run, s, "AzimuthWindowType").c_str());
  EXPECT_NEAR(sw.RgMatchedFilterCoef, Value(run, s, "RangeWindowCoefficient"), 1e-6);
  EXPECT_NEAR(sw.AzMatchedFilterCoef, Value(run, s, "AzimuthWindowCoefficient"), 1e-6);

  SARPulse_Obj pulse;
  ASSERT_EQ(pulse.readhdr(hdr.c_str()), 0);
  EXPECT_NEAR(pulse.PulseLength, Value(run, s, "PulseLength"), 1e-12);
}

// The azimuth FM-rate polynomial of an image against the truth section `s`,
// and state vectors in its header that span its lines first..last.
inline void ExpectFmRateAndOrbitSpan(const SynthRun& run, const std::string& s,
                                     const polySAR& polys, const std::string& hdr, double first,
                                     double last) {
  ASSERT_EQ(polys.nfr, 1);
  EXPECT_NEAR(polys.fr[0].pol[0], Value(run, s, "FmRateC0"), 1e-3);
  EXPECT_NEAR(polys.fr[0].pol[1], Value(run, s, "FmRateC1"),
              std::fabs(Value(run, s, "FmRateC1")) * 1e-6);
  EXPECT_NEAR(polys.fr[0].pol[4], Value(run, s, "FmRateC2"),
              std::fabs(Value(run, s, "FmRateC2")) * 1e-6);
  EXPECT_NEAR(polys.fr[0].trg0_s, Value(run, s, "FmRateRangeTime"), 1e-12);
  GeneralSAROrbit orbit;
  ASSERT_EQ(orbit.readhdr(hdr.c_str()), 0);
  ASSERT_GE(orbit.n(), 5);
  EXPECT_LE(orbit.t0(), first);
  EXPECT_GE(orbit.t0() + (orbit.n() - 1) * orbit.dt(), last);
}

// The antenna elevation pattern of the header `hdr` against the parabola in
// dB that the generator wrote into the product's pattern record of truth
// section `s`, about the calibration reference angle `referenceKey`.
inline void ExpectElevationPattern(const SynthRun& run, const std::string& s,
                                   const std::string& hdr, const std::string& referenceKey) {
  AntennaPattern_Obj p;
  ASSERT_EQ(p.readhdr(hdr.c_str()), 0);
  ASSERT_GE(p.PatternSamples, 3);
  std::vector<float> gains(static_cast<size_t>(p.PatternSamples));
  ASSERT_EQ(p.getPatternArray(gains.data()), 0);
  const double slot = Value(run, s, "XcaSlot");
  const double centre = Value(run, "Calibration", referenceKey);
  for (int i = 0; i < p.PatternSamples; ++i) {
    const double offset = p.StartAngle + i * p.DeltaAngle - centre;
    const double db = -(0.75 + 0.05 * slot) * offset * offset;
    EXPECT_NEAR(gains[static_cast<size_t>(i)], std::pow(10.0, db / 20.0), 1e-6) << i;
  }
}

// One object for the whole program (an inline variable is initialised once).
inline ::testing::Environment* const kHostWorkingFile =
    ::testing::AddGlobalTestEnvironment(new HostWorkingFile);

}  // namespace extraction_test
