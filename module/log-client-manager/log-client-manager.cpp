// The usage-log client: packs an event into a bundle and hands it to the
// closed log-client library, addressed to one of the two survey providers.
// Results of the bundle and insert calls are not checked, as the launcher
// has never relied on them.
#include "log-client-manager/log-client-manager.h"

#include <bundle.h>
#include <velmora_log_manager.h>

#include "common/log.h"

namespace {

// Content URIs of the usage-log service's providers; their paths are fixed.
const char kAppStatusProvider[] =
    "content://com.velmora.provider.usagelog/log/report_app_status_survey";
const char kFeatureUseProvider[] =
    "content://com.velmora.provider.usagelog/log/use_app_feature_survey";

void AddWhenGiven(bundle* b, const char* key, const char* value) {
  if (value != NULL) bundle_add_str(b, key, value);
}

}  // namespace

LogClientManager::LogClientManager() : m_logManager(NULL) {
  velmora_log_manager_create(&m_logManager);
}

LogClientManager::~LogClientManager() { velmora_log_manager_destroy(m_logManager); }

void LogClientManager::InsertLog(const char* appId, const char* feature, const char* extra,
                                 const char* value, bool isAppStatus) {
  if (feature == NULL) {
    KLOG(DLOG_ERROR, "feature is NULL");
    return;
  }
  bundle* b = bundle_create();
  AddWhenGiven(b, "app_id", appId);
  bundle_add_str(b, "feature", feature);
  AddWhenGiven(b, "extra", extra);
  AddWhenGiven(b, "value", value);

  int requestId = 0;  // the service's id for the request; nobody asks for it
  const char* provider = isAppStatus ? kAppStatusProvider : kFeatureUseProvider;
  velmora_log_manager_insert(m_logManager, provider, b, 0, 0, &requestId);
  bundle_free(b);
}
