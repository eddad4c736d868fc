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
  // One buffer per parameter, made here once: a buffer must not move while
  // SQLite holds its text (a short string's text lives inside it).
  texts_.clear();
  if (sqlite3_prepare_v3(db, sql.c_str(), static_cast<int>(sql.size()), SQLITE_PREPARE_PERSISTENT,
                         &stmt_, nullptr) != SQLITE_OK) {
    return false;
  }
  texts_.resize(static_cast<std::size_t>(sqlite3_bind_parameter_count(stmt_)) + 1);
  return true;
}

namespace {

// The encoding wxString::utf8_str() gives, written out because its converter
// and buffer cost more than the rest of a bind: code points past U+10FFFF
// fail, and a UTF-16 surrogate is encoded as it stands, as wx does. Where
// wchar_t is UTF-16 the conversion is left to wx. The text is read in place
// and written through a pointer into `buffer`, which only ever grows, so a
// bind neither checks for room at every byte nor clears the buffer first;
// `length` is what was written.
bool ToUtf8(const wxString& text, std::string* buffer, std::size_t* length) {
  if (sizeof(wchar_t) != 4) {
    wxScopedCharBuffer utf8 = text.utf8_str();
    if (utf8.length() == 0 && !text.empty()) return false;
    buffer->assign(utf8.data(), utf8.length());
    *length = buffer->size();
    return true;
  }
  // Room for the longest form, four bytes a character.
  if (buffer->size() < 4 * text.length()) buffer->resize(4 * text.length());
  char* const start = &(*buffer)[0];
  char* to = start;
  for (const wchar_t *c = text.wc_str(), *end = c + text.length(); c != end; ++c) {
    const std::uint32_t code = static_cast<std::uint32_t>(*c);
    if (code < 0x80) {
      *to++ = static_cast<char>(code);
      continue;
    }
    if (code > 0x10FFFF) return false;
    to = WriteUtf8(code, to);
  }
  *length = static_cast<std::size_t>(to - start);
  return true;
}

}  // namespace

// The text stays in this statement's buffer for its parameter until the
// parameter is bound again or Reset clears every binding, so SQLite is
// handed it without a copy of its own.
bool Statement::BindText(int index, const wxString& text) {
  if (index < 1 || static_cast<std::size_t>(index) >= texts_.size()) return false;
  std::string& buffer = texts_[index];
  std::size_t length = 0;
  // The explicit length keeps an embedded NUL character. A string with no
  // UTF-8 form converts to nothing; storing that would lose the value. Its
  // parameter is left bound to nothing rather than to the buffer's old text.
  if (!ToUtf8(text, &buffer, &length)) {
    sqlite3_bind_null(stmt_, index);
    return false;
  }
  return sqlite3_bind_text64(stmt_, index, buffer.data(), length, SQLITE_STATIC, SQLITE_UTF8) ==
         SQLITE_OK;
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
