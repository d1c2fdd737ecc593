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
  std::vector<Row> Columns(SqlProbe& probe, const std::string& table) {
    return probe.Rows("SELECT name, type, pk FROM pragma_table_info('" + table + "')");
  }

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

TEST_F(DatabaseTest, OpeningCreatesTheFileWithTheSchema) {
  store._OpenDb();
  ASSERT_NE(nullptr, store.m_db);
  SqlProbe probe(DbPath());

  EXPECT_EQ((std::vector<Row>{{"menuId", "INTEGER", "1"}, {"name", "TEXT", "0"},
                              {"type", "INTEGER", "0"}}),
            Columns(probe, "Menus"));
  EXPECT_EQ((std::vector<Row>{{"pageId", "INTEGER", "1"}, {"isFolder", "INTEGER", "0"},
                              {"parentId", "INTEGER", "0"}, {"pageNo", "INTEGER", "0"}}),
            Columns(probe, "Pages"));
  EXPECT_EQ((std::vector<Row>{{"boxId", "INTEGER", "1"},     {"isFolder", "INTEGER", "0"},
                              {"pageParentId", "INTEGER", "0"}, {"pageId", "INTEGER", "0"},
                              {"appId", "TEXT", "0"},        {"name", "TEXT", "0"},
                              {"col", "INTEGER", "0"},       {"row", "INTEGER", "0"},
                              {"isPreload", "INTEGER", "0"}, {"isSystem", "INTEGER", "0"},
                              {"boxType", "INTEGER", "0"},   {"launchType", "INTEGER", "0"},
                              {"iconPath", "TEXT", "0"},     {"content", "TEXT", "0"}}),
            Columns(probe, "Boxes"));
  // AUTOINCREMENT keys, and nothing else: no index, no trigger.
  EXPECT_EQ("Boxes,Menus,Pages,sqlite_sequence",
            probe.Value("SELECT group_concat(name) FROM (SELECT name FROM sqlite_master "
                        "ORDER BY name)"));
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(DatabaseTest, JournalIsPersistent) {
  store._OpenDb();
  sqlite3_stmt* stmt = NULL;
  ASSERT_EQ(SQLITE_OK, sqlite3_prepare_v2(store.m_db, "PRAGMA journal_mode", -1, &stmt, NULL));
  ASSERT_EQ(SQLITE_ROW, sqlite3_step(stmt));
  EXPECT_STREQ("persist", reinterpret_cast<const char*>(sqlite3_column_text(stmt, 0)));
  sqlite3_finalize(stmt);

  // A persistent journal stays behind after a write.
  ASSERT_TRUE(store.BeginTransaction());
  ASSERT_EQ(SQLITE_OK, sqlite3_exec(store.m_db, "INSERT INTO menus(type) VALUES(0)", 0, 0, 0));
  ASSERT_TRUE(store.CommitTransaction());
  struct stat info;
  EXPECT_EQ(0, stat((DbPath() + "-journal").c_str(), &info));
}

TEST_F(DatabaseTest, OpeningAgainKeepsEveryRow) {
  store._OpenDb();
  {
    SqlProbe probe(DbPath());
    probe.Exec("INSERT INTO Menus(name, type) VALUES('Apps', 0);"
               "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 1, 1);"
               "INSERT INTO Boxes(isFolder, pageId, appId, col, row) VALUES(0, 1, 'a', 1, 1);");
  }
  store._OpenDb();
  LauncherDataManager second;
  second._OpenDb();

  SqlProbe probe(DbPath());
  EXPECT_EQ("1", probe.Value("SELECT count(*) FROM Menus"));
  EXPECT_EQ("1", probe.Value("SELECT count(*) FROM Pages"));
  EXPECT_EQ("a", probe.Value("SELECT appId FROM Boxes"));
}

TEST_F(DatabaseTest, CloseReleasesTheConnection) {
  store._OpenDb();
  EXPECT_EQ(SQLITE_OK, store._CloseDb());
  EXPECT_EQ(nullptr, store.m_db);
  EXPECT_EQ(SQLITE_OK, store._CloseDb());
}

// ---- Locking

TEST_F(DatabaseTest, BusyHandlerRetriesFiveTimesThenGivesUp) {
  const int expected[] = {1, 1, 1, 1, 1, 0, 0};
  for (int count = 0; count < 7; ++count) {
    EXPECT_EQ(expected[count], db_util_busy_handler(NULL, count)) << "count " << count;
  }
}

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

TEST_F(DatabaseTest, CommitWithoutTransactionFails) {
  store._OpenDb();
  EXPECT_FALSE(store.CommitTransaction());
  EXPECT_FALSE(store.RollbackTransaction());
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(DatabaseTest, CommitKeepsAndRollbackDiscards) {
  store._OpenDb();
  ASSERT_TRUE(store.BeginTransaction());
  EXPECT_FALSE(store.BeginTransaction());  // no nesting
  sqlite3_exec(store.m_db, "INSERT INTO menus(name, type) VALUES('kept', 0)", 0, 0, 0);
  ASSERT_TRUE(store.CommitTransaction());

  ASSERT_TRUE(store.BeginTransaction());
  sqlite3_exec(store.m_db, "INSERT INTO menus(name, type) VALUES('dropped', 0)", 0, 0, 0);
  ASSERT_TRUE(store.RollbackTransaction());

  SqlProbe probe(DbPath());
  EXPECT_EQ((std::vector<Row>{{"kept"}}), probe.Rows("SELECT name FROM Menus"));
}

// ---- Open failures

TEST_F(DatabaseTest, OpenRefusesNullArguments) {
  sqlite3* db = reinterpret_cast<sqlite3*>(&store);  // any value: it must stay untouched
  sqlite3* const untouched = db;
  EXPECT_EQ(SQLITE_ERROR, db_util_open(NULL, &db, 0));
  EXPECT_EQ(SQLITE_ERROR, db_util_open(DbPath().c_str(), NULL, 0));
  EXPECT_EQ(SQLITE_ERROR, db_util_open_with_options(NULL, &db, SQLITE_OPEN_READWRITE, NULL));
  EXPECT_EQ(SQLITE_ERROR, db_util_open_with_options(DbPath().c_str(), NULL, 0, NULL));
  EXPECT_EQ(untouched, db);
  EXPECT_NE(0, access(DbPath().c_str(), F_OK));
}

TEST_F(DatabaseTest, OpenWithOptionsPassesFlagsThrough) {
  sqlite3* db = NULL;
  EXPECT_EQ(SQLITE_CANTOPEN, db_util_open_with_options(DbPath().c_str(), &db,
                                                       SQLITE_OPEN_READONLY, NULL));
  sqlite3_close(db);
  db = NULL;
  ASSERT_EQ(SQLITE_OK, db_util_open_with_options(
                           DbPath().c_str(), &db, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE, NULL));
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

  std::vector<EngineLog> logs = EngineLogs();
  ASSERT_EQ(1u, logs.size());
  EXPECT_EQ((EngineLog{DLOG_ERROR, "launcher-data-manager.cpp", "_OpenDb",
                       "sqlite error : [14]"}),
            logs[0]);
}

TEST_F(DatabaseTest, FailingSchemaIsLoggedWithSqliteMessage) {
  std::ofstream(DbPath()) << std::string(4096, 'x');

  store._OpenDb();

  ASSERT_NE(nullptr, store.m_db);  // the connection stays open
  std::vector<EngineLog> logs = EngineLogs();
  ASSERT_EQ(1u, logs.size());
  EXPECT_EQ((EngineLog{DLOG_ERROR, "launcher-data-manager.cpp", "_CreateTables",
                       "SQL error(26) : file is not a database"}),
            logs[0]);
}

}  // namespace
