// The layout database file unreadable, read-only, on a full disk, or not a
// database at all: the store logs, answers failure values and loses nothing.
// The mode tests give up root for a while (skipped where they cannot); a full
// disk is a file size limit, with SIGXFSZ ignored so that writes just fail.
#include <dlog.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fstream>
#include <sstream>

#include "reliability/stress/store-log.h"
#include "engine/engine-test.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-package-manager/launcher-package-manager.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

// The rest of the scope runs as "nobody" (real and effective user, since
// access() asks about the real one); the saved user stays root for the way back.
class AsNobody {
 public:
  AsNobody() : m_dropped(geteuid() == 0 && setresuid(65534, 65534, 0) == 0) {}
  ~AsNobody() {
    if (m_dropped && setresuid(0, 0, 0) != 0) ADD_FAILURE() << "cannot become root again";
  }
  bool Active() const { return geteuid() != 0; }

 private:
  bool m_dropped;
};

#define AS_NOBODY()  \
  AsNobody nobody;   \
  if (!nobody.Active()) GTEST_SKIP() << "cannot give up root here (setresuid refused)"

// The rest of the scope may write no file past |bytes|. Lift frees the disk.
class FullDisk {
 public:
  explicit FullDisk(rlim_t bytes) {
    signal(SIGXFSZ, SIG_IGN);
    getrlimit(RLIMIT_FSIZE, &m_free);
    rlimit full = m_free;
    full.rlim_cur = bytes;
    EXPECT_EQ(0, setrlimit(RLIMIT_FSIZE, &full));
  }
  ~FullDisk() { Lift(); }
  void Lift() { setrlimit(RLIMIT_FSIZE, &m_free); }

 private:
  rlimit m_free;
};

std::string Bytes(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::stringstream bytes;
  bytes << in.rdbuf();
  return bytes.str();
}

off_t SizeOf(const std::string& path) {
  struct stat st;
  return stat(path.c_str(), &st) == 0 ? st.st_size : -1;
}

class BadFileTest : public SimTest {
 protected:
  BadFileTest() {
    // Let nobody reach the file, so that only the file's own mode refuses.
    for (std::string dir = DbPath(); dir.size() > root.size();) {
      dir.erase(dir.rfind('/'));
      chmod(dir.c_str(), 0755);
    }
    device.AddGame("com.ex.c", "C");
  }

  // A store made by the store itself, holding menu 1 "Apps", its page 1 and
  // boxes 1 "a" and 2 "b", closed again.
  void WriteRows() {
    store._OpenDb();
    SqlProbe(DbPath()).Exec(
        "INSERT INTO Menus(name, type) VALUES('Apps', 0);"
        "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 1, 1);"
        "INSERT INTO Boxes(isFolder, pageId, appId, col, row, isPreload, isSystem, boxType, "
        "launchType) VALUES(0, 1, 'a', 1, 1, 0, 0, 0, 0), (0, 1, 'b', 2, 1, 0, 0, 0, 0);");
    store._CloseDb();
    rows = SqlProbe(DbPath()).Layout();
    bytes = Bytes(DbPath());
    device.ClearLogs();
  }

  // The file is writable again, unchanged byte for byte.
  void ExpectFileUntouched() {
    ASSERT_EQ(0, chmod(DbPath().c_str(), 0644));
    EXPECT_EQ(bytes, Bytes(DbPath()));
    ExpectRowsKept();
  }

  // Every row of |rows| is there, and nothing else.
  void ExpectRowsKept() {
    EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
    EXPECT_EQ("ok", SqlProbe(DbPath()).Value("PRAGMA integrity_check"));
  }

  LauncherDataManager store;
  LauncherPackageManager packages;
  std::vector<Row> rows;
  std::string bytes;
};

// The look-up by application id, as its failure line quotes it.
const char kByAppId[] =
    "SELECT b.boxId, b.isFolder, p.pageId, col, row, appId, name, p.parentId, isPreload, "
    "isSystem FROM boxes b, pages p ON b.pageId = p.pageId WHERE b.appId = $appId AND "
    "b.boxType != 3 ";

// ---- Unreadable

