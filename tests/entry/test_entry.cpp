// The executable as the host sees it: exit status, "Process.log", the error
// file and the working file.
#include <gtest/gtest.h>

#include <cctype>
#include <string>
#include <vector>

#include "entry/command.h"
#include "installation.h"

using vlr_test::Exists;
using vlr_test::ReadFile;
using vlr_test::RunResult;
using vlr_test::TempInstallation;
using vlr_test::WriteFile;

namespace {

const std::string kStars(160, '*');
const std::string kId = "Veloran Base ENVI 4.2.000 Aug 30 2010 ";

// The log with every local time text ("Sun Dec 06 10:13:56 2026") replaced
// by "<TIME>".
std::string masked(const std::string& text) {
  // 'a' a letter, '9' a digit, anything else itself.
  static const std::string kShape = "aaa aaa 99 99:99:99 9999";
  auto matches = [&](size_t at) {
    if (at + kShape.size() > text.size()) return false;
    for (size_t i = 0; i < kShape.size(); ++i) {
      const char c = text[at + i];
      const bool ok = kShape[i] == 'a'   ? std::isalpha(static_cast<unsigned char>(c)) != 0
                      : kShape[i] == '9' ? std::isdigit(static_cast<unsigned char>(c)) != 0
                                         : c == kShape[i];
      if (!ok) return false;
    }
    return true;
  };
  std::string out;
  for (size_t i = 0; i < text.size();) {
    if (matches(i)) {
      out += "<TIME>";
      i += kShape.size();
    } else {
      out += text[i++];
    }
  }
  return out;
}

std::vector<std::string> fourteen() {
  std::vector<std::string> a(14, "NotOK");
  a[0] = "/data/ASA_WSS_1PNPDE20080302_091230.N1";
  a[3] = "/out/R";
  return a;
}

class Tool : public ::testing::Test {
 protected:
  void SetUp() override { inst_.hostFiles(); }
  std::string log() const { return ReadFile(inst_.working() + "Process.log"); }
  std::string errorFile() const { return ReadFile(inst_.workingFile() + "_error"); }
  TempInstallation inst_;
};

TEST(CommandWord, SelectionIsCaseSensitiveAndNeedsTheHash) {
  const char* rest = nullptr;
  EXPECT_EQ(vlr::SelectCommand("main_multilook_WSS#x main_import_ESA#", &rest),
            vlr::Tool::Multilook);
  EXPECT_STREQ(rest, "x main_import_ESA#");
  EXPECT_EQ(vlr::SelectCommand("main_import_ESA#", &rest), vlr::Tool::Import);
  EXPECT_STREQ(rest, "");
  EXPECT_EQ(vlr::SelectCommand("main_import_esa#a", &rest), vlr::Tool::Unknown);
  EXPECT_EQ(vlr::SelectCommand("main_import_ESA a", &rest), vlr::Tool::Unknown);
  char cmd[] = "main_import_ESA#/a/b###Veloran###more";
  vlr::CutAtMarker(cmd);
  EXPECT_STREQ(cmd, "main_import_ESA#/a/b");
}

TEST_F(Tool, UnknownCommandWordsEndWith456963) {
  for (const char* command : {"main_convert#x", "main_Import_ESA#x", "main_import_ESA x"}) {
    SCOPED_TRACE(command);
    const RunResult r = inst_.run(command);
    EXPECT_EQ(r.status, 255);
    EXPECT_NE(log().find(kId + " [ERROR ID : 456963]\n  INVALID INPUT [Unknown command; the tool"),
              std::string::npos);
    EXPECT_NE(errorFile().find("[EC : 456963]"), std::string::npos);
  }
  EXPECT_EQ(log().find("START :"), std::string::npos);
  EXPECT_NE(masked(log()).find("\n\n- -   " + kId + "\n\n<TIME>\n\nERROR :\n   \n\n\n" + kStars +
                               "\nEND :  -  -  <TIME>\n" + kStars + "\n\n"),
            std::string::npos);
}

TEST_F(Tool, MissingInstallationWritesNothing) {
  RunResult r = inst_.run("main_import_ESA#x", {{"VELORAN_INIT_DIR", ""}});
  EXPECT_EQ(r.status, 255);
  // Only the standard error stream tells the code before the catalogs exist.
  EXPECT_NE(r.err.find("AN ERROR OCCUR DURING Veloran INIT  : [783360]\n"), std::string::npos);
  EXPECT_NE(r.err.find("\nwindir\n"), std::string::npos);
  EXPECT_FALSE(Exists(inst_.working() + "Process.log"));
  EXPECT_FALSE(Exists(inst_.workingFile() + "_error"));
  // windir is the second place looked at.
  r = inst_.run("main_import_ESA#x", {{"VELORAN_INIT_DIR", ""}, {"windir", inst_.root()}});
  EXPECT_EQ(r.status, 255);
  EXPECT_TRUE(Exists(inst_.working() + "Process.log"));
}

TEST_F(Tool, BrokenConfigurationFails) {
  const std::string ini = inst_.root() + "/Veloran_configuration.ini";
  const std::string good = ReadFile(ini);
  // Missing configuration: 261122; thirteen lines or an over-long line: 783360.
  std::remove(ini.c_str());
  RunResult r = inst_.run("main_import_ESA#x");
  EXPECT_EQ(r.status, 255);
  EXPECT_NE(r.err.find("[EC : 261122]\n" + ini + "\n"), std::string::npos) << r.err;
  WriteFile(ini, good.substr(0, good.rfind("NaN")));
  r = inst_.run("main_import_ESA#x");
  EXPECT_EQ(r.status, 255);
  EXPECT_NE(r.err.find("[783360]\n [EC : 783360]\n"), std::string::npos) << r.err;
  WriteFile(ini, std::string(600, 'w') + "/\n" + good);
  r = inst_.run("main_import_ESA#x");
  EXPECT_EQ(r.status, 255);
  EXPECT_NE(r.err.find("[EC : 783360]\n"), std::string::npos);
  EXPECT_NE(r.err.find("too long\n"), std::string::npos) << r.err;
  EXPECT_FALSE(Exists(inst_.working() + "Process.log"));
}

TEST_F(Tool, TooFewArgumentsRaise456962AfterTheStartRecord) {
  struct Case {
    const char* word;
    const char* title;
  };
  for (const Case& c : {Case{"main_import_ESA#", "Import ESA Products"},
                        Case{"main_multilook_WSS#", "Multilooking ASA WSS"}}) {
    SCOPED_TRACE(c.word);
    std::remove((inst_.working() + "Process.log").c_str());
    inst_.hostFiles();
    const std::string args = inst_.writeArguments({"one", "two"});
    const RunResult r = inst_.run(std::string(c.word) + args + "###Veloran###host text");
    EXPECT_EQ(r.status, 255);
    const std::string expected = "\n\n\n" + kStars + "\nSTART : " + c.title + "  [ " + kId +
                                 " ]\n<TIME>\n" + kStars +
                                 "\n\n Parameter 0 (one)\n Parameter 1 (two)\n\n" + kStars + "\n\n";
    EXPECT_EQ(masked(log()).substr(0, expected.size()), expected) << log();
    EXPECT_NE(log().find("[ERROR ID : 456962]\n  INVALID INPUT [An input argument is missing or "
                         "invalid; check the named input]\n  " +
                         args + " \n\n"),
              std::string::npos);
    const std::string error = errorFile();
    EXPECT_EQ(error.substr(0, 3), "-1\n");
    EXPECT_NE(error.find("[EC : 456962]\n" + args + "\n"), std::string::npos);
    EXPECT_EQ(ReadFile(inst_.workingFile()).substr(0, 12), "-1\nStarting\n");
    EXPECT_NE(log().find("\nEND :  " + std::string(c.title) + "  -  "), std::string::npos);
  }
}

TEST_F(Tool, ArgumentChecksNeedingNoFileName) {
  std::vector<std::string> a = fourteen();
  a[0] = "NotOK";
  RunResult r = inst_.run("main_import_ESA#" + inst_.writeArguments(a));
  EXPECT_EQ(r.status, 255);
  EXPECT_NE(errorFile().find("[EC : 456962]\nASA_XXX\n"), std::string::npos);
  // The full parameter text of the import.
  EXPECT_NE(log().find("\nINPUT ASA : [ NotOK ]\nINPUT DORIS : [ NotOK ]\nINPUT ASA_XCA : [ NotOK "
                       "]\nOUTPUT ROOT NAME : [ /out/R ]\n" +
                       kStars),
            std::string::npos);

  r = inst_.run("main_multilook_WSS#" + inst_.writeArguments(a));
  EXPECT_EQ(r.status, 255);
  EXPECT_NE(errorFile().find("[EC : 456962]\nWSS\n"), std::string::npos);
  // "NotOK" is compared whole: a longer text is a file name.
  a = fourteen();
  a[0] = "NotOKay";
  inst_.run("main_import_ESA#" + inst_.writeArguments(a));
  EXPECT_EQ(errorFile().find("ASA_XXX"), std::string::npos);
}

TEST_F(Tool, EmptyArgumentTextEndsWithTheListReaderError) {
  const RunResult r = inst_.run("main_import_ESA#");
  EXPECT_EQ(r.status, 255);
  EXPECT_NE(errorFile().find("[EC : 261122]"), std::string::npos);
}

}  // namespace

namespace {

TEST(ToolTrace, TraceRecordsTheCommandAndIsArchivedAfterAnError) {
  TempInstallation inst(/*trace=*/true);
  inst.hostFiles();
  const RunResult r = inst.run("main_convert#x###Veloran###tail");
  EXPECT_EQ(r.status, 255);
  const std::string trace = ReadFile(inst.working() + "Process.trace");
  EXPECT_EQ(trace.substr(0, 15), "OpenTrace 1  2\n");
  EXPECT_NE(trace.find("[main_convert#x]\n"), std::string::npos);
  EXPECT_NE(trace.find("\nERROR : INVALID INPUT [Unknown command"), std::string::npos);
  EXPECT_NE(trace.find("FILE=main_import_ASAR"), std::string::npos);
  // The standard streams went to files beside the trace.
  EXPECT_TRUE(Exists(inst.working() + "_cerr.txt"));
  EXPECT_NE(ReadFile(inst.working() + "_cerr.txt").find("[EC : 456963]"), std::string::npos);
  const std::string listing = vlr_test::RunProgram({"/bin/ls", inst.working()}, {}, true).out;
  EXPECT_NE(listing.find("_trace.txt"), std::string::npos);
}

}  // namespace
