// A libFuzzer target for the whole engine on the simulated device: each input
// is a story of device changes and public calls, played against the one engine
// of the process, which must come through without a crash, a sanitizer report,
// a leaked platform handle or a damaged schema.
//
// The bytes are read with FuzzedDataProvider, which takes integers and choices
// from the end of the input and texts from the front (a text ends at a
// backslash followed by any other character; two backslashes are one). An
// input is a sequence of steps: one byte picks an entry of kSteps, whose
// arguments follow. Integers are small, special (grid and virtual-page limits,
// screen sizes, INT_MIN/INT_MAX) or any 32-bit value; texts are one of a few
// application ids, a hostile fragment, raw bytes without NUL, an id with raw
// bytes appended, or a piece repeated up to 64 KB.
//
// The engine lives as long as the process, so each input is made to start
// from the same place: no packages, preferences, policy, faults or logs on the
// device, empty tables with their AUTOINCREMENT counters reset, an open
// connection with no transaction, an empty application-information cache, no
// jobs, the engine's own five callbacks, one listening package-manager client
// and no bus subscription. What still carries over: the database file itself
// (its size and free pages) and SQLite's process-wide state. The platform
// handles held open are checked to be back where they were before the input.
//
// KORRIN_FUZZ_TRACE=1 prints every step with its arguments, to read a crashing
// input. The seed corpus in corpus/ is kept as bytes: one input per kind of
// operation, grown by hand or from what a long run finds.
#include <E_DBus.h>
#include <app_control.h>
#include <app_manager.h>
#include <fuzzer/FuzzedDataProvider.h>
#include <errno.h>
#include <limits.h>
#include <signal.h>
#include <sqlite3.h>
#include <stdio.h>
#include <stdlib.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include <boost/function.hpp>

#include "common/device-path.h"
#include "korrin-data/korrin-data.h"
#include "launcher-data-manager/db-util.h"
#include "log-client-manager/log-client-manager.h"
#include "sim/device.h"
#include "system-info/system-info.h"

namespace {

typedef boost::shared_ptr<GameBoxData> BoxPtr;

// ---- What texts and integers are made of.

const char* const kIds[] = {"com.fz.racer", "com.fz.chess", "com.fz.pack", "com.fz.tool"};
const char kCardKey[] = "memory/sysman/mmc";
const char kFloatingCategory[] = "http://velmora.com/category/floatingapp";
const char kMenuLaunchKey[] = "http://velmora.com/tizen/metadata/menu/launch/operation";
const char kBootPath[] = "/Org/Tizen/System/DeviceD/Core";
const char kBootInterface[] = "org.tizen.system.deviced.core";
const char* const kHostile[] = {
    "", "'", "\"", "''", "'; DROP TABLE Boxes; --", "\" OR 1=1 --", "') OR ('1'='1",
    "$appId", "$name", "?1", ":name", "@x", "%s%s%s%n", "%999999d", "\\", "\n\r\t",
    "\xff\xfe\xfd", "\xc0\x80", "\xed\xa0\x80", "A\xcc\x81", "\xf0\x9f\x8e\xae", "\xe2\x80\xae",
    "(null)", "NULL", "-1", "com.fz.racer'--", "com.fz.racer ", "COM.FZ.RACER", kCardKey,
    kFloatingCategory, kMenuLaunchKey, APP_CONTROL_OPERATION_MAIN, kBootPath, "BootingDone"};
const int kSpecialInts[] = {-1, -2, INT_MIN, INT_MAX, INT_MAX - 1, 100000, 100001, 100002,
                            39999, 40000, 40001, 40002, 160000, 320, 480, 540, 720, 800, 960,
                            1080, 1280, 1920};

// Platform calls that can be made to fail. Calls that release are left out:
// a handle the platform refuses to release stays open for good, which would
// blur the check that the engine releases every handle it opens.
const char* const kCalls[] = {
    "app_info_create", "app_info_get_app_id", "app_info_get_package", "app_info_get_icon",
    "app_info_get_label", "app_info_get_type", "app_info_is_nodisplay", "app_info_is_enabled",
    "app_info_is_game", "app_info_foreach_metadata", "app_info_filter_create",
    "app_info_filter_add_bool", "app_info_filter_add_string", "app_info_filter_foreach_appinfo",
    "package_manager_set_event_cb", "package_manager_get_package_info",
    "package_manager_filter_create", "package_manager_filter_add_bool",
    "package_manager_filter_foreach_package_info", "package_info_create",
    "package_info_is_system_package", "package_info_is_removable_package",
    "package_info_is_preload_package", "package_info_foreach_app_from_package",
    "preference_get_int", "system_info_get_platform_int", "bundle_create", "bundle_add_str",
    "e_dbus_init", "e_dbus_bus_get", "e_dbus_signal_handler_add", "mdm_get_service",
    "mdm_get_application_state", "velmora_log_manager_create", "velmora_log_manager_insert"};

const size_t kMaxRaw = 512;     // bytes of one raw text
const size_t kMaxLong = 65536;  // bytes of one repeated text
const int kMaxSteps = 200;      // steps of one input

// |text| for a trace line: printable, and cut short.
std::string Shown(const std::string& text) {
  std::string shown = "\"";
  for (size_t i = 0; i < text.size() && i < 40; ++i) {
    unsigned char c = static_cast<unsigned char>(text[i]);
    char hex[8];
    snprintf(hex, sizeof hex, "\\x%02x", c);
    shown += c >= 0x20 && c < 0x7f && c != '"' && c != '\\' ? std::string(1, c) : hex;
  }
  shown += "\"";
  if (text.size() > 40) shown += "...(" + std::to_string(text.size()) + " bytes)";
  return shown;
}

// ---- Arguments, read from the fuzzer's bytes.

class Input {
 public:
  explicit Input(FuzzedDataProvider& data) : m_data(data) {}

