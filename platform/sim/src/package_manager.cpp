// The package-manager client: listening clients and the delivery of package
// events to them, package-information look-up, and filtered queries over the
// installed packages (deactivated ones included).
#include <package_manager.h>
#include <string.h>

#include <algorithm>

#include "state.h"

using sim::HandleKind;

namespace {

const char* const kPackageProperties[] = {
    PACKAGE_MANAGER_PKGINFO_PROP_REMOVABLE, PACKAGE_MANAGER_PKGINFO_PROP_READONLY,
    PACKAGE_MANAGER_PKGINFO_PROP_SUPPORT_DISABLE, PACKAGE_MANAGER_PKGINFO_PROP_DISABLE,
    PACKAGE_MANAGER_PKGINFO_PROP_PRELOAD};

bool IsPackageProperty(const char* property) {
  for (const char* known : kPackageProperties) {
    if (strcmp(property, known) == 0) return true;
  }
  return false;
}

bool PackageProperty(const sim::Package& pkg, const std::string& property) {
  if (property == PACKAGE_MANAGER_PKGINFO_PROP_REMOVABLE) return pkg.removable;
  if (property == PACKAGE_MANAGER_PKGINFO_PROP_SUPPORT_DISABLE) return pkg.supportDisable;
  if (property == PACKAGE_MANAGER_PKGINFO_PROP_DISABLE) return pkg.disabled;
  return pkg.preload;  // preloaded packages are the read-only ones
}

bool Matches(const package_manager_filter_s& filter, const sim::Package& pkg) {
  for (const auto& condition : filter.bools) {
    if (PackageProperty(pkg, condition.first) != condition.second) return false;
  }
  return true;
}

// Calls |visit| with a lent handle on each package that |filter| selects, in
// installation order, until |visit| returns false.
template <typename Visit>
void ForEachPackage(const package_manager_filter_s& filter, Visit visit) {
  // A copy of the selected ones only: callbacks may change the device, and a
  // filter mostly selects a few of many.
  std::vector<sim::Package> selected;
  for (const sim::Package& pkg : sim::TheState().packages) {
    if (Matches(filter, pkg)) selected.push_back(pkg);
  }
  for (const sim::Package& pkg : selected) {
    package_info_s info{pkg};
    sim::Lent lent(&info, HandleKind::kLentPackageInfo);
    if (!visit(&info)) return;
  }
}

// The status flag that lets events of |type| through; 0 for an unknown type.
int StatusFlag(int type) {
  switch (type) {
    case PACKAGE_MANAGER_EVENT_TYPE_INSTALL: return PACKAGE_MANAGER_STATUS_TYPE_INSTALL;
    case PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL: return PACKAGE_MANAGER_STATUS_TYPE_UNINSTALL;
    case PACKAGE_MANAGER_EVENT_TYPE_UPDATE: return PACKAGE_MANAGER_STATUS_TYPE_UPGRADE;
    default: return 0;
  }
}

bool Client(package_manager_h manager) { return sim::IsLive(manager, HandleKind::kPackageManager); }

bool Filter(package_manager_filter_h filter) {
  return sim::IsLive(filter, HandleKind::kPackageFilter);
}

}  // namespace

namespace sim {

void DeliverPackageEvent(const std::string& type, const std::string& pkgId, int eventType,
                         int eventState, int progress, int error) {
  // A listener may create or destroy clients while it is told.
  std::vector<package_manager_s*> clients = TheState().held.clients;
  for (package_manager_s* client : clients) {
    if (!Client(client) || client->callback == NULL) continue;
    if (client->statusMask != PACKAGE_MANAGER_STATUS_TYPE_ALL &&
        (client->statusMask & StatusFlag(eventType)) == 0) {
      continue;
    }
    client->callback(type.c_str(), pkgId.c_str(),
                     static_cast<package_manager_event_type_e>(eventType),
                     static_cast<package_manager_event_state_e>(eventState), progress,
                     static_cast<package_manager_error_e>(error), client->userData);
  }
}

int Device::PackageListeners() const {
  int listening = 0;
  for (const package_manager_s* client : TheState().held.clients) {
    if (client->callback != NULL) ++listening;
  }
  return listening;
}

}  // namespace sim

