// The settings map: wide key to wide value, keys compared exactly.
//
// Three operations and no others, each with a name that says what it does to
// the map, so a reader of a call site sees whether a read can insert:
//   GetOrInsert  yields the value, inserting the key with an empty value when
//                it is missing (later counts and iterations see the key);
//   Find         yields the value or null, never inserting;
//   iteration    visits every entry once, in the order the keys were first
//                inserted. That order is ours to choose; insertion order makes
//                every run, and every filter's "UI" element, come out the same.
#ifndef HF_ENGINE_SETTINGS_MAP_H_
#define HF_ENGINE_SETTINGS_MAP_H_

#include <wx/hashmap.h>
#include <wx/string.h>

#include <cstddef>
#include <unordered_map>
#include <utility>
#include <vector>

class SettingsMap {
 public:
  using Entry = std::pair<wxString, wxString>;
  using const_iterator = std::vector<Entry>::const_iterator;

  wxString& GetOrInsert(const wxString& key) {
    auto found = index_.find(key);
    if (found != index_.end()) return entries_[found->second].second;
    index_.emplace(key, entries_.size());
    entries_.emplace_back(key, wxString());
    return entries_.back().second;
  }

  const wxString* Find(const wxString& key) const {
    auto found = index_.find(key);
    return found == index_.end() ? nullptr : &entries_[found->second].second;
  }

  bool Contains(const wxString& key) const { return Find(key) != nullptr; }

  const_iterator begin() const { return entries_.begin(); }
  const_iterator end() const { return entries_.end(); }
  std::size_t Size() const { return entries_.size(); }
  bool Empty() const { return entries_.empty(); }

  void Clear() {
    entries_.clear();
    index_.clear();
  }

 private:
  std::vector<Entry> entries_;
  std::unordered_map<wxString, std::size_t, wxStringHash, wxStringEqual> index_;
};

#endif  // HF_ENGINE_SETTINGS_MAP_H_
