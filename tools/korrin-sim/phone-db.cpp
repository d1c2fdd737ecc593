// The commands for a phone's own database: schema, sql, export, import,
// check and replay-log. Each reads the session's layout database (the device
// root's, where `open` and --db put the phone's) through a connection of its
// own, read-only but for import, so that looking never changes it.
#include "phone-db.h"

#include <errno.h>
#include <string.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <map>
#include <set>
#include <sstream>

#include "cli.h"
#include "commands.h"
#include "common/device-path.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "session.h"

namespace po = boost::program_options;
namespace fs = std::filesystem;

namespace korrin_sim {

// The schema stays the store's: a store of korrin-sim's own, which opens
// nothing, runs its schema on |db|.
void CreateStoreTables(const Connection& db) {
  LauncherDataManager store;
  store.m_db = db.get();
  store._CreateTables();
  store.m_db = NULL;  // |db| is not the store's to close
}

namespace {

// The three tables as export writes them: JSON key, table, key column.
struct TableName {
  const char* key;
  const char* table;
  const char* id;
  RowTable Layout::*rows;
};
const TableName kTables[] = {{"menus", "Menus", "menuId", &Layout::menus},
                             {"pages", "Pages", "pageId", &Layout::pages},
                             {"boxes", "Boxes", "boxId", &Layout::boxes}};

void CopyFile(const std::string& from, const std::string& to) {
  std::error_code error;
  fs::copy_file(from, to, fs::copy_options::overwrite_existing, error);
  if (error) throw UsageError("cannot copy " + from + " to " + to + ": " + error.message());
}

}  // namespace

void PlaceDatabase(const std::string& file, bool inPlace) {
  std::string dbPath = korrin::DevicePath(korrin::kGameDataDbPath);
  if (!fs::is_regular_file(file)) throw UsageError("no database file " + file);
  std::error_code ignored;
  fs::remove(dbPath, ignored);
  fs::remove(dbPath + "-journal", ignored);
  if (inPlace) {
    // SQLite follows the link, and keeps the journal beside the file itself.
    fs::create_symlink(fs::absolute(file), dbPath, ignored);
    if (ignored) throw UsageError("cannot link " + dbPath + " to " + file);
    return;
  }
  CopyFile(file, dbPath);
  // A journal left by a crash is part of the database: it rolls back on open.
  if (fs::exists(file + "-journal")) CopyFile(file + "-journal", dbPath + "-journal");
}

// ---- Connections.

Connection::Connection(const std::string& path, bool readOnly) : db_(NULL) {
  if (readOnly && !fs::exists(path)) throw UsageError("no layout database at " + path);
  int flags = readOnly ? SQLITE_OPEN_READONLY : SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE;
  if (sqlite3_open_v2(path.c_str(), &db_, flags, NULL) != SQLITE_OK) {
    std::string message = db_ != NULL ? sqlite3_errmsg(db_) : "out of memory";
    sqlite3_close(db_);
    throw UsageError("cannot open " + path + ": " + message);
  }
}

void Connection::Exec(const std::string& sql) const {
  char* error = NULL;
  if (sqlite3_exec(db_, sql.c_str(), NULL, NULL, &error) != SQLITE_OK) {
    std::string message = error != NULL ? error : sqlite3_errmsg(db_);
    sqlite3_free(error);
    throw UsageError(message);
  }
}

namespace {

Json ColumnValue(sqlite3_stmt* stmt, int i) {
  switch (sqlite3_column_type(stmt, i)) {
    case SQLITE_NULL:
      return nullptr;
    case SQLITE_INTEGER:
      return sqlite3_column_int64(stmt, i);
    case SQLITE_FLOAT:
      return sqlite3_column_double(stmt, i);
    case SQLITE_TEXT:
      return std::string(reinterpret_cast<const char*>(sqlite3_column_text(stmt, i)),
                         static_cast<size_t>(sqlite3_column_bytes(stmt, i)));
    default: {
      static const char kHex[] = "0123456789abcdef";
      const unsigned char* blob = static_cast<const unsigned char*>(sqlite3_column_blob(stmt, i));
      std::string hex = "x'";
      for (int b = 0; b < sqlite3_column_bytes(stmt, i); ++b) {
        hex += std::string(1, kHex[blob[b] >> 4]) + kHex[blob[b] & 15];
      }
      return hex + "'";
    }
  }
}

// Finalises a statement with its owner.
struct Statement {
  sqlite3_stmt* stmt = NULL;
  ~Statement() { sqlite3_finalize(stmt); }
};

}  // namespace

std::vector<Json> Connection::Rows(const std::string& sql,
                                   std::vector<std::string>* columns) const {
  Statement s;
  if (sqlite3_prepare_v2(db_, sql.c_str(), -1, &s.stmt, NULL) != SQLITE_OK) {
    throw UsageError(sqlite3_errmsg(db_));
  }
  int count = sqlite3_column_count(s.stmt);
  std::vector<std::string> names;
  for (int i = 0; i < count; ++i) names.push_back(sqlite3_column_name(s.stmt, i));
  if (columns != NULL) *columns = names;
  std::vector<Json> rows;
  int rc;
  while ((rc = sqlite3_step(s.stmt)) == SQLITE_ROW) {
    Json row = Json::object();
    for (int i = 0; i < count; ++i) row[names[i]] = ColumnValue(s.stmt, i);
    rows.push_back(row);
  }
  if (rc != SQLITE_DONE) throw UsageError(sqlite3_errmsg(db_));
  return rows;
}

Layout ReadLayout(const Connection& db) {
  Layout layout;
  std::set<std::string> present;
  for (const Json& row : db.Rows("SELECT name FROM sqlite_master WHERE type = 'table'")) {
    present.insert(row["name"].get<std::string>());
  }
  for (const TableName& t : kTables) {
    if (!present.count(t.table)) continue;
    (layout.*t.rows).rows = db.Rows(std::string("SELECT * FROM ") + t.table + " ORDER BY rowid");
  }
  return layout;
}

namespace {

std::string DbPath(Session& session) { return session.DatabasePath(); }

// ---- schema and sql.

void RunSchema(Session& session, const Args&) {
  Connection db(DbPath(session), true);
  for (const Json& row : db.Rows("SELECT sql FROM sqlite_master WHERE sql IS NOT NULL "
                                 "ORDER BY rowid")) {
    Out() << row["sql"].get<std::string>() << ";\n";
  }
  // A file records only whether it is in WAL mode; PERSIST is a setting of
  // each connection, which the store makes as it opens.
  bool wal = db.Rows("PRAGMA journal_mode")[0].begin()->get<std::string>() == "wal";
  Out() << (wal ? "-- journal: wal (the launcher uses persist)\n"
                : "-- journal: rollback (the store sets persist on its connection)\n");
}

std::string Shown(const Json& value) {
  if (value.is_null()) return "NULL";
  if (value.is_string()) return Quote(value.get<std::string>());
  return value.dump();
}

void RunSql(Session& session, const Args& args) {
  std::string sql = args.rest();
  if (sql.find_first_not_of(" \t;") == std::string::npos) throw UsageError("usage: sql SELECT ...");
  Connection db(DbPath(session), true);
  Statement s;
  const char* tail = NULL;
  if (sqlite3_prepare_v2(db.get(), sql.c_str(), -1, &s.stmt, &tail) != SQLITE_OK) {
    throw UsageError(std::string("sql: ") + sqlite3_errmsg(db.get()));
  }
  if (s.stmt == NULL) throw UsageError("usage: sql SELECT ...");
  if (std::string(tail).find_first_not_of(" \t\n;") != std::string::npos) {
    throw UsageError("sql: one statement only");
  }
  // The connection is read-only already; this says so before SQLite would.
  if (!sqlite3_stmt_readonly(s.stmt)) throw UsageError("sql: only statements that read");
  int count = sqlite3_column_count(s.stmt);
  std::string header;
  for (int i = 0; i < count; ++i) header += (i ? " | " : "") + std::string(sqlite3_column_name(s.stmt, i));
  if (count > 0) Out() << header << "\n";
  int rc;
  while ((rc = sqlite3_step(s.stmt)) == SQLITE_ROW) {
    std::string line;
    for (int i = 0; i < count; ++i) line += (i ? " | " : "") + Shown(ColumnValue(s.stmt, i));
    Out() << line << "\n";
  }
  if (rc != SQLITE_DONE) throw UsageError(std::string("sql: ") + sqlite3_errmsg(db.get()));
}

// ---- export and import.

// One record per line, so that a line number names a record.
void WriteLayout(const Layout& layout, std::ostream& out) {
  out << "{\n";
  for (size_t t = 0; t < 3; ++t) {
    const std::vector<Json>& rows = (layout.*kTables[t].rows).rows;
    out << "\"" << kTables[t].key << "\": [" << (rows.empty() ? "" : "\n");
    for (size_t i = 0; i < rows.size(); ++i) {
      out << rows[i].dump() << (i + 1 < rows.size() ? ",\n" : "\n");
    }
    out << "]" << (t < 2 ? ",\n" : "\n");
  }
  out << "}\n";
}

void RunExport(Session& session, const Args& args) {
  Connection db(DbPath(session), true);
  Layout layout = ReadLayout(db);
  std::string file = args.Text("FILE");
  if (file == "-") return WriteLayout(layout, Out());
  std::ofstream out(file);
  if (out) WriteLayout(layout, out);
  if (!out.flush()) throw UsageError("cannot write " + file + ": " + strerror(errno));
  Out() << "exported " << layout.menus.rows.size() << " menus, " << layout.pages.rows.size()
        << " pages, " << layout.boxes.rows.size() << " boxes to " << file << "\n";
}

// Line numbers of byte offsets in a text.
class LineIndex {
 public:
  explicit LineIndex(const std::string& text) {
    for (size_t i = 0; i < text.size(); ++i) {
      if (text[i] == '\n') newlines_.push_back(i);
    }
  }
  int LineOf(size_t offset) const {
    return 1 + static_cast<int>(std::lower_bound(newlines_.begin(), newlines_.end(), offset) -
                                newlines_.begin());
  }

