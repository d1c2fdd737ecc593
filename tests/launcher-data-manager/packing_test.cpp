// Packing the boxes of a parent: page by page, reflowed, and the whole layout.
#include "launcher-data-manager/store-test.h"

namespace {

class PackingTest : public StoreTest {
 protected:
  // Each box as "appId@pageNo:col,row", in reading order.
  std::vector<std::string> Layout(int parentId, bool isFolder) {
    std::vector<std::string> layout;
    for (const Row& row : db->Rows(
             "SELECT coalesce(b.appId, b.name) || '@' || p.pageNo || ':' || b.col || ',' || b.row "
             "FROM Boxes b, Pages p ON p.pageId = b.pageId WHERE p.parentId = " +
             std::to_string(parentId) + " AND p.isFolder = " + std::to_string(isFolder) +
             " ORDER BY p.pageNo, b.row, b.col")) {
      layout.push_back(row[0]);
    }
    return layout;
  }

  // "pageId:pageNo" of each page of the parent, by pageId.
  std::string PageNumbers(int parentId, bool isFolder) {
    return db->Value("SELECT coalesce(group_concat(pageId || ':' || pageNo, ' '), '') FROM (SELECT "
                     "* FROM Pages WHERE parentId = " + std::to_string(parentId) +
                     " AND isFolder = " + std::to_string(isFolder) + " ORDER BY pageId)");
  }
};

// ---- Page by page

TEST_F(PackingTest, ReorderPacksEachPageInPlaceAFolderThreeByThreeAndRenumbersOrKeepsEmptyPages) {
  int first = AddPage(1, 4);
  AddPage(1, 6);  // empty: goes
  int second = AddPage(1, 9);
  AddBox(first, "a", 3, 2);
  AddBox(first, "b", 1, 5);
  AddBox(second, "c", 4, 4);
  int emptyFirst = AddPage(2, 5);
  int emptySecond = AddPage(2, 8);
  int folderPage = AddPage(42, 1, true);
  for (int i = 0; i < 10; ++i) AddBox(folderPage, "f" + std::to_string(i), i + 1, 7);

  store._ReorderData(1, false);
  store._ReorderData(2, false);
  store._ReorderData(42, true);

  EXPECT_EQ((std::vector<std::string>{"a@1:1,1", "b@1:2,1", "c@2:1,1"}), Layout(1, false));
  EXPECT_EQ(std::to_string(first) + ":1 " + std::to_string(second) + ":2", PageNumbers(1, false));
  EXPECT_EQ(std::to_string(emptyFirst) + ":1 " + std::to_string(emptySecond) + ":2",
            PageNumbers(2, false));
  EXPECT_EQ((std::vector<std::string>{"f0@1:1,1", "f1@1:2,1", "f2@1:3,1", "f3@1:1,2", "f4@1:2,2",
                                      "f5@1:3,2", "f6@1:1,3", "f7@1:2,3", "f8@1:3,3",
                                      "f9@1:10,7"}),  // past the last row: keeps its cell
            Layout(42, true));
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

// ---- Reflowed across pages

TEST_F(PackingTest, ReorderWithoutSpaceUsesTheMenuGridFillsRowsUpTo40002AndDropsEmptyPages) {
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

  // Rows fill up to 40002, then the next page, or the rest stays put.
  int first = AddPage(1, 1);
  int second = AddPage(1, 2);
  FillPage(first, 160009);
  // Menu 2 has a single page, so its last box has nowhere to go.
  FillPage(AddPage(2, 1), 160009, "only");
  db->Exec("UPDATE Boxes SET col = 3, row = 50000 WHERE appId = 'only160008'");

  ASSERT_TRUE(store.BeginTransaction());
  store._ReorderDataWithoutSpace(1, false);
  store._ReorderDataWithoutSpace(2, false);
  ASSERT_TRUE(store.CommitTransaction());

  EXPECT_EQ("4,40002", CellOf("app160007"));
  EXPECT_EQ(std::to_string(second),
            db->Value("SELECT pageId FROM Boxes WHERE appId = 'app160008'"));
  EXPECT_EQ("1,1", CellOf("app160008"));
  EXPECT_EQ(std::to_string(first), db->Value("SELECT pageId FROM Boxes WHERE appId = 'app0'"));
  EXPECT_EQ("3,50000", CellOf("only160008"));
  EXPECT_EQ("4,40002", CellOf("only160007"));
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

TEST_F(PackingTest, RearrangePacksFolderPagesFourWideInOneTransactionAndASecondPassChangesNothing) {
  int apps = AddMenu("Apps");
  int page = AddPage(apps, 1);
  int folder = AddBoxSql("isFolder, pageId, name, isSystem, col, row",
                         "1, " + std::to_string(page) + ", 'F', 1, 3, 3");
  int folderPage = AddPage(folder, 2, true);
  AddPage(folder, 5, true);  // empty and not the only one: goes
  AddBox(folderPage, "x", 3, 1);
  AddBoxSql("isFolder, pageId, name, col, row",
            "1, " + std::to_string(folderPage) + ", 'nested', 2, 2");
  AddBox(folderPage, "y", 1, 3);
  AddBox(folderPage, "z", 4, 3);
  AddBox(folderPage, "w", 2, 4);
  int lone = AddBoxSql("isFolder, pageId, name, col, row",
                       "1, " + std::to_string(page) + ", 'G', 4, 4");
  int lonePage = AddPage(lone, 1, true);  // empty, but the folder's only page: stays

  store.RearrangeAppsPosition();

  EXPECT_EQ((std::vector<std::string>{"F@1:1,1", "G@1:2,1"}), Layout(apps, false));
  EXPECT_EQ(std::to_string(lonePage) + ":1", PageNumbers(lone, true));
  // A nested folder keeps its cell and takes none; the page is not renumbered.
  EXPECT_EQ((std::vector<std::string>{"x@2:1,1", "y@2:2,1", "z@2:3,1", "w@2:4,1", "nested@2:2,2"}),
            Layout(folder, true));
  EXPECT_EQ(std::to_string(folderPage) + ":2", PageNumbers(folder, true));
  std::vector<std::string> statements = TakeStatements();
  ASSERT_GE(statements.size(), 2u);
  EXPECT_EQ("BEGIN IMMEDIATE TRANSACTION", statements.front());
  EXPECT_EQ("COMMIT TRANSACTION", statements.back());

  const std::vector<Row> pages = db->Rows("SELECT * FROM Pages ORDER BY pageId");
  const std::vector<Row> boxes = db->Rows("SELECT * FROM Boxes ORDER BY boxId");
  store.RearrangeAppsPosition();
  EXPECT_EQ(pages, db->Rows("SELECT * FROM Pages ORDER BY pageId"));
  EXPECT_EQ(boxes, db->Rows("SELECT * FROM Boxes ORDER BY boxId"));
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
