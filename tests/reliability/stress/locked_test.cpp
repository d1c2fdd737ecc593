// The layout database while another process holds a lock on it: every store
// operation gives up after the busy handler's five immediate retries, answers
// its failure value, and once the lock is gone every earlier row is there.
// A file shim counts the refused lock requests (one try + five retries = six);
// every C library call that waits for time is caught and counted, so any
// sleep between the retries shows.
#include <dlfcn.h>
#include <dlog.h>
#include <poll.h>
#include <signal.h>
#include <sys/select.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "reliability/stress/store-log.h"
#include "engine/engine-test.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-package-manager/launcher-package-manager.h"
#include "support/file-shim.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

bool g_catching = false;
int g_sleeps = 0;

void Waited() {
  if (g_catching) ++g_sleeps;
}

}  // namespace

// The calls that wait for time. This binary exports them, so the dynamic
// linker binds the library's, SQLite's and libstdc++'s calls to these.
// Nothing here needs to wait, so a sleep returns at once, counted while
// catching; poll, which also serves file descriptors, is passed on when not
// catching (its arguments hold no time). Raw system calls are not seen: a
// seccomp filter would see them, but qemu-user, where the ARM build's tests
// run, refuses to install one.
extern "C" {
unsigned int sleep(unsigned int) { return Waited(), 0; }
int usleep(useconds_t) { return Waited(), 0; }
int nanosleep(const timespec*, timespec*) { return Waited(), 0; }
int clock_nanosleep(clockid_t, int, const timespec*, timespec*) { return Waited(), 0; }
int select(int, fd_set*, fd_set*, fd_set*, timeval*) { return Waited(), 0; }
int pselect(int, fd_set*, fd_set*, fd_set*, const timespec*, const sigset_t*) {
  return Waited(), 0;
}
int ppoll(pollfd*, nfds_t, const timespec*, const sigset_t*) { return Waited(), 0; }
int poll(pollfd* fds, nfds_t n, int timeout) {
  if (g_catching) return Waited(), 0;
  typedef int (*Poll)(pollfd*, nfds_t, int);
  return reinterpret_cast<Poll>(dlsym(RTLD_NEXT, "poll"))(fds, n, timeout);
}

// With a 64-bit time_t on 32-bit ARM the headers give the definitions above
// the names of the 64-bit versions; libraries built with a 32-bit time_t
// still call the plain ones.
#if defined(__USE_TIME_BITS64) && __TIMESIZE == 32
int Nanosleep32(const void*, void*) __asm__("nanosleep");
int Nanosleep32(const void*, void*) { return Waited(), 0; }
int ClockNanosleep32(clockid_t, int, const void*, void*) __asm__("clock_nanosleep");
int ClockNanosleep32(clockid_t, int, const void*, void*) { return Waited(), 0; }
int Select32(int, fd_set*, fd_set*, fd_set*, void*) __asm__("select");
int Select32(int, fd_set*, fd_set*, fd_set*, void*) { return Waited(), 0; }
#endif
}

namespace {

int g_refusedLocks = 0;

// Runs |body| catching every wait, then expects none was made.
void RunWithoutSleeping(const std::function<void()>& body) {
  g_sleeps = 0;
  g_catching = true;
  body();
  g_catching = false;
  EXPECT_EQ(0, g_sleeps);
}

// The catcher sees SQLite's own sleep and a C++ one on this platform.
TEST(SleepCatcherTest, SeesSqliteAndStandardSleeps) {
  g_sleeps = 0;
  g_catching = true;
  sqlite3_sleep(1000);
  std::this_thread::sleep_for(std::chrono::seconds(1));
  g_catching = false;
  EXPECT_EQ(2, g_sleeps);
}

// A process with a plain SQLite connection of its own to |path|: Run has it
// execute one line of SQL and returns the result code (-1 when it did not
// answer). A lock left by an open transaction stays until later SQL ends it or
// the process goes. Fork it only while this process holds no lock on the file,
// or the child would inherit SQLite's record of that lock.
class OtherProcess {
 public:
  explicit OtherProcess(const std::string& path) {
    int toChild[2], toParent[2];
    if (pipe(toChild) != 0 || pipe(toParent) != 0 || (m_pid = fork()) < 0) {
      ADD_FAILURE() << "no pipe or fork";
      return;
    }
    if (m_pid == 0) {
      close(toChild[1]);
      close(toParent[0]);
      sqlite3* db = NULL;
      sqlite3_open_v2(path.c_str(), &db, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE, "unix");
      FILE* in = fdopen(toChild[0], "r");
      char* sql = NULL;
      size_t capacity = 0;
      while (getline(&sql, &capacity, in) > 0) {
        dprintf(toParent[1], "%d\n", sqlite3_exec(db, sql, NULL, NULL, NULL));
      }
      _exit(0);
    }
    close(toChild[0]);
    close(toParent[1]);
    m_to = toChild[1];
    m_from = fdopen(toParent[0], "r");
  }

  // Closing the pipe ends the process, and with it any lock still held.
  ~OtherProcess() {
    if (m_from == NULL) return;
    close(m_to);
    fclose(m_from);
    waitpid(m_pid, NULL, 0);
  }

