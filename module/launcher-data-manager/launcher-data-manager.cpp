// The launcher's data store. Every SQL text below is kept exactly as the
// launcher and its database expect it, blanks and spellings included: numbers
// spliced in decimal (bools as 0 or 1), text bound through named parameters.
#include "launcher-data-manager/launcher-data-manager.h"

#include <sstream>

#include "common/device-path.h"
#include "common/log.h"
#include "launcher-data-manager/db-util.h"
#include "launcher-data-manager/statement.h"

using korrin::ExecStatement;

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
    KLOG(DLOG_ERROR, "SQL error(%d) : %s", rc, error);
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
