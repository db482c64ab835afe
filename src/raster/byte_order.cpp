#include "raster/byte_order.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

// Ends the process: a wrong order letter is a defect of the caller.
[[noreturn]] void BadOrder() {
  std::printf("\norder must be 'm' or 'l'!\n");
  std::fflush(stdout);
  std::exit(1);
}

constexpr bool kHostLittle = (__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__);

// True when bytes stored in `order` must be reversed for this host.
bool NeedsSwap(char order) {
  if (order == 'l') return !kHostLittle;
  if (order == 'm') return kHostLittle;
  BadOrder();
}

// Reverses n bytes in place.
void Reverse(unsigned char* p, size_t n) {
  for (size_t i = 0; i < n / 2; ++i) {
    const unsigned char c = p[i];
    p[i] = p[n - 1 - i];
    p[n - 1 - i] = c;
  }
}

template <class T>
T Load(const void* bytes, char order) {
  unsigned char tmp[sizeof(T)];
  std::memcpy(tmp, bytes, sizeof(T));
  if (NeedsSwap(order)) Reverse(tmp, sizeof(T));
  T value;
  std::memcpy(&value, tmp, sizeof(T));
  return value;
}

template <class T>
void Store(T value, void* bytes, char order) {
  unsigned char tmp[sizeof(T)];
  std::memcpy(tmp, &value, sizeof(T));
  if (NeedsSwap(order)) Reverse(tmp, sizeof(T));
  std::memcpy(bytes, tmp, sizeof(T));
}

template <class U>
void SwapEach(void* buffer, int64_t count) {
  auto* p = static_cast<unsigned char*>(buffer);
  for (int64_t i = 0; i < count; ++i, p += sizeof(U)) {
    U v;
    std::memcpy(&v, p, sizeof(U));
    if constexpr (sizeof(U) == 2) v = __builtin_bswap16(v);
    if constexpr (sizeof(U) == 4) v = __builtin_bswap32(v);
    if constexpr (sizeof(U) == 8) v = __builtin_bswap64(v);
    std::memcpy(p, &v, sizeof(U));
  }
}

uint32_t FloatBits(float value) {
  uint32_t bits;
  std::memcpy(&bits, &value, sizeof bits);
  return bits;
}

uint64_t DoubleBits(double value) {
  uint64_t bits;
  std::memcpy(&bits, &value, sizeof bits);
  return bits;
}

constexpr uint64_t kDoubleExponent = 0x7FF0000000000000ULL;
constexpr uint64_t kDoubleMantissa = 0x000FFFFFFFFFFFFFULL;
constexpr uint32_t kFloatExponent = 0x7F800000U;
constexpr uint32_t kFloatMantissa = 0x007FFFFFU;
constexpr uint32_t kFloatLargest = 0x7F7FFFFFU;  // largest finite magnitude

}  // namespace

char endi() {
  return kHostLittle ? 'l' : 'm';
}

uint16_t ch2uint2(const void* bytes, char order) {
  return Load<uint16_t>(bytes, order);
}
uint32_t ch2uint4(const void* bytes, char order) {
  return Load<uint32_t>(bytes, order);
}
int16_t ch2int2(const void* bytes, char order) {
  return Load<int16_t>(bytes, order);
}
int32_t ch2int4(const void* bytes, char order) {
  return Load<int32_t>(bytes, order);
}
int32_t ch2long4(const void* bytes, char order) {
  return Load<int32_t>(bytes, order);
}
float ch2float4(const void* bytes, char order) {
  return Load<float>(bytes, order);
}
double ch2double8(const void* bytes, char order) {
  return Load<double>(bytes, order);
}

void float2ch(float value, void* bytes, char order) {
  Store(value, bytes, order);
}
void long2ch(int32_t value, void* bytes, char order) {
  Store(value, bytes, order);
}
void short2ch(int16_t value, void* bytes, char order) {
  Store(value, bytes, order);
}

void swp2(void* buffer, int64_t count) {
  SwapEach<uint16_t>(buffer, count);
}
void swp4(void* buffer, int64_t count) {
  SwapEach<uint32_t>(buffer, count);
}
void swp8(void* buffer, int64_t count) {
  SwapEach<uint64_t>(buffer, count);
}

void swp_any(void* buffer, int64_t bytes, int size) {
  if (buffer == nullptr || size < 2 || size % 2 != 0 || bytes < size) return;
  auto* p = static_cast<unsigned char*>(buffer);
  const int64_t groups = bytes / size;
  for (int64_t g = 0; g < groups; ++g, p += size) Reverse(p, static_cast<size_t>(size));
}

uint16_t bsw2b(uint16_t value) {
  return static_cast<uint16_t>((value >> 8) | (value << 8));
}

int get_endian(void* buffer, int64_t count, int size, int swap) {
  if (swap == 0 || size == 1) return 0;
  switch (size) {
    case 2:
      swp2(buffer, count);
      return 0;
    case 4:
      swp4(buffer, count);
      return 0;
    case 8:
      swp8(buffer, count);
      return 0;
    case 16:
      if (count > INT64_MAX / 16) return -1;
      swp_any(buffer, count * 16, 16);
      return 0;
    default:
      return -1;
  }
}

int myisinf(double value) {
  const uint64_t bits = DoubleBits(value);
  return (bits & kDoubleExponent) == kDoubleExponent && (bits & kDoubleMantissa) == 0;
}

int myfinite(double value) {
  return (DoubleBits(value) & kDoubleExponent) != kDoubleExponent;
}

int myisnan(double value) {
  const uint64_t bits = DoubleBits(value);
  return (bits & kDoubleExponent) == kDoubleExponent && (bits & kDoubleMantissa) != 0;
}

int myisinf4(float value) {
  const uint32_t bits = FloatBits(value);
  if ((bits & ~0x80000000U) == kFloatLargest) return 1;
  return (bits & kFloatExponent) == kFloatExponent && (bits & kFloatMantissa) == 0;
}

int myfinite4(float value) {
  const uint32_t bits = FloatBits(value);
  if ((bits & ~0x80000000U) == kFloatLargest) return 0;
  return (bits & kFloatExponent) != kFloatExponent;
}

int myisnan4(float value) {
  const uint32_t bits = FloatBits(value);
  return (bits & kFloatExponent) == kFloatExponent && (bits & kFloatMantissa) != 0;
}
