// The launcher's data store. Every SQL text below is kept exactly as the
// launcher and its database expect it, blanks and spellings included: numbers
// spliced in decimal (bools as 0 or 1), text bound through named parameters.
#include "launcher-data-manager/launcher-data-manager.h"

#include <limits.h>
#include <math.h>

#include <utility>

#include <boost/make_shared.hpp>

#include "common/device-path.h"
#include "common/log.h"
#include "launcher-data-manager/db-util.h"
#include "launcher-data-manager/statement.h"

using korrin::ExecStatement;
using korrin::Statement;
using korrin::kPrepareLegacy;
using korrin::kPrepareV2;

typedef boost::shared_ptr<GameViewData> MenuPtr;
typedef boost::shared_ptr<GamePageData> PagePtr;
typedef boost::shared_ptr<GameBoxData> BoxPtr;

namespace {

// The computed views number their pages from here; stored pages never get near.
const int kVirtualPageBase = 100000;

// New applications always go to this menu.
const int kFirstMenuId = 1;

// Packed pages grow downward without limit.
const int kNoRowBound = INT_MAX;

// The alphabetical view and its packing lay folders out 3 by 3.
const int kFolderColumns = 3;
const int kFolderRows = 3;

// The whole schema, run in one sqlite3_exec.
const char kSchema[] =
    "PRAGMA journal_mode = PERSIST;"
    "create table if not exists Menus( menuId INTEGER PRIMARY KEY AUTOINCREMENT, name TEXT, "
    "type INTEGER );"
    "create table if not exists Pages( pageId INTEGER PRIMARY KEY AUTOINCREMENT, isFolder "
    "INTEGER, parentId INTEGER, pageNo INTEGER );"
    "create table if not exists Boxes( boxId INTEGER PRIMARY KEY AUTOINCREMENT, isFolder "
    "INTEGER, pageParentId INTEGER, pageId INTEGER, appId TEXT, name TEXT, col INTEGER, row "
    "INTEGER, isPreload INTEGER, isSystem INTEGER, boxType INTEGER, launchType INTEGER, "
    "iconPath TEXT, content TEXT );";

// Steps an insert once (its result is not looked at, as the launcher expects)
// and returns the row id it made.
int StepInsert(sqlite3* db, Statement& stmt) {
  stmt.Step();
  return static_cast<int>(sqlite3_last_insert_rowid(db));
}

// Binds every text member of |box| that is not empty. A form that does not
// name a parameter leaves it unbound.
void BindBoxTexts(Statement& stmt, const GameBoxData& box) {
  stmt.BindTextIfNotEmpty("$name", box.name);
  stmt.BindTextIfNotEmpty("$appId", box.appId);
  stmt.BindTextIfNotEmpty("$iconPath", box.iconPath);
  stmt.BindTextIfNotEmpty("$content", box.content);
}

// Reads the columns most box look-ups select, in this order from |first|:
// isFolder, pageId, col, row, appId, name, parentId, isPreload, isSystem.
// Returns the column after them.
int ReadBoxCommon(const Statement& stmt, int first, GameBoxData* box) {
  int c = first;
  box->isFolder = stmt.Bool(c++);
  box->pageId = stmt.Int(c++);
  box->col = stmt.Int(c++);
  box->row = stmt.Int(c++);
  box->appId = stmt.Text(c++);
  box->name = stmt.Text(c++);
  box->parentId = stmt.Int(c++);
  box->isPreload = stmt.Bool(c++);
  box->isSystem = stmt.Bool(c++);
  return c;
}

// Reads boxType, launchType, iconPath and content, in this order from |first|.
void ReadBoxKind(const Statement& stmt, int first, GameBoxData* box) {
  box->boxType = stmt.Int(first);
  box->launchType = stmt.Int(first + 1);
  box->iconPath = stmt.Text(first + 2);
  box->content = stmt.Text(first + 3);
}

// The id of the k-th virtual page of a parent in the alphabetical view. A
// folder's pages carry its boxId in the high part; like the device, the
// product wraps for very large box ids rather than failing.
int AlphabeticalPageId(int parentId, bool isFolder, int k) {
  unsigned base = isFolder ? static_cast<unsigned>(parentId) * kVirtualPageBase : kVirtualPageBase;
  return static_cast<int>(base + static_cast<unsigned>(k));
}

// A cell on a stored page.
struct Cell {
  int pageId;
  int col;
  int row;
};

int InsertPage(LauncherDataManager& store, int parentId, bool isFolder, int pageNo) {
  GamePageData page;
  page.isFolder = isFolder;
  page.parentId = parentId;
  page.pageNo = pageNo;
  return store.InsertPageData(page);
}

// Where a new box of the parent goes: after the last box of its last page,
// wrapping after |columns|; on a new page, numbered after the last, when the
// row would pass |rowBound| or when that last box stood in row 0; on a first
// page when the parent has none. Sets |*pageAdded| when it made a page.
// Returns false when the last page is unreadable. A new box never fills a hole.
bool FindCellAfterLastBox(LauncherDataManager& store, int parentId, bool isFolder, int columns,
                          int rowBound, Cell* cell, bool* pageAdded) {
  std::vector<PagePtr> pages = store.GetPageDataList(parentId, isFolder);
  if (pages.empty()) {
    cell->pageId = InsertPage(store, parentId, isFolder, 1);
    cell->col = 1;
    cell->row = 1;
    *pageAdded = true;
    return true;
  }
  PagePtr last = pages.back();
  if (!last) return false;

  std::vector<BoxPtr> boxes = store.GetBoxDataList(last->pageId);
  int lastCol = 0;  // an empty page takes the box in its first cell
  int lastRow = 1;
  if (!boxes.empty() && boxes.back()) {
    lastCol = boxes.back()->col;
    lastRow = boxes.back()->row;
  }
  cell->pageId = last->pageId;
  if (lastCol < columns) {
    cell->col = lastCol + 1;
    cell->row = lastRow;
    return true;
  }
  cell->col = 1;
  // A last box in row 0 starts a new page rather than being followed in row 1;
  // kept as the launcher expects it.
  if (lastRow >= rowBound || lastRow == 0) {
    // A stored pageNo may be INT_MAX; the number wraps, as on the device.
    int pageNo = static_cast<int>(static_cast<unsigned>(last->pageNo) + 1u);
    cell->pageId = InsertPage(store, parentId, isFolder, pageNo);
    cell->row = 1;
    *pageAdded = true;
  } else {
    cell->row = lastRow + 1;
  }
  return true;
}

// Stores a new application box, of type 0 with only its id and place.
int InsertAppBox(LauncherDataManager& store, const std::string& appId, const Cell& cell) {
  GameBoxData box;
  box.pageId = cell.pageId;
  box.col = cell.col;
  box.row = cell.row;
  box.appId = appId;
  return store.InsertBoxData(box);
}

// Writes |boxes| row by row from the first cell, |columns| to a row, until the
// row would pass |rows|; the boxes after that keep their cells. Folder boxes
// are skipped, keeping their cells, when |skipFolders| is set. Returns how many
// boxes were placed.
int PackBoxes(LauncherDataManager& store, const std::vector<BoxPtr>& boxes, int columns, int rows,
              bool skipFolders) {
  int col = 1;
  int row = 1;
  int placed = 0;
  for (size_t i = 0; i < boxes.size(); ++i) {
    const BoxPtr& box = boxes[i];
    if (!box || (skipFolders && box->isFolder)) continue;
    box->col = col;
    box->row = row;
    store.UpdateBoxData(*box);
    ++placed;
    if (++col > columns) {
      if (++row > rows) break;
      col = 1;
    }
  }
  return placed;
}

// Packs each page of a folder from its first cell on the menu's width, with no
// row bound; a nested folder keeps its cell and takes none. An empty page goes
// unless it is the folder's only one. The pages are not renumbered.
void PackFolderPages(LauncherDataManager& store, int folderBoxId) {
  std::vector<PagePtr> pages = store.GetPageDataList(folderBoxId, true);
  for (size_t i = 0; i < pages.size(); ++i) {
    std::vector<BoxPtr> boxes = store.GetBoxDataList(pages[i]->pageId);
    if (pages.size() > 1 && boxes.empty()) {
      store.DeletePageData(pages[i]->pageId);
    } else {
      PackBoxes(store, boxes, store.m_columns, kNoRowBound, true);
    }
  }
}

// Numbers the pages from 1 in their order, deleting on the way each page left
// without boxes unless |keepEmpty| is set.
void RenumberPages(LauncherDataManager& store, const std::vector<PagePtr>& pages, bool keepEmpty) {
  int pageNo = 1;
  for (size_t i = 0; i < pages.size(); ++i) {
    if (!pages[i]) continue;
    if (!keepEmpty && store.GetBoxDataList(pages[i]->pageId).empty()) {
      store.DeletePageData(pages[i]->pageId);
    } else {
      pages[i]->pageNo = pageNo++;
      store.UpdatePageData(*pages[i]);
    }
  }
}

}  // namespace

