// Suite environment in process: configuration, catalogs, recorder, progress,
// closing sequence and the list-file reader.
#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "installation.h"
#include "runtime/ckerr.h"
#include "runtime/environment.h"
#include "runtime/error_catalog.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/list_file.h"
#include "runtime/process_log.h"
#include "runtime/progress.h"
#include "runtime/raise.h"

using vlr_test::Exists;
using vlr_test::ReadFile;
using vlr_test::TempInstallation;
using vlr_test::WriteFile;

namespace {

class SuiteEnvironment : public ::testing::Test {
 protected:
  void SetUp() override {
    NVLR_UTILITY_ResetForTesting();
    inst_.useInProcess();
  }
  void TearDown() override { NVLR_UTILITY_ResetForTesting(); }
  void init() { NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1); }
  TempInstallation inst_;
};

// The configuration fills the table of folders; process variables override
// it, and stray characters of a DOS line end are dropped.
TEST_F(SuiteEnvironment, ConfigurationAndProcessVariables) {
  init();
  EXPECT_EQ(NVLR_UTILITY_EnvValue("VELORAN_WORKING_DIR"), inst_.working());
  EXPECT_EQ(NVLR_UTILITY_EnvValue("VELORAN_BATCH_DIR"), inst_.working());
  EXPECT_EQ(NVLR_UTILITY_EnvValue("VELORAN_CEOS_DES_FILES_DIR"), inst_.root() + "/des/");
  EXPECT_EQ(NVLR_UTILITY_WorkingFile(), inst_.working() + "Process.working");
  EXPECT_TRUE(std::isnan(NVLR_UTILITY_NoDataFloat()));
  EXPECT_TRUE(std::isnan(NVLR_UTILITY_NoDataDouble()));
  std::string v;
  EXPECT_EQ(NVLR_UTILITY_GetEnvCode(v, "NO_SUCH_NAME"), -11);
  EXPECT_FALSE(NVLR_UTILITY_Catalog(VlrCatalog::Errors).empty());

  std::string ini = ReadFile(inst_.root() + "/Veloran_configuration.ini");
  ini.insert(ini.find('\n'), "\r");
  ini.replace(ini.rfind("NaN"), 3, "-9999.5");
  WriteFile(inst_.root() + "/Veloran_configuration.ini", ini);
  setenv("VELORAN_BATCH_DIR", (inst_.root() + "/batch").c_str(), 1);
  setenv("VELORAN_GCP_DATABASE_DIR", "/gcp", 1);
  NVLR_UTILITY_ResetForTesting();
  init();
  EXPECT_EQ(NVLR_UTILITY_EnvValue("VELORAN_KEY_FILES_DIR"), inst_.root() + "/keys/");
  EXPECT_EQ(NVLR_UTILITY_EnvValue("VELORAN_BATCH_DIR"), inst_.root() + "/batch/");
  EXPECT_EQ(NVLR_UTILITY_WorkingFile(), inst_.root() + "/batch/Process.working");
  EXPECT_EQ(NVLR_UTILITY_EnvValue("VELORAN_GCP_DATABASE_DIR"), "/gcp/");
  EXPECT_EQ(NVLR_UTILITY_NoDataDouble(), -9999.5);
  setenv("VELORAN_WORKING_FILE", "/tmp/host.working", 1);
  NVLR_UTILITY_ResetForTesting();
  init();
  EXPECT_EQ(NVLR_UTILITY_WorkingFile(), "/tmp/host.working");
  unsetenv("VELORAN_WORKING_FILE");
}

