// The layout database under stress: locked by another process, unreadable,
// read-only, on a full disk, or not a database at all. Every store operation
// answers its failure value without sleeping, and no row is lost. A locked
// operation gives up after the busy handler's five immediate retries: a file
// shim counts the refused lock requests (one try and five retries, six), and
// every C library call that waits for time is caught and counted.
#include <dlfcn.h>
#include <poll.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/select.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <functional>
#include <sstream>
#include <thread>

#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-package-manager/launcher-package-manager.h"
#include "session.h"
#include "support/file-shim.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {
bool g_catching = false;
int g_sleeps = 0, g_refusedLocks = 0;
void Waited() { g_sleeps += g_catching; }
}  // namespace

// The calls that wait for time. This binary exports them, so the dynamic
// linker binds the library's, SQLite's and libstdc++'s calls to these; a
// sleep returns at once, counted while catching. poll also serves file
// descriptors, so it is passed on when not catching. Raw system calls are not
// seen: qemu-user, where the ARM build's tests run, refuses seccomp filters.
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
  return reinterpret_cast<int (*)(pollfd*, nfds_t, int)>(dlsym(RTLD_NEXT, "poll"))(fds, n, timeout);
}
// With a 64-bit time_t on 32-bit ARM the names above are the 64-bit
// versions; libraries built with a 32-bit time_t still call the plain ones.
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

// Runs |body| catching every wait; none may be made.
void WithoutSleeping(const std::function<void()>& body) {
  g_sleeps = 0;
  g_catching = true;
  body();
  g_catching = false;
  EXPECT_EQ(0, g_sleeps) << "slept";
}

TEST(SleepCatcherTest, SeesSqliteAndStandardSleeps) {
  g_catching = true;
  sqlite3_sleep(1000);
  std::this_thread::sleep_for(std::chrono::seconds(1));
  g_catching = false;
  EXPECT_EQ(2, g_sleeps);
}

