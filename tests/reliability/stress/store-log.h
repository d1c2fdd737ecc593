// What the store logged, apart from the package side's own lines.
#ifndef KORRIN_TESTS_DATABASE_STRESS_STORE_LOG_H_
#define KORRIN_TESTS_DATABASE_STRESS_STORE_LOG_H_

#include <dlog.h>

#include <string>
#include <vector>

#include "support/sim-test.h"

// The store's lines of |logs|, each as its priority letter and message.
inline std::vector<std::string> FromStore(const std::vector<EngineLog>& logs) {
  std::vector<std::string> messages;
  for (const EngineLog& log : logs)
    if (log.file == "launcher-data-manager.cpp")
      messages.push_back((log.priority == DLOG_ERROR ? "E " : "? ") + log.message);
  return messages;
}

#endif  // KORRIN_TESTS_DATABASE_STRESS_STORE_LOG_H_