  int Run(const std::string& sql) {
    int rc = -1;
    return dprintf(m_to, "%s\n", sql.c_str()) > 0 && fscanf(m_from, "%d", &rc) == 1 ? rc : -1;
  }

 private:
  pid_t m_pid = -1;
  int m_to = -1;
  FILE* m_from = NULL;
};

class LockedTest : public SimTest {
 protected:
  // The shim becomes the default VFS, so db_util_open's plain open uses it.
  LockedTest() {
    auto count = [](fileshim::Op op, const std::function<int()>& perform) {
      int rc = perform();
      if (op == fileshim::Op::kLock && rc == SQLITE_BUSY) ++g_refusedLocks;
      return rc;
    };
    EXPECT_EQ(SQLITE_OK, fileshim::Install(count));
  }

  // Menu 1 "Apps", its page 1 and boxes 1 "a" and 2 "b", written through the
  // store; then the other process starts.
  void OpenWithRows() {
    store._OpenDb();
    GameViewData menu;
    menu.name = "Apps";
    store.InsertMenuData(menu);
    GamePageData page;
    page.parentId = menu.menuId;
    page.pageNo = 1;
    store.InsertPageData(page);
    for (const char* appId : {"a", "b"}) {
      GameBoxData box;
      box.pageId = page.pageId;
      box.appId = appId;
      box.col = appId[0] - 'a' + 1;
      box.row = 1;
      store.InsertBoxData(box);
    }
    probe.reset(new SqlProbe(DbPath()));
    other.reset(new OtherProcess(DbPath()));
    device.ClearLogs();
  }

