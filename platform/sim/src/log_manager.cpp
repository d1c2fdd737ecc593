// The usage-log client, standing in for the closed library: each insert
// records a copy of its bundle with the provider it was addressed to, and
// answers at once.
#include <velmora_log_manager.h>

#include "state.h"

using sim::HandleKind;

extern "C" {

int velmora_log_manager_create(velmora_log_manager_h* handle) {
  return sim::CreateHandle("velmora_log_manager_create", HandleKind::kLogManager, handle,
                           VELMORA_LOG_MANAGER_ERROR_INVALID_PARAMETER);
}

int velmora_log_manager_destroy(velmora_log_manager_h handle) {
  return sim::DestroyHandle("velmora_log_manager_destroy", HandleKind::kLogManager, handle,
                            VELMORA_LOG_MANAGER_ERROR_INVALID_PARAMETER);
}

int velmora_log_manager_insert(velmora_log_manager_h handle, const char* provider_uri,
                               bundle* data, velmora_log_manager_insert_cb callback,
                               void* user_data, int* request_id) {
  if (int error = sim::Enter("velmora_log_manager_insert")) return error;
  if (!sim::IsLive(handle, HandleKind::kLogManager) || provider_uri == NULL ||
      !sim::IsLive(data, HandleKind::kBundle)) {
    return VELMORA_LOG_MANAGER_ERROR_INVALID_PARAMETER;
  }
  sim::State& state = sim::TheState();
  state.usageLogs.push_back(sim::UsageLog{provider_uri, data->pairs});
  int id = ++state.lastRequestId;
  if (request_id != NULL) *request_id = id;
  if (callback != NULL) callback(VELMORA_LOG_MANAGER_ERROR_NONE, id, user_data);
  return VELMORA_LOG_MANAGER_ERROR_NONE;
}

}  // extern "C"
