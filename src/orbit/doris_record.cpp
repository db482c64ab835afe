#include "orbit/doris_record.h"

#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <string>

#include "time/date_text.h"

namespace {

constexpr const char* kProductTypes[] = {"DOR_VOR_AX", "DOR_POR_AX", "AUX_FRO_AX", "AUX_FPO_AX"};

// The field's characters without the blanks around them; empty when the
// field holds a blank inside its value.
std::string field_value(const char* record, EnvisatField field) {
  const std::string s = EnvisatText(record, kDorisRecordSize, field);
  const size_t first = s.find_first_not_of(' ');
  if (first == std::string::npos) return std::string();
  const size_t last = s.find_last_not_of(' ');
  const std::string value = s.substr(first, last - first + 1);
  return value.find_first_of(" \t\n\r") == std::string::npos ? value : std::string();
}

// The field as a number that fills it up to the blanks around it.
bool field_double(const char* record, EnvisatField field, double* value) {
  const std::string s = field_value(record, field);
  if (s.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const double v = std::strtod(s.c_str(), &end);
  const bool ok = end == s.c_str() + s.size() && errno == 0 && std::isfinite(v);
  errno = 0;
  if (ok) *value = v;
  return ok;
}

bool field_int(const char* record, EnvisatField field, int* value) {
  const std::string s = field_value(record, field);
  if (s.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const long v = std::strtol(s.c_str(), &end, 10);
  const bool ok =
      end == s.c_str() + s.size() && errno == 0 && v >= -2147483647L && v <= 2147483647L;
  errno = 0;
  if (ok) *value = static_cast<int>(v);
  return ok;
}

}  // namespace

bool is_doris_product_type(const char* type) {
  for (const char* t : kProductTypes)
    if (std::strncmp(type, t, kDorisProductType.width) == 0) return true;
  return false;
}

bool parse_doris_time(const char* text, size_t width, double* t) {
  char buffer[kDorisRecordTime.width + 1] = {0};
  std::memcpy(buffer, text, width < kDorisRecordTime.width ? width : kDorisRecordTime.width);
  DateFields fields;
  if (date2str(buffer, &fields) != 0 || fields.year < 1985) return false;
  *t = ascii2sec85(buffer);
  return true;
}

bool parse_doris_record(const char* record, DorisRecord* out) {
  DorisRecord r;
  if (!parse_doris_time(record + kDorisRecordTime.offset, kDorisRecordTime.width, &r.time))
    return false;
  if (!field_int(record, kDorisRecordOrbit, &r.orbit)) return false;
  for (int a = 0; a < 3; ++a) {
    if (!field_double(record, kDorisRecordPosition[a], &r.position[a]) ||
        !field_double(record, kDorisRecordVelocity[a], &r.velocity[a]))
      return false;
  }
  *out = r;
  return true;
}
