// LogClientManager: a thin client of the device's usage-log service. Each
// event (an application's status, or the use of one of its features) travels
// as a bundle of string pairs to one of two log providers.
#ifndef KORRIN_LOG_CLIENT_MANAGER_LOG_CLIENT_MANAGER_H_
#define KORRIN_LOG_CLIENT_MANAGER_LOG_CLIENT_MANAGER_H_

#include <velmora_log_manager.h>

class LogClientManager {
 public:
  // Opens the usage-log client; it stays open for the object's life.
  LogClientManager();
  // Closes the client. Never throws.
  ~LogClientManager();

  // Sends one event: "app_id" = |appId|, "feature" = |feature|, "extra" =
  // |extra| and "value" = |value|, each key only when its text is not null.
  // |isAppStatus| selects the provider: the application-status survey when
  // true, the feature-use survey when false. Nothing is sent without a
  // |feature| (logged). Whether the service took the event is not reported.
  void InsertLog(const char* appId, const char* feature, const char* extra, const char* value,
                 bool isAppStatus);

 private:
  LogClientManager(const LogClientManager&) = delete;
  LogClientManager& operator=(const LogClientManager&) = delete;

  velmora_log_manager_h m_logManager;  // owned; null if the client could not be opened
};

#endif  // KORRIN_LOG_CLIENT_MANAGER_LOG_CLIENT_MANAGER_H_
