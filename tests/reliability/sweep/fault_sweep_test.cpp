// The fault sweep: each platform call the engine makes fails, the first time
// the story makes it and then every time, in one standard story of a
// launcher's life. Whatever fails, the engine must come through whole: no
// crash, every platform handle given back, a sound database, every log line
// in the launcher's format, and the next package event served once the
// platform is well again.
#include <app_manager.h>
#include <app_preference.h>
#include <bundle.h>
#include <mdm.h>
#include <package_manager.h>
#include <system_info.h>
#include <velmora_log_manager.h>

#include <algorithm>
#include <map>

#include "engine/engine-test.h"
#include "log-client-manager/log-client-manager.h"
#include "system-info/system-info.h"

namespace {

enum Kind {
  kSwept,       // the story makes it; it is failed there
  kReleases,    // the same, and it gives a handle back
  kListens,     // the same, and a refusal leaves the engine deaf to packages
  kCannotFail,  // the story makes it, but it has no result to fail
  kNotMade,     // the story never makes it
};

struct Call {
  const char* name;
  Kind kind;
  int error;        // what the real call returns when it fails
  const char* why;  // for a call that is not failed
};

const char kNeverCalled[] = "the library never calls it";
const char kAtUnload[] =
    "only Terminate makes it, when the library unloads, and no event is heard after it; the "
    "package tracker's lifecycle tests fail it";
const char kNoResult[] = "it has no result";
// e_dbus tells a failure by its result alone (0 or NULL): any code arms it.
const int kNoCode = -1;

// Every platform call the simulator knows by name. A call added there fails
// the table test until it is added here, swept or with the reason it is not.
const Call kCalls[] = {
    {"app_info_clone", kNotMade, 0, kNeverCalled},
    {"app_info_create", kSwept, APP_MANAGER_ERROR_NO_SUCH_APP, ""},
    {"app_info_destroy", kReleases, APP_MANAGER_ERROR_INVALID_PARAMETER, ""},
    {"app_info_filter_add_bool", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_filter_add_string", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_filter_count_appinfo", kNotMade, 0, kNeverCalled},
    {"app_info_filter_create", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_filter_destroy", kReleases, APP_MANAGER_ERROR_INVALID_PARAMETER, ""},
    {"app_info_filter_foreach_appinfo", kSwept, APP_MANAGER_ERROR_IO_ERROR, ""},
    {"app_info_foreach_metadata", kSwept, APP_MANAGER_ERROR_IO_ERROR, ""},
    {"app_info_get_app_id", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_get_icon", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_get_label", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_get_package", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_get_type", kSwept, APP_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"app_info_is_enabled", kSwept, APP_MANAGER_ERROR_IO_ERROR, ""},
    {"app_info_is_game", kSwept, APP_MANAGER_ERROR_IO_ERROR, ""},
    {"app_info_is_nodisplay", kSwept, APP_MANAGER_ERROR_IO_ERROR, ""},
    {"app_info_is_preload", kNotMade, 0, kNeverCalled},
    {"app_manager_foreach_app_info", kNotMade, 0, kNeverCalled},
    {"app_manager_get_app_info", kNotMade, 0, kNeverCalled},
    {"bundle_add_str", kSwept, BUNDLE_ERROR_OUT_OF_MEMORY, ""},
    {"bundle_create", kSwept, BUNDLE_ERROR_OUT_OF_MEMORY, ""},
    {"bundle_free", kReleases, BUNDLE_ERROR_INVALID_PARAMETER, ""},
    {"bundle_get_str", kNotMade, 0, kNeverCalled},
    {"e_dbus_bus_get", kSwept, kNoCode, ""},
    {"e_dbus_connection_close", kCannotFail, 0, kNoResult},
    {"e_dbus_init", kSwept, kNoCode, ""},
    {"e_dbus_shutdown", kCannotFail, 0, kNoResult},
    {"e_dbus_signal_handler_add", kSwept, kNoCode, ""},
    {"e_dbus_signal_handler_del", kCannotFail, 0, kNoResult},
    {"mdm_get_application_state", kSwept, MDM_STATUS_ERROR, ""},
    {"mdm_get_service", kSwept, MDM_RESULT_SERVICE_NOT_ENABLED, ""},
    {"mdm_release_service", kReleases, MDM_RESULT_FAIL, ""},
    {"package_info_create", kSwept, PACKAGE_MANAGER_ERROR_NO_SUCH_PACKAGE, ""},
    {"package_info_destroy", kReleases, PACKAGE_MANAGER_ERROR_INVALID_PARAMETER, ""},
    {"package_info_foreach_app_from_package", kSwept, PACKAGE_MANAGER_ERROR_IO_ERROR, ""},
    {"package_info_is_preload_package", kSwept, PACKAGE_MANAGER_ERROR_IO_ERROR, ""},
    {"package_info_is_removable_package", kSwept, PACKAGE_MANAGER_ERROR_IO_ERROR, ""},
    {"package_info_is_system_package", kSwept, PACKAGE_MANAGER_ERROR_IO_ERROR, ""},
    {"package_manager_create", kNotMade, 0,
     "made once, as the library loads, before a test can arm a fault; the package tracker's "
     "lifecycle tests fail it"},
    {"package_manager_destroy", kNotMade, 0, kAtUnload},
    {"package_manager_filter_add_bool", kSwept, PACKAGE_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"package_manager_filter_count", kNotMade, 0, kNeverCalled},
    {"package_manager_filter_create", kSwept, PACKAGE_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"package_manager_filter_destroy", kReleases, PACKAGE_MANAGER_ERROR_INVALID_PARAMETER, ""},
    {"package_manager_filter_foreach_package_info", kSwept, PACKAGE_MANAGER_ERROR_IO_ERROR, ""},
    {"package_manager_get_package_info", kSwept, PACKAGE_MANAGER_ERROR_NO_SUCH_PACKAGE, ""},
    {"package_manager_set_event_cb", kListens, PACKAGE_MANAGER_ERROR_PERMISSION_DENIED, ""},
    {"package_manager_set_event_status", kNotMade, 0, kNeverCalled},
    {"package_manager_unset_event_cb", kNotMade, 0, kAtUnload},
    {"preference_get_int", kSwept, PREFERENCE_ERROR_IO_ERROR, ""},
    {"preference_is_existing", kNotMade, 0, kNeverCalled},
    {"preference_remove", kNotMade, 0, kNeverCalled},
    {"preference_set_int", kNotMade, 0, kNeverCalled},
    {"system_info_get_platform_int", kSwept, SYSTEM_INFO_ERROR_IO_ERROR, ""},
    {"velmora_log_manager_create", kSwept, VELMORA_LOG_MANAGER_ERROR_OUT_OF_MEMORY, ""},
    {"velmora_log_manager_destroy", kReleases, VELMORA_LOG_MANAGER_ERROR_INVALID_PARAMETER, ""},
    {"velmora_log_manager_insert", kSwept, VELMORA_LOG_MANAGER_ERROR_IO_ERROR, ""},
};

bool IsSwept(const Call& call) { return call.kind != kCannotFail && call.kind != kNotMade; }

struct Fault {
  Call call;
  bool always;
};

std::vector<Fault> EveryFault() {
  std::vector<Fault> faults;
  for (const Call& call : kCalls) {
    if (!IsSwept(call)) continue;
    faults.push_back(Fault{call, false});
    faults.push_back(Fault{call, true});
  }
  return faults;
}

void PrintTo(const Fault& fault, std::ostream* out) {
  *out << fault.call.name << (fault.always ? " failing always" : " failing once");
}

std::string FaultName(const ::testing::TestParamInfo<Fault>& info) {
  return std::string(info.param.call.name) + (info.param.always ? "_always" : "_once");
}

// ---- The story.

class FaultSweepStory : public EngineTest {
 protected:
  // A phone with four games and a deactivated one, a 720 by 1280 screen, a
  // storage card, and a device-management service that restricts Alpha.
  void SetUpPhone() {
    AddGames({"Alpha", "Bravo", "Charlie", "Delta"});
    sim::Package oldie = Game("oldie", "Oldie");
    oldie.supportDisable = oldie.disabled = true;
    device.AddPackage(oldie);
    device.SetSystemInfo("http://tizen.org/feature/screen.width", 720);
    device.SetSystemInfo("http://tizen.org/feature/screen.height", 1280);
    device.SetPreference("memory/sysman/mmc", 1);
    device.SetMdm(true, {{"alpha", MDM_RESTRICTED}});
  }

  void Play() {
    Start();  // the first launch
    // The user drops a shortcut of Charlie on the home screen.
    GameBoxData shortcut;
    shortcut.pageId = 1;
    shortcut.appId = "charlie";
    shortcut.name = "Charlie Arena";
    shortcut.boxType = 3;
    shortcut.col = 1;
    shortcut.row = 2;
    store.InsertBoxData(shortcut);

    device.Install(Game("echo", "Echo"));
    device.Update(Game("bravo", "Bravo Deluxe"));
    device.Uninstall("charlie");

    // Boot done: Delta lives on the card, and its label in the records the
    // launcher shares with the cache has gone stale.
    packages._RegisterEdbusSignalHandler();
    auto delta = packages.m_appInfoCache.find("delta");
    if (delta != packages.m_appInfoCache.end()) {
      delta->second->isOnStorageCard = true;
      delta->second->name.clear();
    }
    device.SendBusSignal("/Org/Tizen/System/DeviceD/Core", "org.tizen.system.deviced.core",
                         "BootingDone");

    // The launcher's own questions.
    alphaAllowed = packages.IsMDMAllowed("alpha");
    packages.IsMDMRestriected("alpha");
    packages._IsMenuLaunch("alpha");
    deactivated.reset(new GameBoxData);
    packages._GetDeactivatedAppInfo("oldie", deactivated);
    screen = SystemInfo::GetScreenResolution();
    LogClientManager usage;
    usage.InsertLog("alpha", "launch", NULL, "1", true);
  }

  // The engine's one lasting handle, its listening client, was opened when
  // the library loaded, before the test began; all the story opens is let go
  // within it. So the device must hold what it held at the start, except
  // that a release the platform refused leaves that handle with the
  // platform, one per refusal: the engine has nothing left to retry with.
  void ExpectCameThroughWhole(int refusedReleases) {
    EXPECT_EQ(refusedReleases, HandlesOpenedByTest());
    EXPECT_EQ(0, device.BusInitCount());
    EXPECT_EQ("ok", db->Value("PRAGMA integrity_check"));
    EngineLogs();  // fails the test on a line without the launcher's prefix
  }

  // With the platform well again, a new game gets its box and label.
  void ExpectTheNextInstallServed() {
    device.Install(Game("foxtrot", "Foxtrot"));
    EXPECT_EQ("1", db->Value("SELECT COUNT(*) FROM Boxes WHERE appId = 'foxtrot' AND name = "
                             "'Foxtrot'"));
  }

  bool alphaAllowed = true;
  boost::shared_ptr<GameBoxData> deactivated;
  int screen = -1;
};

// The story does what it says, and makes every call it is said to make.
TEST_F(FaultSweepStory, WithoutFaultsMakesEverySweptCall) {
  SetUpPhone();
  Play();
  EXPECT_EQ((Lines{"alpha 1,1", "bravo 2,1", "delta 3,1", "echo 4,1"}), Page(1));
  EXPECT_EQ("Bravo Deluxe", db->Value("SELECT name FROM Boxes WHERE appId = 'bravo'"));
  EXPECT_EQ("Delta", packages.m_appInfoCache["delta"]->name);  // read afresh at boot done
  EXPECT_FALSE(alphaAllowed);
  EXPECT_EQ("Oldie", deactivated->name);
  EXPECT_EQ(3, screen);
  EXPECT_EQ(1u, device.UsageLogs().size());

  for (const Call& call : kCalls) {
    SCOPED_TRACE(call.name);
    if (call.kind == kNotMade) {
      EXPECT_EQ(0, device.CallCount(call.name)) << "now made: sweep it";
    } else {
      EXPECT_LT(0, device.CallCount(call.name)) << "the story must make it";
    }
  }
  ExpectCameThroughWhole(0);
  ExpectTheNextInstallServed();
}

TEST(FaultSweepTable, NamesEveryCallOfTheSimulatorAsItIs) {
  std::vector<std::string> names;
  for (const Call& call : kCalls) {
    names.push_back(call.name);
    EXPECT_EQ(sim::Device::CanFail(call.name), call.kind != kCannotFail) << call.name;
    EXPECT_EQ(IsSwept(call), call.error != 0 && call.why[0] == '\0') << call.name;
  }
  std::sort(names.begin(), names.end());
  EXPECT_EQ(sim::Device::PlatformCalls(), names);
}

// ---- The sweep.

class FaultSweep : public FaultSweepStory, public ::testing::WithParamInterface<Fault> {};

TEST_P(FaultSweep, TheEngineComesThroughWhole) {
  const Fault& fault = GetParam();
  SetUpPhone();
  if (fault.always) {
    device.FailAlways(fault.call.name, fault.call.error);
  } else {
    device.FailNext(fault.call.name, fault.call.error);
  }
  Play();
  ExpectCameThroughWhole(fault.call.kind != kReleases ? 0
                         : fault.always               ? device.CallCount(fault.call.name)
                                                      : 1);
  device.ClearFailures();
  // The listener is registered only as the engine starts, as the launcher
  // has it: a refused registration is mended by starting it again.
  if (fault.call.kind == kListens) data_engin_initialization();
  ExpectTheNextInstallServed();
}

INSTANTIATE_TEST_SUITE_P(EveryCall, FaultSweep, ::testing::ValuesIn(EveryFault()), FaultName);

}  // namespace
