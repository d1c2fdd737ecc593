#include "support/sql-probe.h"

#include <gtest/gtest.h>

SqlProbe::SqlProbe(const std::string& path) : m_db(NULL) {
  if (sqlite3_open(path.c_str(), &m_db) != SQLITE_OK) ADD_FAILURE() << "cannot open " << path;
}

SqlProbe::~SqlProbe() { sqlite3_close(m_db); }

std::vector<Row> SqlProbe::Rows(const std::string& sql) {
  std::vector<Row> rows;
  sqlite3_stmt* stmt = NULL;
  if (sqlite3_prepare_v2(m_db, sql.c_str(), -1, &stmt, NULL) != SQLITE_OK) {
    ADD_FAILURE() << sqlite3_errmsg(m_db) << " in: " << sql;
    return rows;
  }
  while (sqlite3_step(stmt) == SQLITE_ROW) {
    Row row;
    for (int i = 0; i < sqlite3_column_count(stmt); ++i) {
      const unsigned char* text = sqlite3_column_text(stmt, i);
      row.push_back(text == NULL ? "NULL"
                                 : std::string(reinterpret_cast<const char*>(text),
                                               sqlite3_column_bytes(stmt, i)));
    }
    rows.push_back(row);
  }
  sqlite3_finalize(stmt);
  return rows;
}

std::string SqlProbe::Value(const std::string& sql) {
  std::vector<Row> rows = Rows(sql);
  return rows.empty() || rows[0].empty() ? "" : rows[0][0];
}

std::vector<Row> SqlProbe::Layout() {
  std::vector<Row> rows;
  for (const char* sql :
       {"SELECT * FROM Menus ORDER BY menuId", "SELECT * FROM Pages ORDER BY pageId",
        "SELECT * FROM Boxes ORDER BY boxId"}) {
    std::vector<Row> more = Rows(sql);
    rows.insert(rows.end(), more.begin(), more.end());
  }
  return rows;
}

void SqlProbe::Exec(const std::string& sql) {
  char* error = NULL;
  if (sqlite3_exec(m_db, sql.c_str(), NULL, NULL, &error) != SQLITE_OK) {
    ADD_FAILURE() << (error ? error : "?") << " in: " << sql;
  }
  sqlite3_free(error);
}

int SqlProbe::TryExec(const std::string& sql) {
  return sqlite3_exec(m_db, sql.c_str(), NULL, NULL, NULL);
}
