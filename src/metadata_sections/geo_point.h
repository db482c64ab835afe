// One geographic point of a scene with the viewing angles there.
#pragma once

#include "metadata_framework/general_sar_base.h"

class geopoint : public GeneralSAR_Base {
 public:
  static constexpr int kValues = 5;

  geopoint();

  // Block `name` of channel 1, or else the key `name` (five values) of the
  // parameter-file section "Coordinates".  Read: 0, or 1 when neither form
  // holds the point.  Write: 0 or the writer's code.
  int readhdr(const char* file, const char* name);
  int writehdr(const char* file, const char* name);
  using GeneralSAR_Base::readhdr;
  using GeneralSAR_Base::writehdr;
  int clone(geopoint* other) const;

  // Sets the point and its mirror in Point.  Returns 0.
  int set(double lat, double lon, double h, double incidenceAngle, double lookAngleValue);

  // The stored values in the order latitude (degrees), longitude (degrees),
  // height (m), incidence angle and look angle (degrees).  The named
  // members mirror them: they are copied into Point before a write and
  // taken from it after a read.
  double Point[kValues] = {-999, -999, -999, -999, -999};
  double latitude = -999;
  double longitude = -999;
  double height = -999;
  double incidence = -999;
  double lookAngle = -999;

 protected:
  void refreshParameters() override;

 private:
  void toPoint();
  void fromPoint();
};
