// The ENVISAT MJD time record: three 32-bit signed words stored most
// significant byte first: days since 2000-01-01 00:00:00, seconds of the
// day, microseconds.
#pragma once

#include <cstddef>
#include <cstdint>

#include "time/date_text.h"

constexpr size_t kMjdRecordSize = 12;

// The record as stored in a product: 12 bytes, big-endian words.
struct MjdRecord {
  uint8_t bytes[kMjdRecordSize];
};

// Builds a stored record from its three words, and reads the words back.
MjdRecord MjdRecordFromWords(int32_t days, int32_t seconds, int32_t microseconds);
void MjdRecordWords(const MjdRecord& record, int32_t* days, int32_t* seconds,
                    int32_t* microseconds);

// days * 86400 + seconds + microseconds * 1e-6 + 473299200.
double mjd2sec85(MjdRecord record);

// Writes the record of sec85 time t into `buffer` (kMjdRecordSize bytes).
// Microseconds are truncated as in sec852myascii.  0, or -1 (buffer
// untouched) when t is not finite or its day count does not fit a word.
int sec852mjd(double t, void* buffer);

// mjd2sec85 then sec852ascii; returns the buffer (kSec85TextSize bytes).
char* mjd2ascii(MjdRecord record, char* buffer);
