// The store's connection: the schema and journal it sets up, and how it meets
// a lock held by another connection. (Behaviour through the store's
// operations: tests/scenarios/store-*.ksim; bad files and retries under a
// lock: tests/reliability/stress.)
#include <unistd.h>

#include "launcher-data-manager/launcher-data-manager.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

class DatabaseTest : public SimTest {
 protected:
  DatabaseTest() { store._OpenDb(); }

  LauncherDataManager store;
};

TEST_F(DatabaseTest, OpeningCreatesTheSchemaAndNothingElseWithAPersistentJournal) {
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

  // A persistent journal stays behind after a write.
  GameViewData menu;
  store.InsertMenuData(menu);
  EXPECT_EQ(0, access((DbPath() + "-journal").c_str(), F_OK));
}

TEST_F(DatabaseTest, AWriteLockHeldElsewhereFailsTransactionsAndWritesAtOnce) {
  SqlProbe other(DbPath());
  other.Exec("BEGIN EXCLUSIVE TRANSACTION");
  EXPECT_FALSE(store.BeginTransaction());
  EXPECT_FALSE(store.DeleteMenuData(1));
  GameViewData menu;
  store.InsertMenuData(menu);  // its step fails; an insert does not look at that
  other.Exec("COMMIT TRANSACTION");
  EXPECT_EQ("0", other.Value("SELECT count(*) FROM Menus"));
  EXPECT_TRUE(store.BeginTransaction());
  EXPECT_FALSE(store.BeginTransaction());  // no nesting
  EXPECT_TRUE(store.CommitTransaction());
}

}  // namespace
