// The legacy hot-folder list: a 40-byte header and 264-byte folder records,
// written by the previous generation of the service for all users.
#include <wx/app.h>
#include <wx/strconv.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>

#include "engine/migrator.h"
#include "platform/platform.h"

namespace {

constexpr char kMagic[] = "KYR ZerOvurova Database";
constexpr unsigned char kVersion = 1;
constexpr std::size_t kHeaderSize = 40;
constexpr std::size_t kMagicSize = 24;
constexpr std::size_t kRecordSize = 264;
constexpr std::size_t kStateOffset = 2;
constexpr std::size_t kPathOffset = 4;
constexpr std::size_t kPathSize = 260;
constexpr unsigned kStateEnabled = 2;

// The all-users configuration directory as wxStandardPaths::GetConfigDir
// names it on Windows: the common application-data folder and the
// application's name.
wxString AllUsersConfigDir(const wxString& common_app_data) {
  wxAppConsole* app = wxAppConsole::GetInstance();
  wxString app_name = app ? app->GetAppName() : wxString("hfmigrate");
  return common_app_data + "\\" + app_name;
}

// The list file sits beside the configuration directory, not inside it.
wxString LegacyListPath(const wxString& common_app_data) {
  wxString dir = AllUsersConfigDir(common_app_data).BeforeLast('\\');
  return dir + "\\KYR\\ZerOvurova\\KYR ZerOvurova Preferences\\KYR ZerOvurova DB";
}

bool HeaderIsValid(const char* header) {
  // The magic must end at byte 23; memcmp over the terminator checks both.
  return std::memcmp(header, kMagic, sizeof(kMagic)) == 0 &&
         static_cast<unsigned char>(header[kMagicSize]) == kVersion;
}

// The path ends at its first zero byte, or at the end of the field when the
// writer filled all of it.
std::string PathBytes(const char* field) {
  const void* zero = std::memchr(field, '\0', kPathSize);
  return std::string(field, zero ? static_cast<const char*>(zero) - field : kPathSize);
}

unsigned RecordState(const char* record) {
  const unsigned char* state = reinterpret_cast<const unsigned char*>(record + kStateOffset);
  return state[0] | (state[1] << 8);
}

// Growing a wxArrayString copies every string it holds, and for a large
// installation that copy at the last growth is what sets the run's peak
// memory. The file's size tells how many records follow; a size that no
// real list has is not trusted beyond a bound.
void ReserveForRecords(std::istream& in, wxArrayString* folders, wxArrayString* flags) {
  constexpr std::uint64_t kMaxReserved = 1 << 16;
  const std::istream::pos_type unknown(-1);
  std::istream::pos_type here = in.tellg();
  if (here == unknown) return;  // not seekable: the lists grow as they are read
  in.seekg(0, std::ios::end);
  std::istream::pos_type end = in.tellg();
  in.clear();
  in.seekg(here);
  if (end == unknown || end < here) return;
  std::uint64_t records =
      std::min<std::uint64_t>(static_cast<std::uint64_t>(end - here) / kRecordSize, kMaxReserved);
  folders->Alloc(folders->size() + records);
  flags->Alloc(flags->size() + records);
}

}  // namespace

bool CHFMigrator::ReadLegacyList() {
  // Without the folder the path would fall back to the root of the current
  // drive, which is not where the legacy service kept its list.
  wxString common_app_data(platform::CommonAppDataFolder());
  if (common_app_data.empty()) return false;
  wxString path = LegacyListPath(common_app_data);
  // Opening a FIFO under that name would wait for a writer forever, and an
  // unattended run must end: only a regular file can be the list.
  if (!platform::FileExists(path.ToStdWstring())) return false;
  std::ifstream in(std::filesystem::path(platform::ToLongHostPath(path.ToStdWstring())),
                   std::ios::binary);
  if (!in) return false;

  char header[kHeaderSize];
  if (!in.read(header, kHeaderSize) || !HeaderIsValid(header)) return false;

  ReserveForRecords(in, &m_Folders, &m_EnabledFlags);
  // Only whole records count; a torn write at the end leaves a partial one,
  // which is ignored rather than read as a truncated path.
  bool read_any = false;
  char record[kRecordSize];
  while (in.read(record, kRecordSize)) {
    read_any = true;
    // In the code page the legacy service wrote them in, the host's ANSI
    // one. A path it cannot decode keeps its place, as an empty entry that
    // names nothing, so that it gets an outcome and hfstore check names it.
    const std::string bytes = PathBytes(record + kPathOffset);
    if (bytes.empty()) continue;
    std::wstring path;
    if (!platform::DecodeAnsiText(bytes, &path) || path.empty()) {
      m_UndecodedPaths[m_Folders.size()] = bytes;
      path.clear();
    }
    m_Folders.Add(wxString(path));
    m_EnabledFlags.Add(RecordState(record) == kStateEnabled ? "1" : "0");
  }
  return read_any;
}
