// Loading a legacy folder.cfg within bounds the reader can handle.
//
// A document nested deeper than any folder.cfg needs, or huge, is refused
// before a tree is built, and counts as unreadable like any malformed file.
#ifndef HF_LEGACY_XML_LOAD_H_
#define HF_LEGACY_XML_LOAD_H_

#include <wx/string.h>

#include <cstddef>
#include <string>

#include "legacy/config_tree.h"

constexpr std::size_t kMaxConfigBytes = 64u << 20;
constexpr int kMaxConfigDepth = 256;

// True when the bytes are well-formed XML whose elements nest no deeper than
// kMaxConfigDepth and whose content, entities expanded, stays within
// kMaxConfigBytes.
bool XmlWithinBounds(const std::string& bytes);

// Loads the file at a Windows path into `tree` (see ConfigTree::Parse).
// False, with nothing logged, when the file cannot be read, is too large
// (before or after entity expansion) or too deep, or has no root element.
bool LoadFolderConfig(const wxString& windows_path, ConfigTree* tree);

#endif  // HF_LEGACY_XML_LOAD_H_
