// The single record of an ENVISAT auxiliary product (external calibration
// ASA_XCA, instrument characterisation ASA_INS): main product header, a
// specific header holding one data set descriptor, then the data set.
#pragma once

#include <cstddef>
#include <cstdint>

#include "runtime/call_scope.h"

// Main product header, read whole.
constexpr int64_t kAuxMphSize = 1247;
// Specific product header of the auxiliary products, read after the MPH.
constexpr int64_t kAuxSphSize = 378;
// The value of DS_OFFSET in that header ("+00000000000000001625<bytes>"):
// position and width of the signed decimal number.
constexpr size_t kAuxDsOffsetValue = 231;
constexpr size_t kAuxDsOffsetWidth = 21;

// Opens `file`, finds its data set and reads the first `recordSize` bytes of
// it into `record`.  0, 9 when the file cannot be opened, 4 ("File reading
// failed!") when a header or the record cannot be read whole or the data set
// offset is not a number inside the file's range, 7 when the record buffer
// cannot be allocated.
int readEnvisatAuxRecord(const char* file, int64_t recordSize,
                         vlr::CkBuffer<unsigned char>* record);

// Big-endian values at byte `offset` of a record.
float auxFloat(const unsigned char* record, size_t offset);
double auxDouble(const unsigned char* record, size_t offset);
