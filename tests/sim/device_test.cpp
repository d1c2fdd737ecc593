// The simulated device as a whole, where the engine tests do not reach: the
// log's echo and other tags, failures that hold until cleared, releasing a
// handle twice, what Reset keeps, the sample device, and the preferences and
// system bus where the storage-card status and the boot signal come from.
#include <E_DBus.h>
#include <app_manager.h>
#include <app_preference.h>
#include <bundle.h>
#include <dlog.h>
#include <mdm.h>
#include <package_manager.h>
#include <system_info.h>
#include <unistd.h>

#include <stdexcept>

#include "common/log.h"
#include "support/sim-test.h"

namespace {

class DeviceTest : public SimTest {
 protected:
  static int Open(const char* appId) {
    app_info_h info = NULL;
    int rc = app_info_create(appId, &info);
    if (rc == APP_MANAGER_ERROR_NONE) app_info_destroy(info);
    return rc;
  }
};

TEST_F(DeviceTest, LogCapturesEachLineAndEchoesItInReaderForm) {
  dlog_print(DLOG_WARN, "tag-a", "plain %s %d", "text", 7);
  device.EchoLogs(true);
  testing::internal::CaptureStderr();
  KLOG(DLOG_ERROR, "it's not the first launch");
  const std::string line = std::to_string(__LINE__ - 1);
  std::string printed = testing::internal::GetCapturedStderr();
  device.EchoLogs(false);

  const std::string text = "device_test.cpp: TestBody(" + line + ") >  it's not the first launch";
  ASSERT_EQ(2u, device.Logs().size());
  EXPECT_EQ(DLOG_WARN, device.Logs()[0].priority);
  EXPECT_EQ("tag-a: plain text 7", device.Logs()[0].tag + ": " + device.Logs()[0].text);
  EXPECT_EQ(text, device.Logs()[1].text);
  EXPECT_EQ("E/korrin(" + std::to_string(getpid()) + "): " + text + "\n", printed);
}

TEST_F(DeviceTest, InjectedFailuresHoldOnceOrUntilClearedAndOnlyForKnownCalls) {
  device.AddGame("com.ex.racer", "Racer");
  device.FailNext("app_info_create", APP_MANAGER_ERROR_IO_ERROR, 1);
  // Braced lists run left to right.
  EXPECT_EQ((std::vector<int>{0, APP_MANAGER_ERROR_IO_ERROR, 0}),
            (std::vector<int>{Open("com.ex.racer"), Open("com.ex.racer"), Open("com.ex.racer")}));
  device.FailAlways("app_info_create", APP_MANAGER_ERROR_DB_FAILED);
  EXPECT_EQ((std::vector<int>{APP_MANAGER_ERROR_DB_FAILED, APP_MANAGER_ERROR_DB_FAILED}),
            (std::vector<int>{Open("com.ex.racer"), Open("com.ex.racer")}));
  device.ClearFailures();
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, Open("com.ex.racer"));
  EXPECT_EQ(6, device.CallCount("app_info_create"));
  EXPECT_EQ(3, device.CallCount("app_info_destroy"));
  EXPECT_EQ(0, HandlesOpenedByTest());

  EXPECT_THROW(device.FailNext("app_info_get_lable", -5), std::invalid_argument);
  EXPECT_THROW(device.FailAlways("e_dbus_shutdown", -5), std::invalid_argument);  // void
  EXPECT_THROW(device.FailNext("app_info_create", 0), std::invalid_argument);
  EXPECT_THROW(device.CallCount("nothing"), std::invalid_argument);
  EXPECT_EQ(0, device.CallCount("e_dbus_shutdown"));

  // Calls without an error code fail their own way.
  device.FailNext("bundle_create", BUNDLE_ERROR_OUT_OF_MEMORY);
  EXPECT_EQ(nullptr, bundle_create());
  EXPECT_EQ(BUNDLE_ERROR_OUT_OF_MEMORY, get_last_result());
  device.FailNext("e_dbus_init", -1);
  EXPECT_EQ(0, e_dbus_init());
  device.FailNext("mdm_get_application_state", APP_MANAGER_ERROR_IO_ERROR);
  mdm_get_service();
  EXPECT_EQ(MDM_STATUS_ERROR, mdm_get_application_state("com.ex.racer"));
  mdm_release_service();
}

TEST_F(DeviceTest, HandlesCountUntilReleasedOnce) {
  device.AddGame("com.ex.racer", "Racer");
  app_info_h info = NULL;
  ASSERT_EQ(APP_MANAGER_ERROR_NONE, app_info_create("com.ex.racer", &info));
  bundle* b = bundle_create();
  ASSERT_EQ(MDM_RESULT_SUCCESS, mdm_get_service());
  EXPECT_EQ(3, HandlesOpenedByTest());
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_destroy(info));
  EXPECT_EQ(APP_MANAGER_ERROR_INVALID_PARAMETER, app_info_destroy(info));
  EXPECT_EQ(BUNDLE_ERROR_NONE, bundle_free(b));
  EXPECT_EQ(MDM_RESULT_SUCCESS, mdm_release_service());
  EXPECT_EQ(MDM_RESULT_FAIL, mdm_release_service());
  EXPECT_EQ(0, HandlesOpenedByTest());
}

