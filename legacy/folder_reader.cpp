// The legacy folder.cfg: sections of settings, and one container per legacy
// filter holding its identifier (first child), its settings section and its
// enable text (inside the third child).
#include "legacy/folder_reader.h"

#include <algorithm>
#include <cstdint>
#include <vector>

#include "engine/legacy_filters.h"
#include "engine/numbers.h"
#include "legacy/xml_load.h"
#include "platform/platform.h"

namespace {

// Names are wide, as the document's are: a narrow literal would pass through
// the C library's multibyte conversion on every search, for every folder.
struct Section {
  const wchar_t* name;
  SettingsMember map;
};

const Section kLeadingSections[] = {
    {L"FolderSettings", &CHFMigrator::m_FolderSettings},
    {L"FILTERSETTINGS", &CHFMigrator::m_FilterSettings},
};

const Section kDriverSections[] = {
    {L"DriverSettings", &CHFMigrator::m_DriverSettings},
    {L"ImpositionProperties", &CHFMigrator::m_ImpositionProperties},
    {L"ImposeDeliveryInfo", &CHFMigrator::m_ImposeDeliveryInfo},
};

// Imposition sections whose nested parts are flattened into one map.
const Section kImposeSections[] = {
    {L"ImposeInfo", &CHFMigrator::m_ImposeInfo},
    {L"ImposeInfoVDP", &CHFMigrator::m_ImposeInfoVDP},
};
const wchar_t* const kImposeParts[] = {L"Layout", L"SheetSize", L"SheetMargin", L"PaperSize",
                                       L"PrinterMarks"};

// Comments and processing instructions do not count where a node is located
// by position: a note added to a folder.cfg by hand must not shift which
// child is taken as a container's identifier or enable text.
const wxXmlNode* NthChild(const wxXmlNode* node, int n) {
  for (const wxXmlNode* child = node->GetChildren(); child; child = child->GetNext()) {
    wxXmlNodeType type = child->GetType();
    if (type == wxXML_COMMENT_NODE || type == wxXML_PI_NODE) continue;
    if (n-- == 0) return child;
  }
  return nullptr;
}

// A container's enable text is the text inside its third child. False when
// the container is too small to hold one.
bool ContainerEnableText(const wxXmlNode* container, wxString* text) {
  const wxXmlNode* third = container ? NthChild(container, 2) : nullptr;
  const wxXmlNode* holder = third ? NthChild(third, 0) : nullptr;
  if (!holder) return false;
  *text = holder->GetContent();
  return true;
}

bool Matches(const LegacyIdentifier* ids, const wxString& identifier, const wxString& trimmed) {
  for (; ids && ids->text; ++ids) {
    if ((ids->trim_trailing_space ? trimmed : identifier) == ids->text) return true;
  }
  return false;
}

// The index of the filter known by `identifier`, or the table's size.
std::size_t IdentifyFilter(const wxString& identifier) {
  wxString trimmed = wxString(identifier).Trim(true);
  std::size_t i = 0;
  while (i < kLegacyFilters.size() && !Matches(kLegacyFilters[i].legacy_ids, identifier, trimmed))
    ++i;
  return i;
}

wxString Flag(bool on) {
  return on ? wxS("1") : wxS("0");
}

// Each filter's entry gets the enable text of its own container, or an empty
// text when it has none; a text taken for another filter could switch on a
// filter the folder does not have.
void ReadFilterSections(CHFMigrator& engine, wxXmlNode* root) {
  for (const LegacyFilter& filter : kLegacyFilters) {
    if (filter.enabled_by != EnabledBy::kSection) continue;
    wxXmlNode* section = FindElement(root, filter.key);
    ReadSection(section, engine.*filter.legacy);
    wxString enable;
    if (section) ContainerEnableText(section->GetParent(), &enable);
    engine.m_FilterEnable.GetOrInsert(filter.key) = enable;
  }
}

// The containers without a settings section are known by identifier only.
void ReadFilterContainers(CHFMigrator& engine, wxXmlNode* root) {
  // A sum of 32-bit terms cannot overflow these.
  std::vector<std::int64_t> counts(kLegacyFilters.size(), 0);
  for (const wxXmlNode* node = FindElement(root, wxS("FILTERID")); node; node = node->GetNext()) {
    const wxXmlNode* first = NthChild(node, 0);
    wxString enable;
    if (!first || !ContainerEnableText(node, &enable)) continue;
    std::size_t i = IdentifyFilter(first->GetContent());
    if (i == kLegacyFilters.size()) continue;
    if (kLegacyFilters[i].enabled_by == EnabledBy::kCount) {
      counts[i] += ReadInt32(enable);  // no leading number counts 0
    } else {
      engine.m_FilterEnable.GetOrInsert(kLegacyFilters[i].key) = Flag(enable == wxS("1"));
    }
  }
  for (std::size_t i = 0; i < kLegacyFilters.size(); ++i) {
    if (kLegacyFilters[i].enabled_by != EnabledBy::kCount) continue;
    engine.m_FilterEnable.GetOrInsert(kLegacyFilters[i].key) = Flag(counts[i] > 0);
  }
}

void ReadImposeSection(wxXmlNode* root, const wchar_t* name, SettingsMap& map) {
  wxXmlNode* section = FindElement(root, name);
  if (!section) return;
  ReadSection(section, map);
  for (const wxXmlNode* child = section->GetChildren(); child; child = child->GetNext()) {
    if (child->GetType() != wxXML_ELEMENT_NODE) continue;
    for (const wchar_t* part : kImposeParts) {
      if (child->GetName() == part) ReadSection(child, map);
    }
  }
}

void ReadDocument(CHFMigrator& engine, wxXmlNode* root) {
  for (const Section& section : kLeadingSections) {
    ReadSection(FindElement(root, section.name), engine.*section.map);
  }
  ReadFilterSections(engine, root);
  ReadFilterContainers(engine, root);
  for (const Section& section : kDriverSections) {
    ReadSection(FindElement(root, section.name), engine.*section.map);
  }
  for (const Section& section : kImposeSections) {
    ReadImposeSection(root, section.name, engine.*section.map);
  }
}

bool MatchesElement(const wxXmlNode* node, const wxString& name) {
  return node->GetType() == wxXML_ELEMENT_NODE && node->GetName() == name;
}

}  // namespace

