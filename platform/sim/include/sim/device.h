// The simulated Tizen device behind the platform's C calls, and the control
// interface through which tests and tools set it up and watch it.
//
// There is one device per process. Its C calls (application and package
// information, package events, preferences, system information, bundles,
// e_dbus, device management, the usage-log client, dlog) read and change the
// state kept here. Everything happens on the calling thread: events and bus
// signals reach their listeners before the call that caused them returns.
#ifndef KORRIN_SIM_DEVICE_H_
#define KORRIN_SIM_DEVICE_H_

#include <mdm.h>
#include <package_info.h>

#include <functional>
#include <map>
#include <string>
#include <utility>
#include <vector>

// Boost's optional rather than std::optional: a host built as C++11 includes
// this header too.
#include <boost/optional.hpp>

namespace sim {

// One line of the platform log, as the engine wrote it.
struct LogLine {
  int priority;      // dlog priority: DLOG_WARN is 5, DLOG_ERROR is 6
  std::string tag;
  std::string text;  // the formatted message
};

// One application of a package, with every fact the platform reports on it.
struct App {
  std::string id;
  boost::optional<std::string> label;  // none: the platform gives a null label
  boost::optional<std::string> icon;   // none: a null icon path; "" is an empty one
  std::string type = "capp";         // app_info_get_type
  bool game = false;                 // app_info_is_game
  bool noDisplay = false;
  bool enabled = true;               // a disabled package disables its applications too
  bool taskManage = true;
  package_info_app_component_type_e component = PACKAGE_INFO_UIAPP;
  std::vector<std::string> categories;
  std::vector<std::pair<std::string, std::string>> metadata;  // in declared order
};

// One installed package and its applications, in declared order.
struct Package {
  std::string id;
  std::string type = "tpk";  // what package events report as the package type
  bool system = false;
  bool removable = true;
  bool preload = false;         // also what the read-only filter property selects
  bool supportDisable = false;  // the user may deactivate it
  bool disabled = false;        // deactivated
  std::vector<App> apps;
};

// A game (or, with PlainApp, any other application) labelled |label|, with an
// icon under its package's folder.
App GameApp(const std::string& appId, const std::string& label);
App PlainApp(const std::string& appId, const std::string& label);
// A downloaded package (removable, not preloaded, not system) holding |apps|.
Package MakePackage(const std::string& pkgId, std::vector<App> apps);

// One record sent through the usage-log client.
struct UsageLog {
  std::string provider;                                     // the provider URI
  std::vector<std::pair<std::string, std::string>> fields;  // bundle pairs, in added order
};

class Device {
 public:
  // The device of this process.
  static Device& Get();

  // Forgets everything the device was told or recorded (packages, preferences,
  // system keys, policy, injected failures, call counts, logs, usage logs), as
  // if freshly booted. Handles that the process holds stay valid and counted:
  // they belong to live objects, such as a listening package-manager client or
  // a bus subscription. The device root stays where it is.
  void Reset();

  // ---- Device root: where the device's file system lives on this machine.

  // Lays out |dir| as an installed launcher finds its device (the launcher's
  // data folder exists) and points KORRIN_SIM_ROOT at it. Returns false when a
  // folder cannot be made.
  bool UseRoot(const std::string& dir);
  // The current root (KORRIN_SIM_ROOT), or "" when none is set.
  std::string Root() const;
  // |devicePath| (an absolute path on the device) as a path on this machine.
  std::string HostPath(const std::string& devicePath) const;

  // ---- Packages and applications, listed in the order they were added.

  // Installs |pkg| silently (no event); a package with the same id is
  // replaced where it stands.
  void AddPackage(const Package& pkg);
  // A package named |appId| holding one game, or one other application.
  void AddGame(const std::string& appId, const std::string& label);
  void AddApp(const std::string& appId, const std::string& label);
  // Removes a package silently. False when there is none.
  bool RemovePackage(const std::string& pkgId);
  // What is installed now, to read or to change in place. The pointers are
  // null when nothing matches and stay valid until packages are added or
  // removed.
  const std::vector<Package>& Packages() const;
  Package* FindPackage(const std::string& pkgId);
  App* FindApp(const std::string& appId);

  // ---- Package events, sent to every client with an event callback, in the
  // order the clients were created, on the calling thread.

