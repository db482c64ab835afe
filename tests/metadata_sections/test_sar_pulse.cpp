// The chirp of the transmitted pulse.
#include <cmath>
#include <vector>

#include "metadata_fixture.h"
#include "metadata_sections/sar_pulse.h"
#include "raster/data_file.h"

namespace {

SARPulse_Obj pulse(double length, double bandwidth, double rate) {
  SARPulse_Obj p;
  p.PulseLength = length;
  p.Bandwidth = bandwidth;
  p.PulseSamplingRate = rate;
  return p;
}

TEST(Chirp, SamplesAreSymmetricAboutTheCentreAndNormalised) {
  const SARPulse_Obj p = pulse(10e-6, 16e6, 20e6);
  ASSERT_EQ(p.chirpSamples(), 200);
  std::vector<fcomplex> c(200);
  ASSERT_EQ(p.generateChirp(c.data(), 200), 0);
  for (int n = 0; n < 100; ++n) EXPECT_LT(std::abs(c[n] - c[199 - n]), 1e-6f) << n;
  // |sample| = 1 / sqrt(N fs / B); phase pi B/T t^2 at the first sample.
  const double g = std::sqrt(200 * 20e6 / 16e6);
  EXPECT_NEAR(std::abs(c[37]), 1.0 / g, 1e-6);
  const double t = -99.5 / 20e6;
  const double phi = 3.14159265358979323846 * 16e6 / 10e-6 * t * t;
  EXPECT_NEAR(c[0].real(), std::cos(phi) / g, 1e-5);
  EXPECT_NEAR(c[0].imag(), std::sin(phi) / g, 1e-5);
}

TEST(Chirp, LengthRoundsHalfAwayFromZeroAndDownChirpsWork) {
  EXPECT_EQ(pulse(10.025e-6, 16e6, 20e6).chirpSamples(), 201);  // 200.5
  EXPECT_EQ(pulse(1e-6, 1e6, 0.5e6).chirpSamples(), 1);         // 0.5
  const SARPulse_Obj down = pulse(10e-6, -16e6, 20e6);
  std::vector<fcomplex> c(200), up(200);
  ASSERT_EQ(down.generateChirp(c.data()), 0);
  ASSERT_EQ(pulse(10e-6, 16e6, 20e6).generateChirp(up.data()), 0);
  EXPECT_NEAR(c[3].imag(), -up[3].imag(), 1e-6f);
}

TEST(Chirp, PulsesThatDescribeNoChirpAreRefused) {
  std::vector<fcomplex> c(16, fcomplex(5, 5));
  for (const SARPulse_Obj& p :
       {SARPulse_Obj(), pulse(0, 16e6, 20e6), pulse(1e-6, 0, 20e6), pulse(1e-6, 16e6, -20e6),
        pulse(NAN, 16e6, 20e6), pulse(1e-6, 16e6, 0.1e6), pulse(1.0, 1e6, 1e9)}) {
    EXPECT_EQ(p.chirpSamples(), -1);
    EXPECT_EQ(p.generateChirp(c.data(), 16), 1);
  }
  // A buffer shorter than the chirp is not written.
  EXPECT_EQ(pulse(10e-6, 16e6, 20e6).generateChirp(c.data(), 16), 1);
  EXPECT_EQ(c[0], fcomplex(5, 5));
}

class ChirpFile : public MetadataTest {};

TEST_F(ChirpFile, ChirpIsWrittenAsOneComplexLine) {
  const SARPulse_Obj p = pulse(10e-6, 16e6, 20e6);
  const std::string file = path("chirp");
  ASSERT_EQ(p.writeChirp(file.c_str()), 0);
  DataFile raster;
  ASSERT_EQ(raster.read_hdr(file.c_str()), 0);
  EXPECT_EQ(raster.pixels_per_line, 200);
  EXPECT_EQ(raster.cell_type, CT_FLOAT_COMPLEX);
  std::vector<fcomplex> c(200);
  p.generateChirp(c.data());
  EXPECT_EQ(slurp(file), std::string(reinterpret_cast<const char*>(c.data()), 200 * sizeof c[0]));
  EXPECT_EQ(SARPulse_Obj().writeChirp(path("none").c_str()), 1);
}

}  // namespace
