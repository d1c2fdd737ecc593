// The store's connection: opening, the schema, locking, transactions.
#include <dlog.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <fstream>

#include "launcher-data-manager/db-util.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

class DatabaseTest : public SimTest {
 protected:
  // db_util_open's answer for |path|, from a child that has given up root
  // when |asNobody|.
  static int OpenCode(const std::string& path, bool asNobody) {
    auto open = [&path]() {
      sqlite3* db = NULL;
      int rc = db_util_open(path.c_str(), &db, 0);
      sqlite3_close(db);
      return rc;
    };
    if (!asNobody) return open();
    pid_t child = fork();
    if (child == 0) {
      if (setgid(65534) != 0 || setuid(65534) != 0) _exit(99);
      _exit(open());
    }
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }

  LauncherDataManager store;
};

TEST_F(DatabaseTest, OpeningCreatesTheSchemaAndNothingElseWithAPersistentJournal) {
  store._OpenDb();
  ASSERT_NE(nullptr, store.m_db);
  // AUTOINCREMENT keys make sqlite_sequence; there is no index and no trigger.
  EXPECT_EQ((std::vector<Row>{
                {"CREATE TABLE Boxes( boxId INTEGER PRIMARY KEY AUTOINCREMENT, isFolder INTEGER, "
                 "pageParentId INTEGER, pageId INTEGER, appId TEXT, name TEXT, col INTEGER, row "
                 "INTEGER, isPreload INTEGER, isSystem INTEGER, boxType INTEGER, launchType "
                 "INTEGER, iconPath TEXT, content TEXT )"},
                {"CREATE TABLE Menus( menuId INTEGER PRIMARY KEY AUTOINCREMENT, name TEXT, type "
                 "INTEGER )"},
                {"CREATE TABLE Pages( pageId INTEGER PRIMARY KEY AUTOINCREMENT, isFolder INTEGER, "
                 "parentId INTEGER, pageNo INTEGER )"},
                {"CREATE TABLE sqlite_sequence(name,seq)"}}),
            SqlProbe(DbPath()).Rows("SELECT sql FROM sqlite_master ORDER BY name"));
  EXPECT_TRUE(EngineLogs().empty());

  std::string mode;
  sqlite3_exec(
      store.m_db, "PRAGMA journal_mode",
      [](void* out, int, char** values, char**) {
        *static_cast<std::string*>(out) = values[0];
        return 0;
      },
      &mode, NULL);
  EXPECT_EQ("persist", mode);

  // A persistent journal stays behind after a write.
  ASSERT_TRUE(store.BeginTransaction());
  ASSERT_EQ(SQLITE_OK, sqlite3_exec(store.m_db, "INSERT INTO menus(type) VALUES(0)", 0, 0, 0));
  ASSERT_TRUE(store.CommitTransaction());
  EXPECT_EQ(0, access((DbPath() + "-journal").c_str(), F_OK));
}

TEST_F(DatabaseTest, OpeningAgainKeepsEveryRowAndCloseReleasesTheConnection) {
  store._OpenDb();
  SqlProbe(DbPath()).Exec(
      "INSERT INTO Menus(name, type) VALUES('Apps', 0);"
      "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 1, 1);"
      "INSERT INTO Boxes(isFolder, pageId, appId, col, row) VALUES(0, 1, 'a', 1, 1);");
  store._OpenDb();
  LauncherDataManager second;
  second._OpenDb();
  EXPECT_EQ("1 1 a", SqlProbe(DbPath()).Value(
                         "SELECT (SELECT count(*) FROM Menus) || ' ' || (SELECT count(*) FROM "
                         "Pages) || ' ' || (SELECT group_concat(appId) FROM Boxes)"));

  EXPECT_EQ(SQLITE_OK, store._CloseDb());
  EXPECT_EQ(nullptr, store.m_db);
  EXPECT_EQ(SQLITE_OK, store._CloseDb());
}

// ---- Locking (the retries themselves: database-stress/locked_test.cpp)

TEST_F(DatabaseTest, WriteLockHeldElsewhereFailsWritesAtOnce) {
  store._OpenDb();
  SqlProbe other(DbPath());
  other.Exec("BEGIN EXCLUSIVE TRANSACTION");

  EXPECT_FALSE(store.BeginTransaction());
  EXPECT_FALSE(store.DeleteMenuData(1));
  GameViewData menu;
  menu.name = "Apps";
  store.InsertMenuData(menu);  // its step fails; an insert does not look at that

  other.Exec("COMMIT TRANSACTION");
  EXPECT_EQ("0", other.Value("SELECT count(*) FROM Menus"));
  EXPECT_TRUE(store.BeginTransaction());
  EXPECT_TRUE(store.CommitTransaction());
}

