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
//
// Every folder fills the same maps with much the same keys, so a cleared
// map keeps its entries' strings and fills them again, and the keys of the
// conversion tables come with their hash (SettingsKey): a folder's settings
// cost no allocation and no hashing beyond what its own file brings.
#ifndef HF_ENGINE_SETTINGS_MAP_H_
#define HF_ENGINE_SETTINGS_MAP_H_

#include <wx/string.h>

#include <cstddef>
#include <utility>
#include <vector>

// A key with its hash, for keys looked up once per folder or more: the
// conversion tables' keys, made once per run.
class SettingsKey {
 public:
  explicit SettingsKey(const wxString& text) : text_(text), hash_(HashOf(text)) {}

  const wxString& Text() const { return text_; }
  std::size_t Hash() const { return hash_; }

  // The hash of any key: every character takes part, so keys that differ
  // anywhere spread over the map, however many a file holds.
  static std::size_t HashOf(const wxString& text);

 private:
  wxString text_;
  std::size_t hash_;
};

class SettingsMap {
 public:
  using Entry = std::pair<wxString, wxString>;
  using const_iterator = std::vector<Entry>::const_iterator;

  wxString& GetOrInsert(const wxString& key) { return GetOrInsert(key, SettingsKey::HashOf(key)); }
  wxString& GetOrInsert(const SettingsKey& key) { return GetOrInsert(key.Text(), key.Hash()); }

  const wxString* Find(const wxString& key) const { return Find(key, SettingsKey::HashOf(key)); }
  const wxString* Find(const SettingsKey& key) const { return Find(key.Text(), key.Hash()); }

  bool Contains(const wxString& key) const { return Find(key) != nullptr; }

  const_iterator begin() const { return entries_.begin(); }
  const_iterator end() const { return entries_.begin() + static_cast<std::ptrdiff_t>(size_); }
  std::size_t Size() const { return size_; }
  bool Empty() const { return size_ == 0; }

  void Clear();

 private:
  static constexpr std::size_t kFree = 0;

  wxString& GetOrInsert(const wxString& key, std::size_t hash);
  const wxString* Find(const wxString& key, std::size_t hash) const;
  // The slot that holds `key`, or the free slot where it belongs.
  std::size_t SlotOf(const wxString& key, std::size_t hash) const;
  void Grow();

  // [0, size_) are the map's entries in insertion order; the ones after are
  // kept from before the last Clear, for their strings.
  std::vector<Entry> entries_;
  std::vector<std::size_t> hashes_;  // of each entry's key, beside entries_
  std::size_t size_ = 0;
  // Open addressing with linear probing, at most half full: each slot holds
  // an entry's index + 1, or kFree. Its size is a power of two or zero.
  std::vector<std::size_t> slots_;
};

#endif  // HF_ENGINE_SETTINGS_MAP_H_
