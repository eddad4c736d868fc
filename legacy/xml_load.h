// Loading a legacy folder.cfg within bounds the reader can handle.
//
// wxXmlDocument builds its tree and frees it by recursion, so a document
// nested deeply enough would overflow the stack before the reader could look
// at it; a huge one would exhaust memory. Such documents are refused before a
// tree is built, and count as unreadable like any malformed file.
#ifndef HF_LEGACY_XML_LOAD_H_
#define HF_LEGACY_XML_LOAD_H_

#include <wx/string.h>
#include <wx/xml/xml.h>

#include <cstddef>
#include <string>

constexpr std::size_t kMaxConfigBytes = 64u << 20;
constexpr int kMaxConfigDepth = 256;

// True when the bytes are well-formed XML whose elements nest no deeper than
// kMaxConfigDepth and whose content, entities expanded, stays within
// kMaxConfigBytes.
bool XmlWithinBounds(const std::string& bytes);

// Loads the file at a Windows path into `doc`, encoding "UTF-8". A text node
// that holds only white space is dropped; every other one is kept whole, as
// XML gives it: references replaced, line ends read as a line feed, leading
// and trailing white space included. False, with nothing logged, when
// the file cannot be read, is too large (before or after entity expansion)
// or too deep, or has no root element.
bool LoadFolderConfig(const wxString& windows_path, wxXmlDocument* doc);

#endif  // HF_LEGACY_XML_LOAD_H_
