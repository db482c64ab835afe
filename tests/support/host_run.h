// The host's side of a run of the tool: starting it with an argument list,
// collecting what it left, checking the records a host reads, and reading a
// ".sml" suite header with Python's own XML parser, never with the suite
// library under test.  HostRunTest is the fixture of the tests that run the
// tool on generated products.
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "installation.h"
#include "synth_run.h"

namespace vlr_test {

constexpr const char* kPython = "/usr/bin/python3";

// The first element of each wanted name, "name=value" (vector elements
// joined by '|'), and "OtherInfo.KEY=value" per OtherInfo row, as the suite's
// own field paths find the first field of a name.  A file that is not
// well-formed XML ends the script with an error.
constexpr const char* kSmlReader = R"(
import sys, xml.etree.ElementTree as E
def name(e): return e.tag.split('}')[-1]
want = set(sys.argv[2].split(','))
seen = set()
for e in E.parse(sys.argv[1]).getroot().iter():
    n = name(e)
    if n == 'OtherInfo':
        for row in e.iter():
            if name(row) == 'MatrixRow':
                cells = [c.text or '' for c in row if name(c) == 'StringValue']
                print('OtherInfo.%s=%s' % (cells[0], cells[1]))
    elif n in want and n not in seen:
        seen.add(n)
        values = [v.text or '' for v in e.iter() if name(v).endswith('Value')]
        print('%s=%s' % (n, '|'.join(values) if values else (e.text or '').strip()))
)";

using SmlFields = std::map<std::string, std::string>;

// The wanted fields (comma-separated names) of the header sml.
inline SmlFields ReadSml(const std::string& sml, const char* wanted) {
  const RunResult r = RunProgram({kPython, "-c", kSmlReader, sml, wanted}, {}, true);
  EXPECT_EQ(r.status, 0) << sml << ": " << r.err;
  SmlFields fields;
  std::istringstream lines(r.out);
  for (std::string line; std::getline(lines, line);) {
    const size_t eq = line.find('=');
    if (eq != std::string::npos) fields[line.substr(0, eq)] = line.substr(eq + 1);
  }
  return fields;
}

inline std::string Field(const SmlFields& f, const std::string& name) {
  const auto it = f.find(name);
  return it == f.end() ? std::string() : it->second;
}

// Element `element` of a numeric field ('|'-joined vector); NaN when absent.
inline double Number(const SmlFields& f, const std::string& name, size_t element = 0) {
  std::string text = Field(f, name);
  for (size_t i = 0; i < element; ++i)
    text = text.substr(std::min(text.size(), text.find('|') + 1));
  return text.empty() ? std::nan("") : std::atof(text.c_str());
}

// What one run of the tool left for the host.
struct Outcome {
  int status = -1;
  std::string log;    // what the run added to Process.log
  std::string error;  // the error file; empty when the run wrote none
  bool workingFileLeft = false;
};

// Runs command word + argument-list file as the host does.  `withdrawn`: the
// host has already deleted "_batch_ok"; `env`: further variables for the tool.
inline Outcome RunAsHost(const TempInstallation& inst, const std::string& word,
                         const std::vector<std::string>& args, bool withdrawn = false,
                         const std::map<std::string, std::string>& env = {}) {
  const std::string logPath = inst.working() + "Process.log";
  const std::string errorPath = inst.workingFile() + "_error";
  std::remove(errorPath.c_str());
  const size_t logBefore = ReadFile(logPath).size();
  inst.hostFiles();
  if (withdrawn) std::remove((inst.workingFile() + "_batch_ok").c_str());
  Outcome o;
  o.status = inst.run(word + inst.writeArguments(args), env).status;
  o.log = ReadFile(logPath).substr(logBefore);
  o.error = ReadFile(errorPath);
  o.workingFileLeft = Exists(inst.workingFile());
  return o;
}

// A successful run: exit 0, the START record of `title` with the `inputs`
// text, SUCCESSFUL and the END record in that order, no error anywhere, the
// working file deleted.
inline void ExpectSuccessRecords(const Outcome& o, const std::string& title,
                                 const std::string& inputs) {
  ASSERT_EQ(o.status, 0) << o.error << o.log;
  const size_t start = o.log.find("\nSTART : " + title + "  [");
  const size_t successful = o.log.find("\n\nSUCCESSFUL\n\n");
  const size_t end = o.log.find("\nEND : ");
  EXPECT_NE(start, std::string::npos) << o.log;
  EXPECT_NE(o.log.find(inputs), std::string::npos) << o.log;
  EXPECT_NE(successful, std::string::npos) << o.log;
  EXPECT_NE(end, std::string::npos) << o.log;
  EXPECT_LT(start, successful);
  EXPECT_LT(successful, end);
  EXPECT_EQ(o.log.find("ERROR"), std::string::npos) << o.log;
  EXPECT_EQ(o.error, "");
  EXPECT_FALSE(o.workingFileLeft);
}

