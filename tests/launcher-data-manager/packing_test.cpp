// Packing the boxes of a parent: page by page, reflowed, and the whole layout.
#include "launcher-data-manager/store-test.h"

namespace {

class PackingTest : public StoreTest {
 protected:
  // Each box as "appId@pageNo:col,row", in reading order.
  std::vector<std::string> Layout(int parentId, bool isFolder) {
    std::vector<std::string> layout;
    for (const Row& row : db->Rows(
             "SELECT b.appId || '@' || p.pageNo || ':' || b.col || ',' || b.row FROM Boxes b, "
             "Pages p ON p.pageId = b.pageId WHERE p.parentId = " + std::to_string(parentId) +
             " AND p.isFolder = " + std::to_string(isFolder) + " ORDER BY p.pageNo, b.row, b.col")) {
      layout.push_back(row[0]);
    }
    return layout;
  }

  std::string PageNumbers(int parentId, bool isFolder) {
    return db->Value("SELECT coalesce(group_concat(pageId || ':' || pageNo, ' '), '') FROM (SELECT * FROM Pages "
                     "WHERE parentId = " + std::to_string(parentId) + " AND isFolder = " +
                     std::to_string(isFolder) + " ORDER BY pageId)");
  }

  std::string Dump() {
    std::string dump;
    for (const Row& row : db->Rows("SELECT * FROM Pages ORDER BY pageId")) {
      for (const std::string& column : row) dump += column + "|";
    }
    for (const Row& row : db->Rows("SELECT * FROM Boxes ORDER BY boxId")) {
      for (const std::string& column : row) dump += column + "|";
    }
    return dump;
  }
};

// ---- Page by page

TEST_F(PackingTest, ReorderPacksEachPageInPlaceAndRenumbers) {
  int first = AddPage(1, 4);
  AddPage(1, 6);  // empty: goes
  int second = AddPage(1, 9);
  AddBox(first, "a", 3, 2);
  AddBox(first, "b", 1, 5);
  AddBox(second, "c", 4, 4);

  store._ReorderData(1, false);

  EXPECT_EQ((std::vector<std::string>{"a@1:1,1", "b@1:2,1", "c@2:1,1"}), Layout(1, false));
  EXPECT_EQ(std::to_string(first) + ":1 " + std::to_string(second) + ":2", PageNumbers(1, false));
}

TEST_F(PackingTest, ReorderLaysAFolderOutThreeByThree) {
  int page = AddPage(42, 1, true);
  for (int i = 0; i < 10; ++i) AddBox(page, "f" + std::to_string(i), i + 1, 7);

  store._ReorderData(42, true);

  EXPECT_EQ("1,1", CellOf("f0"));
  EXPECT_EQ("3,1", CellOf("f2"));
  EXPECT_EQ("1,2", CellOf("f3"));
  EXPECT_EQ("3,3", CellOf("f8"));
  EXPECT_EQ("10,7", CellOf("f9"));  // past the last row: keeps its cell
}

TEST_F(PackingTest, ReorderStopsAMenuPageAtRow40000) {
  int page = AddPage(1, 1);
  FillPage(page, 160001);
  db->Exec("UPDATE Boxes SET col = 1, row = 90000 WHERE appId = 'app0'");  // now last in order

  ASSERT_TRUE(store.BeginTransaction());
  store._ReorderData(1, false);
  ASSERT_TRUE(store.CommitTransaction());

  EXPECT_EQ("1,1", CellOf("app1"));
  EXPECT_EQ("4,40000", CellOf("app160000"));
  EXPECT_EQ("1,90000", CellOf("app0"));
}

TEST_F(PackingTest, ReorderKeepsEmptyPagesWhenThereIsNoBoxAtAll) {
  AddPage(1, 5);
  AddPage(1, 8);
  store._ReorderData(1, false);
  EXPECT_EQ("1:1 2:2", PageNumbers(1, false));
}

// ---- Reflowed across pages

TEST_F(PackingTest, ReorderWithoutSpaceUsesTheMenuGridForFoldersAndDropsEmptyPages) {
  int page = AddPage(7, 1, true);
  for (int i = 0; i < 5; ++i) AddBox(page, "f" + std::to_string(i), 1, i + 1);
  AddPage(7, 2, true);
  store._ReorderDataWithoutSpace(7, true);
  EXPECT_EQ("1,2", CellOf("f4"));  // four to a row, not three
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Pages"));

  AddPage(3, 1);
  AddPage(3, 2);
  store._ReorderDataWithoutSpace(3, false);
  EXPECT_EQ("", PageNumbers(3, false));  // no box at all: every page goes
}

TEST_F(PackingTest, ReorderWithoutSpaceFillsRowsUpTo40002) {
  int first = AddPage(1, 1);
  int second = AddPage(1, 2);
  FillPage(first, 160009);

  ASSERT_TRUE(store.BeginTransaction());
  store._ReorderDataWithoutSpace(1, false);
  ASSERT_TRUE(store.CommitTransaction());

  EXPECT_EQ("4,40002", CellOf("app160007"));
  EXPECT_EQ(std::to_string(second),
            db->Value("SELECT pageId FROM Boxes WHERE appId = 'app160008'"));
  EXPECT_EQ("1,1", CellOf("app160008"));
}

TEST_F(PackingTest, ReorderWithoutSpaceLeavesBoxesInPlaceWhenPagesRunOut) {
  int page = AddPage(1, 1);
  FillPage(page, 160009);
  db->Exec("UPDATE Boxes SET col = 3, row = 50000 WHERE appId = 'app160008'");

  ASSERT_TRUE(store.BeginTransaction());
  store._ReorderDataWithoutSpace(1, false);
  ASSERT_TRUE(store.CommitTransaction());

  EXPECT_EQ("3,50000", CellOf("app160008"));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Pages"));
}

// ---- The whole layout

TEST_F(PackingTest, RearrangeRenumbersDropsEmptySurplusPagesAndPacks) {
  int apps = AddMenu("Apps");
  int empty = AddMenu("Empty");
  int first = AddPage(apps, 3);
  AddPage(apps, 4);  // empty: goes
  int second = AddPage(apps, 7);
  int onlyPage = AddPage(empty, 5);  // a menu's only page stays, empty or not
  AddBox(first, "a", 2, 2);
  AddBox(first, "b", 4, 9);
  AddBox(second, "c", 3, 3);

  store.RearrangeAppsPosition();

  EXPECT_EQ((std::vector<std::string>{"a@1:1,1", "b@1:2,1", "c@2:1,1"}), Layout(apps, false));
  EXPECT_EQ(std::to_string(first) + ":1 " + std::to_string(second) + ":2",
            PageNumbers(apps, false));
  EXPECT_EQ(std::to_string(onlyPage) + ":1", PageNumbers(empty, false));
}

TEST_F(PackingTest, RearrangePacksFolderPagesFourWideAroundNestedFolders) {
  int apps = AddMenu("Apps");
  int page = AddPage(apps, 1);
  int folder = AddBoxSql("isFolder, pageId, name, col, row", "1, " + std::to_string(page) + ", 'F', 3, 3");
  int folderPage = AddPage(folder, 2, true);
  AddPage(folder, 5, true);  // empty and not the only one: goes
  AddBox(folderPage, "x", 3, 1);
  AddBoxSql("isFolder, pageId, name, col, row", "1, " + std::to_string(folderPage) + ", 'nested', 2, 2");
  AddBox(folderPage, "y", 1, 3);
  AddBox(folderPage, "z", 4, 3);
  AddBox(folderPage, "w", 2, 4);

  store.RearrangeAppsPosition();

  EXPECT_EQ("1,1", db->Value("SELECT col || ',' || row FROM Boxes WHERE name = 'F'"));
  EXPECT_EQ("1,1", CellOf("x"));
  EXPECT_EQ("2,2", db->Value("SELECT col || ',' || row FROM Boxes WHERE name = 'nested'"));
  EXPECT_EQ("2,1", CellOf("y"));
  EXPECT_EQ("3,1", CellOf("z"));
  EXPECT_EQ("4,1", CellOf("w"));
  EXPECT_EQ(std::to_string(folderPage) + ":2", PageNumbers(folder, true));  // not renumbered
}

TEST_F(PackingTest, RearrangeRunsInOneTransactionAndASecondPassChangesNothing) {
  int apps = AddMenu("Apps");
  int page = AddPage(apps, 2);
  AddPage(apps, 3);
  AddBox(page, "a", 3, 3);
  int folder = AddBoxSql("isFolder, pageId, name, isSystem, col, row",
                         "1, " + std::to_string(page) + ", 'F', 1, 1, 5");
  AddBox(AddPage(folder, 1, true), "b", 2, 2);

  store.RearrangeAppsPosition();
  std::vector<std::string> statements = TakeStatements();
  ASSERT_GE(statements.size(), 2u);
  EXPECT_EQ("BEGIN IMMEDIATE TRANSACTION", statements.front());
  EXPECT_EQ("COMMIT TRANSACTION", statements.back());

  std::string once = Dump();
  store.RearrangeAppsPosition();
  EXPECT_EQ(once, Dump());
}

TEST_F(PackingTest, ATenThousandBoxLayoutRearrangesAndListsAlphabetically) {
  int apps = AddMenu("Apps");
  int page = AddPage(apps, 1);
  FillPage(page, 9000);
  db->Exec("UPDATE Boxes SET row = row * 2, name = 'n' || (100000 - boxId)");  // gaps, names
  std::vector<int> folders;
  for (int f = 0; f < 50; ++f) {
    int folder = AddBoxSql("isFolder, pageId, name, col, row",
                           "1, " + std::to_string(page) + ", 'folder" + std::to_string(f) +
                               "', 1, " + std::to_string(30000 + f));
    FillPage(AddPage(folder, 1, true), 20, "f" + std::to_string(f) + "-");
    db->Exec("UPDATE Boxes SET col = col + 4 WHERE appId LIKE 'f" + std::to_string(f) + "-%'");
    folders.push_back(folder);
  }

  store.RearrangeAppsPosition();

  EXPECT_EQ("9050|1|1|4|2263",
            db->Value("SELECT count(*) || '|' || min(col) || '|' || min(row) || '|' || max(col) "
                      "|| '|' || max(row) FROM Boxes WHERE pageId = " + std::to_string(page)));
  EXPECT_EQ("1000|4|5", db->Value("SELECT count(*) || '|' || max(col) || '|' || max(row) FROM "
                                  "Boxes WHERE appId LIKE 'f%'"));

  std::vector<boost::shared_ptr<GameBoxData> > menu =
      store.GetBoxDataListByAlphabeticalOrder(apps, false);
  ASSERT_EQ(9050u, menu.size());
  EXPECT_EQ("folder0", menu[0]->name);
  EXPECT_EQ(100001, menu.back()->pageId);
  EXPECT_EQ(2263, menu.back()->row);
  EXPECT_EQ(9050u, store.GetBoxDataListByAlphabeticalOrderWithRealPage(apps, false).size());
  for (int folder : folders) {
    std::vector<boost::shared_ptr<GameBoxData> > inside =
        store.GetBoxDataListByAlphabeticalOrder(folder, true);
    ASSERT_EQ(20u, inside.size());
    EXPECT_EQ(folder * 100000 + 3, inside.back()->pageId);
    EXPECT_EQ(3u, store.GetPageDataListByAlphabeticalOrder(folder, true).size());
  }
}

}  // namespace