// ---------------------------------------------------------------------------
// Connection, schema and transactions

LauncherDataManager::LauncherDataManager()
    : m_db(NULL), m_maxRows(40000), m_columns(4), m_maxBoxesPerPage(160000) {}

LauncherDataManager::~LauncherDataManager() { _CloseDb(); }

void LauncherDataManager::_OpenDb() {
  _CloseDb();
  int rc = db_util_open(korrin::DevicePath(korrin::kGameDataDbPath).c_str(), &m_db, 0);
  if (rc != SQLITE_OK) {
    KLOG(DLOG_ERROR, "sqlite error : [%d]", rc);
    return;
  }
  _CreateTables();
}

void LauncherDataManager::_CreateTables() {
  char* error = NULL;
  int rc = sqlite3_exec(m_db, kSchema, NULL, NULL, &error);
  if (rc != SQLITE_OK) {
    KLOG(DLOG_ERROR, "SQL error(%d) : %s", rc, error != NULL ? error : "");
    sqlite3_free(error);
  }
}

int LauncherDataManager::_CloseDb() {
  int rc = db_util_close(m_db);
  if (rc == SQLITE_OK) m_db = NULL;
  return rc;
}

bool LauncherDataManager::BeginTransaction() {
  return ExecStatement(m_db, "BEGIN IMMEDIATE TRANSACTION", NULL);
}

