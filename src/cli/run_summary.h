// The short account of what a run wrote: files with their sizes, and each
// image's size and corners from its header.
#pragma once

#include <ctime>
#include <string>
#include <vector>

namespace vlr::cli {

// What an image's ".sml" header says about it.
struct ImageFacts {
  long lines = -1;
  long samples = -1;
  // Corner latitude and longitude by compass point, NW, NE, SW, SE; empty
  // when the header has none (an import without orbit).
  std::vector<std::pair<double, double>> corners;
};

// Reads the facts from a ".sml" header; false when it is not readable XML.
bool ReadImageFacts(const std::string& sml, ImageFacts& facts);

// Files in the folder of root whose names begin with root's name and that
// were changed at or after since, sorted by name.
std::vector<std::string> WrittenFiles(const std::string& root, std::time_t since);

// The summary text for the written files (full paths).
std::string Summary(const std::vector<std::string>& files);

// A size as "123 B", "4.5 KB", "6.7 MB", "8.9 GB".
std::string HumanSize(unsigned long long bytes);

}  // namespace vlr::cli
