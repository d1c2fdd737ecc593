// The statement pattern every store operation follows: compile, bind text by
// name, step, read columns, finalise. Internal to the store.
//
// Numbers are spliced into the SQL text by the caller; only text travels
// through the named parameters "$name", "$appId", "$iconPath" and "$content".
#ifndef KORRIN_LAUNCHER_DATA_MANAGER_STATEMENT_H_
#define KORRIN_LAUNCHER_DATA_MANAGER_STATEMENT_H_

#include <sqlite3.h>

#include <string>

namespace korrin {

// How a statement is compiled. Writes, and the look-ups by application id, use
// sqlite3_prepare_v2; the other reads use the legacy sqlite3_prepare. The split
// is kept as the launcher expects it.
enum PrepareMode { kPrepareV2, kPrepareLegacy };

// One compiled statement; finalised when it goes out of scope.
class Statement {
 public:
  Statement(sqlite3* db, const std::string& sql, PrepareMode mode);
  ~Statement();

  // False when the text did not compile; Error() then holds SQLite's message.
  bool IsCompiled() const { return m_stmt != NULL; }
  const std::string& Error() const { return m_error; }

  // Binds |text| to the parameter |name| without copying it: |text| must stay
  // alive and unchanged until the statement is finalised. Returns false when
  // the statement did not compile or SQLite refused the binding.
  bool BindText(const char* name, const std::string& text);
  // Binds only a non-empty |text|, so that an empty one is stored as NULL.
  void BindTextIfNotEmpty(const char* name, const std::string& text);

  // Steps once; true when a row is ready to be read.
  bool Step();

  int Int(int column) const { return sqlite3_column_int(m_stmt, column); }
  bool Bool(int column) const { return sqlite3_column_int(m_stmt, column) != 0; }
  // A NULL text column reads as "".
  std::string Text(int column) const;

 private:
  Statement(const Statement&);
  Statement& operator=(const Statement&);

  sqlite3_stmt* m_stmt;
  std::string m_error;
};

// Composes a statement's text exactly as std::ostream prints it by default:
// ints in decimal, bools as 0 or 1. A stream's set-up alone (locale, buffers)
// costs several thousand instructions, more than compiling a short statement.
class SqlText {
 public:
  SqlText() { m_text.reserve(kTypicalLength); }

  SqlText& operator<<(const char* text) {
    m_text += text;
    return *this;
  }
  SqlText& operator<<(const std::string& text) {
    m_text += text;
    return *this;
  }
  SqlText& operator<<(int value);
  SqlText& operator<<(bool value) {
    m_text += value ? '1' : '0';
    return *this;
  }

  // A char would otherwise be taken for an int and printed as a number.
  SqlText& operator<<(char) = delete;

  const std::string& str() const { return m_text; }

 private:
  // The longest statement the store composes fits without growing.
  static const size_t kTypicalLength = 320;

  std::string m_text;
};

// Runs |sql| whole with sqlite3_exec, as deletions and transactions do.
// Returns true on success; on failure stores SQLite's message in |*error|
// when |error| is given. The message is freed either way.
bool ExecStatement(sqlite3* db, const std::string& sql, std::string* error);

}  // namespace korrin

#endif  // KORRIN_LAUNCHER_DATA_MANAGER_STATEMENT_H_
