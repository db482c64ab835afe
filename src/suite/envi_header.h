// The ENVI header written beside every suite product, and the GDAL virtual
// raster written beside a product whose lines carry a prefix or suffix.
#pragma once

class CDescriptionHeader;

// Writes "<product>.hdr" for the suite header named headerName (the product
// name followed by "_hdr" or ".sml", or the product name itself).  Nothing is
// written for TIFF exports or when "RowPrefix" is not set.  When the lines
// have a prefix or suffix, "<product>.vrt" is written too.
void NVLR_UTILITY_WriteEnviHeader(CDescriptionHeader& header, const char* headerName);
