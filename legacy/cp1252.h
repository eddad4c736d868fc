// Narrow paths of the legacy list file, as the legacy service wrote them.
//
// The service ran under a Windows ANSI code page, in practice Windows-1252.
// A POSIX host's locale says nothing about those bytes, so they are decoded
// by this fixed table rather than by the host's multibyte conversion, and
// every byte decodes: no folder is lost to a locale that cannot read it.
#ifndef HF_LEGACY_CP1252_H_
#define HF_LEGACY_CP1252_H_

#include <wx/string.h>

#include <cstddef>

// Decodes `size` bytes of Windows-1252 text. Bytes the code page leaves
// undefined (0x81, 0x8D, 0x8F, 0x90, 0x9D) become the control character of
// the same value, as Windows' own conversion does.
wxString DecodeCp1252(const char* bytes, std::size_t size);

#endif  // HF_LEGACY_CP1252_H_
