// First launch: an empty store is filled with one menu of every game the
// package side lists; a store that holds any menu is left as it stands.
#include <app_manager.h>

#include "launcher-data-manager/store-test.h"
#include "launcher-package-manager/launcher-package-manager.h"

namespace {

class FirstLaunchTest : public StoreTest {
 protected:
  void AddGames(const std::vector<std::string>& appIds) {
    for (const std::string& id : appIds) device.AddGame(id, id);
  }

  LauncherPackageManager packages;
};

TEST_F(FirstLaunchTest, GamesAreLaidOutFourToARowOnOnePageOfTheAppsMenu) {
  AddGames({"com.ex.e", "com.ex.c", "com.ex.a", "com.ex.d", "com.ex.b"});  // listed sorted
  // Empty, but with ids used before: the menu will be 2 and its page 3.
  AddPage(AddMenu("old"), 1);
  AddPage(1, 2);
  db->Exec("DELETE FROM Menus; DELETE FROM Pages");
  ASSERT_TRUE(store.Initialize(packages));
  EXPECT_EQ((std::vector<Row>{{"2", "Apps", "0"}}), db->Rows("SELECT * FROM Menus"));
  EXPECT_EQ((std::vector<Row>{{"3", "0", "2", "1"}}), db->Rows("SELECT * FROM Pages"));
  EXPECT_EQ((std::vector<Row>{{"com.ex.a", "3", "1", "1"},
                              {"com.ex.b", "3", "2", "1"},
                              {"com.ex.c", "3", "3", "1"},
                              {"com.ex.d", "3", "4", "1"},
                              {"com.ex.e", "3", "1", "2"}}),
            db->Rows("SELECT appId, pageId, col, row FROM Boxes ORDER BY boxId"));
  // Nothing else is stored: no name, icon or content, and every flag 0.
  EXPECT_EQ((std::vector<Row>{{"0", "NULL", "NULL", "0", "0", "0", "0", "NULL", "NULL"}}),
            db->Rows("SELECT DISTINCT isFolder, pageParentId, name, isPreload, isSystem, boxType, "
                     "launchType, iconPath, content FROM Boxes"));
}

TEST_F(FirstLaunchTest, WithoutGamesTheMenuHasNoPageAndAMenuWithoutPagesIsAPopulatedStore) {
  device.AddApp("com.ex.notes", "Notes");
  ASSERT_TRUE(store.Initialize(packages));
  EXPECT_EQ((std::vector<Row>{{"1", "Apps", "0"}}), db->Layout());

  // The next start, now with a game: the menu alone means the store is populated.
  AddGames({"com.ex.a"});
  device.ClearLogs();
  const int listings = device.CallCount("app_info_filter_create");
  EXPECT_TRUE(store.Initialize(packages));
  EXPECT_EQ(std::vector<std::string>{"W it's not the first launch"}, EngineMessages());
  EXPECT_EQ(listings, device.CallCount("app_info_filter_create"));  // the games are not listed
  EXPECT_EQ("0", db->Value("SELECT COUNT(*) FROM Pages"));
}

TEST_F(FirstLaunchTest, UnlistableGamesLeaveTheTablesMadeButEmpty) {
  db->Exec("DROP TABLE Boxes; DROP TABLE Pages; DROP TABLE Menus");  // as on a new device
  AddGames({"com.ex.a"});
  device.FailNext("app_info_filter_create", APP_MANAGER_ERROR_IO_ERROR);
  EXPECT_FALSE(store.Initialize(packages));
  EXPECT_EQ((std::vector<Row>{{"Boxes"}, {"Menus"}, {"Pages"}}),
            db->Rows("SELECT name FROM sqlite_master WHERE type = 'table' AND name NOT LIKE "
                     "'sqlite_%' ORDER BY name"));
  EXPECT_EQ(std::vector<Row>{}, db->Layout());
}

}  // namespace
