// The command line's own pieces: choosing auxiliary files by the dates in
// their names, reading the options, reading the host's error file and the
// sizes of the summary.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "cli/aux_choice.h"
#include "cli/cli_options.h"
#include "cli/host_child.h"
#include "cli/run_summary.h"
#include "truth_math.h"

namespace {

using vlr::cli::AuxFileName;

using truth::Sec85;

TEST(AuxFileNames, DatesAreReadFromEsaNames) {
  AuxFileName a;
  ASSERT_TRUE(vlr::cli::ParseAuxFileName(
      "ASA_XCA_AXVIEC20031217_140353_20030211_000000_20041231_000000", "ASA_XCA", a));
  EXPECT_EQ(a.created, Sec85(2003, 12, 17, 14, 3, 53));
  EXPECT_EQ(a.validFrom, Sec85(2003, 2, 11));
  EXPECT_EQ(a.validTo, Sec85(2004, 12, 31));
  // The same layout with an extension.
  ASSERT_TRUE(vlr::cli::ParseAuxFileName(
      "ASA_INS_AXVIEC20080229_120000_20080229_235959_20090101_000000.txt", "ASA_INS", a));
  EXPECT_EQ(a.validFrom, Sec85(2008, 2, 29, 23, 59, 59));

  for (const char* bad : {
           "ASA_INS_AXVIEC20031217_140353_20030211_000000_20041231_000000",   // other type
           "ASA_XCA_AXVIEC20031217_140353_20030211_000000",                   // cut short
           "ASA_XCA_AXVIEC20031217_140353_20030231_000000_20041231_000000",   // 31 February
           "ASA_XCA_AXVIEC20031217_140353_20031311_000000_20041231_000000",   // month 13
           "ASA_XCA_AXVIEC20031217_140353_2003021x_000000_20041231_000000",   // not a digit
           "ASA_XCA_AXVIEC20031217_140353_20030211_000000_20041231_000000X",  // trailing text
       }) {
    EXPECT_FALSE(vlr::cli::ParseAuxFileName(bad, "ASA_XCA", a)) << bad;
  }
}

TEST(AuxFileNames, ChoiceCoversTheDateAndPrefersTheLatestCreated) {
  const std::vector<std::string> names = {
      "ASA_XCA_AXVIEC20030101_000000_20030101_000000_20040101_000000",
      "ASA_XCA_AXVIEC20050101_000000_20030601_000000_20040101_000000",  // reprocessed
      "ASA_XCA_AXVIEC20040301_000000_20040101_000000_20050101_000000",
      "ASA_INS_AXVIEC20090101_000000_20000101_000000_20100101_000000",
      "README.txt",
  };
  const struct {
    double t;
    const char* chosen;  // nullptr: none valid
  } cases[] = {
      {Sec85(2003, 3, 1), "ASA_XCA_AXVIEC20030101_000000_20030101_000000_20040101_000000"},
      {Sec85(2003, 7, 1), "ASA_XCA_AXVIEC20050101_000000_20030601_000000_20040101_000000"},
      // The stop is excluded, the start included.
      {Sec85(2004, 1, 1), "ASA_XCA_AXVIEC20040301_000000_20040101_000000_20050101_000000"},
      {Sec85(2005, 1, 1), nullptr},
      {Sec85(2002, 12, 31, 23, 59, 59), nullptr},
  };
  for (const auto& c : cases) {
    AuxFileName a;
    const bool found = vlr::cli::ChooseAuxFile(names, "ASA_XCA", c.t, a);
    EXPECT_EQ(found, c.chosen != nullptr) << c.t;
    if (found && c.chosen) {
      EXPECT_EQ(a.name, c.chosen) << c.t;
    }
  }
}

TEST(CommandLineOptions, CommandLinesThatCannotRunAreRefusedWithTheReason) {
  const struct {
    std::vector<const char*> args;
    const char* reason;
  } cases[] = {
      {{"import"}, "needs a PRODUCT"},
      {{"import", "p", "q"}, "unexpected argument 'q'"},
      {{"import", "p", "--bogus"}, "unknown option '--bogus'"},
      {{"import", "p", "--tiff"}, "unknown option '--tiff'"},
      {{"import", "p", "-o"}, "needs a value"},
      {{"import", "p", "-o", ""}, "must not be empty"},
      {{"multilook", "p"}, "--orbit FILE"},
      {{"multilook", "p", "--orbit", "o", "--saturation", "5"}, "add --tiff"},
      {{"multilook", "p", "--orbit", "o", "--tiff", "--saturation", "0"}, "above 0"},
      {{"multilook", "p", "--orbit", "o", "--tiff", "--saturation=51"}, "at most 50"},
      {{"multilook", "p", "--orbit", "o", "--tiff=1"}, "takes no value"},
      {{"multilook", "p", "--orbit", "o", "--geocode=utm"}, "EPSG code, not 'utm'"},
      {{"multilook", "p", "--orbit", "o", "--geocode", "--spacing", "-75"}, "positive number"},
      {{"multilook", "p", "--orbit", "o", "--spacing", "75"}, "add --geocode"},
      {{"export", "p"}, "unknown command 'export'"},
  };
  for (const auto& c : cases) {
    std::vector<const char*> argv = {"import_wss"};
    argv.insert(argv.end(), c.args.begin(), c.args.end());
    vlr::cli::Options o;
    std::string error;
    EXPECT_FALSE(vlr::cli::ParseCommandLine(static_cast<int>(argv.size()), argv.data(), o, error))
        << c.args[0];
    EXPECT_NE(error.find(c.reason), std::string::npos) << error;
  }

  const char* argv[] = {"import_wss", "multilook", "--slant",   "--tiff", "--saturation=2.5",
                        "--geocode",  "4326",      "--spacing", "0.001",  "--orbit",
                        "orbit",      "--",        "-odd name"};
  vlr::cli::Options o;
  std::string error;
  ASSERT_TRUE(vlr::cli::ParseCommandLine(13, argv, o, error)) << error;
  EXPECT_TRUE(o.geocode);
  EXPECT_EQ(o.mapEpsg, 4326);
  EXPECT_EQ(o.mapSpacing, 0.001);
  // Behind "--" a name that begins with '-' is the product.
  EXPECT_EQ(o.product, "-odd name");
  EXPECT_FALSE(o.groundRange);
  EXPECT_EQ(o.saturation, 2.5);
}

TEST(HostErrorFile, CodeTitleTextAndExtraLinesAreRead) {
  char name[] = "/tmp/vlr_errfile_XXXXXX";
  const int fd = mkstemp(name);
  ASSERT_GE(fd, 0);
  FILE* f = fdopen(fd, "w");
  // As the error recorder writes it: status, title, text with the code,
  // extra lines, an empty line and two blank lines.
  std::fputs("-1\nINVALID INPUT\nAn argument is not valid [EC : 456962]\nDOR_VOR\n\n", f);
  std::fprintf(f, "%66s\n%66s\n", "", "");
  std::fclose(f);
  std::string message;
  EXPECT_EQ(vlr::cli::ReadErrorFile(name, message), 456962);
  EXPECT_EQ(message, "INVALID INPUT: An argument is not valid (DOR_VOR)");

  // A code without a text of its own (index -1).
  f = std::fopen(name, "w");
  std::fputs("-1\nBATCH RUN INTERRUPTED\n [EC : 326400]\n/tmp/w/Process.working\n\n", f);
  std::fclose(f);
  EXPECT_EQ(vlr::cli::ReadErrorFile(name, message), 326400);
  EXPECT_EQ(message, "BATCH RUN INTERRUPTED (/tmp/w/Process.working)");
  std::remove(name);
  EXPECT_EQ(vlr::cli::ReadErrorFile(name, message), 0);
}

TEST(RunSummary, SizesInTheirLargestWholeUnit) {
  EXPECT_EQ(vlr::cli::HumanSize(0), "0 B");
  EXPECT_EQ(vlr::cli::HumanSize(1023), "1023 B");
  EXPECT_EQ(vlr::cli::HumanSize(1536), "1.5 KB");
  EXPECT_EQ(vlr::cli::HumanSize(3ull << 30), "3.0 GB");
}

}  // namespace
