// Byte-order correction and cell-type conversion of sample runs.
//
// Used by the window reader and writer: the pair (source type, destination
// type) is resolved once per run, so the inner loops are plain typed loops
// that the compiler can vectorise.
#pragma once

#include <cstddef>

// True when samples of cell type `from` can be converted to cell type `to`:
// both within 0..7, and real to real, complex to complex or real to complex
// (imaginary part 0).  Complex to real is not a conversion by value.
bool sample_conversion_supported(int from, int to);

// Converts `count` elements of cell type `from` at `in` into cell type `to`
// at `out`.  With `swap_in` the components of the input are stored in the
// other byte order and are reversed on the way.  Conversions by value:
// integer to floating point exactly or to the nearest representable value,
// floating point to integer rounded half away from zero, integers and
// floating-point values outside the destination's range saturate at its
// limits, NaN becomes 0.  Neither buffer needs any alignment; they must not
// overlap.  Does nothing for an unsupported pair.
void convert_samples(const void* in, int from, bool swap_in, void* out, int to, size_t count);

// Reverses the byte order of each component of `count` elements of cell type
// `type` in place (complex elements as two components).
void swap_samples(void* buffer, int type, size_t count);
