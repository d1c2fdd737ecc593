// Package events: the job each package operation becomes, the callbacks a
// completed job fires, and the holding back of completed jobs while paused.
#include <app_manager.h>
#include <package_manager.h>

#include "package-manager-test.h"

namespace {

const int kInstall = PACKAGE_MANAGER_EVENT_TYPE_INSTALL;
const int kStarted = PACKAGE_MANAGER_EVENT_STATE_STARTED;
const int kCompleted = PACKAGE_MANAGER_EVENT_STATE_COMPLETED;

class PackageEventsTest : public PackageManagerTest {
 protected:
  // Gives |listener| callbacks that note what they receive in |heard|, as
  // "installed com.ex.a" or "deactivated com.ex.b,com.ex.c".
  bool Listen(LauncherPackageManager& listener) {
    return listener.Initialize(
        Noter("installed"), Noter("updated"), Noter("uninstalled"),
        [this](Ids ids) {
          std::string joined;
          for (const std::string& id : ids) joined += (joined.empty() ? "" : ",") + id;
          heard.push_back("deactivated " + joined);
        },
        Noter("card"));
  }
  bool Listen() { return Listen(manager); }

  boost::function<void(const char*)> Noter(const std::string& what) {
    return [this, what](const char* appId) { heard.push_back(what + " " + appId); };
  }

  // What the callbacks received since the last call.
  Ids Heard() {
    Ids taken;
    taken.swap(heard);
    return taken;
  }

  void Emit(const std::string& pkgId, int eventType, int eventState) {
    device.EmitPackageEvent("tpk", pkgId, eventType, eventState);
  }

  // "com.ex.pack" holding a game for each of |appIds|, in that order.
  static sim::Package Pack(const Ids& appIds) {
    std::vector<sim::App> apps;
    for (const std::string& id : appIds) apps.push_back(sim::GameApp(id, id));
    return sim::MakePackage("com.ex.pack", apps);
  }

  // Reads |appId| into the cache, as the engine's callbacks do.
  void Cache(const std::string& appId) { ASSERT_TRUE(manager.GetAppInfo(appId, NewBox())); }

