// The legacy folder.cfg: sections of settings, and one container per legacy
// filter holding its identifier (first child), its settings section and its
// enable text (inside the third child).
#include "legacy/folder_reader.h"

#include <algorithm>
#include <cstdint>
#include <vector>

#include "convert/numbers.h"
#include "legacy/xml_load.h"
#include "platform/platform.h"

namespace {

using MapMember = SettingsMap CHFMigrator::*;

// Names are wide, as the document's are: a narrow literal would pass through
// the C library's multibyte conversion on every search, for every folder.
struct Section {
  const wchar_t* name;
  MapMember map;
};

const Section kLeadingSections[] = {
    {L"FolderSettings", &CHFMigrator::m_FolderSettings},
    {L"FILTERSETTINGS", &CHFMigrator::m_FilterSettings},
};

// The filters with a settings section of their own; each also names its
// entry in the filter-enable map.
const Section kFilterSections[] = {
    {L"ONEBITTIFF", &CHFMigrator::m_OneBitTiff}, {L"CTLWFILTER", &CHFMigrator::m_CtlwFilter},
    {L"DCS2FILTER", &CHFMigrator::m_Dcs2Filter}, {L"EPS2PSFILTER", &CHFMigrator::m_Eps2PsFilter},
    {L"EXPORTPS", &CHFMigrator::m_ExportPs},     {L"JPEG2PDF", &CHFMigrator::m_Jpeg2Pdf},
    {L"PDF2GO", &CHFMigrator::m_Pdf2Go},         {L"PEXFILTER", &CHFMigrator::m_PexFilter},
    {L"TIFF2PDF", &CHFMigrator::m_Tiff2Pdf},     {L"TIFFITFILTER", &CHFMigrator::m_TiffItFilter},
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

enum class LegacyFilter { kOffice, kPdf2Ps, kXrx };

struct KnownIdentifier {
  const wchar_t* text;
  bool trim_trailing_space;  // compare after trailing white space is removed
  LegacyFilter filter;
};

// The identifiers are compared exactly, trailing line feed included.
const KnownIdentifier kKnownIdentifiers[] = {
    {L"{8530FDC1-4FBB-4BD3-A116-33186DE16718}\n", false, LegacyFilter::kOffice},
    {L"{728E7740-D6A7-4D5D-8A68-98DDF21E4132}\n", false, LegacyFilter::kOffice},
    {L"{AE31FFA3-8524-4734-B35D-E6DB6FE9A371}\n", false, LegacyFilter::kOffice},
    {L"{68FC3B4A-62B7-11D6-99CD-00E08101E712}\n", false, LegacyFilter::kOffice},
    {L"{CDD70909-DACE-499B-9186-B6088CD46376}\n", false, LegacyFilter::kPdf2Ps},
    {L"{02AC69D4-CAEE-47E1-912E-95B0C9E8D86A}\n", false, LegacyFilter::kXrx},
    {L"63EE9F15-C7B1-43C8-9958-E9EFE972EA00", true, LegacyFilter::kXrx},
};

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

const LegacyFilter* IdentifyFilter(const wxString& identifier) {
  wxString trimmed = wxString(identifier).Trim(true);
  for (const KnownIdentifier& known : kKnownIdentifiers) {
    if ((known.trim_trailing_space ? trimmed : identifier) == known.text) return &known.filter;
  }
  return nullptr;
}

wxString Flag(bool on) {
  return on ? wxS("1") : wxS("0");
}

// Each filter's entry gets the enable text of its own container, or an empty
// text when it has none; a text taken for another filter could switch on a
// filter the folder does not have.
void ReadFilterSections(CHFMigrator& engine, wxXmlNode* root) {
  for (const Section& filter : kFilterSections) {
    wxXmlNode* section = FindElement(root, filter.name);
    ReadSection(section, engine.*filter.map);
    wxString enable;
    if (section) ContainerEnableText(section->GetParent(), &enable);
    engine.m_FilterEnable.GetOrInsert(filter.name) = enable;
  }
}

// The containers without a settings section are known by identifier only.
void ReadFilterContainers(CHFMigrator& engine, wxXmlNode* root) {
  std::int64_t office_count = 0;  // a sum of 32-bit terms cannot overflow it
  for (const wxXmlNode* node = FindElement(root, wxS("FILTERID")); node; node = node->GetNext()) {
    const wxXmlNode* first = NthChild(node, 0);
    wxString enable;
    if (!first || !ContainerEnableText(node, &enable)) continue;
    const LegacyFilter* filter = IdentifyFilter(first->GetContent());
    if (!filter) continue;
    switch (*filter) {
      case LegacyFilter::kOffice:
        office_count += ReadInt32(enable);  // no leading number counts 0
        break;
      case LegacyFilter::kPdf2Ps:
        engine.m_FilterEnable.GetOrInsert(wxS("PDF2PS")) = Flag(enable == wxS("1"));
        break;
      case LegacyFilter::kXrx:
        engine.m_FilterEnable.GetOrInsert(wxS("XRX")) = Flag(enable == wxS("1"));
        break;
    }
  }
  engine.m_FilterEnable.GetOrInsert(wxS("MICROSOFT")) = Flag(office_count > 0);
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

void CHFMigrator::MigrateFolders() {
  // One outcome per folder: room for all of them at once, rather than
  // copies of every outcome so far each time the list grows.
  m_Status.Alloc(m_Status.size() + m_Folders.size());
  for (std::size_t i = 0; i < m_Folders.size(); ++i) {
    if (!ReadFolderConfiguration(*this, i)) {
      m_Status.Add("Failed; File missing");
      continue;
    }
    m_Status.Add(ConvertFilterSettings() ? "Success" : "Unknown error");
  }
}