// Depth-first with an explicit stack, so that no document can exhaust the
// call stack. A node's direct children are all checked before any subtree is
// entered, and subtrees are entered in document order.
wxXmlNode* FindElement(wxXmlNode* start, const wxString& name) {
  std::vector<wxXmlNode*> pending;
  if (start) pending.push_back(start);
  while (!pending.empty()) {
    wxXmlNode* node = pending.back();
    pending.pop_back();
    std::size_t first_subtree = pending.size();
    for (wxXmlNode* child = node->GetChildren(); child; child = child->GetNext()) {
      if (MatchesElement(child, name)) return child;
      if (child->GetType() == wxXML_ELEMENT_NODE) pending.push_back(child);
    }
    // Pushed in document order; reversed so the first subtree is taken next.
    std::reverse(pending.begin() + first_subtree, pending.end());
  }
  return nullptr;
}

void ReadSection(const wxXmlNode* section, SettingsMap& map) {
  if (!section) return;
  for (const wxXmlNode* child = section->GetChildren(); child; child = child->GetNext()) {
    const wxXmlNode* first = NthChild(child, 0);
    if (first && !first->GetContent().empty())
      map.GetOrInsert(child->GetName()) = first->GetContent();
  }
}

bool ReadFolderConfiguration(CHFMigrator& engine, std::size_t index) {
  if (index >= engine.m_Folders.size()) return false;
  const wxString& folder = engine.m_Folders[index];
  wxString config = folder + wxS("\\[_KYR_HotFolder_]\\folder.cfg");
  if (!platform::FileExists(config.ToStdWstring())) return false;

  engine.ClearSettingsMaps();
  engine.m_FolderSettings.GetOrInsert(wxS("HFFolderPath")) = folder;
  wxXmlDocument doc;
  if (LoadFolderConfig(config, &doc)) ReadDocument(engine, doc.GetRoot());

  bool listed_disabled =
      index < engine.m_EnabledFlags.size() && engine.m_EnabledFlags[index] == wxS("0");
  engine.m_CurrentEnabled = !listed_disabled;
  return true;
}