  Ids heard;
};

TEST_F(PackageEventsTest, OneInstallLogsEachStep) {
  Listen();
  device.Install(sim::MakePackage("com.ex.solo", {sim::GameApp("com.ex.solo", "Solo")}));
  EXPECT_EQ(Ids{"installed com.ex.solo"}, Heard());
  ASSERT_EQ((Ids{"E #Step 1", "E #Step 2", "E BEGIN", "E App [com.ex.solo], [0] [1]",
                 "E ##### [com.ex.solo]", "E ##### [com.ex.solo]", "E END", "E #Step 3 size[1]",
                 "E appId[com.ex.solo]",
                 "E  app_info_get_type appid[com.ex.solo] pkg_id[com.ex.solo] pkg_type[capp]",
                 "E Name[Solo] enable[1] system[0]", "E appId[com.ex.solo] mdm is not enabled"}),
            EngineMessages());
  std::vector<EngineLog> logs = EngineLogs();
  EXPECT_EQ("OnClientListenCb", logs[0].function);
  EXPECT_EQ("_DoPkgJob", logs[7].function);
  EXPECT_TRUE(manager.m_pkgJobMap.empty());
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(PackageEventsTest, UpdateTellsOfUpdatedAppsAndOfAppsItDisabledAsUninstalled) {
  device.AddPackage(Pack({"com.ex.pack.a", "com.ex.pack.b", "com.ex.pack.c"}));
  Cache("com.ex.pack.a");
  Cache("com.ex.pack.c");
  boost::shared_ptr<GameBoxData> before = manager.m_appInfoCache.at("com.ex.pack.a");
  Listen();

  sim::Package updated = Pack({"com.ex.pack.a", "com.ex.pack.b", "com.ex.pack.c"});
  updated.apps[0].label = "A2";
  updated.apps[1].enabled = false;
  // The listing opens the three applications, then the job reads each: c's read fails.
  device.FailNext("app_info_create", APP_MANAGER_ERROR_IO_ERROR, 5);
  device.Update(updated);

  EXPECT_EQ((Ids{"updated com.ex.pack.a", "uninstalled com.ex.pack.b"}), Heard());
  // Every application of the job was dropped from the cache and read anew.
  EXPECT_NE(before, manager.m_appInfoCache.at("com.ex.pack.a"));
  EXPECT_EQ("A2", manager.m_appInfoCache.at("com.ex.pack.a")->name);
  EXPECT_FALSE(manager.m_appInfoCache.at("com.ex.pack.b")->isEnabled);
  EXPECT_EQ(0u, manager.m_appInfoCache.count("com.ex.pack.c"));
  EXPECT_EQ(0, LeftOpen());
}

TEST_F(PackageEventsTest, UninstallTellsOfTheAppsSeenAtItsStartThenOfDeactivatedOnesIfAny) {
  struct {
    const char* name;
    bool deactivatedLeft;
    Ids heard;
  } cases[] = {
      {"none deactivated", false, {"uninstalled com.ex.pack.a", "uninstalled com.ex.pack.b"}},
      {"one deactivated",
       true,
       {"uninstalled com.ex.pack.a", "uninstalled com.ex.pack.b", "deactivated com.ex.off"}},
  };
  Listen();
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    device.AddPackage(Pack({"com.ex.pack.a", "com.ex.pack.b"}));
    if (c.deactivatedLeft) {
      sim::Package off = sim::MakePackage("com.ex.off", {sim::GameApp("com.ex.off", "Off")});
      off.supportDisable = off.disabled = true;
      device.AddPackage(off);
    }
    Cache("com.ex.pack.a");
    ASSERT_TRUE(device.Uninstall("com.ex.pack"));
    EXPECT_EQ(c.heard, Heard());
    EXPECT_TRUE(manager.m_appInfoCache.empty());
    EXPECT_EQ(0, LeftOpen());
  }
}

TEST_F(PackageEventsTest, PausedCompletionsReplayInCompletionOrderOnceUnpaused) {
  device.AddPackage(sim::MakePackage("com.ex.a", {sim::GameApp("com.ex.a", "A")}));
  device.AddPackage(sim::MakePackage("com.ex.b", {sim::GameApp("com.ex.b", "B")}));
  Listen();
  manager.m_onAppInstalled = [this](const char* appId) {
    heard.push_back(std::string("installed ") + appId +
                    (manager.m_isListenPaused ? " (paused)" : ""));
    // A package that completes during the replay is not held back.
    if (std::string(appId) == "com.ex.b") device.Install(Pack({"com.ex.c"}));
  };
  EXPECT_TRUE(manager.PauseListenCb());
  Emit("com.ex.a", kInstall, kStarted);
  Emit("com.ex.b", kInstall, kStarted);
  Emit("com.ex.b", kInstall, kCompleted);
  Emit("com.ex.a", kInstall, kCompleted);
  EXPECT_EQ(Ids{}, Heard());
  EXPECT_EQ(2u, manager.m_pkgJobList.size());
  EXPECT_TRUE(manager.m_pkgJobMap.empty());

  EXPECT_TRUE(manager.StartListenCb());
  EXPECT_EQ((Ids{"installed com.ex.b", "installed com.ex.c", "installed com.ex.a"}), Heard());
  EXPECT_TRUE(manager.m_pkgJobList.empty());
  EXPECT_FALSE(manager.m_isListenPaused);
}

TEST_F(PackageEventsTest, AReplayThatACallbackPausesOrRestartsRunsNoJobTwice) {
  Listen();
  manager.PauseListenCb();
  for (const char* id : {"com.ex.a", "com.ex.b", "com.ex.c"}) {
    device.Install(sim::MakePackage(id, {sim::GameApp(id, id)}));
  }
  manager.m_onAppInstalled = [this](const char* appId) {
    heard.push_back(appId);
    if (std::string(appId) == "com.ex.a") manager.StartListenCb();  // runs b and c
  };
  manager.StartListenCb();
  EXPECT_EQ((Ids{"com.ex.a", "com.ex.b", "com.ex.c"}), Heard());

  manager.PauseListenCb();
  for (const char* id : {"com.ex.d", "com.ex.e"}) {
    device.Install(sim::MakePackage(id, {sim::GameApp(id, id)}));
  }
  manager.m_onAppInstalled = [this](const char* appId) {
    heard.push_back(appId);
    manager.PauseListenCb();  // e is held back again
  };
  manager.StartListenCb();
  EXPECT_EQ(Ids{"com.ex.d"}, Heard());
  ASSERT_EQ(1u, manager.m_pkgJobList.size());
  EXPECT_EQ("com.ex.e", manager.m_pkgJobList[0]->pkgId);
}

}  // namespace
