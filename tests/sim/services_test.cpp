// The simulated device's smaller services: preferences, bundles, the system
// bus, the device-management service and the usage-log client.
#include <E_DBus.h>
#include <app_preference.h>
#include <bundle.h>
#include <mdm.h>
#include <velmora_log_manager.h>

#include "support/sim-test.h"

namespace {

class ServicesTest : public SimTest {};

TEST_F(ServicesTest, PreferencesAnswerNoKeyUntilSet) {
  int value = 7;
  EXPECT_EQ(PREFERENCE_ERROR_NO_KEY, preference_get_int("memory/sysman/mmc", &value));
  EXPECT_EQ(-17825744, PREFERENCE_ERROR_NO_KEY);
  device.SetPreference("memory/sysman/mmc", 1);
  EXPECT_EQ(PREFERENCE_ERROR_NONE, preference_get_int("memory/sysman/mmc", &value));
  EXPECT_EQ(1, value);
  device.RemovePreference("memory/sysman/mmc");
  EXPECT_EQ(PREFERENCE_ERROR_NO_KEY, preference_get_int("memory/sysman/mmc", &value));
}

TEST_F(ServicesTest, BundleKeepsEachKeyOnce) {
  bundle* b = bundle_create();
  ASSERT_NE(nullptr, b);
  EXPECT_EQ(BUNDLE_ERROR_NONE, bundle_add_str(b, "feature", "open"));
  EXPECT_EQ(BUNDLE_ERROR_KEY_EXISTS, bundle_add_str(b, "feature", "close"));
  EXPECT_EQ(-18350079, BUNDLE_ERROR_KEY_EXISTS);
  char* value = NULL;
  EXPECT_EQ(BUNDLE_ERROR_NONE, bundle_get_str(b, "feature", &value));
  EXPECT_STREQ("open", value);
  EXPECT_EQ(BUNDLE_ERROR_KEY_NOT_AVAILABLE, bundle_get_str(b, "extra", &value));
  EXPECT_EQ(1, bundle_get_count(b));
  EXPECT_EQ(1, HandlesOpenedByTest());
  EXPECT_EQ(BUNDLE_ERROR_NONE, bundle_free(b));
  EXPECT_EQ(0, HandlesOpenedByTest());
}

// ---- The system bus.

struct Received {
  std::vector<std::string> signals;
};

void Record(void* data, DBusMessage* msg) {
  static_cast<Received*>(data)->signals.push_back(std::string(dbus_message_get_path(msg)) + " " +
                                                  dbus_message_get_member(msg));
}

TEST_F(ServicesTest, BusNeedsInitAndCountsIt) {
  EXPECT_EQ(nullptr, e_dbus_bus_get(DBUS_BUS_SYSTEM));
  EXPECT_EQ(1, e_dbus_init());
  EXPECT_EQ(2, e_dbus_init());
  EXPECT_EQ(1, e_dbus_shutdown());
  EXPECT_EQ(0, e_dbus_shutdown());
  EXPECT_EQ(0, e_dbus_shutdown());  // never below zero
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

TEST_F(ServicesTest, ClosingAConnectionDropsItsSubscriptions) {
  e_dbus_init();
  E_DBus_Connection* conn = e_dbus_bus_get(DBUS_BUS_SYSTEM);
  Received received;
  e_dbus_signal_handler_add(conn, NULL, NULL, NULL, NULL, Record, &received);
  EXPECT_EQ(2, HandlesOpenedByTest());
  e_dbus_connection_close(conn);
  EXPECT_EQ(0, HandlesOpenedByTest());
  EXPECT_EQ(0, device.SendBusSignal("/p", "i", "m"));
  e_dbus_shutdown();
}

// ---- Device management and usage logs.

TEST_F(ServicesTest, PolicyServiceAnswersPerApplicationWhileConnected) {
  EXPECT_EQ(MDM_STATUS_ERROR, mdm_get_application_state("com.ex.a"));  // not connected
  device.SetMdm(true, {{"com.ex.b", MDM_RESTRICTED}});
  ASSERT_EQ(MDM_RESULT_SUCCESS, mdm_get_service());
  EXPECT_EQ(1, HandlesOpenedByTest());
  EXPECT_EQ(MDM_ALLOWED, mdm_get_application_state("com.ex.a"));
  EXPECT_EQ(MDM_RESTRICTED, mdm_get_application_state("com.ex.b"));
  EXPECT_EQ(MDM_RESULT_SUCCESS, mdm_release_service());
  EXPECT_EQ(0, HandlesOpenedByTest());

  device.SetMdm(false);
  EXPECT_NE(MDM_RESULT_SUCCESS, mdm_get_service());
  EXPECT_EQ(0, HandlesOpenedByTest());
}

TEST_F(ServicesTest, UsageLogClientRecordsEachBundleWithItsProvider) {
  velmora_log_manager_h logs = NULL;
  ASSERT_EQ(VELMORA_LOG_MANAGER_ERROR_NONE, velmora_log_manager_create(&logs));
  bundle* b = bundle_create();
  bundle_add_str(b, "feature", "open");
  bundle_add_str(b, "app_id", "com.ex.a");
  int requestId = 0;
  int answered = 0;
  EXPECT_EQ(VELMORA_LOG_MANAGER_ERROR_NONE,
            velmora_log_manager_insert(
                logs, "content://p/log/x", b,
                [](int result, int id, void* data) { *static_cast<int*>(data) = id + result; },
                &answered, &requestId));
  EXPECT_EQ(1, requestId);
  EXPECT_EQ(1, answered);
  bundle_free(b);
  EXPECT_EQ(VELMORA_LOG_MANAGER_ERROR_INVALID_PARAMETER,
            velmora_log_manager_insert(logs, "content://p/log/x", b, NULL, NULL, NULL));
  velmora_log_manager_destroy(logs);

  ASSERT_EQ(1u, device.UsageLogs().size());
  EXPECT_EQ("content://p/log/x", device.UsageLogs()[0].provider);
  EXPECT_EQ((std::vector<std::pair<std::string, std::string>>{{"feature", "open"},
                                                              {"app_id", "com.ex.a"}}),
            device.UsageLogs()[0].fields);
  EXPECT_EQ(0, HandlesOpenedByTest());
}

}  // namespace