bool LauncherDataManager::CommitTransaction() {
  return ExecStatement(m_db, "COMMIT TRANSACTION", NULL);
}

bool LauncherDataManager::RollbackTransaction() {
  return ExecStatement(m_db, "ROLLBACK TRANSACTION", NULL);
}

// ---------------------------------------------------------------------------
// Menus

int LauncherDataManager::InsertMenuData(GameViewData& menu) {
  korrin::SqlText sql;
  sql << "INSERT INTO menus(name, type) VALUES($name, " << menu.type << ")";
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) return -1;
  stmt.BindTextIfNotEmpty("$name", menu.name);
  menu.menuId = StepInsert(m_db, stmt);
  return menu.menuId;
}

MenuPtr LauncherDataManager::GetMenuData(int menuId) {
  MenuPtr menu = boost::make_shared<GameViewData>();
  korrin::SqlText sql;
  sql << "SELECT name, type FROM menus WHERE menuId = " << menuId;
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  if (!stmt.Step()) return menu;
  menu->menuId = menuId;
  menu->name = stmt.Text(0);
  menu->type = stmt.Int(1);
  return menu;
}

bool LauncherDataManager::UpdateMenuData(GameViewData& menu) {
  korrin::SqlText sql;
  sql << "UPDATE menus SET name = $name, type = " << menu.type
      << " WHERE menuId = " << menu.menuId;
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) return false;
  stmt.BindTextIfNotEmpty("$name", menu.name);
  stmt.Step();
  return true;
}

bool LauncherDataManager::DeleteMenuData(int menuId) {
  korrin::SqlText sql;
  sql << "DELETE FROM menus WHERE menuid = " << menuId;
  return ExecStatement(m_db, sql.str(), NULL);
}

int LauncherDataManager::GetMenuDataCount() {
  Statement stmt(m_db, "SELECT COUNT(*) FROM menus ", kPrepareLegacy);
  return stmt.Step() ? stmt.Int(0) : 0;
}

std::vector<MenuPtr> LauncherDataManager::GetMenuDataList() {
  std::vector<MenuPtr> menus;
  Statement stmt(m_db, "SELECT menuId, name, type FROM menus ORDER BY menuId DESC",
                 kPrepareLegacy);
  while (stmt.Step()) {
    MenuPtr menu = boost::make_shared<GameViewData>();
    menu->menuId = stmt.Int(0);
    menu->name = stmt.Text(1);
    menu->type = stmt.Int(2);
    menus.push_back(std::move(menu));
  }
  return menus;
}

// ---------------------------------------------------------------------------
// Pages

int LauncherDataManager::InsertPageData(GamePageData& page) {
  korrin::SqlText sql;
  sql << "INSERT INTO pages(isFolder, parentId, pageNo) VALUES(" << page.isFolder << ", "
      << page.parentId << ", " << page.pageNo << ")";
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) return -1;
  page.pageId = StepInsert(m_db, stmt);
  return page.pageId;
}

bool LauncherDataManager::UpdatePageData(GamePageData& page) {
  korrin::SqlText sql;
  sql << "UPDATE pages SET parentId = " << page.parentId << ", pageNo = " << page.pageNo
      << " WHERE pageId = " << page.pageId;
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) return false;
  stmt.Step();
  return true;
}

bool LauncherDataManager::DeletePageData(int pageId) {
  korrin::SqlText sql;
  sql << "DELETE FROM pages WHERE pageid = " << pageId;
  return ExecStatement(m_db, sql.str(), NULL);
}

bool LauncherDataManager::DeleteFolderPageData(int folderBoxId) {
  korrin::SqlText sql;
  sql << "DELETE FROM pages WHERE parentId = " << folderBoxId;
  return ExecStatement(m_db, sql.str(), NULL);
}

PagePtr LauncherDataManager::GetMenuPageData(int pageId) {
  PagePtr page = boost::make_shared<GamePageData>();
  korrin::SqlText sql;
  sql << "SELECT isFolder, parentId, pageNo FROM pages WHERE pageId = " << pageId;
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  if (!stmt.Step()) return page;
  page->pageId = pageId;
  page->isFolder = stmt.Bool(0);
  page->parentId = stmt.Int(1);
  page->pageNo = stmt.Int(2);
  return page;
}

