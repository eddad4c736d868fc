#include "engine/ascii_text.h"

#include <unordered_map>

const wxString& TableText(const char* ascii) {
  static std::unordered_map<const char*, wxString> texts;
  auto found = texts.find(ascii);
  if (found == texts.end()) found = texts.emplace(ascii, AsciiText(ascii)).first;
  return found->second;
}

const SettingsKey& TableKey(const char* ascii) {
  static std::unordered_map<const char*, SettingsKey> keys;
  auto found = keys.find(ascii);
  if (found == keys.end()) found = keys.emplace(ascii, SettingsKey(AsciiText(ascii))).first;
  return found->second;
}
