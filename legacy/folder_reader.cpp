// The legacy folder.cfg: sections of settings, and one container per legacy
// filter holding its identifier (first child), its settings section and its
// enable text (inside the third child).
#include "legacy/folder_reader.h"

#include <cstdint>
#include <cwchar>
#include <iterator>
#include <string_view>
#include <vector>

#include "engine/legacy_filters.h"
#include "engine/numbers.h"
#include "legacy/xml_load.h"
#include "platform/platform.h"

namespace {

// Names are wide, as the filter table's keys are.
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

using Id = ConfigTree::Id;
using Type = ConfigTree::Type;
constexpr Id kNone = ConfigTree::kNone;

// The names looked for are ASCII, so comparing their characters with the
// bytes of a UTF-8 name matches exactly the names that are equal as wide
// strings, without converting any. `ascii_size` is wcslen(ascii).
bool NameIs(std::string_view utf8, const wchar_t* ascii, std::size_t ascii_size) {
  if (utf8.size() != ascii_size) return false;
  for (std::size_t i = 0; i < ascii_size; ++i) {
    if (static_cast<wchar_t>(static_cast<unsigned char>(utf8[i])) != ascii[i]) return false;
  }
  return true;
}

// Only what the maps keep, or what a number is read from, is made wide, as
// wx made its strings from expat's UTF-8 (on Windows a character beyond
// 16 bits becomes a surrogate pair). Most texts are short and ASCII, and
// are widened byte for byte, which is what the conversion gives them. An
// empty slice is not converted: wx would take the character after it for
// the start of a string that failed to convert, and assert.
wxString Wide(std::string_view utf8) {
  wchar_t ascii[128];
  if (utf8.size() <= std::size(ascii)) {
    std::size_t i = 0;
    for (; i < utf8.size() && static_cast<unsigned char>(utf8[i]) < 0x80; ++i) ascii[i] = utf8[i];
    if (i == utf8.size()) return wxString(ascii, i);
  }
  return wxString::FromUTF8Unchecked(utf8.data(), utf8.size());
}

// Comments and processing instructions do not count where a node is located
// by position: a note added to a folder.cfg by hand must not shift which
// child is taken as a container's identifier or enable text.
Id NthChild(const ConfigTree& tree, Id node, int n) {
  for (Id child = tree.FirstChild(node); child != kNone; child = tree.Next(child)) {
    Type type = tree.GetType(child);
    if (type == Type::kComment || type == Type::kPi) continue;
    if (n-- == 0) return child;
  }
  return kNone;
}

// A container's enable text is the text inside its third child. False when
// the container is too small to hold one.
bool ContainerEnableText(const ConfigTree& tree, Id container, std::string_view* text) {
  Id third = container != kNone ? NthChild(tree, container, 2) : kNone;
  Id holder = third != kNone ? NthChild(tree, third, 0) : kNone;
  if (holder == kNone) return false;
  *text = tree.Content(holder);
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
void ReadFilterSections(CHFMigrator& engine, const ConfigTree& tree, Id root) {
  for (const LegacyFilter& filter : kLegacyFilters) {
    if (filter.enabled_by != EnabledBy::kSection) continue;
    Id section = FindElement(tree, root, filter.key);
    ReadSection(tree, section, engine.*filter.legacy);
    std::string_view enable;
    if (section != kNone) ContainerEnableText(tree, tree.Parent(section), &enable);
    engine.m_FilterEnable.GetOrInsert(filter.key) = Wide(enable);
  }
}

// The containers without a settings section are known by identifier only.
void ReadFilterContainers(CHFMigrator& engine, const ConfigTree& tree, Id root) {
  // A sum of 32-bit terms cannot overflow these.
  std::vector<std::int64_t> counts(kLegacyFilters.size(), 0);
  for (Id node = FindElement(tree, root, L"FILTERID"); node != kNone; node = tree.Next(node)) {
    Id first = NthChild(tree, node, 0);
    std::string_view enable;
    if (first == kNone || !ContainerEnableText(tree, node, &enable)) continue;
    std::size_t i = IdentifyFilter(Wide(tree.Content(first)));
    if (i == kLegacyFilters.size()) continue;
    if (kLegacyFilters[i].enabled_by == EnabledBy::kCount) {
      counts[i] += ReadInt32(Wide(enable));  // no leading number counts 0
    } else {
      engine.m_FilterEnable.GetOrInsert(kLegacyFilters[i].key) = Flag(enable == "1");
    }
  }
  for (std::size_t i = 0; i < kLegacyFilters.size(); ++i) {
    if (kLegacyFilters[i].enabled_by != EnabledBy::kCount) continue;
    engine.m_FilterEnable.GetOrInsert(kLegacyFilters[i].key) = Flag(counts[i] > 0);
  }
}

void ReadImposeSection(const ConfigTree& tree, Id root, const wchar_t* name, SettingsMap& map) {
  Id section = FindElement(tree, root, name);
  if (section == kNone) return;
  ReadSection(tree, section, map);
  for (Id child = tree.FirstChild(section); child != kNone; child = tree.Next(child)) {
    if (tree.GetType(child) != Type::kElement) continue;
    for (const wchar_t* part : kImposeParts) {
      if (NameIs(tree.Name(child), part, std::wcslen(part))) ReadSection(tree, child, map);
    }
  }
}

void ReadDocument(CHFMigrator& engine, const ConfigTree& tree, Id root) {
  for (const Section& section : kLeadingSections) {
    ReadSection(tree, FindElement(tree, root, section.name), engine.*section.map);
  }
  ReadFilterSections(engine, tree, root);
  ReadFilterContainers(engine, tree, root);
  for (const Section& section : kDriverSections) {
    ReadSection(tree, FindElement(tree, root, section.name), engine.*section.map);
  }
  for (const Section& section : kImposeSections) {
    ReadImposeSection(tree, root, section.name, engine.*section.map);
  }
}

Id NextElement(const ConfigTree& tree, Id node) {
  while (node != kNone && tree.GetType(node) != Type::kElement) node = tree.Next(node);
  return node;
}

}  // namespace

// Depth-first, back up by the parent links: no stack of its own to fill,
// and no call stack a document could exhaust. A node's direct children are
// all checked before any subtree is entered, and subtrees are entered in
// document order.
Id FindElement(const ConfigTree& tree, Id start, const wchar_t* name) {
  if (start == kNone) return kNone;
  const std::size_t name_size = std::wcslen(name);
  Id node = start;
  for (;;) {
    for (Id child = tree.FirstChild(node); child != kNone; child = tree.Next(child)) {
      if (tree.GetType(child) == Type::kElement && NameIs(tree.Name(child), name, name_size))
        return child;
    }
    Id below = NextElement(tree, tree.FirstChild(node));
    if (below != kNone) {
      node = below;
      continue;
    }
    // No match in this subtree: on to the next element after it, on the
    // nearest level up that has one, until the search is back at `start`.
    for (;;) {
      if (node == start) return kNone;
      Id next = NextElement(tree, tree.Next(node));
      if (next != kNone) {
        node = next;
        break;
      }
      node = tree.Parent(node);
    }
  }
}

void ReadSection(const ConfigTree& tree, Id section, SettingsMap& map) {
  if (section == kNone) return;
  for (Id child = tree.FirstChild(section); child != kNone; child = tree.Next(child)) {
    Id first = NthChild(tree, child, 0);
    if (first != kNone && !tree.Content(first).empty())
      map.GetOrInsert(Wide(tree.Name(child))) = Wide(tree.Content(first));
  }
}

bool ReadFolderConfiguration(CHFMigrator& engine, std::size_t index) {
  if (index >= engine.m_Folders.size()) return false;
  const wxString& folder = engine.m_Folders[index];
  wxString config = folder + wxS("\\[_KYR_HotFolder_]\\folder.cfg");
  if (!platform::FileExists(config.ToStdWstring())) return false;

  engine.ClearSettingsMaps();
  engine.m_FolderSettings.GetOrInsert(wxS("HFFolderPath")) = folder;
  ConfigTree tree;
  if (LoadFolderConfig(config, &tree)) ReadDocument(engine, tree, tree.Root());

  bool listed_disabled =
      index < engine.m_EnabledFlags.size() && engine.m_EnabledFlags[index] == wxS("0");
  engine.m_CurrentEnabled = !listed_disabled;
  return true;
}