int LauncherDataManager::GetPageDataCount(int menuId, bool isFolder) {
  // Lacks a comparison after isFolder and names a column Pages does not have:
  // it never compiles, and the launcher relies on the 0 that follows.
  korrin::SqlText sql;
  sql << "SELECT COUNT(*) FROM pages WHERE isFolder " << isFolder << " AND menuId = " << menuId;
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  return stmt.Step() ? stmt.Int(0) : 0;
}

int LauncherDataManager::_GetPageDataCountByDownload(int) {
  korrin::SqlText sql;
  sql << "SELECT COUNT(*) "
      << "FROM boxes b, pages p ON p.pageId = b.pageId "
      << "WHERE b.isFolder = 0 AND b.IsPreload = 0";
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  return stmt.Step() ? stmt.Int(0) : 0;
}

int LauncherDataManager::InsertPageDataForAlphaBeticalOrder(GamePageData&) { return -1; }

bool LauncherDataManager::UpdatePageDataForAlphaBeticalOrder(GamePageData&) { return false; }

bool LauncherDataManager::DeletePageDataForAlphaBeticalOrder(int) { return false; }

// ---------------------------------------------------------------------------
// Boxes

int LauncherDataManager::InsertBoxData(GameBoxData& box) {
  korrin::SqlText sql;
  if (box.isFolder) {
    sql << "INSERT INTO boxes(isFolder, pageId, name, appId, col, row, isPreload, isSystem, "
           "boxType, launchType) "
        << "VALUES(1, " << box.pageId << ", $name, $appId, " << box.col << ", " << box.row
        << ", " << box.isPreload << ", " << box.isSystem << ", " << box.boxType << ", "
        << box.launchType << ") ";
  } else if (box.boxType == kShortcutBoxType) {
    sql << "INSERT INTO boxes(isFolder, pageId, name, appId, col, row, isPreload, isSystem, "
           "boxType, launchType, iconPath, content) "
        << "VALUES(0, " << box.pageId << ", $name, $appId, " << box.col << ", " << box.row
        << ", " << box.isPreload << ", " << box.isSystem << ", " << box.boxType << ", "
        << box.launchType << ", $iconPath, $content) ";
  } else {
    // Name, icon and content of an application come from the platform each time.
    sql << "INSERT INTO boxes(isFolder, pageId, appId, col, row, isPreload, isSystem, boxType, "
           "launchType) "
        << "VALUES(0, " << box.pageId << ", $appId, " << box.col << ", " << box.row << ", "
        << box.isPreload << ", " << box.isSystem << ", " << box.boxType << ", "
        << box.launchType << ") ";
  }
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) return -1;
  BindBoxTexts(stmt, box);
  box.boxId = StepInsert(m_db, stmt);
  return box.boxId;
}

bool LauncherDataManager::UpdateBoxData(GameBoxData& box) {
  korrin::SqlText sql;
  if (box.isFolder) {
    // A folder is never a system box, whatever the record says.
    sql << "UPDATE boxes set isFolder = 1, pageId = " << box.pageId << ", "
        << "name = $name, "
        << "col = " << box.col << ", row = " << box.row << ", "
        << "isPreload = " << box.isPreload << ", isSystem = 0 "
        << ", "
        << "boxType = " << box.boxType << ", launchType = " << box.launchType << " "
        << " WHERE boxId = " << box.boxId;
  } else {
    sql << "UPDATE boxes set isFolder = 0, pageId = " << box.pageId << ", "
        << "appId = $appId, "
        << "name = $name, "
        << "col = " << box.col << ", row = " << box.row << ", "
        << "isPreload = " << box.isPreload << ", isSystem = " << box.isSystem << ", "
        << "boxType = " << box.boxType << ", launchType = " << box.launchType
        << (box.boxType == kShortcutBoxType ? ", iconPath = $iconPath, content = $content " : " ")
        << " WHERE boxId = " << box.boxId;
  }
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (stmt.IsCompiled()) {
    BindBoxTexts(stmt, box);
    stmt.Step();
  }
  return true;  // the launcher never hears of a failed box update
}

bool LauncherDataManager::DeleteBoxData(int boxId) {
  korrin::SqlText sql;
  sql << "DELETE FROM boxes WHERE boxid = " << boxId;
  std::string error;
  if (!ExecStatement(m_db, sql.str(), &error)) {
    KLOG(DLOG_ERROR, "sqlite error : %s", error.c_str());
    return false;
  }
  return true;
}

BoxPtr LauncherDataManager::GetMenuBoxData(int boxId) {
  BoxPtr box = boost::make_shared<GameBoxData>();
  korrin::SqlText sql;
  sql << "SELECT b.isFolder, p.pageId, col, row, appId, name, p.parentId, isPreload, isSystem, "
         "boxType, launchType, iconPath, content FROM boxes b, pages p ON b.pageId = p.pageId "
         "WHERE boxId = "
      << boxId;
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  if (!stmt.Step()) return box;
  box->boxId = boxId;
  int next = ReadBoxCommon(stmt, 0, box.get());
  ReadBoxKind(stmt, next, box.get());
  return box;
}

