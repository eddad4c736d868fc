#include "store/store_file.h"

#include <filesystem>

namespace db {
namespace {

// The database and the files SQLite keeps beside it.
const char* const kSuffixes[] = {"", "-wal", "-shm", "-journal"};

std::string Shown(const platform::HostPath& path) {
  return std::filesystem::path(path).u8string();
}

}  // namespace

StoreFile PlaceStoreFile(const platform::TrustedFolder& folder, const platform::HostPath& name) {
  StoreFile file;
  switch (folder.trust) {
    case platform::FolderTrust::kTrusted:
      break;
    case platform::FolderTrust::kMissing:
      file.missing = true;
      file.refusal = Shown(folder.path) + " does not exist";
      return file;
    case platform::FolderTrust::kForeignLink:
      file.refusal = Shown(folder.path) + " is a link owned by another user";
      return file;
    case platform::FolderTrust::kNotADirectory:
      file.refusal = Shown(folder.path) + " is not a directory";
      return file;
    case platform::FolderTrust::kFailed:
      file.refusal = Shown(folder.path) + " cannot be examined";
      return file;
  }
  const std::filesystem::path path = std::filesystem::path(folder.path) / name;
  for (const char* suffix : kSuffixes) {
    const platform::HostPath companion = path.native() + std::filesystem::path(suffix).native();
    if (platform::IsLink(companion)) {
      file.refusal = Shown(companion) + " is a link";
      return file;
    }
  }
  file.path = path.native();
  return file;
}

StoreFile CheckStoreFile(const platform::HostPath& file) {
  const std::filesystem::path path(file);
  const std::filesystem::path parent = path.has_parent_path() ? path.parent_path() : ".";
  return PlaceStoreFile(platform::CheckTrustedHostFolder(parent.native()),
                        path.filename().native());
}

}  // namespace db
