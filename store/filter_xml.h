// The filter tree as the store keeps it: XML text with the tree's root as
// the document element.
#ifndef HF_STORE_FILTER_XML_H_
#define HF_STORE_FILTER_XML_H_

#include <wx/xml/xml.h>

#include <string>

namespace db {

// UTF-8 XML text of the element and all its descendants, without an XML
// declaration and without layout whitespace, so every text node reads back
// exactly. A node that was never given an element (no name, no attributes,
// no children) gives empty text. False when the tree cannot be written.
bool FilterXmlText(const wxXmlNode& root, std::string* text);

}  // namespace db

#endif  // HF_STORE_FILTER_XML_H_
