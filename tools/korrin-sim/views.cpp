#include "views.h"

#include <ctype.h>
#include <dlog.h>
#include <sqlite3.h>
#include <stdlib.h>

#include <algorithm>
#include <nlohmann/json.hpp>
#include <set>

#include "cli.h"
#include "launcher-data-manager/game-data.h"
#include "sim/device.h"
#include "width.h"

namespace korrin_sim {

namespace {

const size_t kCellWidth = 16;  // terminal columns
const int kMenuColumns = 4;
const int kFolderColumns = 3;

// One value as SQLite gave it.
struct Value {
  int type;  // SQLITE_INTEGER, SQLITE_TEXT, ...
  std::string text;

  int Int() const { return atoi(text.c_str()); }
  // As the raw views print it.
  std::string Show() const {
    if (type == SQLITE_NULL) return "NULL";
    if (type == SQLITE_TEXT) return Quote(text);
    if (type != SQLITE_BLOB) return text;
    static const char kHex[] = "0123456789abcdef";
    std::string hex = "x'";
    for (unsigned char c : text) hex += std::string(1, kHex[c >> 4]) + kHex[c & 15];
    return hex + "'";
  }
  // As a JSON value: numbers as numbers, NULL as null, a blob as Show() does.
  nlohmann::ordered_json Json() const {
    if (type == SQLITE_NULL) return nullptr;
    if (type == SQLITE_INTEGER) return atoll(text.c_str());
    if (type == SQLITE_FLOAT) return atof(text.c_str());
    return type == SQLITE_TEXT ? text : Show();
  }
};
typedef std::vector<Value> Row;

// A read-only connection to the layout database; invalid when the file
// cannot be opened (not made yet, say).
class Reader {
 public:
  explicit Reader(const std::string& path) : db_(NULL) {
    if (sqlite3_open_v2(path.c_str(), &db_, SQLITE_OPEN_READONLY, NULL) != SQLITE_OK) {
      sqlite3_close(db_);
      db_ = NULL;
    }
  }
  ~Reader() { sqlite3_close(db_); }
  bool ok() const { return db_ != NULL; }

  // The rows of |sql|, with |param| bound to its one parameter if it has one.
  // Empty when the statement fails (a table that is missing, say).
  std::vector<Row> Rows(const std::string& sql, int64_t param = 0) const {
    std::vector<Row> rows;
    sqlite3_stmt* stmt = NULL;
    if (db_ == NULL || sqlite3_prepare_v2(db_, sql.c_str(), -1, &stmt, NULL) != SQLITE_OK) {
      return rows;
    }
    if (sqlite3_bind_parameter_count(stmt) > 0) sqlite3_bind_int64(stmt, 1, param);
    while (sqlite3_step(stmt) == SQLITE_ROW) {
      Row row;
      for (int i = 0; i < sqlite3_column_count(stmt); ++i) {
        const char* text = static_cast<const char*>(sqlite3_column_blob(stmt, i));
        row.push_back(Value{sqlite3_column_type(stmt, i),
                            std::string(text != NULL ? text : "",
                                        static_cast<size_t>(sqlite3_column_bytes(stmt, i)))});
      }
      rows.push_back(row);
    }
    sqlite3_finalize(stmt);
    return rows;
  }

  std::vector<std::string> Columns(const std::string& table) const {
    std::vector<std::string> names;
    for (const Row& row : Rows("PRAGMA table_info(" + Quote(table) + ")")) {
      names.push_back(row[1].text);
    }
    return names;
  }

  // The tables the engine made, in the order it made them.
  std::vector<std::string> Tables() const {
    std::vector<std::string> names;
    for (const Row& row : Rows("SELECT name FROM sqlite_master WHERE type = 'table' AND "
                               "name NOT LIKE 'sqlite_%' ORDER BY rowid")) {
      names.push_back(row[0].text);
    }
    return names;
  }

