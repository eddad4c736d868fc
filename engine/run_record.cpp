#include "engine/run_record.h"

#include <cinttypes>
#include <cstdio>

#include "platform/platform.h"
#include "store/store_reader.h"

namespace {

const char kHeader[] = "KYR hfmigrate run record 1\n";
const wchar_t kFileName[] = L"\\hfmigrate.run";
const wchar_t kDamagedSuffix[] = L".damaged";

// No real installation lists this many bytes of folder paths; a bigger
// file is not read into memory.
constexpr std::uintmax_t kMaxRecordBytes = 256u << 20;

// FNV-1a, 64 bits: enough to tell a torn or altered file from a whole one.
std::uint64_t Checksum(const std::string& bytes, std::size_t length) {
  std::uint64_t hash = 14695981039346656037ull;
  for (std::size_t i = 0; i < length; ++i) {
    hash ^= static_cast<unsigned char>(bytes[i]);
    hash *= 1099511628211ull;
  }
  return hash;
}

std::string ChecksumLine(const std::string& bytes) {
  char line[24];
  std::snprintf(line, sizeof line, "%016" PRIx64 "\n", Checksum(bytes, bytes.size()));
  return line;
}

// Reads a decimal number ending in `end` at `*pos`; digits only, no sign.
bool ReadNumber(const std::string& bytes, std::size_t* pos, char end, std::size_t* value) {
  std::size_t start = *pos;
  *value = 0;
  while (*pos < bytes.size() && bytes[*pos] >= '0' && bytes[*pos] <= '9') {
    if (*pos - start >= 12) return false;
    *value = *value * 10 + static_cast<std::size_t>(bytes[(*pos)++] - '0');
  }
  if (*pos == start || *pos >= bytes.size() || bytes[*pos] != end) return false;
  ++*pos;
  return true;
}

bool ReadEntry(const std::string& bytes, std::size_t* pos, RunRecordEntry* entry) {
  if (*pos + 2 > bytes.size() || (bytes[*pos] != 'R' && bytes[*pos] != 'K') ||
      bytes[*pos + 1] != ' ') {
    return false;
  }
  entry->retires = bytes[*pos] == 'R';
  *pos += 2;
  std::size_t length = 0;
  if (!ReadNumber(bytes, pos, ' ', &length) || length > bytes.size() - *pos ||
      bytes.size() - *pos - length < 1 || bytes[*pos + length] != '\n') {
    return false;
  }
  entry->folder = wxString::FromUTF8(bytes.data() + *pos, length);
  if (entry->folder.empty() != (length == 0)) return false;  // not UTF-8
  *pos += length + 1;
  return true;
}

}  // namespace

// Empty when the all-users folder is unknown: the record then has no place.
std::wstring RunRecordPath() {
  if (platform::CommonAppDataFolder().empty()) return std::wstring();
  return StoreFolder() + kFileName;
}

// Built in one string, the count put in front at the end: a record of
// thousands of folders is never held twice.
std::string EncodeRunRecord(const std::vector<RunRecordEntry>& entries) {
  std::string bytes;
  std::size_t count = 0;
  for (const RunRecordEntry& entry : entries) {
    wxScopedCharBuffer utf8 = entry.folder.utf8_str();
    if (utf8.length() == 0 && !entry.folder.empty()) continue;  // no UTF-8 form
    bytes += entry.retires ? "R " : "K ";
    bytes += std::to_string(utf8.length()) + ' ';
    bytes.append(utf8.data(), utf8.length());
    bytes += '\n';
    ++count;
  }
  bytes.insert(0, kHeader + std::to_string(count) + '\n');
  bytes += ChecksumLine(bytes);
  return bytes;
}

bool DecodeRunRecord(const std::string& bytes, std::vector<RunRecordEntry>* entries) {
  entries->clear();
  constexpr std::size_t kChecksumLine = 17;
  const std::size_t header = sizeof(kHeader) - 1;
  if (bytes.size() < header + kChecksumLine || bytes.compare(0, header, kHeader) != 0) {
    return false;
  }
  const std::string body = bytes.substr(0, bytes.size() - kChecksumLine);
  if (bytes.compare(body.size(), kChecksumLine, ChecksumLine(body)) != 0) return false;
  std::size_t pos = header;
  std::size_t count = 0;
  if (!ReadNumber(body, &pos, '\n', &count)) return false;
  std::vector<RunRecordEntry> read;
  for (std::size_t i = 0; i < count; ++i) {
    RunRecordEntry entry;
    if (!ReadEntry(body, &pos, &entry)) return false;
    read.push_back(std::move(entry));
  }
  if (pos != body.size()) return false;
  entries->swap(read);
  return true;
}

// The record's folder is the store's: reached through no link but those of
// an administrator, SYSTEM or the running user, or the record is not
// touched at all. Behind someone else's link there is no record of ours.
namespace {
platform::FolderTrust RecordFolder(bool create) {
  return platform::OpenTrustedFolder(StoreFolder(), create).trust;
}
bool RecordFolderTrusted(bool create) {
  return RecordFolder(create) == platform::FolderTrust::kTrusted;
}
}  // namespace

RunRecordState ReadRunRecord(std::vector<RunRecordEntry>* entries) {
  entries->clear();
  const std::wstring path = RunRecordPath();
  if (path.empty() || !RecordFolderTrusted(/*create=*/false)) return RunRecordState::kNone;
  // A link, a directory or anything else under the name is no record either.
  std::string bytes;
  switch (platform::ReadRegularFile(path, kMaxRecordBytes, &bytes)) {
    case platform::FileRead::kMissing:
      return RunRecordState::kNone;
    case platform::FileRead::kRead:
      return DecodeRunRecord(bytes, entries) ? RunRecordState::kFound : RunRecordState::kDamaged;
    case platform::FileRead::kNotAFile:
    case platform::FileRead::kFailed:
      break;
  }
  return RunRecordState::kDamaged;
}

bool WriteRunRecord(const std::vector<RunRecordEntry>& entries) {
  if (RunRecordPath().empty() || !RecordFolderTrusted(/*create=*/true)) return false;
  return platform::ReplaceFileDurably(RunRecordPath(), EncodeRunRecord(entries));
}

bool RemoveRunRecord() {
  const std::wstring path = RunRecordPath();
  if (path.empty()) return true;
  const platform::FolderTrust trust = RecordFolder(/*create=*/false);
  return trust == platform::FolderTrust::kMissing ||
         (trust == platform::FolderTrust::kTrusted && platform::RemoveFile(path));
}

bool SetAsideRunRecord() {
  const std::wstring path = RunRecordPath();
  if (path.empty() || !RecordFolderTrusted(/*create=*/false)) return false;
  for (int n = 1; n <= 100; ++n) {
    std::wstring aside = path + kDamagedSuffix;
    if (n > 1) aside += L"-" + std::to_wstring(n);
    if (platform::FileExists(aside) || platform::DirectoryExists(aside)) continue;
    return platform::RenameFile(path, aside) ||
           (platform::DirectoryExists(path) &&
            platform::MoveDirectory(path, aside) == platform::MoveOutcome::kMoved);
  }
  return false;
}
