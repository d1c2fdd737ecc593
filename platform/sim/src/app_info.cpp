// Application information: opening one application by id (a disabled one
// too), its getters, and filtered queries over every installed application,
// disabled ones included. The application manager's own listing leaves
// disabled applications out, as the platform's ordinary queries do.
#include <app_manager.h>

#include <string.h>

#include <algorithm>

#include "state.h"

using sim::HandleKind;

namespace {

bool Readable(app_info_h info) {
  return sim::IsLive(info, HandleKind::kAppInfo) || sim::IsLive(info, HandleKind::kLentAppInfo);
}

int Open(const char* call, const char* appId, app_info_h* out) {
  if (int error = sim::Enter(call)) return error;
  if (appId == NULL || out == NULL) return APP_MANAGER_ERROR_INVALID_PARAMETER;
  std::pair<const sim::Package*, const sim::App*> found = sim::InstalledApp(appId);
  if (found.second == NULL) return APP_MANAGER_ERROR_NO_SUCH_APP;
  app_info_s* info = new app_info_s(sim::AppInfoOf(*found.first, *found.second));
  sim::Track(info, HandleKind::kAppInfo);
  *out = info;
  return APP_MANAGER_ERROR_NONE;
}

// |read| names the handle's text; it is copied once, into the caller's string.
template <typename Read>
int GetText(const char* call, app_info_h info, char** out, Read read) {
  if (int error = sim::Enter(call)) return error;
  if (!Readable(info) || out == NULL) return APP_MANAGER_ERROR_INVALID_PARAMETER;
  *out = sim::CopyText(read(*info));
  return APP_MANAGER_ERROR_NONE;
}

template <typename Read>
int GetFlag(const char* call, app_info_h info, bool* out, Read read) {
  if (int error = sim::Enter(call)) return error;
  if (!Readable(info) || out == NULL) return APP_MANAGER_ERROR_INVALID_PARAMETER;
  *out = read(*info);
  return APP_MANAGER_ERROR_NONE;
}

bool IsBoolProperty(const char* property) {
  return strcmp(property, PACKAGE_INFO_PROP_APP_NODISPLAY) == 0 ||
         strcmp(property, PACKAGE_INFO_PROP_APP_TASKMANAGE) == 0;
}

bool IsStringProperty(const char* property) {
  return strcmp(property, PACKAGE_INFO_PROP_APP_ID) == 0 ||
         strcmp(property, PACKAGE_INFO_PROP_APP_TYPE) == 0 ||
         strcmp(property, PACKAGE_INFO_PROP_APP_CATEGORY) == 0;
}

// Every condition of the filter must hold.
bool Matches(const app_info_filter_s& filter, const sim::App& app) {
  for (const auto& condition : filter.bools) {
    bool value = condition.first == PACKAGE_INFO_PROP_APP_NODISPLAY ? app.noDisplay
                                                                    : app.taskManage;
    if (value != condition.second) return false;
  }
  for (const auto& condition : filter.strings) {
    const std::string& wanted = condition.second;
    if (condition.first == PACKAGE_INFO_PROP_APP_ID) {
      if (app.id != wanted) return false;
    } else if (condition.first == PACKAGE_INFO_PROP_APP_TYPE) {
      if (app.type != wanted) return false;
    } else if (std::find(app.categories.begin(), app.categories.end(), wanted) ==
               app.categories.end()) {
      return false;
    }
  }
  return true;
}

// Calls |visit| with a lent handle on each application that |accept|s, in
// installation order, until |visit| returns false. Works on a copy, so the
// callback may change the device; each application is moved from the copy
// into its handle rather than copied twice.
template <typename Accept, typename Visit>
void ForEachApp(Accept accept, Visit visit) {
  std::vector<sim::Package> packages = sim::TheState().packages;
  for (sim::Package& pkg : packages) {
    for (sim::App& app : pkg.apps) {
      if (!accept(pkg, app)) continue;
      app_info_s info = sim::AppInfoOf(pkg, std::move(app));
      sim::Lent lent(&info, HandleKind::kLentAppInfo);
      if (!visit(&info)) return;
    }
  }
}

}  // namespace

