#include "support/sim-test.h"

#include <ctype.h>
#include <stdlib.h>

#include <filesystem>

#include "common/device-path.h"

bool operator==(const EngineLog& a, const EngineLog& b) {
  return a.priority == b.priority && a.file == b.file && a.function == b.function &&
         a.message == b.message;
}

std::ostream& operator<<(std::ostream& out, const EngineLog& log) {
  return out << "{" << log.priority << ", " << log.file << ", " << log.function << ", \""
             << log.message << "\"}";
}

SimTest::SimTest() : device(sim::Device::Get()), handlesAtStart(device.OpenHandles()) {
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

namespace {

// Takes "<file>: <function>(<line>) >  <message>" apart; false when |text|
// does not have that exact prefix. (std::regex recurses per character and
// cannot take the long lines some tests log.)
bool ParseEngineLog(const std::string& text, EngineLog* log) {
  size_t colon = text.find(": ");
  size_t open = text.find('(', colon);
  size_t close = text.find(") >  ", open);
  if (colon == 0 || colon == std::string::npos || open == std::string::npos ||
      close == std::string::npos || close == open + 1) {
    return false;
  }
  for (size_t i = open + 1; i < close; ++i) {
    if (!isdigit(static_cast<unsigned char>(text[i]))) return false;
  }
  log->file = text.substr(0, colon);
  log->function = text.substr(colon + 2, open - colon - 2);
  log->message = text.substr(close + 5);
  return !log->function.empty() && log->function.find(' ') == std::string::npos;
}

}  // namespace

std::vector<EngineLog> SimTest::EngineLogs() const {
  std::vector<EngineLog> logs;
  for (const sim::LogLine& line : device.Logs()) {
    if (line.tag != "korrin") continue;
    EngineLog log;
    log.priority = line.priority;
    if (!ParseEngineLog(line.text, &log)) {
      ADD_FAILURE() << "log line without the engine's prefix: " << line.text;
      continue;
    }
    logs.push_back(log);
  }
  return logs;
}

int SimTest::HandlesOpenedByTest() const { return device.OpenHandles() - handlesAtStart; }

std::vector<std::string> SimTest::EngineMessages() const {
  std::vector<std::string> messages;
  for (const EngineLog& log : EngineLogs()) {
    const char* letter = log.priority == 5 ? "W" : log.priority == 6 ? "E" : "?";
    messages.push_back(std::string(letter) + " " + log.message);
  }
  return messages;
}
