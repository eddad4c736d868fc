#include "store/sqlite_statement.h"

#include "store/utf8.h"

namespace db {

Database OpenDatabase(const std::string& utf8_path, int flags, std::string* error) {
  sqlite3* raw = nullptr;
  int rc = sqlite3_open_v2(utf8_path.c_str(), &raw, flags, nullptr);
  Database db(raw);
  if (rc != SQLITE_OK) {
    if (error) *error = raw ? sqlite3_errmsg(raw) : sqlite3_errstr(rc);
    return nullptr;
  }
  sqlite3_extended_result_codes(raw, 1);
  return db;
}

bool Exec(sqlite3* db, const char* sql) {
  return sqlite3_exec(db, sql, nullptr, nullptr, nullptr) == SQLITE_OK;
}

bool Statement::Prepare(sqlite3* db, const std::string& sql) {
  sqlite3_finalize(stmt_);
  stmt_ = nullptr;
  return sqlite3_prepare_v3(db, sql.c_str(), static_cast<int>(sql.size()),
                            SQLITE_PREPARE_PERSISTENT, &stmt_, nullptr) == SQLITE_OK;
}

namespace {

// The encoding wxString::utf8_str() gives, written out because its converter
// and buffer cost more than the rest of a bind: code points past U+10FFFF
// fail, and a UTF-16 surrogate is encoded as it stands, as wx does. Where
// wchar_t is UTF-16 the conversion is left to wx.
bool ToUtf8(const wxString& text, std::string* out) {
  out->clear();
  if (sizeof(wchar_t) != 4) {
    wxScopedCharBuffer utf8 = text.utf8_str();
    if (utf8.length() == 0 && !text.empty()) return false;
    out->assign(utf8.data(), utf8.length());
    return true;
  }
  for (wchar_t c : text.ToStdWstring()) {
    std::uint32_t code = static_cast<std::uint32_t>(c);
    if (code > 0x10FFFF) return false;
    AppendUtf8(code, out);
  }
  return true;
}

}  // namespace

bool Statement::BindText(int index, const wxString& text) {
  // The explicit length keeps an embedded NUL character. A string with no
  // UTF-8 form converts to nothing; storing that would lose the value.
  if (!ToUtf8(text, &utf8_)) return false;
  return sqlite3_bind_text64(stmt_, index, utf8_.data(), utf8_.size(), SQLITE_TRANSIENT,
                             SQLITE_UTF8) == SQLITE_OK;
}

bool Statement::BindUtf8(int index, const std::string& utf8) {
  return sqlite3_bind_text64(stmt_, index, utf8.data(), utf8.size(), SQLITE_TRANSIENT,
                             SQLITE_UTF8) == SQLITE_OK;
}

bool Statement::BindInt(int index, std::int64_t value) {
  return sqlite3_bind_int64(stmt_, index, value) == SQLITE_OK;
}

bool Statement::BindNull(int index) {
  return sqlite3_bind_null(stmt_, index) == SQLITE_OK;
}

bool Statement::Step() {
  int rc = sqlite3_step(stmt_);
  if (rc == SQLITE_ROW) return true;
  if (rc != SQLITE_DONE) failed_ = true;
  return false;
}

bool Statement::Run() {
  failed_ = false;
  bool row = Step();
  bool ok = !row && !failed_;
  Reset();
  return ok;
}

void Statement::Reset() {
  failed_ = false;
  sqlite3_reset(stmt_);
  sqlite3_clear_bindings(stmt_);
}

wxString Statement::ColumnText(int column) {
  const char* text = reinterpret_cast<const char*>(sqlite3_column_text(stmt_, column));
  int bytes = sqlite3_column_bytes(stmt_, column);
  if (text == nullptr || bytes == 0) return wxString();
  wxString value = wxString::FromUTF8(text, static_cast<size_t>(bytes));
  if (value.empty()) bad_text_ = true;
  return value;
}

}  // namespace db
