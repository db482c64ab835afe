// Map references of geocoded products: the "CartographicSystem" and grid
// fields of a suite header, and their check against the installation's map
// list and the map file of each state.
#pragma once

#include <string>

class CDescriptionHeader;

// Geographic coordinates on WGS 84; needs no map file.
constexpr const char* CVLR_STATE_GEO_GLOBAL = "GEO-GLOBAL";
// UTM on WGS 84, zones 1 to 60.
constexpr const char* CVLR_STATE_UTM_GLOBAL = "UTM-GLOBAL";
// The list of valid states in VELORAN_MAP_FILES_DIR, one a line.
constexpr const char* CVLR_MAP_LIST_NAME = "map_list";
// A state's map file is the state name followed by this suffix (a suite
// header, stored as "<state>_map.sml").
constexpr const char* CVLR_MAP_FILE_SUFFIX = "_map";

// The map reference of a header.  Texts that are not set are empty.
struct CVlrMapReference {
  bool geocoded = false;  // "RasterInfo.GeocodedImage" is "OK", in any case
  std::string state;
  std::string hemisphere;
  std::string projection;
  std::string zone;
  std::string ellipsoid;
  std::string datumShift;
  // Upper-left corner and pixel spacings ("RegistrationCoordinates"),
  // valid when hasGrid is set.
  bool hasGrid = false;
  double lonEasting = 0.0;
  double latNorthing = 0.0;
  double spacingEast = 0.0;
  double spacingNorth = 0.0;
  int lines = 0;
  int pixels = 0;

  bool north() const { return hemisphere == "NORTH"; }
};

// Reads the map reference of a header; absent sections or fields leave the
// corresponding members empty.
CVlrMapReference NVLR_UTILITY_ReadMapReference(CDescriptionHeader& header);

// The UTM zone of a reference: 1 to 60 for a "UTM-GLOBAL" reference whose
// zone is such a whole number, else 0 (the reference is then treated like
// any other state).
int NVLR_UTILITY_UtmZone(const CVlrMapReference& reference);

// Checks the state and its values.  "GEO-GLOBAL" needs nothing; any other
// state must be a line of the map list (456960; 783360 for a list without
// any line), its map file must exist (261122), hold a section for each value
// (195840) and list the header's hemisphere, projection, zone, ellipsoid and
// datum shift (130560, after a trace line for each value not found).
void NVLR_UTILITY_CheckMapState(const CVlrMapReference& reference);
