#include "metadata_sections/file_roi.h"

#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "roi";

}  // namespace

int FileROI_Obj::read_roi() {
  VLR_SCOPE("FileROI_Obj::read_roi", kModule);
  const std::string header = fileName + ".hdr";
  roi.read_roi(header.c_str(), "ROI");
  data.read_hdr(fileName.c_str());
  return 0;
}
