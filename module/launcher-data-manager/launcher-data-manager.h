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

class LauncherPackageManager;

class LauncherDataManager {
 public:
  // Opens nothing; the connection is made by _OpenDb.
  LauncherDataManager();
  // Closes the connection.
  virtual ~LauncherDataManager();

  // ---- Start-up.

  // Opens the store and, when it holds no menu yet (the first launch on a
  // device), lays out one menu "Apps" with a box for every id |pkgMgr| lists,
  // four to a row, each insert committed by itself. True when the store was
  // populated already or has just been; false, with nothing written, when the
  // ids cannot be listed.
  bool Initialize(LauncherPackageManager& pkgMgr);

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

  // ---- Menus (table Menus).

  // Stores |menu| (an empty name as NULL). Returns the new menuId, also
  // written into |menu|, or -1 when the statement does not compile.
  int InsertMenuData(GameViewData& menu);
  // The menu, or a record with menuId 0 and type -1 when there is none.
  boost::shared_ptr<GameViewData> GetMenuData(int menuId);
  // Writes name and type by menuId; true once the statement ran, found or not.
  bool UpdateMenuData(GameViewData& menu);
  // Deletes the menu row only; its pages and boxes stay.
  bool DeleteMenuData(int menuId);
  int GetMenuDataCount();
  // All menus, newest first.
  std::vector<boost::shared_ptr<GameViewData> > GetMenuDataList();

  // ---- Pages (table Pages).

  // Returns the new pageId, also written into |page|, or -1.
  int InsertPageData(GamePageData& page);
  // Writes parentId and pageNo by pageId; a page never changes its isFolder.
  bool UpdatePageData(GamePageData& page);
  // Deletes one page row; its boxes stay.
  bool DeletePageData(int pageId);
  // Deletes every page whose parentId is |folderBoxId|, menu pages included.
  bool DeleteFolderPageData(int folderBoxId);
  // The page, or a record with pageId 0 when there is none.
  boost::shared_ptr<GamePageData> GetMenuPageData(int pageId);
  // Always 0: the launcher's statement for it never compiles, and first launch
  // relies on that answer.
  int GetPageDataCount(int menuId, bool isFolder);
  // Application boxes not preloaded, over the whole database; |menuId| unused.
  int _GetPageDataCountByDownload(int menuId);

  // Fixed answers, so the host may call the alphabetical forms like the others.
  int InsertPageDataForAlphaBeticalOrder(GamePageData& page);   // -1
  bool UpdatePageDataForAlphaBeticalOrder(GamePageData& page);  // false
  bool DeletePageDataForAlphaBeticalOrder(int pageId);          // false

  // ---- Boxes (table Boxes). Each statement has a folder form, a form for a
  // box of type 3 (with its own name, icon path and content) and a form for
  // any other application box (only its appId and place are stored).

  // Returns the new boxId, also written into |box|, or -1.
  int InsertBoxData(GameBoxData& box);
  // Writes the box by boxId. Always true, also when the statement fails.
  bool UpdateBoxData(GameBoxData& box);
  // Deletes one box; a folder's pages stay. Logs a failure.
  bool DeleteBoxData(int boxId);
  // The box, or a record with boxId 0 when there is none or its page is gone.
  boost::shared_ptr<GameBoxData> GetMenuBoxData(int boxId);
  // Finds the application's box (never one of type 3). Writes the owner of its
  // page, its page and its id, and returns true; returns false and writes
  // nothing when there is none.
  bool GetBoxIdByAppId(std::string appId, int* parentId, int* pageId, int* boxId);
  // The application's box (never one of type 3), or a record with boxId 0,
  // logged, when there is none.
  boost::shared_ptr<GameBoxData> GetBoxDataByAppId(std::string appId);
  // Boxes on the page, folders included.
  int GetBoxDataCount(int pageId);

  // ---- Listings, in layout order. Empty on failure.

  // Pages of a menu (isFolder false, |parentId| a menuId) or of a folder
  // (isFolder true, |parentId| its boxId), by pageNo.
  std::vector<boost::shared_ptr<GamePageData> > GetPageDataList(int parentId, bool isFolder);
  // Boxes of a stored page, by row then col.
  std::vector<boost::shared_ptr<GameBoxData> > GetBoxDataList(int pageId);
  // Every box of the application with |boxType|, on any page, by row then col.
  std::vector<boost::shared_ptr<GameBoxData> > GetBoxDataListByAppId(std::string appId,
                                                                     int boxType);

