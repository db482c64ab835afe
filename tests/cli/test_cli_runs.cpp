// The command line end to end on a generated wide-swath product: every
// subcommand with its defaults and with every option, wrong inputs, the
// choice of auxiliary files by name, the progress display with and without
// a terminal, and Ctrl-C.  Results are checked against the generator's truth.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cmath>
#include <cstdio>
#include <filesystem>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "host_run.h"
#include "synth_run.h"

namespace {

namespace fs = std::filesystem;
using vlr_test::Exists;
using vlr_test::ReadFile;
using vlr_test::RunResult;

// The host's variables are left out: the command line needs none.
const std::map<std::string, std::string> kNoHost = {{"VELORAN_INIT_DIR", ""},
                                                    {"VELORAN_WORKING_DIR", ""},
                                                    {"VELORAN_BATCH_DIR", ""},
                                                    {"VELORAN_WORKING_FILE", ""},
                                                    {"windir", ""}};

class CommandLineRuns : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    synth_ = new synth_test::SynthRun(synth_test::run_synth("--size tiny --pass descending"));
    ASSERT_EQ(synth_->exit_code, 0);
    char pattern[] = "/tmp/vlr_cli_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    scratch_ = std::string(pattern) + "/";
    // An installed copy of the tool whose auxiliary list is the generator's,
    // so that the defaults find the product's auxiliary files.
    prefix_ = scratch_ + "prefix/";
    fs::create_directories(prefix_ + "bin");
    fs::copy(VLR_BUILD_DIR "/share", prefix_ + "share", fs::copy_options::recursive);
    fs::copy_file(vlr_test::ToolPath(), prefix_ + "bin/import_wss");
    fs::copy_file(VLR_BUILD_DIR "/bin/main_delete_file", prefix_ + "bin/main_delete_file");
    const std::string des = prefix_ + "share/import_wss/des/";
    for (const auto& e : fs::directory_iterator(synth_->dir)) {
      const std::string name = e.path().filename().string();
      if (name == "ASA_AUX_list.dat" || name.rfind("ASA_XCA_", 0) == 0 ||
          name.rfind("ASA_INS_", 0) == 0)
        fs::copy_file(e.path(), des + name, fs::copy_options::overwrite_existing);
    }
  }
  static void TearDownTestSuite() {
    synth_test::remove_run(*synth_);
    delete synth_;
    std::error_code ec;
    fs::remove_all(scratch_, ec);
  }

  static std::string truth(const std::string& section, const std::string& key) {
    return synth_->truth[section][key];
  }
  // A fresh empty folder for one case.
  static std::string folder(const std::string& name) {
    const std::string dir = scratch_ + name + "/";
    fs::create_directories(dir);
    return dir;
  }
  // Runs a tool in cwd with the arguments.
  static RunResult run(const std::string& tool, const std::string& cwd,
                       const std::vector<std::string>& args) {
    std::vector<std::string> argv = {"/usr/bin/env", "-C", cwd, tool};
    argv.insert(argv.end(), args.begin(), args.end());
    return vlr_test::RunProgram(argv, kNoHost, true);
  }

  static synth_test::SynthRun* synth_;
  static std::string scratch_;
  static std::string prefix_;
};

synth_test::SynthRun* CommandLineRuns::synth_ = nullptr;
std::string CommandLineRuns::scratch_;
std::string CommandLineRuns::prefix_;

struct CliCase {
  const char* name;
  bool installedCopy;  // the copy whose auxiliary list is the generator's
  std::vector<std::string> args;
  int status;  // -1: any non-zero status
  std::vector<std::string> errHas;
  std::vector<std::string> outHas;
  std::vector<std::string> written;  // in the case's folder; empty: nothing at all
};

