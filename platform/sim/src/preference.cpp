// Preferences: integer values by key, such as the storage-card status
// "memory/sysman/mmc".
#include <app_preference.h>

#include "state.h"

namespace sim {

namespace {

// Where deviced keeps the storage-card status.
const char kStorageCardKey[] = "memory/sysman/mmc";

}  // namespace

void Device::SetPreference(const std::string& key, int value) {
  TheState().preferences[key] = value;
}

void Device::RemovePreference(const std::string& key) { TheState().preferences.erase(key); }

void Device::SetStorageCard(bool inserted) { SetStorageCardStatus(inserted ? 1 : 0); }

void Device::SetStorageCardStatus(int status) { SetPreference(kStorageCardKey, status); }

void Device::ClearStorageCard() { RemovePreference(kStorageCardKey); }

}  // namespace sim

extern "C" {

int preference_get_int(const char* key, int* value) {
  if (int error = sim::Enter("preference_get_int")) return error;
  if (key == NULL || value == NULL) return PREFERENCE_ERROR_INVALID_PARAMETER;
  const std::map<std::string, int>& preferences = sim::TheState().preferences;
  std::map<std::string, int>::const_iterator found = preferences.find(key);
  if (found == preferences.end()) return PREFERENCE_ERROR_NO_KEY;
  *value = found->second;
  return PREFERENCE_ERROR_NONE;
}

int preference_set_int(const char* key, int value) {
  if (int error = sim::Enter("preference_set_int")) return error;
  if (key == NULL) return PREFERENCE_ERROR_INVALID_PARAMETER;
  sim::TheState().preferences[key] = value;
  return PREFERENCE_ERROR_NONE;
}

int preference_is_existing(const char* key, bool* existing) {
  if (int error = sim::Enter("preference_is_existing")) return error;
  if (key == NULL || existing == NULL) return PREFERENCE_ERROR_INVALID_PARAMETER;
  *existing = sim::TheState().preferences.count(key) > 0;
  return PREFERENCE_ERROR_NONE;
}

int preference_remove(const char* key) {
  if (int error = sim::Enter("preference_remove")) return error;
  if (key == NULL) return PREFERENCE_ERROR_INVALID_PARAMETER;
  return sim::TheState().preferences.erase(key) > 0 ? PREFERENCE_ERROR_NONE
                                                    : PREFERENCE_ERROR_NO_KEY;
}

}  // extern "C"
