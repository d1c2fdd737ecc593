// Start-up through the entry point: first launch, a later start, package
// operations that complete while the launcher starts, and the engine's life
// after it.
#include <app_manager.h>

#include <algorithm>
#include <fstream>
#include <sstream>

#include "engine/engine-test.h"

namespace {

class StartUpTest : public EngineTest {
 protected:
  static std::string FileBytes(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream bytes;
    bytes << file.rdbuf();
    return bytes.str();
  }
};

TEST_F(StartUpTest, AStartOnAPopulatedDatabaseWritesNothing) {
  AddGames({"Alpha", "Beta"});
  {
    // A launcher that ran before, with a layout its user arranged.
    LauncherDataManager earlier;
    earlier._OpenDb();
    SqlProbe(DbPath()).Exec(
        "INSERT INTO Menus(name, type) VALUES('Apps', 0);"
        "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 1, 1);"
        "INSERT INTO Boxes(isFolder, pageId, appId, col, row) VALUES(0, 1, 'beta', 3, 2);");
  }
  std::string bytes = FileBytes(DbPath());

  Start();
  EXPECT_EQ(bytes, FileBytes(DbPath()));
  EXPECT_EQ(Lines{"beta 3,2"}, Page(1));
  Lines logs = EngineMessages();
  EXPECT_EQ(1, std::count(logs.begin(), logs.end(), "W it's not the first launch"));
}

// The store is built while completed operations are held back; each is then
// processed once, after the first layout.
TEST_F(StartUpTest, APackageCompletingDuringStartUpIsPlacedOnceAfterTheFirstLayout) {
  AddGames({"Alpha", "Beta"});
  // Once the installed games are listed, a new one finishes installing.
  device.BeforeNext("app_info_filter_destroy", [&] { device.Install(Game("zed", "Zed")); });
  // A game that started installing before, and completes during start-up too.
  device.AddGame("early", "Early");
  device.BeforeNext("app_info_filter_foreach_appinfo", [&] {
    device.EmitPackageEvent("tpk", "early", PACKAGE_MANAGER_EVENT_TYPE_INSTALL,
                            PACKAGE_MANAGER_EVENT_STATE_STARTED);
    device.EmitPackageEvent("tpk", "early", PACKAGE_MANAGER_EVENT_TYPE_INSTALL,
                            PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
  });

  Start();
  // "early" was installed when the games were listed, so the first layout
  // has it; its held-back completion finds it placed. "zed" goes at the end.
  EXPECT_EQ((Lines{"alpha 1,1", "beta 2,1", "early 3,1", "zed 4,1"}), Page(1));
  EXPECT_EQ("Zed", db->Value("SELECT name FROM Boxes WHERE appId = 'zed'"));
  EXPECT_TRUE(packages.m_pkgJobList.empty());
  EXPECT_TRUE(packages.m_pkgJobMap.empty());
}

TEST_F(StartUpTest, AnOperationStartedDuringStartUpAndCompletedAfterIsProcessedOnce) {
  AddGames({"Alpha"});
  device.BeforeNext("app_info_filter_destroy", [&] {
    device.EmitPackageEvent("tpk", "late", PACKAGE_MANAGER_EVENT_TYPE_INSTALL,
                            PACKAGE_MANAGER_EVENT_STATE_STARTED);
  });
  Start();
  EXPECT_EQ(1u, packages.m_pkgJobMap.count("late"));

  device.AddGame("late", "Late");
  device.EmitPackageEvent("tpk", "late", PACKAGE_MANAGER_EVENT_TYPE_INSTALL,
                          PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
  EXPECT_EQ((Lines{"alpha 1,1", "late 2,1"}), Page(1));
}

TEST_F(StartUpTest, StartingTwiceRepeatsTheStepsWithoutDoublingAnything) {
  AddGames({"Alpha"});
  Start();
  device.ClearLogs();
  data_engin_initialization();
  EXPECT_EQ(Lines{"W it's not the first launch"}, EngineMessages());
  EXPECT_EQ(1, device.PackageListeners());

  device.Install(Game("beta", "Beta"));
  EXPECT_EQ((Lines{"alpha 1,1", "beta 2,1"}), Page(1));
}

TEST_F(StartUpTest, AfterTerminateNoPackageIsHeardAndASecondTerminateFindsNothingToDo) {
  AddGames({"Alpha"});
  Start();
  EXPECT_TRUE(packages.Terminate());
  EXPECT_EQ(nullptr, packages.m_pkgMgr);
  EXPECT_TRUE(packages.Terminate());
  EXPECT_EQ(1, device.CallCount("package_manager_destroy"));
  EXPECT_EQ(0, device.PackageListeners());

  device.Install(Game("beta", "Beta"));
  EXPECT_EQ(Lines{"alpha 1,1"}, Page(1));
}

TEST_F(StartUpTest, AFailedFirstLaunchStillStartsListening) {
  AddGames({"Alpha"});
  device.FailNext("app_info_filter_create", APP_MANAGER_ERROR_IO_ERROR);
  Start();  // the games cannot be listed: no menu is made
  EXPECT_EQ("0", db->Value("SELECT COUNT(*) FROM Menus"));
  EXPECT_EQ(1, device.PackageListeners());

  // New games still go to the first menu's first page, made on the way.
  device.Install(Game("beta", "Beta"));
  EXPECT_EQ((std::vector<Row>{{"1", "0", "1", "1"}}), db->Rows("SELECT * FROM Pages"));
  EXPECT_EQ(Lines{"beta 1,1"}, Page(1));
}

}  // namespace
