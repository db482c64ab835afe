// Pieces of the header conversion shared by its source files.
#pragma once

#include <string>
#include <vector>

#include "runtime/light_speed.h"

class CDescriptionHeader;
class GeneralSAR;

namespace kestova {

constexpr const char* kModule = "imagesar_kestova";
// Swath text of a product composed from the five sub-swaths.
constexpr const char* kComposedSwath = "ALL";
// Section of the suite header that holds the ENVISAT fixed headers.
constexpr const char* kFixHeaderSection = "EnvisatFixHeader";
// Numbers of coefficients the suite header keeps per Doppler centroid and
// Doppler rate polynomial (range terms only), and per geometric polynomial
// (all seven).
constexpr int kDopplerCentroidCoefficients = 5;
constexpr int kDopplerRateCoefficients = 3;
constexpr int kGeometryCoefficients = 7;

// What the mapping needs besides the container: the swath kind, the image's
// first and last line times (sec85) and the ground speed used for the
// azimuth pixel spacing.
struct ImageTiming {
  bool composed = false;
  double firstLine = 0.0;
  double lastLine = 0.0;
  // Speed written as "ProcessingVelocity" and the one the azimuth spacing
  // uses; spacingKnown is false when neither the header nor an orbit gives
  // a speed.
  double velocity = 0.0;
  bool spacingKnown = false;
};

// Writes every field of the mapping and the "RasterInfo.OtherInfo" rows into
// `header`.  0, 1 for a polarisation outside the four known ones ("Wrong
// Polarization Type"), an unsupported cell type or a time that cannot be
// written as a date, or the code of the antenna pattern read.
int WriteMappedFields(GeneralSAR& gs, const ImageTiming& timing, CDescriptionHeader& header);

// Carries the main and specific product headers of the ENVISAT file `aux`
// into the "EnvisatFixHeader" section of `header` through the temporary
// text-form headers "<suiteHeader>_tmp1_hdr" and "<suiteHeader>_tmp2_hdr",
// and writes `header` again.  `fixed` is the header that holds only that
// section.  0, 9, 4, 5, or 1 when the file is not an ENVISAT product.
int CarryEnvisatFixHeader(CDescriptionHeader& header, CDescriptionHeader& fixed,
                          const char* suiteHeader, const char* aux);

// The suite's name of a raster cell type of the libraries, and back.  The
// two types the tool writes (complex and real single-precision samples) are
// "FLOAT_COMPLEX" and "FLOAT"; the others keep their own sizes, so that a
// reader of the suite header never takes their samples for floats.  Null, or
// -1, for a type the other side has no name for.
const char* SuiteCellType(int cellType);
int LibraryCellType(const std::string& name);

// The date text of a sec85 time; false for a time before 1985, after the
// year 9999 or not finite.
bool TimeText(double t, std::string* text);

// Whether the file exists, leaving errno as it was (a failed probe must not
// be taken for an error of the next call).
bool PathExists(const std::string& path);

}  // namespace kestova
