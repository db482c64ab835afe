#include "suite/number_text.h"

#include <cerrno>
#include <climits>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>

std::string NVLR_UTILITY_DoubleText(double value) {
  if (std::isnan(value)) return "NaN";
  if (std::isinf(value)) return value > 0 ? "inf" : "-inf";
  char text[40];
  for (int digits = 15; digits <= 17; ++digits) {
    std::snprintf(text, sizeof text, "%.*g", digits, value);
    if (std::strtod(text, nullptr) == value) break;
  }
  return text;
}

namespace {

// The text without blanks, tabs and line ends around it.
std::string trimmed(const std::string& text) {
  const char* blanks = " \t\r\n";
  const size_t first = text.find_first_not_of(blanks);
  if (first == std::string::npos) return std::string();
  return text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

}  // namespace

bool NVLR_UTILITY_ParseDouble(const std::string& text, double& value) {
  const std::string t = trimmed(text);
  if (t.empty()) return false;
  if (t == "NaN" || t == "nan" || t == "-NaN" || t == "-nan") {
    value = std::nan("");
    return true;
  }
  // Hexadecimal floats are not a header number.
  if (t.find_first_of("xX") != std::string::npos) return false;
  char* end = nullptr;
  errno = 0;
  const double v = std::strtod(t.c_str(), &end);
  if (end != t.c_str() + t.size()) return false;
  // Underflow to a denormal or zero is a valid reading; overflow is not.
  if (errno == ERANGE && std::isinf(v) && t.find("inf") == std::string::npos) return false;
  errno = 0;
  value = v;
  return true;
}

bool NVLR_UTILITY_ParseInteger(const std::string& text, int& value) {
  const std::string t = trimmed(text);
  if (t.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const long long v = std::strtoll(t.c_str(), &end, 10);
  const bool ok = end == t.c_str() + t.size() && errno == 0 && v >= INT_MIN && v <= INT_MAX;
  errno = 0;
  if (!ok) return false;
  value = static_cast<int>(v);
  return true;
}
