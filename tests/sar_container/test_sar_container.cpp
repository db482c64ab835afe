// The metadata container and the image bundles: which sections a header
// enables, write and read back, clones, damaged headers, and the equivalent
// speed and distance of an image.
#include <cmath>
#include <cstring>
#include <set>
#include <string>

#include "metadata_fixture.h"
#include "sar_container/general_sar.h"
#include "sar_container/image_sar_data.h"
#include "section_fields.h"

namespace {

using section_test::expectSameFields;
using section_test::fill;
using GS = GeneralSAR;

constexpr double kC = 299792458.0;

std::set<int> enabledSet(const GeneralSAR& gs) {
  std::set<int> on;
  for (int i = 0; i < GS::kObjects; ++i)
    if (gs.GSexists(static_cast<GS::GSObject>(i))) on.insert(i);
  return on;
}

std::set<int> allBut(std::set<int> off) {
  std::set<int> on;
  for (int i = 0; i < GS::kObjects; ++i)
    if (off.count(i) == 0) on.insert(i);
  return on;
}

void enableOnly(GeneralSAR& gs, const std::set<int>& on) {
  for (int i = 0; i < GS::kObjects; ++i)
    on.count(i) ? gs.GSenable(static_cast<GS::GSObject>(i))
                : gs.GSdisable(static_cast<GS::GSObject>(i));
}

// Position and velocity at time t on an inclined circular orbit.
void circularOrbit(double t, double* p, double* v) {
  const double r = 7.07e6, w = 7500.0 / r, inc = 98.5 * M_PI / 180.0;
  const double a = 0.3 + w * (t - 1000.0), c = std::cos(inc), s = std::sin(inc);
  const double pv[6] = {r * std::cos(a),      r * std::sin(a) * c,     r * std::sin(a) * s,
                        -r * w * std::sin(a), r * w * std::cos(a) * c, r * w * std::cos(a) * s};
  for (int k = 0; k < 3; ++k) p[k] = pv[k], v[k] = pv[3 + k];
}

// Seven vectors 10 s apart from t = 1000.
template <class Orbit>
void fillVectors(Orbit& o) {
  ASSERT_EQ(o.SVCreate(1000.0, 10.0, 7), 0);
  for (int i = 0; i < 7; ++i)
    circularOrbit(1000.0 + 10.0 * i, o.positions() + 3 * i, o.velocities() + 3 * i);
}

void fillOrbit(GeneralSAROrbit& o) {
  fillVectors(o);
  ASSERT_EQ(o.computeApproximateSV(), 0);
}

// Every section of the container with distinct values.
void fillContainer(GeneralSAR& gs) {
  DataFile& d = gs.datafile.data;
  d.pixels_per_line = 120, d.lines_per_image = 40, d.row_prefix = 17, d.cell_type = 2;
  gs.bufferfile.setSamples(120), gs.bufferfile.setLines(40), gs.bufferfile.setRowPrefix(17);
  gs.bufferfile.setType(static_cast<BufferFile::UnitType>(2));
  gs.roi.roi.SetFastAxe(5.6e-3, 5e-8, 120), gs.roi.roi.SetSlowAxe(1000.0, 1e-3, 40);
  ASSERT_EQ(gs.polys.CreatePolys(2, 1, 1, 1, 1, 1, 1, 1), 0);
  gs.polys.dc[1].pol[0] = 300.0, gs.polys.dc[1].taz0_s = 1010.0, gs.polys.frExt[0].extPol[13] = 2.5;
  fill(gs.sampling, 1), fill(gs.pulse, 2), fill(gs.dataSetInfo, 3), fill(gs.attitude, 4);
  fill(gs.spectralWindows, 5), fill(gs.geoCoords, 6), fill(gs.geoCoords.Center, 7);
  fill(gs.swathInfo, 8);
  gs.swathInfo.Swst_changes = 0;
  gs.sampling.lambda_m = 0.0566;
  gs.dataSetInfo.LookDirection = -1;
  fillOrbit(gs.orbit);
  fillVectors(gs.stateVectors);
  gs.antenna.StartAngle = 20.0, gs.antenna.DeltaAngle = 0.05, gs.antenna.PatternSamples = 5;
  ASSERT_EQ(gs.antenna.createBuffers(), 0);
}

class SarContainer : public MetadataTest {
 protected:
  // A copy of `file` with every `from` replaced by `to`.
  std::string edited(const std::string& file, const std::string& from, const std::string& to) {
    std::string text = slurp(file);
    EXPECT_NE(text.find(from), std::string::npos) << from;
    for (size_t at = text.find(from); at != std::string::npos; at = text.find(from, at + to.size()))
      text.replace(at, from.size(), to);
    const std::string out = path("edited" + std::to_string(++edits_) + ".hdr");
    spit(out, text);
    return out;
  }
  int edits_ = 0;
};

TEST_F(SarContainer, PartialHeaderEnablesExactlyItsSections) {
  SamplingConstants_Obj sampling;
  DataSetInfo_Obj info;
  fill(sampling, 1), fill(info, 2);
  const std::string file = path("partial.hdr");
  ASSERT_EQ(sampling.writehdr(file.c_str()), 0);
  ASSERT_EQ(info.writehdr(file.c_str()), 0);
  GeneralSAR gs;
  gs.GSenable(GS::GS_SWATHINFO);  // reading starts afresh
  ASSERT_EQ(gs.GSread(file.c_str()), 0);
  EXPECT_EQ(enabledSet(gs), (std::set<int>{GS::GS_SAMPLING, GS::GS_DATASETINFO}));
  expectSameFields(gs.sampling, sampling);
}

TEST_F(SarContainer, WriteThenReadRestoresSectionsAndFlags) {
  GeneralSAR src;
  fillContainer(src);
  // Sections sharing a block go together: raster file and data file, state
  // vectors and orbit.
  const std::set<int> some = {GS::GS_ROI,   GS::GS_POLYSAR,     GS::GS_STATEVECTORS,
                              GS::GS_ORBIT, GS::GS_DATASETINFO, GS::GS_SWATHINFO};
  for (const std::set<int>& wanted : {allBut({}), some}) {
    enableOnly(src, wanted);
    const std::string file = path("scene" + std::to_string(wanted.size()) + ".hdr");
    ASSERT_EQ(src.GSwrite(file.c_str()), 0);
    GeneralSAR back;
    ASSERT_EQ(back.GSread(file.c_str()), 0);
    ASSERT_EQ(enabledSet(back), wanted);
    expectSameFields(back.polys, src.polys);
    EXPECT_EQ(back.polys.frExt[0].extPol[13], 2.5);
    EXPECT_EQ(back.orbit.positions()[20], src.orbit.positions()[20]);
    // The look side reaches both orbit sections; the wavelength only comes
    // with the sampling constants.
    EXPECT_EQ(back.orbit.lookSign(), -1);
    EXPECT_EQ(back.stateVectors.lookSign(), -1);
    EXPECT_EQ(back.orbit.lambda(), wanted.size() == 14 ? 0.0566 : GeneralSAROrbit::kDefaultLambda);
  }
  // What the container adds: the raster names and the shared blocks.
  GeneralSAR back;
  ASSERT_EQ(back.GSread(path("scene14.hdr").c_str()), 0);
  EXPECT_EQ(back.antenna.PatternSamples, 5);
  EXPECT_EQ(back.bufferfile.filename(), path("scene14"));
}

TEST_F(SarContainer, CloneCopiesEnabledSectionsOnly) {
  GeneralSAR src;
  fillContainer(src);
  enableOnly(src, {GS::GS_POLYSAR, GS::GS_SAMPLING, GS::GS_ORBIT});
  GeneralSAR dst;
  ASSERT_EQ(src.GSclone(&dst), 0);
  EXPECT_EQ(enabledSet(dst), enabledSet(src));
  expectSameFields(dst.sampling, src.sampling);
  EXPECT_EQ(dst.orbit.positions()[4], src.orbit.positions()[4]);
  EXPECT_EQ(dst.stateVectors.n(), -999);  // disabled: not copied
  EXPECT_STREQ(dst.dataSetInfo.Track, "NOT_AVAILABLE");
  src.GSdestroy();  // the copy owns its own buffers
  EXPECT_EQ(src.polys.ndc, 0);
  EXPECT_EQ(dst.polys.dc[1].pol[0], 300.0);
  EXPECT_EQ(dst.orbit.n(), 7);
}

TEST_F(SarContainer, MissingDamagedAndHostileHeaders) {
  GeneralSAR gs;
  gs.GSenable(GS::GS_PULSE);
  EXPECT_EQ(gs.GSread(path("absent.hdr").c_str()), 1);
  EXPECT_EQ(gs.GSread(dir_.c_str()), 1);
  EXPECT_EQ(gs.GSread(nullptr), 1);
  EXPECT_TRUE(gs.GSexists(GS::GS_PULSE));  // a refused read changes nothing

  GeneralSAR full;
  fillContainer(full);
  enableOnly(full, allBut({}));
  const std::string good = path("full.hdr");
  ASSERT_EQ(full.GSwrite(good.c_str()), 0);
  // Not a header at all, and a truncated one: every section disabled.
  spit(path("binary.hdr"), std::string("\x00\xff<\x01TessalXmlDoc\x7f", 17));
  spit(path("truncated.hdr"), slurp(good).substr(0, slurp(good).size() / 2));
  for (const char* name : {"binary.hdr", "truncated.hdr"}) {
    ASSERT_EQ(gs.GSread(path(name).c_str()), 0);
    EXPECT_TRUE(enabledSet(gs).empty()) << name;
  }
  // Absurd counts disable the sections that hold them and nothing else (the
  // readers' own refusals are covered with each section).
  struct Hostile {
    const char *from, *to;
    std::set<int> off;
  };
  const Hostile cases[] = {
      {"<ndc>2</ndc>", "<ndc>1000000000</ndc>", {GS::GS_POLYSAR}},
      {"<PatternSamples>5<", "<PatternSamples>1000000000<", {GS::GS_ANTENNA}},
      {"<NrOfPixelsPerLine>120<", "<NrOfPixelsPerLine>-7<", {GS::GS_DATAFILE, GS::GS_BUFFERFILE}},
      {"<nSV_n>7<", "<nSV_n>1000000000<", {GS::GS_STATEVECTORS, GS::GS_ORBIT}},
      {"<nSV_n>7<", "<nSV_n>3<", {GS::GS_ORBIT}},  // fewer vectors than the orbit needs
  };
  for (const Hostile& h : cases) {
    ASSERT_EQ(gs.GSread(edited(good, h.from, h.to).c_str()), 0);
    EXPECT_EQ(enabledSet(gs), allBut(h.off)) << h.to;
  }
}

// A header may declare up to 100000 state vectors (a long scene's orbit, or
// a hostile count), which both orbit sections hold as read.  A clone of the
// container copies them whole, its orbit model follows the orbit, and no
// single polynomial is fitted through them all.
TEST_F(SarContainer, LongOrbitsCloneWhole) {
  const int n = kMaxStateVectors;
  const double dt = 5.0;
  GeneralSAR src;
  ASSERT_EQ(src.orbit.SVCreate(1000.0, dt, n), 0);
  ASSERT_EQ(src.stateVectors.SVCreate(1000.0, dt, n), 0);
  for (int i = 0; i < n; ++i) {
    circularOrbit(1000.0 + i * dt, src.orbit.positions() + 3 * i, src.orbit.velocities() + 3 * i);
    circularOrbit(1000.0 + i * dt, src.stateVectors.positions() + 3 * i,
                  src.stateVectors.velocities() + 3 * i);
  }
  ASSERT_EQ(src.orbit.computeApproximateSV(), 0);
  enableOnly(src, {GS::GS_STATEVECTORS, GS::GS_ORBIT});

  GeneralSAR copy;
  ASSERT_EQ(src.GSclone(&copy), 0);
  ASSERT_EQ(enabledSet(copy), enabledSet(src));
  const size_t bytes = 3 * static_cast<size_t>(n) * sizeof(double);
  ASSERT_EQ(copy.stateVectors.n(), n);
  EXPECT_EQ(std::memcmp(copy.stateVectors.positions(), src.orbit.positions(), bytes), 0);
  EXPECT_EQ(std::memcmp(copy.stateVectors.velocities(), src.orbit.velocities(), bytes), 0);
  EXPECT_FALSE(copy.stateVectors.isFitted());
  ASSERT_EQ(copy.orbit.n(), n);
  for (double t : {1002.5, 251234.5, 1000.0 + (n - 1) * dt - 0.3}) {
    double p[3], truth[3], v[3];
    ASSERT_EQ(copy.orbit.SVGetPos(t, p), 0) << t;
    circularOrbit(t, truth, v);
    for (int k = 0; k < 3; ++k) EXPECT_NEAR(p[k], truth[k], 1e-3) << t;
  }
}

// An image seen from 7000 m/s whose Doppler rate is -2 V^2 / (lambda R) at
// the near and far range of the region: the equivalent speed is V combined
// with the squint, the distance the near range seen under the squint.
class EquivalentSpeed : public SarContainer {
 protected:
  void SetUp() override {
    SarContainer::SetUp();
    img.sampling.fc_hz = 5.331e9;
    img.sampling.frg_hz = 19.208e6;
    img.data.pixels_per_line = 4000;
    img.roi.SetFastAxe(tau1, 1.0 / 19.208e6, 4000);
    ASSERT_EQ(img.polys.CreatePolys(2, 2), 0);
    // The rate through FR(tau1) and FR(tau2) with a quadratic term about
    // trg0; its azimuth and higher range terms and the second set are not
    // used.
    const double x1 = tau1 - trg0, x2 = tau2() - trg0, c4 = 3.0e7;
    const double c1 = (fr(tau2()) - c4 * x2 * x2 - fr(tau1) + c4 * x1 * x1) / (x2 - x1);
    polyFR& rate = img.polys.fr[0];
    rate.pol[0] = fr(tau1) - c1 * x1 - c4 * x1 * x1, rate.pol[1] = c1, rate.pol[4] = c4;
    rate.pol[2] = 50.0, rate.pol[3] = 1e3, rate.pol[5] = 1e9, rate.trg0_s = trg0;
    img.polys.fr[1].pol[0] = -99.0, img.polys.fr[1].taz0_s = 2000.0;
    // Doppler centroid 400 Hz + 2e5 Hz/s of range, at the first set's time.
    img.polys.dc[0].pol[0] = 400.0, img.polys.dc[0].pol[1] = 2e5, img.polys.dc[0].pol[2] = 3.0;
    img.polys.dc[0].trg0_s = tau1, img.polys.dc[0].taz0_s = 1000.0;
    img.polys.dc[1].pol[0] = -7000.0, img.polys.dc[1].taz0_s = 1010.0;
  }
  double lambda() const { return kC / 5.331e9; }
  double tau2() const { return tau1 + 4000 / 19.208e6; }
  double fr(double tau) const { return -2.0 * v * v / (lambda() * kC / 2 * tau); }

