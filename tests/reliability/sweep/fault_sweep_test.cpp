// The fault sweep: each platform call the engine makes fails, the first time
// story.ksim makes it and then every time. Whatever fails, the engine must
// come through whole: every platform handle given back, no bus left
// initialised, a sound database, every log line in the launcher's format,
// and the next install served once the platform is well again.
#include <fstream>
#include <iostream>
#include <set>

#include "log-client-manager/log-client-manager.h"
#include "session.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

// Calls with a result the story never makes: the package client's, made and
// ended as the library loads and unloads (the package tracker's lifecycle
// tests fail them), and those the library never makes. The rest are swept.
const std::set<std::string> kNotMade = {
    "package_manager_create", "package_manager_destroy", "package_manager_unset_event_cb",
    "app_info_clone", "app_info_filter_count_appinfo", "app_info_is_preload",
    "app_manager_foreach_app_info", "app_manager_get_app_info", "bundle_get_str",
    "package_manager_filter_count", "package_manager_set_event_status", "preference_is_existing",
    "preference_remove", "preference_set_int"};
// A refused release leaves its handle: the engine has nothing to retry with.
const std::set<std::string> kReleases = {
    "app_info_destroy", "app_info_filter_destroy", "bundle_free", "mdm_release_service",
    "package_info_destroy", "package_manager_filter_destroy", "velmora_log_manager_destroy"};

std::vector<std::string> Swept() {
  std::vector<std::string> calls;
  for (const std::string& call : sim::Device::PlatformCalls()) {
    if (sim::Device::CanFail(call) && kNotMade.count(call) == 0) calls.push_back(call);
  }
  return calls;
}

class FaultSweepStory : public SimTest {
 protected:
  void Play() {
    std::ifstream story(KORRIN_SWEEP_STORY);
    EXPECT_TRUE(session.RunScript(story, "story.ksim", std::cerr));
    // The usage-log client is closed as its owner ends; korrin-sim's never is.
    LogClientManager().InsertLog("alpha", "launch", NULL, "1", true);
  }

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

TEST_F(FaultSweepStory, MakesEverySweptCallAndNoneOfTheOthers) {
  Play();
  for (const std::string& call : Swept()) EXPECT_LT(0, device.CallCount(call)) << call;
  for (const std::string& call : kNotMade) EXPECT_EQ(0, device.CallCount(call)) << call;
  // Every name in the tables is a call the simulator can fail (it throws on others).
  for (auto table : {&kNotMade, &kReleases}) {
    for (const std::string& call : *table) EXPECT_TRUE(sim::Device::CanFail(call)) << call;
  }
  ExpectCameThroughWhole(0);
}

class FaultSweep : public FaultSweepStory,
                   public ::testing::WithParamInterface<std::tuple<std::string, bool>> {};

TEST_P(FaultSweep, TheEngineComesThroughWhole) {
  const std::string call = std::get<0>(GetParam());
  const bool always = std::get<1>(GetParam());
  // The platform's I/O error: the engine tells success from failure only.
  session.Execute("fail " + call + " -5" + (always ? " always" : " once"));
  Play();
  session.Execute("fail clear");
  // The listener registers only as the engine starts: a new start mends it.
  if (call == "package_manager_set_event_cb") {
    session.Execute("start --without boot-signal --without card-watch");
  }
  ExpectCameThroughWhole(kReleases.count(call) == 0 ? 0 : always ? device.CallCount(call) : 1);
}

INSTANTIATE_TEST_SUITE_P(EveryCall, FaultSweep,
                         ::testing::Combine(::testing::ValuesIn(Swept()), ::testing::Bool()),
                         [](const ::testing::TestParamInfo<FaultSweep::ParamType>& info) {
                           return std::get<0>(info.param) +
                                  (std::get<1>(info.param) ? "_always" : "_once");
                         });

}  // namespace
