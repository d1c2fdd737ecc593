// Menus: what each operation writes and reads. (Failures: failures_test.cpp.)
#include "launcher-data-manager/store-test.h"

namespace {

class MenuStoreTest : public StoreTest {};

TEST_F(MenuStoreTest, InsertStoresTheMenuWritesItsIdAndLeavesAnEmptyNameNull) {
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
  EXPECT_EQ((std::vector<Row>{{"1", "Apps", "0"}, {"2", "Racing", "7"}, {"3", "NULL", "-1"}}),
            db->Rows("SELECT menuId, name, type FROM Menus"));
  EXPECT_EQ((Row{"3", "", "-1"}), Fields(*store.GetMenuData(3)));
}

TEST_F(MenuStoreTest, UpdateRewritesNameAndTypeByIdFoundOrNot) {
  GameViewData menu;
  menu.menuId = AddMenu("Apps");
  menu.name = "Games";
  menu.type = 2;
  EXPECT_TRUE(store.UpdateMenuData(menu));
  EXPECT_EQ((std::vector<Row>{{"Games", "2"}}), db->Rows("SELECT name, type FROM Menus"));

  menu.name = "";
  EXPECT_TRUE(store.UpdateMenuData(menu));
  menu.menuId = 99;  // no such menu: still true, and nothing written
  menu.name = "Nowhere";
  EXPECT_TRUE(store.UpdateMenuData(menu));
  EXPECT_EQ((std::vector<Row>{{"NULL", "2"}}), db->Rows("SELECT name, type FROM Menus"));
}

TEST_F(MenuStoreTest, DeleteRemovesOnlyTheMenuRow) {
  int apps = AddMenu("Apps");
  AddBox(AddPage(apps, 1), "a", 1, 1);

  EXPECT_TRUE(store.DeleteMenuData(apps));
  EXPECT_TRUE(store.DeleteMenuData(apps));  // already gone: still true

  EXPECT_EQ("0 1 1", Counts());
}

TEST_F(MenuStoreTest, CountAndListNewestFirst) {
  EXPECT_EQ(0, store.GetMenuDataCount());
  EXPECT_TRUE(store.GetMenuDataList().empty());
  AddMenu("one");
  AddMenu("two");
  AddMenu("three");

  EXPECT_EQ(3, store.GetMenuDataCount());
  EXPECT_EQ((std::vector<Row>{{"3", "three", "0"}, {"2", "two", "0"}, {"1", "one", "0"}}),
            Fields(store.GetMenuDataList()));
}

}  // namespace
