// Menus and pages: what the rows hold after each operation, and what reads
// give back. Their texts are pinned in sql_text_test.cpp, their failures in
// failures_test.cpp.
#include "launcher-data-manager/store-test.h"

namespace {

class MenuPageStoreTest : public StoreTest {};

TEST_F(MenuPageStoreTest, MenusInsertWithTheirIdUpdateByIdFoundOrNotAndListNewestFirst) {
  EXPECT_EQ(0, store.GetMenuDataCount());
  EXPECT_TRUE(store.GetMenuDataList().empty());
  GameViewData apps, racing, unnamed;
  apps.name = "Apps";
  apps.type = 0;
  racing.name = "Racing";
  racing.type = 7;

  EXPECT_EQ(1, store.InsertMenuData(apps));
  EXPECT_EQ(2, store.InsertMenuData(racing));
  EXPECT_EQ(3, store.InsertMenuData(unnamed));

  EXPECT_EQ((std::vector<int>{1, 2, 3}),
            (std::vector<int>{apps.menuId, racing.menuId, unnamed.menuId}));
  // An empty name is stored as NULL and read back as "".
  EXPECT_EQ((std::vector<Row>{{"1", "Apps", "0"}, {"2", "Racing", "7"}, {"3", "NULL", "-1"}}),
            db->Rows("SELECT menuId, name, type FROM Menus"));
  EXPECT_EQ((Row{"3", "", "-1"}), Fields(*store.GetMenuData(3)));
  EXPECT_EQ(3, store.GetMenuDataCount());
  EXPECT_EQ((std::vector<Row>{{"3", "", "-1"}, {"2", "Racing", "7"}, {"1", "Apps", "0"}}),
            Fields(store.GetMenuDataList()));

  apps.name = "Games";
  apps.type = 2;
  EXPECT_TRUE(store.UpdateMenuData(apps));
  EXPECT_EQ((std::vector<Row>{{"Games", "2"}}), db->Rows("SELECT name, type FROM Menus LIMIT 1"));
  apps.name = "";
  EXPECT_TRUE(store.UpdateMenuData(apps));
  apps.menuId = 99;  // no such menu: still true, and nothing written
  apps.name = "Nowhere";
  EXPECT_TRUE(store.UpdateMenuData(apps));
  EXPECT_EQ((std::vector<Row>{{"NULL", "2"}, {"Racing", "7"}, {"NULL", "-1"}}),
            db->Rows("SELECT name, type FROM Menus"));
}

TEST_F(MenuPageStoreTest, PagesReadOneOrTheDefaultAndDeletionsTakeTheirPagesAndLeaveTheBoxes) {
  int first = AddPage(1, 1);
  AddPage(1, 2);
  AddBox(first, "a", 1, 1);
  EXPECT_TRUE(store.DeletePageData(first));
  EXPECT_TRUE(store.DeletePageData(first));  // already gone: still true
  AddPage(5, 1, true);
  AddPage(5, 1, false);  // menu 5 shares the number, and goes too
  int kept = AddPage(6, 1, true);
  EXPECT_TRUE(store.DeleteFolderPageData(5));
  EXPECT_EQ((std::vector<Row>{{"1", "2"}, {"6", "1"}}),
            db->Rows("SELECT parentId, pageNo FROM Pages ORDER BY pageId"));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Boxes"));
  EXPECT_EQ((Row{std::to_string(kept), "1", "6", "1"}), Fields(*store.GetMenuPageData(kept)));
  EXPECT_EQ(Fields(GamePageData()), Fields(*store.GetMenuPageData(first)));
}

TEST_F(MenuPageStoreTest, AlphabeticalPageFormsAnswerFixedValuesAndTouchNothing) {
  GamePageData page;
  page.pageId = AddPage(1, 1);
  page.parentId = 9;
  EXPECT_EQ(-1, store.InsertPageDataForAlphaBeticalOrder(page));
  EXPECT_FALSE(store.UpdatePageDataForAlphaBeticalOrder(page));
  EXPECT_FALSE(store.DeletePageDataForAlphaBeticalOrder(page.pageId));
  EXPECT_EQ(1, page.pageId);
  EXPECT_EQ((std::vector<Row>{{"0", "1", "1"}}),
            db->Rows("SELECT isFolder, parentId, pageNo FROM Pages"));
}

}  // namespace