 private:
  sqlite3* db_;
};

// ---- Records for other tools: one JSON object, or one CSV line, each.

typedef nlohmann::ordered_json Record;

const std::vector<std::string> kBoxColumns = {"page", "pageId",   "folder", "boxId",
                                              "col",  "row",      "label",  "appId",
                                              "name", "isFolder", "boxType"};

Record BoxRecord(int pageNo, int pageId, const Record& folder, int boxId, int col, int row,
                 const std::string& label, const std::string& appId, const std::string& name,
                 bool isFolder, int boxType) {
  return Record{{"page", pageNo}, {"pageId", pageId},     {"folder", folder},  {"boxId", boxId},
                {"col", col},     {"row", row},           {"label", label},    {"appId", appId},
                {"name", name},   {"isFolder", isFolder}, {"boxType", boxType}};
}

std::string CsvField(const Record& value) {
  if (value.is_null()) return "";
  std::string text = value.is_string() ? value.get<std::string>() : value.dump();
  if (text.find_first_of(",\"\r\n") == std::string::npos) return text;
  std::string quoted = "\"";
  for (char c : text) quoted += c == '"' ? std::string("\"\"") : std::string(1, c);
  return quoted + "\"";
}

// A JSON array with one record a line, or CSV with a header of |columns|.
void PrintRecords(const std::vector<Record>& records, const std::vector<std::string>& columns,
                  ViewStyle::Format format, std::ostream& out) {
  if (format == ViewStyle::kJson) {
    out << "[";
    for (size_t i = 0; i < records.size(); ++i) {
      // A label that is not UTF-8 still prints, with U+FFFD for its bad bytes.
      out << (i ? ",\n" : "\n")
          << records[i].dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
    }
    out << (records.empty() ? "]\n" : "\n]\n");
    return;
  }
  std::string line;
  for (const std::string& column : columns) line += (line.empty() ? "" : ",") + column;
  out << line << "\n";
  for (const Record& record : records) {
    line.clear();
    for (size_t i = 0; i < columns.size(); ++i) {
      Record::const_iterator value = record.find(columns[i]);
      line += (i ? "," : "") + (value != record.end() ? CsvField(*value) : std::string());
    }
    out << line << "\n";
  }
}

std::string TrimRight(std::string line) {
  line.erase(line.find_last_not_of(' ') + 1);
  return line;
}

// The boxes of one stored page, drawn as a grid, then the pages of each folder
// on it, indented under it.
void PrintStoredPage(const Reader& db, int64_t pageId, int columns, int indent, bool ids, bool wide,
                     std::ostream& out);

// The folders being drawn, outermost first: a folder whose page holds the
// folder itself (or one around it) is named, not drawn again forever.
std::vector<int64_t> g_openFolders;

// The boxes of one stored page and of the folders on it, as records.
void CollectStoredPage(const Reader& db, const Row& page, const Record& folder,
                       std::vector<Record>& records) {
  for (const Row& box : db.Rows("SELECT boxId, isFolder, boxType, appId, name, col, row FROM "
                                "Boxes WHERE pageId = ? ORDER BY row, col, boxId",
                                page[0].Int())) {
    bool isFolder = box[1].Int() != 0;
    records.push_back(BoxRecord(page[1].Int(), page[0].Int(), folder, box[0].Int(), box[5].Int(),
                                box[6].Int(),
                                BoxLabel(isFolder, box[2].Int(), box[3].text, box[4].text),
                                box[3].text, box[4].text, isFolder, box[2].Int()));
    if (!isFolder || std::find(g_openFolders.begin(), g_openFolders.end(), box[0].Int()) !=
                         g_openFolders.end()) {
      continue;  // a folder that holds itself is listed once
    }
    g_openFolders.push_back(box[0].Int());
    for (const Row& inner : db.Rows("SELECT pageId, pageNo FROM Pages WHERE isFolder = 1 AND "
                                    "parentId = ? ORDER BY pageNo",
                                    box[0].Int())) {
      CollectStoredPage(db, inner, box[0].Int(), records);
    }
    g_openFolders.pop_back();
  }
}

void PrintFolderPages(const Reader& db, int64_t boxId, const std::string& name, int indent,
                      bool ids, bool wide, std::ostream& out) {
  if (std::find(g_openFolders.begin(), g_openFolders.end(), boxId) != g_openFolders.end()) {
    out << std::string(indent, ' ') << "folder " << Quote(name) << " (box " << boxId
        << ") holds itself: shown above\n";
    return;
  }
  g_openFolders.push_back(boxId);
  struct Close {
    ~Close() { g_openFolders.pop_back(); }
  } close;
  std::vector<Row> pages = db.Rows(
      "SELECT pageId, pageNo FROM Pages WHERE isFolder = 1 AND parentId = ? ORDER BY pageNo",
      boxId);
  std::string pad(indent, ' ');
  if (pages.empty()) out << pad << "folder " << Quote(name) << ": no pages\n";
  for (const Row& page : pages) {
    out << pad << "folder " << Quote(name) << ", page " << page[1].text;
    if (ids) out << " (pageId " << page[0].text << ")";
    out << "\n";
    PrintStoredPage(db, page[0].Int(), kFolderColumns, indent, ids, wide, out);
  }
}

void PrintStoredPage(const Reader& db, int64_t pageId, int columns, int indent, bool ids, bool wide,
                     std::ostream& out) {
  std::vector<Row> boxes = db.Rows(
      "SELECT boxId, isFolder, boxType, appId, name, col, row FROM Boxes WHERE pageId = ? "
      "ORDER BY row, col, boxId",
      pageId);
  std::vector<GridBox> grid;
  for (const Row& box : boxes) {
    std::string label = BoxLabel(box[1].Int() != 0, box[2].Int(), box[3].text, box[4].text);
    if (ids) label = "#" + box[0].text + " " + label;
    grid.push_back(GridBox{box[5].Int(), box[6].Int(), label});
  }
  PrintGrid(grid, columns, indent, out, wide);
  for (const Row& box : boxes) {
    if (box[1].Int() != 0) {
      PrintFolderPages(db, box[0].Int(), box[4].text, indent + 4, ids, wide, out);
    }
  }
}

const char kNoDatabase[] = "no layout database yet: `start` makes it\n";

// dlog priorities by letter, lowest first, from DLOG_VERBOSE (2).
const std::string kPriorities = "VDIWEF";

char PriorityLetter(int priority) {
  int index = priority - 2;
  return index >= 0 && index < static_cast<int>(kPriorities.size()) ? kPriorities[index] : '?';
}

// The text after the engine's "file: function(line) >  " prefix.
std::string Message(const std::string& text) {
  size_t end = text.find(") >  ");
  return end == std::string::npos ? text : text.substr(end + 5);
}

// A log text on one line: a newline in it shows as \n, as it was written.
std::string OneLine(const std::string& text) {
  std::string line;
  for (char c : text) line += c == '\n' ? std::string("\\n") : std::string(1, c);
  return line;
}

}  // namespace

std::string BoxLabel(bool isFolder, int boxType, const std::string& appId,
                     const std::string& name) {
  if (isFolder) return "[" + name + "]";
  if (boxType == kShortcutBoxType) return "<" + name + ">";
  if (!name.empty()) return name;
  const sim::App* app = sim::Device::Get().FindApp(appId);
  return app != NULL && app->label && !app->label->empty() ? *app->label : appId;
}

void PrintGrid(const std::vector<GridBox>& boxes, int columns, int indent, std::ostream& out,
               bool wide) {
  std::string pad(indent, ' ');
  if (boxes.empty()) {
    out << pad << " (empty)\n";
    return;
  }
  std::map<std::pair<int, int>, std::string> cells;  // (row, col) -> label
  std::vector<const GridBox*> elsewhere;
  for (const GridBox& box : boxes) {
    bool onGrid = box.row >= 1 && box.col >= 1 && box.col <= columns;
    if (!onGrid || !cells.emplace(std::make_pair(box.row, box.col), box.label).second) {
      elsewhere.push_back(&box);
    }
  }
  std::vector<size_t> widths(columns + 1, kCellWidth);
  if (wide) {
    std::fill(widths.begin(), widths.end(), 0);
    for (const auto& cell : cells) {
      widths[cell.first.second] = std::max(widths[cell.first.second], TextColumns(cell.second));
    }
  }
  auto drawRow = [&](int row) {
    std::string line = pad + (row < 10 ? " " : "") + std::to_string(row) + " ";
    int last = 0;
    for (int col = 1; col <= columns; ++col) {
      if (cells.count(std::make_pair(row, col))) last = col;
    }
    for (int col = 1; col <= last; ++col) {
      std::map<std::pair<int, int>, std::string>::const_iterator cell =
          cells.find(std::make_pair(row, col));
      line += "| " + FitColumns(cell != cells.end() ? cell->second : "", widths[col]) + " ";
    }
    out << TrimRight(line) << "\n";
  };
  // Rows are drawn from 1 to the last one used; a long run of empty rows (a box
  // far down, in row 2147483647 say) is one line.
  const long long kEmptyRowsDrawn = 9;
  long long drawn = 0;  // the last row drawn
  for (std::map<std::pair<int, int>, std::string>::const_iterator used = cells.begin();
       used != cells.end(); used = cells.upper_bound(std::make_pair(used->first.first, columns))) {
    long long row = used->first.first;
    if (row - 1 - drawn > kEmptyRowsDrawn) {
      out << pad << "   (rows " << drawn + 1 << " to " << row - 1 << " empty)\n";
      drawn = row - 1;
    }
    while (drawn < row) drawRow(static_cast<int>(++drawn));
  }
  for (const GridBox* box : elsewhere) {
    out << pad << "   also at row " << box->row << ", col " << box->col << ": " << box->label
        << "\n";
  }
}

void PrintMenuLayout(const std::string& dbPath, int menuId, bool ids, const ViewStyle& style,
                     std::ostream& out) {
  Reader db(dbPath);
  if (!db.ok()) {
    out << kNoDatabase;
    return;
  }
  std::vector<Row> menu = db.Rows("SELECT name FROM Menus WHERE menuId = ?", menuId);
  if (menu.empty()) {
    out << "no menu " << menuId << "\n";
    return;
  }
  std::vector<Row> pages = db.Rows(
      "SELECT pageId, pageNo FROM Pages WHERE isFolder = 0 AND parentId = ? ORDER BY pageNo",
      menuId);
  if (style.format != ViewStyle::kGrid) {
    std::vector<Record> records;
    for (const Row& page : pages) CollectStoredPage(db, page, nullptr, records);
    PrintRecords(records, kBoxColumns, style.format, out);
    return;
  }
  out << "menu " << menuId << " " << menu[0][0].Show() << "\n";
  if (pages.empty()) out << " (no pages)\n";
  for (const Row& page : pages) {
    out << "page " << page[1].text;
    if (ids) out << " (pageId " << page[0].text << ")";
    out << "\n";
    PrintStoredPage(db, page[0].Int(), kMenuColumns, 0, ids, style.wide, out);
  }
}

void PrintFolder(const std::string& dbPath, int boxId, bool ids, const ViewStyle& style,
                 std::ostream& out) {
  Reader db(dbPath);
  if (!db.ok()) {
    out << kNoDatabase;
    return;
  }
  std::vector<Row> box = db.Rows("SELECT name FROM Boxes WHERE boxId = ? AND isFolder", boxId);
  if (box.empty()) {
    out << "no folder box " << boxId << "\n";
    return;
  }
  if (style.format != ViewStyle::kGrid) {
    std::vector<Record> records;
    for (const Row& page : db.Rows("SELECT pageId, pageNo FROM Pages WHERE isFolder = 1 AND "
                                   "parentId = ? ORDER BY pageNo",
                                   boxId)) {
      CollectStoredPage(db, page, boxId, records);
    }
    PrintRecords(records, kBoxColumns, style.format, out);
    return;
  }
  PrintFolderPages(db, boxId, box[0][0].text, 0, ids, style.wide, out);
}

void PrintComputedView(const std::vector<boost::shared_ptr<GamePageData>>& pages,
                       const std::vector<boost::shared_ptr<GameBoxData>>& boxes, int columns,
                       const ViewStyle& style, std::ostream& out) {
  if (style.format != ViewStyle::kGrid) {
    std::vector<Record> records;
    for (const boost::shared_ptr<GamePageData>& page : pages) {
      for (const boost::shared_ptr<GameBoxData>& box : boxes) {
        if (box->pageId != page->pageId) continue;
        records.push_back(BoxRecord(page->pageNo, page->pageId,
                                    page->isFolder ? Record(page->parentId) : Record(), box->boxId,
                                    box->col, box->row,
                                    BoxLabel(box->isFolder, box->boxType, box->appId, box->name),
                                    box->appId, box->name, box->isFolder, box->boxType));
      }
    }
    PrintRecords(records, kBoxColumns, style.format, out);
    return;
  }
  if (pages.empty()) out << " (no pages)\n";
  for (const boost::shared_ptr<GamePageData>& page : pages) {
    out << "page " << page->pageNo << " (pageId " << page->pageId << ")\n";
    std::vector<GridBox> grid;
    for (const boost::shared_ptr<GameBoxData>& box : boxes) {
      if (box->pageId != page->pageId) continue;
      grid.push_back(GridBox{box->col, box->row,
                             BoxLabel(box->isFolder, box->boxType, box->appId, box->name)});
    }
    PrintGrid(grid, columns, 0, out, style.wide);
  }
}

void PrintTables(const std::string& dbPath, const std::vector<std::string>& tables,
                 ViewStyle::Format format, std::ostream& out) {
  Reader db(dbPath);
  if (!db.ok()) {
    out << kNoDatabase;
    return;
  }
  std::vector<std::string> known = db.Tables();
  for (const std::string& table : tables) {
    if (std::find(known.begin(), known.end(), table) == known.end()) {
      throw UsageError("no table '" + table + "' (there are Menus, Pages and Boxes)");
    }
  }
  if (format == ViewStyle::kCsv && tables.size() != 1) {
    throw UsageError("--csv shows one table: name it (Menus, Pages or Boxes)");
  }
  std::vector<Record> records;
  for (const std::string& table : tables.empty() ? known : tables) {
    std::vector<std::string> columns = db.Columns(table);
    std::vector<Row> rows = db.Rows("SELECT * FROM " + Quote(table) + " ORDER BY rowid");
    if (format != ViewStyle::kGrid) {
      for (const Row& row : rows) {
        Record record = format == ViewStyle::kJson ? Record{{"table", table}} : Record::object();
        for (size_t i = 0; i < row.size() && i < columns.size(); ++i) {
          record[columns[i]] = row[i].Json();
        }
        records.push_back(record);
      }
      if (format == ViewStyle::kCsv) PrintRecords(records, columns, format, out);
      continue;
    }
    out << table << ": " << rows.size() << (rows.size() == 1 ? " row\n" : " rows\n");
    for (const Row& row : rows) {
      std::string line;
      for (size_t i = 0; i < row.size() && i < columns.size(); ++i) {
        line += (i ? " " : "  ") + columns[i] + "=" + row[i].Show();
      }
      out << line << "\n";
    }
  }
  if (format == ViewStyle::kJson) PrintRecords(records, {}, format, out);
}

Snapshot TakeSnapshot(const std::string& dbPath) {
  Snapshot snapshot;
  Reader db(dbPath);
  for (const std::string& name : db.Tables()) {
    Snapshot::Table& table = snapshot.tables[name];
    table.columns = db.Columns(name);
    for (const Row& row : db.Rows("SELECT rowid, * FROM " + Quote(name))) {
      std::vector<std::string>& values = table.rows[atoll(row[0].text.c_str())];
      for (size_t i = 1; i < row.size(); ++i) values.push_back(row[i].Show());
    }
  }
  return snapshot;
}

void PrintChanges(const Snapshot& before, const Snapshot& after, std::ostream& out) {
  static const Snapshot::Table kNone;
  std::set<std::string> names;
  for (const auto& table : before.tables) names.insert(table.first);
  for (const auto& table : after.tables) names.insert(table.first);
  bool any = false;
  for (const std::string& name : names) {
    const Snapshot::Table& old = before.tables.count(name) ? before.tables.at(name) : kNone;
    const Snapshot::Table& now = after.tables.count(name) ? after.tables.at(name) : kNone;
    const std::vector<std::string>& columns = now.columns.empty() ? old.columns : now.columns;
    // Every column of a row, or the ones that differ between two.
    auto describe = [&columns](const std::vector<std::string>& row,
                               const std::vector<std::string>* was) {
      std::string text;
      for (size_t i = 0; i < row.size() && i < columns.size(); ++i) {
        if (was == NULL) {
          text += " " + columns[i] + "=" + row[i];
        } else if (i < was->size() && (*was)[i] != row[i]) {
          text += " " + columns[i] + ": " + (*was)[i] + " -> " + row[i];
        }
      }
      return text;
    };
    std::set<int64_t> ids;
    for (const auto& row : old.rows) ids.insert(row.first);
    for (const auto& row : now.rows) ids.insert(row.first);
    for (int64_t id : ids) {
      auto was = old.rows.find(id);
      auto is = now.rows.find(id);
      std::string line;
      if (was == old.rows.end()) {
        line = "+ " + name + describe(is->second, NULL);
      } else if (is == now.rows.end()) {
        line = "- " + name + describe(was->second, NULL);
      } else if (was->second != is->second) {
        line = "~ " + name + " " + columns[0] + "=" + is->second[0] +
               describe(is->second, &was->second);
      }
      if (!line.empty()) out << line << "\n";
      any = any || !line.empty();
    }
  }
  if (!any) out << "no changes\n";
}

int ParsePriority(const std::string& letter) {
  size_t index = kPriorities.find(letter);
  if (letter.size() != 1 || index == std::string::npos) {
    throw UsageError("--priority: '" + letter + "' is not one of V D I W E F");
  }
  return static_cast<int>(index) + 2;
}

void PrintLogLine(const sim::LogLine& line, bool messageOnly, std::ostream& out) {
  std::string text = messageOnly ? Message(line.text) : line.text;
  out << PriorityLetter(line.priority) << "/" << line.tag << ": " << OneLine(text) << "\n";
}

bool FailureLogged(const sim::LogLine& line) {
  static const char* const kMarkers[] = {"error", "fail", "cannot", "invalid", "err :",
                                         "return [", "no page [", "no box ["};
  if (line.priority < DLOG_ERROR) return false;
  size_t prefix = line.text.find(") >  ");
  std::string text = line.text.substr(prefix == std::string::npos ? 0 : prefix + 5);
  std::transform(text.begin(), text.end(), text.begin(),
                 [](unsigned char c) { return std::tolower(c); });
  // Information in a failure's words: a call that worked and said no (its
  // code 0: "app_info_is_game FAILED [0] [0]" for an application that is no
  // game), and the look-up every install makes before placing a new box.
  static const char* const kNotFailures[] = {"failed [0]", "cannot find box with appid"};
  for (const char* words : kNotFailures) {
    if (text.find(words) != std::string::npos) return false;
  }
  for (const char* marker : kMarkers) {
    if (text.find(marker) != std::string::npos) return true;
  }
  return false;
}

}  // namespace korrin_sim