TEST_F(DeviceTest, PreferencesAnswerNoKeyUntilSetAndResetForgetsTheDeviceButKeepsHeldHandles) {
  int value = 7;
  EXPECT_EQ(PREFERENCE_ERROR_NO_KEY, preference_get_int("memory/sysman/mmc", &value));
  device.SetPreference("memory/sysman/mmc", 1);
  EXPECT_EQ(PREFERENCE_ERROR_NONE, preference_get_int("memory/sysman/mmc", &value));
  EXPECT_EQ(1, value);
  device.RemovePreference("memory/sysman/mmc");
  EXPECT_EQ(PREFERENCE_ERROR_NO_KEY, preference_get_int("memory/sysman/mmc", &value));

  package_manager_h client = NULL;
  ASSERT_EQ(PACKAGE_MANAGER_ERROR_NONE, package_manager_create(&client));
  static int heard;
  heard = 0;
  package_manager_set_event_cb(
      client,
      [](const char*, const char*, package_manager_event_type_e, package_manager_event_state_e, int,
         package_manager_error_e, void*) { ++heard; },
      NULL);
  device.AddGame("com.ex.racer", "Racer");
  device.SetPreference("memory/sysman/mmc", 1);
  device.FailAlways("app_info_create", -5);

  device.Reset();
  EXPECT_TRUE(device.Packages().empty());
  EXPECT_EQ(PREFERENCE_ERROR_NO_KEY, preference_get_int("memory/sysman/mmc", &value));
  EXPECT_EQ(0, device.CallCount("app_info_create"));
  EXPECT_EQ(1, device.PackageListeners());
  device.Install(sim::MakePackage("com.ex.new", {sim::GameApp("com.ex.new", "New")}));
  EXPECT_EQ(3, heard);
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, Open("com.ex.new"));
  EXPECT_EQ(PACKAGE_MANAGER_ERROR_NONE, package_manager_destroy(client));
}

TEST_F(DeviceTest, SampleDeviceIsALivedInPhone) {
  device.LoadSampleDevice();
  int games = 0, others = 0, noDisplay = 0, withoutIcon = 0, deactivated = 0;
  for (const sim::Package& pkg : device.Packages()) {
    deactivated += pkg.disabled;
    for (const sim::App& app : pkg.apps) {
      noDisplay += app.noDisplay;
      games += !app.noDisplay && app.game;
      others += !app.noDisplay && !app.game;
      withoutIcon += !app.noDisplay && app.game && !app.icon;
    }
  }
  EXPECT_GE(games, 30);
  EXPECT_GE(others, 4);
  EXPECT_EQ((std::vector<int>{2, 1, 1}), (std::vector<int>{noDisplay, withoutIcon, deactivated}));
  int width = 0;
  EXPECT_EQ(0, system_info_get_platform_int("http://tizen.org/feature/screen.width", &width));
  EXPECT_EQ(720, width);
}

// ---- The system bus.

struct Received {
  std::vector<std::string> signals;
};

void Record(void* data, DBusMessage* msg) {
  static_cast<Received*>(data)->signals.push_back(std::string(dbus_message_get_path(msg)) + " " +
                                                  dbus_message_get_member(msg));
}

TEST_F(DeviceTest, BusSignalsReachMatchingHandlersWithWildcards) {
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

TEST_F(DeviceTest, BusNeedsInitCountsItAndHandlersMayUnsubscribeOrBeDroppedWithTheirConnection) {
  EXPECT_EQ(nullptr, e_dbus_bus_get(DBUS_BUS_SYSTEM));
  EXPECT_EQ(1, e_dbus_init());
  EXPECT_EQ(2, e_dbus_init());
  EXPECT_EQ(1, e_dbus_shutdown());

  // A handler may unsubscribe while it is signalled.
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

  // Closing a connection drops its subscriptions.
  Received received;
  e_dbus_signal_handler_add(shot.conn, NULL, NULL, NULL, NULL, Record, &received);
  EXPECT_EQ(2, HandlesOpenedByTest());
  e_dbus_connection_close(shot.conn);
  EXPECT_EQ(0, HandlesOpenedByTest());
  EXPECT_EQ(0, device.SendBusSignal("/p", "i", "m"));
  EXPECT_EQ(0, e_dbus_shutdown());
  EXPECT_EQ(0, e_dbus_shutdown());  // never below zero
}

}  // namespace
