// Fault injection and call counting. Every platform call names itself on
// entry, so a test can make any of them fail, once or always, and can see how
// often the engine asked the platform for something.
#include <stdio.h>
#include <stdlib.h>

#include <set>
#include <stdexcept>

#include "state.h"

namespace sim {

namespace {

// Calls that return a result, and so can be made to fail.
const std::set<std::string>& FailableCalls() {
  static const std::set<std::string> calls = {
      "app_info_create", "app_info_destroy", "app_info_clone", "app_info_get_app_id",
      "app_info_get_package", "app_info_get_icon", "app_info_get_label", "app_info_get_type",
      "app_info_is_nodisplay", "app_info_is_enabled", "app_info_is_preload",
      "app_info_is_game", "app_info_foreach_metadata", "app_info_filter_create",
      "app_info_filter_destroy", "app_info_filter_add_bool", "app_info_filter_add_string",
      "app_info_filter_count_appinfo", "app_info_filter_foreach_appinfo",
      "app_manager_foreach_app_info", "app_manager_get_app_info",
      "package_manager_create", "package_manager_destroy", "package_manager_set_event_status",
      "package_manager_set_event_cb", "package_manager_unset_event_cb",
      "package_manager_get_package_info", "package_manager_filter_create",
      "package_manager_filter_destroy", "package_manager_filter_add_bool",
      "package_manager_filter_count", "package_manager_filter_foreach_package_info",
      "package_info_create", "package_info_destroy", "package_info_is_system_package",
      "package_info_is_removable_package", "package_info_is_preload_package",
      "package_info_foreach_app_from_package",
      "preference_get_int", "preference_set_int", "preference_is_existing",
      "preference_remove", "system_info_get_platform_int",
      "bundle_create", "bundle_free", "bundle_add_str", "bundle_get_str",
      "e_dbus_init", "e_dbus_bus_get", "e_dbus_signal_handler_add",
      "mdm_get_service", "mdm_release_service", "mdm_get_application_state",
      "velmora_log_manager_create", "velmora_log_manager_destroy",
      "velmora_log_manager_insert"};
  return calls;
}

// Calls without a result: counted only.
const std::set<std::string>& CountedCalls() {
  static const std::set<std::string> calls = {"e_dbus_shutdown", "e_dbus_connection_close",
                                              "e_dbus_signal_handler_del"};
  return calls;
}

void RequireKnown(const std::set<std::string>& calls, const char* name) {
  if (calls.count(name) == 0) {
    fprintf(stderr, "sim: platform call '%s' is not in the simulator's list\n", name);
    abort();
  }
}

}  // namespace

int Enter(const char* name) {
  RequireKnown(FailableCalls(), name);
  State& state = TheState();
  int call = ++state.callCounts[name];
  std::map<std::string, std::function<void()>>::iterator before = state.beforeNext.find(name);
  if (before != state.beforeNext.end()) {
    std::function<void()> action = std::move(before->second);
    state.beforeNext.erase(before);
    action();  // may make platform calls of its own
  }
  std::map<std::string, int>::const_iterator always = state.alwaysFail.find(name);
  if (always != state.alwaysFail.end()) return always->second;
  std::map<int, int>& pending = state.failAtCall[name];
  std::map<int, int>::iterator once = pending.find(call);
  if (once == pending.end()) return 0;
  int error = once->second;
  pending.erase(once);
  return error;
}

void Count(const char* name) {
  RequireKnown(CountedCalls(), name);
  ++TheState().callCounts[name];
}

void Device::FailNext(const std::string& call, int error, int skip) {
  if (FailableCalls().count(call) == 0) throw std::invalid_argument("cannot fail " + call);
  if (error == 0 || skip < 0) throw std::invalid_argument("a failure needs an error code");
  State& state = TheState();
  state.failAtCall[call][state.callCounts[call] + skip + 1] = error;
}

void Device::FailAlways(const std::string& call, int error) {
  if (FailableCalls().count(call) == 0) throw std::invalid_argument("cannot fail " + call);
  if (error == 0) throw std::invalid_argument("a failure needs an error code");
  TheState().alwaysFail[call] = error;
}

void Device::ClearFailures() {
  TheState().alwaysFail.clear();
  TheState().failAtCall.clear();
}

void Device::BeforeNext(const std::string& call, std::function<void()> action) {
  if (FailableCalls().count(call) == 0) throw std::invalid_argument("cannot act before " + call);
  TheState().beforeNext[call] = std::move(action);
}

int Device::CallCount(const std::string& call) const {
  if (FailableCalls().count(call) == 0 && CountedCalls().count(call) == 0) {
    throw std::invalid_argument("no platform call " + call);
  }
  std::map<std::string, int>::const_iterator count = TheState().callCounts.find(call);
  return count == TheState().callCounts.end() ? 0 : count->second;
}

std::vector<std::string> Device::PlatformCalls() {
  std::set<std::string> calls = FailableCalls();
  calls.insert(CountedCalls().begin(), CountedCalls().end());
  return std::vector<std::string>(calls.begin(), calls.end());
}

bool Device::CanFail(const std::string& call) {
  if (FailableCalls().count(call) != 0) return true;
  if (CountedCalls().count(call) != 0) return false;
  throw std::invalid_argument("no platform call " + call);
}

}  // namespace sim
