// Argument handling shared by the drivers.
#pragma once

#include <string>
#include <vector>

namespace vlr {

// Both drivers need at least this many arguments.
constexpr size_t kDriverMinArguments = 14;
// Placeholder for an input the host leaves to the tool.
constexpr const char* kNotOK = "NotOK";
constexpr const char* kOK = "OK";

// Reads the argument list; with too few arguments writes the START record
// with title and raises 456962 with the whole argument text.
std::vector<std::string> ReadDriverArguments(const char* argumentText, const char* title,
                                             const char* module);

// The argument at position, or "" when the list is shorter.
const std::string& DriverArgument(const std::vector<std::string>& arguments, size_t position);

// Copies a file name into a fixed name field of N characters; false (field
// untouched) when it does not fit.
template <size_t N>
bool CopyDriverName(const std::string& name, char (&field)[N]) {
  if (name.size() >= N) return false;
  name.copy(field, name.size());
  field[name.size()] = '\0';
  return true;
}

// Checks that the orbit file the host named can be read; a name that does
// not open, or names something that cannot be read (a folder), is reported
// with the name and gives 9 ("File not opened!") or 4 ("File reading
// failed!").  Without this a missing orbit would give an import without
// geolocation that still looks successful.
int CheckOrbitFile(const std::string& path);

// Writes the list file of an import over root: one line "<root>k_slc" per
// sub-swath, through a temporary file renamed over the target so that the
// host never reads a partial list.  0, 9 ("File not opened!") or 5.
int WriteImportListFile(const std::string& root);

}  // namespace vlr