  bool More() const { return m_data.remaining_bytes() > 0; }
  size_t Step(size_t count) { return Pick(count); }

  unsigned Choose(unsigned n) {
    unsigned value = Pick(n);
    Note(std::to_string(value));
    return value;
  }
  bool Bool() { return Choose(2) == 1; }

  int Int() {
    const size_t kSpecials = sizeof kSpecialInts / sizeof kSpecialInts[0];
    int value;
    switch (Pick(3)) {
      case 0: value = static_cast<int>(Pick(16)); break;
      case 1: value = kSpecialInts[Pick(kSpecials)]; break;
      default: value = m_data.ConsumeIntegral<int>(); break;
    }
    Note(std::to_string(value));
    return value;
  }

  std::string Text() {
    const size_t kIdCount = sizeof kIds / sizeof kIds[0];
    const size_t kHostileCount = sizeof kHostile / sizeof kHostile[0];
    // 0-3: an id; 4: a hostile fragment; 5: raw bytes; 6: a piece repeated; 7: an id and raw bytes
    std::string text;
    switch (Pick(8)) {
      case 4: text = kHostile[Pick(kHostileCount)]; break;
      case 5: text = Raw(kMaxRaw); break;
      case 6: {
        std::string piece = Raw(16);
        if (piece.empty()) piece = "x";
        size_t length = 1 + static_cast<uint32_t>(m_data.ConsumeIntegral<int>()) % kMaxLong;
        while (text.size() < length) text += piece;
        text.resize(length);
        break;
      }
      case 7: text = std::string(kIds[Pick(kIdCount)]) + Raw(kMaxRaw); break;
      default: text = kIds[Pick(kIdCount)]; break;
    }
    Note(Shown(text));
    return text;
  }

  // A text, or NULL one time in eight; |storage| keeps the text.
  const char* NullableText(std::string& storage) {
    if (Pick(8) == 0) {
      Note("NULL");
      return NULL;
    }
    storage = Text();
    return storage.c_str();
  }

  template <size_t N>
  const char* OneOf(const char* const (&names)[N]) {
    const char* name = names[Pick(N)];
    Note(name);
    return name;
  }

  static void Die(const std::string& message) {
    fprintf(stderr, "korrin-fuzz: %s\n", message.c_str());
    abort();
  }

  std::string trace;  // the arguments of the current step, as read

 private:
  void Note(const std::string& text) { trace += " " + text; }

  // 0 to n - 1, from one byte at the end (n is at most 256).
  unsigned Pick(size_t n) {
    if (n < 2) return 0;
    return m_data.ConsumeIntegralInRange<unsigned>(0, n - 1);
  }
  // Up to |max| bytes from the front, NULs dropped.
  std::string Raw(size_t max) {
    std::string text = m_data.ConsumeRandomLengthString(max);
    text.erase(std::remove(text.begin(), text.end(), '\0'), text.end());
    return text;
  }

