// HKEY_LOCAL_MACHINE on a POSIX host is Wine's text hive
// "<prefix>/system.reg". A key opens when the hive has a section for it or
// for a key below it (Wine writes only the keys that hold values, so a
// parent may have no section of its own).
//
// Section lines look like
//   [Software\\Wow6432Node\\Vendor\\App\\3.0] 1700000000
// with backslashes doubled, "[" and "]" in names escaped with a backslash,
// and other characters outside printable ASCII written as \x followed by up
// to four hex digits.
#include <cstdlib>
#include <fstream>
#include <mutex>
#include <string>

#include "platform/platform.h"
#include "platform/posix_internal.h"

namespace platform {
namespace {

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

// Joins UTF-16 surrogate pairs of escaped characters into code points.
std::wstring JoinSurrogates(const std::wstring& units) {
  std::wstring joined;
  for (size_t i = 0; i < units.size(); ++i) {
    const wchar_t c = units[i];
    if (c >= 0xD800 && c <= 0xDBFF && i + 1 < units.size() && units[i + 1] >= 0xDC00 &&
        units[i + 1] <= 0xDFFF) {
      joined.push_back(
          static_cast<wchar_t>(0x10000 + ((c - 0xD800) << 10) + (units[i + 1] - 0xDC00)));
      ++i;
    } else {
      joined.push_back(c);
    }
  }
  return joined;
}

// The key name of a section line; false for any other line and for a
// section line that does not close.
bool ParseSectionName(const std::string& line, std::wstring* name) {
  if (line.empty() || line[0] != '[') return false;
  std::wstring units;
  for (size_t i = 1; i < line.size(); ++i) {
    const char c = line[i];
    if (c == ']') {
      *name = JoinSurrogates(units);
      return true;
    }
    if (c != '\\' || i + 1 == line.size()) {
      units.push_back(static_cast<wchar_t>(static_cast<unsigned char>(c)));
      continue;
    }
    const char escaped = line[++i];
    if (escaped != 'x') {
      units.push_back(static_cast<wchar_t>(static_cast<unsigned char>(escaped)));
      continue;
    }
    int value = 0;
    int digits = 0;
    while (digits < 4 && i + 1 < line.size() && HexValue(line[i + 1]) >= 0) {
      value = value * 16 + HexValue(line[++i]);
      ++digits;
    }
    units.push_back(digits == 0 ? L'x' : static_cast<wchar_t>(value));
  }
  return false;
}

// Whether a section for `section` means that `key` exists: the same key or
// one below it, ignoring case. "App\3.01" is not below "App\3.0".
bool OpensKey(const std::wstring& section, const std::wstring& key) {
  if (section.size() < key.size()) return false;
  if (section.size() > key.size() && section[key.size()] != L'\\') return false;
  return posix::EqualIgnoringCase(section.substr(0, key.size()), key);
}

}  // namespace

namespace posix {

unsigned PrefixAnsiCodePage() {
  static std::mutex guard;
  static std::string read_for;
  static unsigned code_page = 0;
  const std::lock_guard<std::mutex> lock(guard);
  const std::string prefix = PrefixDirectory();
  if (prefix == read_for) return code_page;
  read_for = prefix;
  code_page = 0;
  std::ifstream hive(prefix + "/system.reg", std::ios::binary);
  const std::wstring key = L"System\\CurrentControlSet\\Control\\Nls\\CodePage";
  std::string line;
  std::wstring section;
  bool inside = false;
  while (!prefix.empty() && std::getline(hive, line)) {
    if (ParseSectionName(line, &section)) {
      inside = section.size() == key.size() && OpensKey(section, key);
    } else if (inside && line.rfind("\"ACP\"=\"", 0) == 0) {
      code_page = static_cast<unsigned>(std::strtoul(line.c_str() + 7, nullptr, 10));
      break;
    }
  }
  return code_page;
}

}  // namespace posix

bool HklmKeyOpensForRead(const std::wstring& key) {
  const std::string prefix = posix::PrefixDirectory();
  if (prefix.empty() || key.find(L'\0') != std::wstring::npos) return false;
  std::ifstream hive(prefix + "/system.reg", std::ios::binary);
  if (!hive) return false;
  if (key.empty()) return true;  // the empty subkey is HKEY_LOCAL_MACHINE itself
  std::string line;
  std::wstring section;
  while (std::getline(hive, line)) {
    if (ParseSectionName(line, &section) && OpensKey(section, key)) return true;
  }
  return false;
}

}  // namespace platform