bool LauncherDataManager::GetBoxIdByAppId(std::string appId, int* parentId, int* pageId,
                                          int* boxId) {
  korrin::SqlText sql;
  sql << "SELECT boxId, b.pageId, p.parentId FROM boxes b, pages p ON p.pageId = b.pageId  "
         "WHERE b.appId = $appId AND b.boxType != "
      << kShortcutBoxType << " ";
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) return false;
  stmt.BindText("$appId", appId);
  if (!stmt.Step()) return false;
  *boxId = stmt.Int(0);
  *pageId = stmt.Int(1);
  *parentId = stmt.Int(2);
  return true;
}

BoxPtr LauncherDataManager::GetBoxDataByAppId(std::string appId) {
  BoxPtr box = boost::make_shared<GameBoxData>();
  korrin::SqlText sql;
  sql << "SELECT b.boxId, b.isFolder, p.pageId, col, row, appId, name, p.parentId, isPreload, "
         "isSystem FROM boxes b, pages p ON b.pageId = p.pageId WHERE b.appId = $appId AND "
         "b.boxType != "
      << kShortcutBoxType << " ";
  // Each failure is logged and the next step tried regardless.
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) {
    KLOG(DLOG_ERROR, "sqlite error : [%s,%s]", sql.str().c_str(), stmt.Error().c_str());
  }
  if (!stmt.BindText("$appId", appId)) KLOG(DLOG_ERROR, "Bind Err : %s\n", appId.c_str());
  if (!stmt.Step()) {
    KLOG(DLOG_ERROR, "cannot find box with appid[%s]", appId.c_str());
    return box;
  }
  box->boxId = stmt.Int(0);
  ReadBoxCommon(stmt, 1, box.get());
  return box;
}

int LauncherDataManager::GetBoxDataCount(int pageId) {
  korrin::SqlText sql;
  sql << "SELECT COUNT(*) FROM boxes WHERE pageId = " << pageId;
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  return stmt.Step() ? stmt.Int(0) : 0;
}

// ---------------------------------------------------------------------------
// Listings

std::vector<PagePtr> LauncherDataManager::GetPageDataList(int parentId, bool isFolder) {
  std::vector<PagePtr> pages;
  korrin::SqlText sql;
  sql << "SELECT pageId, isFolder, parentId, pageNo FROM pages "
      << "WHERE isFolder = " << isFolder << " AND parentId = " << parentId
      << " ORDER BY pageNo ASC";
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  while (stmt.Step()) {
    PagePtr page = boost::make_shared<GamePageData>();
    page->pageId = stmt.Int(0);
    page->isFolder = stmt.Bool(1);
    page->parentId = stmt.Int(2);
    page->pageNo = stmt.Int(3);
    pages.push_back(std::move(page));
  }
  return pages;
}

std::vector<BoxPtr> LauncherDataManager::GetBoxDataList(int pageId) {
  std::vector<BoxPtr> boxes;
  korrin::SqlText sql;
  sql << "SELECT boxId, b.isFolder, b.pageId, col, row, appId, name, p.parentId, isPreload, "
         "isSystem, boxType, launchType, iconPath, content FROM boxes b, pages p ON p.pageId = "
         "b.pageId  WHERE b.pageId = "
      << pageId << " ORDER BY row, col";
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  while (stmt.Step()) {
    BoxPtr box = boost::make_shared<GameBoxData>();
    box->boxId = stmt.Int(0);
    int next = ReadBoxCommon(stmt, 1, box.get());
    ReadBoxKind(stmt, next, box.get());
    boxes.push_back(std::move(box));
  }
  return boxes;
}

std::vector<BoxPtr> LauncherDataManager::GetBoxDataListByAppId(std::string appId, int boxType) {
  std::vector<BoxPtr> boxes;
  korrin::SqlText sql;
  sql << "SELECT boxId, b.isFolder, p.parentId, b.pageId, appId, name, col, row, isPreload, "
         "isSystem, boxType, launchType, iconPath, content "
      << "FROM boxes b, pages p ON p.pageId = b.pageId "
      << "WHERE appId = $appId AND boxType = " << boxType << " ORDER BY row, col";
  // Each failure is logged and the next step tried regardless.
  Statement stmt(m_db, sql.str(), kPrepareV2);
  if (!stmt.IsCompiled()) {
    KLOG(DLOG_ERROR, "sqlite error : [%s,%s]", sql.str().c_str(), stmt.Error().c_str());
  }
  if (!stmt.BindText("$appId", appId)) KLOG(DLOG_ERROR, "Bind Err : %s\n", appId.c_str());
  while (stmt.Step()) {
    BoxPtr box = boost::make_shared<GameBoxData>();
    box->boxId = stmt.Int(0);
    box->isFolder = stmt.Bool(1);
    box->parentId = stmt.Int(2);
    box->pageId = stmt.Int(3);
    box->appId = stmt.Text(4);
    box->name = stmt.Text(5);
    box->col = stmt.Int(6);
    box->row = stmt.Int(7);
    box->isPreload = stmt.Bool(8);
    box->isSystem = stmt.Bool(9);
    ReadBoxKind(stmt, 10, box.get());
    boxes.push_back(std::move(box));
  }
  return boxes;
}