  FuzzedDataProvider& m_data;
};

// ---- The harness's own state, outside the engine.

struct Harness {
  std::string root;       // the device root, a fresh temporary folder
  sqlite3* side = NULL;   // the harness's own connection to the layout database
  bool sideLocked = false;
  bool tracing = false;
  std::map<std::string, int> baselineHandles;
  // The engine's five callbacks, as data_engin_initialization() set them.
  boost::function<void(const char*)> onInstalled, onUpdated, onUninstalled, onCardChanged;
  boost::function<void(std::vector<std::string>)> onDeactivated;
};
Harness g;

sim::Device& Dev() { return sim::Device::Get(); }
LauncherDataManager& Store() { return korrin::DataManager(); }
LauncherPackageManager& Tracker() { return korrin::PackageManager(); }

bool SideSql(const char* sql) { return sqlite3_exec(g.side, sql, NULL, NULL, NULL) == SQLITE_OK; }

// ---- Records and device packages from the input.

GameViewData Menu(Input& in) {
  GameViewData menu;
  menu.menuId = in.Int();
  menu.name = in.Text();
  menu.type = in.Int();
  return menu;
}

GamePageData Page(Input& in) {
  GamePageData page;
  page.pageId = in.Int();
  page.isFolder = in.Bool();
  page.parentId = in.Int();
  page.pageNo = in.Int();
  return page;
}

GameBoxData Box(Input& in) {
  GameBoxData box;
  box.boxId = in.Int();
  box.pageId = in.Int();
  box.parentId = in.Int();
  box.col = in.Int();
  box.row = in.Int();
  unsigned flags = in.Choose(16);
  box.isFolder = flags & 1;
  box.isPreload = flags & 2;
  box.isSystem = flags & 4;
  box.isOnStorageCard = flags & 8;
  box.boxType = in.Int();
  box.launchType = in.Int();
  box.appId = in.Text();
  box.name = in.Text();
  box.iconPath = in.Text();
  box.content = in.Text();
  return box;
}

// A package of one to three applications; all flags 0 is an ordinary
// downloaded game.
sim::Package Pkg(Input& in) {
  sim::Package pkg;
  pkg.id = in.Text();
  unsigned flags = in.Choose(64);
  pkg.system = flags & 1;
  pkg.removable = !(flags & 2);
  pkg.preload = flags & 4;
  pkg.supportDisable = flags & 8;
  pkg.disabled = flags & 16;
  if (flags & 32) pkg.type = in.Text();
  for (unsigned n = 1 + in.Choose(3); n > 0; --n) {
    sim::App app = sim::GameApp(in.Text(), "");
    unsigned a = in.Choose(256);
    app.game = !(a & 1);
    app.noDisplay = a & 2;
    app.enabled = !(a & 4);
    if (a & 8) {
      app.label.reset();
    } else {
      app.label = in.Text();
    }
    if (a & 16) {
      app.icon = (a & 32) ? std::optional<std::string>("") : std::nullopt;
    } else if (a & 32) {
      app.icon = in.Text();
    }
    if (a & 64) app.categories.push_back(kFloatingCategory);
    if (a & 128) {
      app.metadata.push_back({kMenuLaunchKey, in.Bool() ? in.Text() : APP_CONTROL_OPERATION_MAIN});
    }
    pkg.apps.push_back(app);
  }
  return pkg;
}

struct Event {
  std::string type, pkgId;
  int eventType, state, progress, error;
};

Event ReadEvent(Input& in) {
  Event e;
  e.type = in.Text();
  e.pkgId = in.Text();
  e.eventType = in.Int();
  e.state = in.Int();
  e.progress = in.Int();
  e.error = in.Int();
  return e;
}

// A package event handed to the tracker as the platform would, or straight
// to its handler. Values outside the enums pass as the platform passes them.
void SendToTracker(Input& in, bool direct) {
  std::string typeText, pkgText;
  const char* type = in.NullableText(typeText);
  const char* pkg = in.NullableText(pkgText);
  int eventType = in.Int(), state = in.Int(), progress = in.Int(), error = in.Int();
  if (direct) {
    Tracker().OnClientListenCb(type, pkg, static_cast<package_manager_event_type_e>(eventType),
                               static_cast<package_manager_event_state_e>(state), progress,
                               static_cast<package_manager_error_e>(error), &Tracker());
  } else {
    LauncherPackageManager::_PkgMgrClientListenCb(
        type, pkg, static_cast<package_manager_event_type_e>(eventType),
        static_cast<package_manager_event_state_e>(state), progress,
        static_cast<package_manager_error_e>(error), &Tracker());
  }
}

// An application handle opened by id for one step; null when it did not open.
class AppHandle {
 public:
  explicit AppHandle(const std::string& id) : m_info(NULL) {
    if (app_info_create(id.c_str(), &m_info) != APP_MANAGER_ERROR_NONE) m_info = NULL;
  }
  ~AppHandle() {
    if (m_info != NULL) app_info_destroy(m_info);
  }
  app_info_h& Get() { return m_info; }

