#include "legacy/xml_load.h"

#include <expat.h>
#include <wx/log.h>

#include <cstring>

#include "platform/platform.h"

namespace {

// What the tree would hold, measured as the document streams past.
// Content counts after entity expansion, so a small file that expands into
// a huge tree is refused like a huge file.
struct Measure {
  XML_Parser parser;
  int depth = 0;
  std::size_t content = 0;
};

void Charge(Measure* measure, std::size_t bytes) {
  measure->content += bytes;
  if (measure->content > kMaxConfigBytes) XML_StopParser(measure->parser, XML_FALSE);
}

void XMLCALL OnStart(void* data, const XML_Char* name, const XML_Char** attributes) {
  Measure* measure = static_cast<Measure*>(data);
  std::size_t bytes = std::strlen(name) + 2;
  for (; *attributes; ++attributes) bytes += std::strlen(*attributes) + 1;
  Charge(measure, bytes);
  if (++measure->depth > kMaxConfigDepth) XML_StopParser(measure->parser, XML_FALSE);
}

void XMLCALL OnEnd(void* data, const XML_Char*) {
  --static_cast<Measure*>(data)->depth;
}

void XMLCALL OnText(void* data, const XML_Char*, int length) {
  Charge(static_cast<Measure*>(data), static_cast<std::size_t>(length));
}

// The tree reads a declared single-byte encoding that expat does not know
// through wx's table of it. Nesting depends only on the ASCII markup, so reading
// such bytes as Latin-1 lets this check see the structure the tree will have.
int XMLCALL OnUnknownEncoding(void*, const XML_Char*, XML_Encoding* info) {
  for (int i = 0; i < 256; ++i) info->map[i] = i;
  info->data = nullptr;
  info->convert = nullptr;
  info->release = nullptr;
  return XML_STATUS_OK;
}

// Whether a scan of the markup alone shows the bounds hold, so that the
// measuring parse can be spared; parsing twice was a tenth of the cost of a
// folder. It holds for a document without a DTD, comment, CDATA section or
// processing instruction (no "<!", and "<?" only for the XML declaration):
// there every '<' opens a tag, "</" closes one, nothing expands, and the
// count of open tags bounds the nesting. NUL bytes mean UTF-16, whose markup
// this byte scan cannot see, and expat's conversion at most doubles the
// bytes, hence half the size bound. Anything else takes the full check.
bool PlainlyWithinBounds(const std::string& bytes) {
  if (bytes.size() > kMaxConfigBytes / 2) return false;
  std::size_t i = bytes.compare(0, 3, "\xEF\xBB\xBF") == 0 ? 3 : 0;
  if (bytes.compare(i, 2, "<?") == 0) i += 2;
  int depth = 0;
  for (; i < bytes.size(); ++i) {
    char c = bytes[i];
    if (c == '\0') return false;
    if (c != '<') continue;
    char next = i + 1 < bytes.size() ? bytes[i + 1] : '\0';
    if (next == '!' || next == '?') return false;
    depth += next == '/' ? -1 : 1;
    if (depth < 0 || depth > kMaxConfigDepth) return false;
  }
  return true;
}

}  // namespace

bool XmlWithinBounds(const std::string& bytes) {
  XML_Parser parser = XML_ParserCreate(nullptr);
  if (!parser) return false;
  Measure measure{parser};
  XML_SetUserData(parser, &measure);
  XML_SetElementHandler(parser, OnStart, OnEnd);
  XML_SetCharacterDataHandler(parser, OnText);
  XML_SetUnknownEncodingHandler(parser, OnUnknownEncoding, nullptr);
  XML_Status status = XML_Parse(parser, bytes.data(), static_cast<int>(bytes.size()), XML_TRUE);
  XML_ParserFree(parser);
  return status == XML_STATUS_OK;
}

bool LoadFolderConfig(const wxString& windows_path, ConfigTree* tree) {
  std::string bytes;
  // Read as any program opening it by name would: through a link.
  if (platform::ReadRegularFile(windows_path.ToStdWstring(), kMaxConfigBytes, &bytes,
                                platform::Links::kFollowed) != platform::FileRead::kRead) {
    return false;
  }
  if (!PlainlyWithinBounds(bytes) && !XmlWithinBounds(bytes)) return false;
  // The conversion behind a declared encoding may log; the tool prints
  // nothing.
  wxLogNull quiet;
  return tree->Parse(bytes) && tree->Root() != ConfigTree::kNone;
}
