// Thin ownership wrappers over the SQLite C API, so that every early return
// finalizes its statement and closes its database.
#ifndef HF_STORE_SQLITE_STATEMENT_H_
#define HF_STORE_SQLITE_STATEMENT_H_

#include <sqlite3.h>
#include <wx/string.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace db {

struct DatabaseCloser {
  void operator()(sqlite3* db) const { sqlite3_close_v2(db); }
};
using Database = std::unique_ptr<sqlite3, DatabaseCloser>;

// Opens with the given SQLITE_OPEN_* flags; null on failure, with the reason
// in `error` when it is not null.
Database OpenDatabase(const std::string& utf8_path, int flags, std::string* error);

// Runs SQL that returns no rows (one or more statements).
bool Exec(sqlite3* db, const char* sql);

class Statement {
 public:
  Statement() = default;
  ~Statement() { sqlite3_finalize(stmt_); }
  Statement(const Statement&) = delete;
  Statement& operator=(const Statement&) = delete;

  bool Prepare(sqlite3* db, const std::string& sql);

  // Parameters count from 1, as in SQLite.
  bool BindText(int index, const wxString& text);
  bool BindUtf8(int index, const std::string& utf8);
  bool BindInt(int index, std::int64_t value);
  bool BindNull(int index);

  // Steps once: true for a row, false at the end or on an error (tell them
  // apart with Failed()).
  bool Step();
  bool Failed() const { return failed_; }

  // Runs a statement that returns no rows, then resets it for the next use.
  bool Run();
  void Reset();

  // Text that is not UTF-8 reads as empty and marks the statement bad, so a
  // reader never shows a value that differs from the stored one unnoticed.
  wxString ColumnText(int column);
  std::int64_t ColumnInt(int column) { return sqlite3_column_int64(stmt_, column); }
  bool ColumnIsNull(int column) { return sqlite3_column_type(stmt_, column) == SQLITE_NULL; }
  bool TextWasBad() const { return bad_text_; }

 private:
  sqlite3_stmt* stmt_ = nullptr;
  bool failed_ = false;
  bool bad_text_ = false;
  // The bound texts by parameter index, kept between binds so that a bind
  // allocates nothing. SQLite reads them in place (see BindText).
  std::vector<std::string> texts_;
};

}  // namespace db

#endif  // HF_STORE_SQLITE_STATEMENT_H_
