// The writing side of the store: one connection with its prepared
// statements, kept open across calls because every registration already
// costs a durable commit and should cost nothing more.
#ifndef HF_STORE_STORE_WRITER_H_
#define HF_STORE_STORE_WRITER_H_

#include <cstdint>
#include <memory>
#include <string>

#include "platform/platform.h"
#include "store/records.h"
#include "store/sqlite_statement.h"

namespace db {

// The six records of one hot folder, as handed to the store.
struct HotFolderRecords {
  const Setting& setting;
  const FolderConfiguration& folder;
  const JobConfiguration& job;
  const FilterConfiguration& filter;
  const ImposeConfiguration& impose;
  const PreflightConfiguration& preflight;
};

// Where the database lives: its folder as a Windows path (created on first
// use) and the file as the host names it.
struct StoreLocation {
  std::wstring folder;
  platform::HostPath file;
};

enum class CreateResult { kCreated, kAlreadyRegistered, kFailed };

enum class Registration { kRegistered, kNotRegistered, kUnknown };

class StoreWriter {
 public:
  StoreWriter();
  ~StoreWriter();

  // Both calls (re)open the database at `file` when it is not the one open,
  // or when the last call failed. A failure closes the connection so that
  // the next call starts afresh. Create stores the folder with the given
  // enabled state in the transaction of its records, so that nobody ever
  // sees it in another state.
  CreateResult Create(const StoreLocation& location, const HotFolderRecords& records, bool enabled);
  // Opens the database at `file` when it exists and is ours, creating
  // nothing, so that the next Create is only its own transaction.
  bool OpenExisting(const StoreLocation& location);
  // False for an unknown folder path as well as for a failure. A missing
  // database holds no folder, so it is not created for this. A folder that
  // is disabled already answers true without a write.
  bool Disable(const StoreLocation& location, const wxString& folder_path);
  // Whether a folder of that path is stored. A missing or empty database
  // holds none; one that cannot be read answers kUnknown.
  Registration Find(const StoreLocation& location, const wxString& folder_path);
  // Whether a connection is open, as the last call left it.
  bool IsOpen() const { return db_ != nullptr; }
  // Lets go of the connection and its statements.
  void Close();

 private:
  struct Statements;

  bool EnsureOpen(const StoreLocation& location, bool create);
  bool Open(const StoreLocation& location, bool create);
  bool Insert(const HotFolderRecords& records, bool enabled, bool* duplicate);
  bool InsertRecords(const HotFolderRecords& records, bool enabled, bool* duplicate);

  // Which file is open: the path, and the file's identity on hosts where
  // an open file can be deleted or replaced under the same name.
  struct FileId {
    std::uint64_t device = 0;
    std::uint64_t inode = 0;
    bool operator==(const FileId& other) const {
      return device == other.device && inode == other.inode;
    }
  };
  static bool Identify(const platform::HostPath& file, FileId* id);

  platform::HostPath file_;
  FileId file_id_;
  Database db_;
  std::unique_ptr<Statements> statements_;
};

}  // namespace db

#endif  // HF_STORE_STORE_WRITER_H_
