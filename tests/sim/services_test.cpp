// The simulated device's preferences and system bus: where the storage-card
// status and the boot signal reach the launcher.
#include <E_DBus.h>
#include <app_preference.h>

#include "support/sim-test.h"

namespace {

class ServicesTest : public SimTest {};

TEST_F(ServicesTest, PreferencesAnswerNoKeyUntilSet) {
  int value = 7;
  EXPECT_EQ(PREFERENCE_ERROR_NO_KEY, preference_get_int("memory/sysman/mmc", &value));
  device.SetPreference("memory/sysman/mmc", 1);
  EXPECT_EQ(PREFERENCE_ERROR_NONE, preference_get_int("memory/sysman/mmc", &value));
  EXPECT_EQ(1, value);
  device.RemovePreference("memory/sysman/mmc");
  EXPECT_EQ(PREFERENCE_ERROR_NO_KEY, preference_get_int("memory/sysman/mmc", &value));
}

// ---- The system bus.

struct Received {
  std::vector<std::string> signals;
};

void Record(void* data, DBusMessage* msg) {
  static_cast<Received*>(data)->signals.push_back(std::string(dbus_message_get_path(msg)) + " " +
                                                  dbus_message_get_member(msg));
}

TEST_F(ServicesTest, SignalsReachMatchingHandlersWithWildcards) {
  ASSERT_EQ(1, e_dbus_init());
  E_DBus_Connection* conn = e_dbus_bus_get(DBUS_BUS_SYSTEM);
  ASSERT_NE(nullptr, conn);
  const char* path = "/Org/Tizen/System/DeviceD/Core";
  const char* interface = "org.tizen.system.deviced.core";
  struct {
    const char* name;
    const char* sender;
    const char* path;
    const char* interface;
    const char* member;
    bool hears;
  } cases[] = {
      {"exact", NULL, path, interface, "BootingDone", true},
      {"empty strings match anything", "", "", "", "", true},
      {"another member", NULL, path, interface, "PowerOff", false},
      {"another path", NULL, "/Org/Else", interface, "BootingDone", false},
      {"another sender", ":1.99", path, interface, "BootingDone", false},
  };
  for (const auto& c : cases) {
    Received received;
    E_DBus_Signal_Handler* handler =
        e_dbus_signal_handler_add(conn, c.sender, c.path, c.interface, c.member, Record, &received);
    ASSERT_NE(nullptr, handler);
    EXPECT_EQ(c.hears ? 1 : 0, device.SendBusSignal(path, interface, "BootingDone")) << c.name;
    EXPECT_EQ(c.hears ? std::vector<std::string>{std::string(path) + " BootingDone"}
                      : std::vector<std::string>{},
              received.signals)
        << c.name;
    e_dbus_signal_handler_del(conn, handler);
  }
  EXPECT_EQ(0, device.BusSubscriptions());
  e_dbus_connection_close(conn);
  e_dbus_shutdown();
  EXPECT_EQ(0, HandlesOpenedByTest());
}

TEST_F(ServicesTest, HandlerMayUnsubscribeWhileSignalled) {
  e_dbus_init();
  struct OneShot {
    E_DBus_Connection* conn;
    E_DBus_Signal_Handler* handler;
    int calls;
  } shot = {e_dbus_bus_get(DBUS_BUS_SYSTEM), NULL, 0};
  shot.handler = e_dbus_signal_handler_add(
      shot.conn, NULL, NULL, NULL, "BootingDone",
      [](void* data, DBusMessage*) {
        OneShot* shot = static_cast<OneShot*>(data);
        ++shot->calls;
        e_dbus_signal_handler_del(shot->conn, shot->handler);
      },
      &shot);
  EXPECT_EQ(1, device.SendBusSignal("/p", "i", "BootingDone"));
  EXPECT_EQ(0, device.SendBusSignal("/p", "i", "BootingDone"));
  EXPECT_EQ(1, shot.calls);
  e_dbus_connection_close(shot.conn);
  e_dbus_shutdown();
}

TEST_F(ServicesTest, BusNeedsInitCountsItAndClosingAConnectionDropsItsSubscriptions) {
  EXPECT_EQ(nullptr, e_dbus_bus_get(DBUS_BUS_SYSTEM));
  EXPECT_EQ(1, e_dbus_init());
  EXPECT_EQ(2, e_dbus_init());
  EXPECT_EQ(1, e_dbus_shutdown());
  E_DBus_Connection* conn = e_dbus_bus_get(DBUS_BUS_SYSTEM);
  Received received;
  e_dbus_signal_handler_add(conn, NULL, NULL, NULL, NULL, Record, &received);
  EXPECT_EQ(2, HandlesOpenedByTest());
  e_dbus_connection_close(conn);
  EXPECT_EQ(0, HandlesOpenedByTest());
  EXPECT_EQ(0, device.SendBusSignal("/p", "i", "m"));
  EXPECT_EQ(0, e_dbus_shutdown());
  EXPECT_EQ(0, e_dbus_shutdown());  // never below zero
}

}  // namespace
