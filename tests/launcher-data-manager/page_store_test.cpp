// Pages: single-page operations. (Failures: failures_test.cpp.)
#include "launcher-data-manager/store-test.h"

namespace {

class PageStoreTest : public StoreTest {
 protected:
  static GamePageData Page(int parentId, int pageNo, bool isFolder) {
    GamePageData page;
    page.parentId = parentId;
    page.pageNo = pageNo;
    page.isFolder = isFolder;
    return page;
  }
};

TEST_F(PageStoreTest, InsertWritesTheFlagAsOneAndReturnsTheId) {
  GamePageData menuPage = Page(1, 1, false);
  GamePageData folderPage = Page(12, 3, true);
  EXPECT_EQ(1, store.InsertPageData(menuPage));
  EXPECT_EQ(2, store.InsertPageData(folderPage));
  EXPECT_EQ(2, folderPage.pageId);
  EXPECT_EQ((std::vector<Row>{{"1", "0", "1", "1"}, {"2", "1", "12", "3"}}),
            db->Rows("SELECT pageId, isFolder, parentId, pageNo FROM Pages"));
}

TEST_F(PageStoreTest, UpdateMovesThePageButNeverChangesItsKind) {
  GamePageData page = Page(7, 4, false);
  page.pageId = AddPage(1, 1, true);
  EXPECT_TRUE(store.UpdatePageData(page));
  EXPECT_EQ((std::vector<Row>{{"1", "7", "4"}}),
            db->Rows("SELECT isFolder, parentId, pageNo FROM Pages"));
}

TEST_F(PageStoreTest, GetMenuPageDataReadsOneOrGivesTheDefault) {
  int id = AddPage(12, 2, true);
  EXPECT_EQ((Row{std::to_string(id), "1", "12", "2"}), Fields(*store.GetMenuPageData(id)));
  EXPECT_EQ(Fields(GamePageData()), Fields(*store.GetMenuPageData(id + 1)));
}

TEST_F(PageStoreTest, DeletionsTakeTheirPagesAndLeaveTheBoxes) {
  int first = AddPage(1, 1);
  AddPage(1, 2);
  AddBox(first, "a", 1, 1);
  EXPECT_TRUE(store.DeletePageData(first));
  EXPECT_TRUE(store.DeletePageData(first));  // already gone: still true
  AddPage(5, 1, true);
  AddPage(5, 1, false);  // menu 5 shares the number, and goes too
  AddPage(6, 1, true);
  EXPECT_TRUE(store.DeleteFolderPageData(5));
  EXPECT_EQ((std::vector<Row>{{"1", "2"}, {"6", "1"}}),
            db->Rows("SELECT parentId, pageNo FROM Pages ORDER BY pageId"));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Boxes"));
}

TEST_F(PageStoreTest, AlphabeticalFormsAnswerFixedValuesAndTouchNothing) {
  GamePageData page = Page(9, 9, true);
  page.pageId = AddPage(1, 1);
  EXPECT_EQ(-1, store.InsertPageDataForAlphaBeticalOrder(page));
  EXPECT_FALSE(store.UpdatePageDataForAlphaBeticalOrder(page));
  EXPECT_FALSE(store.DeletePageDataForAlphaBeticalOrder(page.pageId));
  EXPECT_EQ(1, page.pageId);
  EXPECT_EQ((std::vector<Row>{{"0", "1", "1"}}),
            db->Rows("SELECT isFolder, parentId, pageNo FROM Pages"));
}

}  // namespace
