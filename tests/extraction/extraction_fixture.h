// What every extraction test needs: the generator's truth, the run of the
// extraction on a generated product, and the host's working file through
// which the line copy reports its progress (registered once for the whole
// test program).
#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "extraction/images.h"
#include "installation.h"
#include "runtime/suite_state.h"
#include "synth_run.h"

namespace extraction_test {

using synth_test::SynthRun;

inline std::string Text(const SynthRun& run, const std::string& section, const std::string& key) {
  const auto s = run.truth.find(section);
  if (s == run.truth.end() || s->second.count(key) == 0) return "nan";
  return s->second.at(key);
}
inline double Value(const SynthRun& run, const std::string& section, const std::string& key) {
  return std::atof(Text(run, section, key).c_str());
}
using vlr_test::Exists;

// Runs the extraction of a generated product into <dir>R, with the orbit
// file the generator wrote unless another (or "" for none) is given.
inline int Extract(const SynthRun& run, images_conf& conf, images* out,
                   const char* orbit = nullptr) {
  std::snprintf(out->input.ASA_level1_filename, kImagesNameSize, "%s", run.product.c_str());
  const std::string orbitFile =
      orbit == nullptr ? run.dir + Text(run, "Scene", "OrbitFile") : std::string(orbit);
  std::snprintf(out->input.ASA_dor_vor, kImagesNameSize, "%s", orbitFile.c_str());
  std::snprintf(out->input.ASA_INS_Filename, kImagesNameSize, "%s%s", run.dir.c_str(),
                Text(run, "Scene", "InsFile").c_str());
  std::snprintf(out->output.OutputFile, kImagesNameSize, "%sR", run.dir.c_str());
  conf.Verbose = 1;
  return out->run();
}

// The host's side of the progress protocol: a working file and its
// "_batch_ok" companion, so that the copy's progress bar can report.
class HostWorkingFile : public ::testing::Environment {
 public:
  void SetUp() override {
    char pattern[] = "/tmp/vlr_extraction_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir_ = pattern;
    vlr_detail::suite().workingFile = dir_ + "/Process.working";
    vlr_test::WriteFile(dir_ + "/Process.working", "0\nStarting\n");
    vlr_test::WriteFile(dir_ + "/Process.working_batch_ok", "");
  }
  void TearDown() override { synth_test::shell("rm -rf '" + dir_ + "'"); }

 private:
  std::string dir_;
};

// One object for the whole program (an inline variable is initialised once).
inline ::testing::Environment* const kHostWorkingFile =
    ::testing::AddGlobalTestEnvironment(new HostWorkingFile);

}  // namespace extraction_test