TEST(ErrorCatalogParse, DamagedCatalogsLoadWhatTheyHold) {
  // More groups announced than lines, and a text count beyond the end.
  ErrorCatalog c = ParseErrorCatalog(
      {"9", "K", "A", "B", "T", "Title A", "Title B", "[ErrorCodeInfo_A]", "5", "first", "second"});
  ASSERT_EQ(c.groups.size(), 4u);
  EXPECT_EQ(c.groups[0].key, "A");
  // Non-numeric counts give an empty catalog.
  EXPECT_TRUE(ParseErrorCatalog({"many", "x"}).empty());
  EXPECT_TRUE(ParseErrorCatalog({}).empty());
  ErrorCatalog good = ParseErrorCatalog({"2", "K", "A, extra", "B", "T", "Title A", "Title B", "",
                                         "[ErrorCodeInfo_B]", "3", "one", "two", "three"});
  ASSERT_EQ(good.groups.size(), 2u);
  EXPECT_EQ(good.groups[0].title, "Title A");
  EXPECT_EQ(good.groups[1].texts.size(), 3u);
  std::string title, text;
  NVLR_UTILITY_GetErrorTexts(good, 65280 + 2, title, text);
  EXPECT_EQ(title, "Title B");
  EXPECT_EQ(text, "two");
  NVLR_UTILITY_GetErrorTexts(good, 65280, title, text);  // index -1
  EXPECT_EQ(text, "");
  NVLR_UTILITY_GetErrorTexts(good, 65280 + 9, title, text);
  EXPECT_EQ(text, "GENERIC ERROR WRONG CODE");
  NVLR_UTILITY_GetErrorTexts(good, 5 * 65280, title, text);
  EXPECT_EQ(title, "GENERIC ERROR WRONG CODE");
  EXPECT_EQ(NVLR_UTILITY_ErrorTitleLine(good, 5 * 65280 + 1),
            "GENERIC ERROR WRONG CODE  :  326401 [PEC 5]");
  EXPECT_EQ(NVLR_UTILITY_ErrorTextLine(good, 65280 + 9),
            "GENERIC ERROR WRONG CODE  :  65289 [1 : 8]");
  // Texts longer than 1025 characters are cut.
  ErrorCatalog longText = ParseErrorCatalog({"1", "K", "A", "T", std::string(3000, 't'),
                                             "[ErrorCodeInfo_A]", "1", std::string(3000, 'x')});
  EXPECT_EQ(longText.groups[0].title.size(), 1025u);
  EXPECT_EQ(longText.groups[0].texts[0].size(), 1025u);
  ErrorCatalog none;
  NVLR_UTILITY_GetErrorTexts(none, 4, title, text);
  EXPECT_EQ(title, "AN ERROR OCCUR DURING Veloran INIT");
  EXPECT_EQ(NVLR_UTILITY_ErrorTitleLine(none, 4), "AN ERROR OCCUR DURING Veloran INIT  : [4]");
}

TEST(ErrorRecorder, ExtraTextsFollowTheFortyEightByThreeLayout) {
  const std::string s48(48, 'a'), s49(49, 'b'), s54(54, 'c'), s200(200, 'd');
  auto lines = [](int code, std::initializer_list<const char*> texts) {
    std::vector<const char*> v(texts);
    return VlrErrorExtraLines(code, v.data(), static_cast<int>(v.size()));
  };
  EXPECT_EQ(lines(4, {s48.c_str()}), s48 + "\n");
  // 49 characters: only one would remain after 48, so no break.
  EXPECT_EQ(lines(4, {s49.c_str()}), s49 + "\n");
  EXPECT_EQ(lines(4, {s54.c_str()}), std::string(48, 'c') + "\n" + std::string(6, 'c') + "\n");
  // A long text stops at 144 characters in all.
  EXPECT_EQ(lines(4, {s200.c_str()}), std::string(48, 'd') + "\n" + std::string(48, 'd') + "\n" +
                                          std::string(48, 'd') + "\n");
  // Short texts are left out once the total would reach 144.
  EXPECT_EQ(lines(4, {s48.c_str(), s48.c_str(), s48.c_str()}), s48 + "\n" + s48 + "\n");
  EXPECT_EQ(lines(vlr::kCodeFileNotFound, {"/data/R1_slc_hdr"}), "/data/R1_slc.sml\n");
  EXPECT_EQ(lines(vlr::kCodeBadArgument, {"/data/R1_slc_hdr"}), "/data/R1_slc_hdr\n");
}