TEST_F(BadFileTest, UnreadableFileIsRefusedAndTheUnopenedStoreAnswersFailures) {
  WriteRows();
  ASSERT_EQ(0, chmod(DbPath().c_str(), 0));
  {
    AS_NOBODY();
    // The ids are listed and nothing is stored, yet first launch reports success.
    EXPECT_TRUE(store.Initialize(packages));
    EXPECT_EQ(nullptr, store.m_db);

    // Without a connection every operation still answers, placements included.
    bool pageAdded = false;
    GameViewData menu;
    GameBoxData box;
    box.appId = "c";
    EXPECT_EQ(-1, store.InsertMenuData(menu));
    EXPECT_EQ(-1, store.InsertBoxData(box));
    EXPECT_EQ(-1, store.InsertBoxData("c", pageAdded));
    EXPECT_EQ(-1, store.InsertBoxDataForDeactivatedApp(1, "c"));
    EXPECT_EQ(-1, store.InsertBoxDataForAlphaBeticalOrder(box));
    EXPECT_FALSE(store.UpdateMenuData(menu));
    EXPECT_FALSE(store.DeleteBoxData(1));
    EXPECT_FALSE(store.BeginTransaction());
    EXPECT_EQ(0, store.GetMenuBoxData(1)->boxId);
    EXPECT_EQ(0, store.GetBoxDataByAppId("a")->boxId);
    EXPECT_TRUE(store.GetBoxDataListByAlphabeticalOrder(1, false).empty());
    // A menu always has its first virtual page.
    EXPECT_EQ(1u, store.GetPageDataListByAlphabeticalOrder(1, false).size());
    store.RearrangeAppsPosition();
    store._ReorderData(1, false);
    EXPECT_EQ(1, store.DeleteBoxDataForDeactivatedApp(1, 1));
  }
  // SQLite has no message for a connection that is not there: exec leaves
  // none, and errmsg says "out of memory".
  EXPECT_EQ((std::vector<std::string>{
                "E sqlite error : [3]", "E sqlite error : ",
                "E sqlite error : [" + std::string(kByAppId) + ",out of memory]",
                "E Bind Err : a\n", "E cannot find box with appid[a]", "E sqlite error : "}),
            FromStore(EngineLogs()));

  ExpectFileUntouched();
}

// ---- Read-only

TEST_F(BadFileTest, ReadOnlyFileIsReadAndRefusesEveryWrite) {
  WriteRows();
  ASSERT_EQ(0, chmod(DbPath().c_str(), 0444));
  {
    AS_NOBODY();
    store._OpenDb();  // the tables exist: the schema writes nothing
    EXPECT_EQ(2u, store.GetBoxDataList(1).size());
    EXPECT_EQ(2, store.GetBoxDataByAppId("b")->boxId);

    // Inserts do not look at their step: with no row made on this connection
    // they answer 0, and write it into the record.
    GameViewData menu;
    menu.menuId = 1;
    GameBoxData box;
    box.boxId = 1;
    box.appId = "c";
    EXPECT_EQ(0, store.InsertMenuData(menu));
    EXPECT_EQ(0, store.InsertBoxData(box));
    EXPECT_TRUE(store.UpdateMenuData(menu));
    EXPECT_TRUE(store.UpdateBoxData(box));
    EXPECT_FALSE(store.DeleteBoxData(1));
    EXPECT_FALSE(store.DeleteMenuData(1));
    // SQLite begins a read transaction on a read-only file.
    EXPECT_TRUE(store.BeginTransaction());
    EXPECT_TRUE(store.CommitTransaction());
    store._CloseDb();
  }
  EXPECT_EQ(std::vector<std::string>{"E sqlite error : attempt to write a readonly database"},
            FromStore(EngineLogs()));
  ExpectFileUntouched();
}

TEST_F(BadFileTest, ReadOnlyEmptyFileLogsTheSchemaAndStaysEmpty) {
  std::ofstream(DbPath()) << "";
  ASSERT_EQ(0, chmod(DbPath().c_str(), 0444));
  AS_NOBODY();
  EXPECT_TRUE(store.Initialize(packages));
  EXPECT_EQ(std::vector<std::string>{"E SQL error(8) : attempt to write a readonly database"},
            FromStore(EngineLogs()));
  EXPECT_EQ(0, SizeOf(DbPath()));
}

// ---- Full disk. A size limit fails a write with EFBIG, which SQLite reports
// as an I/O error (10) where ENOSPC would be SQLITE_FULL (13); the store
// treats both alike.

