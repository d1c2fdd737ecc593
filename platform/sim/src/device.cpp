// The simulated device as a whole: its one state, Reset, the device root and
// the records (platform log, usage logs). Each platform area keeps its own
// part of the control interface beside its C calls.
#include "sim/device.h"

#include <errno.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "state.h"

namespace sim {

const char kLauncherDataDir[] = "/opt/usr/apps/com.velmora.korrin/data";

namespace {

// KORRIN_SIM_LOG=stderr echoes the log, any other value keeps it in; unset or
// empty, a host at a terminal sees it, so that a failure never goes unsaid,
// while tests (whose stderr is no terminal) see what they always saw.
bool EchoRequestedByEnvironment() {
  const char* value = getenv("KORRIN_SIM_LOG");
  if (value == NULL || *value == '\0') return isatty(STDERR_FILENO) == 1;
  return strcmp(value, "stderr") == 0;
}

bool MakeDirs(const std::string& path) {
  for (size_t slash = path.find('/', 1);; slash = path.find('/', slash + 1)) {
    std::string prefix = path.substr(0, slash);
    if (!prefix.empty() && mkdir(prefix.c_str(), 0755) != 0 && errno != EEXIST) return false;
    if (slash == std::string::npos) return true;
  }
}

}  // namespace

State& TheState() {
  static State* state = NULL;
  if (state == NULL) {
    state = new State;  // never destroyed: the engine may log from static destructors
    state->echoLogs = EchoRequestedByEnvironment();
  }
  return *state;
}

Device::Device() {}

Device& Device::Get() {
  static Device device;
  return device;
}

void Device::Reset() {
  State& state = TheState();
  bool echo = state.echoLogs;
  Held held = std::move(state.held);
  state = State();
  state.echoLogs = echo;
  state.held = std::move(held);
}

bool Device::UseRoot(const std::string& dir) {
  if (dir.empty() || !MakeDirs(dir + kLauncherDataDir)) return false;
  return setenv("KORRIN_SIM_ROOT", dir.c_str(), 1) == 0;
}

std::string Device::Root() const {
  const char* root = getenv("KORRIN_SIM_ROOT");
  return root != NULL ? root : "";
}

std::string Device::HostPath(const std::string& devicePath) const { return Root() + devicePath; }

const std::vector<LogLine>& Device::Logs() const { return TheState().logs; }

void Device::ClearLogs() { TheState().logs.clear(); }

void Device::EchoLogs(bool on) { TheState().echoLogs = on; }

const std::vector<UsageLog>& Device::UsageLogs() const { return TheState().usageLogs; }

char* CopyText(const std::string& text) { return strdup(text.c_str()); }

char* CopyText(const boost::optional<std::string>& text) {
  return text ? CopyText(*text) : NULL;
}

}  // namespace sim
