// Menus: what each operation writes and reads, and what it answers on failure.
#include "launcher-data-manager/store-test.h"

namespace {

class MenuStoreTest : public StoreTest {};

TEST_F(MenuStoreTest, InsertStoresTheMenuAndWritesItsId) {
  GameViewData apps;
  apps.name = "Apps";
  apps.type = 0;
  GameViewData other;
  other.name = "Racing";
  other.type = 7;

  EXPECT_EQ(1, store.InsertMenuData(apps));
  EXPECT_EQ(2, store.InsertMenuData(other));

  EXPECT_EQ(1, apps.menuId);
  EXPECT_EQ(2, other.menuId);
  EXPECT_EQ((std::vector<Row>{{"1", "Apps", "0"}, {"2", "Racing", "7"}}),
            db->Rows("SELECT menuId, name, type FROM Menus"));
}

TEST_F(MenuStoreTest, EmptyNameIsStoredAsNullAndReadsBackEmpty) {
  GameViewData menu;
  int id = store.InsertMenuData(menu);
  EXPECT_EQ("NULL", db->Value("SELECT quote(name) FROM Menus"));
  EXPECT_EQ("-1", db->Value("SELECT type FROM Menus"));

  boost::shared_ptr<GameViewData> read = store.GetMenuData(id);
  EXPECT_EQ(id, read->menuId);
  EXPECT_EQ("", read->name);
  EXPECT_EQ(-1, read->type);
}

TEST_F(MenuStoreTest, UpdateRewritesNameAndTypeByIdFoundOrNot) {
  int id = AddMenu("Apps");
  GameViewData menu;
  menu.menuId = id;
  menu.name = "Games";
  menu.type = 2;
  EXPECT_TRUE(store.UpdateMenuData(menu));
  EXPECT_EQ((std::vector<Row>{{"Games", "2"}}), db->Rows("SELECT name, type FROM Menus"));

  menu.name = "";
  EXPECT_TRUE(store.UpdateMenuData(menu));
  EXPECT_EQ("NULL", db->Value("SELECT quote(name) FROM Menus"));

  menu.menuId = 99;
  menu.name = "Nowhere";
  EXPECT_TRUE(store.UpdateMenuData(menu));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Menus WHERE name IS NULL"));
}

TEST_F(MenuStoreTest, DeleteRemovesOnlyTheMenuRow) {
  int apps = AddMenu("Apps");
  int page = AddPage(apps, 1);
  AddBox(page, "a", 1, 1);

  EXPECT_TRUE(store.DeleteMenuData(apps));
  EXPECT_TRUE(store.DeleteMenuData(apps));  // already gone: still true

  EXPECT_EQ("0", db->Value("SELECT count(*) FROM Menus"));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Pages"));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Boxes"));
}

TEST_F(MenuStoreTest, CountAndListNewestFirst) {
  EXPECT_EQ(0, store.GetMenuDataCount());
  EXPECT_TRUE(store.GetMenuDataList().empty());

  AddMenu("one");
  AddMenu("two");
  AddMenu("three");

  EXPECT_EQ(3, store.GetMenuDataCount());
  std::vector<boost::shared_ptr<GameViewData> > menus = store.GetMenuDataList();
  ASSERT_EQ(3u, menus.size());
  EXPECT_EQ(3, menus[0]->menuId);
  EXPECT_EQ("three", menus[0]->name);
  EXPECT_EQ(0, menus[0]->type);
  EXPECT_EQ(2, menus[1]->menuId);
  EXPECT_EQ(1, menus[2]->menuId);
}

// ---- Failures

TEST_F(MenuStoreTest, EveryOperationFailsQuietlyWithoutItsTable) {
  AddMenu("Apps");
  Break("Menus");
  GameViewData menu;
  menu.menuId = 5;
  menu.name = "x";

  EXPECT_EQ(-1, store.InsertMenuData(menu));
  EXPECT_EQ(5, menu.menuId);  // untouched
  EXPECT_FALSE(store.UpdateMenuData(menu));
  EXPECT_FALSE(store.DeleteMenuData(1));
  EXPECT_EQ(0, store.GetMenuDataCount());
  EXPECT_TRUE(store.GetMenuDataList().empty());
  boost::shared_ptr<GameViewData> read = store.GetMenuData(1);
  ASSERT_TRUE(read);
  EXPECT_EQ(0, read->menuId);
  EXPECT_EQ(-1, read->type);

  EXPECT_TRUE(EngineLogs().empty());
  EXPECT_EQ((std::vector<Row>{{"Apps"}}), db->Rows("SELECT name FROM MenusGone"));
}

}  // namespace
