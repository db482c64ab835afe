// Geographic corners and centre of a scene, with the grid sizes of its
// geocoded form.
#pragma once

#include "metadata_framework/general_sar_base.h"
#include "metadata_sections/geo_point.h"

class geoCoords_Obj : public GeneralSAR_Base {
 public:
  geoCoords_Obj();

  // The grid sizes as block "GroundCornersPoints" of channel 1 (or else the
  // parameter-file section "GeoGridSize"), then the points as the blocks
  // "NorthWest", "NorthEast", "SouthWest", "SouthEast" and "Center" (or
  // else the keys of those names in the section "Coordinates").  Read: 0, 1
  // when the grid sizes are missing, or the code of the first point that
  // cannot be read (the later points are not read).  Write: 0 or the first
  // failing writer's code.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  int clone(geoCoords_Obj* other) const;

  double EastingGridSize = -999;
  double NorthingGridSize = -999;
  geopoint NorthWest;
  geopoint NorthEast;
  geopoint SouthWest;
  geopoint SouthEast;
  geopoint Center;

 protected:
  void refreshParameters() override;
};
