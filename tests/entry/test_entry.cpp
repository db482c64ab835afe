// The executable as the host sees it: exit status, "Process.log", the error
// file and the working file.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <regex>
#include <stdexcept>
#include <string>
#include <vector>

#include "entry/command.h"
#include "entry/entry.h"
#include "installation.h"

using vlr_test::Exists;
using vlr_test::MaskLocalTimes;
using vlr_test::ReadFile;
using vlr_test::RunResult;
using vlr_test::TempInstallation;
using vlr_test::WriteFile;

namespace {

const std::string kStars(160, '*');
const std::string kId = "Veloran Base ENVI 4.2.000 Aug 30 2010 ";

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

// Runs that end before any driver starts: an unknown command word, no
// installation, a damaged configuration, an empty argument text.  Before the
// catalogs exist only the standard error stream tells the code.
TEST_F(Tool, RunsEndingBeforeTheDriver) {
  const std::string ini = inst_.root() + "/Veloran_configuration.ini";
  const std::string good = ReadFile(ini);
  enum Init { kInitDir, kNone, kWindir };  // where the installation is named
  struct Case {
    const char* what;
    std::string command;
    int code;
    std::string text;  // in Process.log when `logged`, else on standard error
    bool logged;
    Init init = kInitDir;
    std::string configuration = "";  // empty: the installed one; "-": none
  };
  const Case cases[] = {
      {"unknown command word", "main_Import_ESA#x", 456963,
       kId + " [ERROR ID : 456963]\n  INVALID INPUT [Unknown command; the tool", true},
      {"no installation", "main_import_ESA#x", 783360,
       "AN ERROR OCCUR DURING Veloran INIT  : [783360]\n [EC : 783360]\nwindir\n", false, kNone},
      {"installation named by windir", "main_Import_ESA#x", 456963, "[ERROR ID : 456963]", true,
       kWindir},
      {"no configuration", "main_import_ESA#x", 261122, ini + "\n", false, kInitDir, "-"},
      {"thirteen configuration lines", "main_import_ESA#x", 783360, "[783360]\n [EC : 783360]\n",
       false, kInitDir, good.substr(0, good.rfind("NaN"))},
      {"an over-long configuration line", "main_import_ESA#x", 783360, "too long\n", false,
       kInitDir, std::string(600, 'w') + "/\n" + good},
      {"empty argument text", "main_import_ESA#", 261122, "[ERROR ID : 261122]", true},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    std::remove((inst_.working() + "Process.log").c_str());
    std::remove((inst_.workingFile() + "_error").c_str());
    std::remove(ini.c_str());
    if (c.configuration != "-") WriteFile(ini, c.configuration.empty() ? good : c.configuration);
    std::map<std::string, std::string> env;
    if (c.init != kInitDir) env["VELORAN_INIT_DIR"] = "";
    if (c.init == kWindir) env["windir"] = inst_.root();
    const RunResult r = inst_.run(c.command, env);
    EXPECT_EQ(r.status, 255);
    const std::string code = std::to_string(c.code);
    if (!c.logged) {
      EXPECT_NE(r.err.find(c.text), std::string::npos) << r.err;
      EXPECT_NE(r.err.find("[EC : " + code + "]\n"), std::string::npos) << r.err;
      EXPECT_FALSE(Exists(inst_.working() + "Process.log"));
      EXPECT_FALSE(Exists(inst_.workingFile() + "_error"));
      continue;
    }
    EXPECT_NE(log().find(c.text), std::string::npos) << log();
    EXPECT_EQ(log().find("START :"), std::string::npos) << log();
    EXPECT_NE(errorFile().find("[EC : " + code + "]"), std::string::npos) << errorFile();
  }
}

TEST_F(Tool, ClosedStandardDescriptorsKeepTheErrorLinesOutOfTheLogs) {
  // A host may start the tool with standard descriptors closed; the logs
  // opened later must not take their numbers.
  struct Case {
    std::vector<int> closed;
    bool trace;
  };
  const Case cases[] = {{{2}, false}, {{1}, true}, {{0, 1, 2}, true}};
  for (const Case& c : cases) {
    std::string name;
    for (int fd : c.closed) name += std::to_string(fd) + " ";
    SCOPED_TRACE("closed " + name + (c.trace ? "with trace" : "without trace"));
    TempInstallation inst(c.trace);
    inst.hostFiles();
    const RunResult r = inst.run("main_convert#x", {}, c.closed);
    EXPECT_EQ(r.status, 255);
    const std::string log = ReadFile(inst.working() + "Process.log");
    // The error recorder's lines go to the standard error stream only.
    EXPECT_EQ(log.find("[EC : "), std::string::npos) << log;
    EXPECT_NE(log.find(kId + " [ERROR ID : 456963]\n  INVALID INPUT [Unknown command"),
              std::string::npos)
        << log;
    EXPECT_NE(log.find("\nEND :  -  "), std::string::npos) << log;
    EXPECT_NE(ReadFile(inst.workingFile() + "_error").find("[EC : 456963]"), std::string::npos);
    if (c.trace) {
      const std::string trace = ReadFile(inst.working() + "Process.trace");
      EXPECT_EQ(trace.substr(0, 15), "OpenTrace 1  2\n");
      EXPECT_EQ(trace.find("[EC : "), std::string::npos) << trace;
      EXPECT_NE(trace.find("\nERROR : INVALID INPUT [Unknown command"), std::string::npos) << trace;
    }
  }
}

// The entry with stand-in drivers, run in a child process as the host runs
// the tool: what each way of ending a driver leaves for the host.
int driverSucceeds(const char*) {
  return 0;
}
int driverFailsReading(const char*) {
  return 4;
}
int driverThrows(const char*) {
  throw std::runtime_error("escaped from the driver");
}
int driverThrowsAnything(const char*) {
  throw 42;
}
int driverNotSelected(const char*) {
  std::_Exit(99);
}

TEST_F(Tool, EntryEndsTheRunAsTheDriverEnds) {
  const std::string closing = "\n\n- -   " + kId + "\n\n<TIME>\n\nERROR :\n   \n\n";
  const std::string end = "\n" + kStars + "\nEND :  -  -  <TIME>\n" + kStars + "\n\n";
  struct Case {
    const char* name;
    const char* word;
    vlr::EntryDrivers drivers;
    int status;
    std::string log;
    std::string errorFile;  // empty: none is written
  };
  const std::string blanks = "\n" + std::string(66, ' ') + "\n" + std::string(66, ' ') + "\n";
  const std::string exceptionLog = "\n\n" + kId +
                                   " [ERROR ID : 913920]\n  UNEXPECTED INTERNAL ERROR []\n   \n\n" +
                                   closing + end;
  const std::string exceptionFile = "-1\nUNEXPECTED INTERNAL ERROR\n [EC : 913920]\n" + blanks;
  const Case cases[] = {
      {"success",
       "main_import_ESA#",
       {driverNotSelected, driverSucceeds},
       0,
       "\n\nSUCCESSFUL\n\n<TIME>\n\n" + end,
       ""},
      {"driver code",
       "main_multilook_WSS#",
       {driverFailsReading, driverNotSelected},
       4,
       "\n\n" + kId +
           " [ERROR ID : 4]\n  PROCESSING LIBRARY ERROR [A file could not be read; check that it "
           "is complete and readable]\n   \n\n" +
           closing + end,
       "-1\nPROCESSING LIBRARY ERROR\nA file could not be read; check that it is complete and "
       "readable [EC : 4]\n" +
           blanks},
      {"standard exception",
       "main_import_ESA#",
       {driverNotSelected, driverThrows},
       255,
       exceptionLog,
       exceptionFile},
      {"other exception",
       "main_import_ESA#",
       {driverNotSelected, driverThrowsAnything},
       255,
       exceptionLog,
       exceptionFile},
  };
  inst_.useInProcess();
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    std::remove((inst_.working() + "Process.log").c_str());
    std::remove((inst_.workingFile() + "_error").c_str());
    inst_.hostFiles();
    std::string program = "import_wss", command = std::string(c.word) + "args.txt";
    char* argv[] = {&program[0], &command[0], nullptr};
    EXPECT_EXIT(std::_Exit(vlr::RunEntry(2, argv, c.drivers)), ::testing::ExitedWithCode(c.status),
                "");
    EXPECT_EQ(MaskLocalTimes(log()), c.log);
    if (c.errorFile.empty()) {
      EXPECT_FALSE(Exists(inst_.workingFile() + "_error"));
      EXPECT_FALSE(Exists(inst_.workingFile()));
    } else {
      EXPECT_EQ(errorFile(), c.errorFile);
      EXPECT_EQ(ReadFile(inst_.workingFile()), "-1\nStarting\n" + c.errorFile.substr(3));
    }
  }
}

}  // namespace

