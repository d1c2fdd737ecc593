// StoreTest: an open store on a fresh simulated device, plus plain SQL to lay
// out rows directly, read back what the store wrote, and break the file.
#ifndef KORRIN_TESTS_LAUNCHER_DATA_MANAGER_STORE_TEST_H_
#define KORRIN_TESTS_LAUNCHER_DATA_MANAGER_STORE_TEST_H_

#include <dlog.h>

#include <memory>
#include <string>
#include <vector>

#include "launcher-data-manager/launcher-data-manager.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

class StoreTest : public SimTest {
 protected:
  StoreTest();

  // Direct rows, bypassing the store. Each returns the new row id.
  int AddMenu(const std::string& name);
  int AddPage(int parentId, int pageNo, bool isFolder = false);
  int AddBox(int pageId, const std::string& appId, int col, int row);
  int AddBoxSql(const std::string& columns, const std::string& values);

  // |count| application boxes "<prefix>0", "<prefix>1", ... on |pageId|, in
  // reading order from (1, 1), four to a row, in one statement (fast enough
  // for pages of 160000 boxes).
  void FillPage(int pageId, int count, const std::string& prefix = "app");
  // "col,row" of the box of |appId|, or "" when it has none.
  std::string CellOf(const std::string& appId);
  // How many rows Menus, Pages and Boxes hold: "1 2 5".
  std::string Counts();

  // Renames |table| away, so that every statement naming it stops compiling.
  void Break(const std::string& table);

  // The SQL texts the store's connection has run since the last call.
  std::vector<std::string> TakeStatements();

  // (col,row) pairs of |boxes|, for compact layout checks.
  static std::vector<std::pair<int, int> > Cells(
      const std::vector<boost::shared_ptr<GameBoxData> >& boxes);

  // What a read fills in, as text, so that a whole record is checked at once.
  // A box: boxId, isFolder, pageId, parentId, col, row, appId, name,
  // isPreload, isSystem, boxType, launchType, iconPath, content.
  static Row Fields(const GameBoxData& box);
  // A page: pageId, isFolder, parentId, pageNo.
  static Row Fields(const GamePageData& page);
  // A menu: menuId, name, type.
  static Row Fields(const GameViewData& menu);
  template <class Record>
  static std::vector<Row> Fields(const std::vector<boost::shared_ptr<Record> >& records) {
    std::vector<Row> rows;
    for (const auto& record : records) rows.push_back(Fields(*record));
    return rows;
  }

  LauncherDataManager store;
  std::unique_ptr<SqlProbe> db;
  std::vector<std::string> statements;
};

#endif  // KORRIN_TESTS_LAUNCHER_DATA_MANAGER_STORE_TEST_H_
