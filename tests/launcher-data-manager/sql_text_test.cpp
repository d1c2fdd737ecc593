// The statements the store runs are the launcher's own texts, blanks and
// spellings included; other tools read this database and its traces.
#include "launcher-data-manager/store-test.h"

#include <functional>

namespace {

class SqlTextTest : public StoreTest {};

TEST_F(SqlTextTest, EachOperationRunsItsOwnText) {
  // Each insert writes the new id into its record, which the update after it
  // then names.
  int page = AddPage(1, 1);
  GameViewData menu;
  menu.type = 0;
  GamePageData pageRecord;
  pageRecord.isFolder = true;
  pageRecord.parentId = 12;
  pageRecord.pageNo = 3;
  GameBoxData folder, shortcut, app;
  folder.isFolder = folder.isSystem = true;
  folder.pageId = 3;
  folder.col = 2;
  folder.row = 1;
  shortcut.boxType = 3;
  shortcut.pageId = app.pageId = page;
  app.col = 1;
  app.row = 2;
  app.isPreload = true;
  int parentId, pageId, boxId;

  struct Case {
    std::function<void()> call;
    std::string sql;
  } cases[] = {
      {[&] { store.InsertMenuData(menu); }, "INSERT INTO menus(name, type) VALUES($name, 0)"},
      {[&] { store.GetMenuData(2); }, "SELECT name, type FROM menus WHERE menuId = 2"},
      {[&] { store.UpdateMenuData(menu); },
       "UPDATE menus SET name = $name, type = 0 WHERE menuId = 1"},
      {[&] { store.DeleteMenuData(2); }, "DELETE FROM menus WHERE menuid = 2"},
      {[&] { store.GetMenuDataCount(); }, "SELECT COUNT(*) FROM menus "},
      {[&] { store.GetMenuDataList(); },
       "SELECT menuId, name, type FROM menus ORDER BY menuId DESC"},
      {[&] { store.InsertPageData(pageRecord); },
       "INSERT INTO pages(isFolder, parentId, pageNo) VALUES(1, 12, 3)"},
      {[&] { store.UpdatePageData(pageRecord); },
       "UPDATE pages SET parentId = 12, pageNo = 3 WHERE pageId = 2"},
      {[&] { store.DeletePageData(4); }, "DELETE FROM pages WHERE pageid = 4"},
      {[&] { store.DeleteFolderPageData(12); }, "DELETE FROM pages WHERE parentId = 12"},
      {[&] { store.GetMenuPageData(4); },
       "SELECT isFolder, parentId, pageNo FROM pages WHERE pageId = 4"},
      {[&] { store._GetPageDataCountByDownload(1); },
       "SELECT COUNT(*) FROM boxes b, pages p ON p.pageId = b.pageId WHERE b.isFolder = 0 AND "
       "b.IsPreload = 0"},
      {[&] { store.InsertBoxData(folder); },
       "INSERT INTO boxes(isFolder, pageId, name, appId, col, row, isPreload, isSystem, boxType, "
       "launchType) VALUES(1, 3, $name, $appId, 2, 1, 0, 1, 0, 0) "},
      {[&] { store.InsertBoxData(shortcut); },
       "INSERT INTO boxes(isFolder, pageId, name, appId, col, row, isPreload, isSystem, boxType, "
       "launchType, iconPath, content) VALUES(0, 1, $name, $appId, 0, 0, 0, 0, 3, 0, $iconPath, "
       "$content) "},
      {[&] { store.InsertBoxData(app); },
       "INSERT INTO boxes(isFolder, pageId, appId, col, row, isPreload, isSystem, boxType, "
       "launchType) VALUES(0, 1, $appId, 1, 2, 1, 0, 0, 0) "},
      {[&] { store.UpdateBoxData(folder); },
       "UPDATE boxes set isFolder = 1, pageId = 3, name = $name, col = 2, row = 1, isPreload = "
       "0, isSystem = 0 , boxType = 0, launchType = 0  WHERE boxId = 1"},
      {[&] { store.UpdateBoxData(shortcut); },
       "UPDATE boxes set isFolder = 0, pageId = 1, appId = $appId, name = $name, col = 0, row = "
       "0, isPreload = 0, isSystem = 0, boxType = 3, launchType = 0, iconPath = $iconPath, "
       "content = $content  WHERE boxId = 2"},
      {[&] { store.UpdateBoxData(app); },
       "UPDATE boxes set isFolder = 0, pageId = 1, appId = $appId, name = $name, col = 1, row = "
       "2, isPreload = 1, isSystem = 0, boxType = 0, launchType = 0  WHERE boxId = 3"},
      {[&] { store.DeleteBoxData(9); }, "DELETE FROM boxes WHERE boxid = 9"},
      {[&] { store.GetMenuBoxData(3); },
       "SELECT b.isFolder, p.pageId, col, row, appId, name, p.parentId, isPreload, isSystem, "
       "boxType, launchType, iconPath, content FROM boxes b, pages p ON b.pageId = p.pageId "
       "WHERE boxId = 3"},
      {[&] { store.GetBoxIdByAppId("a", &parentId, &pageId, &boxId); },
       "SELECT boxId, b.pageId, p.parentId FROM boxes b, pages p ON p.pageId = b.pageId  WHERE "
       "b.appId = $appId AND b.boxType != 3 "},
      {[&] { store.GetBoxDataByAppId("a"); },
       "SELECT b.boxId, b.isFolder, p.pageId, col, row, appId, name, p.parentId, isPreload, "
       "isSystem FROM boxes b, pages p ON b.pageId = p.pageId WHERE b.appId = $appId AND "
       "b.boxType != 3 "},
      {[&] { store.GetBoxDataCount(1); }, "SELECT COUNT(*) FROM boxes WHERE pageId = 1"},
      {[&] { store.GetPageDataList(1, false); },
       "SELECT pageId, isFolder, parentId, pageNo FROM pages WHERE isFolder = 0 AND parentId = 1 "
       "ORDER BY pageNo ASC"},
      {[&] { store.GetBoxDataList(1); },
       "SELECT boxId, b.isFolder, b.pageId, col, row, appId, name, p.parentId, isPreload, "
       "isSystem, boxType, launchType, iconPath, content FROM boxes b, pages p ON p.pageId = "
       "b.pageId  WHERE b.pageId = 1 ORDER BY row, col"},
      {[&] { store.GetBoxDataListByAppId("a", 3); },
       "SELECT boxId, b.isFolder, p.parentId, b.pageId, appId, name, col, row, isPreload, "
       "isSystem, boxType, launchType, iconPath, content FROM boxes b, pages p ON p.pageId = "
       "b.pageId WHERE appId = $appId AND boxType = 3 ORDER BY row, col"},
      {[&] { store.GetBoxDataListByDownload(1, false); },
       "SELECT boxId, b.isFolder, appId, name FROM boxes b, pages p ON p.pageId = b.pageId  "
       "WHERE b.isFolder = 0 AND b.IsPreload = 0 AND b.boxType != 3 "},
  };
  for (Case& c : cases) {
    TakeStatements();
    c.call();
    EXPECT_EQ(std::vector<std::string>{c.sql}, TakeStatements());
  }

  store.BeginTransaction();
  store.RollbackTransaction();
  store.BeginTransaction();
  store.CommitTransaction();
  EXPECT_EQ((std::vector<std::string>{"BEGIN IMMEDIATE TRANSACTION", "ROLLBACK TRANSACTION",
                                      "BEGIN IMMEDIATE TRANSACTION", "COMMIT TRANSACTION"}),
            TakeStatements());
}

TEST_F(SqlTextTest, PageCountComposesATextThatNeverCompilesAndAnswersZero) {
  AddPage(1, 1);
  // Not traced, since it never runs; what it would run cannot compile.
  EXPECT_EQ(0, store.GetPageDataCount(1, false));
  EXPECT_EQ(0, store.GetPageDataCount(1, true));
  EXPECT_TRUE(TakeStatements().empty());
  EXPECT_TRUE(EngineLogs().empty());
  EXPECT_NE(SQLITE_OK, db->TryExec("SELECT COUNT(*) FROM pages WHERE isFolder 0 AND menuId = 1"));
}

}  // namespace
