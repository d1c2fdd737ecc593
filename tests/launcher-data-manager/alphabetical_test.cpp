// The alphabetical view: listings on computed cells, and the edits made on it.
#include "launcher-data-manager/store-test.h"

namespace {

class AlphabeticalTest : public StoreTest {
 protected:
  int AddNamedBox(int pageId, const std::string& name, int col = 1, int row = 1) {
    return AddBoxSql("isFolder, pageId, appId, name, col, row",
                     "0, " + std::to_string(pageId) + ", 'id." + name + "', '" + name + "', " +
                         std::to_string(col) + ", " + std::to_string(row));
  }

  // Each listed box as "name@pageId:col,row".
  static std::vector<std::string> Placed(const std::vector<boost::shared_ptr<GameBoxData>>& boxes) {
    std::vector<std::string> placed;
    for (const auto& box : boxes) {
      placed.push_back(box->name + "@" + std::to_string(box->pageId) + ":" +
                       std::to_string(box->col) + "," + std::to_string(box->row));
    }
    return placed;
  }

  // "parentId/isFolder pageNo:col,row" of a stored box.
  std::string StoredPlace(int boxId) {
    return db->Value("SELECT p.parentId || '/' || p.isFolder || ' ' || p.pageNo || ':' || b.col "
                     "|| ',' || b.row FROM Boxes b, Pages p ON p.pageId = b.pageId WHERE boxId = " +
                     std::to_string(boxId));
  }