namespace {

// The trace records the command and the error, the standard streams go to
// files beside it, and "Process.trace_save" in the working folder asks for a
// copy of every closed trace, named "Process" + "YYYYMMDDhhmmss.uuuuuu" +
// ".trace".
TEST(ToolTrace, TraceRecordsTheRunAndIsArchivedWhenTheHostAsks) {
  for (const bool save : {false, true}) {
    SCOPED_TRACE(save ? "Process.trace_save present" : "no Process.trace_save");
    TempInstallation inst(/*trace=*/true);
    inst.hostFiles();
    if (save) WriteFile(inst.working() + "Process.trace_save", "");
    EXPECT_EQ(inst.run("main_convert#x###Veloran###tail").status, 255);
    const std::string trace = ReadFile(inst.working() + "Process.trace");
    EXPECT_EQ(trace.substr(0, 15), "OpenTrace 1  2\n");
    EXPECT_NE(trace.find("[main_convert#x]\n"), std::string::npos);
    EXPECT_NE(trace.find("\nERROR : INVALID INPUT [Unknown command"), std::string::npos);
    EXPECT_NE(trace.find("FILE=main_import_ASAR"), std::string::npos);
    EXPECT_NE(ReadFile(inst.working() + "_cerr.txt").find("[EC : 456963]"), std::string::npos);
    std::vector<std::string> archives;
    bool errorTrace = false;
    for (const auto& e : std::filesystem::directory_iterator(inst.working())) {
      const std::string name = e.path().filename().string();
      if (std::regex_match(name, std::regex(R"(Process\d{14}\.\d{6}\.trace)")))
        archives.push_back(name);
      errorTrace = errorTrace || name.find("_trace.txt") != std::string::npos;
    }
    EXPECT_TRUE(errorTrace);
    ASSERT_EQ(archives.size(), save ? 1u : 0u);
    if (!save) continue;
    // The copy is taken after the closing records.
    const std::string copy = ReadFile(inst.working() + archives[0]);
    EXPECT_EQ(copy, ReadFile(inst.working() + "Process.trace"));
    EXPECT_NE(copy.find("\nEND :  -  "), std::string::npos) << copy;
  }
}

}  // namespace
