// Listing applications: the displayable games of the device, the
// applications of one package, and whether an application is launched from
// the menu.
#include <app_control.h>
#include <app_manager.h>
#include <package_manager.h>

#include "package-manager-test.h"

namespace {

class AppListsTest : public PackageManagerTest {
 protected:
  // Games, a disabled game, a non-game and a no-display game, in an order
  // that is not the sorted one.
  void SetUpMixedDevice() {
    device.AddGame("com.ex.zebra", "Zebra");
    device.AddGame("com.ex.apple", "Apple");
    device.AddApp("com.ex.notes", "Notes");
    device.AddGame("com.ex.off", "Off");
    device.FindPackage("com.ex.off")->disabled = true;
    device.AddGame("com.ex.hidden", "Hidden");
    device.FindApp("com.ex.hidden")->noDisplay = true;
    device.AddGame("com.ex.mango", "Mango");
  }

  // A package whose applications are |apps|, in that order.
  void AddPack(std::vector<sim::App> apps) {
    device.AddPackage(sim::MakePackage("com.ex.pack", std::move(apps)));
  }

  static sim::App Service(const std::string& id) {
    sim::App app = sim::PlainApp(id, id);
    app.component = PACKAGE_INFO_SERVICEAPP;
    return app;
  }
};

// ---- GetAppIdList

TEST_F(AppListsTest, ListsEnabledDisplayableGamesSortedWithTheCallersEntriesThenTrustsTheCache) {
  SetUpMixedDevice();
  Ids ids = {"com.ex.zz-callers", "com.ex.aa-callers"};
  ASSERT_TRUE(manager.GetAppIdList(ids));
  EXPECT_EQ((Ids{"com.ex.aa-callers", "com.ex.apple", "com.ex.mango", "com.ex.zebra",
                 "com.ex.zz-callers"}),
            ids);
  // The disabled game is cached all the same; only the listing leaves it out.
  EXPECT_EQ(4u, manager.m_appInfoCache.size());
  EXPECT_FALSE(manager.m_appInfoCache["com.ex.off"]->isEnabled);
  Ids logs = EngineMessages();
  EXPECT_EQ("W # BEGIN", logs.front());
  EXPECT_EQ("W # END", logs.back());
  EXPECT_EQ(1, std::count(logs.begin(), logs.end(), "E  app_info_is_game FAILED [0] [0]"));
  EXPECT_EQ(0, LeftOpen());

  // A cache holding anything is trusted without asking: a new game goes unseen.
  device.AddGame("com.ex.new", "New");
  device.ClearLogs();
  ids.clear();
  ASSERT_TRUE(manager.GetAppIdList(ids));
  EXPECT_EQ((Ids{"com.ex.apple", "com.ex.mango", "com.ex.zebra"}), ids);
  EXPECT_EQ(1, device.CallCount("app_info_filter_create"));
  EXPECT_EQ((Ids{"W # BEGIN", "W # END"}), EngineMessages());
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(AppListsTest, ListingFailuresReturnFalseAndKeepTheCallersListAGameTestFailureSkipsOne) {
  struct {
    const char* call;
    Ids logs;
  } cases[] = {
      {"app_info_filter_create",
       {"W # BEGIN", "E (APP_MANAGER_ERROR_NONE != app_info_filter_create(&handle))"}},
      {"app_info_filter_add_bool", {"W # BEGIN"}},
      {"app_info_filter_foreach_appinfo", {"W # BEGIN"}},
  };
  SetUpMixedDevice();
  for (const auto& c : cases) {
    SCOPED_TRACE(c.call);
    device.ClearLogs();
    device.FailNext(c.call, APP_MANAGER_ERROR_IO_ERROR);
    Ids ids = {"mine"};
    EXPECT_FALSE(manager.GetAppIdList(ids));
    EXPECT_EQ(Ids{"mine"}, ids);
    EXPECT_EQ(c.logs, EngineMessages());
    EXPECT_TRUE(manager.m_appInfoCache.empty());
    EXPECT_EQ(0, LeftOpen());
  }

  // A failing game test skips only that application.
  device.ClearLogs();
  device.FailNext("app_info_is_game", APP_MANAGER_ERROR_IO_ERROR);  // com.ex.zebra
  Ids ids;
  ASSERT_TRUE(manager.GetAppIdList(ids));
  EXPECT_EQ((Ids{"com.ex.apple", "com.ex.mango"}), ids);
  EXPECT_EQ("E  app_info_is_game FAILED [-5] [0]", EngineMessages()[1]);
}

// ---- _GetAppIds

TEST_F(AppListsTest, PackageListsItsDisplayableUiGamesUpToTheFirstThatIsNoGame) {
  sim::App hidden = sim::GameApp("com.ex.pack.hidden", "Hidden");
  hidden.noDisplay = true;
  AddPack({sim::GameApp("com.ex.pack.a", "A"), hidden, Service("com.ex.pack.sync"),
           sim::GameApp("com.ex.pack.b", "B")});
  EXPECT_EQ((Ids{"com.ex.pack.a", "com.ex.pack.b"}), manager._GetAppIds("com.ex.pack"));
  EXPECT_EQ((Ids{"E BEGIN", "E App [com.ex.pack.a], [0] [1]", "E ##### [com.ex.pack.a]",
                 "E App [com.ex.pack.hidden], [0] [1]", "E this package is no display",
                 "E ##### [com.ex.pack.a]", "E App [com.ex.pack.b], [0] [1]",
                 "E ##### [com.ex.pack.a]", "E ##### [com.ex.pack.b]", "E ##### [com.ex.pack.a]",
                 "E ##### [com.ex.pack.b]", "E END"}),
            EngineMessages());
  EXPECT_EQ(0, LeftOpen());

  // The first application that is no game ends the list.
  AddPack({sim::PlainApp("com.ex.pack.launcher", "Launcher"), sim::GameApp("com.ex.pack.a", "A")});
  EXPECT_EQ(Ids{}, manager._GetAppIds("com.ex.pack"));
  AddPack({sim::GameApp("com.ex.pack.a", "A"), sim::PlainApp("com.ex.pack.launcher", "Launcher"),
           sim::GameApp("com.ex.pack.b", "B")});
  EXPECT_EQ(Ids{"com.ex.pack.a"}, manager._GetAppIds("com.ex.pack"));
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(AppListsTest, PackageListingFailures) {
  const char* retry = "E package_info_foreach_app_from_package != PACKAGE_MANAGER_ERROR_NONE";
  const char* appA = "E App [com.ex.pack.a], [0] [1]";
  struct {
    const char* name;
    const char* call;
    int times;  // failing calls in a row
    Ids appIds;
    Ids logs;  // between BEGIN and END
  } cases[] = {
      {"no package information", "package_manager_get_package_info", 1, {},
       {"E package_manager_get_package_info[com.ex.pack] != PACKAGE_MANAGER_ERROR_NONE"}},
      {"UI listing fails, all components listed instead", "package_info_foreach_app_from_package",
       1, {"com.ex.pack.a"},
       {retry, appA, "E ##### [com.ex.pack.a]", "E App [com.ex.pack.sync], [0] [0]",
        "E ##### [com.ex.pack.a]"}},
      {"both listings fail", "package_info_foreach_app_from_package", 2, {},
       {retry, "E try again package_info_foreach_app_from_package != PACKAGE_MANAGER_ERROR_NONE"}},
      {"application cannot be opened", "app_info_create", 1, {}, {}},
      {"game test fails", "app_info_is_game", 1, {}, {"E App [com.ex.pack.a], [-5] [1]"}},
      {"no-display read fails", "app_info_is_nodisplay", 1, {}, {appA}},
      {"id read fails", "app_info_get_app_id", 1, {}, {appA}},
  };
  AddPack({sim::GameApp("com.ex.pack.a", "A"), Service("com.ex.pack.sync")});
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    device.ClearLogs();
    for (int i = 0; i < c.times; ++i) device.FailNext(c.call, -5, i);
    EXPECT_EQ(c.appIds, manager._GetAppIds("com.ex.pack"));
    Ids logs = {"E BEGIN"};
    logs.insert(logs.end(), c.logs.begin(), c.logs.end());
    logs.push_back("E END");
    EXPECT_EQ(logs, EngineMessages());
    EXPECT_EQ(0, LeftOpen());
  }
}

// ---- _IsMenuLaunch

TEST_F(AppListsTest, MenuLaunchIsAFloatingCategoryOrTheFirstMetadataPairAndFalseOnFailure) {
  const std::pair<std::string, std::string> menuLaunch = {
      "http://velmora.com/tizen/metadata/menu/launch/operation", APP_CONTROL_OPERATION_MAIN};
  struct {
    const char* name;
    std::vector<std::string> categories;
    std::vector<std::pair<std::string, std::string>> metadata;
    bool menuLaunched;
  } cases[] = {
      {"plain", {}, {}, false},
      {"floating", {"http://velmora.com/category/floatingapp"}, {}, true},
      {"menu launch second: only the first pair is looked at", {}, {{"k", "v"}, menuLaunch}, false},
      {"another operation", {}, {{menuLaunch.first, APP_CONTROL_OPERATION_DEFAULT}}, false},
      {"another authority", {"http://tizen.org/category/floatingapp"}, {}, false},
      {"menu launch first", {}, {menuLaunch, {"k", "v"}}, true},
  };
  device.AddGame("com.ex.racer", "Racer");
  for (const auto& c : cases) {
    device.FindApp("com.ex.racer")->categories = c.categories;
    device.FindApp("com.ex.racer")->metadata = c.metadata;
    EXPECT_EQ(c.menuLaunched, manager._IsMenuLaunch("com.ex.racer")) << c.name;
  }
  EXPECT_FALSE(manager._IsMenuLaunch("com.ex.unknown"));
  EXPECT_TRUE(EngineMessages().empty());
  EXPECT_EQ(0, LeftOpen());

  // The last case's application again, with one call failing each time.
  struct {
    const char* call;
    int skip;
    Ids logs;
  } failures[] = {
      {"app_info_filter_create", 0,
       {"E (APP_MANAGER_ERROR_NONE != app_info_filter_create(&handle))"}},
      {"app_info_filter_add_string", 0, {}},
      {"app_info_filter_add_string", 1, {}},
      {"app_info_filter_foreach_appinfo", 0, {}},
      {"app_info_create", 0, {}},
      {"app_info_foreach_metadata", 0, {}},
  };
  for (const auto& f : failures) {
    SCOPED_TRACE(f.call);
    device.ClearLogs();
    device.FailNext(f.call, APP_MANAGER_ERROR_IO_ERROR, f.skip);
    EXPECT_FALSE(manager._IsMenuLaunch("com.ex.racer"));
    EXPECT_EQ(f.logs, EngineMessages());
    EXPECT_EQ(0, LeftOpen());
  }
  EXPECT_TRUE(manager._IsMenuLaunch("com.ex.racer"));
}

TEST_F(AppListsTest, CallbacksGuardTheirArgumentsAndTheMetadataWalkStopsAtOnce) {
  device.AddGame("com.ex.apple", "Apple");
  app_info_h info = NULL;
  ASSERT_EQ(APP_MANAGER_ERROR_NONE, app_info_create("com.ex.apple", &info));
  EXPECT_FALSE(LauncherPackageManager::_GetAllAppsInfoCb(NULL, &manager));
  EXPECT_FALSE(LauncherPackageManager::_GetAllAppsInfoCb(info, NULL));
  app_info_destroy(info);

  bool found = false;
  const char* key = "http://velmora.com/tizen/metadata/menu/launch/operation";
  EXPECT_FALSE(
      LauncherPackageManager::_app_metadata_list_cb(NULL, APP_CONTROL_OPERATION_MAIN, &found));
  EXPECT_FALSE(LauncherPackageManager::_app_metadata_list_cb(key, NULL, &found));
  EXPECT_FALSE(found);
  EXPECT_FALSE(
      LauncherPackageManager::_app_metadata_list_cb(key, APP_CONTROL_OPERATION_MAIN, &found));
  EXPECT_TRUE(found);
  EXPECT_FALSE(LauncherPackageManager::_app_metadata_list_cb(key, "x", NULL));
  EXPECT_FALSE(LauncherPackageManager::_has_mini_app_cb(NULL, &found));
  EXPECT_EQ((Ids{"E (NULL == handle)", "E (NULL == user_data)", "E (NULL == user_data)",
                 "E (NULL == handle)"}),
            EngineMessages());
}

}  // namespace
