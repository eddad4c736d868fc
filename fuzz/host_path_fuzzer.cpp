// The mapping from Windows paths to host paths, over arbitrary wide text.
// Every path the tool touches comes from a list file or a folder.cfg; no
// such text may reach a host file outside the prefix's drives.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <string>

#include "fuzz/fuzz_support.h"
#include "platform/platform.h"
#include "tests/temp_prefix.h"

namespace {

enum class Kind { kDrive, kShare, kNowhere, kRelative };

// What a Windows path names, as Windows reads it: up to its first NUL, with
// forward slashes as separators.
Kind Classify(const std::wstring& text, wchar_t* drive) {
  std::wstring path = text.substr(0, text.find(L'\0'));
  for (wchar_t& c : path) {
    if (c == L'/') c = L'\\';
  }
  if (path.empty()) return Kind::kNowhere;
  if (path.compare(0, 2, L"\\\\") == 0) return Kind::kShare;
  wchar_t letter = path[0] | 0x20;
  if (path.size() >= 2 && path[1] == L':' && letter >= L'a' && letter <= L'z') {
    *drive = letter;
    return Kind::kDrive;
  }
  return path[0] == L'\\' ? Kind::kNowhere : Kind::kRelative;
}

// Below its root, a mapped path names every directory it passes through:
// nothing that climbs, stays put or collapses.
void CheckStaysBelow(const std::string& host, const std::string& root, std::size_t min_parts) {
  FUZZ_CHECK(host.compare(0, root.size(), root) == 0);
  FUZZ_CHECK(host.size() == root.size() || host[root.size()] == '/');
  std::size_t parts = 0;
  for (std::size_t at = root.size(); at < host.size(); ++parts) {
    const std::size_t end = std::min(host.find('/', at + 1), host.size());
    const std::string part = host.substr(at + 1, end - at - 1);
    FUZZ_CHECK(!part.empty() && part != "." && part != "..");
    at = end;
  }
  FUZZ_CHECK(parts >= min_parts);
}

// A prefix with drives C: and D:, network shares, and entries that a path
// may match ignoring case (once or, for "CASE", ambiguously).
const TempPrefix& Prefix() {
  static TempPrefix prefix;
  static bool built = false;
  if (!built) {
    const std::filesystem::path& root = prefix.root();
    prefix.WriteFile(prefix.Drive('c') / "ProgramData" / "KYR" / "ZerOvurova" / "list", "");
    prefix.WriteFile(prefix.Drive('d') / "Jobs" / "Brochures" / "[_KYR_HotFolder_]" / "folder.cfg",
                     "");
    std::filesystem::create_directories(prefix.Drive('d') / "Jobs" / "CASE");
    std::filesystem::create_directories(prefix.Drive('d') / "Jobs" / "case");
    std::filesystem::create_directories(prefix.Drive('d') / "Jobs" / "Caf\xC3\xA9 Menus");
    std::filesystem::create_directories(root / "dosdevices" / "unc" / "press-01" / "Jobs");
    built = true;
  }
  return prefix;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string devices = Prefix().root().string() + "/dosdevices/";
  const std::wstring windows = WideFromBytes(data, size);
  const platform::HostPath host = platform::ToHostPath(windows);

  wchar_t drive = 0;
  switch (Classify(windows, &drive)) {
    case Kind::kDrive:
      CheckStaysBelow(host, devices + static_cast<char>(drive) + ":", 0);
      break;
    case Kind::kShare:
      // A share without a server or a name names nothing.
      if (!host.empty()) CheckStaysBelow(host, devices + "unc", 2);
      break;
    case Kind::kNowhere:
      FUZZ_CHECK(host.empty());
      break;
    case Kind::kRelative:
      FUZZ_CHECK(host.empty() || host[0] != '/');
      break;
  }

  // A path on a drive of the prefix comes back as the same Windows path,
  // which maps to the same host path again.
  if (drive == L'c' || drive == L'd') {
    const std::wstring back = platform::FromHostPath(host);
    FUZZ_CHECK(back.size() >= 3 && back[0] == (drive & ~0x20) && back.compare(1, 2, L":\\") == 0);
    FUZZ_CHECK(platform::ToHostPath(back) == host);
  }

  // Any host text at all, shown as a Windows path.
  platform::FromHostPath(InputBytes(data, size));
  return 0;
}
