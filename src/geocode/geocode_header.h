// The suite header of a geocoded image and the whole geocoding of a
// multilook output: map grid, image and header.
#pragma once

#include <string>

#include "geocode/geocoder.h"
#include "geocode/map_grid.h"

// Writes the suite header "<target>_hdr" (stored as "<target>.sml") of the
// geocoded image `target`: the header of the multilook output `image` with
// the map image's size, cell type and no-data value, and the map grid in
// "CartographicSystem" and "RegistrationCoordinates".  Raises the suite
// errors of the header library on failure.
void WriteGeocodedHeader(const char* image, const MapGrid& map, const char* target);

// Map grid, geocoded image and header of the multilook output `image`
// (grid and orbit from its run) into `target`.  0, or a library code with
// *message.
int GeocodeMultilook(const char* image, const MlookRadarGrid& grid, const GeneralSAROrbit& orbit,
                     const GeocodeOptions& options, double groundStep, const char* target,
                     std::string* message, MapGrid* map = nullptr,
                     GeocodeFigures* figures = nullptr);
