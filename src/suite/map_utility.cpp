// The map reference of a suite header and its check against the map list and
// the per-state map files of the installation.
#include "suite/map_utility.h"

#include <strings.h>

#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/list_file.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "suite/description_header.h"
#include "suite/number_text.h"

namespace {

constexpr const char* kModule = "vlr_map_utility";
constexpr const char* kInvalidStateText =
    "State specified in the Image header or GCP File is invalid.";
constexpr const char* kMissingMapFileText = "Error: missing map file";
constexpr const char* kWrongFieldText = "Wrong map field. Please check.";
constexpr int kFirstUtmZone = 1;
constexpr int kLastUtmZone = 60;

// The text of a set scalar field of any data type; empty when absent.
std::string textAt(CDescriptionHeader& header, const char* path) {
  const CDescriptionField* field = findField(header, path);
  if (field == nullptr || !field->isSet()) return std::string();
  switch (field->type()) {
    case CVLR_FieldType::String:
      return field->getStringAt(0, 0);
    case CVLR_FieldType::Integer:
      return std::to_string(field->getIntegerAt(0, 0));
    case CVLR_FieldType::Double:
      return NVLR_UTILITY_DoubleText(field->getDoubleAt(0, 0));
    default:
      return std::string();
  }
}

// A set, finite number of the header.
bool numberAt(CDescriptionHeader& header, const char* path, double& value) {
  const CDescriptionField* field = findField(header, path);
  if (field == nullptr || !field->isSet()) return false;
  if (field->type() == CVLR_FieldType::Double) {
    value = field->getDoubleAt(0, 0);
  } else if (field->type() == CVLR_FieldType::Integer) {
    value = field->getIntegerAt(0, 0);
  } else {
    return false;
  }
  return std::isfinite(value);
}

bool countAt(CDescriptionHeader& header, const char* path, int& value) {
  const CDescriptionField* field = findField(header, path);
  if (field == nullptr || !field->isSet() || field->type() != CVLR_FieldType::Integer) {
    return false;
  }
  value = field->getIntegerAt(0, 0);
  return true;
}

// The states of the map list; blank lines name no state.
std::vector<std::string> readMapList(const std::string& path) {
  std::vector<std::string> states = NVLR_UTILITY_ReadListFile(path.c_str());
  states.erase(std::remove(states.begin(), states.end(), std::string()), states.end());
  return states;
}

// One value of the reference and where its map file lists the allowed ones.
struct MapValue {
  const char* section;
  const std::string* value;
  const char* traceText;
};

}  // namespace

CVlrMapReference NVLR_UTILITY_ReadMapReference(CDescriptionHeader& header) {
  CVlrMapReference r;
  r.geocoded = strcasecmp(textAt(header, "RasterInfo.GeocodedImage").c_str(), "OK") == 0;
  r.state = textAt(header, "CartographicSystem.State");
  r.hemisphere = textAt(header, "CartographicSystem.Hemisphere");
  r.projection = textAt(header, "CartographicSystem.Projection");
  r.zone = textAt(header, "CartographicSystem.Zone");
  r.ellipsoid = textAt(header, "CartographicSystem.Ellipsoid");
  r.datumShift = textAt(header, "CartographicSystem.DatumShift");
  countAt(header, "RasterInfo.NrOfLinesPerImage", r.lines);
  countAt(header, "RasterInfo.NrOfPixelsPerLine", r.pixels);
  r.hasGrid = numberAt(header, "RegistrationCoordinates.LonEasting", r.lonEasting) &&
              numberAt(header, "RegistrationCoordinates.LatNorthing", r.latNorthing) &&
              numberAt(header, "RegistrationCoordinates.PixelSpacingLonEast", r.spacingEast) &&
              numberAt(header, "RegistrationCoordinates.PixelSpacingLatNorth", r.spacingNorth) &&
              r.spacingEast != 0.0 && r.spacingNorth != 0.0;
  return r;
}

int NVLR_UTILITY_UtmZone(const CVlrMapReference& reference) {
  int zone = 0;
  if (reference.state != CVLR_STATE_UTM_GLOBAL ||
      !NVLR_UTILITY_ParseInteger(reference.zone, zone) || zone < kFirstUtmZone ||
      zone > kLastUtmZone) {
    return 0;
  }
  return zone;
}

void NVLR_UTILITY_CheckMapState(const CVlrMapReference& reference) {
  if (reference.state == CVLR_STATE_GEO_GLOBAL) return;
  const std::string dir = NVLR_UTILITY_EnvValue("VELORAN_MAP_FILES_DIR");
  const std::string listPath = dir + CVLR_MAP_LIST_NAME;
  const std::vector<std::string> states = readMapList(listPath);
  if (states.empty()) {
    NVLR_UTILITY_RaiseError(vlr::kCodeNoInitDir, kModule, __LINE__, listPath.c_str());
  }
  // An unset state matches nothing; only listed states lead to a file name.
  if (reference.state.empty() ||
      std::find(states.begin(), states.end(), reference.state) == states.end()) {
    NVLR_UTILITY_TracePrint("State not in the map list [%s]\n", reference.state.c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeMapState, kModule, __LINE__, kInvalidStateText);
  }

  CDescriptionHeader mapFile(std::vector<std::string>{"state", "hemisphere", "projection", "zone",
                                                      "ellipsoid", "datumshift"});
  const std::string mapPath = dir + reference.state + CVLR_MAP_FILE_SUFFIX;
  if (!readHeader(mapFile, mapPath.c_str())) {
    NVLR_UTILITY_TracePrint("%s : %s\n", kMissingMapFileText, mapPath.c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, kMissingMapFileText);
  }

  const MapValue values[] = {
      {"hemisphere", &reference.hemisphere, "Hemisphere not found ["},
      {"projection", &reference.projection, "Projrction not found ["},
      {"zone", &reference.zone, "Zone not found ["},
      {"ellipsoid", &reference.ellipsoid, "Ellipsoid not found ["},
      {"datumshift", &reference.datumShift, "Datum shift not found ["},
  };
  bool wrong = false;
  for (const MapValue& v : values) {
    const CDescriptionSection* section = findSection(mapFile, v.section);
    // A map file without any value for a section cannot answer the lookup.
    if (section == nullptr || !section->isSet()) {
      const std::string key = mapPath + " : " + v.section;
      NVLR_UTILITY_RaiseError(vlr::kCodeMemory, kModule, __LINE__, key.c_str());
    }
    const std::string key = std::string(v.section) + "_" + *v.value;
    const CDescriptionField* allowed = section->findField(key);
    if (allowed == nullptr || !allowed->isSet()) {
      NVLR_UTILITY_TracePrint("%s%s]\n", v.traceText, v.value->c_str());
      wrong = true;
    }
  }
  if (wrong)
    NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, __LINE__, kWrongFieldText);
}
