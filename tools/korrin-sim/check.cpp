// The integrity check of a layout: what the rows say against what a launcher
// needs of them, each problem one line naming the rows, so that a person can
// act on it. It reads rows only; import runs it on a file before writing.
#include <algorithm>
#include <map>
#include <optional>
#include <set>
#include <tuple>

#include "cli.h"
#include "phone-db.h"

namespace korrin_sim {

namespace {

const int kMenuColumns = 4;
const int kFolderColumns = 3;

// A column's integer, none when NULL, missing or not an integer.
std::optional<int64_t> Int(const Json& row, const char* column) {
  if (!row.contains(column) || !row[column].is_number_integer()) return std::nullopt;
  return row[column].get<int64_t>();
}

int64_t IntOr0(const Json& row, const char* column) { return Int(row, column).value_or(0); }

std::string Text(const Json& row, const char* column) {
  return row.contains(column) && row[column].is_string() ? row[column].get<std::string>() : "";
}

std::string Shown(std::optional<int64_t> value) {
  return value ? std::to_string(*value) : std::string("NULL");
}

std::string Owner(bool isFolder, int64_t parentId) {
  return (isFolder ? "folder box " : "menu ") + std::to_string(parentId);
}

class Checker {
 public:
  explicit Checker(const Layout& layout) : layout_(layout) {}

  std::vector<Finding> Run() {
    for (const Json& menu : layout_.menus.rows) menus_.insert(IntOr0(menu, "menuId"));
    for (const Json& page : layout_.pages.rows) pages_[IntOr0(page, "pageId")] = &page;
    for (const Json& box : layout_.boxes.rows) {
      boxes_.insert(IntOr0(box, "boxId"));
      if (IntOr0(box, "isFolder")) folders_.insert(IntOr0(box, "boxId"));
    }
    Boxes();
    Pages();
    Applications();
    return findings_;
  }

 private:
  void Add(char table, int64_t id, const std::string& text) {
    findings_.push_back(Finding{text, table, id});
  }

  void Boxes() {
    std::map<std::tuple<int64_t, int64_t, int64_t>, int64_t> cells;
    for (const Json& box : layout_.boxes.rows) {
      int64_t id = IntOr0(box, "boxId");
      std::string name = "box " + std::to_string(id);
      std::optional<int64_t> pageId = Int(box, "pageId"), col = Int(box, "col"),
                             row = Int(box, "row");
      auto page = pageId ? pages_.find(*pageId) : pages_.end();
      if (page == pages_.end()) {
        Add('b', id, name + " is on page " + Shown(pageId) + ", which does not exist");
        continue;
      }
      ++boxesOnPage_[*pageId];
      bool inFolder = IntOr0(*page->second, "isFolder") != 0;
      int columns = inFolder ? kFolderColumns : kMenuColumns;
      if (!col || !row || *col < 1 || *col > columns || *row < 1) {
        Add('b', id, name + " is outside the grid of page " + std::to_string(*pageId) +
                         ": col " + Shown(col) + " row " + Shown(row) + " (" +
                         (inFolder ? "a folder" : "a menu") + " page has cols 1.." +
                         std::to_string(columns) + ", rows from 1)");
        continue;
      }
      auto cell = cells.emplace(std::make_tuple(*pageId, *col, *row), id);
      if (!cell.second) {
        Add('b', id, "box " + std::to_string(cell.first->second) + " and " + name +
                         " share page " + std::to_string(*pageId) + " col " +
                         std::to_string(*col) + " row " + std::to_string(*row));
      }
    }
  }

  void Pages() {
    std::map<std::pair<bool, int64_t>, std::map<int64_t, std::vector<int64_t> > > numbers;
    std::map<int64_t, int> folderPages;
    for (const Json& page : layout_.pages.rows) {
      int64_t id = IntOr0(page, "pageId");
      std::string name = "page " + std::to_string(id);
      bool isFolder = IntOr0(page, "isFolder") != 0;
      int64_t parentId = IntOr0(page, "parentId");
      if (isFolder && !folders_.count(parentId)) {
        Add('p', id, name + " belongs to folder box " + std::to_string(parentId) + ", which " +
                         (boxes_.count(parentId) ? "is not a folder" : "does not exist"));
      } else if (!isFolder && !menus_.count(parentId)) {
        Add('p', id, name + " belongs to menu " + std::to_string(parentId) +
                         ", which does not exist");
      }
      if (isFolder) ++folderPages[parentId];
      if (!boxesOnPage_.count(id)) Add('p', id, name + " holds no box");
      numbers[{isFolder, parentId}][IntOr0(page, "pageNo")].push_back(id);
    }
    for (int64_t folder : folders_) {
      if (!folderPages.count(folder)) Add('b', folder, "folder box " + std::to_string(folder) + " has no page");
    }
    for (const auto& owner : numbers) {
      std::string who = Owner(owner.first.first, owner.first.second);
      int64_t expected = 1;
      for (const auto& number : owner.second) {
        const std::vector<int64_t>& ids = number.second;
        if (number.first != expected) {
          Add('p', ids[0], who + " has no page " + std::to_string(expected) + " but a page " +
                               std::to_string(number.first) + " (page " +
                               std::to_string(ids[0]) + "): numbers run from 1 without gaps");
        }
        expected = number.first + 1;
        if (ids.size() < 2) continue;
        std::string list;
        for (size_t i = 0; i < ids.size(); ++i) {
          list += (i == 0 ? "" : i + 1 == ids.size() ? " and " : ", ") + std::to_string(ids[i]);
        }
        Add('p', ids[1], who + " has " + std::to_string(ids.size()) + " pages numbered " +
                             std::to_string(number.first) + ": pages " + list);
      }
    }
  }