TEST_F(CommandLineRuns, CommandsWithDefaultsOptionsAndWrongInputs) {
  const std::string product = synth_->product;
  std::string stem = fs::path(product).filename().string();
  stem = stem.substr(0, stem.rfind('.'));
  const std::string orbit = synth_->dir + truth("Scene", "OrbitFile");
  const std::string xca = synth_->dir + truth("Scene", "XcaFile");
  const std::string ins = synth_->dir + truth("Scene", "InsFile");
  const std::string aux = synth_->dir;
  // A folder whose only calibration file is valid years before the product.
  const std::string staleAux = folder("stale_aux");
  fs::copy_file(ins, staleAux + fs::path(ins).filename().string());
  fs::copy_file(xca, staleAux + "ASA_XCA_AXVIEC20000101_000000_20000101_000000_20010101_000000");
  const std::string sensingStart = truth("Scene", "SensingStartText");
  const std::string xcaName = fs::path(xca).filename().string();
  const std::string insName = fs::path(ins).filename().string();
  const std::vector<std::string> slc = {"R",          "R.log",  "R1_slc",    "R1_slc.sml",
                                        "R3_slc.vrt", "R5_slc", "R5_slc.sml"};

  // clang-format off
  const std::vector<CliCase> cases = {
      {"import_defaults", true, {"import", product}, 0, {"Done", "100 %"},
       {"Written in " + scratch_ + "import_defaults:", stem + "5_slc.sml", "no corners"},
       {stem, stem + ".log", stem + "1_slc", stem + "1_slc.sml", stem + "5_slc"}},
      {"import_every_option", false,
       {"import", product, "-o", "R", "--orbit", orbit, "--xca", xca, "--ins", ins, "--quiet"},
       0, {}, {}, slc},
      {"import_aux_dir", false, {"import", product, "--output=R", "--aux-dir", aux}, 0,
       {xcaName, insName}, {"R1_slc"}, slc},
      {"multilook_defaults", true, {"multilook", product, "--orbit", orbit}, 0, {"100 %"},
       {stem + "_gr: ", "corners (lat, lon): NW"},
       {stem + "_gr", stem + "_gr.sml", stem + "_gr.hdr", stem + "5_slc", stem + ".log"}},
      {"multilook_every_option", false,
       {"multilook", product, "--orbit", orbit, "-o", "R", "--slant", "--tiff", "--saturation",
        "5", "--aux-dir", aux, "-q"},
       0, {}, {}, {"R_pwr", "R_pwr.sml", "R_pwr.tif", "R.log"}},
      // Refused before the run: a clear message, a non-zero status, nothing
      // written.
      {"missing_product", false, {"import", scratch_ + "none.N1", "-o", "R"}, 1,
       {scratch_ + "none.N1: No such file or directory"}, {}, {}},
      {"product_is_an_orbit", false, {"import", orbit, "-o", "R"}, 1,
       {"is not an ASAR wide-swath SLC product"}, {}, {}},
      {"orbit_is_no_orbit", false, {"multilook", product, "--orbit", xca}, 1,
       {xca + " is not a DORIS orbit file"}, {}, {}},
      {"missing_orbit", false, {"import", product, "--orbit", scratch_ + "none"}, 1,
       {scratch_ + "none: No such file"}, {}, {}},
      {"no_valid_aux", false, {"import", product, "--aux-dir", staleAux}, 1,
       {"no ASA_XCA file in " + staleAux + " is valid at the product's sensing start " +
        sensingStart}, {}, {}},
      {"output_over_input", false, {"import", product, "-o", product}, 1,
       {"would overwrite the input " + product}, {}, {}},
      {"output_root_is_a_folder", false, {"import", product, "-o", "."}, 2,
       {"names a folder"}, {}, {}},
      {"output_folder_missing", false, {"import", product, "-o", "no/such/R"}, 1,
       {"does not exist"}, {}, {}},
      {"bad_option", false, {"import", product, "--ground"}, 2,
       {"unknown option '--ground'", "import_wss import --help"}, {}, {}},
      // A failure inside the run: the shipped list has no auxiliary files for
      // the product; the code in words, its log kept.
      {"no_listed_aux", false, {"import", product, "-o", "R"}, 10,
       {"error 10: ", "--aux-dir", "R.log"}, {}, {"R.log"}},
      {"help_import", false, {"import", "--help"}, 0, {},
       {"usage: import_wss import PRODUCT", "--aux-dir DIR", "OUTROOT.log"}, {}},
      {"help_multilook", false, {"multilook", "-h"}, 0, {},
       {"usage: import_wss multilook PRODUCT --orbit FILE", "--saturation PCT", "--slant"}, {}},
      {"help", false, {"--help"}, 0, {}, {"import_wss import", "import_wss multilook"}, {}},
      {"version", false, {"--version"}, 0, {}, {"import_wss " VLR_VERSION "\n"}, {}},
  };
  // clang-format on
  for (const CliCase& c : cases) {
    SCOPED_TRACE(c.name);
    const std::string dir = folder(c.name);
    const std::string tool = c.installedCopy ? prefix_ + "bin/import_wss" : vlr_test::ToolPath();
    const RunResult r = run(tool, dir, c.args);
    if (c.status >= 0) {
      EXPECT_EQ(r.status, c.status) << r.err;
    } else {
      EXPECT_GT(r.status, 0) << r.err;
    }
    for (const std::string& s : c.errHas) EXPECT_NE(r.err.find(s), std::string::npos) << r.err;
    for (const std::string& s : c.outHas) EXPECT_NE(r.out.find(s), std::string::npos) << r.out;
    if (c.status == 0 && c.errHas.empty() && c.args.back() == "--quiet") {
      EXPECT_EQ(r.err, "");
    }
    for (const std::string& w : c.written) EXPECT_TRUE(Exists(dir + w)) << w;
    // The run's private folder never stays; a refused run writes nothing.
    for (const std::string& name : vlr_test::FolderNames(dir)) {
      EXPECT_EQ(name.find(".import_wss-run-"), std::string::npos) << name;
      if (c.written.empty()) {
        ADD_FAILURE() << "left behind: " << name;
      }
    }
  }
  // The list file of the import names the five rasters.
  const std::string dir = folder("import_every_option");
  std::string list;
  for (int k = 1; k <= 5; ++k) list += dir + "R" + std::to_string(k) + "_slc\n";
  EXPECT_EQ(ReadFile(dir + "R"), list);
}