TEST_F(BadFileTest, FullDiskRefusesEveryWriteKeepsEveryRowAndWritesAgainOnceFreed) {
  {
    FullDisk disk(0);
    EXPECT_TRUE(store.Initialize(packages));
    EXPECT_EQ(0, SizeOf(DbPath()));
  }
  // Room again: the next start makes the whole first layout.
  EXPECT_TRUE(store.Initialize(packages));
  rows = SqlProbe(DbPath()).Layout();
  EXPECT_EQ((std::vector<Row>{{"Apps", "com.ex.c"}}),
            SqlProbe(DbPath()).Rows("SELECT m.name, appId FROM Menus m, Pages p, Boxes b "
                                    "ON p.parentId = m.menuId AND b.pageId = p.pageId"));
  GameBoxData shortcut;
  shortcut.pageId = 1;
  shortcut.boxType = 3;
  shortcut.appId = "c";
  shortcut.content = std::string(100000, 'x');
  const off_t size = SizeOf(DbPath());
  {
    // No room past what the file holds: an insert that needs more fails, it
    // answers the id the row would have had, and the file is cut back.
    FullDisk disk(size);
    EXPECT_EQ(2, store.InsertBoxData(shortcut));
    EXPECT_EQ(size, SizeOf(DbPath()));
  }
  {
    // Not a byte anywhere: every write fails at its journal.
    FullDisk disk(0);
    GameBoxData moved = *store.GetMenuBoxData(1);
    moved.col = 4;
    EXPECT_TRUE(store.UpdateBoxData(moved));
    EXPECT_FALSE(store.DeleteBoxData(1));
  }
  EXPECT_EQ((std::vector<std::string>{"E SQL error(10) : disk I/O error",
                                      "E sqlite error : disk I/O error"}),
            FromStore(EngineLogs()));
  ExpectRowsKept();

  // Room again: the same writes go through.
  EXPECT_EQ(2, store.InsertBoxData(shortcut));
  EXPECT_TRUE(store.DeleteBoxData(1));
  EXPECT_EQ((std::vector<Row>{{"2", "c", "100000"}}),
            SqlProbe(DbPath()).Rows("SELECT boxId, appId, length(content) FROM Boxes"));
}

// ---- Garbage

TEST_F(BadFileTest, GarbageFileIsLoggedAndNeverOverwritten) {
  std::string garbage;
  for (int i = 0; i < 16384; ++i) garbage += static_cast<char>(i * 7 + 1);
  std::ofstream(DbPath(), std::ios::binary) << garbage;

  EXPECT_TRUE(store.Initialize(packages));
  GameBoxData box;
  box.appId = "c";
  EXPECT_EQ(-1, store.InsertBoxData(box));
  EXPECT_FALSE(store.BeginTransaction());
  EXPECT_FALSE(store.DeleteBoxData(1));
  EXPECT_EQ(0, store.GetBoxDataByAppId("a")->boxId);
  EXPECT_EQ(
      (std::vector<std::string>{
          "E SQL error(26) : file is not a database", "E sqlite error : file is not a database",
          "E sqlite error : [" + std::string(kByAppId) + ",file is not a database]",
          "E Bind Err : a\n", "E cannot find box with appid[a]"}),
      FromStore(EngineLogs()));
  EXPECT_EQ(garbage, Bytes(DbPath()));
}

class BadFileEngineTest : public EngineTest {};

TEST_F(BadFileEngineTest, GarbageFileSurvivesTheEngine) {
  std::string garbage(16384, '\x5a');
  std::ofstream(DbPath(), std::ios::binary) << garbage;
  AddGames({"Alpha"});
  Start();
  device.Install(Game("com.ex.new", "New"));
  device.Uninstall("alpha");

  const std::string notADatabase = ",file is not a database]";
  std::vector<std::string> logs = {"E SQL error(26) : file is not a database"};
  for (std::string appId : {"com.ex.new", "alpha"}) {
    logs.insert(logs.end(),
                {"E sqlite error : [" + std::string(kByAppId) + notADatabase,
                 "E Bind Err : " + appId + "\n", "E cannot find box with appid[" + appId + "]"});
  }
  logs.insert(logs.end(),
              {"E sqlite error : [SELECT boxId, b.isFolder, p.parentId, b.pageId, appId, name, "
               "col, row, isPreload, isSystem, boxType, launchType, iconPath, content FROM boxes "
               "b, pages p ON p.pageId = b.pageId WHERE appId = $appId AND boxType = 3 ORDER BY "
               "row, col" +
                   notADatabase,
               "E Bind Err : alpha\n"});
  EXPECT_EQ(logs, FromStore(EngineLogs()));
  EXPECT_EQ(garbage, Bytes(DbPath()));
}

}  // namespace
