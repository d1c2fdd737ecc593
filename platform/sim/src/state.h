// The state of the simulated device, shared by the control interface and the
// platform's C calls. Internal to the simulator.
#ifndef KORRIN_SIM_STATE_H_
#define KORRIN_SIM_STATE_H_

#include <string>
#include <vector>

#include "sim/device.h"

namespace sim {

// The launcher's own folders on the device.
extern const char kLauncherDataDir[];

struct State {
  State() : echoLogs(false) {}

  std::vector<LogLine> logs;
  bool echoLogs;
};

State& TheState();

}  // namespace sim

#endif  // KORRIN_SIM_STATE_H_
