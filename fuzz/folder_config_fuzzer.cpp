// One listed folder, whatever bytes its folder.cfg holds, through reading,
// conversion, registration and the real store. Settings directories that
// accumulated over years, some damaged, must neither crash the tool nor
// lose a folder's settings: they end up either registered and retired, or
// refused and back where a later run finds them.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <iterator>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include <wx/log.h>
#include <wx/mstream.h>
#include <wx/sstream.h>
#include <wx/xml/xml.h>

#include "engine/migrator.h"
#include "fuzz/fuzz_support.h"
#include "legacy/config_tree.h"
#include "legacy/xml_load.h"
#include "store/store.h"
#include "store/store_reader.h"
#include "tests/legacy_fixture.h"
#include "tests/snapshot.h"
#include "tests/temp_prefix.h"

namespace {

const char kFolder[] = "D:\\Jobs\\Fuzz";
const char kFolderOnD[] = "drive_d/Jobs/Fuzz";
const char kSettingsDir[] = "[_KYR_HotFolder_]";
const char kStoreDir[] = "drive_c/ProgramData/KYR/Dirorodiv";
const char kDamagedStore[] = "not a database\n";

// How the legacy folder is listed and what the store makes of it. Both
// follow the input's length, so that every input is tried in each of them
// as the fuzzer lengthens and shortens it.
struct Situation {
  bool enabled;  // listed with state 2
  bool refused;  // a damaged file sits where the store belongs
};

Situation SituationFor(std::size_t size) {
  return Situation{size % 2 == 0, size % 3 == 0};
}

// One prefix for the whole process: the C library keeps every distinct
// WINEPREFIX value it was ever given, so a prefix per input would grow the
// process with every run (and set off the leak check after each one).
const TempPrefix& Prefix() {
  static TempPrefix prefix;
  return prefix;
}

// The installation as the legacy service left it, the folder under test
// with a job waiting in it and a spool file beside folder.cfg; no store, or
// one the store refuses to write into.
void ResetInstallation(const TempPrefix& prefix, const std::string& config, Situation situation) {
  for (const char* dir : {kFolderOnD, kStoreDir}) {
    std::error_code ec;
    std::filesystem::remove_all(prefix.root() / dir, ec);
    FUZZ_CHECK(!ec);
  }
  WriteLegacyList(prefix, {{kFolder, static_cast<std::uint16_t>(situation.enabled ? 2 : 0)}});
  if (situation.refused) prefix.WriteFile(StoreHostPath(), kDamagedStore);
  std::filesystem::path folder = prefix.root() / kFolderOnD;
  prefix.WriteFile(folder / "incoming.pdf", "%PDF-1.4\n");
  prefix.WriteFile(folder / kSettingsDir / "folder.cfg", config);
  prefix.WriteFile(folder / kSettingsDir / "[WorkFolder]" / "job.ps", "%!PS\n");
}

bool IsFilterSettingXml(const wxString& text) {
  wxLogNull quiet;
  wxStringInputStream stream(text);
  wxXmlDocument doc;
  return doc.Load(stream) && doc.GetRoot() && doc.GetRoot()->GetName() == "FilterSetting";
}

// How deep the elements of a loaded tree nest, counted without recursion so
// that the count itself cannot overflow the stack.
int Depth(const ConfigTree& tree) {
  int deepest = 0;
  int depth = 1;
  for (ConfigTree::Id node = tree.Root(); node != ConfigTree::kNone;) {
    if (tree.GetType(node) == ConfigTree::Type::kElement) deepest = std::max(deepest, depth);
    if (tree.FirstChild(node) != ConfigTree::kNone) {
      node = tree.FirstChild(node);
      ++depth;
      continue;
    }
    for (; node != ConfigTree::kNone && tree.Next(node) == ConfigTree::kNone; --depth)
      node = tree.Parent(node);
    if (node != ConfigTree::kNone) node = tree.Next(node);
  }
  return deepest;
}

// A document the reader accepts nests within the bound.
void CheckLoadBounds() {
  ConfigTree tree;
  if (!LoadFolderConfig(wxString(kFolder) + "\\" + kSettingsDir + "\\folder.cfg", &tree)) return;
  FUZZ_CHECK(Depth(tree) <= kMaxConfigDepth);
}

const std::pair<wxXmlNodeType, ConfigTree::Type> kNodeTypes[] = {
    {wxXML_ELEMENT_NODE, ConfigTree::Type::kElement},
    {wxXML_TEXT_NODE, ConfigTree::Type::kText},
    {wxXML_CDATA_SECTION_NODE, ConfigTree::Type::kCdata},
    {wxXML_COMMENT_NODE, ConfigTree::Type::kComment},
    {wxXML_PI_NODE, ConfigTree::Type::kPi}};

wxString Wide(std::string_view utf8) {
  return utf8.empty() ? wxString() : wxString::FromUTF8Unchecked(utf8.data(), utf8.size());
}

// Of the names, only an element's and a processing instruction's target
// mean something; wx calls the others "text", "cdata" and "comment".
bool SameNode(const wxXmlNode* node, const ConfigTree& tree, ConfigTree::Id id) {
  auto row = std::find_if(std::begin(kNodeTypes), std::end(kNodeTypes),
                          [&](const auto& type) { return type.first == node->GetType(); });
  if (row == std::end(kNodeTypes) || row->second != tree.GetType(id)) return false;
  const bool named =
      row->second == ConfigTree::Type::kElement || row->second == ConfigTree::Type::kPi;
  return (named ? node->GetName() : wxString()) == Wide(tree.Name(id)) &&
         node->GetContent() == Wide(tree.Content(id));
}

// The tree the reader works on is the one wx builds from the same bytes,
// less the text nodes that are blank as a whole: the same nodes, kinds,
// names and texts, linked the same way. Only documents within the bounds
// are given to wx, which builds and frees its tree by recursion.
void CheckTreeAsWxBuildsIt(const std::string& bytes) {
  if (!XmlWithinBounds(bytes)) return;
  wxLogNull quiet;
  wxMemoryInputStream stream(bytes.data(), bytes.size());
  wxXmlDocument doc;
  ConfigTree tree;
  const bool loaded = doc.Load(stream, "UTF-8", wxXMLDOC_KEEP_WHITESPACE_NODES);
  FUZZ_CHECK(tree.Parse(bytes) == loaded);
  if (!loaded) return;
  std::vector<std::pair<const wxXmlNode*, ConfigTree::Id>> pending{
      {doc.GetDocumentNode(), ConfigTree::kDocument}};
  while (!pending.empty()) {
    const auto [parent, parent_id] = pending.back();
    pending.pop_back();
    ConfigTree::Id id = tree.FirstChild(parent_id);
    for (const wxXmlNode* node = parent->GetChildren(); node; node = node->GetNext()) {
      if (node->GetType() == wxXML_TEXT_NODE && node->IsWhitespaceOnly()) continue;
      FUZZ_CHECK(id != ConfigTree::kNone && tree.Parent(id) == parent_id);
      FUZZ_CHECK(SameNode(node, tree, id));
      if (node == doc.GetRoot()) FUZZ_CHECK(id == tree.Root());
      pending.push_back({node, id});
      id = tree.Next(id);
    }
    FUZZ_CHECK(id == ConfigTree::kNone);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const TempPrefix& prefix = Prefix();
  const Situation situation = SituationFor(size);
  ResetInstallation(prefix, InputBytes(data, size), situation);
  bool whole = false;
  const Tree before = Without(Snapshot(prefix.root(), &whole), kStoreDir);
  FUZZ_CHECK(whole);
  CheckLoadBounds();
  CheckTreeAsWxBuildsIt(InputBytes(data, size));

  CHFMigrator engine;
  // The server's directory is found among the running processes; it does
  // not depend on the input, so the scan is left out.
  engine.m_ServerDirectory = wxString("C:\\Program Files\\KYR\\HotFolder");
  FUZZ_CHECK(engine.ReadLegacyList());
  engine.MigrateFolders();

  FUZZ_CHECK(engine.m_Status.size() == 1);
  const bool success = engine.m_Status[0] == "Success";
  FUZZ_CHECK(success || engine.m_Status[0] == "Unknown error");

  // Nothing but the store changed, or the settings directory was retired
  // whole.
  const Tree after = Without(Snapshot(prefix.root(), &whole), kStoreDir);
  FUZZ_CHECK(whole);
  const bool kept = after == before;
  FUZZ_CHECK(kept || after == Retired(before, {std::string(kFolderOnD) + "/" + kSettingsDir}));

  // A refused folder keeps its settings where a later run finds them, and
  // the store writes nothing into a file it does not know.
  if (situation.refused) {
    FUZZ_CHECK(!success);
    FUZZ_CHECK(kept);
    FUZZ_CHECK(TempPrefix::ReadFile(StoreHostPath()) == kDamagedStore);
    RODuriZudaze::GetInstance().Close();
    return 0;
  }

  // Otherwise the folder is registered, as it was listed, with a filter
  // tree that reads back. A disabled folder may still fail after it was
  // created, when it cannot be disabled; it then stays as it is.
  std::vector<StoredHotFolder> stored;  // read back as the inspector reads it
  wxString error;
  FUZZ_CHECK(!std::filesystem::exists(StoreHostPath()) ||
             ReadStore(StoreHostPath(), &stored, &error));
  FUZZ_CHECK(stored.size() <= 1);
  if (success) {
    FUZZ_CHECK(stored.size() == 1);
    FUZZ_CHECK(stored[0].enabled == situation.enabled);
    FUZZ_CHECK(IsFilterSettingXml(stored[0].filterConfiguration));
  } else if (situation.enabled) {
    FUZZ_CHECK(stored.empty());
    FUZZ_CHECK(kept);
  }
  // The next input starts from a closed store, and the check for leaks
  // after each input sees only what really leaked.
  RODuriZudaze::GetInstance().Close();
  return 0;
}