TEST_F(SuiteEnvironment, RecorderWritesErrorFileAndWorkingFile) {
  init();
  inst_.hostFiles(37, "Extracting");
  // An earlier, longer content of the working file must not survive.
  WriteFile(inst_.workingFile(), "37\nExtracting\n" + std::string(3000, 'x') + "\n");
  NVLR_UTILITY_RecordError(vlr::kCodeFileNotFound, "/a/b_hdr");
  const std::string body =
      "FILE ERROR\nFile not found; check the path and that the file exists [EC : 261122]\n"
      "/a/b.sml\n\n" +
      std::string(66, ' ') + "\n" + std::string(66, ' ') + "\n";
  EXPECT_EQ(ReadFile(inst_.workingFile() + "_error"), "-1\n" + body);
  EXPECT_EQ(ReadFile(inst_.workingFile()), "-1\nExtracting\n" + body);
  NVLR_UTILITY_RecordError(vlr::kCodeWarnings, nullptr);
  EXPECT_EQ(ReadFile(inst_.workingFile()).substr(0, 14), "-2\nExtracting\n");
  // Without a working file the lines go beside it.
  std::remove(inst_.workingFile().c_str());
  NVLR_UTILITY_RecordError(vlr::kCodeBatchWithdrawn, nullptr);
  EXPECT_FALSE(Exists(inst_.workingFile()));
  const std::string tmp = ReadFile(inst_.workingFile() + "_tmp");
  EXPECT_EQ(tmp.substr(0, 4), "-1\n\n");
  EXPECT_NE(tmp.find("BATCH RUN INTERRUPTED\n [EC : 326400]\n"), std::string::npos);
}

TEST_F(SuiteEnvironment, CorruptWorkingFileEndsWith326400) {
  init();
  inst_.hostFiles(101, "Running");
  EXPECT_EXIT(getAndSetPerc(10, 20, "x"), ::testing::ExitedWithCode(255), "");
  EXPECT_EQ(ReadFile(inst_.workingFile()).substr(0, 3), "-1\n");
  EXPECT_NE(ReadFile(inst_.workingFile() + "_error").find("[EC : 326400]"), std::string::npos);
}

TEST_F(SuiteEnvironment, FatalReportLevelRaisesItsCode) {
  init();
  inst_.hostFiles();
  init_ckerr_locking();
  init_report(0, "ASAR FOCUSSING", 1);
  EXPECT_EXIT(are_add_report("orbit missing", ARE_DORVOR_NOT_EXIST, 7, "reader", "mod"),
              ::testing::ExitedWithCode(255), "");
  const std::string log = ReadFile(inst_.working() + "Process.log");
  EXPECT_NE(log.find("PROCESSING ERROR: orbit missing - line : 7 - function : reader - file : mod"
                     " - Tessal\n"),
            std::string::npos);
  EXPECT_NE(log.find("[ERROR ID : 1305602]"), std::string::npos);
  EXPECT_NE(ReadFile(inst_.workingFile() + "_error").find("orbit missing\n"), std::string::npos);
  exit_ckerr();
}

TEST(ExitStatus, SmallCodesAreTheirOwnExitStatus) {
  EXPECT_EQ(vlr::ExitStatusFor(0), 0);
  EXPECT_EQ(vlr::ExitStatusFor(255), 255);
  EXPECT_EQ(vlr::ExitStatusFor(65280), 255);
  EXPECT_EQ(vlr::ExitStatusFor(-3), 255);
}

