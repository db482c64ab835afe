// Reading a ".sml" suite header the way a host would: with Python's own XML
// parser, never with the suite library under test.
#pragma once

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <map>
#include <sstream>
#include <string>

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

}  // namespace vlr_test
