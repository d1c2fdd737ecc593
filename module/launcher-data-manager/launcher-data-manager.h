// The launcher's data store: one SQLite connection to the layout database
// (menus, their pages, the boxes on the pages) and every operation on it.
//
// Results, never exceptions: inserts return the new row id or -1, updates,
// deletions and checks return bool, counts return the count or 0, single reads
// return a non-null record whose id is 0 when nothing was found, lists return
// a possibly empty vector. Records handed out belong to the caller. One thread
// at a time: the store takes no lock.
#ifndef KORRIN_LAUNCHER_DATA_MANAGER_LAUNCHER_DATA_MANAGER_H_
#define KORRIN_LAUNCHER_DATA_MANAGER_LAUNCHER_DATA_MANAGER_H_

#include <sqlite3.h>

#include <map>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "launcher-data-manager/game-data.h"

class LauncherDataManager {
 public:
  // Opens nothing; the connection is made by _OpenDb.
  LauncherDataManager();
  // Closes the connection.
  virtual ~LauncherDataManager();

  // ---- Connection and schema.

  // Closes any held connection, opens the layout database and creates the
  // tables that are missing. A failed open is logged and leaves no tables made.
  void _OpenDb();
  // Runs the schema text; a failure is logged, the connection stays open.
  void _CreateTables();
  // Closes the connection. Returns db_util_close's result.
  int _CloseDb();

  // ---- Transactions: true when the statement ran.

  bool BeginTransaction();
  bool CommitTransaction();
  bool RollbackTransaction();

  // ---- State.

  sqlite3* m_db;                      // null until _OpenDb
  // Bookkeeping of the virtual pages handed out by the computed views.
  std::map<int, int> m_pageMap;       // virtual pageId -> parentId
  std::map<int, bool> m_pageFlagMap;  // virtual pageId -> isFolder
  // Grid limits, fixed for the life of the store.
  int m_maxRows;          // rows of a menu page before a new page begins
  int m_columns;          // boxes in a row
  int m_maxBoxesPerPage;  // m_maxRows * m_columns
};

#endif  // KORRIN_LAUNCHER_DATA_MANAGER_LAUNCHER_DATA_MANAGER_H_
