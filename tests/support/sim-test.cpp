#include "support/sim-test.h"

#include <stdlib.h>

#include <filesystem>
#include <regex>

#include "common/device-path.h"

bool operator==(const EngineLog& a, const EngineLog& b) {
  return a.priority == b.priority && a.file == b.file && a.function == b.function &&
         a.message == b.message;
}

std::ostream& operator<<(std::ostream& out, const EngineLog& log) {
  return out << "{" << log.priority << ", " << log.file << ", " << log.function << ", \""
             << log.message << "\"}";
}

SimTest::SimTest() : device(sim::Device::Get()) {
  char pattern[] = "/tmp/korrin-test-XXXXXX";
  const char* made = mkdtemp(pattern);
  if (made == NULL) {
    ADD_FAILURE() << "cannot make a device root";
    return;
  }
  root = made;
  device.Reset();
  EXPECT_TRUE(device.UseRoot(root));
}

SimTest::~SimTest() {
  std::error_code ignored;
  if (!root.empty()) std::filesystem::remove_all(root, ignored);
}

std::string SimTest::DbPath() const { return device.HostPath(korrin::kGameDataDbPath); }

std::vector<EngineLog> SimTest::EngineLogs() const {
  static const std::regex kPrefix(R"(^([^:]+): (\w+)\((\d+)\) >  ([\s\S]*)$)");
  std::vector<EngineLog> logs;
  for (const sim::LogLine& line : device.Logs()) {
    if (line.tag != "korrin") continue;
    std::smatch match;
    if (!std::regex_match(line.text, match, kPrefix)) {
      ADD_FAILURE() << "log line without the engine's prefix: " << line.text;
      continue;
    }
    logs.push_back(EngineLog{line.priority, match[1], match[2], match[4]});
  }
  return logs;
}
