// The phone's state as a whole: read out and cleared for tools that save a
// simulated device and bring it back.
#include "state.h"

namespace sim {

const std::map<std::string, int>& Device::Preferences() const { return TheState().preferences; }

const std::map<std::string, int>& Device::SystemInfo() const { return TheState().systemInfo; }

bool Device::MdmReachable() const { return TheState().mdmReachable; }

const std::map<std::string, mdm_status_t>& Device::MdmStates() const {
  return TheState().mdmStates;
}

void Device::ClearPhone() {
  // Through RemovePackage, so that the application index follows.
  while (!Packages().empty()) RemovePackage(Packages().back().id);
  State& state = TheState();
  state.preferences.clear();
  state.systemInfo.clear();
  SetMdm(true);
}

}  // namespace sim
