// DORIS orbit files (DOR_VOR_AX, DOR_POR_AX, AUX_FRO_AX, AUX_FPO_AX): an
// ENVISAT product of a main product header, a 378-byte specific header with
// one data set descriptor, and fixed 129-byte ASCII records of Earth-fixed
// state vectors.  All offsets of the format are here.
#pragma once

#include <cstddef>

#include "envisat/product_header.h"

constexpr size_t kDorisSphSize = 378;
// The descriptor of the record data set within the specific header.
constexpr size_t kDorisDsdOffset = 98;
constexpr size_t kDorisRecordSize = 129;
// The product name's first ten characters name the file type.
constexpr EnvisatField kDorisProductType{9, 10};

// Record fields (offsets within a record).
constexpr EnvisatField kDorisRecordTime{0, 27};  // "DD-MMM-YYYY hh:mm:ss.uuuuuu"
constexpr EnvisatField kDorisRecordOrbit{37, 6};
constexpr EnvisatField kDorisRecordPosition[3] = {{44, 12}, {57, 12}, {70, 12}};   // m
constexpr EnvisatField kDorisRecordVelocity[3] = {{83, 12}, {96, 12}, {109, 12}};  // m/s

// The Lagrange window of the reader holds nine records.
constexpr int kDorisWindowSize = 9;

// The values of one record.
struct DorisRecord {
  double time = 0.0;  // sec85
  int orbit = 0;      // absolute orbit number
  double position[3] = {0.0, 0.0, 0.0};
  double velocity[3] = {0.0, 0.0, 0.0};
};

// True when `type` (the first ten characters of the product name) is one of
// the four orbit file types read.
bool is_doris_product_type(const char* type);

// Parses a record of kDorisRecordSize bytes.  False when the date text or a
// number is malformed (a number must fill its field up to blanks).
bool parse_doris_record(const char* record, DorisRecord* out);

// A 27-character date text as sec85; false when it is not a valid date.
bool parse_doris_time(const char* text, size_t width, double* t);
