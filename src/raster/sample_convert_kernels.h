// Sample conversion kernels.  Included by sample_convert.cpp and, compiled
// for AVX2, by sample_convert_avx2.cpp: everything here has internal linkage
// so that the two builds never mix, and nothing calls out-of-line library
// templates.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>

namespace {

// Component kinds of the cell types 0..7 (real and complex share them).
enum Component { kFloat, kDouble, kInt32, kInt16 };

template <class T>
struct SameSizeUnsigned {
  using type = T;  // the unsigned types themselves
};
template <>
struct SameSizeUnsigned<int16_t> {
  using type = uint16_t;
};
template <>
struct SameSizeUnsigned<int32_t> {
  using type = uint32_t;
};
template <>
struct SameSizeUnsigned<float> {
  using type = uint32_t;
};
template <>
struct SameSizeUnsigned<double> {
  using type = uint64_t;
};

inline uint16_t ByteSwap(uint16_t v) {
  return static_cast<uint16_t>((v >> 8) | (v << 8));
}
inline uint32_t ByteSwap(uint32_t v) {
  return __builtin_bswap32(v);
}
inline uint64_t ByteSwap(uint64_t v) {
  return __builtin_bswap64(v);
}

template <class T, bool Swap>
inline T Load(const unsigned char* p) {
  using U = typename SameSizeUnsigned<T>::type;
  U bits;
  std::memcpy(&bits, p, sizeof bits);
  if constexpr (Swap) bits = ByteSwap(bits);
  T value;
  std::memcpy(&value, &bits, sizeof value);
  return value;
}

template <class T>
inline void Store(unsigned char* p, T value) {
  std::memcpy(p, &value, sizeof value);
}

template <class T>
struct Limits;
template <>
struct Limits<int16_t> {
  static constexpr int16_t kMax = 32767;
  static constexpr int16_t kMin = -32767 - 1;
};
template <>
struct Limits<int32_t> {
  static constexpr int32_t kMax = 2147483647;
  static constexpr int32_t kMin = -2147483647 - 1;
};

// Conversion of one component by value.
template <class D, class S>
inline D Convert(S v) {
  if constexpr (std::is_same<D, S>::value) {
    return v;
  } else if constexpr (std::is_floating_point<D>::value) {
    return static_cast<D>(v);
  } else if constexpr (std::is_integral<S>::value) {
    // Integer to a narrower or equal integer: saturate.
    if constexpr (sizeof(S) > sizeof(D)) {
      if (v > Limits<D>::kMax) return Limits<D>::kMax;
      if (v < Limits<D>::kMin) return Limits<D>::kMin;
    }
    return static_cast<D>(v);
  } else {
    // Floating point to integer: round half away from zero, saturate, NaN 0.
    if (!(v == v)) return 0;
    const double r = __builtin_round(static_cast<double>(v));
    if (r >= static_cast<double>(Limits<D>::kMax)) return Limits<D>::kMax;
    if (r <= static_cast<double>(Limits<D>::kMin)) return Limits<D>::kMin;
    return static_cast<D>(r);
  }
}

// `n` input components to `n` output components, or with Expand to `2n`
// output components whose imaginary parts are 0.
template <class S, class D, bool Swap, bool Expand>
void Kernel(const unsigned char* in, unsigned char* out, size_t n) {
  for (size_t i = 0; i < n; ++i) {
    const D d = Convert<D>(Load<S, Swap>(in + i * sizeof(S)));
    if constexpr (Expand) {
      Store(out + 2 * i * sizeof(D), d);
      Store(out + (2 * i + 1) * sizeof(D), D(0));
    } else {
      Store(out + i * sizeof(D), d);
    }
  }
}

template <class S, bool Swap, bool Expand>
void ToDestination(const unsigned char* in, unsigned char* out, Component to, size_t n) {
  switch (to) {
    case kFloat:
      Kernel<S, float, Swap, Expand>(in, out, n);
      break;
    case kDouble:
      Kernel<S, double, Swap, Expand>(in, out, n);
      break;
    case kInt32:
      Kernel<S, int32_t, Swap, Expand>(in, out, n);
      break;
    case kInt16:
      Kernel<S, int16_t, Swap, Expand>(in, out, n);
      break;
  }
}

template <bool Swap, bool Expand>
void FromSource(const unsigned char* in, Component from, unsigned char* out, Component to,
                size_t n) {
  switch (from) {
    case kFloat:
      ToDestination<float, Swap, Expand>(in, out, to, n);
      break;
    case kDouble:
      ToDestination<double, Swap, Expand>(in, out, to, n);
      break;
    case kInt32:
      ToDestination<int32_t, Swap, Expand>(in, out, to, n);
      break;
    case kInt16:
      ToDestination<int16_t, Swap, Expand>(in, out, to, n);
      break;
  }
}

// Converts `n` components of the component kinds `from` to `to`; with
// `expand`, `n` real inputs become `n` complex outputs.
void ConvertRun(const unsigned char* in, int from, bool swap, unsigned char* out, int to, size_t n,
                bool expand) {
  const Component cf = static_cast<Component>(from);
  const Component ct = static_cast<Component>(to);
  if (swap) {
    if (expand) {
      FromSource<true, true>(in, cf, out, ct, n);
    } else {
      FromSource<true, false>(in, cf, out, ct, n);
    }
  } else if (expand) {
    FromSource<false, true>(in, cf, out, ct, n);
  } else {
    FromSource<false, false>(in, cf, out, ct, n);
  }
}

}  // namespace

// The AVX2 build of ConvertRun (sample_convert_avx2.cpp).
void vlr_convert_run_avx2(const unsigned char* in, int from, bool swap, unsigned char* out, int to,
                          size_t n, bool expand);
