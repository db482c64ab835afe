#include "raster/sample_convert.h"

#include <cstdint>
#include <cstring>

#include "raster/cell_type.h"
#include "raster/sample_convert_kernels.h"

namespace {

Component ComponentOf(int type) {
  switch (type / 2) {
    case 0:
      return kFloat;
    case 1:
      return kDouble;
    case 2:
      return kInt32;
    default:
      return kInt16;
  }
}

}  // namespace

bool sample_conversion_supported(int from, int to) {
  if (from < 0 || from > 7 || to < 0 || to > 7) return false;
  return !(cell_type_is_complex(from) && !cell_type_is_complex(to));
}

void convert_samples(const void* in, int from, bool swap_in, void* out, int to, size_t count) {
  if (!sample_conversion_supported(from, to) || count == 0) return;
  const auto* src = static_cast<const unsigned char*>(in);
  auto* dst = static_cast<unsigned char*>(out);
  const bool from_complex = cell_type_is_complex(from);
  const bool expand = !from_complex && cell_type_is_complex(to);
  const size_t components = from_complex ? 2 * count : count;
  const int cf = ComponentOf(from);
  const int ct = ComponentOf(to);
  if (from == to && !swap_in) {
    std::memcpy(dst, src, count * static_cast<size_t>(cell_type_size(from)));
    return;
  }
#if defined(VLR_HAVE_AVX2_KERNELS)
  static const bool avx2 = __builtin_cpu_supports("avx2");
  if (avx2) {
    vlr_convert_run_avx2(src, cf, swap_in, dst, ct, components, expand);
    return;
  }
#endif
  ConvertRun(src, cf, swap_in, dst, ct, components, expand);
}

void swap_samples(void* buffer, int type, size_t count) {
  if (!cell_type_is_valid(type)) return;
  const int size = cell_type_size(type);
  const int component = cell_type_is_complex(type) ? size / 2 : size;
  const size_t n = cell_type_is_complex(type) ? 2 * count : count;
  auto* p = static_cast<unsigned char*>(buffer);
  switch (component) {
    case 2:
      for (size_t i = 0; i < n; ++i) Store(p + 2 * i, ByteSwap(Load<uint16_t, false>(p + 2 * i)));
      break;
    case 4:
      for (size_t i = 0; i < n; ++i) Store(p + 4 * i, ByteSwap(Load<uint32_t, false>(p + 4 * i)));
      break;
    case 8:
      for (size_t i = 0; i < n; ++i) Store(p + 8 * i, ByteSwap(Load<uint64_t, false>(p + 8 * i)));
      break;
    default:  // one-byte components need no swapping
      break;
  }
}
