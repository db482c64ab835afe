#include "cli/aux_choice.h"

#include <cctype>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>

#include "time/date_text.h"

namespace vlr::cli {

namespace {

// "ASA_XCA" + "_AX" is the 10-character product ID; stage (1) and
// originator (3) follow, then the three times.
constexpr size_t kIdLength = 10;
constexpr size_t kStageOriginatorLength = 4;
constexpr size_t kTimeLength = 15;  // yyyymmdd_hhmmss
constexpr size_t kTimesLength = 3 * kTimeLength + 2;
// Where the MPH keeps SENSING_START, and its length.
constexpr long kSensingStartOffset = 351;
constexpr size_t kDateTextLength = 27;

const char* const kMonths[] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                               "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};

// yyyymmdd_hhmmss as seconds since 1985.
bool parseTime(const std::string& s, double& t) {
  if (s.size() != kTimeLength || s[8] != '_') return false;
  for (size_t i = 0; i < kTimeLength; ++i) {
    if (i != 8 && !std::isdigit(static_cast<unsigned char>(s[i]))) return false;
  }
  const int month = std::stoi(s.substr(4, 2));
  if (month < 1 || month > 12) return false;
  const int day = std::stoi(s.substr(6, 2));
  // The date parser wraps impossible days into the next month; refuse them.
  static const int kDays[] = {31, 29, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  if (day < 1 || day > kDays[month - 1]) return false;
  const std::string text = s.substr(6, 2) + "-" + kMonths[month - 1] + "-" + s.substr(0, 4) + " " +
                           s.substr(9, 2) + ":" + s.substr(11, 2) + ":" + s.substr(13, 2);
  return parse_sec85(text.c_str(), &t);
}

}  // namespace

bool ParseAuxFileName(const std::string& name, const std::string& type, AuxFileName& out) {
  const std::string id = type + "_AX";
  if (id.size() != kIdLength || name.compare(0, kIdLength, id) != 0) return false;
  const size_t timesAt = kIdLength + kStageOriginatorLength;
  if (name.size() < timesAt + kTimesLength) return false;
  const std::string rest = name.substr(timesAt + kTimesLength);
  if (!rest.empty() && rest[0] != '.') return false;
  AuxFileName a;
  a.name = name;
  const std::string times = name.substr(timesAt, kTimesLength);
  if (times[kTimeLength] != '_' || times[2 * kTimeLength + 1] != '_') return false;
  if (!parseTime(times.substr(0, kTimeLength), a.created) ||
      !parseTime(times.substr(kTimeLength + 1, kTimeLength), a.validFrom) ||
      !parseTime(times.substr(2 * kTimeLength + 2, kTimeLength), a.validTo))
    return false;
  out = a;
  return true;
}

bool ChooseAuxFile(const std::vector<std::string>& names, const std::string& type, double t,
                   AuxFileName& chosen) {
  bool found = false;
  for (const std::string& n : names) {
    AuxFileName a;
    if (!ParseAuxFileName(n, type, a) || !(a.validFrom <= t && t < a.validTo)) continue;
    if (!found || a.created > chosen.created ||
        (a.created == chosen.created && a.name > chosen.name)) {
      chosen = a;
      found = true;
    }
  }
  return found;
}

bool ProductSensingStart(const std::string& product, double& t, std::string& error) {
  FILE* f = std::fopen(product.c_str(), "rb");
  if (f == nullptr) {
    error = "cannot open " + product + ": " + std::strerror(errno);
    return false;
  }
  char text[kDateTextLength + 1] = {};
  const bool read = std::fseek(f, kSensingStartOffset, SEEK_SET) == 0 &&
                    std::fread(text, 1, kDateTextLength, f) == kDateTextLength;
  std::fclose(f);
  if (!read || !parse_sec85(text, &t)) {
    error = product + " has no readable sensing start in its main product header";
    return false;
  }
  return true;
}

bool ListFolder(const std::string& dir, std::vector<std::string>& names, std::string& error) {
  namespace fs = std::filesystem;
  std::error_code ec;
  fs::directory_iterator it(dir, ec);
  if (ec) {
    error = "cannot read the folder " + dir + ": " + ec.message();
    return false;
  }
  for (const fs::directory_entry& e : it) {
    std::error_code fileEc;
    if (e.is_regular_file(fileEc)) names.push_back(e.path().filename().string());
  }
  return true;
}

}  // namespace vlr::cli
