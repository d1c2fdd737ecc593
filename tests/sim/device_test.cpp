// The simulated device where the engine's tests would pass without noticing
// it wrong: injected failures that hold once or until cleared, handles that
// count until released once, and package events around the change.
#include <app_manager.h>
#include <bundle.h>
#include <package_manager.h>

#include <stdexcept>

#include "support/sim-test.h"

namespace {

int Open(const char* appId) {
  app_info_h info = NULL;
  int rc = app_info_create(appId, &info);
  if (rc == APP_MANAGER_ERROR_NONE) app_info_destroy(info);
  return rc;
}

class DeviceTest : public SimTest {};

TEST_F(DeviceTest, InjectedFailuresHoldOnceOrUntilClearedAndOnlyForKnownCalls) {
  device.AddGame("racer", "Racer");
  device.FailNext("app_info_create", APP_MANAGER_ERROR_IO_ERROR, 1);
  EXPECT_EQ(0, Open("racer"));
  EXPECT_EQ(APP_MANAGER_ERROR_IO_ERROR, Open("racer"));
  EXPECT_EQ(0, Open("racer"));
  device.FailAlways("app_info_create", APP_MANAGER_ERROR_DB_FAILED);
  EXPECT_EQ(APP_MANAGER_ERROR_DB_FAILED, Open("racer"));
  EXPECT_EQ(APP_MANAGER_ERROR_DB_FAILED, Open("racer"));
  device.ClearFailures();
  EXPECT_EQ(0, Open("racer"));
  EXPECT_EQ(6, device.CallCount("app_info_create"));
  device.FailNext("bundle_create", BUNDLE_ERROR_OUT_OF_MEMORY);  // fails by its result
  EXPECT_EQ(nullptr, bundle_create());
  EXPECT_EQ(BUNDLE_ERROR_OUT_OF_MEMORY, get_last_result());
  EXPECT_THROW(device.FailNext("app_info_get_lable", -5), std::invalid_argument);
  EXPECT_THROW(device.FailAlways("e_dbus_shutdown", -5), std::invalid_argument);  // void
  EXPECT_THROW(device.FailNext("app_info_create", 0), std::invalid_argument);
}

TEST_F(DeviceTest, HandlesCountUntilReleasedOnce) {
  device.AddGame("racer", "Racer");
  app_info_h info = NULL;
  ASSERT_EQ(APP_MANAGER_ERROR_NONE, app_info_create("racer", &info));
  bundle* b = bundle_create();
  EXPECT_EQ(2, HandlesOpenedByTest());
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_destroy(info));
  EXPECT_EQ(APP_MANAGER_ERROR_INVALID_PARAMETER, app_info_destroy(info));
  EXPECT_EQ(BUNDLE_ERROR_NONE, bundle_free(b));
  EXPECT_EQ(0, HandlesOpenedByTest());
}

// A listening client hears STARTED, PROCESSING and COMPLETED; an uninstall
// starts while the application can still be read.
TEST_F(DeviceTest, PackageEventsComeAroundTheChange) {
  static std::vector<std::string> heard;
  package_manager_h client = NULL;
  ASSERT_EQ(PACKAGE_MANAGER_ERROR_NONE, package_manager_create(&client));
  package_manager_set_event_cb(
      client,
      [](const char*, const char* pkg, package_manager_event_type_e type,
         package_manager_event_state_e state, int progress, package_manager_error_e, void*) {
        heard.push_back(std::string(pkg) + " " + std::to_string(type) + std::to_string(state) +
                        " " + std::to_string(progress) + (Open(pkg) == 0 ? " readable" : ""));
      },
      NULL);
  sim::Package racer = sim::MakePackage("racer", {sim::GameApp("racer", "Racer")});
  device.Install(racer);
  device.Update(racer);
  EXPECT_TRUE(device.Uninstall("racer"));
  EXPECT_FALSE(device.Uninstall("racer"));  // nothing sent
  package_manager_destroy(client);
  EXPECT_EQ((std::vector<std::string>{"racer 00 0", "racer 01 60", "racer 02 100 readable",
                                      "racer 20 0 readable", "racer 21 60 readable",
                                      "racer 22 100 readable", "racer 10 0 readable",
                                      "racer 11 60 readable", "racer 12 100"}),
            heard);
}

}  // namespace
