#include "metadata_sections/gs_data_file.h"

#include <cstring>
#include <string>

#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "gs_data_file";
// Characters of the header file's extension (".hdr").
constexpr size_t kExtensionLength = 4;

// `file` without its extension; false when nothing would remain.
bool stripExtension(const char* file, std::string* base) {
  if (file == nullptr) return false;
  const size_t n = std::strlen(file);
  if (n <= kExtensionLength) return false;
  base->assign(file, n - kExtensionLength);
  return true;
}

}  // namespace

int GSDataFile_Obj::readhdr(const char* file) {
  VLR_SCOPE("GSDataFile_Obj::readhdr", kModule);
  std::string base;
  if (!stripExtension(file, &base)) VLR_FAIL("Invalid header file name!", vlr::kLibInconsistent);
  return data.read_hdr(base.c_str());
}

int GSDataFile_Obj::writehdr(const char* file) {
  VLR_SCOPE("GSDataFile_Obj::writehdr", kModule);
  std::string base;
  if (!stripExtension(file, &base)) VLR_FAIL("Invalid header file name!", vlr::kLibInconsistent);
  const std::string own = data.name();
  data.set_name(base.c_str());
  const int rc = data.write_hdr();
  data.set_name(own.c_str());
  VLR_CALL(rc);
  return 0;
}

int GSDataFile_Obj::clone(GSDataFile_Obj* other) const {
  if (other != nullptr && other != this) data.clone(&other->data);
  return 0;
}
