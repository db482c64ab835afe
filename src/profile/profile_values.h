// Typed readers and writers of parameter-file values.
//
// Values are kept as text.  Encodings written:
//   string            the text as given
//   quoted string     "text"
//   int / int64       %d / %lld (no braces)
//   double            %.15g (no braces)
//   arrays            {e1 e2 ... en}, elements %d, %lld, %ld, %.7g (float),
//                     %.15g (double), "text" (string); {} when empty
//   matrices          one brace group per row; every row group but the first
//                     is preceded by "\n\t".  Caller memory is column-major:
//                     element (row i, column j) is at index i + j * rows.
//
// Results: 0 success, 10 failure (absent key or section, too few elements,
// bad arguments), kProfileFileRefused (4) for every key of a file larger
// than kProfileMaxFileSize.  Readers leave the destination untouched when the key is
// absent, so the caller keeps its defaults.  Writers change only the cache;
// SyncProfile writes it to disk.
#pragma once

#include <cstdint>

// Copies at most size-1 characters of the value into buffer and terminates
// it.  10 when the key is absent or size < 1 (buffer untouched).
int GetMyProfileString(const char* section, const char* key, char* buffer, int size,
                       const char* file);

// Reads a value of the form {"a" "b" ...} into the n buffers of `strings`,
// each of `elementSize` bytes (elementSize < 1 stands for the library's
// standard 512).  Quotes are stripped.  Results:
//   - value not starting with '{': 0, nothing read;
//   - n elements read: 0;
//   - a '}' met before n elements: the number of elements read (0 if none);
//   - text ended before n elements: warning "Read only ..." and 10;
//   - a character other than a blank, '"' or '}' between elements: 0;
//   - an element longer than elementSize-1: truncated, warning, 10.
int GetMyProfileStringArray(const char* section, const char* key, char** strings, int n,
                            int elementSize, const char* file);

// Numeric array readers: the value is "{e1 e2 ...}" or "e1 e2 ..." (a single
// number reads as a one-element array).  Reads up to n elements; fewer than n
// gives the warning "Read only %d elements of %d - SEC: %s, KEY: %s, FILE: %s"
// and 10 (the elements read are stored).  A number out of the element type's
// range stops the scan like any other token that does not scan.
int GetMyProfileIntArray(const char* section, const char* key, int* values, int n,
                         const char* file);
int GetMyProfileInt64Array(const char* section, const char* key, int64_t* values, int n,
                           const char* file);
int GetMyProfileLongArray(const char* section, const char* key, long* values, int n,
                          const char* file);
int GetMyProfileFloatArray(const char* section, const char* key, float* values, int n,
                           const char* file);
int GetProfileDoubleArray(const char* section, const char* key, double* values, int n,
                          const char* file);

// Writers: 0 when stored; 10 with the warning "Parameter writing failed -
// SEC: %s, KEY: %s, FILE: %s" otherwise.
int WriteMyProfileString(const char* section, const char* key, const char* text, const char* file);
int WriteMyProfileStringQuote(const char* section, const char* key, const char* text,
                              const char* file);
int WriteMyProfileStringArray(const char* section, const char* key, const char* const* strings,
                              int n, const char* file);
int WriteMyProfileStringMatrix(const char* section, const char* key, const char* const* strings,
                               int rows, int columns, const char* file);
int WriteMyProfileInt(const char* section, const char* key, int value, const char* file);
int WriteMyProfileInt64(const char* section, const char* key, int64_t value, const char* file);
int WriteMyProfileDouble(const char* section, const char* key, double value, const char* file);
int WriteMyProfileIntArray(const char* section, const char* key, const int* values, int n,
                           const char* file);
int WriteMyProfileInt64Array(const char* section, const char* key, const int64_t* values, int n,
                             const char* file);
int WriteMyProfileLongArray(const char* section, const char* key, const long* values, int n,
                            const char* file);
int WriteMyProfileFloatArray(const char* section, const char* key, const float* values, int n,
                             const char* file);
int WriteProfileDoubleArray(const char* section, const char* key, const double* values, int n,
                            const char* file);
int WriteMyProfileDoubleMatrix(const char* section, const char* key, const double* values, int rows,
                               int columns, const char* file);
