// Legacy numbers, read and printed the same way on every host.
//
// The legacy files were written with a point as the decimal separator, and
// the store expects one, so neither reading nor printing may follow the
// host's LC_NUMERIC: these helpers always use the "C" conventions.
#ifndef HF_ENGINE_NUMBERS_H_
#define HF_ENGINE_NUMBERS_H_

#include <wx/string.h>

#include <cstdint>

// Reads a decimal number as strtod does: leading white space skipped, the
// longest leading run that forms a number taken, the rest ignored. Answers
// false, leaving `value` alone, when no number can be read at all.
bool ReadDouble(const wxString& text, double* value);

// As above, with 0 for a text that holds no number.
double ReadDoubleOr0(const wxString& text);

// Reads a base-10 integer as strtol does, clamped to the signed 32-bit range
// (the width of the legacy service's long). 0 when the text holds no number.
std::int32_t ReadInt32(const wxString& text);

// Prints a number as printf's "%f": fixed-point, six digits after a point.
wxString FormatFixed(double value);

#endif  // HF_ENGINE_NUMBERS_H_