 private:
  app_info_h m_info;
};

BoxPtr NewBox() { return BoxPtr(new GameBoxData); }

// A menu just stored reads back with the very name that went in. (An insert
// that did not run still returns the last row id, so a locked store is left
// out.)
void CheckMenuStored(const GameViewData& menu, int menuId) {
  if (menuId <= 0 || g.sideLocked || menu.name.empty()) return;
  std::string stored = Store().GetMenuData(menuId)->name;
  if (stored != menu.name) {
    Input::Die("menu " + std::to_string(menuId) + " stored " + Shown(menu.name) + ", reads " +
               Shown(stored));
  }
}

// ---- Steps that call one method with arguments of these types, read in the
// order of its parameters.

void Read(Input& in, int& value) { value = in.Int(); }
void Read(Input& in, bool& value) { value = in.Bool(); }
void Read(Input& in, std::string& value) { value = in.Text(); }
void Read(Input& in, GameViewData& value) { value = Menu(in); }
void Read(Input& in, GamePageData& value) { value = Page(in); }
void Read(Input& in, GameBoxData& value) { value = Box(in); }
void Read(Input&, BoxPtr& value) { value = NewBox(); }

// The fold over the comma reads left to right; a call's own arguments would
// be read in an order the compiler picks.
template <typename T, typename C, typename R, typename... P>
void Call(T& object, R (C::*method)(P...), Input& in) {
  std::tuple<std::decay_t<P>...> args;
  std::apply([&in](auto&... arg) { (Read(in, arg), ...); }, args);
  std::apply([&object, method](auto&... arg) { (object.*method)(arg...); }, args);
}

#define STORE(method) \
  { "store." #method, [](Input& in) { Call(Store(), &LauncherDataManager::method, in); } }
#define TRACKER(method) \
  { "tracker." #method, [](Input& in) { Call(Tracker(), &LauncherPackageManager::method, in); } }

// The platform callbacks that take a component type and an application id,
// and those that take an application handle, each with a list to fill.
void AppIdListCb(Input& in, bool (*callback)(package_info_app_component_type_e, const char*,
                                             void*)) {
  unsigned component = in.Choose(4);
  std::string text;
  const char* appId = in.NullableText(text);
  std::vector<std::string> appIds;
  callback(static_cast<package_info_app_component_type_e>(component), appId, &appIds);
}

void AppHandleListCb(Input& in, bool (*callback)(app_info_h, void*)) {
  AppHandle info(in.Text());
  std::vector<std::string> texts;
  callback(info.Get(), &texts);
}

void Emit(const Event& e) {
  Dev().EmitPackageEvent(e.type, e.pkgId, e.eventType, e.state, e.progress, e.error);
}

// ---- The steps.

struct Step {
  const char* name;
  void (*run)(Input& in);
};

const Step kSteps[] = {
    // The device.
    {"device.add", [](Input& in) { Dev().AddPackage(Pkg(in)); }},
    {"device.remove", [](Input& in) { Dev().RemovePackage(in.Text()); }},
    {"device.install", [](Input& in) { Dev().Install(Pkg(in)); }},
    {"device.update", [](Input& in) { Dev().Update(Pkg(in)); }},
    {"device.uninstall", [](Input& in) { Dev().Uninstall(in.Text()); }},
    {"device.event", [](Input& in) { Emit(ReadEvent(in)); }},
    {"device.card",
     [](Input& in) {
       if (in.Bool()) {
         Dev().RemovePreference(kCardKey);
       } else {
         Dev().SetPreference(kCardKey, in.Int());
       }
     }},
    {"device.screen",
     [](Input& in) {
       Dev().SetSystemInfo("http://tizen.org/feature/screen.width", in.Int());
       Dev().SetSystemInfo("http://tizen.org/feature/screen.height", in.Int());
     }},
    {"device.mdm",
     [](Input& in) {
       bool reachable = !in.Bool();
       std::map<std::string, mdm_status_t> states;
       for (unsigned n = in.Choose(4); n > 0; --n) {
         std::string id = in.Text();
         states[id] = static_cast<mdm_status_t>(static_cast<int>(in.Choose(3)) - 1);
       }
       Dev().SetMdm(reachable, states);
     }},
    {"device.boot-done",
     [](Input& in) {
       Dev().SendBusSignal(kBootPath, kBootInterface, in.Bool() ? in.Text() : "BootingDone");
     }},
    {"device.fail",
     [](Input& in) {
       const char* call = in.OneOf(kCalls);
       int error = in.Int();
       if (error == 0) error = -1;
       if (in.Bool()) {
         Dev().FailAlways(call, error);
       } else {
         Dev().FailNext(call, error, static_cast<int>(in.Choose(4)));
       }
     }},
    {"device.before",
     [](Input& in) {
       const char* call = in.OneOf(kCalls);
       std::function<void()> action;
       switch (in.Choose(4)) {
         case 0: action = [pkg = Pkg(in)] { Dev().Install(pkg); }; break;
         case 1: action = [pkg = Pkg(in)] { Dev().Update(pkg); }; break;
         case 2: action = [id = in.Text()] { Dev().Uninstall(id); }; break;
         default: action = [e = ReadEvent(in)] { Emit(e); }; break;
       }
       // An empty callback slot throws out of the nested event only: on a device
       // events never arrive inside a platform call, so the engine frames
       // around it need not expect an exception.
       Dev().BeforeNext(call, [action] {
         try {
           action();
         } catch (const boost::bad_function_call&) {
         }
       });
     }},
    {"device.sample", [](Input&) { Dev().LoadSampleDevice(); }},
    // Another process takes the database's exclusive lock, or lets it go.
    {"device.lock",
     [](Input&) {
       g.sideLocked = g.sideLocked ? !SideSql("ROLLBACK") : SideSql("BEGIN EXCLUSIVE");
     }},

    // The entry points and the exported database helpers.
    {"engine.start", [](Input&) { data_engin_initialization(); }},
    {"engine.stop",
     [](Input&) {
       data_engin_uninitialization();
       korrin_data_probe();
     }},
    {"engine.db_util",
     [](Input& in) {
       std::string path = korrin::DevicePath(korrin::kGameDataDbPath);
       sqlite3* db = NULL;
       switch (in.Choose(3)) {
         case 0: db_util_open(path.c_str(), &db, 0); break;
         case 1: db_util_open_with_options(path.c_str(), &db, SQLITE_OPEN_READONLY, NULL); break;
         default:
           db_util_open_with_options(path.c_str(), &db, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE,
                                     NULL);
           break;
       }
       db_util_close(db);
     }},

    // The layout store.
    {"store.Initialize", [](Input&) { Store().Initialize(Tracker()); }},
    STORE(_OpenDb), STORE(_CreateTables), STORE(_CloseDb), STORE(BeginTransaction),
    STORE(CommitTransaction), STORE(RollbackTransaction),
    {"store.InsertMenuData",
     [](Input& in) {
       GameViewData menu = Menu(in);
       CheckMenuStored(menu, Store().InsertMenuData(menu));
     }},
    STORE(GetMenuData), STORE(UpdateMenuData), STORE(DeleteMenuData), STORE(GetMenuDataCount),
    STORE(GetMenuDataList), STORE(InsertPageData), STORE(UpdatePageData), STORE(DeletePageData),
    STORE(DeleteFolderPageData), STORE(GetMenuPageData), STORE(GetPageDataCount),
    STORE(_GetPageDataCountByDownload),
    {"store.PageDataForAlphaBeticalOrder",
     [](Input& in) {
       GamePageData page = Page(in);
       Store().InsertPageDataForAlphaBeticalOrder(page);
       Store().UpdatePageDataForAlphaBeticalOrder(page);
       Store().DeletePageDataForAlphaBeticalOrder(page.pageId);
     }},
    {"store.InsertBoxData",  // overloaded: the record form
     [](Input& in) {
       GameBoxData box = Box(in);
       Store().InsertBoxData(box);
     }},
    STORE(UpdateBoxData), STORE(DeleteBoxData), STORE(GetMenuBoxData),
    {"store.GetBoxIdByAppId",
     [](Input& in) {
       int parentId = 0, pageId = 0, boxId = 0;
       Store().GetBoxIdByAppId(in.Text(), &parentId, &pageId, &boxId);
     }},
    STORE(GetBoxDataByAppId), STORE(GetBoxDataCount), STORE(GetPageDataList),
    STORE(GetBoxDataList), STORE(GetBoxDataListByAppId), STORE(GetBoxDataListByDownload),
    STORE(GetPageDataListByDownload),
    {"store.InsertBoxData(appId)",
     [](Input& in) {
       bool pageAdded = false;
       Store().InsertBoxData(in.Text(), pageAdded);
     }},
    STORE(InsertBoxDataForDeactivatedApp), STORE(DeleteBoxDataForDeactivatedApp),
    STORE(_ReorderData), STORE(_ReorderDataWithoutSpace), STORE(RearrangeAppsPosition),
    STORE(GetBoxDataListByAlphabeticalOrder), STORE(GetBoxDataListByAlphabeticalOrderWithRealPage),
    STORE(GetPageDataListByAlphabeticalOrder), STORE(InsertBoxDataForAlphaBeticalOrder),
    STORE(UpdateBoxDataForAlphaBeticalOrder), STORE(DeleteBoxDataForAlphaBeticalOrder),

    // The package tracker. Initialize with empty slots makes the next
    // callback throw, as the launcher's own would.
    {"tracker.Initialize",
     [](Input& in) {
       if (in.Bool()) {
         Tracker().Initialize({}, {}, {}, {}, {});
       } else {
         Tracker().Initialize(g.onInstalled, g.onUpdated, g.onUninstalled, g.onDeactivated,
                              g.onCardChanged);
       }
     }},
    {"tracker._PkgMgrClientListenCb", [](Input& in) { SendToTracker(in, false); }},
    {"tracker.OnClientListenCb", [](Input& in) { SendToTracker(in, true); }},
    TRACKER(PauseListenCb), TRACKER(StartListenCb),
    {"tracker._DoPkgJob",
     [](Input& in) {
       boost::shared_ptr<LauncherPackageManager::PkgData> job(new LauncherPackageManager::PkgData);
       job->type = static_cast<LauncherPackageManager::PkgJobType>(in.Int());
       job->pkgId = in.Text();
       for (unsigned n = in.Choose(4); n > 0; --n) job->appIds.push_back(in.Text());
       Tracker()._DoPkgJob(job);
     }},
    TRACKER(Terminate), TRACKER(_RegisterEdbusSignalHandler),
    TRACKER(UnregisterEdbusSignalHandler), TRACKER(OnMMCStatusChanged),
    {"tracker._BootingDoneSignalCb",
     [](Input& in) {
       LauncherPackageManager::_BootingDoneSignalCb(in.Bool() ? &Tracker() : NULL, NULL);
     }},
    TRACKER(GetAppInfo), TRACKER(GetAppName),
    {"tracker._GetAppInfo", [](Input& in) { Tracker()._GetAppInfo(in.Text(), NewBox()); }},
    {"tracker._GetAppInfo(handle)",
     [](Input& in) {
       AppHandle info(in.Text());
       if (info.Get() != NULL) Tracker()._GetAppInfo(info.Get(), NewBox());
     }},
    // The launcher changes the records it was handed, and so the cache.
    {"tracker.cached-record",
     [](Input& in) {
       std::map<std::string, BoxPtr>::iterator found = Tracker().m_appInfoCache.find(in.Text());
       unsigned change = in.Choose(8);
       if (found == Tracker().m_appInfoCache.end()) return;
       GameBoxData& record = *found->second;
       record.isOnStorageCard = change & 1;
       if (change & 2) record.name.clear();
       if (change & 4) record.iconPath.clear();
     }},
    {"tracker.GetAppIdList",
     [](Input& in) {
       std::vector<std::string> appIds;
       for (unsigned n = in.Choose(3); n > 0; --n) appIds.push_back(in.Text());
       Tracker().GetAppIdList(appIds);
     }},
    {"tracker._GetAppIds",
     [](Input& in) {
       std::string text;
       Tracker()._GetAppIds(in.NullableText(text));
     }},
    TRACKER(_IsMenuLaunch),
    {"tracker._GetAllAppsInfoCb",
     [](Input& in) {
       AppHandle info(in.Text());
       LauncherPackageManager::_GetAllAppsInfoCb(info.Get(), in.Bool() ? NULL : &Tracker());
     }},
    {"tracker._PkgMgrAppInfoGetListCb",
     [](Input& in) { AppIdListCb(in, LauncherPackageManager::_PkgMgrAppInfoGetListCb); }},
    {"tracker._has_mini_app_cb",
     [](Input& in) {
       AppHandle info(in.Text());
       bool found = false;
       LauncherPackageManager::_has_mini_app_cb(info.Get(), in.Bool() ? NULL : &found);
     }},
    {"tracker._app_metadata_list_cb",
     [](Input& in) {
       std::string keyText, valueText;
       const char* key = in.NullableText(keyText);
       const char* value = in.NullableText(valueText);
       bool found = false;
       LauncherPackageManager::_app_metadata_list_cb(key, value, in.Bool() ? NULL : &found);
     }},
    TRACKER(LoadDeactivatedAppList), TRACKER(_GetDeactivatedAppIds),
    TRACKER(_GetDeactivatedAppInfo), TRACKER(_GetDeactivatedPkgInfo),
    {"tracker._PkgMgrDeactivatedPackageInfoGetListCb",
     [](Input& in) {
       package_info_h pkg = NULL;
       if (package_info_create(in.Text().c_str(), &pkg) != PACKAGE_MANAGER_ERROR_NONE) pkg = NULL;
       std::vector<std::string> appIds;
       LauncherPackageManager::_PkgMgrDeactivatedPackageInfoGetListCb(pkg, &appIds);
       if (pkg != NULL) package_info_destroy(pkg);
     }},
    {"tracker._PkgMgrDeactivatedAppInfoGetListCb",
     [](Input& in) {
       AppIdListCb(in, LauncherPackageManager::_PkgMgrDeactivatedAppInfoGetListCb);
     }},
    {"tracker._PkgMgrDeactivatedAppInfoGetCb",
     [](Input& in) {
       AppHandleListCb(in, LauncherPackageManager::_PkgMgrDeactivatedAppInfoGetCb);
     }},
    {"tracker._PkgMgrDeactivatedPkgInfoGetCb",
     [](Input& in) {
       AppHandleListCb(in, LauncherPackageManager::_PkgMgrDeactivatedPkgInfoGetCb);
     }},
    TRACKER(IsMDMAllowed), TRACKER(IsMDMRestriected),

    // The small services.
    {"service.InsertLog",
     [](Input& in) {
       std::string texts[4];
       const char* appId = in.NullableText(texts[0]);
       const char* feature = in.NullableText(texts[1]);
       const char* extra = in.NullableText(texts[2]);
       const char* value = in.NullableText(texts[3]);
       LogClientManager client;
       client.InsertLog(appId, feature, extra, value, in.Bool());
     }},
    {"service.SystemInfo",
     [](Input&) {
       SystemInfo::GetScreenResolution();
       SystemInfo::GetCurrentDate();
       SystemInfo::IsMdmEnabled();
     }},
    {"service.to_string",
     [](Input& in) {
       int value = in.Int();
       Korrin3D::to_string(value);
       Korrin3D::to_string(static_cast<unsigned int>(value));
     }},
};
const size_t kStepCount = sizeof kSteps / sizeof kSteps[0];
static_assert(kStepCount <= 256, "a step is picked by one byte");

// Runs the input's steps, printing each with its arguments when tracing.
void RunSteps(Input& in) {
  for (int steps = 0; in.More() && steps < kMaxSteps; ++steps) {
    const Step& step = kSteps[in.Step(kStepCount)];
    in.trace.clear();
    try {
      step.run(in);
    } catch (const boost::bad_function_call&) {
      in.trace += " -> bad_function_call";
    }
    Dev().ClearLogs();  // nobody reads them, and long texts make them big
    if (g.tracing) fputs((step.name + in.trace + "\n").c_str(), stderr);
  }
}

// ---- Between inputs: put everything back, then check what must hold.

void CheckHandles() {
  std::map<std::string, int> open = Dev().OpenHandlesByKind();
  if (open == g.baselineHandles) return;
  auto list = [](const std::map<std::string, int>& handles) {
    std::string text;
    for (const auto& kind : handles) text += " " + kind.first + "=" + std::to_string(kind.second);
    return text;
  };
  Input::Die("platform handles open after the input:" + list(open) + "; before it:" +
             list(g.baselineHandles));
}

// Text travels only through bound parameters, so no input can drop a table.
void CheckSchema() {
  sqlite3_stmt* stmt = NULL;
  int tables = -1;
  if (sqlite3_prepare_v2(g.side,
                         "SELECT COUNT(*) FROM sqlite_master WHERE type = 'table' AND "
                         "name IN ('Menus', 'Pages', 'Boxes')",
                         -1, &stmt, NULL) == SQLITE_OK &&
      sqlite3_step(stmt) == SQLITE_ROW) {
    tables = sqlite3_column_int(stmt, 0);
  }
  sqlite3_finalize(stmt);
  if (tables != 3) Input::Die("the layout tables are not all there: " + std::to_string(tables));
}

void EndInput() {
  Dev().Reset();  // first, so that no fault or pending action reaches the steps below
  if (g.sideLocked && SideSql("ROLLBACK")) g.sideLocked = false;

  LauncherDataManager& store = Store();
  if (store.m_db != NULL && !sqlite3_get_autocommit(store.m_db)) store.RollbackTransaction();
  if (store.m_db == NULL) store._OpenDb();
  store.m_pageMap.clear();
  store.m_pageFlagMap.clear();

  LauncherPackageManager& tracker = Tracker();
  if (tracker.m_dbusConnection != NULL) tracker.UnregisterEdbusSignalHandler();
  while (Dev().BusInitCount() > 0) e_dbus_shutdown();
  LauncherPackageManager::s_bootSignalSubscriber = NULL;
  if (tracker.m_pkgMgr == NULL) package_manager_create(&tracker.m_pkgMgr);
  tracker.Initialize(g.onInstalled, g.onUpdated, g.onUninstalled, g.onDeactivated,
                     g.onCardChanged);
  tracker.m_appInfoCache.clear();
  tracker.m_pkgJobMap.clear();
  tracker.m_pkgJobList.clear();
  tracker.m_isListenPaused = false;
  tracker.m_isMmcInserted = false;

  CheckHandles();
  CheckSchema();
  if (!SideSql("DELETE FROM Boxes; DELETE FROM Pages; DELETE FROM Menus; "
               "DELETE FROM sqlite_sequence;")) {
    Input::Die(std::string("cannot empty the tables: ") + sqlite3_errmsg(g.side));
  }
  Dev().Reset();  // the logs and call counts of the clean-up
}

void RemoveRoot() {
  sqlite3_close(g.side);
  g.side = NULL;
  std::error_code ignored;
  std::filesystem::remove_all(g.root, ignored);
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  g.tracing = getenv("KORRIN_FUZZ_TRACE") != NULL;
  // On tmpfs when there is one: every insert commits, and syncing to a disk
  // would take most of the time. A crash leaves its root behind; roots are
  // named after their process, so a later run sweeps those of dead ones.
  std::string base = access("/dev/shm", W_OK) == 0 ? "/dev/shm" : "/tmp";
  std::error_code ignored;
  namespace fs = std::filesystem;
  for (fs::directory_iterator it(base, ignored), end; it != end; it.increment(ignored)) {
    std::string name = it->path().filename().string();
    int pid = name.rfind("korrin-fuzz-", 0) == 0 ? atoi(name.c_str() + 12) : 0;
    if (pid > 0 && kill(pid, 0) != 0 && errno == ESRCH) fs::remove_all(it->path(), ignored);
  }
  g.root = base + "/korrin-fuzz-" + std::to_string(getpid());
  std::filesystem::remove_all(g.root, ignored);
  if (!Dev().UseRoot(g.root)) Input::Die("cannot make a device root");
  atexit(RemoveRoot);

  data_engin_initialization();
  LauncherPackageManager& tracker = Tracker();
  g.onInstalled = tracker.m_onAppInstalled;
  g.onUpdated = tracker.m_onAppUpdated;
  g.onUninstalled = tracker.m_onAppUninstalled;
  g.onDeactivated = tracker.m_onDeactivatedAppIds;
  g.onCardChanged = tracker.m_onStorageCardAppChanged;
  if (sqlite3_open(korrin::DevicePath(korrin::kGameDataDbPath).c_str(), &g.side) != SQLITE_OK ||
      !SideSql("PRAGMA journal_mode = PERSIST")) {
    Input::Die("cannot open the layout database");
  }
  g.baselineHandles = Dev().OpenHandlesByKind();
  EndInput();
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  FuzzedDataProvider data(bytes, size);
  Input in(data);
  RunSteps(in);
  EndInput();
  return 0;
}
