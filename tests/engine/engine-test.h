// EngineTest: the library's own engine, started through its entry point on a
// fresh simulated device, and the database read back with plain SQL.
//
// The engine's two managers live as long as the process, so every test needs
// a process of its own; CTest runs each one alone (gtest_discover_tests). A
// second engine test in one process fails at once rather than lie.
#ifndef KORRIN_TESTS_ENGINE_ENGINE_TEST_H_
#define KORRIN_TESTS_ENGINE_ENGINE_TEST_H_

#include <memory>
#include <string>
#include <vector>

#include "korrin-data/korrin-data.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

typedef std::vector<std::string> Lines;

class EngineTest : public SimTest {
 protected:
  EngineTest();

  // data_engin_initialization(), then a probe on the database it opened.
  void Start();

  // Games whose ids are their labels in lower case: AddGames({"Alpha"}) adds
  // "alpha" labelled "Alpha".
  void AddGames(const std::vector<std::string>& labels);
  // A package holding one game, as the package manager installs it.
  static sim::Package Game(const std::string& appId, const std::string& label);

  // The boxes of a stored page in reading order, each "appId col,row"; a box
  // without an appId (a folder) shows its name in brackets.
  Lines Page(int pageId);

  LauncherDataManager& store;
  LauncherPackageManager& packages;
  std::unique_ptr<SqlProbe> db;
};

#endif  // KORRIN_TESTS_ENGINE_ENGINE_TEST_H_
