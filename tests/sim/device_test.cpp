// Injected failures, which the fault sweep stands on: they hold once (after
// the calls let pass) or until cleared, and only calls with a result fail.
#include <app_manager.h>

#include <stdexcept>

#include "support/sim-test.h"

TEST_F(SimTest, InjectedFailuresHoldOnceOrUntilClearedAndOnlyForKnownCalls) {
  device.AddGame("racer", "Racer");
  std::vector<int> results;
  auto open = [&] {
    app_info_h info = NULL;
    results.push_back(app_info_create("racer", &info));
    if (info != NULL) app_info_destroy(info);
  };
  device.FailNext("app_info_create", APP_MANAGER_ERROR_IO_ERROR, 1);
  open(), open(), open();
  device.FailAlways("app_info_create", APP_MANAGER_ERROR_DB_FAILED);
  open(), open();
  device.ClearFailures();
  open();
  EXPECT_EQ((std::vector<int>{0, APP_MANAGER_ERROR_IO_ERROR, 0, APP_MANAGER_ERROR_DB_FAILED,
                              APP_MANAGER_ERROR_DB_FAILED, 0}),
            results);
  EXPECT_THROW(device.FailNext("app_info_get_lable", -5), std::invalid_argument);
  EXPECT_THROW(device.FailAlways("e_dbus_shutdown", -5), std::invalid_argument);  // void
}
