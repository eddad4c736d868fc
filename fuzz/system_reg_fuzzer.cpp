// The registry probe over whatever text sits in the prefix's system.reg. A
// hive edited by hand or cut short by a crash must give a yes or a no, and
// the answers must hang together the way registry keys do.
#include <cstddef>
#include <cstdint>
#include <cwctype>
#include <string>

#include "fuzz/fuzz_support.h"
#include "platform/platform.h"
#include "tests/temp_prefix.h"

namespace {

// Keys probed in every run, each with its parent keys; the first is the one
// the tool asks about.
const wchar_t* const kKeys[] = {
    L"SOFTWARE\\Wow6432Node\\Tessaly Systems\\Corvane_app\\3.0",
    L"Software\\Microsoft\\Windows NT\\CurrentVersion",
    L"System\\CurrentControlSet\\Control\\Session Manager\\Environment",
    L"Software\\Wine\\Drives",
};

// A key opens when a section names it or a key below it, ignoring case; so
// a key that opens has every parent open too, in any letter case.
void CheckKey(const std::wstring& key) {
  bool opens = platform::HklmKeyOpensForRead(key);
  for (wint_t (*to)(wint_t) : {std::towupper, std::towlower}) {
    std::wstring cased = key;
    for (wchar_t& c : cased) c = static_cast<wchar_t>(to(c));
    FUZZ_CHECK(platform::HklmKeyOpensForRead(cased) == opens);
  }
  if (!opens) return;
  for (std::size_t cut = key.rfind(L'\\'); cut != std::wstring::npos && cut > 0;
       cut = key.rfind(L'\\', cut - 1)) {
    FUZZ_CHECK(platform::HklmKeyOpensForRead(key.substr(0, cut)));
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  static TempPrefix prefix;
  prefix.WriteFile(prefix.root() / "system.reg", InputBytes(data, size));
  // The empty subkey is HKEY_LOCAL_MACHINE itself, there whenever the hive is.
  FUZZ_CHECK(platform::HklmKeyOpensForRead(L""));
  for (const wchar_t* key : kKeys) CheckKey(key);
  return 0;
}
