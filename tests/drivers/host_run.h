// The host's side of a run of the tool: starting it with an argument list,
// collecting what it left, checking the records a host reads, and reading a
// ".sml" suite header with Python's own XML parser, never with the suite
// library under test.
#pragma once

#include <gtest/gtest.h>

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

}  // namespace vlr_test
