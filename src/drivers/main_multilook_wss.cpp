// "main_multilook_WSS#": import, then multilook of the whole swath.
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "convert/imagesar_kestova.h"
#include "drivers/driver_arguments.h"
#include "drivers/drivers.h"
#include "drivers/find_aux.h"
#include "envisat/envisat_types.h"
#include "extraction/images.h"
#include "geocode/geocode_header.h"
#include "multilook/mlook.h"
#include "multilook/mlook_io.h"
#include "profile/profile_par.h"
#include "runtime/call_scope.h"
#include "runtime/ckerr.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/progress.h"
#include "runtime/raise.h"
#include "suite/raster_to_geotiff.h"

namespace {

constexpr const char* kModule = "main_multilook_wss";
constexpr const char* kTitle = "Multilooking ASA WSS";

constexpr const char* kParameterFile = "parameters_multilook.hdr";
// The optional map-projected copy of the output: section and keys of the
// multilook parameter file.  Without "Geocode = 1" nothing is geocoded.
constexpr const char* kGeocodeSection = "Geocoding";
constexpr const char* kGeocodeSuffix = "_geo.tif";

enum MultilookArgument : size_t {
  kProduct = 0,
  kOutputRoot = 1,
  kDoris = 2,
  kGroundRange = 6,
  kTiff = 12,
  kSaturation = 13
};

[[noreturn]] void stepFailed(int line, const char* step) {
  NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, line, step);
}

// Ground control points of the output: a grid of pixels across the whole
// swath (every sub-swath gets some) on its first, middle and last line,
// located on the ellipsoid through the orbit.  The image is not map-projected;
// these let a viewer place it.
constexpr int kControlColumns = 16;
constexpr int kControlRows = 3;

int controlPoints(mlook& processor, std::vector<CVlrGroundControlPoint>* points) {
  VLR_SCOPE("controlPoints", kModule);
  const int columns = processor.outputSamples();
  const int rows = processor.outputLines();
  if (columns < 1 || rows < 1) VLR_FAIL("Empty output image", vlr::kLibInconsistent);
  for (int r = 0; r < kControlRows; ++r) {
    const double row = rows == 1 ? 0.0 : (rows - 1.0) * r / (kControlRows - 1);
    for (int c = 0; c < kControlColumns; ++c) {
      const double column = columns == 1 ? 0.0 : (columns - 1.0) * c / (kControlColumns - 1);
      CVlrGroundControlPoint p;
      p.column = column;
      p.row = row;
      VLR_CALL(processor.geolocate(column, row, &p.latitude, &p.longitude));
      points->push_back(p);
    }
  }
  return 0;
}

// Whether the parameter file asks for the geocoded copy, and its options:
// "Geocode" (0 or 1), "MapEPSG" (0: UTM of the scene centre), "MapSpacing"
// (0: the ground sampling step), "GroundHeight" (m).
bool geocodeRequested(const std::string& file, GeocodeOptions* options) {
  int on = 0;
  if (GetParInt(file.c_str(), "Geocode", 1, &on, 1, kGeocodeSection) != 0 || on != 1) return false;
  GetParInt(file.c_str(), "MapEPSG", 1, &options->epsg, 1, kGeocodeSection);
  GetParDouble(file.c_str(), "MapSpacing", 1, &options->spacing, 1, kGeocodeSection);
  GetParDouble(file.c_str(), "GroundHeight", 1, &options->height, 1, kGeocodeSection);
  return true;
}

}  // namespace

