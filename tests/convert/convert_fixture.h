// A wide-swath product generated and extracted once for all conversion
// tests; each test converts copies of its library headers and rasters in the
// working folder of its own installation.
#pragma once

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "convert/imagesar_kestova.h"
#include "convert/imagesar_kestova_internal.h"
#include "extraction/images.h"
#include "runtime/ckerr.h"
#include "runtime/suite_state.h"
#include "sample_files.h"
#include "sar_container/general_sar.h"
#include "suite/description_header.h"
#include "suite_fixture.h"
#include "synth_run.h"
#include "truth_math.h"

namespace convert_test {

constexpr double kHalfSpeedOfLight = 149896229.0;

class Conversion : public vlr_test::SuiteTest {
 protected:
  static void SetUpTestSuite() {
    run_ = new synth_test::SynthRun(synth_test::run_synth("--seed 3"));
    ASSERT_EQ(run_->exit_code, 0);
    // The line copy reports its progress to the host's working file.
    NVLR_UTILITY_ResetForTesting();
    const std::string working = run_->dir + "Process.working";
    vlr_test::WriteFile(working, "0\nStarting\n");
    vlr_test::WriteFile(working + "_batch_ok", "");
    vlr_detail::suite().workingFile = working;
    images_conf conf;
    images ex(conf);
    std::snprintf(ex.input.ASA_level1_filename, kImagesNameSize, "%s", run_->product.c_str());
    std::snprintf(ex.input.ASA_dor_vor, kImagesNameSize, "%s%s", run_->dir.c_str(),
                  truth("Scene", "OrbitFile").c_str());
    std::snprintf(ex.output.OutputFile, kImagesNameSize, "%sR", run_->dir.c_str());
    ASSERT_EQ(ex.run(), 0);
    NVLR_UTILITY_ResetForTesting();
  }
  static void TearDownTestSuite() {
    synth_test::remove_run(*run_);
    delete run_;
    run_ = nullptr;
  }

  void SetUp() override {
    SuiteTest::SetUp();
    // Report lines of level 0 reach "Process.log"; the allocation table
    // shows what a conversion leaves behind.
    init_ckerr_locking();
    init_report(0, "ASAR FOCUSSING", 1);
  }

  static std::string truth(const std::string& section, const std::string& key) {
    const auto s = run_->truth.find(section);
    return s == run_->truth.end() || s->second.count(key) == 0 ? "nan" : s->second.at(key);
  }
  static double value(const std::string& section, const std::string& key) {
    return std::atof(truth(section, key).c_str());
  }
  static std::string swath(int k) { return "SubSwath" + std::to_string(k); }

  // Copies raster k, its library header and the header's antenna pattern
  // raster to "<working>name"; returns the raster's path.
  std::string copySwath(int k, const std::string& name) const {
    const std::string from = run_->dir + "R" + std::to_string(k);
    const std::string to = work(name);
    EXPECT_EQ(synth_test::shell("cp '" + from + "' '" + to + "' && cp '" + from + ".hdr' '" + to +
                                ".hdr' && cp '" + from + "_pattern' '" + to + "_pattern'"),
              0);
    return to;
  }
  // Reads the library header `hdr`, lets `edit` change it and writes it back.
  static void editHeader(const std::string& hdr, const std::function<void(GeneralSAR&)>& edit) {
    auto gs = std::make_unique<GeneralSAR>();
    ASSERT_EQ(gs->GSread(hdr.c_str()), 0);
    edit(*gs);
    ASSERT_EQ(gs->GSwrite(hdr.c_str()), 0);
  }
  static std::unique_ptr<GeneralSAR> library(const std::string& hdr) {
    auto gs = std::make_unique<GeneralSAR>();
    EXPECT_EQ(gs->GSread(hdr.c_str()), 0);
    return gs;
  }
  // The suite header written under `name`, read back.
  static std::unique_ptr<CDescriptionHeader> suiteHeader(const std::string& name) {
    auto h = std::make_unique<CDescriptionHeader>(NVLR_UTILITY_ProductHeaderSections());
    EXPECT_TRUE(readHeader(*h, name.c_str()));
    return h;
  }

  static synth_test::SynthRun* run_;
};

inline synth_test::SynthRun* Conversion::run_ = nullptr;

// Field access on a header read back.
inline CDescriptionField* F(CDescriptionHeader& h, const char* path) {
  return getField(h, path);
}
inline double D(CDescriptionHeader& h, const char* path, int i = 0) {
  return getDouble(getField(h, path), i);
}
inline int I(CDescriptionHeader& h, const char* path) {
  return getInteger(getField(h, path));
}
inline std::string S(CDescriptionHeader& h, const char* path, int i = 0) {
  return getString(getField(h, path), i);
}
// The rows of "RasterInfo.OtherInfo".
inline std::vector<std::pair<std::string, std::string>> OtherInfo(CDescriptionHeader& h) {
  std::vector<std::pair<std::string, std::string>> rows;
  const CDescriptionField* f = getField(h, "RasterInfo.OtherInfo");
  for (int r = 0; r < f->rows(); ++r) rows.emplace_back(getStringAt(f, r, 0), getStringAt(f, r, 1));
  return rows;
}
inline std::string OtherInfoValue(CDescriptionHeader& h, const std::string& key) {
  for (const auto& row : OtherInfo(h)) {
    if (row.first == key) return row.second;
  }
  return "<missing>";
}

}  // namespace convert_test
