// Deactivated applications: which are reported, what is read of them, and
// the engine callback that receives them.
#include <app_manager.h>
#include <package_manager.h>

#include <boost/function.hpp>

#include "package-manager-test.h"

namespace {

class DeactivatedTest : public PackageManagerTest {
 protected:
  // A package the user deactivated, holding |apps|.
  void AddDeactivated(const std::string& pkgId, std::vector<sim::App> apps) {
    sim::Package pkg = sim::MakePackage(pkgId, std::move(apps));
    pkg.supportDisable = pkg.disabled = true;
    device.AddPackage(pkg);
  }

  static sim::App Hidden(const std::string& id) {
    sim::App app = sim::GameApp(id, id);
    app.noDisplay = true;
    return app;
  }
};

TEST_F(DeactivatedTest, OnlyTheFirstListablePackageIsReported) {
  device.AddGame("com.ex.active", "Active");
  sim::Package cannot = sim::MakePackage("com.ex.locked", {sim::GameApp("com.ex.locked", "L")});
  cannot.disabled = true;  // disabled, but not a package the user may deactivate
  device.AddPackage(cannot);
  AddDeactivated("com.ex.first", {sim::GameApp("com.ex.first.a", "A"), Hidden("com.ex.first.h"),
                                  sim::PlainApp("com.ex.first.b", "B")});
  AddDeactivated("com.ex.second", {sim::GameApp("com.ex.second", "S")});

  EXPECT_EQ((Ids{"com.ex.first.a", "com.ex.first.b"}), manager._GetDeactivatedAppIds());
  // The walk goes on past a package whose applications could not be listed.
  device.FailNext("package_info_foreach_app_from_package", PACKAGE_MANAGER_ERROR_IO_ERROR);
  EXPECT_EQ(Ids{"com.ex.second"}, manager._GetDeactivatedAppIds());
  EXPECT_TRUE(manager.m_appInfoCache.empty());
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(DeactivatedTest, IdListFailuresGiveWhatWasCollected) {
  AddDeactivated("com.ex.first",
                 {sim::GameApp("com.ex.first.a", "A"), sim::GameApp("com.ex.first.b", "B")});
  struct {
    const char* call;
    int skip;
    Ids appIds;
  } cases[] = {
      {"package_manager_filter_create", 0, {}},
      {"package_manager_filter_add_bool", 0, {}},
      {"package_manager_filter_add_bool", 1, {}},
      {"package_manager_filter_foreach_package_info", 0, {}},
      {"app_info_create", 0, {"com.ex.first.b"}},
      {"app_info_get_app_id", 1, {"com.ex.first.a"}},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.call);
    device.FailNext(c.call, -5, c.skip);
    EXPECT_EQ(c.appIds, manager._GetDeactivatedAppIds());
    EXPECT_EQ(0, LeftOpen());
  }
  EXPECT_TRUE(EngineMessages().empty());
}

TEST_F(DeactivatedTest, LoadHandsTheIdsToTheEngineOnlyWhenThereAreSome) {
  std::vector<Ids> received;
  manager.m_onDeactivatedAppIds = [&](Ids ids) { received.push_back(ids); };
  manager.LoadDeactivatedAppList();
  EXPECT_TRUE(received.empty());

  AddDeactivated("com.ex.off", {sim::GameApp("com.ex.off", "Off")});
  manager.LoadDeactivatedAppList();
  EXPECT_EQ(std::vector<Ids>{Ids{"com.ex.off"}}, received);

  manager.m_onDeactivatedAppIds.clear();
  EXPECT_THROW(manager.LoadDeactivatedAppList(), boost::bad_function_call);
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(DeactivatedTest, InfoOfADeactivatedAppIsReadThroughFiltersAndOfAnUnknownOneNot) {
  sim::App off = sim::GameApp("com.ex.off.main", "Off");
  off.type = "webapp";
  off.icon.reset();
  AddDeactivated("com.ex.off", {off});
  boost::shared_ptr<GameBoxData> box = NewBox();
  box->appId = "untouched";

  ASSERT_TRUE(manager._GetDeactivatedAppInfo("com.ex.off.main", box));
  EXPECT_EQ((Ids{"com.ex.off", "untouched", "webapp", "Off", DefaultIcon(), "000000 0"}),
            Facts(*box));
  EXPECT_EQ(0, device.CallCount("app_info_create"));  // filters only
  EXPECT_TRUE(manager.m_appInfoCache.empty());

  boost::shared_ptr<GameBoxData> unknown = NewBox();
  EXPECT_FALSE(manager._GetDeactivatedAppInfo("com.ex.none", unknown));
  EXPECT_FALSE(manager._GetDeactivatedPkgInfo("com.ex.none", unknown));
  EXPECT_EQ(Facts(GameBoxData()), Facts(*unknown));
  EXPECT_TRUE(EngineMessages().empty());
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(DeactivatedTest, InfoFailures) {
  AddDeactivated("com.ex.off", {sim::GameApp("com.ex.off", "Off")});
  struct {
    const char* name;
    const char* call;
    int skip;
    bool read;
    std::string pkgType;  // after the call; "old" when not read
    Ids logs;
  } cases[] = {
      {"no filter", "app_info_filter_create", 0, false, "old", {}},
      {"no condition", "app_info_filter_add_string", 0, false, "old", {}},
      {"no query", "app_info_filter_foreach_appinfo", 0, false, "old", {}},
      {"enabled flag unread: nothing collected", "app_info_is_enabled", 0, false, "old", {}},
      {"no package id", "app_info_get_package", 0, false, "old", {"E Failed to get pkgid"}},
      {"no label", "app_info_get_label", 0, false, "old", {"E Failed to get name"}},
      {"no icon: the default", "app_info_get_icon", 0, true, "capp", {"E Failed to get icon"}},
      {"no type: still read", "app_info_get_type", 0, true, "old", {"E Failed to get type"}},
      {"type query fails: still read", "app_info_filter_foreach_appinfo", 1, true, "old", {}},
      {"package id of the type query", "app_info_get_package", 1, true, "capp",
       {"E Failed to get pkgid"}},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    device.ClearLogs();
    device.FailNext(c.call, APP_MANAGER_ERROR_IO_ERROR, c.skip);
    boost::shared_ptr<GameBoxData> box = NewBox();
    box->pkgType = "old";
    EXPECT_EQ(c.read, manager._GetDeactivatedAppInfo("com.ex.off", box));
    EXPECT_EQ(c.read ? "Off" : "", box->name);
    EXPECT_EQ(c.read ? "com.ex.off" : "", box->pkgId);
    EXPECT_EQ(c.pkgType, box->pkgType);
    EXPECT_EQ(c.logs, EngineMessages());
    EXPECT_EQ(0, LeftOpen());
  }
}

}  // namespace
