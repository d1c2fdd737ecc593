// Injected failures, which the fault sweep and the failure tests stand on:
// they hold once, after the calls to let pass, or until cleared, and only
// calls with a result can be failed. (The sweep shows the handle count.)
#include <app_manager.h>
#include <bundle.h>

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

}  // namespace
