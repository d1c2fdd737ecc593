// Bundles: string pairs in the order they were added, each key once.
#include <bundle.h>

#include "state.h"

using sim::HandleKind;

namespace {

bool Live(bundle* b) { return sim::IsLive(b, HandleKind::kBundle); }

const std::string* ValueOf(const bundle* b, const char* key) {
  for (const auto& pair : b->pairs) {
    if (pair.first == key) return &pair.second;
  }
  return NULL;
}

}  // namespace

extern "C" {

bundle* bundle_create(void) {
  if (int error = sim::Enter("bundle_create")) {
    set_last_result(error);
    return NULL;
  }
  bundle* b = new bundle;
  sim::Track(b, HandleKind::kBundle);
  set_last_result(BUNDLE_ERROR_NONE);
  return b;
}

int bundle_free(bundle* b) {
  return sim::DestroyHandle("bundle_free", HandleKind::kBundle, b,
                            BUNDLE_ERROR_INVALID_PARAMETER);
}

int bundle_add_str(bundle* b, const char* key, const char* str) {
  if (int error = sim::Enter("bundle_add_str")) return error;
  if (!Live(b) || key == NULL || key[0] == '\0' || str == NULL) {
    return BUNDLE_ERROR_INVALID_PARAMETER;
  }
  if (ValueOf(b, key) != NULL) return BUNDLE_ERROR_KEY_EXISTS;
  b->pairs.push_back(std::make_pair(std::string(key), std::string(str)));
  return BUNDLE_ERROR_NONE;
}

int bundle_get_str(bundle* b, const char* key, char** str) {
  if (int error = sim::Enter("bundle_get_str")) return error;
  if (!Live(b) || key == NULL) return BUNDLE_ERROR_INVALID_PARAMETER;
  const std::string* value = ValueOf(b, key);
  if (value == NULL) return BUNDLE_ERROR_KEY_NOT_AVAILABLE;
  if (str != NULL) *str = const_cast<char*>(value->c_str());
  return BUNDLE_ERROR_NONE;
}

int bundle_get_count(bundle* b) { return Live(b) ? static_cast<int>(b->pairs.size()) : 0; }

}  // extern "C"
