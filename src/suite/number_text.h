// Number texts of the suite headers: doubles written so that they read back
// bit for bit, and strict parsers that accept a text only when it is a whole
// number.
#pragma once

#include <string>

// The shortest of %.15g, %.16g and %.17g that reads back exactly; "NaN" for
// a NaN, "inf" and "-inf" for infinities.
std::string NVLR_UTILITY_DoubleText(double value);
// The whole text (blanks around it allowed) as a double; "NaN" gives a NaN.
bool NVLR_UTILITY_ParseDouble(const std::string& text, double& value);
// The whole text as a 32-bit signed integer.
bool NVLR_UTILITY_ParseInteger(const std::string& text, int& value);