  const double v = 7000.0, tau1 = 5.6e-3, trg0 = 5.65e-3;
  GeneralSLCData img;
};

TEST_F(EquivalentSpeed, MatchesTheGeometryOfTheImage) {
  ASSERT_EQ(img.compute_eqspeed(), 0);
  const double fdc = 400.0 + 2e5 * (0.5 * (tau2() - tau1));
  const double squint = lambda() * fdc / 2;
  const double veq = std::sqrt(v * v + squint * squint);
  EXPECT_NEAR(img.attitude.Eq_speed, veq, veq * 1e-9);
  EXPECT_NEAR(img.attitude.Eq_distance, kC / 2 * tau1 * std::cos(std::asin(squint / veq)), 1e-3);
}

TEST_F(EquivalentSpeed, RefusesWhatGivesNoFiniteResult) {
  ImageSARData_Obj empty;
  ASSERT_EQ(empty.polys.CreatePolys(0, 1), 0);
  EXPECT_EQ(empty.compute_eqspeed(), 10);  // no Doppler centroid
  const polyFR rate = img.polys.fr[0];
  img.polys.fr[0].pol[1] = img.polys.fr[0].pol[4] = 0.0;  // the same rate everywhere
  EXPECT_EQ(img.compute_eqspeed(), 1);
  rate.clone(&img.polys.fr[0]);
  img.sampling.frg_hz = 0.0;
  EXPECT_EQ(img.compute_eqspeed(), 1);
  img.sampling.frg_hz = 19.208e6;
  img.sampling.fc_hz = -999;
  EXPECT_EQ(img.compute_eqspeed(), 1);
  EXPECT_EQ(img.attitude.Eq_speed, -999);  // nothing stored
  img.sampling.fc_hz = 5.331e9;
  EXPECT_EQ(img.compute_eqspeed(), 0);
}

TEST_F(EquivalentSpeed, BundleWrittenIsReadBackAndReadsAsAContainer) {
  ASSERT_EQ(img.compute_eqspeed(), 0);
  ASSERT_EQ(img.setImageFile(path("swath1").c_str()), 0);
  img.data.lines_per_image = 40;
  fill(img.sampling, 1), fill(img.pulse, 2), fill(img.spectralWindows, 3), fill(img.swathInfo, 4);
  fill(img.geoCoords, 5), fill(img.dataSetInfo, 6);
  for (geopoint* p : {&img.geoCoords.NorthWest, &img.geoCoords.NorthEast, &img.geoCoords.SouthWest,
                      &img.geoCoords.SouthEast, &img.geoCoords.Center})
    p->set(45.0, 7.0, 0.0, 30.0, 25.0);
  img.sampling.lambda_m = 0.0566;
  img.swathInfo.Swst_changes = 0;
  img.dataSetInfo.LookDirection = -1;
  fillOrbit(img.orbit);
  ASSERT_EQ(img.writehdr(), 0);

  const std::string header = path("swath1.hdr");
  GeneralSLCData back;
  ASSERT_EQ(back.readhdr(header.c_str()), 0);
  EXPECT_EQ(back.imageFile(), path("swath1"));
  EXPECT_EQ(back.attitude.Eq_speed, img.attitude.Eq_speed);
  EXPECT_EQ(back.orbit.lookSign(), -1);
  GeneralSAR gs;
  ASSERT_EQ(gs.GSread(header.c_str()), 0);
  EXPECT_EQ(enabledSet(gs), allBut({GS::GS_ANTENNA}));

  // Without the sensor attitude the read stops there with its code: the
  // polynomials after it are not read.
  ImageSARData_Obj cut;
  EXPECT_EQ(cut.readhdr(edited(header, "SensorAttitude>", "OtherAttitude>").c_str()), 1);
  EXPECT_EQ(cut.orbit.n(), 7);
  EXPECT_EQ(cut.polys.ndc, 0);
  ImageSARData_Obj unnamed;
  EXPECT_EQ(unnamed.readhdr(path("swath1.xml").c_str()), 1);
  EXPECT_EQ(unnamed.writehdr(), 1);
}

}  // namespace
