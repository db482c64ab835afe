// Choice of an auxiliary file from the installation's auxiliary list.
#pragma once

#include <string>

// Longest auxiliary path that the drivers hand on, in characters.
constexpr size_t kAuxPathMax = 511;

// Finds the auxiliary file of type ("ASA_XCA" or "ASA_INS") valid at the
// product's sensing start in "<directory>ASA_AUX_list.dat"; on success puts
// directory + file name into result and returns 0.  9 or 4 when the product
// cannot be opened or read, 4 as well when its sensing start is not a date
// or the list is too large to be read; 10 when no entry covers the product,
// a StartDate or StopDate met on the way is missing or not a date, the
// chosen entry has no FileName, or the chosen file is not a regular file
// that opens.
int find_aux(const char* product, const char* directory, const char* type, std::string& result);