// ---------------------------------------------------------------------------
// The download view

std::vector<BoxPtr> LauncherDataManager::GetBoxDataListByDownload(int parentId, bool) {
  std::vector<BoxPtr> boxes;
  // No ORDER BY: SQLite walks boxes by boxId, which is the order they were added.
  korrin::SqlText sql;
  sql << "SELECT boxId, b.isFolder, appId, name "
      << "FROM boxes b, pages p ON p.pageId = b.pageId  "
      << "WHERE b.isFolder = 0 AND b.IsPreload = 0 AND b.boxType != " << kShortcutBoxType << " ";
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  int pageId = kVirtualPageBase + 1;
  int col = 1;
  int row = 1;
  while (stmt.Step()) {
    BoxPtr box = boost::make_shared<GameBoxData>();
    box->boxId = stmt.Int(0);
    box->isFolder = stmt.Bool(1);
    box->appId = stmt.Text(2);
    box->name = stmt.Text(3);
    box->pageId = pageId;
    box->col = col;
    box->row = row;
    box->parentId = parentId;
    boxes.push_back(std::move(box));

    if (++col > m_columns) {
      col = 1;
      if (++row > m_maxRows) {
        row = 1;
        ++pageId;
      }
    }
  }
  return boxes;
}

std::vector<PagePtr> LauncherDataManager::GetPageDataListByDownload(int parentId, bool) {
  std::vector<PagePtr> pages;
  int boxCount = _GetPageDataCountByDownload(parentId);
  int pageCount = static_cast<int>(ceil(static_cast<double>(boxCount) / (m_maxRows * m_columns)));
  for (int k = 1; k <= pageCount; ++k) {
    PagePtr page = boost::make_shared<GamePageData>();
    page->pageId = kVirtualPageBase + k;
    page->isFolder = false;
    page->parentId = parentId;
    page->pageNo = k;
    pages.push_back(page);
    m_pageMap[page->pageId] = parentId;
  }
  return pages;
}

// ---------------------------------------------------------------------------
// Placement and packing

int LauncherDataManager::InsertBoxData(std::string appId, bool& pageAdded) {
  Cell cell;
  if (!FindCellAfterLastBox(*this, kFirstMenuId, false, m_columns, m_maxRows, &cell, &pageAdded)) {
    return -1;
  }
  return InsertAppBox(*this, appId, cell);
}

int LauncherDataManager::InsertBoxDataForDeactivatedApp(int menuId, std::string appId) {
  Cell cell;
  bool pageAdded = false;  // not reported to this caller
  // Two rows more than a placement in menu 1 allows; kept as the launcher expects it.
  if (!FindCellAfterLastBox(*this, menuId, false, m_columns, m_maxRows + 2, &cell, &pageAdded)) {
    return 0;
  }
  return InsertAppBox(*this, appId, cell);
}

int LauncherDataManager::DeleteBoxDataForDeactivatedApp(int menuId, int boxId) {
  DeleteBoxData(boxId);
  _ReorderDataWithoutSpace(menuId, false);
  return 1;
}

void LauncherDataManager::_ReorderData(int parentId, bool isFolder) {
  int columns = isFolder ? kFolderColumns : m_columns;
  int rows = isFolder ? kFolderRows : m_maxRows;
  std::vector<PagePtr> pages = GetPageDataList(parentId, isFolder);
  if (pages.empty()) return;

  int placed = 0;
  for (size_t i = 0; i < pages.size(); ++i) {
    if (!pages[i]) continue;
    placed += PackBoxes(*this, GetBoxDataList(pages[i]->pageId), columns, rows, false);
  }

  // With nothing placed at all, empty pages are kept and only renumbered.
  RenumberPages(*this, pages, placed == 0);
}

void LauncherDataManager::_ReorderDataWithoutSpace(int parentId, bool isFolder) {
  std::vector<PagePtr> pages = GetPageDataList(parentId, isFolder);
  if (pages.empty()) return;

  std::vector<BoxPtr> queue;
  for (size_t i = 0; i < pages.size(); ++i) {
    if (!pages[i]) continue;
    std::vector<BoxPtr> boxes = GetBoxDataList(pages[i]->pageId);
    queue.insert(queue.end(), boxes.begin(), boxes.end());
  }

  // The menu grid whatever isFolder says, and a row bound of m_maxRows + 2;
  // both kept as the launcher expects them.
  size_t next = 0;
  for (size_t i = 0; i < pages.size() && next < queue.size(); ++i) {
    if (!pages[i]) continue;
    int col = 1;
    int row = 1;
    while (next < queue.size()) {
      GameBoxData& box = *queue[next++];
      box.col = col;
      box.row = row;
      box.pageId = pages[i]->pageId;
      UpdateBoxData(box);
      if (++col > m_columns) {
        if (++row > m_maxRows + 2) break;
        col = 1;
      }
    }
  }

  RenumberPages(*this, pages, false);
}