// ---- Transactions

TEST_F(DatabaseTest, CommitKeepsRollbackDiscardsAndNeitherRunsOutsideATransaction) {
  store._OpenDb();
  EXPECT_FALSE(store.CommitTransaction());
  EXPECT_FALSE(store.RollbackTransaction());
  ASSERT_TRUE(store.BeginTransaction());
  EXPECT_FALSE(store.BeginTransaction());  // no nesting
  sqlite3_exec(store.m_db, "INSERT INTO menus(name, type) VALUES('kept', 0)", 0, 0, 0);
  ASSERT_TRUE(store.CommitTransaction());

  ASSERT_TRUE(store.BeginTransaction());
  sqlite3_exec(store.m_db, "INSERT INTO menus(name, type) VALUES('dropped', 0)", 0, 0, 0);
  ASSERT_TRUE(store.RollbackTransaction());

  EXPECT_EQ((std::vector<Row>{{"kept"}}), SqlProbe(DbPath()).Rows("SELECT name FROM Menus"));
  EXPECT_TRUE(EngineLogs().empty());
}

// ---- Open failures

TEST_F(DatabaseTest, OpenRefusesNullArgumentsAndPassesFlagsThrough) {
  sqlite3* db = reinterpret_cast<sqlite3*>(&store);  // any value: it must stay untouched
  sqlite3* const untouched = db;
  EXPECT_EQ(SQLITE_ERROR, db_util_open(NULL, &db, 0));
  EXPECT_EQ(SQLITE_ERROR, db_util_open(DbPath().c_str(), NULL, 0));
  EXPECT_EQ(SQLITE_ERROR, db_util_open_with_options(NULL, &db, SQLITE_OPEN_READWRITE, NULL));
  EXPECT_EQ(SQLITE_ERROR, db_util_open_with_options(DbPath().c_str(), NULL, 0, NULL));
  EXPECT_EQ(untouched, db);
  EXPECT_NE(0, access(DbPath().c_str(), F_OK));

  db = NULL;
  EXPECT_EQ(SQLITE_CANTOPEN, db_util_open_with_options(DbPath().c_str(), &db,
                                                       SQLITE_OPEN_READONLY, NULL));
  sqlite3_close(db);
  ASSERT_EQ(SQLITE_OK, db_util_open_with_options(DbPath().c_str(), &db,
                                                 SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE, NULL));
  EXPECT_EQ(SQLITE_OK, db_util_close(db));
}

TEST_F(DatabaseTest, NonRootIsRefusedAnUnreadableFileButNotAMissingOne) {
  ASSERT_EQ(0, chmod(root.c_str(), 0755));  // only the file's own mode may stand in the way
  std::ofstream(DbPath()) << "";
  ASSERT_EQ(0, chmod(DbPath().c_str(), 0));
  const bool isRoot = geteuid() == 0;
  EXPECT_EQ(SQLITE_PERM, OpenCode(DbPath(), isRoot));
  if (isRoot) {
    EXPECT_EQ(SQLITE_OK, OpenCode(DbPath(), false));  // root reads whatever the mode says
  }
  // A missing file passes the check; as nobody, SQLite itself cannot create
  // it in root's folder.
  EXPECT_EQ(isRoot ? SQLITE_CANTOPEN : SQLITE_OK, OpenCode(root + "/fresh.db", isRoot));
}

TEST_F(DatabaseTest, FailedOpenIsLoggedAndCreatesNothing) {
  ASSERT_TRUE(device.UseRoot(root + "/elsewhere"));
  ASSERT_EQ(0, rmdir((device.Root() + "/opt/usr/apps/com.velmora.korrin/data").c_str()));
  device.ClearLogs();

  store._OpenDb();
  EXPECT_EQ((std::vector<EngineLog>{
                {DLOG_ERROR, "launcher-data-manager.cpp", "_OpenDb", "sqlite error : [14]"}}),
            EngineLogs());
}

TEST_F(DatabaseTest, FailingSchemaIsLoggedWithSqliteMessage) {
  std::ofstream(DbPath()) << std::string(4096, 'x');

  store._OpenDb();
  EXPECT_NE(nullptr, store.m_db);  // the connection stays open
  EXPECT_EQ((std::vector<EngineLog>{{DLOG_ERROR, "launcher-data-manager.cpp", "_CreateTables",
                                     "SQL error(26) : file is not a database"}}),
            EngineLogs());
}

}  // namespace
