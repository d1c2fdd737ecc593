// Reading one application's information, and the cache that shares the
// records it filled.
#include <app_manager.h>
#include <package_manager.h>

#include <functional>

#include "package-manager-test.h"

namespace {

class AppInfoTest : public PackageManagerTest {
 protected:
  AppInfoTest() {
    sim::Package racer = sim::MakePackage("com.ex.racer", {sim::GameApp("com.ex.racer", "Racer")});
    racer.preload = true;
    racer.removable = false;
    device.AddPackage(racer);
  }
};

const char kIcon[] = "/opt/usr/share/icons/default/small/com.ex.racer.png";

TEST_F(AppInfoTest, ReadingFillsTheRecordAndCachesThatVeryRecord) {
  boost::shared_ptr<GameBoxData> box = NewBox();
  box->boxId = 7;
  box->isNewBadge = box->isUpdatable = box->isSelected = box->isMdmRestricted = true;
  box->appSize = 99;

  ASSERT_TRUE(manager._GetAppInfo("com.ex.racer", box));
  EXPECT_EQ((Ids{"com.ex.racer", "com.ex.racer", "capp", "Racer", kIcon, "010100 0"}), Facts(*box));
  // Not the reading's business:
  EXPECT_TRUE(box->boxId == 7 && box->isNewBadge && box->isUpdatable && box->isSelected);

  ASSERT_EQ(1u, manager.m_appInfoCache.size());
  EXPECT_EQ(box.get(), manager.m_appInfoCache["com.ex.racer"].get());
  EXPECT_EQ((std::vector<std::string>{
                "E  app_info_get_type appid[com.ex.racer] pkg_id[com.ex.racer] pkg_type[capp]",
                "E Name[Racer] enable[1] system[0]"}),
            EngineMessages());
  EXPECT_EQ("_GetAppInfo", EngineLogs()[0].function);
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(AppInfoTest, WhatTheDeviceReportsShapesTheRecord) {
  const std::string icon = kIcon;
  struct {
    const char* name;
    std::function<void(sim::App&)> change;
    bool read;
    std::string appName;  // the record held "Kept"
    std::string iconPath;
    bool enabled;
    std::string log;  // the last line
  } cases[] = {
      {"no icon", [](sim::App& a) { a.icon.reset(); }, true, "Racer", DefaultIcon(), true,
       "E Name[Racer] enable[1] system[0]"},
      {"empty icon", [](sim::App& a) { a.icon = ""; }, true, "Racer", DefaultIcon(), true,
       "E Name[Racer] enable[1] system[0]"},
      {"null label: the name stays", [](sim::App& a) { a.label.reset(); }, true, "Kept", icon,
       true, "E Name[(null)] enable[1] system[0]"},
      {"disabled", [](sim::App& a) { a.enabled = false; }, true, "Racer", icon, false,
       "E Name[Racer] enable[0] system[0]"},
      {"no display: refused untouched", [](sim::App& a) { a.noDisplay = true; }, false, "Kept",
       "", false, "E app[com.ex.racer] is nodisplay app"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sim::App app = sim::GameApp("com.ex.racer", "Racer");
    c.change(app);
    device.AddPackage(sim::MakePackage("com.ex.racer", {app}));
    device.ClearLogs();
    manager.m_appInfoCache.clear();
    boost::shared_ptr<GameBoxData> box = NewBox();
    box->name = "Kept";
    EXPECT_EQ(c.read, manager._GetAppInfo("com.ex.racer", box));
    EXPECT_EQ(c.appName, box->name);
    EXPECT_EQ(c.iconPath, box->iconPath);
    EXPECT_EQ(c.enabled, box->isEnabled);
    EXPECT_EQ(c.read ? "com.ex.racer" : "", box->appId);
    EXPECT_EQ(c.read ? 1u : 0u, manager.m_appInfoCache.size());
    EXPECT_EQ(c.read ? 2u : 1u, EngineMessages().size());  // the type line comes first
    EXPECT_EQ(c.log, EngineMessages().back());
    EXPECT_EQ(0, LeftOpen());
  }
}

// ---- Failure paths: one platform call fails; nothing is filled, nothing
// cached, and no handle stays open.

TEST_F(AppInfoTest, EveryFailingCallIsLoggedAndReportedAsFalse) {
  const std::string type =
      "E  app_info_get_type appid[com.ex.racer] pkg_id[com.ex.racer] pkg_type[capp]";
  const std::string failed = "E AppId[com.ex.racer] failed to get pkginfo";
  const int io = TIZEN_ERROR_IO_ERROR;  // the same -5 for both managers
  const int db = APP_MANAGER_ERROR_DB_FAILED;
  struct Case {
    const char* call;
    int error;
    Ids logs;
  };
  std::vector<Case> cases = {
      {"app_info_create", db, {"E app_info_create return [-17891325]"}},
      {"app_info_get_app_id", io,
       {"E app_info_get_app_id return [-5]", "E AppId[(null)] failed to get pkginfo"}},
      // The enabled read reports itself with the label's text.
      {"app_info_is_enabled", db, {"E app_info_get_label return [-17891325]", failed}},
      // The package information is opened with package_info_create, though the
      // text names the package manager's call.
      {"package_info_create", PACKAGE_MANAGER_ERROR_NO_SUCH_PACKAGE,
       {type, "E package_manager_get_package_info return [-18153359]", failed}}};
  // The other reads name themselves; the package's come after the type line.
  for (const char* call : {"app_info_is_nodisplay", "app_info_get_package", "app_info_get_icon",
                           "app_info_get_label", "app_info_get_type"}) {
    cases.push_back({call, io, {std::string("E ") + call + " return [-5]", failed}});
  }
  for (const char* call : {"package_info_is_system_package", "package_info_is_removable_package",
                           "package_info_is_preload_package"}) {
    cases.push_back({call, io, {type, std::string("E ") + call + " return [-5]", failed}});
  }
  for (const auto& c : cases) {
    SCOPED_TRACE(c.call);
    device.ClearLogs();
    device.FailNext(c.call, c.error);
    boost::shared_ptr<GameBoxData> box = NewBox();
    EXPECT_FALSE(manager._GetAppInfo("com.ex.racer", box));
    EXPECT_EQ(c.logs, EngineMessages());
    EXPECT_EQ(Facts(GameBoxData()), Facts(*box));
    EXPECT_TRUE(manager.m_appInfoCache.empty());
    EXPECT_EQ(0, LeftOpen());
  }
}

// ---- The cache.

TEST_F(AppInfoTest, SecondRequestIsAnsweredFromTheCacheButGetAppNameAlwaysAsks) {
  boost::shared_ptr<GameBoxData> first = NewBox();
  ASSERT_TRUE(manager.GetAppInfo("com.ex.racer", first));
  first->isLocked = first->isOnStorageCard = first->isUpdatable = true;
  first->isNewBadge = first->isSelected = true;
  first->badgeCount = 4;
  first->appSize = 42;
  device.ClearLogs();

  boost::shared_ptr<GameBoxData> second = NewBox();
  second->appId = "as the caller had it";
  second->boxId = 12;
  second->col = 3;
  ASSERT_TRUE(manager.GetAppInfo("com.ex.racer", second));
  EXPECT_EQ(1, device.CallCount("app_info_create"));
  EXPECT_EQ((Ids{"E Find a App Info Name[Racer] enable[1] system[0]"}), EngineMessages());
  EXPECT_EQ((Ids{"com.ex.racer", "as the caller had it", "capp", "Racer", kIcon, "010100 42"}),
            Facts(*second));
  EXPECT_TRUE(second->isLocked && second->isOnStorageCard && second->isUpdatable);
  // Placement, appId, the third and sixth flags and the badge stay the caller's.
  EXPECT_EQ((std::vector<int>{12, 3, 0}), (std::vector<int>{second->boxId, second->col,
                                                             second->badgeCount}));
  EXPECT_FALSE(second->isNewBadge || second->isSelected);
  // The cache still holds the first record, which the caller may change.
  first->name = "Renamed by the launcher";
  ASSERT_TRUE(manager.GetAppInfo("com.ex.racer", second));
  EXPECT_EQ("Renamed by the launcher", second->name);

  // GetAppName always asks the platform, and caches what it read.
  device.FindApp("com.ex.racer")->label = "Racer 2";
  boost::shared_ptr<GameBoxData> named = NewBox();
  ASSERT_TRUE(manager.GetAppName("com.ex.racer", named));
  EXPECT_EQ("Racer 2", named->name);
  EXPECT_EQ(2, device.CallCount("app_info_create"));
  EXPECT_EQ(named.get(), manager.m_appInfoCache["com.ex.racer"].get());
}

TEST_F(AppInfoTest, EntryWithoutNameOrIconIsDroppedAndReadAfresh) {
  for (std::string GameBoxData::*field : {&GameBoxData::name, &GameBoxData::iconPath}) {
    manager.m_appInfoCache.clear();
    boost::shared_ptr<GameBoxData> first = NewBox();
    ASSERT_TRUE(manager.GetAppInfo("com.ex.racer", first));
    int reads = device.CallCount("app_info_create");
    (*first).*field = "";

    boost::shared_ptr<GameBoxData> second = NewBox();
    ASSERT_TRUE(manager.GetAppInfo("com.ex.racer", second));
    EXPECT_EQ(reads + 1, device.CallCount("app_info_create"));
    EXPECT_EQ(second.get(), manager.m_appInfoCache["com.ex.racer"].get());
    EXPECT_EQ("Racer", second->name);
  }
  // A failed re-read leaves no entry behind.
  manager.m_appInfoCache["com.ex.racer"]->name = "";
  device.FailNext("app_info_create", APP_MANAGER_ERROR_IO_ERROR);
  EXPECT_FALSE(manager.GetAppInfo("com.ex.racer", NewBox()));
  EXPECT_TRUE(manager.m_appInfoCache.empty());
}

}  // namespace