  void Applications() {
    std::map<std::string, std::vector<int64_t> > ordinary;
    for (const Json& box : layout_.boxes.rows) {
      if (IntOr0(box, "isFolder") || IntOr0(box, "boxType") == kShortcut) continue;
      std::string appId = Text(box, "appId");
      if (!appId.empty()) ordinary[appId].push_back(IntOr0(box, "boxId"));
    }
    for (const auto& app : ordinary) {
      if (app.second.size() < 2) continue;
      std::string list;
      for (size_t i = 0; i < app.second.size(); ++i) {
        list += (i == 0 ? "" : i + 1 == app.second.size() ? " and " : ", ") +
                std::to_string(app.second[i]);
      }
      Add('b', app.second[1], "boxes " + list + " are all for application " + app.first);
    }
    for (const Json& box : layout_.boxes.rows) {
      if (IntOr0(box, "boxType") != kShortcut) continue;
      std::string appId = Text(box, "appId");
      if (!appId.empty() && !ordinary.count(appId)) {
        Add('b', IntOr0(box, "boxId"), "shortcut box " + std::to_string(IntOr0(box, "boxId")) +
                                           " is for " + appId + ", which has no box");
      }
    }
  }

  // The store's shortcut box type.
  static const int kShortcut = 3;

  const Layout& layout_;
  std::set<int64_t> menus_;
  std::map<int64_t, const Json*> pages_;
  std::set<int64_t> boxes_;
  std::set<int64_t> folders_;
  std::map<int64_t, int> boxesOnPage_;
  std::vector<Finding> findings_;
};

// The columns of |table| in |db| as "name TYPE[ pk]", in order.
std::vector<std::string> Columns(const Connection& db, const std::string& table) {
  std::vector<std::string> columns;
  for (const Json& c : db.Rows("PRAGMA table_info(" + table + ")")) {
    columns.push_back(c["name"].get<std::string>() + " " + c["type"].get<std::string>() +
                      (c["pk"].get<int>() ? " PRIMARY KEY" : ""));
  }
  return columns;
}

std::string Joined(const std::vector<std::string>& words) {
  std::string out;
  for (const std::string& word : words) out += (out.empty() ? "" : ", ") + word;
  return out;
}

}  // namespace

std::vector<Finding> CheckLayout(const Layout& layout) { return Checker(layout).Run(); }

std::vector<Finding> CheckDatabase(const Connection& db) {
  std::vector<Finding> findings;
  auto add = [&](const std::string& text) { findings.push_back(Finding{text, 0, 0}); };
  Connection store(":memory:", false);
  CreateStoreTables(store);
  for (const char* table : {"Menus", "Pages", "Boxes"}) {
    std::vector<std::string> want = Columns(store, table), have = Columns(db, table);
    if (have.empty()) {
      add(std::string("schema: no table ") + table);
    } else if (have != want) {
      std::vector<std::string> extra, missing;
      for (const std::string& c : have) {
        if (std::find(want.begin(), want.end(), c) == want.end()) extra.push_back(c);
      }
      for (const std::string& c : want) {
        if (std::find(have.begin(), have.end(), c) == have.end()) missing.push_back(c);
      }
      std::string prefix = std::string("schema: table ") + table;
      if (!extra.empty()) add(prefix + " has columns the store does not make: " + Joined(extra));
      if (!missing.empty()) add(prefix + " lacks columns: " + Joined(missing));
      if (extra.empty() && missing.empty()) add(prefix + " has its columns in another order");
    }
  }
  std::string mode = db.Rows("PRAGMA journal_mode")[0].begin()->get<std::string>();
  if (mode == "wal") add("journal mode is wal; the launcher uses persist");
  for (const Json& row : db.Rows("PRAGMA integrity_check")) {
    std::string text = row.begin()->get<std::string>();
    if (text != "ok") add("integrity_check: " + text);
  }
  return findings;
}

}  // namespace korrin_sim
