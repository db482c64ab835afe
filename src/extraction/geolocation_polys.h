// The polynomials of an ASAR image from its annotation: Doppler centroid per
// Doppler record, Doppler rate from the main processing parameters, and the
// slant-to-ground, ground-to-slant and slant-to-incidence polynomials of
// each geolocation grid row.
#pragma once

#include <vector>

#include "extraction/asar_annotation.h"
#include "metadata_sections/poly_sar.h"

using GeolocationRows = std::vector<int>;

// The rows of the geolocation grid that belong to sub-swath `subSwath`
// (1..5, by the swath digit of each record), or every row for 0, in table
// order.  0, or 7.
int SelectGeolocationRows(const asar::AnnotationTable& grid, int subSwath, GeolocationRows* rows);

// Fills `polys`: one Doppler centroid data set per Doppler record (for a
// sub-swath `subSwathIndex` 0..4 its own offset added to the constant term;
// -1 for none), one Doppler rate data set from the main processing
// parameters record `mpp`, and per grid row in `rows` one slant-to-ground,
// ground-to-slant and slant-to-incidence data set (degree 4 over the 11 tie
// points).  0; 1 when a row's tie points do not give a fit; 7.
int MakeImagePolynomials(const asar::AnnotationTable& doppler, const asar::AnnotationTable& grid,
                         const GeolocationRows& rows, int subSwathIndex, const asar::Record& mpp,
                         polySAR* polys);
