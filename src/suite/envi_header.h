// The ENVI header written beside a suite product, and the GDAL virtual
// raster written instead beside a product whose lines carry a prefix or
// suffix.
#pragma once

class CDescriptionHeader;

// Writes "<product>.hdr" for the suite header named headerName (the product
// name followed by "_hdr" or ".sml", or the product name itself).  Nothing is
// written for TIFF exports or when "RowPrefix" is not set.  When the lines
// have a prefix or suffix, which an ENVI header cannot describe,
// "<product>.vrt" is written instead and an ENVI header of an earlier run
// is removed.
void NVLR_UTILITY_WriteEnviHeader(CDescriptionHeader& header, const char* headerName);
