#include "launcher-data-manager/statement.h"

namespace korrin {

Statement::Statement(sqlite3* db, const std::string& sql, PrepareMode mode) : m_stmt(NULL) {
  int rc = mode == kPrepareV2
               ? sqlite3_prepare_v2(db, sql.c_str(), -1, &m_stmt, NULL)
               : sqlite3_prepare(db, sql.c_str(), static_cast<int>(sql.size()), &m_stmt, NULL);
  if (rc != SQLITE_OK) {
    sqlite3_finalize(m_stmt);
    m_stmt = NULL;
    m_error = sqlite3_errmsg(db);
  }
}

Statement::~Statement() { sqlite3_finalize(m_stmt); }

bool Statement::BindText(const char* name, const std::string& text) {
  if (m_stmt == NULL) return false;
  int index = sqlite3_bind_parameter_index(m_stmt, name);
  return sqlite3_bind_text(m_stmt, index, text.c_str(), -1, SQLITE_STATIC) == SQLITE_OK;
}

void Statement::BindTextIfNotEmpty(const char* name, const std::string& text) {
  if (!text.empty()) BindText(name, text);
}

bool Statement::Step() { return m_stmt != NULL && sqlite3_step(m_stmt) == SQLITE_ROW; }

std::string Statement::Text(int column) const {
  const unsigned char* text = sqlite3_column_text(m_stmt, column);
  if (text == NULL) return std::string();
  return std::string(reinterpret_cast<const char*>(text),
                     static_cast<size_t>(sqlite3_column_bytes(m_stmt, column)));
}

SqlText& SqlText::operator<<(int value) {
  // Digits from the right, as unsigned so that INT_MIN negates safely.
  char digits[12];
  char* end = digits + sizeof digits;
  char* p = end;
  unsigned magnitude = value < 0 ? 0u - static_cast<unsigned>(value) : static_cast<unsigned>(value);
  do {
    *--p = static_cast<char>('0' + magnitude % 10);
    magnitude /= 10;
  } while (magnitude != 0);
  if (value < 0) *--p = '-';
  m_text.append(p, end);
  return *this;
}

bool ExecStatement(sqlite3* db, const std::string& sql, std::string* error) {
  char* message = NULL;
  int rc = sqlite3_exec(db, sql.c_str(), NULL, NULL, &message);
  if (rc != SQLITE_OK && error != NULL) *error = message != NULL ? message : "";
  sqlite3_free(message);
  return rc == SQLITE_OK;
}

}  // namespace korrin
