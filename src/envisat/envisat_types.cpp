#include "envisat/envisat_types.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>

#include "envisat/product_header.h"
#include "runtime/ckerr.h"
#include "runtime/file_utility.h"
#include "time/date_text.h"

namespace {

constexpr const char* kModule = "envisat_types";

struct TypeCode {
  const char* code;
  int number;
};

// Table order is the order of find_type.  The two level-0 codes with a
// double underscore compare nine characters, the others seven.
constexpr TypeCode kTypeCodes[] = {
    {"ASA_APS", kEnvisatAsaAps}, {"ASA_APP", kEnvisatAsaApp},   {"ASA_APM", kEnvisatAsaApm},
    {"ASA_APC", kEnvisatAsaApc}, {"ASA_APH", kEnvisatAsaAph},   {"ASA_APV", kEnvisatAsaApv},
    {"ASA_IMS", kEnvisatAsaIms}, {"ASA_IM__0", kEnvisatAsaIm0}, {"ASA_WSS", kEnvisatAsaWss},
    {"ASA_WSM", kEnvisatAsaWsm}, {"ASA_WS__0", kEnvisatAsaWs0}, {"DOR_VOR", kEnvisatDorVor},
    {"DOR_POR", kEnvisatDorPor}, {"ASA_XCA", kEnvisatAsaXca},   {"ASA_XCH", kEnvisatAsaXch},
    {"ASA_INS", kEnvisatAsaIns},
};

// Reads `count` bytes at `offset` of the file; false when the file does not
// open or is shorter.  A failed open leaves errno cleared.
bool read_at(const char* path, long offset, char* out, size_t count) {
  if (path == nullptr) return false;
  std::FILE* f = std::fopen(path, "rb");
  if (f == nullptr) {
    errno = 0;
    return false;
  }
  const bool ok = std::fseek(f, offset, SEEK_SET) == 0 && std::fread(out, 1, count, f) == count;
  std::fclose(f);
  return ok;
}

int has_code(const char* path, const char* code) {
  const size_t n = std::strlen(code);
  char name[kMphProduct.width];
  // Only the characters compared have to be there.
  std::FILE* f = path ? std::fopen(path, "rb") : nullptr;
  if (f == nullptr) {
    errno = 0;
    return 0;
  }
  size_t got = 0;
  if (std::fseek(f, static_cast<long>(kMphProduct.offset), SEEK_SET) == 0)
    got = std::fread(name, 1, sizeof name, f);
  std::fclose(f);
  return got >= n && std::memcmp(name, code, n) == 0 ? 1 : 0;
}

// The 27-character UTC text at `offset` as seconds since 1985; false when it
// cannot be read, and false with a report naming the value when it is not a
// date (a broken date must not pass for 1-JAN-1985).
bool utc_at(const char* path, long offset, const char* name, double* t85) {
  char text[kUtcTextWidth + 1] = {0};
  if (!read_at(path, offset, text, kUtcTextWidth)) return false;
  if (!parse_sec85(text, t85)) {
    const std::string message = NVLR_UTILITY_Format("%s of %s is not a date: \"%s\"", name, path,
                                                    EnvisatPrintable(text).c_str());
    are_add_report(message.c_str(), ARE_ERROR, __LINE__, "check_dorvor", kModule);
    return false;
  }
  return true;
}

}  // namespace

int EnvisatTypes::is_aps(const char* path) {
  return has_code(path, "ASA_APS");
}
int EnvisatTypes::is_app(const char* path) {
  return has_code(path, "ASA_APP");
}
int EnvisatTypes::is_apm(const char* path) {
  return has_code(path, "ASA_APM");
}
int EnvisatTypes::is_apc(const char* path) {
  return has_code(path, "ASA_APC");
}
int EnvisatTypes::is_aph(const char* path) {
  return has_code(path, "ASA_APH");
}
int EnvisatTypes::is_apv(const char* path) {
  return has_code(path, "ASA_APV");
}
int EnvisatTypes::is_ims(const char* path) {
  return has_code(path, "ASA_IMS");
}
int EnvisatTypes::is_im0(const char* path) {
  return has_code(path, "ASA_IM__0");
}
int EnvisatTypes::is_wss(const char* path) {
  return has_code(path, "ASA_WSS");
}
int EnvisatTypes::is_wsm(const char* path) {
  return has_code(path, "ASA_WSM");
}
int EnvisatTypes::is_ws0(const char* path) {
  return has_code(path, "ASA_WS__0");
}
int EnvisatTypes::is_dorvor(const char* path) {
  return has_code(path, "DOR_VOR");
}
int EnvisatTypes::is_dorpor(const char* path) {
  return has_code(path, "DOR_POR");
}
int EnvisatTypes::is_xca(const char* path) {
  return has_code(path, "ASA_XCA");
}
int EnvisatTypes::is_xch(const char* path) {
  return has_code(path, "ASA_XCH");
}
int EnvisatTypes::is_ins(const char* path) {
  return has_code(path, "ASA_INS");
}

int EnvisatTypes::find_type(const char* path) {
  for (const TypeCode& t : kTypeCodes)
    if (has_code(path, t.code)) return t.number;
  return kEnvisatUnknown;
}

int EnvisatTypes::check_dorvor(const char* product_path, const char* orbit_path) {
  const int type = find_type(product_path);
  if (type < kEnvisatAsaAps || type > kEnvisatAsaWs0) return 0;
  double product_start = 0.0, orbit_start = 0.0, orbit_stop = 0.0;
  if (!utc_at(product_path, kMphSensingStart.offset, "SENSING_START", &product_start)) return 0;
  if (!utc_at(orbit_path, kMphSensingStart.offset, "SENSING_START", &orbit_start)) return 0;
  if (!utc_at(orbit_path, kMphSensingStop.offset, "SENSING_STOP", &orbit_stop)) return 0;
  return orbit_start < product_start && product_start < orbit_stop ? 1 : 0;
}
