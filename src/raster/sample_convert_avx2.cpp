// The conversion kernels compiled for AVX2; convert_samples() calls them
// when the processor has it.
#include "raster/sample_convert_kernels.h"

void vlr_convert_run_avx2(const unsigned char* in, int from, bool swap, unsigned char* out, int to,
                          size_t n, bool expand) {
  ConvertRun(in, from, swap, out, to, n, expand);
}