void LauncherDataManager::RearrangeAppsPosition() {
  BeginTransaction();
  std::vector<MenuPtr> menus = GetMenuDataList();
  for (size_t m = 0; m < menus.size(); ++m) {
    if (!menus[m]) continue;
    std::vector<PagePtr> pages = GetPageDataList(menus[m]->menuId, false);
    int pageNo = 1;
    for (size_t p = 0; p < pages.size(); ++p) {
      std::vector<BoxPtr> boxes = GetBoxDataList(pages[p]->pageId);
      // A menu's only page stays, empty or not.
      if (pages.size() > 1 && boxes.empty()) {
        DeletePageData(pages[p]->pageId);
        continue;
      }
      pages[p]->pageNo = pageNo++;
      UpdatePageData(*pages[p]);

      PackBoxes(*this, boxes, m_columns, kNoRowBound, false);
      for (size_t b = 0; b < boxes.size(); ++b) {
        if (boxes[b] && boxes[b]->isFolder) PackFolderPages(*this, boxes[b]->boxId);
      }
    }
  }
  CommitTransaction();
}

// ---------------------------------------------------------------------------
// The alphabetical view

namespace {

// The boxes of one parent by name; ties keep SQLite's order.
std::string AlphabeticalBoxesSql(int parentId, bool isFolder) {
  korrin::SqlText sql;
  sql << "SELECT boxId, b.isFolder, appId, name, isPreload, isSystem, boxType, launchType, "
         "iconPath, content "
      << "FROM boxes b, pages p ON p.pageId = b.pageId "
      << "WHERE p.isFolder = " << isFolder << " AND p.parentId = " << parentId << " "
      << "ORDER BY name COLLATE NOCASE";
  return sql.str();
}

BoxPtr ReadAlphabeticalBox(const Statement& stmt) {
  BoxPtr box = boost::make_shared<GameBoxData>();
  box->boxId = stmt.Int(0);
  box->isFolder = stmt.Bool(1);
  box->appId = stmt.Text(2);
  box->name = stmt.Text(3);
  box->isPreload = stmt.Bool(4);
  box->isSystem = stmt.Bool(5);
  ReadBoxKind(stmt, 6, box.get());
  return box;
}

// Walks the cells of the view: |columns| to a row, |rows| to a page.
class GridCursor {
 public:
  GridCursor(int columns, int rows) : page(0), col(1), row(1), m_columns(columns), m_rows(rows) {}

  void Advance() {
    if (++col <= m_columns) return;
    col = 1;
    if (++row <= m_rows) return;
    row = 1;
    ++page;
  }

  int page;  // counted from 0
  int col;
  int row;

 private:
  int m_columns;
  int m_rows;
};

}  // namespace

std::vector<BoxPtr> LauncherDataManager::GetBoxDataListByAlphabeticalOrder(int parentId,
                                                                           bool isFolder) {
  std::vector<BoxPtr> boxes;
  GridCursor cursor(isFolder ? kFolderColumns : m_columns, isFolder ? kFolderRows : m_maxRows);
  Statement stmt(m_db, AlphabeticalBoxesSql(parentId, isFolder), kPrepareLegacy);
  while (stmt.Step()) {
    BoxPtr box = ReadAlphabeticalBox(stmt);
    box->pageId = AlphabeticalPageId(parentId, isFolder, cursor.page + 1);
    box->col = cursor.col;
    box->row = cursor.row;
    boxes.push_back(std::move(box));
    cursor.Advance();
  }
  return boxes;
}

std::vector<BoxPtr> LauncherDataManager::GetBoxDataListByAlphabeticalOrderWithRealPage(
    int parentId, bool isFolder) {
  // The stored pages of every parent with this id, menu or folder alike: the
  // launcher's statement does not look at isFolder.
  std::vector<int> pageIds;
  korrin::SqlText pagesSql;
  pagesSql << "SELECT pageId from Pages "
           << "WHERE parentId = " << parentId << " "
           << "Order By pageNo ASC ";
  Statement pages(m_db, pagesSql.str(), kPrepareLegacy);
  while (pages.Step()) pageIds.push_back(pages.Int(0));

  std::vector<BoxPtr> boxes;
  GridCursor cursor(isFolder ? kFolderColumns : m_columns, isFolder ? kFolderRows : m_maxRows);
  Statement stmt(m_db, AlphabeticalBoxesSql(parentId, isFolder), kPrepareLegacy);
  // The listing ends where the view would need a page the parent does not have.
  while (static_cast<size_t>(cursor.page) < pageIds.size() && stmt.Step()) {
    BoxPtr box = ReadAlphabeticalBox(stmt);
    box->pageId = pageIds[cursor.page];
    box->col = cursor.col;
    box->row = cursor.row;
    boxes.push_back(std::move(box));
    cursor.Advance();
  }
  return boxes;
}

