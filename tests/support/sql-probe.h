// SqlProbe: plain SQL on the layout database through a connection of its own,
// to see what the store wrote and to set up or break the file behind its back.
#ifndef KORRIN_TESTS_SUPPORT_SQL_PROBE_H_
#define KORRIN_TESTS_SUPPORT_SQL_PROBE_H_

#include <sqlite3.h>

#include <string>
#include <vector>

typedef std::vector<std::string> Row;

class SqlProbe {
 public:
  explicit SqlProbe(const std::string& path);
  ~SqlProbe();

  // Every row of |sql|, each column as text; SQL NULL reads as "NULL".
  std::vector<Row> Rows(const std::string& sql);
  // Column 0 of the first row of |sql|, or "" without a row.
  std::string Value(const std::string& sql);
  // Every row of Menus, Pages and Boxes, in that order and by id: the whole
  // layout, to show that nothing was written.
  std::vector<Row> Layout();
  // Runs |sql|; fails the test when it does not succeed.
  void Exec(const std::string& sql);
  // Runs |sql| and returns SQLite's result code.
  int TryExec(const std::string& sql);

  sqlite3* db() const { return m_db; }

 private:
  sqlite3* m_db;
};

#endif  // KORRIN_TESTS_SUPPORT_SQL_PROBE_H_
