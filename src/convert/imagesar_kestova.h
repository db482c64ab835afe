// Conversion between the processing libraries' metadata header of a raster
// (the GeneralSAR container, "<raster>.hdr") and the suite header of the same
// raster ("<raster>.sml", written under the header name "<raster>_hdr",
// with the ENVI header "<raster>.hdr" beside it).
//
// The functions follow the processing libraries' convention: 0 on success,
// otherwise a small code after a report line (1 inconsistent data, 4 read
// failure, 5 write failure, 7 allocation failure, 9 open failure, 10 missing
// input file).  Failures inside the suite library (a missing key file, a
// field the key files do not define, a header file that cannot be written)
// go through the suite's raise sequence instead.
#pragma once

#include <cstddef>

class CDescriptionHeader;
class GeneralSAR;

// Longest file name, in characters, the conversion accepts.
constexpr size_t kKestovaMaxName = 511;

// Reads the library header `libraryHeader` and writes the suite header named
// `suiteHeader`.  For a composed product (data-set swath "ALL") the fixed
// ENVISAT headers of `auxiliaryFile` (an ENVISAT auxiliary file, normally
// the ASA_XCA calibration file) are carried into the suite header's
// "EnvisatFixHeader" section.  `spare` is not used.
// The azimuth pixel spacing is the line interval times the header's
// equivalent speed or, when that is not positive (the extraction stores -1
// for "not computed"), times the orbit's ground speed at the image centre,
// which is then the processing velocity written too.  Without either the
// spacing is left out.  The ENVI header is written beside the product as
// "<suiteHeader without _hdr>.hdr": a library header of that name is
// replaced by it.
//   1   the library header cannot be read or lacks the raster description,
//       data-set information, region or sampling constants; a polarisation
//       other than "H/H", "V/V", "H/V", "V/H" ("Wrong Polarization Type": no
//       suite header is written); a value the suite header cannot hold
//   9, 4, 5   the auxiliary file cannot be opened or read, or a temporary
//       file cannot be written
//   the code of a failing orbit computation
int writehdr_kestova(const char* libraryHeader, const char* suiteHeader, const char* auxiliaryFile,
                     int spare = 0);

// Converts the five sub-swaths of an import: for k = 1..5 the library header
// "<root>k.hdr" into the suite header "<root>k_slc_hdr", then moves the
// raster "<root>k" to "<root>k_slc" (an older "<root>k_slc" is removed
// first).  `reportLevel` is not used.  0, the first failing conversion's
// code, 10 when a raster is missing, 5 when it cannot be renamed, 1 for a
// name longer than kKestovaMaxName.
int tessal2kestova(const char* root, const char* auxiliaryFile, int reportLevel);
// The same, as the multilook driver calls it.
int tessal2kestova(const char* root, const char* auxiliaryFile);

// Reads the suite header `suiteHeader` (".sml" or the older "_hdr" form) and
// fills `gs` from it, the reverse of writehdr_kestova: see readpar_kestova.
// 9 when neither form of the header exists.
int readhdr_kestova(const char* suiteHeader, GeneralSAR* gs);

// Fills `gs` from a suite header already read: state vectors (orbit and
// state-vector sections), region, polynomials, swath information, sampling
// constants, pulse, spectral windows, data-set information, sensor attitude,
// raster description of `rasterName` and the geographic corners.  The
// region starts at the first line time (sec85) and its line interval is the
// azimuth pixel spacing over the processing velocity it was made with.  The
// sections filled are enabled, the others disabled.  A field that the key
// files do not define raises 848642.  1 for values that contradict each
// other (vectors shorter than their counts, an unknown cell type, a date
// that does not parse, an impossible raster description), or the code of
// the orbit or polynomial creation.
int readpar_kestova(CDescriptionHeader& header, const char* rasterName, GeneralSAR* gs);
