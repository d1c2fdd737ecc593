// The state of the simulated device, shared by the control interface and the
// platform's C calls, and the bodies of the handles those calls hand out.
// Internal to the simulator.
#ifndef KORRIN_SIM_STATE_H_
#define KORRIN_SIM_STATE_H_

#include <E_DBus.h>
#include <app_info.h>
#include <bundle.h>
#include <package_manager.h>
#include <velmora_log_manager.h>

#include <functional>
#include <map>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "sim/device.h"

// ---- Handle bodies. Each holds a copy of what it describes, so a handle
// opened before an uninstall still answers as the real platform's would.

struct app_info_s {
  sim::App app;
  std::string pkgId;
  bool enabled;  // the application's own flag and its package's
  bool preload;
};

struct app_info_filter_s {
  std::vector<std::pair<std::string, bool>> bools;
  std::vector<std::pair<std::string, std::string>> strings;
};

struct package_info_s {
  sim::Package pkg;
};

struct package_manager_s {
  package_manager_event_cb callback = nullptr;
  void* userData = nullptr;
  int statusMask = PACKAGE_MANAGER_STATUS_TYPE_ALL;
};

struct package_manager_filter_s {
  std::vector<std::pair<std::string, bool>> bools;
};

struct _bundle_t {
  std::vector<std::pair<std::string, std::string>> pairs;
};

struct E_DBus_Connection {
  DBusBusType type;
};

struct E_DBus_Signal_Handler {
  E_DBus_Connection* connection;
  std::string sender, path, interface, member;  // empty: any
  E_DBus_Signal_Cb callback;
  void* data;
};

struct DBusMessage {
  std::string sender, path, interface, member;
};

struct velmora_log_manager_s {};

namespace sim {

// The launcher's own folders on the device.
extern const char kLauncherDataDir[];

enum class HandleKind {
  kAppInfo,
  kAppInfoFilter,
  kPackageInfo,
  kPackageManager,
  kPackageFilter,
  kBundle,
  kBusConnection,
  kBusSignalHandler,
  kLogManager,
  // Lent to a callback for its duration; not the callee's to release.
  kLentAppInfo,
  kLentPackageInfo,
};

// What outlives Reset: the handles that the process holds.
struct Held {
  std::map<const void*, HandleKind> handles;
  std::vector<package_manager_s*> clients;            // in creation order
  std::vector<E_DBus_Signal_Handler*> busHandlers;    // in subscription order
  int busInitCount = 0;
  int mdmConnections = 0;
};

// Where each package, and the first application of each id, stands in the
// list, so that opening one by id does not walk thousands of packages. An
// append keeps it; any other change leaves it to be rebuilt at the next
// look-up. While FindPackage or FindApp has lent a package out, its ids may
// change behind the index, so look-ups walk the list until the next change.
struct PackageIndex {
  bool fresh = false;
  bool lent = false;
  std::unordered_map<std::string, size_t> packages;
  std::unordered_map<std::string, std::pair<size_t, size_t>> apps;  // package, app
};

struct State {
  // Records.
  std::vector<LogLine> logs;
  bool echoLogs = false;
  std::vector<UsageLog> usageLogs;
  int lastRequestId = 0;

  // What the device holds.
  std::vector<Package> packages;
  PackageIndex index;
  std::map<std::string, int> preferences;
  std::map<std::string, int> systemInfo;  // keys without "http://"
  bool mdmReachable = true;
  std::map<std::string, mdm_status_t> mdmStates;

  // Call counts, by the call's slot in the simulator's list (faults.cpp);
  // empty until the first call.
  std::vector<int> callCounts;
  // Fault injection, by platform function name: std::less<> finds a call by
  // its C string name without making a std::string of it.
  template <typename Value>
  using ByCall = std::map<std::string, Value, std::less<>>;
  ByCall<int> alwaysFail;                      // name -> error
  ByCall<std::map<int, int>> failAtCall;       // name -> call number -> error
  ByCall<std::function<void()>> beforeNext;    // name -> action, once

  Held held;
};

State& TheState();

// ---- Calls (faults.cpp).

// Counts a call of |name| and returns the error injected for it, or 0.
int Enter(const char* name);
// Counts a call of |name|, one that cannot fail (its result is void).
void Count(const char* name);

// ---- Handles (handles.cpp).

void Track(const void* handle, HandleKind kind);
bool IsLive(const void* handle, HandleKind kind);
// False, and nothing changes, when |handle| is not a live handle of |kind|.
bool Untrack(const void* handle, HandleKind kind);

// The usual create and destroy calls: |call| may fail; a missing out-parameter
// or a handle that is not live gives |invalid|.
template <typename Body>
int CreateHandle(const char* call, HandleKind kind, Body** out, int invalid) {
  if (int error = Enter(call)) return error;
  if (out == NULL) return invalid;
  Body* body = new Body();
  Track(body, kind);
  *out = body;
  return 0;
}

template <typename Body>
int DestroyHandle(const char* call, HandleKind kind, Body* handle, int invalid) {
  if (int error = Enter(call)) return error;
  if (!Untrack(handle, kind)) return invalid;
  delete handle;
  return 0;
}

// Lends |handle| as |kind| for the life of the guard.
class Lent {
 public:
  Lent(const void* handle, HandleKind kind) : m_handle(handle), m_kind(kind) {
    Track(handle, kind);
  }
  ~Lent() { Untrack(m_handle, m_kind); }
  Lent(const Lent&) = delete;
  Lent& operator=(const Lent&) = delete;

 private:
  const void* m_handle;
  HandleKind m_kind;
};

// ---- The device's contents.

const Package* InstalledPackage(const std::string& pkgId);
// The application and its package, or two nulls.
std::pair<const Package*, const App*> InstalledApp(const std::string& appId);
app_info_s AppInfoOf(const Package& pkg, const App& app);
// The same, taking |app| over: for a copy the caller no longer needs.
app_info_s AppInfoOf(const Package& pkg, App&& app);

// Opens a package's information for package_info_create and
// package_manager_get_package_info, which differ only in their name.
int OpenPackageInfo(const char* call, const char* pkgId, package_info_h* out);

// Sends one package event to every listening client, in creation order.
void DeliverPackageEvent(const std::string& type, const std::string& pkgId, int eventType,
                         int eventState, int progress, int error);

// ---- Strings handed to the caller, who frees them.

char* CopyText(const std::string& text);
char* CopyText(const boost::optional<std::string>& text);  // NULL for none

}  // namespace sim

#endif  // KORRIN_SIM_STATE_H_
