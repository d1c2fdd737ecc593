// SimTest: every test starts on a freshly reset simulated device whose root is
// a temporary folder of its own, removed when the test ends.
#ifndef KORRIN_TESTS_SUPPORT_SIM_TEST_H_
#define KORRIN_TESTS_SUPPORT_SIM_TEST_H_

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "sim/device.h"

// A "korrin" log line taken apart: "<file>: <function>(<line>) >  <message>".
struct EngineLog {
  int priority;
  std::string file;
  std::string function;
  std::string message;
};

bool operator==(const EngineLog& a, const EngineLog& b);
std::ostream& operator<<(std::ostream& out, const EngineLog& log);

class SimTest : public ::testing::Test {
 protected:
  SimTest();
  ~SimTest() override;

  // The host path of the layout database.
  std::string DbPath() const;
  // Lines the engine logged under "korrin" since the last ClearLogs, taken
  // apart; a line without the exact prefix fails the test.
  std::vector<EngineLog> EngineLogs() const;
  // The same, each as its priority letter and message: "W # BEGIN",
  // "E app_info_create return [-5]".
  std::vector<std::string> EngineMessages() const;
  // Platform handles opened since the test began and not released yet;
  // handles held from before (a library global's client) do not count.
  int HandlesOpenedByTest() const;

  sim::Device& device;
  std::string root;
  int handlesAtStart;
};

#endif  // KORRIN_TESTS_SUPPORT_SIM_TEST_H_