// The summary's sizes and corners against the generator's truth.
TEST_F(CommandLineRuns, SummaryStatesSizesAndCornersOfTheSubSwaths) {
  const std::string dir = folder("summary");
  const RunResult r = run(
      prefix_ + "bin/import_wss", dir,
      {"import", synth_->product, "-o", "S", "--orbit", synth_->dir + truth("Scene", "OrbitFile")});
  ASSERT_EQ(r.status, 0) << r.err;
  for (int k = 1; k <= 5; ++k) {
    const std::string s = "SubSwath" + std::to_string(k);
    const std::string head = "S" + std::to_string(k) + "_slc: ";
    const size_t at = r.out.find(head);
    ASSERT_NE(at, std::string::npos) << r.out;
    long lines = 0, samples = 0;
    double lat[4], lon[4];
    ASSERT_EQ(std::sscanf(r.out.c_str() + at + head.size(),
                          "%ld lines x %ld samples\n  corners (lat, lon): NW (%lf, %lf) NE (%lf, "
                          "%lf) SW (%lf, %lf) SE (%lf, %lf)",
                          &lines, &samples, &lat[0], &lon[0], &lat[1], &lon[1], &lat[2], &lon[2],
                          &lat[3], &lon[3]),
              10)
        << r.out;
    EXPECT_EQ(lines, std::stol(truth(s, "Records")));
    EXPECT_EQ(samples, std::stol(truth(s, "Samples")));
    // A descending pass starts in the north and looks west: far range is
    // north-west at the first line.
    const char* corners[] = {"FirstFar", "FirstNear", "LastFar", "LastNear"};
    for (int i = 0; i < 4; ++i) {
      EXPECT_NEAR(lat[i], std::stod(truth(s, std::string(corners[i]) + "Lat")), 1e-3) << corners[i];
      EXPECT_NEAR(lon[i], std::stod(truth(s, std::string(corners[i]) + "Lon")), 1e-3) << corners[i];
    }
  }
}