std::vector<PagePtr> LauncherDataManager::GetPageDataListByAlphabeticalOrder(int parentId,
                                                                            bool isFolder) {
  korrin::SqlText sql;
  sql << "SELECT COUNT(*) "
      << "FROM boxes b, pages p ON p.pageId = b.pageId "
      << "WHERE p.isFolder = " << isFolder << " AND p.parentId = " << parentId;
  Statement count(m_db, sql.str(), kPrepareLegacy);
  int boxCount = count.Step() ? count.Int(0) : 0;

  // An empty menu still shows one page; an empty folder shows none.
  int pageCount;
  if (isFolder) {
    pageCount = static_cast<int>(ceil(boxCount / 9.0));
  } else {
    pageCount = static_cast<int>(ceil(static_cast<double>(boxCount) / (m_maxRows * m_columns)));
    if (pageCount == 0) pageCount = 1;
  }

  std::vector<PagePtr> pages;
  for (int k = 1; k <= pageCount; ++k) {
    PagePtr page = boost::make_shared<GamePageData>();
    page->pageId = AlphabeticalPageId(parentId, isFolder, k);
    page->isFolder = isFolder;
    page->parentId = parentId;
    page->pageNo = k;
    pages.push_back(page);
    m_pageMap[page->pageId] = parentId;
    m_pageFlagMap[page->pageId] = isFolder;
  }
  return pages;
}

int LauncherDataManager::InsertBoxDataForAlphaBeticalOrder(GameBoxData& box) {
  Cell cell;
  bool pageAdded = false;  // not reported to this caller
  if (!FindCellAfterLastBox(*this, kFirstMenuId, false, m_columns, m_maxRows, &cell, &pageAdded)) {
    return -1;
  }
  box.pageId = cell.pageId;
  box.col = cell.col;
  box.row = cell.row;
  return InsertBoxData(box);
}

int LauncherDataManager::UpdateBoxDataForAlphaBeticalOrder(GameBoxData& box) {
  BoxPtr stored = GetMenuBoxData(box.boxId);
  if (stored->boxId == 0) {
    KLOG(DLOG_ERROR, "No box [%d]", box.boxId);
    return 0;
  }
  PagePtr oldPage = GetMenuPageData(stored->pageId);
  if (oldPage->pageId == 0) {
    KLOG(DLOG_ERROR, "No page [%d]", stored->pageId);
    return 0;
  }
  if (oldPage->parentId == 0) {
    KLOG(DLOG_ERROR, "invalid page parent id");
    return 0;
  }

  // Where the box was dropped: a virtual page handed out by the page listing,
  // else a stored page, else the parent the caller names. A miss leaves an
  // empty entry in both maps, as the launcher has always done.
  int targetParent = m_pageMap[box.pageId];
  bool targetIsFolder = m_pageFlagMap[box.pageId];
  if (targetParent == 0) {
    PagePtr dropped = GetMenuPageData(box.pageId);
    if (dropped->pageId != 0) {
      targetParent = dropped->parentId;
      targetIsFolder = false;
    } else {
      KLOG(DLOG_ERROR, "No page [%d]", box.pageId);
      targetParent = box.parentId;
      // Menus have small ids; a parent above 5 is taken for a folder box.
      targetIsFolder = box.parentId > 5;
    }
  }

  if (targetParent == oldPage->parentId) {
    korrin::SqlText sql;
    sql << "UPDATE boxes set "
        << "name = $name "
        << " WHERE boxId = " << box.boxId;
    Statement rename(m_db, sql.str(), kPrepareV2);
    // Like every update, an empty name is stored as NULL.
    rename.BindTextIfNotEmpty("$name", box.name);
    rename.Step();
    return 0;
  }

  Cell cell;
  bool pageAdded = false;  // not reported to this caller
  if (!FindCellAfterLastBox(*this, box.parentId, targetIsFolder,
                            targetIsFolder ? kFolderColumns : m_columns,
                            targetIsFolder ? kFolderRows : m_maxRows, &cell, &pageAdded)) {
    return 0;
  }
  box.pageId = cell.pageId;
  box.col = cell.col;
  box.row = cell.row;
  bool updated = UpdateBoxData(box);
  if (updated) _ReorderData(oldPage->parentId, oldPage->isFolder);
  return updated;
}

int LauncherDataManager::DeleteBoxDataForAlphaBeticalOrder(int boxId) {
  BoxPtr box = GetMenuBoxData(boxId);
  if (box->boxId == 0) {
    KLOG(DLOG_ERROR, "No box [%d]", boxId);
    return 0;
  }
  PagePtr page = GetMenuPageData(box->pageId);
  if (page->pageId == 0) {
    KLOG(DLOG_ERROR, "No page [%d]", box->pageId);
    return 0;
  }
  DeleteBoxData(boxId);
  _ReorderData(page->parentId, page->isFolder);
  return 0;
}
