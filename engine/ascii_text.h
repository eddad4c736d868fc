// Table texts as wide strings.
#ifndef HF_ENGINE_ASCII_TEXT_H_
#define HF_ENGINE_ASCII_TEXT_H_

#include <wx/string.h>

#include <cstring>
#include <string>

#include "engine/settings_map.h"

// The texts of the conversion tables are ASCII, which widens character by
// character to the same wide text in every locale. wxString's conversion of
// a narrow text (wxString::FromAscii too) runs the C library's multibyte
// conversion instead, and for the hundred-odd table texts a folder uses that
// cost more than the rest of its conversion.
// Short texts are widened on the stack, so the result is the only
// allocation.
inline wxString AsciiText(const char* ascii) {
  const std::size_t length = std::strlen(ascii);
  wchar_t wide[64];
  if (length > sizeof(wide) / sizeof(wide[0])) {
    return wxString(std::wstring(ascii, ascii + length));
  }
  for (std::size_t i = 0; i < length; ++i) wide[i] = ascii[i];
  return wxString(wide, length);
}

// The wide text of a table's text or a literal, widened on first use and
// kept for the run, and the same text as a settings key with its hash. The
// text is known by its address, so it must live as long as the program.
const wxString& TableText(const char* ascii);
const SettingsKey& TableKey(const char* ascii);

#endif  // HF_ENGINE_ASCII_TEXT_H_
