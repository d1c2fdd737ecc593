// The fault sweep: each platform call the engine makes fails, the first time
// story.ksim makes it and then every time. Whatever fails, the engine must
// come through whole: every platform handle given back, no bus left
// initialised, a sound database, every log line in the launcher's format,
// and the next install served once the platform is well again.
#include <app_manager.h>
#include <app_preference.h>
#include <bundle.h>
#include <mdm.h>
#include <package_manager.h>
#include <system_info.h>
#include <velmora_log_manager.h>

#include <algorithm>
#include <fstream>
#include <sstream>

#include "log-client-manager/log-client-manager.h"
#include "session.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

enum Kind { kFails, kReleases, kListens };

struct Call {
  const char* name;
  int error;  // what the real call returns when it fails
  Kind kind;  // a refused release keeps its handle; a refused listener needs a new start
};

// e_dbus tells a failure by its result alone (0 or NULL): any code arms it.
const int kNoCode = -1;

const Call kSwept[] = {
    {"app_info_create", APP_MANAGER_ERROR_NO_SUCH_APP, kFails},
    {"app_info_destroy", APP_MANAGER_ERROR_INVALID_PARAMETER, kReleases},
    {"app_info_filter_add_bool", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_filter_add_string", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_filter_create", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_filter_destroy", APP_MANAGER_ERROR_INVALID_PARAMETER, kReleases},
    {"app_info_filter_foreach_appinfo", APP_MANAGER_ERROR_IO_ERROR, kFails},
    {"app_info_foreach_metadata", APP_MANAGER_ERROR_IO_ERROR, kFails},
    {"app_info_get_app_id", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_get_icon", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_get_label", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_get_package", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_get_type", APP_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"app_info_is_enabled", APP_MANAGER_ERROR_IO_ERROR, kFails},
    {"app_info_is_game", APP_MANAGER_ERROR_IO_ERROR, kFails},
    {"app_info_is_nodisplay", APP_MANAGER_ERROR_IO_ERROR, kFails},
    {"bundle_add_str", BUNDLE_ERROR_OUT_OF_MEMORY, kFails},
    {"bundle_create", BUNDLE_ERROR_OUT_OF_MEMORY, kFails},
    {"bundle_free", BUNDLE_ERROR_INVALID_PARAMETER, kReleases},
    {"e_dbus_bus_get", kNoCode, kFails},
    {"e_dbus_init", kNoCode, kFails},
    {"e_dbus_signal_handler_add", kNoCode, kFails},
    {"mdm_get_application_state", MDM_STATUS_ERROR, kFails},
    {"mdm_get_service", MDM_RESULT_SERVICE_NOT_ENABLED, kFails},
    {"mdm_release_service", MDM_RESULT_FAIL, kReleases},
    {"package_info_create", PACKAGE_MANAGER_ERROR_NO_SUCH_PACKAGE, kFails},
    {"package_info_destroy", PACKAGE_MANAGER_ERROR_INVALID_PARAMETER, kReleases},
    {"package_info_foreach_app_from_package", PACKAGE_MANAGER_ERROR_IO_ERROR, kFails},
    {"package_info_is_preload_package", PACKAGE_MANAGER_ERROR_IO_ERROR, kFails},
    {"package_info_is_removable_package", PACKAGE_MANAGER_ERROR_IO_ERROR, kFails},
    {"package_info_is_system_package", PACKAGE_MANAGER_ERROR_IO_ERROR, kFails},
    {"package_manager_filter_add_bool", PACKAGE_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"package_manager_filter_create", PACKAGE_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"package_manager_filter_destroy", PACKAGE_MANAGER_ERROR_INVALID_PARAMETER, kReleases},
    {"package_manager_filter_foreach_package_info", PACKAGE_MANAGER_ERROR_IO_ERROR, kFails},
    {"package_manager_get_package_info", PACKAGE_MANAGER_ERROR_NO_SUCH_PACKAGE, kFails},
    {"package_manager_set_event_cb", PACKAGE_MANAGER_ERROR_PERMISSION_DENIED, kListens},
    {"preference_get_int", PREFERENCE_ERROR_IO_ERROR, kFails},
    {"system_info_get_platform_int", SYSTEM_INFO_ERROR_IO_ERROR, kFails},
    {"velmora_log_manager_create", VELMORA_LOG_MANAGER_ERROR_OUT_OF_MEMORY, kFails},
    {"velmora_log_manager_destroy", VELMORA_LOG_MANAGER_ERROR_INVALID_PARAMETER, kReleases},
    {"velmora_log_manager_insert", VELMORA_LOG_MANAGER_ERROR_IO_ERROR, kFails},
};

// Calls with a result that the story never makes. The package client is made
// as the library loads and given back as it unloads, outside any test (the
// package tracker's lifecycle tests fail those); the rest the library never
// calls. Calls without a result are only counted.
const char* const kNotMade[] = {
    "package_manager_create", "package_manager_destroy", "package_manager_unset_event_cb",
    "app_info_clone", "app_info_filter_count_appinfo", "app_info_is_preload",
    "app_manager_foreach_app_info", "app_manager_get_app_info", "bundle_get_str",
    "package_manager_filter_count", "package_manager_set_event_status", "preference_is_existing",
    "preference_remove", "preference_set_int"};

class FaultSweepStory : public SimTest {
 protected:
  // Plays story.ksim, its expect blocks too when |checked|; a line that
  // cannot run fails the test.
  void Play(bool checked) {
    std::ifstream in(KORRIN_SWEEP_STORY);
    std::stringstream story;
    bool inExpect = false;
    for (std::string line; std::getline(in, line); story << "\n") {
      inExpect = inExpect || (!checked && line == "expect");
      if (!inExpect) story << line;
      inExpect = inExpect && line != "end";
    }
    std::ostringstream errors;
    EXPECT_TRUE(session.RunScript(story, "story.ksim", errors)) << errors.str();
    // The usage-log client is closed as its owner ends; korrin-sim's never does.
    LogClientManager().InsertLog("alpha", "launch", NULL, "1", true);
  }

  // With the platform well again, a new game gets its box and label.
  void ExpectCameThroughWhole(int refusedReleases) {
    EXPECT_EQ(refusedReleases, HandlesOpenedByTest());
    EXPECT_EQ(0, device.BusInitCount());
    EXPECT_EQ("ok", SqlProbe(DbPath()).Value("PRAGMA integrity_check"));
    EngineLogs();  // fails the test on a line without the launcher's prefix
    session.Execute("install foxtrot Foxtrot");
    EXPECT_EQ("1", SqlProbe(DbPath()).Value(
                       "SELECT COUNT(*) FROM Boxes WHERE appId = 'foxtrot' AND name = 'Foxtrot'"));
  }

  korrin_sim::Session session{false};
};

class FaultSweep : public FaultSweepStory,
                   public ::testing::WithParamInterface<std::pair<Call, bool>> {};

TEST_F(FaultSweepStory, TheTableNamesEveryCallOfTheSimulatorAndTheStoryMakesEverySweptOne) {
  Play(true);
  std::vector<std::string> names(std::begin(kNotMade), std::end(kNotMade));
  for (const Call& call : kSwept) {
    names.push_back(call.name);
    EXPECT_LT(0, device.CallCount(call.name)) << call.name << ": the story must make it";
  }
  for (const char* call : kNotMade) EXPECT_EQ(0, device.CallCount(call)) << call << ": sweep it";
  for (const std::string& call : sim::Device::PlatformCalls()) {
    if (!sim::Device::CanFail(call)) names.push_back(call);
  }
  std::sort(names.begin(), names.end());
  EXPECT_EQ(sim::Device::PlatformCalls(), names);
  ExpectCameThroughWhole(0);
}

TEST_P(FaultSweep, TheEngineComesThroughWhole) {
  const Call& call = GetParam().first;
  const bool always = GetParam().second;
  session.Execute("fail " + std::string(call.name) + " " + std::to_string(call.error) +
                  (always ? " always" : " once"));
  Play(false);
  session.Execute("fail clear");
  // The listener is registered only as the engine starts, as the launcher
  // has it: a refused registration is mended by starting it again.
  if (call.kind == kListens) session.Execute("start");
  ExpectCameThroughWhole(call.kind != kReleases ? 0 : always ? device.CallCount(call.name) : 1);
}

std::vector<std::pair<Call, bool>> EveryFault() {
  std::vector<std::pair<Call, bool>> faults;
  for (const Call& call : kSwept) faults.insert(faults.end(), {{call, false}, {call, true}});
  return faults;
}

INSTANTIATE_TEST_SUITE_P(EveryCall, FaultSweep, ::testing::ValuesIn(EveryFault()),
                         [](const ::testing::TestParamInfo<std::pair<Call, bool>>& info) {
                           return std::string(info.param.first.name) +
                                  (info.param.second ? "_always" : "_once");
                         });

}  // namespace
