// Byte-order and number helpers shared by every module that reads binary data.
//
// Order letters: 'l' least significant byte first, 'm' most significant byte
// first.  The readers and writers end the process with status 1 on any other
// letter, after printing "\norder must be 'm' or 'l'!\n" on the standard
// output: a wrong letter is a programming error, not a data error.
#pragma once

#include <cstdint>

// Order letter of this host.
char endi();

// Values stored in the given order at `bytes` (no alignment needed).
uint16_t ch2uint2(const void* bytes, char order);
uint32_t ch2uint4(const void* bytes, char order);
int16_t ch2int2(const void* bytes, char order);
int32_t ch2int4(const void* bytes, char order);
int32_t ch2long4(const void* bytes, char order);
float ch2float4(const void* bytes, char order);
double ch2double8(const void* bytes, char order);

// Stores the value at `bytes` in the given order.
void float2ch(float value, void* bytes, char order);
void long2ch(int32_t value, void* bytes, char order);
void short2ch(int16_t value, void* bytes, char order);

// Reverse the bytes of each of `count` 2-, 4- or 8-byte elements in place.
void swp2(void* buffer, int64_t count);
void swp4(void* buffer, int64_t count);
void swp8(void* buffer, int64_t count);
// Reverses each whole group of `size` bytes in the first `bytes` bytes; odd
// sizes (and a trailing partial group) are left unchanged.
void swp_any(void* buffer, int64_t bytes, int size);
// The value with its two bytes exchanged.
uint16_t bsw2b(uint16_t value);

// Swaps `count` elements of `size` bytes when `swap` is non-zero.  0, or -1
// for a size other than 1, 2, 4, 8 and 16 (nothing is changed then).
int get_endian(void* buffer, int64_t count, int size, int swap);

// Classification by the exponent and mantissa bits.
int myisinf(double value);
int myfinite(double value);
int myisnan(double value);
// The float forms also count the largest finite magnitude (bits 0x7F7FFFFF),
// which the data sources use as an overflow marker, as infinite.
int myisinf4(float value);
int myfinite4(float value);
int myisnan4(float value);