// A failed run: its code as exit status (255 for codes beyond a byte), the
// error file naming the code and `extra`, the START record of `title`, the
// ERROR record with `logText`, no SUCCESSFUL, the working file left for the
// host.
inline void ExpectFailureRecords(const Outcome& o, int code, const std::string& extra,
                                 const std::string& title, const std::string& logText) {
  EXPECT_EQ(o.status, code <= 255 ? code : 255) << o.error;
  EXPECT_EQ(o.error.rfind("-1\n", 0), 0u) << o.error;
  EXPECT_NE(o.error.find("[EC : " + std::to_string(code) + "]\n" + extra), std::string::npos)
      << o.error;
  EXPECT_NE(o.log.find("\nSTART : " + title + "  ["), std::string::npos) << o.log;
  EXPECT_NE(o.log.find("[ERROR ID : " + std::to_string(code) + "]"), std::string::npos) << o.log;
  EXPECT_NE(o.log.find(logText), std::string::npos) << o.log;
  EXPECT_EQ(o.log.find("SUCCESSFUL"), std::string::npos) << o.log;
  EXPECT_TRUE(o.workingFileLeft);
}

// The names in a folder (not recursive).
inline std::set<std::string> FolderNames(const std::string& dir) {
  std::set<std::string> names;
  std::error_code ec;
  for (const auto& e : std::filesystem::directory_iterator(dir, ec))
    names.insert(e.path().filename().string());
  return names;
}

// Every file of a folder, by name, with its bytes.
inline std::map<std::string, std::string> FolderFiles(const std::string& dir) {
  std::map<std::string, std::string> files;
  for (const std::string& name : FolderNames(dir)) files[name] = ReadFile(dir + "/" + name);
  return files;
}

inline bool HaveGdal() {
  return synth_test::shell("command -v gdal_translate > /dev/null 2>&1") == 0;
}

// A value of the generator's truth file, "<missing KEY>" when absent.
inline std::string Truth(const synth_test::SynthRun& run, const std::string& section,
                         const std::string& key) {
  const auto s = run.truth.find(section);
  if (s == run.truth.end() || s->second.count(key) == 0) return "<missing " + key + ">";
  return s->second.at(key);
}
inline double TruthNumber(const synth_test::SynthRun& run, const std::string& section,
                          const std::string& key) {
  return synth_test::truth_number(run.truth, section, key);
}
inline std::string SubSwath(int k) {
  return "SubSwath" + std::to_string(k);
}

// Tests that run the tool on generated products: one installation, one
// scratch folder and the products of each generator argument text, made on
// first use and removed when the test program ends.
class HostRunTest : public ::testing::Test {
 protected:
  static TempInstallation& inst() { return state().inst; }
  // A new empty folder under the scratch folder; ends with '/'.
  static std::string folder(const std::string& name) {
    const std::string path = state().scratch + name + "/";
    std::filesystem::create_directories(path);
    return path;
  }
  static std::string desFolder() { return inst().root() + "/des/"; }
  // The generator's products for `args`; a test fails when they cannot be made.
  static const synth_test::SynthRun& scene(const std::string& args) {
    auto& scenes = state().scenes;
    auto it = scenes.find(args);
    if (it == scenes.end()) it = scenes.emplace(args, synth_test::run_synth(args)).first;
    EXPECT_EQ(it->second.exit_code, 0) << args;
    return it->second;
  }
  static std::string orbitOf(const synth_test::SynthRun& run) {
    return run.dir + Truth(run, "Scene", "OrbitFile");
  }
  // Puts the generator's auxiliary list and files where the tool looks.
  static void useAuxiliaryListOf(const synth_test::SynthRun& run) {
    ASSERT_EQ(synth_test::shell("cp " + run.dir + "ASA_AUX_list.dat " + run.dir + "ASA_XCA_* " +
                                run.dir + "ASA_INS_* " + desFolder()),
              0);
  }
  // The installation's multilook parameter file with the given keys set to
  // new values; an empty value removes the key.
  static void parameters(const std::map<std::string, std::string>& edits) {
    std::istringstream in(ReadFile(SourceDir() + "/data/install/parameters_multilook.hdr"));
    std::string out;
    for (std::string line; std::getline(in, line);) {
      const std::string key = line.substr(0, line.find(' '));
      const auto edit = edits.find(key);
      if (edit == edits.end())
        out += line + "\n";
      else if (!edit->second.empty())
        out += key + " = " + edit->second + "\n";
    }
    WriteFile(desFolder() + "parameters_multilook.hdr", out);
  }

 private:
  struct State {
    TempInstallation inst;
    std::string scratch;
    std::map<std::string, synth_test::SynthRun> scenes;
    State() {
      char pattern[] = "/tmp/vlr_host_run_XXXXXX";
      if (mkdtemp(pattern) != nullptr) scratch = std::string(pattern) + "/";
    }
    ~State() {
      for (const auto& s : scenes) synth_test::remove_run(s.second);
      std::error_code ec;
      if (!scratch.empty()) std::filesystem::remove_all(scratch, ec);
    }
  };
  static State& state() {
    static State s;
    return s;
  }
};

}  // namespace vlr_test
