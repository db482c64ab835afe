// The two-way elevation antenna pattern of one beam, as the product's
// antenna elevation pattern record states it, on the regular angle grid of
// the metadata's antenna pattern.
#pragma once

#include <string>

#include "extraction/asar_annotation.h"

class AntennaPattern_Obj;

// Angular step of the stored pattern (degrees): that of the patterns of the
// external calibration file, so that every pattern a header holds has the
// same spacing about its reference angle.
constexpr double kElevationPatternStep = 0.05;

// Fills `out` from the record: gains 10^(dB/20), as for the calibration
// file's patterns, at angles kElevationPatternStep apart, centred on the
// middle of the record's elevation angles and inside their span.  Each gain
// is interpolated in dB by the parabola through the three record points
// nearest its angle: over the main lobe the pattern is close to a parabola
// in dB, which straight lines between the record's sparse points would cut
// short.  0; 1 with `problem` set when the record's angles or gains cannot
// make a pattern (not finite, repeated angles, an implausible span or
// gain); 7.
int ElevationPatternOfRecord(const asar::Record& record, AntennaPattern_Obj* out,
                             std::string* problem);