// The progress display through a pseudo-terminal: a bar redrawn in place
// that ends at 100 %; without a terminal, plain lines.
TEST_F(CommandLineRuns, ProgressIsABarOnATerminalAndPlainLinesOtherwise) {
  const std::string dir = folder("progress");
  const std::string script =
      "import os, pty, sys\n"
      "os.chdir(sys.argv[1])\n"
      "out = bytearray()\n"
      "def read(fd):\n"
      "    data = os.read(fd, 65536)\n"
      "    out.extend(data)\n"
      "    return data\n"
      "status = pty.spawn(sys.argv[2:], read)\n"
      "sys.stdout.write(out.decode('utf-8', 'replace'))\n"
      "sys.exit(os.waitstatus_to_exitcode(status))\n";
  std::vector<std::string> argv = {
      "/usr/bin/python3", "-c", script, dir,         vlr_test::ToolPath(), "import",
      synth_->product,    "-o", "T",    "--aux-dir", synth_->dir};
  const RunResult tty = vlr_test::RunProgram(argv, kNoHost, true);
  ASSERT_EQ(tty.status, 0) << tty.out << tty.err;
  EXPECT_NE(tty.out.find("\r\033[KExtracting data ["), std::string::npos) << tty.out;
  const size_t last = tty.out.rfind("\r\033[K");
  ASSERT_NE(last, std::string::npos);
  EXPECT_EQ(tty.out.compare(last, 30, "\r\033[KDone [########################", 0, 30), 0)
      << tty.out.substr(last);
  EXPECT_NE(tty.out.find("] 100 %", last), std::string::npos);

  const RunResult plain = run(vlr_test::ToolPath(), dir,
                              {"import", synth_->product, "-o", "P", "--aux-dir", synth_->dir});
  ASSERT_EQ(plain.status, 0) << plain.err;
  EXPECT_EQ(plain.err.find('\r'), std::string::npos);
  EXPECT_EQ(plain.err.find('\033'), std::string::npos);
  EXPECT_NE(plain.err.find("\nExtracting data 0 %\n"), std::string::npos) << plain.err;
  EXPECT_NE(plain.err.find("\nDone 100 %\n"), std::string::npos) << plain.err;
}

// Ctrl-C withdraws the run the way a host does: the run stops at its next
// progress step with its own error records, and the command line says so.
TEST_F(CommandLineRuns, CtrlCStopsTheRunThroughTheWithdrawal) {
  // Enough lines that the run is still extracting when the signal comes.
  const synth_test::SynthRun big = synth_test::run_synth("--size small");
  ASSERT_EQ(big.exit_code, 0);
  const std::string dir = folder("interrupted");
  const std::string script =
      "import signal, subprocess, sys\n"
      "p = subprocess.Popen(sys.argv[2:], cwd=sys.argv[1], stderr=subprocess.PIPE, text=True)\n"
      "err = ''\n"
      "for line in p.stderr:\n"
      "    err += line\n"
      "    if line.startswith('Extracting data') and p.poll() is None:\n"
      "        p.send_signal(signal.SIGINT)\n"
      "        break\n"
      "err += p.stderr.read()\n"
      "sys.stderr.write(err)\n"
      "sys.exit(p.wait())\n";
  const RunResult r =
      vlr_test::RunProgram({"/usr/bin/python3", "-c", script, dir, vlr_test::ToolPath(), "import",
                            big.product, "-o", "R", "--aux-dir", big.dir},
                           kNoHost, true);
  synth_test::remove_run(big);
  EXPECT_EQ(r.status, 130) << r.err;
  EXPECT_NE(r.err.find("stopped by Ctrl-C (error 326400"), std::string::npos) << r.err;
  EXPECT_EQ(r.err.find("Done 100 %"), std::string::npos) << r.err;
  // The run's own records of the withdrawal, kept beside the output; no list
  // file, since the import never completed.
  EXPECT_NE(ReadFile(dir + "R.log").find("[ERROR ID : 326400]"), std::string::npos);
  EXPECT_FALSE(Exists(dir + "R"));
  for (const std::string& name : vlr_test::FolderNames(dir))
    EXPECT_EQ(name.find(".import_wss-run-"), std::string::npos) << name;
}

}  // namespace
