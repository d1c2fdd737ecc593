#include "engine/engine-test.h"

#include <ctype.h>

namespace {

int g_enginesInThisProcess = 0;

}  // namespace

EngineTest::EngineTest() : store(korrin::DataManager()), packages(korrin::PackageManager()) {
  if (++g_enginesInThisProcess > 1) {
    ADD_FAILURE() << "an engine test needs a process of its own: run it through ctest, or "
                     "with --gtest_filter naming one test";
  }
}

void EngineTest::Start() {
  data_engin_initialization();
  db.reset(new SqlProbe(DbPath()));
}

void EngineTest::AddGames(const std::vector<std::string>& labels) {
  for (const std::string& label : labels) {
    std::string id = label;
    for (char& c : id) c = static_cast<char>(tolower(static_cast<unsigned char>(c)));
    device.AddGame(id, label);
  }
}

sim::Package EngineTest::Game(const std::string& appId, const std::string& label) {
  return sim::MakePackage(appId, {sim::GameApp(appId, label)});
}

Lines EngineTest::Page(int pageId) {
  Lines cells;
  for (const Row& row : db->Rows("SELECT appId, col, row, name FROM Boxes WHERE pageId = " +
                                 std::to_string(pageId) + " ORDER BY row, col")) {
    bool named = row[0] != "" && row[0] != "NULL";
    cells.push_back((named ? row[0] : "[" + row[3] + "]") + " " + row[1] + "," + row[2]);
  }
  return cells;
}