int fvlr_main_multilook_wss(const char* argumentText) {
  using vlr::DriverArgument;
  const std::vector<std::string> args = vlr::ReadDriverArguments(argumentText, kTitle, kModule);
  const std::string parameters = NVLR_UTILITY_Format(
      "\nINPUT ASA_RS : [ %s ]\nOUTPUT ROOT NAME : [ %s ]\nINPUT DORIS : [ %s ]",
      DriverArgument(args, kProduct).c_str(), DriverArgument(args, kOutputRoot).c_str(),
      DriverArgument(args, kDoris).c_str());
  NVLR_UTILITY_WriteStart(args, kTitle, parameters.c_str());

  std::string directory;
  NVLR_UTILITY_GetEnvCode(directory, "VELORAN_CEOS_DES_FILES_DIR");
  const std::string parameterFile = directory + kParameterFile;

  const std::string& product = DriverArgument(args, kProduct);
  if (product == vlr::kNotOK || !EnvisatTypes::is_wss(product.c_str())) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "WSS");
  }
  const std::string& root = DriverArgument(args, kOutputRoot);
  if (root == vlr::kNotOK) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "OUTNAME");
  }
  std::string xcaPath, insPath;
  if (find_aux(product.c_str(), directory.c_str(), "ASA_XCA", xcaPath) != 0 ||
      find_aux(product.c_str(), directory.c_str(), "ASA_INS", insPath) != 0) {
    stepFailed(__LINE__, "findaux()");
  }
  const std::string& orbit = DriverArgument(args, kDoris);
  if (orbit == vlr::kNotOK || vlr::CheckOrbitFile(orbit) != 0 ||
      (!EnvisatTypes::is_dorvor(orbit.c_str()) && !EnvisatTypes::is_dorpor(orbit.c_str()))) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "DOR_VOR");
  }

  // An old list file would name rasters that this run replaces.
  if (NVLR_UTILITY_FileExists(root.c_str()) && std::remove(root.c_str()) != 0)
    stepFailed(__LINE__, "images run()");
  errno = 0;
  images_conf conf;
  images extraction(conf);
  if (!vlr::CopyDriverName(product, extraction.input.ASA_level1_filename) ||
      !vlr::CopyDriverName(insPath, extraction.input.ASA_INS_Filename) ||
      !vlr::CopyDriverName(orbit, extraction.input.ASA_dor_vor) ||
      !vlr::CopyDriverName(root, extraction.output.OutputFile)) {
    stepFailed(__LINE__, "images run()");
  }
  conf.Memory = 256;
  conf.ReportLevel = 1;
  conf.Incore = 0;
  conf.Verbose = 0;
  conf.ExtractData = 1;
  if (extraction.run() != 0) stepFailed(__LINE__, "images run()");
  if (tessal2kestova(root.c_str(), xcaPath.c_str()) != 0) stepFailed(__LINE__, "tessal2kestova()");
  if (const int rc = vlr::WriteImportListFile(root)) return rc;

  mlook_conf mconf;
  mlook_input minput;
  mlook_output moutput;
  if (mconf.readpar(parameterFile.c_str()) != 0) stepFailed(__LINE__, "mlook conf readpar()");
  if (mconf.checkpar() != 0) stepFailed(__LINE__, "mlook conf checkpar()");
  GeocodeOptions geocodeOptions;
  const bool geocode = geocodeRequested(parameterFile, &geocodeOptions);
  std::string geocodeMessage;
  // Wrong map options are refused before the long multilook.
  if (geocode && CheckGeocodeOptions(geocodeOptions, mconf.GrSamplingStep, &geocodeMessage) != 0)
    stepFailed(__LINE__, ("geocode(): " + geocodeMessage).c_str());
  errno = 0;
  // The command decides the geometry; the antenna correction stays off.
  const bool groundRange = DriverArgument(args, kGroundRange) == vlr::kOK;
  mconf.setGeometry(groundRange ? OutputGeometry::kGroundRange : OutputGeometry::kSlantRange);
  mconf.RgAnt_flag = 0;
  const std::string output = root + (groundRange ? "_gr" : "_pwr");
  minput.BurstsToSkip = 0;
  minput.BurstsToProcess = 0;
  if (!vlr::CopyDriverName(root, minput.Level1Filename) ||
      !vlr::CopyDriverName(xcaPath, minput.ASA_XCA_Filename) ||
      !vlr::CopyDriverName(output, moutput.OutputFilename)) {
    stepFailed(__LINE__, "mlook readimages()");
  }
  const bool tiff = DriverArgument(args, kTiff) == vlr::kOK;
  std::vector<CVlrGroundControlPoint> points;
  MlookRadarGrid radarGrid;
  GeneralSAROrbit imagingOrbit;
  {
    mlook processor(&mconf, &minput, &moutput);
    if (processor.readimages_kestova() != 0) stepFailed(__LINE__, "mlook readimages()");
    // The raise ends the process: the temporary sub-swath power files go
    // first, as they would after a run that worked.
    if (processor.run() != 0) {
      processor.freeimages();
      stepFailed(__LINE__, "mlook run()");
    }
    if (processor.writepar() != 0) {
      processor.freeimages();
      stepFailed(__LINE__, "mlook writepar()");
    }
    if (geocode && (processor.radarGrid(&radarGrid) != 0 || processor.orbit() == nullptr ||
                    processor.orbit()->clone(&imagingOrbit) != 0)) {
      processor.freeimages();
      stepFailed(__LINE__, "geocode()");
    }
    // Without an orbit position the TIFF simply carries no control points.
    if (tiff && controlPoints(processor, &points) != 0) points.clear();
    errno = 0;
    if (processor.freeimages() != 0) stepFailed(__LINE__, "mlook freeimages()");
  }
  const std::string libraryHeader = output + ".hdr";
  const std::string suiteHeader = output + "_hdr";
  if (writehdr_kestova(libraryHeader.c_str(), suiteHeader.c_str(), xcaPath.c_str(), 0) != 0)
    stepFailed(__LINE__, "writehdr kestova()");
  if (geocode) {
    NVLR_UTILITY_SetProcessLabel("Geocoding ...");
    const std::string target = root + kGeocodeSuffix;
    if (GeocodeMultilook(output.c_str(), radarGrid, imagingOrbit, geocodeOptions,
                         mconf.GrSamplingStep, target.c_str(), &geocodeMessage) != 0)
      stepFailed(__LINE__, ("geocode(): " + geocodeMessage).c_str());
    errno = 0;
  }
  exit_report();

  if (tiff) {
    NVLR_UTILITY_SetProcessLabel("Tiff generation ...");
    // The host may have withdrawn the run while the multilook ran.
    if (!NVLR_UTILITY_FileExists((NVLR_UTILITY_WorkingFile() + "_batch_ok").c_str())) {
      std::fputs("\n EXECUTION INTERRUPTED BY OPERATOR\n", stdout);
      NVLR_UTILITY_RaiseError(vlr::kCodeBatchWithdrawn, kModule, __LINE__, nullptr);
    }
    errno = 0;
    getAndSetPerc(-1, 0, "Tiff generation ...");
    const std::string tiff = output + ".tif";
    NVLR_UTILITY_RasterToGeoTiff(output.c_str(), tiff.c_str(),
                                 std::atof(DriverArgument(args, kSaturation).c_str()), points);
  }
  return 0;
}
