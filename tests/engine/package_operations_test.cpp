// Package operations end to end: the platform's events reach the layout
// through the package tracker and the engine's handlers. Plain installs,
// updates and event streams are pinned, row by row, by the scenario scripts
// (tests/scenarios); these are the cases the scripts cannot set up.
#include <app_manager.h>
#include <mdm.h>

#include "engine/engine-test.h"

namespace {

class PackageOperationsTest : public EngineTest {
 protected:
  // A started engine whose first menu holds Alpha to Echo on page 1.
  void StartWithFiveGames() {
    AddGames({"Alpha", "Bravo", "Charlie", "Delta", "Echo"});
    Start();
  }

  void Emit(const std::string& pkgId, int type, int state) {
    device.EmitPackageEvent("tpk", pkgId, type, state);
  }

  // An application box or shortcut (type 3) stored directly; returns its id.
  int AddBox(int pageId, const std::string& appId, int col, int row, int boxType = 0) {
    db->Exec("INSERT INTO Boxes(isFolder, pageId, appId, name, col, row, isPreload, isSystem, "
             "boxType, launchType) VALUES(0, " + std::to_string(pageId) + ", '" + appId +
             "', '" + appId + "', " + std::to_string(col) + ", " + std::to_string(row) +
             ", 0, 0, " + std::to_string(boxType) + ", 0)");
    return std::stoi(db->Value("SELECT last_insert_rowid()"));
  }

  int AddPage(int parentId, int pageNo, bool isFolder) {
    db->Exec("INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(" +
             std::to_string(isFolder) + ", " + std::to_string(parentId) + ", " +
             std::to_string(pageNo) + ")");
    return std::stoi(db->Value("SELECT last_insert_rowid()"));
  }

  // Boxes whose appId and name are both exactly |text|, byte for byte.
  int BoxesNamed(const std::string& text) {
    sqlite3_stmt* stmt = NULL;
    sqlite3_prepare_v2(db->db(), "SELECT COUNT(*) FROM Boxes WHERE appId = ?1 AND name = ?1",
                       -1, &stmt, NULL);
    sqlite3_bind_text(stmt, 1, text.data(), static_cast<int>(text.size()), SQLITE_STATIC);
    int count = sqlite3_step(stmt) == SQLITE_ROW ? sqlite3_column_int(stmt, 0) : -1;
    sqlite3_finalize(stmt);
    return count;
  }
};

TEST_F(PackageOperationsTest, AnUpdateThatDisablesAGameTakesItsBoxAwayWhateverThePolicy) {
  StartWithFiveGames();
  device.SetMdm(true, {{"bravo", MDM_RESTRICTED}});
  sim::Package bravo = Game("bravo", "Bravo");
  bravo.apps[0].enabled = false;
  device.Update(bravo);
  EXPECT_EQ((Lines{"alpha 1,1", "charlie 2,1", "delta 3,1", "echo 4,1"}), Page(1));
}

TEST_F(PackageOperationsTest, AnUninstallTakesTheBoxAndItsShortcutsAndClosesEachPageFourWide) {
  StartWithFiveGames();
  // Shortcuts of Charlie beside its box, alone on a second page, and in a
  // folder whose page holds five boxes.
  AddBox(1, "charlie", 2, 2, 3);
  int folder = AddBox(1, "", 3, 2);
  db->Exec("UPDATE Boxes SET isFolder = 1, name = 'Folder' WHERE boxId = " +
           std::to_string(folder));
  int lonely = AddPage(1, 2, false);
  AddBox(lonely, "charlie", 1, 1, 3);
  int inFolder = AddPage(folder, 1, true);
  AddBox(inFolder, "x", 1, 1);
  AddBox(inFolder, "charlie", 2, 1, 3);
  AddBox(inFolder, "y", 3, 1);
  AddBox(inFolder, "z", 1, 2);
  AddBox(inFolder, "w", 2, 2);
  device.ClearLogs();

  device.Uninstall("charlie");
  EXPECT_EQ("0", db->Value("SELECT COUNT(*) FROM Boxes WHERE appId = 'charlie'"));
  EXPECT_EQ((Lines{"alpha 1,1", "bravo 2,1", "delta 3,1", "echo 4,1", "[Folder] 1,2"}), Page(1));
  EXPECT_EQ((Lines{"x 1,1", "y 2,1", "z 3,1", "w 4,1"}), Page(inFolder));  // not 3 by 3
  EXPECT_EQ(Lines{}, Page(lonely));
  EXPECT_EQ("1", db->Value("SELECT COUNT(*) FROM Pages WHERE pageId = " +
                           std::to_string(lonely)));
  // Page 1 is met again among the shortcuts, which come by row, then col.
  std::vector<EngineLog> warnings;
  for (const EngineLog& log : EngineLogs()) {
    if (log.priority == 5) warnings.push_back(log);
  }
  EXPECT_EQ((std::vector<EngineLog>{{5, "korrin-data.cpp", "_removeShortcut",
                                     "Do not add page"}}),
            warnings);
}

TEST_F(PackageOperationsTest, AnUninstallOfAGameWithoutBoxesWritesNothing) {
  StartWithFiveGames();
  device.AddGame("ghost", "Ghost");
  std::vector<Row> before = db->Layout();
  device.Uninstall("ghost");
  EXPECT_EQ(before, db->Layout());
}

// ---- Event streams the platform may send.

// Streams that end in nothing to do: each is logged as it comes, and the
// layout stays as it was.
TEST_F(PackageOperationsTest, StreamsWithNothingToDoAreLoggedAndChangeNothing) {
  const int kInstall = PACKAGE_MANAGER_EVENT_TYPE_INSTALL;
  const int kStarted = PACKAGE_MANAGER_EVENT_STATE_STARTED;
  const int kCompleted = PACKAGE_MANAGER_EVENT_STATE_COMPLETED;
  struct {
    const char* name;
    std::vector<std::pair<int, int>> events;  // type, state
    Lines logs;
  } cases[] = {
      {"failed", {{kInstall, kStarted}, {kInstall, PACKAGE_MANAGER_EVENT_STATE_FAILED},
                  {kInstall, kCompleted}}, {"E #Step 1"}},
      {"never started", {{kInstall, kCompleted}}, {"E #Step 1"}},
      {"unknown type", {{7, kStarted}, {7, kCompleted}},
       {"E Invalid event_type: 7\n", "E #Step 1", "E #Step 2", "E #Step 3 size[0]"}},
      {"unknown states", {{kInstall, 9}, {-1, -100}},
       {"E Invalid event_state: 9\n", "E Invalid event_state: -100\n"}},
  };
  StartWithFiveGames();
  device.AddGame("stranger", "Stranger");
  std::vector<Row> before = db->Layout();
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    device.ClearLogs();
    for (const auto& event : c.events) Emit("stranger", event.first, event.second);
    EXPECT_EQ(c.logs, EngineMessages());
    EXPECT_EQ(before, db->Layout());
  }
}

