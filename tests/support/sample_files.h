// The real ENVISAT files bundled in data/samples/envisat.  Including this
// header registers a check that runs before any test of the executable: when
// one of the files is missing, every test fails with the file's name instead
// of reading past an empty orbit or header.
#pragma once

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstdio>
#include <cstdlib>
#include <string>

namespace vlr_test {

inline const std::string kSampleDir = ENVISAT_SAMPLE_DIR;
inline const std::string kSampleVor =
    kSampleDir + "DOR_VOR_AXVF-P20080331_075200_20080301_215527_20080303_002327";
inline const std::string kSamplePor =
    kSampleDir + "DOR_POR_AXVF-P20080404_014700_20080401_215527_20080403_002327";
inline const std::string kSampleXca =
    kSampleDir + "ASA_XCA_AXVIEC20070517_153558_20070204_165113_20071231_000000";
inline const std::string kSampleEr1Xca =
    kSampleDir + "ER1_XCA_AXNXXX20050321_000000_19910101_000000_20100101_000000.txt";

class SampleFilesPresent : public ::testing::Environment {
 public:
  void SetUp() override {
    for (const std::string* f : {&kSampleVor, &kSamplePor, &kSampleXca, &kSampleEr1Xca}) {
      struct stat st {};
      if (stat(f->c_str(), &st) != 0 || !S_ISREG(st.st_mode))
        ADD_FAILURE() << "missing sample file " << *f;
    }
    // A fatal failure here would only mark the tests skipped, which the test
    // driver counts as passed: end the executable with a failure instead.
    if (::testing::Test::HasFailure()) {
      std::fprintf(stderr, "the bundled sample files are incomplete\n");
      std::exit(1);
    }
  }
};

inline ::testing::Environment* const kSampleFilesCheck =
    ::testing::AddGlobalTestEnvironment(new SampleFilesPresent);

}  // namespace vlr_test