extern "C" {

int package_manager_create(package_manager_h* manager) {
  int rc = sim::CreateHandle("package_manager_create", HandleKind::kPackageManager, manager,
                             PACKAGE_MANAGER_ERROR_INVALID_PARAMETER);
  if (rc == PACKAGE_MANAGER_ERROR_NONE) sim::TheState().held.clients.push_back(*manager);
  return rc;
}

int package_manager_destroy(package_manager_h manager) {
  if (int error = sim::Enter("package_manager_destroy")) return error;
  if (!sim::Untrack(manager, HandleKind::kPackageManager)) {
    return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  }
  std::vector<package_manager_s*>& clients = sim::TheState().held.clients;
  clients.erase(std::remove(clients.begin(), clients.end(), manager), clients.end());
  delete manager;
  return PACKAGE_MANAGER_ERROR_NONE;
}

int package_manager_set_event_status(package_manager_h manager, int status_type) {
  if (int error = sim::Enter("package_manager_set_event_status")) return error;
  if (!Client(manager) || status_type < 0) return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  manager->statusMask = status_type;
  return PACKAGE_MANAGER_ERROR_NONE;
}

int package_manager_set_event_cb(package_manager_h manager, package_manager_event_cb callback,
                                 void* user_data) {
  if (int error = sim::Enter("package_manager_set_event_cb")) return error;
  if (!Client(manager) || callback == NULL) return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  manager->callback = callback;
  manager->userData = user_data;
  return PACKAGE_MANAGER_ERROR_NONE;
}

int package_manager_unset_event_cb(package_manager_h manager) {
  if (int error = sim::Enter("package_manager_unset_event_cb")) return error;
  if (!Client(manager)) return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  manager->callback = NULL;
  manager->userData = NULL;
  return PACKAGE_MANAGER_ERROR_NONE;
}

int package_manager_get_package_info(const char* package_id, package_info_h* package_info) {
  return sim::OpenPackageInfo("package_manager_get_package_info", package_id, package_info);
}

int package_manager_filter_create(package_manager_filter_h* handle) {
  return sim::CreateHandle("package_manager_filter_create", HandleKind::kPackageFilter, handle,
                           PACKAGE_MANAGER_ERROR_INVALID_PARAMETER);
}

int package_manager_filter_destroy(package_manager_filter_h handle) {
  return sim::DestroyHandle("package_manager_filter_destroy", HandleKind::kPackageFilter, handle,
                            PACKAGE_MANAGER_ERROR_INVALID_PARAMETER);
}

int package_manager_filter_add_bool(package_manager_filter_h handle, const char* property,
                                    const bool value) {
  if (int error = sim::Enter("package_manager_filter_add_bool")) return error;
  if (!Filter(handle) || property == NULL || !IsPackageProperty(property)) {
    return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  }
  handle->bools.push_back(std::make_pair(std::string(property), value));
  return PACKAGE_MANAGER_ERROR_NONE;
}

int package_manager_filter_count(package_manager_filter_h handle, int* count) {
  if (int error = sim::Enter("package_manager_filter_count")) return error;
  if (!Filter(handle) || count == NULL) return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  *count = 0;
  ForEachPackage(*handle, [&](package_info_h) { return ++*count > 0; });
  return PACKAGE_MANAGER_ERROR_NONE;
}

int package_manager_filter_foreach_package_info(package_manager_filter_h handle,
                                                package_manager_package_info_cb callback,
                                                void* user_data) {
  if (int error = sim::Enter("package_manager_filter_foreach_package_info")) return error;
  if (!Filter(handle) || callback == NULL) return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  package_manager_filter_s filter = *handle;  // the callback may destroy the filter
  ForEachPackage(filter, [&](package_info_h info) { return callback(info, user_data); });
  return PACKAGE_MANAGER_ERROR_NONE;
}

}  // extern "C"