TEST_F(SuiteEnvironment, TraceIsArchivedOnlyAboveOneMillionBytes) {
  init();
  const std::string trace = inst_.working() + "Process.trace";
  WriteFile(trace, std::string(1000000, 't'));
  NVLR_UTILITY_EndProcess(0, 0, 0);
  EXPECT_TRUE(Exists(trace));
  WriteFile(trace, std::string(1000001, 't'));
  NVLR_UTILITY_EndProcess(0, 0, 0);
  EXPECT_FALSE(Exists(trace));
  const std::string listing = vlr_test::RunProgram({"/bin/ls", inst_.working()}, {}, true).out;
  EXPECT_NE(listing.find("_trace.txt"), std::string::npos);
}

TEST_F(SuiteEnvironment, ListFilesAndArgumentLists) {
  init();
  const std::string path = inst_.working() + "list.txt";
  WriteFile(path, "first\n   second  \r\n\n  # comment\nnever\n");
  EXPECT_EQ(NVLR_UTILITY_ReadListFile(path.c_str()),
            (std::vector<std::string>{"first", "second", ""}));
  // A missing path falls back to its file name in the working folder.
  EXPECT_EQ(NVLR_UTILITY_ReadListFile("/no/such/dir/list.txt").size(), 3u);
  WriteFile(path, "header\nonly\n#stop\nlost\n");
  EXPECT_EQ(NVLR_UTILITY_SplitCommand((path + "###Veloran###ignored").c_str()),
            std::vector<std::string>{"only"});
  WriteFile(path, "header\n");
  EXPECT_EXIT(NVLR_UTILITY_SplitCommand(path.c_str()), ::testing::ExitedWithCode(255), "");
  EXPECT_NE(ReadFile(inst_.workingFile() + "_error").find("[EC : 261122]"), std::string::npos);
  WriteFile(path, "header\n" + std::string(kListFileMaxLine + 1, 'p') + "\n");
  EXPECT_EXIT(NVLR_UTILITY_ReadListFile(path.c_str()), ::testing::ExitedWithCode(255), "");
  EXPECT_NE(ReadFile(inst_.workingFile() + "_error").find("[EC : 261127]"), std::string::npos);
  WriteFile(path, "header\n" + std::string(kListFileMaxLine, 'p') + "\n");
  EXPECT_EQ(NVLR_UTILITY_ReadListFile(path.c_str())[1].size(), size_t(kListFileMaxLine));
}

TEST(FileUtility, SuffixesAndHeaderNames) {
  EXPECT_TRUE(NVLR_UTILITY_EndsWith("name_hdr", "_hdr"));
  EXPECT_TRUE(NVLR_UTILITY_EndsWith("name_HDR", "_hdr"));
  EXPECT_FALSE(NVLR_UTILITY_EndsWith("_hdr", "_hdr"));
  std::string n = "image.SML";
  NVLR_UTILITY_RemoveSuffix(n, ".sml");
  EXPECT_EQ(n, "image");
  n = ".sml";
  NVLR_UTILITY_RemoveSuffix(n, ".sml");
  EXPECT_EQ(n, ".sml");
  char dir[] = "/tmp/vlr_hdr_XXXXXX";
  ASSERT_NE(mkdtemp(dir), nullptr);
  const std::string base = std::string(dir) + "/R1_slc";
  EXPECT_EQ(NVLR_UTILITY_ResolveHeaderName(base.c_str()), base + "_hdr");
  WriteFile(base + ".sml", "x");
  EXPECT_EQ(NVLR_UTILITY_ResolveHeaderName(base.c_str()), base + ".sml");
  EXPECT_EQ(NVLR_UTILITY_ResolveHeaderName((base + "_hdr").c_str()), base + ".sml");
  EXPECT_TRUE(NVLR_UTILITY_CreateDir((std::string(dir) + "/a/b/c").c_str()));
  EXPECT_TRUE(Exists(std::string(dir) + "/a/b/c"));
  vlr_test::RunProgram({"/bin/rm", "-rf", dir}, {}, true);
}

}  // namespace
