// The storage card: the boot-done subscription on the system bus, its one-shot
// handler, and the refresh of the cached applications that live on the card.
#include <E_DBus.h>
#include <app_preference.h>

#include "package-manager-test.h"

namespace {

const char kCoreObject[] = "/Org/Tizen/System/DeviceD/Core";
const char kCoreInterface[] = "org.tizen.system.deviced.core";
const char kCardStatus[] = "memory/sysman/mmc";

class StorageCardTest : public PackageManagerTest {
 protected:
  StorageCardTest() {
    manager.m_onStorageCardAppChanged = [this](const char* appId) { refreshed.push_back(appId); };
  }

  // A game whose cached record the launcher marked as living on the card.
  void AddCardGame(const std::string& appId) {
    AddCachedGame(appId);
    manager.m_appInfoCache.at(appId)->isOnStorageCard = true;
  }
  void AddCachedGame(const std::string& appId) {
    device.AddGame(appId, appId);
    ASSERT_TRUE(manager.GetAppInfo(appId, NewBox()));
  }

  // The handlers the signal reached.
  int SendBootDone() { return device.SendBusSignal(kCoreObject, kCoreInterface, "BootingDone"); }

  // Neither subscribed nor connected, and e_dbus shut down as often as it was started.
  void ExpectNoBus() {
    EXPECT_EQ(nullptr, manager.m_bootSignalHandler);
    EXPECT_EQ(nullptr, manager.m_dbusConnection);
    EXPECT_EQ(0, device.BusSubscriptions());
    EXPECT_EQ(0, device.BusInitCount());
    EXPECT_EQ(0, LeftOpen());
  }

  Ids refreshed;
};

TEST_F(StorageCardTest, CardStatusSetsOnlyTheInsertedFlag) {
  struct {
    const char* name;
    bool stored;
    int status;
    bool failRead;
    bool inserted;
  } cases[] = {
      {"card", true, 1, false, true},
      {"any other non-zero status", true, -3, false, true},
      {"no card", true, 0, false, false},
      {"no such preference", false, 0, false, false},
      {"preference unreadable", true, 1, true, false},
  };
  AddCardGame("com.ex.zebra");
  AddCachedGame("com.ex.home");
  AddCardGame("com.ex.apple");
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    refreshed.clear();
    device.RemovePreference(kCardStatus);
    if (c.stored) device.SetPreference(kCardStatus, c.status);
    if (c.failRead) device.FailNext("preference_get_int", PREFERENCE_ERROR_IO_ERROR);
    manager.m_isMmcInserted = !c.inserted;
    ASSERT_TRUE(manager._RegisterEdbusSignalHandler());
    EXPECT_EQ(1, SendBootDone());
    EXPECT_EQ(c.inserted, manager.m_isMmcInserted);
    // The same walk whatever the status: the card's games, by id.
    EXPECT_EQ((Ids{"com.ex.apple", "com.ex.zebra"}), refreshed);
    ExpectNoBus();
  }
}

TEST_F(StorageCardTest, FailedSubscriptionKeepsNoBus) {
  struct {
    const char* call;
    int failures;  // in a row
    bool subscribed;
    Ids logs;
    int inits, shutdowns, closes;
  } cases[] = {
      {"e_dbus_init", 9, true, {}, 10, 1, 1},
      {"e_dbus_init", 10, false, {"E e_dbus_init failed"}, 10, 0, 0},
      {"e_dbus_bus_get", 1, false, {"E e_dbus_bus_get failed"}, 1, 1, 0},
      {"e_dbus_signal_handler_add", 1, false, {"E edbus_coord_rotation_handler failed"}, 1, 1, 1},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.call) + " x" + std::to_string(c.failures));
    device.Reset();
    for (int i = 0; i < c.failures; ++i) device.FailNext(c.call, -1, i);
    EXPECT_EQ(c.subscribed, manager._RegisterEdbusSignalHandler());
    EXPECT_EQ(c.logs, EngineMessages());
    if (c.subscribed) {
      EXPECT_EQ(1, device.BusSubscriptions());
      manager.UnregisterEdbusSignalHandler();
    }
    ExpectNoBus();
    EXPECT_EQ(c.inits, device.CallCount("e_dbus_init"));
    EXPECT_EQ(c.shutdowns, device.CallCount("e_dbus_shutdown"));
    EXPECT_EQ(c.closes, device.CallCount("e_dbus_connection_close"));
  }
}

TEST_F(StorageCardTest, ASecondSubscriptionKeepsTheFirstAndUnregisterAloneStillShutsTheBusDown) {
  manager.UnregisterEdbusSignalHandler();
  EXPECT_EQ(1, device.CallCount("e_dbus_shutdown"));
  EXPECT_EQ(0, device.CallCount("e_dbus_connection_close"));
  EXPECT_EQ(0, device.CallCount("e_dbus_signal_handler_del"));
  ExpectNoBus();

  ASSERT_TRUE(manager._RegisterEdbusSignalHandler());
  E_DBus_Signal_Handler* first = manager.m_bootSignalHandler;
  EXPECT_TRUE(manager._RegisterEdbusSignalHandler());
  EXPECT_EQ(first, manager.m_bootSignalHandler);
  EXPECT_EQ(1, device.BusSubscriptions());
  EXPECT_EQ(1, SendBootDone());
  ExpectNoBus();
}

TEST_F(StorageCardTest, SignalAfterItsSubscriberIsGoneIsIgnored) {
  E_DBus_Connection* left = NULL;
  {
    LauncherPackageManager gone;
    ASSERT_TRUE(gone._RegisterEdbusSignalHandler());
    left = gone.m_dbusConnection;  // destruction leaves the subscription in place
  }
  EXPECT_EQ(1, SendBootDone());
  EXPECT_EQ(0, device.CallCount("preference_get_int"));
  e_dbus_connection_close(left);
  e_dbus_shutdown();
  ExpectNoBus();
}

}  // namespace
