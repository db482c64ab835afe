// The suite header in memory: sections created from key files, and field
// lookup by path.
#include "suite/description_header.h"

#include <cstdarg>
#include <cstdio>

#include "runtime/error_codes.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "vlr_description_section";

}  // namespace

CDescriptionHeader::CDescriptionHeader(const char* section, ...) {
  va_list names;
  va_start(names, section);
  for (const char* name = section; name != nullptr; name = va_arg(names, const char*)) {
    try {
      addSectionFromKeyFile(name);
    } catch (...) {
      va_end(names);
      throw;
    }
  }
  va_end(names);
}

CDescriptionHeader::CDescriptionHeader(const std::vector<std::string>& sections,
                                       const std::string& initialTag)
    : mInitialTag(initialTag) {
  for (const auto& name : sections) addSectionFromKeyFile(name);
}

CDescriptionSection* CDescriptionHeader::addSection(const std::string& name) {
  if (mSections.size() >= static_cast<size_t>(CVLR_DH_MAX_NBR_SECTIONS)) {
    NVLR_UTILITY_TracePrint("\nECEEDED : %d sections\n", CVLR_DH_MAX_NBR_SECTIONS);
    NVLR_UTILITY_RaiseError(vlr::kCodeKeyFileMissing, kModule, __LINE__, "All pools are busy");
  }
  mSections.emplace_back(name);
  return &mSections.back();
}

CDescriptionSection* CDescriptionHeader::addSectionFromKeyFile(const std::string& name) {
  CDescriptionSection* section = addSection(name);
  section->defineFromKeyFile();
  return section;
}

void CDescriptionHeader::clear() {
  for (auto& section : mSections) section.clear();
}

std::string CDescriptionHeader::dumpText() const {
  char head[80];
  std::snprintf(head, sizeof head, "\n\n << Total number of Sections : %d >>", sectionCount());
  std::string text = head;
  for (const auto& section : mSections) text += section.dumpText();
  return text;
}

const std::vector<std::string>& NVLR_UTILITY_ProductHeaderSections() {
  static const std::vector<std::string> kSections = {"GCPRasterInfo",
                                                     "Baseline",
                                                     "OrbitCorrection",
                                                     "StateVectorCalc",
                                                     "StateVectorData",
                                                     "InitialGeometry",
                                                     "Processing",
                                                     "RasterInfo",
                                                     "PolarimetricCalibrationParameters",
                                                     "interferometric_processing",
                                                     "sar_processing",
                                                     "orbit_information",
                                                     "Sensor",
                                                     "ChannelInfo",
                                                     "DEMCoordinates",
                                                     "RegistrationCoordinates",
                                                     "CartographicSystem",
                                                     "user_defined_section",
                                                     "EnvisatFixHeader",
                                                     "EnvisatDescriptionRecord"};
  return kSections;
}

CDescriptionSection* findSection(CDescriptionHeader& header, const char* name) {
  if (name == nullptr) return nullptr;
  for (int i = 0; i < header.sectionCount(); ++i)
    if (header.section(i).name() == name) return &header.section(i);
  return nullptr;
}

const CDescriptionSection* findSection(const CDescriptionHeader& header, const char* name) {
  return findSection(const_cast<CDescriptionHeader&>(header), name);
}

CDescriptionField* findField(CDescriptionHeader& header, const char* path) {
  if (path == nullptr) return nullptr;
  const std::string p = path;
  const size_t dot = p.find('.');
  if (dot != std::string::npos) {
    CDescriptionSection* section = findSection(header, p.substr(0, dot).c_str());
    return section == nullptr ? nullptr : section->findField(p.substr(dot + 1));
  }
  for (int i = 0; i < header.sectionCount(); ++i)
    if (CDescriptionField* field = header.section(i).findField(p)) return field;
  return nullptr;
}

CDescriptionField* getField(CDescriptionHeader& header, const char* path) {
  CDescriptionField* field = findField(header, path);
  if (field == nullptr) {
    if (NVLR_UTILITY_IsTraceOn()) NVLR_UTILITY_TracePrint("%s", header.dumpText().c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeFieldNotFound, kModule, __LINE__, path ? path : "");
  }
  return field;
}
