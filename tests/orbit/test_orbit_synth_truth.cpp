// The orbit geometry against the generator's own zero-Doppler geometry: the
// generator follows the real DORIS orbit with its own interpolation and
// intersects each line of sight with the ellipsoid by itself; its truth file
// holds the corners and centres of every sub-swath.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <string>

#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_roi.h"
#include "orbit/general_sar_orbit.h"
#include "synth_run.h"
#include "truth_math.h"

namespace {

using synth_test::SynthRun;

std::string Text(const SynthRun& run, const std::string& section, const std::string& key) {
  const auto s = run.truth.find(section);
  if (s == run.truth.end() || s->second.count(key) == 0) return "nan";
  return s->second.at(key);
}

double Value(const SynthRun& run, const std::string& section, const std::string& key) {
  return std::atof(Text(run, section, key).c_str());
}

// Earth-fixed point of a truth corner.
truth::Vec3 Corner(const SynthRun& run, const std::string& swath, const std::string& name) {
  return truth::EarthFixed(Value(run, swath, name + "Lat"), Value(run, swath, name + "Lon"));
}

// One truth point of a sub-swath.
struct TruthPoint {
  const char* name;  // key prefix of latitude and longitude
  const char* time;
  const char* range;
};
const TruthPoint kPoints[] = {{"FirstNear", "FirstLineTime", "NearRangeTime"},
                              {"FirstFar", "FirstLineTime", "FarRangeTime"},
                              {"LastNear", "LastLineTime", "NearRangeTime"},
                              {"LastFar", "LastLineTime", "FarRangeTime"},
                              {"Centre", "CentreTime", "CentreRangeTime"}};

class SynthTruth : public ::testing::TestWithParam<const char*> {
 protected:
  static void SetUpTestSuite() {
    runs_[0] = new SynthRun(synth_test::run_synth("--pass descending --pattern flat"));
    runs_[1] = new SynthRun(synth_test::run_synth("--pass ascending --pattern flat"));
  }
  static void TearDownTestSuite() {
    for (SynthRun*& r : runs_) {
      synth_test::remove_run(*r);
      delete r;
      r = nullptr;
    }
  }
  void SetUp() override {
    run_ = runs_[std::string(GetParam()) == "ascending" ? 1 : 0];
    ASSERT_EQ(run_->exit_code, 0);
    const double start = Value(*run_, "SubSwath1", "FirstLineTime");
    const double stop = Value(*run_, "SubSwath1", "LastLineTime");
    const std::string file = run_->dir + Text(*run_, "Scene", "OrbitFile");
    ASSERT_EQ(orbit_.GetStateVectorsENVI(file.c_str(), start, stop - start), 0) << file;
    ASSERT_EQ(orbit_.isAscending(), std::string(GetParam()) == "ascending");
  }
  std::string Swath(int k) const { return "SubSwath" + std::to_string(k); }

  static SynthRun* runs_[2];
  const SynthRun* run_ = nullptr;
  GeneralSAROrbit orbit_;
};

SynthRun* SynthTruth::runs_[2] = {nullptr, nullptr};

TEST_P(SynthTruth, GroundPointsOfEverySubSwath) {
  for (int k = 1; k <= 5; ++k) {
    for (const TruthPoint& p : kPoints) {
      const double t = Value(*run_, Swath(k), p.time);
      const double tau = Value(*run_, Swath(k), p.range);
      const truth::Vec3 want = Corner(*run_, Swath(k), p.name);
      truth::Vec3 g;
      double lat = 0.0, lon = 0.0;
      ASSERT_EQ(orbit_.sat2earth(t, tau, g.data()), 0);
      EXPECT_LT(truth::Distance(g, want), 0.1) << Swath(k) << " " << p.name;
      ASSERT_EQ(orbit_.SVGetLatLon(t, tau, &lat, &lon), 0);
      EXPECT_LT(truth::Distance(truth::EarthFixed(lat, lon), want), 0.1)
          << Swath(k) << " " << p.name;
    }
    // The look angle from the geocentric nadir, as the generator measures it.
    double inc = 0.0, look = 0.0;
    ASSERT_EQ(orbit_.SVGetAngles(Value(*run_, Swath(k), "CentreTime"),
                                 Value(*run_, Swath(k), "CentreRangeTime"), &inc, &look),
              0);
    EXPECT_NEAR(look, Value(*run_, Swath(k), "CentreLookAngle"), 1e-4) << Swath(k);
  }
}

TEST_P(SynthTruth, CornersOfEverySubSwath) {
  for (int k = 1; k <= 5; ++k) {
    GSRoi_Obj region;
    const double near = Value(*run_, Swath(k), "NearRangeTime");
    const double first = Value(*run_, Swath(k), "FirstLineTime");
    region.roi.FastStartTime = near;
    region.roi.FastTimeLength = Value(*run_, Swath(k), "FarRangeTime") - near;
    region.roi.SlowStartTime = first;
    region.roi.SlowTimeLength = Value(*run_, Swath(k), "LastLineTime") - first;
    geoCoords_Obj gc;
    ASSERT_EQ(orbit_.SVGetGeoCoords(&gc, &region), 0);
    // Right-looking: an ascending pass sees the west at near range and goes
    // north; a descending one sees the west at far range and goes south.
    const bool ascending = std::string(GetParam()) == "ascending";
    const struct {
      const geopoint* point;
      const char* truth;
    } corners[] = {{&gc.NorthWest, ascending ? "LastNear" : "FirstFar"},
                   {&gc.NorthEast, ascending ? "LastFar" : "FirstNear"},
                   {&gc.SouthWest, ascending ? "FirstNear" : "LastFar"},
                   {&gc.SouthEast, ascending ? "FirstFar" : "LastNear"},
                   {&gc.Center, "Centre"}};
    for (const auto& c : corners) {
      const truth::Vec3 got = truth::EarthFixed(c.point->latitude, c.point->longitude);
      EXPECT_LT(truth::Distance(got, Corner(*run_, Swath(k), c.truth)), 1.0)
          << Swath(k) << " " << c.truth;
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Passes, SynthTruth, ::testing::Values("descending", "ascending"));

}  // namespace