 private:
  std::vector<size_t> newlines_;
};

// Notes the line where each record (an object inside a top-level array)
// starts. The parser reads '{' and tells of it before reading on, so the
// stream stands just past it.
class RecordLines : public nlohmann::json_sax<Json> {
 public:
  RecordLines(std::istream& in, const LineIndex& index) : in_(in), index_(index) {}
  std::map<std::string, std::vector<int> > lines;

  bool start_object(std::size_t) override {
    if (depth_++ == 2) {
      lines[key_].push_back(index_.LineOf(static_cast<size_t>(in_.tellg()) - 1));
    }
    return true;
  }
  bool end_object() override { return --depth_, true; }
  bool start_array(std::size_t) override { return ++depth_, true; }
  bool end_array() override { return --depth_, true; }
  bool key(string_t& name) override {
    if (depth_ == 1) key_ = name;
    return true;
  }
  bool null() override { return true; }
  bool boolean(bool) override { return true; }
  bool number_integer(number_integer_t) override { return true; }
  bool number_unsigned(number_unsigned_t) override { return true; }
  bool number_float(number_float_t, const string_t&) override { return true; }
  bool string(string_t&) override { return true; }
  bool binary(binary_t&) override { return true; }
  bool parse_error(std::size_t, const std::string&, const nlohmann::detail::exception&) override {
    return false;
  }

