// Readers of the ENVISAT auxiliary files (external calibration, instrument
// characterisation), the antenna pattern raster and the burst times.
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <utility>
#include <vector>

#include "metadata_fixture.h"
#include "metadata_sections/antenna_pattern.h"
#include "metadata_sections/data_set_info.h"
#include "metadata_sections/sensor_attitude.h"
#include "metadata_sections/swath_info.h"
#include "raster/buffer_io.h"
#include "synth_run.h"
#include "time/mjd_time.h"

namespace {

const std::string kXca = vlr_test::kSampleXca;

double gain(double db) {
  return std::pow(10.0, db / 20.0);
}

// The pattern of a swath given by its text, for a polarisation text.
AntennaPattern_Obj* patternOf(AntennaPattern_Obj* p, const char* swath, const char* polarisation) {
  DataSetInfo_Obj info;
  std::snprintf(info.Swath, sizeof info.Swath, "%s", swath);
  std::snprintf(info.Polarization, sizeof info.Polarization, "%s", polarisation);
  EXPECT_EQ(p->getPatternENVI(kXca.c_str(), info.getPolarizationNbr(), info.getISNbr()), 0);
  return p;
}

class AuxFiles : public MetadataTest {};

TEST_F(AuxFiles, CalibrationPatternsFollowTheSwathSlotsAndPolarisations) {
  AntennaPattern_Obj ss1, is1, ss2, is3, is1vv;
  // SS1 has the last slot of its own, reference angle 19.163 degrees.
  patternOf(&ss1, "SS1", "H/H");
  EXPECT_EQ(ss1.PatternSamples, 201);
  EXPECT_NEAR(ss1.StartAngle, 19.163 - 5.0, 1e-4);
  EXPECT_EQ(ss1.DeltaAngle, 0.05);
  EXPECT_NEAR(ss1.pattern()[0], gain(-3.8827), 1e-5);
  // IS1, HH and HV; known first gains of the file.
  patternOf(&is1, "IS1", "H/V");
  EXPECT_NEAR(is1.StartAngle, 16.628 - 5.0, 1e-4);
  EXPECT_NEAR(is1.pattern()[0], gain(-19.8203), 1e-5);
  patternOf(&is1vv, "IS1", "H/H");
  EXPECT_NEAR(is1vv.pattern()[0], gain(-18.6224), 1e-5);
  // SS2 shares the slot of IS3.
  patternOf(&ss2, "SS2", "V/V");
  patternOf(&is3, "IS3", "V/V");
  EXPECT_NEAR(ss2.StartAngle, 25.243 - 5.0, 1e-4);
  EXPECT_NEAR(ss2.pattern()[0], gain(-30.3441), 1e-5);
  EXPECT_EQ(std::memcmp(ss2.pattern(), is3.pattern(), 201 * sizeof(float)), 0);
  // 0 dB at the centre of every pattern.
  for (AntennaPattern_Obj* p : {&ss1, &is1, &ss2, &is1vv})
    EXPECT_NEAR(p->pattern()[100], 1.0, 1e-6);

  // Unknown swath or polarisation texts are refused before any read.
  AntennaPattern_Obj bad;
  EXPECT_EQ(bad.getPatternENVI(kXca.c_str(), 0, DataSetInfo_Obj::kUnknown), 1);
  EXPECT_EQ(bad.getPatternENVI(kXca.c_str(), 4, 0), 1);
  EXPECT_EQ(bad.getPatternENVI(path("missing").c_str(), 0, 0), 9);
}

TEST_F(AuxFiles, ShortOrDamagedAuxiliaryFilesAreRefused) {
  const std::string real = slurp(kXca);
  ASSERT_EQ(real.size(), 28177u);
  AntennaPattern_Obj p;
  SensorAttitude_Obj attitude;
  // Cut inside the main header, inside the specific header, inside the
  // record; an INS record is longer than this whole file.
  for (size_t size : {size_t{600}, size_t{1300}, size_t{28176}}) {
    const std::string cut = path("cut" + std::to_string(size));
    spit(cut, real.substr(0, size));
    EXPECT_EQ(p.getPatternENVI(cut.c_str(), 0, 0), 4) << size;
  }
  EXPECT_EQ(attitude.getDroopGain(kXca.c_str(), 2), 4);
  EXPECT_EQ(attitude.Temperature, -999);
  // A data set offset that is no number, negative, or beyond the file.
  const size_t field = 1478;  // the DS_OFFSET value of the descriptor
  for (const char* offset : {"+xxxxxxxxxxxxxxxxxxxx", "-00000000000000001625",
                             "+99999999999999999999", "+00000000000000028000"}) {
    std::string damaged = real;
    damaged.replace(field, 21, offset);
    const std::string file = path("damaged");
    spit(file, damaged);
    EXPECT_EQ(p.getPatternENVI(file.c_str(), 0, 0), 4) << offset;
  }
}

TEST_F(AuxFiles, DroopGainOfEachModeFromTheInstrumentFile) {
  const synth_test::SynthRun run = synth_test::run_synth("--orbit kepler");
  ASSERT_EQ(run.exit_code, 0);
  const std::string ins = run.dir + run.truth.at("Scene").at("InsFile");
  const double temperature = std::atof(run.truth.at("Calibration").at("Temperature").c_str());
  std::vector<double> droop;
  for (const char* p = run.truth.at("Calibration").at("DroopGain").c_str() + 1; *p && *p != '}';) {
    char* end = nullptr;
    droop.push_back(std::strtod(p, &end));
    p = end;
  }
  ASSERT_EQ(droop.size(), 8u);
  for (int mode = 0; mode < 5; ++mode) {
    SensorAttitude_Obj a;
    ASSERT_EQ(a.getDroopGain(ins.c_str(), mode), 0);
    EXPECT_NEAR(a.Temperature, temperature + (mode - 2), 1e-4) << mode;
    for (int i = 0; i < 8; ++i) EXPECT_NEAR(a.DroopGain[i], droop[i] - 0.001 * (mode - 2), 1e-6);
  }
  SensorAttitude_Obj other;
  EXPECT_EQ(other.getDroopGain(ins.c_str(), 5), 0);
  EXPECT_EQ(other.Temperature, -999);
  EXPECT_EQ(other.DroopGain[0], 0);
  synth_test::remove_run(run);
}

TEST_F(AuxFiles, PatternTravelsThroughItsRasterBesideTheHeader) {
  AntennaPattern_Obj p;
  patternOf(&p, "SS3", "H/H");
  const std::string hdr = path("swath.hdr");
  ASSERT_EQ(p.writehdr(hdr.c_str()), 0);
  EXPECT_EQ(slurp(path("swath_pattern")).size(), 201 * sizeof(float));

  AntennaPattern_Obj back;
  ASSERT_EQ(back.readhdr(hdr.c_str()), 0);
  std::vector<float> gains(201);
  ASSERT_EQ(back.getPatternArray(gains.data()), 0);
  EXPECT_EQ(std::memcmp(gains.data(), p.pattern(), gains.size() * sizeof(float)), 0);

  std::vector<float> copied(201);
  // A header read and written under another name takes its pattern along.
  AntennaPattern_Obj moving;
  ASSERT_EQ(moving.readhdr(hdr.c_str()), 0);
  ASSERT_EQ(moving.writehdr(path("moved.hdr").c_str()), 0);
  AntennaPattern_Obj moved;
  ASSERT_EQ(moved.readhdr(path("moved.hdr").c_str()), 0);
  ASSERT_EQ(moved.getPatternArray(copied.data()), 0);
  EXPECT_EQ(copied, gains);

  // A header whose raster is shorter than its pattern.
  spit(path("swath_pattern"), std::string(100, '\0'));
  AntennaPattern_Obj shortRaster;
  ASSERT_EQ(shortRaster.readhdr(hdr.c_str()), 0);
  EXPECT_EQ(shortRaster.getPatternArray(gains.data()), 4);
  EXPECT_EQ(AntennaPattern_Obj().getPatternArray(gains.data()), 1);
  EXPECT_EQ(AntennaPattern_Obj().WritePatternArray(), 1);
}

class BurstTimes : public MetadataTest {
 protected:
  // A raster of `bursts` x 3 lines of 4 SHORT_COMPLEX samples with a 17-byte
  // prefix; burst b starts at t0 + b seconds.
  void writeSwath(const std::string& base, int bursts, double t0) {
    DataFile raster;
    raster.set_name(base.c_str());
    raster.pixels_per_line = 4, raster.lines_per_image = bursts * 3, raster.row_prefix = 17;
    raster.cell_type = CT_SHORT_COMPLEX, raster.byte_order = 1;
    ASSERT_EQ(raster.write_hdr(), 0);
    std::string bytes;
    for (int line = 0; line < bursts * 3; ++line) {
      char prefix[17] = {};
      sec852mjd(t0 + line / 3 + (line % 3) * 0.01, prefix);
      bytes += std::string(prefix, 17) + std::string(16, char(line));
    }
    spit(base, bytes);
    writeBursts(base, bursts);
  }
  static void writeBursts(const std::string& base, int bursts) {
    SwathInfo swath;
    swath.Bursts = bursts, swath.Lines_per_burst = 3, swath.Swst_changes = 0;
    ASSERT_EQ(swath.writehdr((base + ".hdr").c_str()), 0);
  }
};

TEST_F(BurstTimes, EachBurstTakesTheTimeOfItsFirstLine) {
  const std::string base = path("ss1");
  writeSwath(base, 5, 7.0e8);
  SwathInfo swath;
  ASSERT_EQ(swath.readBurstTimes(base.c_str()), 0);
  ASSERT_EQ(swath.burstTimeCount(), 5);
  for (int b = 0; b < 5; ++b) EXPECT_NEAR(swath.burstTimes()[b], 7.0e8 + b, 1e-6);
}

TEST_F(BurstTimes, BurstCountsBeyondTheRasterAreRefusedBeforeAllocating) {
  const std::string base = path("ss2");
  writeSwath(base, 4, 7.0e8);
  // More bursts than lines, absurdly many, a negative count.
  const std::pair<int, int> cases[] = {{5, 4}, {1000000000, 4}, {-3, 1}};
  for (const auto& [bursts, code] : cases) {
    writeBursts(base, bursts);
    SwathInfo swath;
    EXPECT_EQ(swath.readBurstTimes(base.c_str()), code) << bursts;
    EXPECT_EQ(swath.burstTimeCount(), 0);
  }
  EXPECT_NE(SwathInfo().readBurstTimes(path("absent").c_str()), 0);
}

}  // namespace