  // Every kind of store operation, while the other process holds the lock
  // |begin| takes (with a menu of its own written). Reads work only when
  // |readsWork|; writes never do, and change no row.
  void EveryOperationUnder(const std::string& begin, bool readsWork) {
    std::vector<Row> before = probe->Layout();
    ASSERT_EQ(SQLITE_OK, other->Run(begin + "; INSERT INTO Menus(name, type) VALUES('Other', 9)"));
    GameViewData menu;
    menu.menuId = 1;
    menu.name = "Games";
    GamePageData page;
    page.pageId = page.parentId = 1;
    page.pageNo = 2;
    GameBoxData box;
    box.boxId = box.pageId = 1;
    box.appId = "c";
    int parentId = 0, pageId = 0, boxId = 0;
    const int read = readsWork ? 1 : 0;
    struct {
      const char* call;
      std::function<int()> run;
      bool writes;
      int answer;
    } cases[] = {
#define OP(call, writes, answer) \
  { #call, [&] { return static_cast<int>(store.call); }, writes, answer }
        // Inserts ignore their step and answer this connection's last row id
        // (box 2), writing it into the record; updates answer true.
        OP(InsertMenuData(menu), true, 2), OP(InsertPageData(page), true, 2),
        OP(InsertBoxData(box), true, 2), OP(UpdateMenuData(menu), true, true),
        OP(UpdatePageData(page), true, true), OP(UpdateBoxData(box), true, true),
        OP(DeleteMenuData(1), true, false), OP(DeletePageData(1), true, false),
        OP(DeleteFolderPageData(1), true, false), OP(DeleteBoxData(1), true, false),
        OP(BeginTransaction(), true, false), OP(GetMenuDataCount(), false, read),
        OP(GetBoxDataCount(1), false, 2 * read),
        OP(_GetPageDataCountByDownload(1), false, 2 * read),
        OP(GetMenuData(1)->menuId, false, read), OP(GetMenuPageData(1)->pageId, false, read),
        OP(GetMenuBoxData(2)->boxId, false, 2 * read),
        OP(GetBoxIdByAppId("b", &parentId, &pageId, &boxId), false, read),
        OP(GetBoxDataByAppId("b")->boxId, false, 2 * read),
        OP(GetMenuDataList().size(), false, read),
        OP(GetPageDataList(1, false).size(), false, read),
        OP(GetBoxDataList(1).size(), false, 2 * read),
        OP(GetBoxDataListByAppId("a", 0).size(), false, read),
#undef OP
    };
    ASSERT_NO_FATAL_FAILURE(RunWithoutSleeping([&] {
      for (const auto& c : cases) {
        g_refusedLocks = 0;
        EXPECT_EQ(c.answer, c.run()) << c.call;
        EXPECT_EQ(c.writes || !readsWork ? 6 : 0, g_refusedLocks) << c.call;
      }
    }));
    EXPECT_EQ(2, menu.menuId);
    std::vector<std::string> logs = {"E sqlite error : database is locked"};
    if (!readsWork) logs.push_back("E cannot find box with appid[b]");
    EXPECT_EQ(logs, EngineMessages());

    // Let go: the rows are kept, the other menu is added and read, writes work.
    ASSERT_EQ(SQLITE_OK, other->Run("COMMIT"));
    before.insert(before.begin() + 1, Row{"2", "Other", "9"});
    EXPECT_EQ(before, probe->Layout());
    EXPECT_EQ("Other", store.GetMenuData(2)->name);
    EXPECT_TRUE(store.BeginTransaction());
    EXPECT_EQ(3, store.InsertBoxData(box));
    EXPECT_TRUE(store.DeleteBoxData(1));
    EXPECT_TRUE(store.CommitTransaction());
    EXPECT_EQ((std::vector<Row>{{"2", "b"}, {"3", "c"}}),
              probe->Rows("SELECT boxId, appId FROM Boxes ORDER BY boxId"));
  }

  LauncherDataManager store;
  std::unique_ptr<SqlProbe> probe;
  std::unique_ptr<OtherProcess> other;
};

TEST_F(LockedTest, ExclusiveLockRefusesEveryOperationAfterFiveImmediateRetries) {
  OpenWithRows();
  EveryOperationUnder("BEGIN EXCLUSIVE", false);
}

TEST_F(LockedTest, ReservedLockRefusesWritesOnlyAfterFiveImmediateRetries) {
  OpenWithRows();
  EveryOperationUnder("BEGIN IMMEDIATE", true);
}

// The rearrangement's commit, refused by a reader, leaves the store in its
// transaction holding its lock: new readers are shut out and later writes
// join the transaction until the host commits.
TEST_F(LockedTest, CommitRefusedByAReaderLeavesTheTransactionOpenUntilCommittedAgain) {
  OpenWithRows();
  probe->Exec("UPDATE Boxes SET col = 3 WHERE appId = 'b'");  // a gap to close
  ASSERT_EQ(SQLITE_OK, other->Run("BEGIN; SELECT count(*) FROM Menus"));
  g_refusedLocks = 0;
  ASSERT_NO_FATAL_FAILURE(RunWithoutSleeping([&] { store.RearrangeAppsPosition(); }));
  EXPECT_EQ(6, g_refusedLocks);

  ASSERT_EQ(SQLITE_OK, other->Run("COMMIT"));
  EXPECT_EQ(SQLITE_BUSY, other->Run("SELECT count(*) FROM Menus"));
  GameViewData menu;
  menu.name = "Games";
  EXPECT_EQ(2, store.InsertMenuData(menu));
  EXPECT_TRUE(store.CommitTransaction());
  EXPECT_EQ(SQLITE_OK, other->Run("SELECT count(*) FROM Menus"));
  EXPECT_EQ((std::vector<Row>{{"Apps"}, {"Games"}}),
            probe->Rows("SELECT name FROM Menus ORDER BY menuId"));
  EXPECT_EQ((std::vector<Row>{{"a", "1"}, {"b", "2"}}),
            probe->Rows("SELECT appId, col FROM Boxes ORDER BY boxId"));
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(LockedTest, FirstLaunchUnderALockWritesNothingAndTheNextStartPopulates) {
  other.reset(new OtherProcess(DbPath()));  // its open makes the empty file
  ASSERT_EQ(SQLITE_OK, other->Run("BEGIN EXCLUSIVE"));
  device.AddGame("com.ex.a", "A");
  LauncherPackageManager packages;
  device.ClearLogs();
  ASSERT_NO_FATAL_FAILURE(RunWithoutSleeping([&] { EXPECT_TRUE(store.Initialize(packages)); }));
  EXPECT_EQ(std::vector<std::string>{"E SQL error(5) : database is locked"},
            FromStore(EngineLogs()));

  ASSERT_EQ(SQLITE_OK, other->Run("COMMIT"));
  SqlProbe probe(DbPath());
  EXPECT_TRUE(probe.Rows("SELECT name FROM sqlite_master").empty());
  EXPECT_TRUE(store.Initialize(packages));
  EXPECT_EQ((std::vector<Row>{{"1", "Apps"}}), probe.Rows("SELECT menuId, name FROM Menus"));
  EXPECT_EQ((std::vector<Row>{{"1", "com.ex.a"}}),
            probe.Rows("SELECT parentId, appId FROM Boxes JOIN Pages USING (pageId)"));
}

// A package installed while the file is locked gets no box, now or later, but
// the layout is kept and the engine goes on.
class LockedEngineTest : public EngineTest {};

TEST_F(LockedEngineTest, InstallUnderALockIsLostAndTheLayoutKept) {
  AddGames({"Alpha", "Beta"});
  Start();
  std::vector<Row> before = db->Layout();
  OtherProcess other(DbPath());
  ASSERT_EQ(SQLITE_OK, other.Run("BEGIN EXCLUSIVE"));
  device.ClearLogs();
  ASSERT_NO_FATAL_FAILURE(RunWithoutSleeping([&] { device.Install(Game("com.ex.new", "New")); }));
  EXPECT_EQ(std::vector<std::string>{"E cannot find box with appid[com.ex.new]"},
            FromStore(EngineLogs()));

  ASSERT_EQ(SQLITE_OK, other.Run("COMMIT"));
  EXPECT_EQ(before, db->Layout());
  device.Install(Game("com.ex.later", "Later"));
  EXPECT_EQ((Lines{"alpha 1,1", "beta 2,1", "com.ex.later 3,1"}), Page(1));
}

}  // namespace