// Another process with a plain SQLite connection to |path|: Run has it run
// one line of SQL and returns the result code. A lock it takes stays until
// later SQL ends it or the process ends, as this object goes.
class OtherProcess {
 public:
  explicit OtherProcess(const std::string& path) {
    int toChild[2], toParent[2];
    if (pipe(toChild) != 0 || pipe(toParent) != 0 || (m_pid = fork()) < 0) abort();
    if (m_pid == 0) {
      close(toChild[1]);
      sqlite3* db = NULL;
      sqlite3_open_v2(path.c_str(), &db, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE, "unix");
      FILE* in = fdopen(toChild[0], "r");
      char sql[1024];
      while (fgets(sql, sizeof sql, in) != NULL) {
        dprintf(toParent[1], "%d\n", sqlite3_exec(db, sql, NULL, NULL, NULL));
      }
      _exit(0);
    }
    close(toChild[0]);
    close(toParent[1]);
    m_to = toChild[1];
    m_from = fdopen(toParent[0], "r");
  }
  ~OtherProcess() {
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

enum Condition { kExclusiveLock, kReservedLock, kBroken, kReadOnly, kFullDisk };

// The rest of the scope runs as "nobody" (real and effective user, as
// access() asks about the real one); the saved user stays root for the way back.
struct AsNobody {
  AsNobody() : dropped(geteuid() == 0 && setresuid(65534, 65534, 0) == 0) {}
  ~AsNobody() { EXPECT_TRUE(!dropped || setresuid(0, 0, 0) == 0); }
  bool dropped;
};
#define AS_NOBODY() \
  AsNobody nobody;  \
  if (geteuid() == 0) GTEST_SKIP() << "cannot give up root here"

// The rest of the scope may write no file past |bytes|; SIGXFSZ is ignored
// so that writes just fail.
struct FullDisk {
  explicit FullDisk(rlim_t bytes) {
    signal(SIGXFSZ, SIG_IGN);
    getrlimit(RLIMIT_FSIZE, &room);
    rlimit full = {bytes, room.rlim_max};
    EXPECT_EQ(0, setrlimit(RLIMIT_FSIZE, &full));
  }
  ~FullDisk() { setrlimit(RLIMIT_FSIZE, &room); }
  rlimit room;
};

class StressTest : public SimTest {
 protected:
  StressTest() {
    EXPECT_EQ(SQLITE_OK, fileshim::Install([](fileshim::Op op, const std::function<int()>& run) {
                int rc = run();
                g_refusedLocks += op == fileshim::Op::kLock && rc == SQLITE_BUSY;
                return rc;
              }));
    // Let nobody reach the file, so that only the file's own mode refuses.
    for (std::string dir = DbPath(); dir.size() > root.size();) {
      dir.erase(dir.rfind('/'));
      chmod(dir.c_str(), 0755);
    }
  }

  // Menu 1 "Apps", its page 1 and boxes 1 "a" and 2 "b", written through
  // the store, which stays open unless |close|.
  void WriteRows(bool close = false) {
    store._OpenDb();
    GameViewData menu;
    menu.name = "Apps";
    store.InsertMenuData(menu);
    GamePageData page;
    page.parentId = page.pageNo = 1;
    store.InsertPageData(page);
    for (const char* appId : {"a", "b"}) {
      GameBoxData box;
      box.pageId = box.row = 1;
      box.appId = appId;
      box.col = appId[0] - 'a' + 1;
      store.InsertBoxData(box);
    }
    if (close) store._CloseDb();
    rows = SqlProbe(DbPath()).Layout();
    device.ClearLogs();
  }

  // Every kind of store operation under |condition|, without sleeping: its
  // answer, and under a lock the refused lock requests, six a statement.
  void EveryOperationUnder(Condition condition) {
    GameViewData menu;
    menu.menuId = 1;
    GamePageData page;
    page.pageId = page.parentId = 1;
    GameBoxData box;
    box.boxId = box.pageId = 1;
    box.appId = "c";
    int parentId = 0, pageId = 0, boxId = 0;
    bool pageAdded = false;
    struct {
      const char* call;
      std::function<int()> run;
      bool reads;
      int answers[5];  // by Condition
    } cases[] = {
#define OP(call, reads, ...) {#call, [&] { return static_cast<int>(store.call); }, reads, __VA_ARGS__}
        // Inserts do not look at their step: they answer this connection's
        // last row id, and updates succeed.
        OP(InsertMenuData(menu), false, {2, 2, -1, 0, 2}),
        OP(InsertPageData(page), false, {2, 2, -1, 0, 2}),
        OP(InsertBoxData(box), false, {2, 2, -1, 0, 3}),
        OP(InsertBoxData("c", pageAdded), false, {2, 2, -1, 0, 3}),
        OP(InsertBoxDataForDeactivatedApp(1, "c"), false, {2, 2, -1, 0, 3}),
        OP(UpdateMenuData(menu), false, {1, 1, 0, 1, 1}),
        OP(UpdatePageData(page), false, {1, 1, 0, 1, 1}),
        OP(UpdateBoxData(box), false, {1, 1, 1, 1, 1}),
        OP(DeleteMenuData(1), false, {0, 0, 0, 0, 0}),
        OP(DeletePageData(1), false, {0, 0, 0, 0, 0}),
        OP(DeleteFolderPageData(1), false, {0, 0, 0, 0, 0}),
        OP(DeleteBoxData(1), false, {0, 0, 0, 0, 0}),
        // A read-only file still takes a read transaction.
        OP(BeginTransaction() && store.CommitTransaction(), false, {0, 0, 0, 1, 1}),
        OP(GetMenuDataCount(), true, {0, 1, 0, 1, 1}),
        OP(GetBoxDataCount(1), true, {0, 2, 0, 2, 2}),
        OP(_GetPageDataCountByDownload(1), true, {0, 2, 0, 2, 2}),
        OP(GetMenuData(1)->menuId, true, {0, 1, 0, 1, 1}),
        OP(GetMenuPageData(1)->pageId, true, {0, 1, 0, 1, 1}),
        OP(GetMenuBoxData(2)->boxId, true, {0, 2, 0, 2, 2}),
        OP(GetBoxIdByAppId("b", &parentId, &pageId, &boxId), true, {0, 1, 0, 1, 1}),
        OP(GetBoxDataByAppId("b")->boxId, true, {0, 2, 0, 2, 2}),
        OP(GetMenuDataList().size(), true, {0, 1, 0, 1, 1}),
        OP(GetPageDataList(1, false).size(), true, {0, 1, 0, 1, 1}),
        OP(GetBoxDataList(1).size(), true, {0, 2, 0, 2, 2}),
        OP(GetBoxDataListByAppId("a", 0).size(), true, {0, 1, 0, 1, 1}),
        OP(GetBoxDataListByAlphabeticalOrder(1, false).size(), true, {0, 2, 0, 2, 2}),
        // A menu always has its first virtual page.
        OP(GetPageDataListByAlphabeticalOrder(1, false).size(), true, {1, 1, 1, 1, 1}),
#undef OP
    };
    WithoutSleeping([&] {
      for (const auto& c : cases) {
        g_refusedLocks = 0;
        int answer = c.run();
        EXPECT_EQ(c.answers[condition], answer) << c.call;
        bool refused = condition == kExclusiveLock || (condition == kReservedLock && !c.reads);
        EXPECT_TRUE(refused ? g_refusedLocks > 0 && g_refusedLocks % 6 == 0 : g_refusedLocks == 0)
            << c.call << ": " << g_refusedLocks << " refused lock requests";
      }
    });
  }

  // Under a lock |begin| takes in another process, which also adds a menu:
  // once it commits, every row is there, and the store writes again.
  void UnderALock(const std::string& begin, Condition condition) {
    WriteRows();
    OtherProcess other(DbPath());
    ASSERT_EQ(SQLITE_OK, other.Run(begin + "; INSERT INTO Menus(name, type) VALUES('Other', 9)"));
    EveryOperationUnder(condition);
    ASSERT_EQ(SQLITE_OK, other.Run("COMMIT"));
    rows.insert(rows.begin() + 1, Row{"2", "Other", "9"});
    EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
    GameBoxData box;
    EXPECT_EQ(3, store.InsertBoxData(box));
  }

  LauncherDataManager store;
  LauncherPackageManager packages;
  std::vector<Row> rows;
};

TEST_F(StressTest, ExclusiveLockRefusesEveryOperationAfterFiveImmediateRetries) {
  UnderALock("BEGIN EXCLUSIVE", kExclusiveLock);
  EXPECT_EQ((std::vector<std::string>{"E sqlite error : database is locked",
                                      "E cannot find box with appid[b]"}),
            EngineMessages());
}

TEST_F(StressTest, ReservedLockRefusesWritesOnlyAfterFiveImmediateRetries) {
  UnderALock("BEGIN IMMEDIATE", kReservedLock);
  EXPECT_EQ(std::vector<std::string>{"E sqlite error : database is locked"}, EngineMessages());
}

TEST_F(StressTest, FirstLaunchUnderALockWritesNothingAndTheNextStartMakesIt) {
  OtherProcess other(DbPath());  // its open makes the empty file
  ASSERT_EQ(SQLITE_OK, other.Run("BEGIN EXCLUSIVE"));
  device.AddGame("a", "A");
  WithoutSleeping([&] { EXPECT_TRUE(store.Initialize(packages)); });
  EXPECT_EQ("E SQL error(5) : database is locked", EngineMessages().at(0));
  ASSERT_EQ(SQLITE_OK, other.Run("COMMIT"));
  EXPECT_TRUE(SqlProbe(DbPath()).Rows("SELECT name FROM sqlite_master").empty());
  EXPECT_TRUE(store.Initialize(packages));
  EXPECT_EQ((std::vector<Row>{{"Apps", "a"}}),
            SqlProbe(DbPath()).Rows("SELECT m.name, appId FROM Menus m, Pages p, Boxes b "
                                    "ON p.parentId = m.menuId AND b.pageId = p.pageId"));
}

TEST_F(StressTest, UnreadableFileLeavesTheStoreUnopenedAnsweringFailures) {
  WriteRows(true);
  ASSERT_EQ(0, chmod(DbPath().c_str(), 0));
  {
    AS_NOBODY();
    EXPECT_TRUE(store.Initialize(packages));  // the ids are listed and nothing is stored
    EXPECT_EQ(nullptr, store.m_db);
    EveryOperationUnder(kBroken);
  }
  EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
}

TEST_F(StressTest, ReadOnlyFileIsReadAndRefusesEveryWrite) {
  WriteRows(true);
  ASSERT_EQ(0, chmod(DbPath().c_str(), 0444));
  AS_NOBODY();
  store._OpenDb();
  EveryOperationUnder(kReadOnly);
  EXPECT_EQ(std::vector<std::string>{"E sqlite error : attempt to write a readonly database"},
            EngineMessages());
  EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
}

// A size limit fails a write with EFBIG, which SQLite reports as an I/O
// error where a full disk's ENOSPC is SQLITE_FULL; the store treats both alike.
TEST_F(StressTest, FullDiskRefusesEveryWriteAndWritesAgainOnceFreed) {
  WriteRows();
  {
    FullDisk disk(0);
    EveryOperationUnder(kFullDisk);
  }
  EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
  GameBoxData box;
  EXPECT_EQ(3, store.InsertBoxData(box));
  EXPECT_EQ("ok", SqlProbe(DbPath()).Value("PRAGMA integrity_check"));
}

TEST_F(StressTest, GarbageFileAnswersFailuresAndIsNeverOverwritten) {
  std::string garbage;
  for (int i = 0; i < 16384; ++i) garbage += static_cast<char>(i * 7 + 1);
  std::ofstream(DbPath(), std::ios::binary) << garbage;
  EXPECT_TRUE(store.Initialize(packages));
  EveryOperationUnder(kBroken);
  std::stringstream bytes;
  bytes << std::ifstream(DbPath(), std::ios::binary).rdbuf();
  EXPECT_EQ(garbage, bytes.str());
}

}  // namespace
