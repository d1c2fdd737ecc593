// The views of korrin-sim: the layout database drawn as the launcher shows it
// (pages of 4-column grids, folders 3 by 3), its raw tables, and what a
// command changed in it; the views the engine computes, drawn the same way;
// and the platform log. The stored views read the database file through a
// connection of their own, so looking never changes the engine's state.
#ifndef KORRIN_SIM_VIEWS_H_
#define KORRIN_SIM_VIEWS_H_

#include <stdint.h>

#include <map>
#include <ostream>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "launcher-data-manager/game-data.h"
#include "sim/device.h"

namespace korrin_sim {

// One cell of a grid: a box at (col, row), and what it shows.
struct GridBox {
  int col;
  int row;
  std::string label;
};

// What a box shows: "[name]" for a folder, "<name>" for a shortcut (box type
// 3), otherwise its stored name or else the label the device gives appId.
std::string BoxLabel(bool isFolder, int boxType, const std::string& appId,
                     const std::string& name);

// Rows of |columns| cells 16 terminal columns wide (a wider label is cut and
// ends in "~"), or with |wide| each column as wide as its widest label; each
// line indented by |indent|. Boxes outside the grid or on a taken cell are
// listed under it.
void PrintGrid(const std::vector<GridBox>& boxes, int columns, int indent, std::ostream& out,
               bool wide = false);

// How a view prints: as grids (|wide| ones cut no label), or as one record a
// box (a row for `tables`) for other tools: a JSON array holding one object a
// line, or CSV (RFC 4180, a header line first).
struct ViewStyle {
  enum Format { kGrid, kJson, kCsv } format;
  bool wide;
};

// The stored layout of menu |menuId|: each page as a grid, each folder's pages
// under the page that holds it. |ids| puts each box's id before its label.
// Records have page, pageId, folder (the folder box whose page it is, or
// null), boxId, col, row, label, appId, name, isFolder and boxType.
void PrintMenuLayout(const std::string& dbPath, int menuId, bool ids, const ViewStyle& style,
                     std::ostream& out);
// The pages of the folder box |boxId|.
void PrintFolder(const std::string& dbPath, int boxId, bool ids, const ViewStyle& style,
                 std::ostream& out);

// Pages the engine computed (the download and alphabetical views) and the
// boxes on them, page by page as grids of |columns|, or as records.
void PrintComputedView(const std::vector<boost::shared_ptr<GamePageData>>& pages,
                       const std::vector<boost::shared_ptr<GameBoxData>>& boxes, int columns,
                       const ViewStyle& style, std::ostream& out);

// Every row of the named tables (all tables when |tables| is empty). A JSON
// record names its table first; CSV takes one table. Throws UsageError for a
// table that is missing.
void PrintTables(const std::string& dbPath, const std::vector<std::string>& tables,
                 ViewStyle::Format format, std::ostream& out);

// Every row of every table, by table and row id: values as text, NULL as
// NULL, texts quoted.
struct Snapshot {
  struct Table {
    std::vector<std::string> columns;
    std::map<int64_t, std::vector<std::string> > rows;
  };
  std::map<std::string, Table> tables;
};
Snapshot TakeSnapshot(const std::string& dbPath);
// Rows added (+), removed (-) and changed (~, column by column).
void PrintChanges(const Snapshot& before, const Snapshot& after, std::ostream& out);

// ---- The platform log.

// dlog's priority for its letter (V D I W E F); throws UsageError for another.
int ParsePriority(const std::string& letter);
// |line| as "P/tag: text", a newline in the text as \n; |messageOnly| leaves
// out the engine's "file: function(line) >  " prefix.
void PrintLogLine(const sim::LogLine& line, bool messageOnly, std::ostream& out);
// Whether the engine wrote |line| as a failure. The engine logs much at error
// priority that is only information ("#Step 1", "Name[...]", "appId[...]"), so
// a line counts only when its message says that something went wrong.
bool FailureLogged(const sim::LogLine& line);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_VIEWS_H_
