// Choice of an auxiliary file from the installation's auxiliary list.
#pragma once

#include <string>

// Longest auxiliary path that the drivers hand on, in characters.
constexpr size_t kAuxPathMax = 511;

// Finds the auxiliary file of type ("ASA_XCA" or "ASA_INS") valid at the
// product's sensing start in "<directory>ASA_AUX_list.dat"; on success puts
// directory + file name into result and returns 0.  9 or 4 when the product
// cannot be opened or read, 10 when no entry covers the product or the chosen
// file does not open.
int find_aux(const char* product, const char* directory, const char* type, std::string& result);
