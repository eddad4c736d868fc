#include "store/filter_xml.h"

#include <wx/mstream.h>

namespace db {

bool FilterXmlText(const wxXmlNode& root, std::string* text) {
  text->clear();
  // A default-constructed node has no defined type, so it must not be
  // copied or asked for one; it stands for "no tree".
  if (root.GetName().empty() && root.GetChildren() == nullptr && root.GetAttributes() == nullptr) {
    return true;
  }
  wxXmlDocument document;
  document.SetRoot(new wxXmlNode(root));  // the document owns and frees the copy
  wxMemoryOutputStream out;
  if (!document.Save(out, wxXML_NO_INDENTATION)) return false;
  std::string saved(out.GetLength(), '\0');
  out.CopyTo(saved.data(), saved.size());
  // Drop the declaration line: the text is an element, not a file.
  std::string::size_type start = 0;
  if (saved.compare(0, 5, "<?xml") == 0) {
    std::string::size_type end = saved.find("?>");
    if (end == std::string::npos) return false;
    start = saved.find_first_not_of("\r\n", end + 2);
    if (start == std::string::npos) start = saved.size();
  }
  *text = saved.substr(start);
  while (!text->empty() && (text->back() == '\n' || text->back() == '\r')) text->pop_back();
  return true;
}

}  // namespace db
