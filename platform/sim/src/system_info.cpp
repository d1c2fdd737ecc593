// System information: integer platform features, found with or without the
// key's leading "http://", as on the device.
#include <system_info.h>

#include "state.h"

namespace {

std::string WithoutScheme(const std::string& key) {
  static const std::string kScheme = "http://";
  return key.compare(0, kScheme.size(), kScheme) == 0 ? key.substr(kScheme.size()) : key;
}

}  // namespace

namespace sim {

void Device::SetSystemInfo(const std::string& key, int value) {
  TheState().systemInfo[WithoutScheme(key)] = value;
}

}  // namespace sim

extern "C" {

int system_info_get_platform_int(const char* key, int* value) {
  if (int error = sim::Enter("system_info_get_platform_int")) return error;
  if (key == NULL || value == NULL) return SYSTEM_INFO_ERROR_INVALID_PARAMETER;
  const std::map<std::string, int>& keys = sim::TheState().systemInfo;
  std::map<std::string, int>::const_iterator found = keys.find(WithoutScheme(key));
  if (found == keys.end()) return SYSTEM_INFO_ERROR_INVALID_PARAMETER;
  *value = found->second;
  return SYSTEM_INFO_ERROR_NONE;
}

}  // extern "C"
