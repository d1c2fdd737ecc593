// The launcher's data store. Every SQL text below is kept exactly as the
// launcher and its database expect it, blanks and spellings included: numbers
// spliced in decimal (bools as 0 or 1), text bound through named parameters.
#include "launcher-data-manager/launcher-data-manager.h"

#include <utility>

#include <boost/make_shared.hpp>

#include "common/device-path.h"
#include "common/log.h"
#include "launcher-data-manager/db-util.h"
#include "launcher-data-manager/statement.h"
#include "launcher-data-manager/store-internal.h"

using korrin::ExecStatement;
using korrin::ReadBoxKind;
using korrin::Statement;
using korrin::kPrepareLegacy;
using korrin::kPrepareV2;

namespace {

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

}  // namespace

namespace korrin {

void ReadBoxKind(const Statement& stmt, int first, GameBoxData* box) {
  box->boxType = stmt.Int(first);
  box->launchType = stmt.Int(first + 1);
  box->iconPath = stmt.Text(first + 2);
  box->content = stmt.Text(first + 3);
}

}  // namespace korrin

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
