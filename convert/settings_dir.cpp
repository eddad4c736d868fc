#include "convert/settings_dir.h"

#include <wx/filename.h>

#include <chrono>
#include <cstddef>
#include <string>
#include <thread>

#include "platform/platform.h"

namespace {

// Wide, as the paths are: a narrow text would be converted by the C
// library's multibyte conversion at every join.
const wchar_t kSettingsDirName[] = L"[_KYR_HotFolder_]";
const wchar_t kRetiredDirName[] = L"[_KYR_HotFolder_Old]";
const wchar_t kSeparator[] = L"\\";

// Attributes that would make the move fail on Windows.
constexpr std::uint32_t kBlockingAttributes =
    platform::kAttributeReadOnly | platform::kAttributeSystem;

std::optional<std::uint32_t> ReadAttributes(const wxString& path) {
  std::uint32_t attributes = 0;
  if (!platform::GetFileAttributes(path.ToStdWstring(), &attributes)) return std::nullopt;
  return attributes;
}

void ClearBlockingAttributes(const wxString& path, std::optional<std::uint32_t> attributes) {
  if (!attributes || (*attributes & kBlockingAttributes) == 0) return;
  platform::SetFileAttributes(path.ToStdWstring(), *attributes & ~kBlockingAttributes);
}

// A busy directory (another process holds a handle inside it) is tried
// again with growing pauses, as SQLite's Windows layer does for busy files:
// at most kBusyRetries more attempts per folder, 50 ms, 100 ms, ... apart,
// under 3 s in all. Any other failure is not waited for.
constexpr int kBusyRetries = 10;
constexpr auto kBusyPause = std::chrono::milliseconds(50);

class BusyRetries {
 public:
  // False once the folder's retries are spent; otherwise pauses first.
  bool WaitForAnother() {
    if (used_ == kBusyRetries) return false;
    ++used_;
    std::this_thread::sleep_for(kBusyPause * used_);
    return true;
  }

 private:
  int used_ = 0;
};

// No sync follows a move: a move lost in a power cut is finished by the
// next run (the store refuses the folder as registered and its settings
// stay retired) or undone by the run record (section 5 of the design).
bool Move(const wxString& from, const wxString& to, BusyRetries* retries) {
  for (;;) {
    const platform::MoveOutcome outcome =
        platform::MoveDirectory(from.ToStdWstring(), to.ToStdWstring());
    if (outcome == platform::MoveOutcome::kMoved) return true;
    if (outcome != platform::MoveOutcome::kBusy || !retries->WaitForAnother()) return false;
  }
}

// A plain drive path: a drive letter, a colon, then components each after
// one backslash, none empty, none "." or "..", and no slash or colon in
// them. wxFileName gives such a path back as it stands, and its name is the
// last component up to that component's last dot (empty when the dot comes
// first); that is worked out here directly, since nearly every listed folder
// has such a path and wxFileName costs more than the rest of the folder's
// paths. settings_dir_test holds the two side by side. False, with nothing
// set, for any other path.
bool SplitPlainDrivePath(const wxString& path, wxString* name) {
  const wchar_t* const text = path.wc_str();
  const std::size_t length = path.length();
  const auto ascii_letter = [](wchar_t c) { return (c | 0x20) >= L'a' && (c | 0x20) <= L'z'; };
  if (length < 4 || !ascii_letter(text[0]) || text[1] != L':' || text[2] != L'\\') return false;
  std::size_t start = 3;  // of the component being read
  std::size_t last_dot = std::wstring::npos;
  for (std::size_t i = start;; ++i) {
    if (i < length && text[i] != L'\\') {
      if (text[i] == L'/' || text[i] == L':') return false;
      if (text[i] == L'.') last_dot = i;
      continue;
    }
    const std::size_t size = i - start;
    if (size == 0 ||
        (text[start] == L'.' && (size == 1 || (size == 2 && text[start + 1] == L'.')))) {
      return false;
    }
    if (i == length) break;
    start = i + 1;
    last_dot = std::wstring::npos;
  }
  const std::size_t end = last_dot == std::wstring::npos ? length : last_dot;
  name->assign(text + start, end - start);
  return true;
}

}  // namespace

FolderPaths MakeFolderPaths(const wxString& folder_path) {
  FolderPaths paths;
  if (SplitPlainDrivePath(folder_path, &paths.name)) {
    paths.full_path = folder_path;
  } else {
    wxFileName file_name(folder_path, wxPATH_WIN);
    paths.full_path = file_name.GetFullPath(wxPATH_WIN);
    paths.name = file_name.GetName();
  }
  paths.settings = paths.full_path + kSeparator + kSettingsDirName;
  paths.work = paths.settings + kSeparator + L"[WorkFolder]";
  paths.failed = paths.settings + kSeparator + L"[FailedFolder]";
  paths.move = paths.settings + kSeparator + L"[MoveFolder]";
  paths.retired = paths.full_path + kSeparator + kRetiredDirName;
  return paths;
}

wxString LegacyConfigPath(const wxString& listed_folder) {
  return listed_folder + kSeparator + kSettingsDirName + kSeparator + L"folder.cfg";
}

Retirement RetireSettingsDirectory(const FolderPaths& paths) {
  Retirement retirement;
  BusyRetries retries;
  // The attributes read to be restored are the ones cleared before the
  // first move; a second attempt reads them afresh.
  retirement.attributes = ReadAttributes(paths.settings);
  ClearBlockingAttributes(paths.settings, retirement.attributes);
  retirement.moved = Move(paths.settings, paths.retired, &retries);
  if (!retirement.moved) {
    ClearBlockingAttributes(paths.settings, ReadAttributes(paths.settings));
    retirement.moved = Move(paths.settings, paths.retired, &retries);
  }
  return retirement;
}

void RestoreSettingsDirectory(const FolderPaths& paths, const Retirement& retirement) {
  if (!retirement.moved) return;
  // A failed move back leaves the directory where it is; there is nothing
  // safer to do with it.
  BusyRetries retries;
  if (!Move(paths.retired, paths.settings, &retries)) return;
  if (retirement.attributes) {
    platform::SetFileAttributes(paths.settings.ToStdWstring(), *retirement.attributes);
  }
}

bool PutBackSettingsDirectory(const FolderPaths& paths) {
  BusyRetries retries;
  return Move(paths.retired, paths.settings, &retries);
}
