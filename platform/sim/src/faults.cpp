// Fault injection and call counting. Every platform call names itself on
// entry, so a test can make any of them fail, once or always, and can see how
// often the engine asked the platform for something.
#include <stdio.h>
#include <stdlib.h>

#include <set>
#include <stdexcept>
#include <string_view>
#include <unordered_map>

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

// A known call: where its count stands in State::callCounts, and which list
// it is on.
struct KnownCall {
  size_t slot;
  bool failable;
};

// Both lists by name, hashed, for the look-up every platform call makes on
// entry: its C string name is viewed, not copied into a std::string.
const std::unordered_map<std::string_view, KnownCall>& KnownCalls() {
  static const std::unordered_map<std::string_view, KnownCall> known = [] {
    std::unordered_map<std::string_view, KnownCall> calls;
    for (const std::string& name : FailableCalls()) {
      calls.emplace(name, KnownCall{calls.size(), true});
    }
    for (const std::string& name : CountedCalls()) {
      calls.emplace(name, KnownCall{calls.size(), false});
    }
    return calls;
  }();
  return known;
}

// The count of |name|, a call on the list |failable| says, since the last Reset.
int& CountOf(const char* name, bool failable) {
  const std::unordered_map<std::string_view, KnownCall>& known = KnownCalls();
  auto found = known.find(name);
  if (found == known.end() || found->second.failable != failable) {
    fprintf(stderr, "sim: platform call '%s' is not in the simulator's list\n", name);
    abort();
  }
  std::vector<int>& counts = TheState().callCounts;
  if (counts.empty()) counts.resize(known.size());
  return counts[found->second.slot];
}

// How often |call|, a known one, was made since the last Reset.
int CountSoFar(const std::string& call) {
  const std::vector<int>& counts = TheState().callCounts;
  return counts.empty() ? 0 : counts[KnownCalls().at(call).slot];
}

}  // namespace

int Enter(const char* name) {
  int call = ++CountOf(name, true);
  State& state = TheState();
  auto before = state.beforeNext.find(name);
  if (before != state.beforeNext.end()) {
    std::function<void()> action = std::move(before->second);
    state.beforeNext.erase(before);
    action();  // may make platform calls of its own
  }
  auto always = state.alwaysFail.find(name);
  if (always != state.alwaysFail.end()) return always->second;
  auto pending = state.failAtCall.find(name);
  if (pending == state.failAtCall.end()) return 0;
  std::map<int, int>::iterator once = pending->second.find(call);
  if (once == pending->second.end()) return 0;
  int error = once->second;
  pending->second.erase(once);
  return error;
}

void Count(const char* name) { ++CountOf(name, false); }

void Device::FailNext(const std::string& call, int error, int skip) {
  if (FailableCalls().count(call) == 0) throw std::invalid_argument("cannot fail " + call);
  if (error == 0 || skip < 0) throw std::invalid_argument("a failure needs an error code");
  State& state = TheState();
  state.failAtCall[call][CountSoFar(call) + skip + 1] = error;
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
  return CountSoFar(call);
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
