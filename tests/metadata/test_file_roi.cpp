// A region read together with the raster header beside it.
#include "metadata/file_roi.h"
#include "metadata_fixture.h"

namespace {

class FileRoiTest : public MetadataTest {};

TEST_F(FileRoiTest, RegionAndRasterHeaderComeFromOneHeaderFile) {
  const std::string raster = path("image");
  DataFile description;
  description.set_name(raster.c_str());
  description.pixels_per_line = 1000;
  description.lines_per_image = 12;
  description.row_prefix = 17;
  description.cell_type = CT_SHORT_COMPLEX;
  description.byte_order = 1;
  ASSERT_EQ(description.write_hdr(), 0);
  ROI_Obj region;
  region.SetFastAxe(0.005, 1e-7, 1000);
  region.SetSlowAxe(7.0e8, 1.0 / 1652.0, 12);
  ASSERT_EQ(region.write_roi((raster + ".hdr").c_str(), "ROI"), 0);

  FileROI_Obj f;
  f.fileName = raster;
  EXPECT_EQ(f.read_roi(), 0);
  EXPECT_EQ(f.roi.Samples, 1000);
  EXPECT_EQ(f.roi.Lines, 12);
  EXPECT_EQ(f.data.pixels_per_line, 1000);
  EXPECT_EQ(f.data.row_prefix, 17);
  EXPECT_EQ(f.data.cell_type, CT_SHORT_COMPLEX);

  // Neither part present: still 0, the members keep their values.
  FileROI_Obj missing;
  missing.fileName = path("absent");
  missing.roi.Samples = 5;
  EXPECT_EQ(missing.read_roi(), 0);
  EXPECT_EQ(missing.roi.Samples, 5);
}

}  // namespace
