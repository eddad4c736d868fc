// Where the store's database file may be opened. The tool may run elevated
// and the store lies below the all-users folder, where ordinary users may be
// able to create entries: the folder is reached through no link but those of
// an administrator, SYSTEM or the running user, and neither the database nor
// a journal file of its own may be a link. The database is then opened with
// SQLite's no-follow flag, below a folder path that holds no link at all on
// POSIX hosts (SQLite refuses a link anywhere in it, and opens every file of
// its own with O_NOFOLLOW).
#ifndef HF_STORE_STORE_FILE_H_
#define HF_STORE_STORE_FILE_H_

#include <string>

#include "platform/platform.h"

namespace db {

struct StoreFile {
  platform::HostPath path;  // the database file to open; empty when refused
  bool missing = false;     // refused because the folder or the file is not there
  std::string refusal;      // why it was refused, one line (UTF-8)
};

// The database file `name` below a folder as the platform layer found it.
StoreFile PlaceStoreFile(const platform::TrustedFolder& folder, const platform::HostPath& name);

// The folder of a database file named by a host path, walked the same way.
StoreFile CheckStoreFile(const platform::HostPath& file);

}  // namespace db

#endif  // HF_STORE_STORE_FILE_H_
