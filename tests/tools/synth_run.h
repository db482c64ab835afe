// Runs the generator into a fresh temporary folder and reads what it wrote.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "sample_files.h"

namespace synth_test {

// Section -> key -> value of a parameter file.
using Params = std::map<std::string, std::map<std::string, std::string>>;

struct SynthRun {
  std::string dir;      // ends with '/'
  std::string product;  // full path of the product
  Params truth;
  int exit_code = -1;
};

// Runs envisat_synth with `args` (besides --out) into a new folder under the
// system temporary directory.  The folder is removed by remove_run.
SynthRun run_synth(const std::string& args);
void remove_run(const SynthRun& run);

Params read_params(const std::string& path);
std::vector<uint8_t> read_file(const std::string& path);
std::string read_text(const std::string& path);
// Runs a shell command; returns its exit status.
int shell(const std::string& command);

// Big-endian readers.
uint32_t be32(const uint8_t* p);
int16_t be16(const uint8_t* p);
float bef32(const uint8_t* p);
// MJD2000 record (days, seconds, microseconds) as seconds since 1985.
double mjd_time(const uint8_t* p);
// Decimal value of a header field at an offset ("+000123<bytes>" -> 123).
long long header_number(const std::vector<uint8_t>& file, size_t offset);

// Data set descriptor k (0..17) of an ASAR image product (wide-swath and
// image-mode products both have 18 descriptors after the 1059-byte SPH).
struct Dsd {
  long long offset, size, num, dsr;
};
Dsd product_dsd(const std::vector<uint8_t>& file, int k);

// Number in the truth file; NaN when the key is missing.
double truth_number(const Params& truth, const std::string& section, const std::string& key);

}  // namespace synth_test