 private:
  std::istream& in_;
  const LineIndex& index_;
  int depth_ = 0;
  std::string key_;
};

// The columns of the store's tables and their declared types.
std::map<std::string, std::map<std::string, std::string> > SchemaColumns() {
  Connection scratch(":memory:", false);
  CreateStoreTables(scratch);
  std::map<std::string, std::map<std::string, std::string> > tables;
  for (const TableName& t : kTables) {
    for (const Json& c : scratch.Rows(std::string("PRAGMA table_info(") + t.table + ")")) {
      tables[t.table][c["name"].get<std::string>()] = c["type"].get<std::string>();
    }
  }
  return tables;
}

// The layout in |text|, every record typed as its column is; throws
// UsageError naming |file| and the line of the first problem.
Layout ParseLayout(const std::string& text, const std::string& file) {
  LineIndex index(text);
  auto fail = [&](int line, const std::string& what) {
    throw UsageError(file + ":" + std::to_string(line) + ": " + what);
  };
  Json doc;
  try {
    doc = Json::parse(text);
  } catch (const Json::parse_error& e) {
    fail(index.LineOf(e.byte > 0 ? e.byte - 1 : 0), "not JSON: " + std::string(e.what()));
  }
  if (!doc.is_object()) fail(1, "not a layout: an object of menus, pages and boxes");
  std::istringstream in(text);
  RecordLines lines(in, index);
  Json::sax_parse(in, &lines);
  std::map<std::string, std::map<std::string, std::string> > schema = SchemaColumns();
  Layout layout;
  for (auto it = doc.begin(); it != doc.end(); ++it) {
    bool known = false;
    for (const TableName& t : kTables) known = known || it.key() == t.key;
    if (!known) fail(1, "unknown key \"" + it.key() + "\" (menus, pages, boxes)");
  }
  for (const TableName& t : kTables) {
    if (!doc.contains(t.key) || !doc[t.key].is_array()) {
      fail(1, std::string("no \"") + t.key + "\" array");
    }
    RowTable& table = layout.*t.rows;
    table.rows = doc[t.key].get<std::vector<Json> >();
    table.lines = lines.lines[t.key];
    const std::map<std::string, std::string>& columns = schema[t.table];
    for (size_t i = 0; i < table.rows.size(); ++i) {
      Json& row = table.rows[i];
      int line = i < table.lines.size() ? table.lines[i] : 1;
      if (!row.is_object()) fail(line, std::string(t.key) + ": a record is an object");
      if (!row.contains(t.id) || !row[t.id].is_number_integer()) {
        fail(line, std::string(t.key) + ": no integer " + t.id);
      }
      Json typed = Json::object();
      for (const auto& column : columns) {
        Json value = row.contains(column.first) ? row[column.first] : Json(nullptr);
        if (value.is_boolean()) value = value.get<bool>() ? 1 : 0;
        bool integer = column.second == "INTEGER";
        if (!value.is_null() && (integer ? !value.is_number_integer() : !value.is_string())) {
          fail(line, std::string(t.table) + "." + column.first + " is " +
                         (integer ? "an integer" : "a text") + " or null, not " + value.dump());
        }
        typed[column.first] = value;
      }
      for (auto it = row.begin(); it != row.end(); ++it) {
        if (!columns.count(it.key())) fail(line, std::string(t.table) + " has no column " + it.key());
      }
      row = typed;
    }
  }
  return layout;
}

int LineOfRow(const Layout& layout, char table, int64_t id) {
  for (const TableName& t : kTables) {
    if (t.key[0] != table) continue;
    const RowTable& rows = layout.*t.rows;
    for (size_t i = 0; i < rows.rows.size() && i < rows.lines.size(); ++i) {
      if (rows.rows[i][t.id] == id) return rows.lines[i];
    }
  }
  return 1;
}

bool HoldsRows(const Connection& db) {
  Layout layout = ReadLayout(db);
  return !layout.menus.rows.empty() || !layout.pages.rows.empty() || !layout.boxes.rows.empty();
}

void InsertRows(const Connection& db, const char* table, const std::vector<Json>& rows) {
  if (rows.empty()) return;
  std::string names, params;
  for (auto it = rows[0].begin(); it != rows[0].end(); ++it) {
    names += (names.empty() ? "" : ", ") + it.key();
    params += params.empty() ? "?" : ", ?";
  }
  Statement s;
  std::string sql = std::string("INSERT INTO ") + table + "(" + names + ") VALUES(" + params + ")";
  if (sqlite3_prepare_v2(db.get(), sql.c_str(), -1, &s.stmt, NULL) != SQLITE_OK) {
    throw UsageError(sqlite3_errmsg(db.get()));
  }
  for (const Json& row : rows) {
    int i = 1;
    for (auto it = row.begin(); it != row.end(); ++it, ++i) {
      if (it->is_null()) {
        sqlite3_bind_null(s.stmt, i);
      } else if (it->is_number_integer()) {
        sqlite3_bind_int64(s.stmt, i, it->get<int64_t>());
      } else {
        sqlite3_bind_text(s.stmt, i, it->get_ref<const std::string&>().c_str(), -1,
                          SQLITE_TRANSIENT);
      }
    }
    if (sqlite3_step(s.stmt) != SQLITE_DONE) {
      throw UsageError(std::string("import: ") + sqlite3_errmsg(db.get()));
    }
    sqlite3_reset(s.stmt);
  }
}

void RunImport(Session& session, const Args& args) {
  std::string file = args.Text("FILE");
  std::ifstream in(file, std::ios::binary);
  if (!in) throw UsageError("cannot read " + file + ": " + strerror(errno));
  std::string text((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  Layout layout = ParseLayout(text, file);
  std::vector<Finding> findings = CheckLayout(layout);
  if (!findings.empty()) {
    const Finding& first = findings[0];
    throw UsageError(file + ":" + std::to_string(LineOfRow(layout, first.table, first.id)) +
                     ": " + first.text + " (import writes only layouts that check passes)");
  }
  bool force = args.Get<bool>("force");
  std::string target = args.Has("DBFILE") ? args.Text("DBFILE") : DbPath(session);
  bool fresh = !fs::exists(target);
  if (!fresh && !force && (args.Has("DBFILE") ? fs::file_size(target) > 0
                                              : HoldsRows(Connection(target, true)))) {
    throw UsageError("import: " + target + " holds a layout already (--force replaces it)");
  }
  if (!fresh && args.Has("DBFILE") && force) {
    fs::remove(target);
    fs::remove(target + "-journal");
  }
  Connection db(target, false);
  CreateStoreTables(db);
  db.Exec("BEGIN IMMEDIATE");
  try {
    for (const TableName& t : kTables) db.Exec(std::string("DELETE FROM ") + t.table);
    db.Exec("DELETE FROM sqlite_sequence");
    for (const TableName& t : kTables) InsertRows(db, t.table, (layout.*t.rows).rows);
    db.Exec("COMMIT");
  } catch (...) {
    sqlite3_exec(db.get(), "ROLLBACK", NULL, NULL, NULL);
    throw;
  }
  Out() << "imported " << layout.menus.rows.size() << " menus, " << layout.pages.rows.size()
        << " pages, " << layout.boxes.rows.size() << " boxes into " << target << "\n";
}

// ---- check and replay-log.

void RunCheck(Session& session, const Args& args) {
  Connection db(DbPath(session), true);
  std::vector<Finding> findings = CheckDatabase(db);
  for (const Finding& f : CheckLayout(ReadLayout(db))) findings.push_back(f);
  if (findings.empty()) {
    Out() << "ok\n";
    return;
  }
  std::string report;
  for (const Finding& f : findings) report += f.text + "\n";
  if (args.Get<bool>("keep-going")) {
    Out() << report;
    return;
  }
  report.pop_back();
  throw UsageError("check: " + std::to_string(findings.size()) +
                   (findings.size() == 1 ? " problem:\n" : " problems:\n") + report);
}

void RunReplayLog(Session&, const Args& args) {
  std::string file = args.Text("LOG");
  std::ifstream in(file);
  if (!in) throw UsageError("cannot read " + file + ": " + strerror(errno));
  if (!args.Has("output")) {
    ReplayLog(in, file, Out());
    return;
  }
  std::ofstream out(args.Text("output"));
  int jobs = ReplayLog(in, file, out);
  if (!out.flush()) throw UsageError("cannot write " + args.Text("output"));
  Out() << jobs << (jobs == 1 ? " package job" : " package jobs") << " written to "
        << args.Text("output") << "\n";
}

void NoOptions(po::options_description&) {}

}  // namespace

std::vector<Command> PhonedbCommands() {
  const bool kAction = true, kView = false;
  return {
      {"schema", "", "show the database's schema and journal mode",
       "Prints the SQL of every table and index of the layout database (the one\n"
       "`open` or --db gave, else the device's), then its journal mode.",
       "schema", kView, Command::kOptions, NoOptions, RunSchema},
      {"sql", "SELECT...", "run one read-only SQL statement",
       "Runs one statement on a read-only connection to the layout database and\n"
       "prints a header line, then its rows, values separated by \" | \", texts\n"
       "quoted, NULL as NULL. A statement that writes, or more than one, is refused.",
       "sql SELECT appId, col, row FROM Boxes WHERE pageId = 1", kView, Command::kText,
       NoOptions, RunSql},
      {"export", "FILE", "write the layout as JSON (- for the screen)",
       "Writes every row of Menus, Pages and Boxes, every column, NULL as null, as a\n"
       "JSON object {\"menus\": [...], \"pages\": [...], \"boxes\": [...]}, one row per\n"
       "line, for backups and test fixtures. `import` reads it back.",
       "export layout.json", kView, Command::kOptions, NoOptions, RunExport},
      {"import", "FILE [DBFILE]", "make a layout database from exported JSON",
       "Reads a layout as `export` writes it and writes it, in one transaction, to\n"
       "a new database DBFILE, or to the session's database when that holds no rows\n"
       "(--force replaces what is there). Input that is not JSON, holds a column of\n"
       "the wrong type, or breaks the layout (anything `check` reports) is refused\n"
       "with FILE:LINE of the record at fault. Missing columns are NULL.",
       "import layout.json\nimport layout.json copy.db --force", kAction, Command::kOptions,
       [](po::options_description& o) {
         o.add_options()("force", po::bool_switch(), "replace a database that holds rows");
       },
       RunImport},
      {"check", "", "report what is wrong with the layout database",
       "Checks the layout database on a read-only connection: two boxes in one cell,\n"
       "cells off the grid (col 1..4 on a menu page, 1..3 in a folder, row from 1),\n"
       "boxes on missing pages, pages of missing menus or folders, folders without\n"
       "pages, empty pages, page numbers with gaps or repeats, two ordinary boxes for\n"
       "one application, shortcuts of applications without a box, the schema against\n"
       "the store's, the journal mode (a file records only WAL, which the launcher\n"
       "never uses) and SQLite's integrity_check. Prints ok, or fails with one line\n"
       "per problem naming the rows (--keep-going prints them and goes on).",
       "check\nkorrin-sim check --db phone.db", kView, Command::kOptions,
       [](po::options_description& o) {
         o.add_options()("keep-going", po::bool_switch(), "print the problems, do not fail");
       },
       RunCheck},
      {"replay-log", "LOG", "turn a field log into a scenario script",
       "Reads a phone's log (dlogutil output in any format: brief, tag, time,\n"
       "threadtime, long, raw...) and writes the package jobs the engine logged (its\n"
       "\"#Step 3\", \"appId[..]\", \"#8\", \"#9\" lines) as a script of install, update\n"
       "and uninstall commands, to play on the opened database. The log names only\n"
       "applications: each job becomes a package named after its first one. Lines\n"
       "that cannot be placed are said in # comments, with their line numbers.",
       "replay-log phone.log --output replay.ksim\nkorrin-sim open phone.db replay.ksim",
       kView, Command::kOptions,
       [](po::options_description& o) {
         o.add_options()("output", po::value<std::string>()->value_name("FILE"),
                         "write the script to FILE");
       },
       RunReplayLog},
  };
}

}  // namespace korrin_sim