  // The screen drops the box |boxId|, renamed |name|, on |pageId| of |parentId|.
  int Drop(int boxId, int pageId, int parentId, const std::string& name) {
    GameBoxData box = *store.GetMenuBoxData(boxId);
    box.pageId = pageId;
    box.parentId = parentId;
    box.name = name;
    return store.UpdateBoxDataForAlphaBeticalOrder(box);
  }
};

// ---- Listings

TEST_F(AlphabeticalTest, MenuBoxesByNameWithoutRegardToCase) {
  int page = AddPage(1, 1);
  AddNamedBox(page, "beta");
  AddNamedBox(page, "Alpha", 4, 4);
  AddNamedBox(page, "gamma");
  AddBoxSql("isFolder, pageId, name, isPreload, boxType",
            "1, " + std::to_string(page) + ", 'Delta', 1, 3");

  std::vector<boost::shared_ptr<GameBoxData> > boxes =
      store.GetBoxDataListByAlphabeticalOrder(1, false);
  EXPECT_EQ((std::vector<std::string>{"Alpha@100001:1,1", "beta@100001:2,1", "Delta@100001:3,1",
                                      "gamma@100001:4,1"}),
            Placed(boxes));
  EXPECT_TRUE(boxes[2]->isFolder);  // folders, preloaded boxes and shortcuts are all shown
  EXPECT_EQ(3, boxes[2]->boxType);
  EXPECT_EQ("id.Alpha", boxes[0]->appId);
}

TEST_F(AlphabeticalTest, FolderBoxesFillVirtualPagesNineAtATimeAnEmptyMenuShowsOnePage) {
  int first = AddPage(42, 1, true);
  int second = AddPage(42, 2, true);
  for (char c = 'a'; c < 'j'; ++c) AddNamedBox(first, std::string(1, c));
  AddNamedBox(second, "j");

  std::vector<std::string> placed = Placed(store.GetBoxDataListByAlphabeticalOrder(42, true));
  ASSERT_EQ(10u, placed.size());
  EXPECT_EQ("a@4200001:1,1", placed[0]);
  EXPECT_EQ("d@4200001:1,2", placed[3]);
  EXPECT_EQ("i@4200001:3,3", placed[8]);
  EXPECT_EQ("j@4200002:1,1", placed[9]);
  EXPECT_EQ((std::vector<Row>{{"4200001", "1", "42", "1"}, {"4200002", "1", "42", "2"}}),
            Fields(store.GetPageDataListByAlphabeticalOrder(42, true)));
  EXPECT_EQ(42, store.m_pageMap[4200002]);
  EXPECT_TRUE(store.m_pageFlagMap[4200002]);

  // An empty menu still shows one page, an empty folder none.
  EXPECT_EQ((std::vector<Row>{{"100001", "0", "1", "1"}}),
            Fields(store.GetPageDataListByAlphabeticalOrder(1, false)));
  EXPECT_EQ(1, store.m_pageMap[100001]);
  EXPECT_FALSE(store.m_pageFlagMap[100001]);
  EXPECT_TRUE(store.GetPageDataListByAlphabeticalOrder(9, true).empty());
}

TEST_F(AlphabeticalTest, RealPagesFollowTheStoredPagesAndStopAtTheLast) {
  int first = AddPage(9, 1, true);
  for (char c = 'a'; c < 'k'; ++c) AddNamedBox(first, std::string(1, c));  // ten boxes, one page
  std::vector<std::string> placed =
      Placed(store.GetBoxDataListByAlphabeticalOrderWithRealPage(9, true));
  ASSERT_EQ(9u, placed.size());
  EXPECT_EQ("i@" + std::to_string(first) + ":3,3", placed[8]);

  int second = AddPage(9, 2, true);
  placed = Placed(store.GetBoxDataListByAlphabeticalOrderWithRealPage(9, true));
  ASSERT_EQ(10u, placed.size());
  EXPECT_EQ("j@" + std::to_string(second) + ":1,1", placed[9]);

  // Menu 9's pages count too: the page statement does not look at isFolder.
  int menuPage = AddPage(9, 0, false);
  EXPECT_EQ("a@" + std::to_string(menuPage) + ":1,1",
            Placed(store.GetBoxDataListByAlphabeticalOrderWithRealPage(9, true))[0]);

  EXPECT_TRUE(store.GetBoxDataListByAlphabeticalOrderWithRealPage(77, false).empty());
}

// ---- Edits

TEST_F(AlphabeticalTest, InsertStoresTheCallersBoxAtTheEndOfMenuOneDeletePacksAndAnswersZero) {
  int x = AddNamedBox(AddPage(1, 1), "x", 2, 3);
  GameBoxData shortcut;
  shortcut.boxType = 3;
  shortcut.appId = "com.ex.racer";
  shortcut.name = "Race now";
  shortcut.iconPath = "/race.png";
  shortcut.content = "race://now";
  shortcut.col = 9;

  int id = store.InsertBoxDataForAlphaBeticalOrder(shortcut);

  EXPECT_EQ(id, shortcut.boxId);
  EXPECT_EQ("1/0 1:3,3", StoredPlace(id));
  EXPECT_EQ((std::vector<Row>{{"Race now", "/race.png", "race://now", "3"}}),
            db->Rows("SELECT name, iconPath, content, boxType FROM Boxes WHERE boxId = " +
                     std::to_string(id)));

  EXPECT_EQ(0, store.DeleteBoxDataForAlphaBeticalOrder(x));
  EXPECT_EQ("1/0 1:1,1", StoredPlace(id));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Boxes"));
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(AlphabeticalTest, DroppedOnItsOwnParentOnlyTheNameChanges) {
  int id = AddNamedBox(AddPage(1, 1), "old", 3, 2);
  store.GetPageDataListByAlphabeticalOrder(1, false);
  GameBoxData box = *store.GetMenuBoxData(id);
  box.pageId = 100001;
  box.name = "new";
  box.col = 1;
  TakeStatements();

  EXPECT_EQ(0, store.UpdateBoxDataForAlphaBeticalOrder(box));

  EXPECT_EQ("1/0 1:3,2", StoredPlace(id));
  EXPECT_EQ("new", db->Value("SELECT name FROM Boxes"));
  EXPECT_EQ("UPDATE boxes set name = $name  WHERE boxId = " + std::to_string(id),
            TakeStatements().back());
}

TEST_F(AlphabeticalTest, MovingIntoAFolderFollowsItsLastBoxAndPacksTheMenu) {
  int menuPage = AddPage(1, 1);
  const int folder = 7;  // a box id apart from every menu id
  AddBoxSql("boxId, isFolder, pageId, name, col, row",
            "7, 1, " + std::to_string(menuPage) + ", 'F', 1, 1");
  int moved = AddNamedBox(menuPage, "moved", 2, 1);
  AddNamedBox(menuPage, "stays", 3, 1);
  AddNamedBox(AddPage(folder, 1, true), "inside", 1, 1);
  store.GetPageDataListByAlphabeticalOrder(folder, true);

  EXPECT_EQ(1, Drop(moved, folder * 100000 + 1, folder, "moved"));

  EXPECT_EQ(std::to_string(folder) + "/1 1:2,1", StoredPlace(moved));
  EXPECT_EQ("2,1", CellOf("id.stays"));  // menu 1 packed
}

TEST_F(AlphabeticalTest, MovingOutOfAFolderGoesToTheEndOfTheMenuAndPacksTheFolder) {
  AddNamedBox(AddPage(1, 1), "m", 4, 1);
  int folderPage = AddPage(30, 1, true);
  int moved = AddNamedBox(folderPage, "moved", 1, 1);
  AddNamedBox(folderPage, "second", 2, 1);
  AddNamedBox(folderPage, "third", 3, 1);
  AddNamedBox(folderPage, "fourth", 1, 2);
  store.GetPageDataListByAlphabeticalOrder(1, false);

  EXPECT_EQ(1, Drop(moved, 100001, 1, "moved"));

  EXPECT_EQ("1/0 1:1,2", StoredPlace(moved));
  EXPECT_EQ("1,1", CellOf("id.second"));
  EXPECT_EQ("3,1", CellOf("id.fourth"));  // three to a folder's row
}

TEST_F(AlphabeticalTest, WithoutAVirtualPageTheTargetIsAStoredPageOrTheNamedParent) {
  int menuPage = AddPage(1, 1);
  int a = AddNamedBox(menuPage, "a");
  int b = AddNamedBox(menuPage, "b", 2, 1);
  int c = AddNamedBox(menuPage, "c", 3, 1);
  int d = AddNamedBox(menuPage, "d", 4, 1);
  int otherPage = AddPage(2, 1);
  AddNamedBox(otherPage, "there", 1, 1);
  AddNamedBox(AddPage(6, 1, true), "f", 3, 1);
  AddNamedBox(AddPage(5, 1, false), "m", 3, 1);

  EXPECT_EQ(1, Drop(a, otherPage, 2, "a"));  // a stored page names its parent
  // An unknown page takes the named parent, a folder when above five.
  EXPECT_EQ(1, Drop(b, 555555, 6, "b"));
  EXPECT_EQ(1, Drop(c, 555556, 5, "c"));
  EXPECT_EQ(1, Drop(d, 555557, 12, "d"));  // a parent without pages gets its first

  EXPECT_EQ((std::vector<std::string>{"2/0 1:2,1", "6/1 1:1,2", "5/0 1:4,1", "12/1 1:1,1"}),
            (std::vector<std::string>{StoredPlace(a), StoredPlace(b), StoredPlace(c),
                                      StoredPlace(d)}));
  // The lookup of a page that is not virtual leaves an empty entry behind.
  EXPECT_EQ(1u, store.m_pageMap.count(otherPage));
  EXPECT_EQ(0, store.m_pageMap[otherPage]);
  const std::string function = "UpdateBoxDataForAlphaBeticalOrder";
  EXPECT_EQ((std::vector<EngineLog>{
                {DLOG_ERROR, "launcher-data-manager.cpp", function, "No page [555555]"},
                {DLOG_ERROR, "launcher-data-manager.cpp", function, "No page [555556]"},
                {DLOG_ERROR, "launcher-data-manager.cpp", function, "No page [555557]"}}),
            EngineLogs());
}

TEST_F(AlphabeticalTest, ADropOnAStoredPageTargetsMenuPagesWhateverAFolderListingLeftBehind) {
  int menuPage = AddPage(1, 1);
  ASSERT_EQ(1, menuPage);  // the same id as the first virtual page of a folder box 0
  AddNamedBox(menuPage, "a");
  AddNamedBox(AddPage(0, 1, true), "f");
  int moved = AddNamedBox(AddPage(2, 1), "m");
  ASSERT_EQ(1u, store.GetPageDataListByAlphabeticalOrder(0, true).size());

  EXPECT_EQ(1, Drop(moved, menuPage, 1, "m"));
  EXPECT_EQ("1/0 1:2,1", StoredPlace(moved));
}

TEST_F(AlphabeticalTest, RefusedEditsAreLoggedAndAnswerZero) {
  int stranded = AddNamedBox(AddPage(0, 1), "stranded");  // on a page without parent
  GameBoxData ghost;
  ghost.boxId = 404;
  EXPECT_EQ(0, store.UpdateBoxDataForAlphaBeticalOrder(ghost));
  EXPECT_EQ(0, store.DeleteBoxDataForAlphaBeticalOrder(405));
  EXPECT_EQ(0, Drop(stranded, 100001, 1, "renamed"));
  EXPECT_EQ("stranded", db->Value("SELECT name FROM Boxes"));
  const std::string function = "UpdateBoxDataForAlphaBeticalOrder";
  EXPECT_EQ((std::vector<EngineLog>{
                {DLOG_ERROR, "launcher-data-manager.cpp", function, "No box [404]"},
                {DLOG_ERROR, "launcher-data-manager.cpp", "DeleteBoxDataForAlphaBeticalOrder",
                 "No box [405]"},
                {DLOG_ERROR, "launcher-data-manager.cpp", function, "invalid page parent id"}}),
            EngineLogs());
}

}  // namespace