extern "C" {

int app_info_create(const char* app_id, app_info_h* app_info) {
  return Open("app_info_create", app_id, app_info);
}

int app_manager_get_app_info(const char* app_id, app_info_h* app_info) {
  return Open("app_manager_get_app_info", app_id, app_info);
}

int app_info_destroy(app_info_h app_info) {
  return sim::DestroyHandle("app_info_destroy", HandleKind::kAppInfo, app_info,
                            APP_MANAGER_ERROR_INVALID_PARAMETER);
}

int app_info_clone(app_info_h* clone, app_info_h app_info) {
  if (int error = sim::Enter("app_info_clone")) return error;
  if (clone == NULL || !Readable(app_info)) return APP_MANAGER_ERROR_INVALID_PARAMETER;
  app_info_s* copy = new app_info_s(*app_info);
  sim::Track(copy, HandleKind::kAppInfo);
  *clone = copy;
  return APP_MANAGER_ERROR_NONE;
}

int app_info_get_app_id(app_info_h app_info, char** app_id) {
  return GetText("app_info_get_app_id", app_info, app_id,
                 [](const app_info_s& info) -> const auto& { return info.app.id; });
}

int app_info_get_package(app_info_h app_info, char** package) {
  return GetText("app_info_get_package", app_info, package,
                 [](const app_info_s& info) -> const auto& { return info.pkgId; });
}

int app_info_get_icon(app_info_h app_info, char** path) {
  return GetText("app_info_get_icon", app_info, path,
                 [](const app_info_s& info) -> const auto& { return info.app.icon; });
}

int app_info_get_label(app_info_h app_info, char** label) {
  return GetText("app_info_get_label", app_info, label,
                 [](const app_info_s& info) -> const auto& { return info.app.label; });
}

int app_info_get_type(app_info_h app_info, char** type) {
  return GetText("app_info_get_type", app_info, type,
                 [](const app_info_s& info) -> const auto& { return info.app.type; });
}

int app_info_is_nodisplay(app_info_h app_info, bool* nodisplay) {
  return GetFlag("app_info_is_nodisplay", app_info, nodisplay,
                 [](const app_info_s& info) { return info.app.noDisplay; });
}

int app_info_is_enabled(app_info_h app_info, bool* enabled) {
  return GetFlag("app_info_is_enabled", app_info, enabled,
                 [](const app_info_s& info) { return info.enabled; });
}

int app_info_is_preload(app_info_h app_info, bool* preload) {
  return GetFlag("app_info_is_preload", app_info, preload,
                 [](const app_info_s& info) { return info.preload; });
}

int app_info_is_game(app_info_h app_info, bool* is_game) {
  return GetFlag("app_info_is_game", app_info, is_game,
                 [](const app_info_s& info) { return info.app.game; });
}

int app_info_foreach_metadata(app_info_h app_info, app_info_metadata_cb callback,
                              void* user_data) {
  if (int error = sim::Enter("app_info_foreach_metadata")) return error;
  if (!Readable(app_info) || callback == NULL) return APP_MANAGER_ERROR_INVALID_PARAMETER;
  std::vector<std::pair<std::string, std::string>> metadata = app_info->app.metadata;
  for (const auto& pair : metadata) {
    if (!callback(pair.first.c_str(), pair.second.c_str(), user_data)) break;
  }
  return APP_MANAGER_ERROR_NONE;
}

int app_info_filter_create(app_info_filter_h* handle) {
  return sim::CreateHandle("app_info_filter_create", HandleKind::kAppInfoFilter, handle,
                           APP_MANAGER_ERROR_INVALID_PARAMETER);
}

int app_info_filter_destroy(app_info_filter_h handle) {
  return sim::DestroyHandle("app_info_filter_destroy", HandleKind::kAppInfoFilter, handle,
                            APP_MANAGER_ERROR_INVALID_PARAMETER);
}

int app_info_filter_add_bool(app_info_filter_h handle, const char* property, const bool value) {
  if (int error = sim::Enter("app_info_filter_add_bool")) return error;
  if (!sim::IsLive(handle, HandleKind::kAppInfoFilter) || property == NULL ||
      !IsBoolProperty(property)) {
    return APP_MANAGER_ERROR_INVALID_PARAMETER;
  }
  handle->bools.push_back(std::make_pair(std::string(property), value));
  return APP_MANAGER_ERROR_NONE;
}

int app_info_filter_add_string(app_info_filter_h handle, const char* property,
                               const char* value) {
  if (int error = sim::Enter("app_info_filter_add_string")) return error;
  if (!sim::IsLive(handle, HandleKind::kAppInfoFilter) || property == NULL || value == NULL ||
      !IsStringProperty(property)) {
    return APP_MANAGER_ERROR_INVALID_PARAMETER;
  }
  handle->strings.push_back(std::make_pair(std::string(property), std::string(value)));
  return APP_MANAGER_ERROR_NONE;
}

int app_info_filter_count_appinfo(app_info_filter_h handle, int* count) {
  if (int error = sim::Enter("app_info_filter_count_appinfo")) return error;
  if (!sim::IsLive(handle, HandleKind::kAppInfoFilter) || count == NULL) {
    return APP_MANAGER_ERROR_INVALID_PARAMETER;
  }
  app_info_filter_s filter = *handle;
  *count = 0;
  ForEachApp([&](const sim::Package&, const sim::App& app) { return Matches(filter, app); },
             [&](app_info_h) { return ++*count > 0; });
  return APP_MANAGER_ERROR_NONE;
}

int app_info_filter_foreach_appinfo(app_info_filter_h handle, app_info_filter_cb callback,
                                    void* user_data) {
  if (int error = sim::Enter("app_info_filter_foreach_appinfo")) return error;
  if (!sim::IsLive(handle, HandleKind::kAppInfoFilter) || callback == NULL) {
    return APP_MANAGER_ERROR_INVALID_PARAMETER;
  }
  app_info_filter_s filter = *handle;  // the callback may destroy the filter
  ForEachApp([&](const sim::Package&, const sim::App& app) { return Matches(filter, app); },
             [&](app_info_h info) { return callback(info, user_data); });
  return APP_MANAGER_ERROR_NONE;
}

int app_manager_foreach_app_info(app_manager_app_info_cb callback, void* user_data) {
  if (int error = sim::Enter("app_manager_foreach_app_info")) return error;
  if (callback == NULL) return APP_MANAGER_ERROR_INVALID_PARAMETER;
  ForEachApp(
      [](const sim::Package& pkg, const sim::App& app) { return app.enabled && !pkg.disabled; },
      [&](app_info_h info) { return callback(info, user_data); });
  return APP_MANAGER_ERROR_NONE;
}

}  // extern "C"
