#include "legacy/xml_load.h"

#include <expat.h>
#include <wx/log.h>
#include <wx/mstream.h>

#include <fstream>

#include "platform/platform.h"

namespace {

struct DepthCheck {
  XML_Parser parser;
  int depth = 0;
};

void XMLCALL OnStart(void* data, const XML_Char*, const XML_Char**) {
  DepthCheck* check = static_cast<DepthCheck*>(data);
  if (++check->depth > kMaxConfigDepth) XML_StopParser(check->parser, XML_FALSE);
}

void XMLCALL OnEnd(void* data, const XML_Char*) {
  --static_cast<DepthCheck*>(data)->depth;
}

// wx reads a declared single-byte encoding that expat does not know through
// a table of its own. Nesting depends only on the ASCII markup, so reading
// such bytes as Latin-1 lets this check see the structure wx will see.
int XMLCALL OnUnknownEncoding(void*, const XML_Char*, XML_Encoding* info) {
  for (int i = 0; i < 256; ++i) info->map[i] = i;
  info->data = nullptr;
  info->convert = nullptr;
  info->release = nullptr;
  return XML_STATUS_OK;
}

// Reads at most kMaxConfigBytes; one byte more means the file is too large.
bool ReadBounded(const platform::HostPath& path, std::string* bytes) {
  std::ifstream in(path, std::ios::binary);
  if (!in) return false;
  bytes->resize(kMaxConfigBytes + 1);
  in.read(bytes->data(), static_cast<std::streamsize>(bytes->size()));
  if (in.bad()) return false;
  bytes->resize(static_cast<std::size_t>(in.gcount()));
  return bytes->size() <= kMaxConfigBytes;
}

}  // namespace

bool XmlWithinBounds(const std::string& bytes) {
  XML_Parser parser = XML_ParserCreate(nullptr);
  if (!parser) return false;
  DepthCheck check{parser};
  XML_SetUserData(parser, &check);
  XML_SetElementHandler(parser, OnStart, OnEnd);
  XML_SetUnknownEncodingHandler(parser, OnUnknownEncoding, nullptr);
  XML_Status status = XML_Parse(parser, bytes.data(), static_cast<int>(bytes.size()), XML_TRUE);
  XML_ParserFree(parser);
  return status == XML_STATUS_OK;
}

bool LoadFolderConfig(const wxString& windows_path, wxXmlDocument* doc) {
  std::string bytes;
  if (!ReadBounded(platform::ToHostPath(windows_path.ToStdWstring()), &bytes)) return false;
  if (!XmlWithinBounds(bytes)) return false;
  // The tool prints nothing; wx would log a parse failure of its own.
  wxLogNull quiet;
  wxMemoryInputStream stream(bytes.data(), bytes.size());
  return doc->Load(stream, "UTF-8") && doc->GetRoot() != nullptr;
}
