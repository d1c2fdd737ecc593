// Package information: one package's flags and its applications by component
// type, read from a copy taken when the handle was opened.
#include <package_manager.h>

#include "state.h"

using sim::HandleKind;

namespace {

bool Readable(package_info_h info) {
  return sim::IsLive(info, HandleKind::kPackageInfo) ||
         sim::IsLive(info, HandleKind::kLentPackageInfo);
}

template <typename Read>
int GetFlag(const char* call, package_info_h info, bool* out, Read read) {
  if (int error = sim::Enter(call)) return error;
  if (!Readable(info) || out == NULL) return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  *out = read(info->pkg);
  return PACKAGE_MANAGER_ERROR_NONE;
}

}  // namespace

namespace sim {

int OpenPackageInfo(const char* call, const char* pkgId, package_info_h* out) {
  if (int error = Enter(call)) return error;
  if (pkgId == NULL || out == NULL) return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  const Package* pkg = InstalledPackage(pkgId);
  if (pkg == NULL) return PACKAGE_MANAGER_ERROR_NO_SUCH_PACKAGE;
  package_info_s* info = new package_info_s{*pkg};
  Track(info, HandleKind::kPackageInfo);
  *out = info;
  return PACKAGE_MANAGER_ERROR_NONE;
}

}  // namespace sim

extern "C" {

int package_info_create(const char* package, package_info_h* package_info) {
  return sim::OpenPackageInfo("package_info_create", package, package_info);
}

int package_info_destroy(package_info_h package_info) {
  return sim::DestroyHandle("package_info_destroy", HandleKind::kPackageInfo, package_info,
                            PACKAGE_MANAGER_ERROR_INVALID_PARAMETER);
}

int package_info_is_system_package(package_info_h package_info, bool* system) {
  return GetFlag("package_info_is_system_package", package_info, system,
                 [](const sim::Package& pkg) { return pkg.system; });
}

int package_info_is_removable_package(package_info_h package_info, bool* removable) {
  return GetFlag("package_info_is_removable_package", package_info, removable,
                 [](const sim::Package& pkg) { return pkg.removable; });
}

int package_info_is_preload_package(package_info_h package_info, bool* preload) {
  return GetFlag("package_info_is_preload_package", package_info, preload,
                 [](const sim::Package& pkg) { return pkg.preload; });
}

int package_info_foreach_app_from_package(package_info_h package_info,
                                          package_info_app_component_type_e comp_type,
                                          package_info_app_cb callback, void* user_data) {
  if (int error = sim::Enter("package_info_foreach_app_from_package")) return error;
  if (!Readable(package_info) || callback == NULL || comp_type < PACKAGE_INFO_ALLAPP ||
      comp_type > PACKAGE_INFO_SERVICEAPP) {
    return PACKAGE_MANAGER_ERROR_INVALID_PARAMETER;
  }
  std::vector<sim::App> apps = package_info->pkg.apps;  // the callback may close the handle
  for (const sim::App& app : apps) {
    if (comp_type != PACKAGE_INFO_ALLAPP && app.component != comp_type) continue;
    if (!callback(app.component, app.id.c_str(), user_data)) break;
  }
  return PACKAGE_MANAGER_ERROR_NONE;
}

}  // extern "C"
