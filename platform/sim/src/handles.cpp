// The register of handles the platform handed out, so that a handle used
// after its release, released twice or of the wrong kind is refused, and so
// that tests can see every handle go back.
#include "state.h"

namespace sim {

namespace {

const char* KindName(HandleKind kind) {
  switch (kind) {
    case HandleKind::kAppInfo: return "app_info";
    case HandleKind::kAppInfoFilter: return "app_info_filter";
    case HandleKind::kPackageInfo: return "package_info";
    case HandleKind::kPackageManager: return "package_manager";
    case HandleKind::kPackageFilter: return "package_manager_filter";
    case HandleKind::kBundle: return "bundle";
    case HandleKind::kBusConnection: return "e_dbus_connection";
    case HandleKind::kBusSignalHandler: return "e_dbus_signal_handler";
    case HandleKind::kLogManager: return "velmora_log_manager";
    case HandleKind::kLentAppInfo:
    case HandleKind::kLentPackageInfo: return NULL;
  }
  return NULL;
}

}  // namespace

void Track(const void* handle, HandleKind kind) { TheState().held.handles[handle] = kind; }

bool IsLive(const void* handle, HandleKind kind) {
  if (handle == NULL) return false;
  const std::map<const void*, HandleKind>& handles = TheState().held.handles;
  std::map<const void*, HandleKind>::const_iterator found = handles.find(handle);
  return found != handles.end() && found->second == kind;
}

bool Untrack(const void* handle, HandleKind kind) {
  if (!IsLive(handle, kind)) return false;
  TheState().held.handles.erase(handle);
  return true;
}

int Device::OpenHandles() const {
  int open = 0;
  for (const auto& kind : OpenHandlesByKind()) open += kind.second;
  return open;
}

std::map<std::string, int> Device::OpenHandlesByKind() const {
  std::map<std::string, int> open;
  for (const auto& handle : TheState().held.handles) {
    const char* name = KindName(handle.second);
    if (name != NULL) ++open[name];
  }
  if (TheState().held.mdmConnections > 0) open["mdm_service"] = TheState().held.mdmConnections;
  return open;
}

}  // namespace sim
