// The six records a hot folder is registered with, and their entries.
// Members are in the store's order, with their construction values.
#ifndef HF_STORE_RECORDS_H_
#define HF_STORE_RECORDS_H_

#include <wx/string.h>
#include <wx/xml/xml.h>

#include <cstdint>
#include <map>
#include <optional>
#include <vector>

namespace db {

// Orders keys by their UTF-16 code units, as the store does on every host.
// wxString holds UTF-32 on POSIX hosts, where plain operator< would sort a
// character outside the Basic Multilingual Plane after U+E000..U+FFFF.
struct Utf16Less {
  bool operator()(const wxString& a, const wxString& b) const;
};

struct FilterEntry {
  wxString DisplayName;
  wxString Identifier;
};

struct JobSettingEntry {
  wxString Name;
  wxString Value;
  wxString Extra;
};

struct ImposeSettingEntry {
  wxString Name;
  wxString Value;
};

struct PreflightEntry {
  wxString First;
  wxString Second;
};

struct Setting {
  wxString Name;
  wxString String1;
  wxString ServerAddr;
  wxString ServerName;
  std::int32_t Number1 = -1;
  wxString Queue;
  wxString String2;
  wxString Queue2;
  bool Flag1 = false;
  std::vector<FilterEntry> Filters;
  bool Flag2 = false;
  bool Flag3 = false;
  std::optional<bool> Flag4;  // no construction value; the tool always sets it
  wxString String3;
  wxString FolderPath;
  wxString String4;
  wxString String5;
  wxString String6;
  wxString String7;
  wxString String8;
  bool Flag5 = false;
  bool Flag6 = false;
  wxString String9;
};

struct FolderConfiguration {
  wxString FailedFolder;
  wxString WorkFolder;
  wxString MoveFolder;
  wxString FolderPath;
};

// Ordered maps with unique keys: inserting a present key changes nothing.
using JobConfiguration = std::map<wxString, JobSettingEntry, Utf16Less>;
using ImposeConfiguration = std::map<wxString, ImposeSettingEntry, Utf16Less>;

// An element tree. Assigning an element makes a deep copy that the record
// owns; the tree it came from stays with its owner.
class FilterConfiguration : public wxXmlNode {
 public:
  FilterConfiguration() = default;
  FilterConfiguration& operator=(const wxXmlNode& element) {
    wxXmlNode::operator=(element);
    return *this;
  }
};

using PreflightConfiguration = std::vector<PreflightEntry>;

// The six records of one hot folder, as CreateHotFolder takes them.
struct HotFolderRecordSet {
  Setting setting;
  FolderConfiguration folder;
  JobConfiguration job;
  FilterConfiguration filter;
  ImposeConfiguration impose;
  PreflightConfiguration preflight;
};

}  // namespace db

#endif  // HF_STORE_RECORDS_H_
