#include "engine/ascii_text.h"

#include <mutex>
#include <unordered_map>

// The run reads a folder on a second thread while the store commits the one
// before; the tables are shared by both.
namespace {
std::mutex g_tables;
}  // namespace

const wxString& TableText(const char* ascii) {
  static std::unordered_map<const char*, wxString> texts;
  std::lock_guard<std::mutex> lock(g_tables);
  auto found = texts.find(ascii);
  if (found == texts.end()) found = texts.emplace(ascii, AsciiText(ascii)).first;
  return found->second;
}

const SettingsKey& TableKey(const char* ascii) {
  static std::unordered_map<const char*, SettingsKey> keys;
  std::lock_guard<std::mutex> lock(g_tables);
  auto found = keys.find(ascii);
  if (found == keys.end()) found = keys.emplace(ascii, SettingsKey(AsciiText(ascii))).first;
  return found->second;
}
