#include "engine/settings_map.h"

#include <algorithm>
#include <functional>
#include <initializer_list>
#include <string_view>

namespace {

// A cleared map keeps at most this many entries, and in them no string
// longer than this: a file with a huge section, or a huge value, is let go
// of once its folder is done rather than held for the rest of the run.
constexpr std::size_t kKeptEntries = 256;
constexpr std::size_t kKeptLength = 64;

constexpr std::size_t kFirstSlots = 16;

// The whole text, embedded NUL characters included.
std::wstring_view View(const wxString& text) {
  return std::wstring_view(text.wc_str(), text.length());
}

}  // namespace

std::size_t SettingsKey::HashOf(const wxString& text) {
  return std::hash<std::wstring_view>()(View(text));
}

std::size_t SettingsMap::SlotOf(const wxString& key, std::size_t hash) const {
  const std::size_t mask = slots_.size() - 1;
  const std::wstring_view wanted = View(key);
  for (std::size_t slot = hash & mask;; slot = (slot + 1) & mask) {
    const std::size_t held = slots_[slot];
    if (held == kFree) return slot;
    if (hashes_[held - 1] == hash && View(entries_[held - 1].first) == wanted) return slot;
  }
}

const wxString* SettingsMap::Find(const wxString& key, std::size_t hash) const {
  if (size_ == 0) return nullptr;
  const std::size_t held = slots_[SlotOf(key, hash)];
  return held == kFree ? nullptr : &entries_[held - 1].second;
}

wxString& SettingsMap::GetOrInsert(const wxString& key, std::size_t hash) {
  std::size_t slot = 0;
  if (!slots_.empty()) {
    slot = SlotOf(key, hash);
    if (slots_[slot] != kFree) return entries_[slots_[slot] - 1].second;
  }
  if (2 * (size_ + 1) > slots_.size()) {
    Grow();
    slot = SlotOf(key, hash);
  }
  if (size_ < entries_.size()) {
    entries_[size_].first = key;
    entries_[size_].second.clear();
    hashes_[size_] = hash;
  } else {
    entries_.emplace_back(key, wxString());
    hashes_.push_back(hash);
  }
  slots_[slot] = ++size_;
  return entries_[size_ - 1].second;
}

void SettingsMap::Grow() {
  slots_.assign(slots_.empty() ? kFirstSlots : 2 * slots_.size(), kFree);
  const std::size_t mask = slots_.size() - 1;
  for (std::size_t index = 0; index < size_; ++index) {
    std::size_t slot = hashes_[index] & mask;
    while (slots_[slot] != kFree) slot = (slot + 1) & mask;
    slots_[slot] = index + 1;
  }
}

void SettingsMap::Clear() {
  if (entries_.size() > kKeptEntries) {
    std::vector<Entry>().swap(entries_);
    std::vector<std::size_t>().swap(hashes_);
    std::vector<std::size_t>().swap(slots_);
    size_ = 0;
    return;
  }
  if (size_ == 0) return;
  std::fill(slots_.begin(), slots_.end(), kFree);
  for (std::size_t index = 0; index < size_; ++index) {
    for (wxString* text : {&entries_[index].first, &entries_[index].second}) {
      if (text->capacity() > kKeptLength) wxString().swap(*text);
    }
  }
  size_ = 0;
}
