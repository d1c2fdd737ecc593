// A phone's own layout database, as a bug report brings it: placing it under
// the device root (a copy, or the file itself), reading it through read-only
// connections, its rows as JSON, the integrity check over those rows, and
// the scenario a field log implies. The commands are in phone-db.cpp.
#ifndef KORRIN_SIM_PHONE_DB_H_
#define KORRIN_SIM_PHONE_DB_H_

#include <sqlite3.h>
#include <stdint.h>

#include <istream>
#include <ostream>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "sim/device.h"

namespace korrin_sim {

typedef nlohmann::ordered_json Json;

// Puts |file| where the device root's layout database lives: a copy (with its
// journal, if any), or with |inPlace| a link to the file itself. Throws
// UsageError naming the file when it cannot.
void PlaceDatabase(const std::string& file, bool inPlace);

// A connection that closes with its owner. Throws UsageError naming |path|
// when it cannot open; |readOnly| opens with SQLITE_OPEN_READONLY, otherwise
// the file is made when missing.
class Connection {
 public:
  Connection(const std::string& path, bool readOnly);
  ~Connection() { sqlite3_close(db_); }
  sqlite3* get() const { return db_; }
  // Runs |sql| (no results); throws UsageError with SQLite's message.
  void Exec(const std::string& sql) const;
  // The rows of one statement, each value as JSON (NULL as null, a blob as
  // x'..' text); the column names go to |columns| when given.
  std::vector<Json> Rows(const std::string& sql, std::vector<std::string>* columns = NULL) const;

 private:
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;
  sqlite3* db_;
};

// Makes the store's tables in |db| with the store's own schema (and its
// journal mode): the tables check compares with and import fills.
void CreateStoreTables(const Connection& db);

// ---- Layouts as rows.

// One table's rows in rowid order, each an object of column to value; |lines|
// holds each row's line in the JSON it was read from (empty when read from a
// database).
struct RowTable {
  std::vector<Json> rows;
  std::vector<int> lines;
};
struct Layout {
  RowTable menus, pages, boxes;
};
// Every row of Menus, Pages and Boxes; a table that is missing reads empty.
Layout ReadLayout(const Connection& db);

// One problem that check found: a line a person can act on, and the row it
// starts from ('m', 'p' or 'b' and its id; 0 for the database as a whole).
struct Finding {
  std::string text;
  char table;
  int64_t id;
};
// What is wrong with the rows of |layout| as a layout.
std::vector<Finding> CheckLayout(const Layout& layout);
// What is wrong with the database itself: its schema against the store's,
// its journal mode, and SQLite's integrity check.
std::vector<Finding> CheckDatabase(const Connection& db);

// ---- Field logs.

// The scenario that the package jobs logged in |log| (dlogutil output in any
// of its formats) imply, as korrin-sim commands on |out|; the lines that
// could not be placed are said as comments. Returns how many jobs it found.
int ReplayLog(std::istream& log, const std::string& name, std::ostream& out);
// |line| as `dlogutil -v brief` prints it on a phone: "P/TAG(PID): message",
// this process standing for the launcher's.
void PrintDlogutilLine(const sim::LogLine& line, std::ostream& out);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_PHONE_DB_H_