  // ---- The download view: every application box that did not come with the
  // device, in the order the boxes were added, on virtual pages 100001 on.
  // |parentId| is copied into the records; |isFolder| is not used.

  std::vector<boost::shared_ptr<GameBoxData> > GetBoxDataListByDownload(int parentId,
                                                                        bool isFolder);
  // Also remembers each virtual page in m_pageMap.
  std::vector<boost::shared_ptr<GamePageData> > GetPageDataListByDownload(int parentId,
                                                                          bool isFolder);

  // ---- Placement and packing. These work only through the record operations
  // and listings above; none opens a transaction except RearrangeAppsPosition.

  // Places a new application box after the last box of the last page of menu
  // 1 (a new page when the row would pass m_maxRows, or when that box stood in
  // row 0). Never fills a hole. Sets |pageAdded| when it made a page and never
  // clears it. Returns the new boxId, or -1 when the last page is unreadable.
  int InsertBoxData(std::string appId, bool& pageAdded);
  // As above in |menuId|, wrapping only after row m_maxRows + 2. Returns the
  // new boxId, or 0 when the last page is unreadable.
  int InsertBoxDataForDeactivatedApp(int menuId, std::string appId);
  // Deletes the box and packs the menu without gaps. Always 1.
  int DeleteBoxDataForDeactivatedApp(int menuId, int boxId);
  // Packs each page of the parent from its first cell (3 by 3 for a folder;
  // boxes past the last row keep their cells), then renumbers the pages and
  // deletes the empty ones, unless no box was placed at all.
  void _ReorderData(int parentId, bool isFolder);
  // Pours every box of the parent into its pages from the first cell on, on
  // the menu grid with row bound m_maxRows + 2; renumbers the pages that hold
  // boxes and deletes the others. Boxes left when pages run out stay put.
  void _ReorderDataWithoutSpace(int parentId, bool isFolder);
  // In one transaction, for every menu: renumbers its pages, deletes empty ones
  // (never a menu's only page) and packs each page and each folder's pages.
  void RearrangeAppsPosition();

  // ---- The alphabetical view: the boxes of one parent by name (NOCASE), on
  // computed cells (3 by 3 for a folder). Menu pages are virtual pages 100001
  // on; folder pages are parentId * 100000 + k.

  // The boxes, each on its virtual page.
  std::vector<boost::shared_ptr<GameBoxData> > GetBoxDataListByAlphabeticalOrder(int parentId,
                                                                                 bool isFolder);
  // The same cells, each on the parent's stored page of that rank. The listing
  // ends at the last stored page: boxes that would need more pages than the
  // parent has are left out.
  std::vector<boost::shared_ptr<GameBoxData> > GetBoxDataListByAlphabeticalOrderWithRealPage(
      int parentId, bool isFolder);
  // The virtual pages (a menu has at least one, an empty folder none); each is
  // remembered in m_pageMap and m_pageFlagMap for the edits below.
  std::vector<boost::shared_ptr<GamePageData> > GetPageDataListByAlphabeticalOrder(int parentId,
                                                                                  bool isFolder);
  // Stores a caller-filled box after the last box of menu 1; only its pageId,
  // col and row are set here. Returns the new boxId, or -1.
  int InsertBoxDataForAlphaBeticalOrder(GameBoxData& box);
  // |box| names a stored boxId, its new name, the page it was dropped on
  // (virtual or stored) and, in parentId, its new parent. Dropped within its
  // own parent, only the name changes (0). Otherwise the box goes after the
  // new parent's last box, the old parent is packed, and the result is
  // UpdateBoxData's. 0, logged, when the box or its page is unknown.
  int UpdateBoxDataForAlphaBeticalOrder(GameBoxData& box);
  // Deletes the box and packs its old parent. Always 0; an unknown box is logged.
  int DeleteBoxDataForAlphaBeticalOrder(int boxId);

  // ---- State.

  sqlite3* m_db;                      // null until _OpenDb
  // Bookkeeping of the virtual pages handed out by the computed views.
  std::map<int, int> m_pageMap;       // virtual pageId -> parentId
  std::map<int, bool> m_pageFlagMap;  // virtual pageId -> isFolder
  // The menu grid, fixed for the life of the store (grid.h walks it).
  int m_maxRows;          // rows of a menu page before a new page begins
  int m_columns;          // boxes in a row
  int m_maxBoxesPerPage;  // m_maxRows * m_columns; kept for the launcher, the
                          // grid counts pages from the two above
};

#endif  // KORRIN_LAUNCHER_DATA_MANAGER_LAUNCHER_DATA_MANAGER_H_