  // STARTED, PROCESSING, then the package is added, then COMPLETED.
  void Install(const Package& pkg);
  // STARTED, PROCESSING, then the package is replaced (or added), COMPLETED.
  void Update(const Package& pkg);
  // STARTED while its applications can still be read, PROCESSING, then the
  // package is removed, COMPLETED. False, and nothing sent, for an unknown id.
  bool Uninstall(const std::string& pkgId);
  // One raw event, whatever the device holds. Values outside the platform's
  // enums reach listeners as the plain integers the platform would send; a
  // C++ listener must not load them as its enum type (the sanitizers report
  // that), but read the integer behind them.
  void EmitPackageEvent(const std::string& type, const std::string& pkgId, int eventType,
                        int eventState, int progress = 0,
                        int error = 0 /* PACKAGE_MANAGER_ERROR_NONE */);
  // Clients that have an event callback set.
  int PackageListeners() const;

  // ---- Preferences and system information.

  void SetPreference(const std::string& key, int value);
  void RemovePreference(const std::string& key);
  // The storage-card status deviced keeps as a preference: 1 with a card in,
  // 0 without; SetStorageCardStatus stores any value the platform might hold,
  // ClearStorageCard leaves none.
  void SetStorageCard(bool inserted);
  void SetStorageCardStatus(int status);
  void ClearStorageCard();
  // An integer platform feature such as "http://tizen.org/feature/screen.width".
  void SetSystemInfo(const std::string& key, int value);

  // ---- Device management: whether mdm_get_service connects, and the state of
  // each application (applications not named are MDM_ALLOWED). Reachable with
  // everything allowed after Reset.
  void SetMdm(bool reachable, const std::map<std::string, mdm_status_t>& states = {});

  // ---- The system bus.

  // Sends a signal from |sender| to every matching handler on a system-bus
  // connection while e_dbus is initialised. Returns the handlers called.
  int SendBusSignal(const std::string& path, const std::string& interface,
                    const std::string& member, const std::string& sender = ":1.1");
  // deviced's "BootingDone", sent once the phone has booted. Returns the
  // handlers called.
  int SendBootDone();
  int BusInitCount() const;
  int BusSubscriptions() const;

  // ---- Fault injection and call counts, by the platform function's name
  // ("app_info_get_label"). A name the simulator does not know is a mistake in
  // the test and throws std::invalid_argument.

  // The call after the next |skip| ones returns |error| (a pointer-returning
  // call returns NULL, e_dbus_init 0, mdm_get_application_state |error|).
  void FailNext(const std::string& call, int error, int skip = 0);
  void FailAlways(const std::string& call, int error);
  void ClearFailures();
  // Runs |action| once, when |call| is next made, before the call does
  // anything else: the device acting in the middle of an engine operation,
  // such as a package that completes while the launcher starts.
  void BeforeNext(const std::string& call, std::function<void()> action);
  // How often |call| was made since the last Reset.
  int CallCount(const std::string& call) const;
  // Every platform call known by name here, in name order: those with a
  // result, which can be made to fail, and those without, only counted.
  static std::vector<std::string> PlatformCalls();
  // Whether |call| has a result, and so can be made to fail.
  static bool CanFail(const std::string& call);

  // ---- Handles: what the platform handed out and nobody released yet
  // (application and package information, filters, package-manager clients,
  // bundles, bus connections and subscriptions, log managers, device-management
  // connections). Handles lent to a callback for its duration do not count.

  int OpenHandles() const;
  std::map<std::string, int> OpenHandlesByKind() const;

  // ---- Records.

  // Every dlog line since the last Reset or ClearLogs, oldest first.
  const std::vector<LogLine>& Logs() const;
  void ClearLogs();
  // Also print each new line to stderr as "P/tag(pid): text". By default on
  // when the environment sets KORRIN_SIM_LOG=stderr, off when it sets another
  // value, and, unset or empty, on when stderr is a terminal.
  void EchoLogs(bool on);
  // Every record sent through the usage-log client since the last Reset.
  const std::vector<UsageLog>& UsageLogs() const;

  // ---- The sample device of the demo: a few dozen games, some other
  // applications, a no-display service, a deactivated package, a game
  // without an icon, a 720 by 1280 screen and no storage card. Adds to what
  // the device holds.
  void LoadSampleDevice();

  // ---- The phone's state beyond its packages, for tools that save a device
  // and bring it back (korrin-sim's `save` and `load`).

  const std::map<std::string, int>& Preferences() const;
  // Keys without their leading "http://".
  const std::map<std::string, int>& SystemInfo() const;
  bool MdmReachable() const;
  const std::map<std::string, mdm_status_t>& MdmStates() const;
  // Removes every package, preference and system-information key and makes
  // device management reachable with everything allowed, silently (no event).
  // Logs, failures, call counts and handles stay.
  void ClearPhone();

 private:
  Device();
  Device(const Device&);
  Device& operator=(const Device&);
};

}  // namespace sim

#endif  // KORRIN_SIM_DEVICE_H_
