// What scripts cannot reach in the package tracker: its cache entries and
// card flag, and a manager that is gone. The rest is in tests/scenarios.
#include <app_preference.h>

#include "launcher-package-manager/launcher-package-manager.h"
#include "support/sim-test.h"

namespace {

typedef boost::shared_ptr<GameBoxData> Box;

class PackageTrackerTest : public SimTest {
 protected:
  static Box NewBox() { return Box(new GameBoxData); }

  LauncherPackageManager manager;
};

TEST_F(PackageTrackerTest, AnEmptyIconIsTheLaunchersDefault) {
  sim::App racer = sim::GameApp("com.ex.racer", "Racer");
  racer.icon = "";
  device.AddPackage(sim::MakePackage("com.ex.racer", {racer}));
  Box box = NewBox();
  ASSERT_TRUE(manager._GetAppInfo("com.ex.racer", box));
  EXPECT_EQ("/opt/usr/apps/com.velmora.korrin/res/images/common/default_app_icon.png",
            box->iconPath);
}

// The launcher may change the records it shares with the cache.
TEST_F(PackageTrackerTest, ACachedRecordWithoutNameOrIconIsReadAfresh) {
  device.AddGame("com.ex.racer", "Racer");
  for (std::string GameBoxData::*field : {&GameBoxData::name, &GameBoxData::iconPath}) {
    ASSERT_TRUE(manager.GetAppInfo("com.ex.racer", NewBox()));
    (*manager.m_appInfoCache.at("com.ex.racer")).*field = "";
    Box again = NewBox();
    ASSERT_TRUE(manager.GetAppInfo("com.ex.racer", again));
    EXPECT_EQ(again, manager.m_appInfoCache.at("com.ex.racer"));
    EXPECT_EQ("Racer", again->name);
  }
}

// Any status but 0 is a card; a missing or unreadable status is none.
TEST_F(PackageTrackerTest, BootDoneSetsTheCardFlagFromItsStatus) {
  // stored, status, read fails, inserted
  const int cases[][4] = {{1, 1, 0, 1}, {1, -3, 0, 1}, {1, 0, 0, 0}, {0, 1, 0, 0}, {1, 1, 1, 0}};
  for (const auto& c : cases) {
    device.ClearStorageCard();
    if (c[0]) device.SetStorageCardStatus(c[1]);
    if (c[2]) device.FailNext("preference_get_int", PREFERENCE_ERROR_IO_ERROR);
    manager.m_isMmcInserted = !c[3];
    LauncherPackageManager::_BootingDoneSignalCb(&manager, NULL);
    EXPECT_EQ(c[3] != 0, manager.m_isMmcInserted) << c[0] << c[1] << c[2];
  }
}

// The destructor leaves the subscription on the bus; its signal must not
// reach the manager that is gone.
TEST_F(PackageTrackerTest, ASignalAfterItsSubscriberIsGoneIsIgnored) {
  E_DBus_Connection* left = NULL;
  {
    LauncherPackageManager gone;
    ASSERT_TRUE(gone._RegisterEdbusSignalHandler());
    left = gone.m_dbusConnection;
  }
  EXPECT_EQ(1, device.SendBusSignal("/Org/Tizen/System/DeviceD/Core",
                                    "org.tizen.system.deviced.core", "BootingDone"));
  EXPECT_EQ(0, device.CallCount("preference_get_int"));
  e_dbus_connection_close(left);
  e_dbus_shutdown();
}

}  // namespace