// Package ids as the platform might send them: the event path neither
// crashes nor loses a row, and ids are stored byte for byte.
TEST_F(PackageOperationsTest, HostileIdsAreHandledAndStoredByteForByte) {
  StartWithFiveGames();
  const std::string ids[] = {
      "it's \"quoted\"",
      "x'); DROP TABLE Boxes; --",
      "com.ex.\xc3\xa9t\xc3\xa9-\xe6\xb8\xb8\xe6\x88\x8f",
      "bad-utf8-\xff\xfe\xc3",
      std::string(65536, 'g'),
  };
  for (const std::string& id : ids) {
    SCOPED_TRACE(id.substr(0, 40));
    device.Install(Game(id, id));
    EXPECT_EQ(1, BoxesNamed(id));
    device.Uninstall(id);
    EXPECT_EQ(0, BoxesNamed(id));
    EXPECT_EQ("5", db->Value("SELECT COUNT(*) FROM Boxes"));
  }

  // Ids that name nothing, or nothing at all.
  std::vector<Row> before = db->Layout();
  for (const char* id : {"", "never.installed"}) {
    for (int type : {PACKAGE_MANAGER_EVENT_TYPE_INSTALL, PACKAGE_MANAGER_EVENT_TYPE_UPDATE,
                     PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL}) {
      Emit(id, type, PACKAGE_MANAGER_EVENT_STATE_STARTED);
      Emit(id, type, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
    }
  }
  for (int state : {PACKAGE_MANAGER_EVENT_STATE_STARTED, PACKAGE_MANAGER_EVENT_STATE_COMPLETED}) {
    LauncherPackageManager::_PkgMgrClientListenCb(
        "tpk", NULL, PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL,
        static_cast<package_manager_event_state_e>(state), 0, PACKAGE_MANAGER_ERROR_NONE,
        &packages);
  }
  EXPECT_EQ(before, db->Layout());
  EXPECT_EQ("ok", db->Value("PRAGMA integrity_check"));
}

}  // namespace
