// The device-management service: reachable or not, and a policy state per
// application (MDM_ALLOWED for any not named). Connections are counted as
// open handles until released.
#include <mdm.h>

#include "state.h"

namespace {

// An injected error as the call's own result type: values outside it would
// be undefined for the caller's enum.
mdm_result_t AsResult(int error) {
  return error >= MDM_RESULT_SERVICE_NOT_ENABLED && error < MDM_RESULT_SUCCESS
             ? static_cast<mdm_result_t>(error)
             : MDM_RESULT_FAIL;
}

mdm_status_t AsStatus(int error) {
  return error >= MDM_STATUS_ERROR && error <= MDM_RESTRICTED ? static_cast<mdm_status_t>(error)
                                                              : MDM_STATUS_ERROR;
}

}  // namespace

namespace sim {

void Device::SetMdm(bool reachable, const std::map<std::string, mdm_status_t>& states) {
  TheState().mdmReachable = reachable;
  TheState().mdmStates = states;
}

}  // namespace sim

extern "C" {

mdm_result_t mdm_get_service(void) {
  if (int error = sim::Enter("mdm_get_service")) return AsResult(error);
  sim::State& state = sim::TheState();
  if (!state.mdmReachable) return MDM_RESULT_FAIL;
  ++state.held.mdmConnections;
  return MDM_RESULT_SUCCESS;
}

int mdm_release_service(void) {
  if (int error = sim::Enter("mdm_release_service")) return error;
  int& connections = sim::TheState().held.mdmConnections;
  if (connections == 0) return MDM_RESULT_FAIL;
  --connections;
  return MDM_RESULT_SUCCESS;
}

mdm_status_t mdm_get_application_state(const char* app_id) {
  if (int error = sim::Enter("mdm_get_application_state")) return AsStatus(error);
  const sim::State& state = sim::TheState();
  if (state.held.mdmConnections == 0 || app_id == NULL) return MDM_STATUS_ERROR;
  std::map<std::string, mdm_status_t>::const_iterator found = state.mdmStates.find(app_id);
  return found == state.mdmStates.end() ? MDM_ALLOWED : found->second;
}

}  // extern "C"
