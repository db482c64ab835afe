// Regions of interest: indices, corners, intersections and the older stored forms.
#include <cmath>

#include "metadata_fixture.h"
#include "metadata_sections/roi.h"

namespace {

class RoiTest : public MetadataTest {};

TEST_F(RoiTest, IndicesRoundHalfAwayFromZero) {
  ROI_Obj r;
  EXPECT_EQ(r.isNULL(), 1);
  r.SetFastAxe(0.005, 1e-7, 1000);
  r.SetSlowAxe(0.5, 0.25, 4);  // binary fractions: half steps are exact
  EXPECT_NEAR(r.FastTimeLength, 1e-4, 1e-18);
  EXPECT_EQ(r.isNULL(), 0);
  EXPECT_EQ(r.GetFastIndex(0.00505), 500);
  EXPECT_EQ(r.GetSlowIndex(0.375), -1);  // half a step before the start
  EXPECT_EQ(r.GetSlowIndex(0.625), 1);
  EXPECT_EQ(r.GetSlowRange(0.375), 2);
  double f, s;
  r.GetDownRight(&f, &s);
  EXPECT_NEAR(f, 0.0051, 1e-15);
  EXPECT_EQ(s, 1.5);
  r.ResetROI();
  EXPECT_EQ(r.isNULL(), 1);
  // A zero step: no usable index, and no undefined conversion.
  ROI_Obj zero;
  EXPECT_EQ(zero.GetFastIndex(1.0), INT_MAX);
  EXPECT_EQ(zero.GetSlowRange(0.0), 0);
}

TEST_F(RoiTest, Intersections) {
  ROI_Obj a, b, out;
  a.SetFastAxe(0.005, 1e-7, 1000);
  a.SetSlowAxe(7.0e8, 1.0 / 1652.0, 5000);

  // With itself: the same region, in spite of the rounding of the end times.
  ASSERT_EQ(IntersectROI(&a, &a, &out), 0);
  EXPECT_EQ(out.Samples, 1000);
  EXPECT_EQ(out.Lines, 5000);
  EXPECT_EQ(out.FastStartTime, a.FastStartTime);

  // Partial overlap on both axes, steps taken from the first region.
  b.SetFastAxe(0.00505, 2e-7, 1000);
  b.SetSlowAxe(7.0e8 - 1.0, 1.0 / 1652.0, 1652 * 2);
  ASSERT_EQ(IntersectROI(&a, &b, &out), 0);
  EXPECT_EQ(out.FastStartTime, 0.00505);
  EXPECT_EQ(out.FastTimeDelta, 1e-7);
  EXPECT_EQ(out.Samples, 500);
  EXPECT_EQ(out.Lines, 1652);
  EXPECT_NEAR(out.FastTimeLength, 500 * 1e-7, 1e-18);

  // A part of a step does not count.
  b.SetFastAxe(0.005 + 0.25e-7, 1e-7, 1000);
  IntersectROI(&a, &b, &out);
  EXPECT_EQ(out.Samples, 999);

  // Disjoint on one axis, or touching only: empty.
  b.SetFastAxe(0.0052, 1e-7, 10);
  IntersectROI(&a, &b, &out);
  EXPECT_EQ(out.Lines, 0);
  EXPECT_EQ(out.isNULL(), 1);
  b.SetFastAxe(a.FastStartTime + a.FastTimeLength, 1e-7, 10);
  IntersectROI(&a, &b, &out);
  EXPECT_EQ(out.isNULL(), 1);

  // The output may be one of the inputs.
  b.SetFastAxe(0.00505, 1e-7, 1000);
  b.SetSlowAxe(7.0e8, 1.0 / 1652.0, 10);
  IntersectROI(&a, &b, &a);
  EXPECT_EQ(a.Samples, 500);
  EXPECT_EQ(a.Lines, 10);

  // A region without a step intersects to nothing.
  ROI_Obj unset;
  IntersectROI(&unset, &b, &out);
  EXPECT_EQ(out.isNULL(), 1);
}

// Headers of older releases hold the region as a "[ROI]" section, and the geographic region as
// corner points.
TEST_F(RoiTest, OlderParameterForms) {
  const std::string legacy = path("legacy.hdr");
  spit(legacy,
       "\n[ROI]\nSlowStartTime = 10.5\nFastStartTime = 0.004\nSlowTimeDelta = 0.001\n"
       "FastTimeDelta = 1e-7\nSlowTimeLength = 0.1\nFastTimeLength = 1e-5\nSamples = 100\n");
  ROI_Obj old;
  old.Lines = 33;
  ASSERT_EQ(old.read_roi(legacy.c_str(), "ROI"), 0);  // "Lines" is not needed
  EXPECT_EQ(old.SlowStartTime, 10.5);
  EXPECT_EQ(old.Samples, 100);
  EXPECT_EQ(old.Lines, 33);
  ROI_Obj none;
  EXPECT_EQ(none.read_roi(legacy.c_str(), "Other"), 1);
  const std::string noSamples = path("nosamples.hdr");
  spit(noSamples, "\n[ROI]\nLines = 5\nSlowStartTime = 1\n");
  EXPECT_EQ(none.read_roi(noSamples.c_str(), "ROI"), 1);

  const std::string corners = path("cl.hdr");
  spit(corners,
       "\n[Coordinates]\nUpLeft = {7.0 46.0}\nUpRight = {9.0 46.0}\nDownRight = {9.0 45.7}\n"
       "Latitude_SamplingStep = -0.1\nLongitude_SamplingStep = 0.5\n");
  ROI_Coords coords;
  ASSERT_EQ(coords.readhdr(corners.c_str()), 0);
  EXPECT_EQ(coords.FastStartTime, 46.0);
  EXPECT_NEAR(coords.FastTimeLength, -0.3, 1e-12);
  EXPECT_EQ(coords.Lines, 4);
  EXPECT_EQ(coords.Samples, 3);
  spit(path("ci.hdr"), "\n[Coordinates]\nUpLeft = {7.0 46.0}\n");
  EXPECT_EQ(ROI_Coords().readhdr(path("ci.hdr").c_str()), 1);
}

}  // namespace
