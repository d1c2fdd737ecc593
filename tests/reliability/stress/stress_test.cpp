// The layout database locked by another process, unreadable, read-only, on a
// full disk, or not a database at all: every store operation answers its
// failure value without a wait, and no row is lost. Under a lock a statement
// gives up after the busy handler's five immediate retries: a file shim counts
// refused lock requests (a try and five retries, six), and every C library
// call that waits for time is caught.
#include <dlfcn.h>
#include <poll.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/select.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <functional>
#include <iterator>
#include <thread>

#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-package-manager/launcher-package-manager.h"
#include "support/file-shim.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {
bool g_catching = false;
int g_sleeps = 0, g_refusedLocks = 0;
void Waited() { g_sleeps += g_catching; }
}  // namespace

// The calls that wait for time, exported by this binary so that every library
// binds to them: a sleep returns at once, counted while catching (poll also
// serves file descriptors, and is passed on when not). Raw system calls are
// not seen: qemu-user, where the ARM build's tests run, refuses seccomp.
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

// Counts the waits |body| makes.
int Sleeps(const std::function<void()>& body) {
  g_sleeps = 0;
  g_catching = true;
  body();
  g_catching = false;
  return g_sleeps;
}

TEST(SleepCatcherTest, SeesSqliteAndStandardSleeps) {
  EXPECT_EQ(2, Sleeps([] {
              sqlite3_sleep(1000);
              std::this_thread::sleep_for(std::chrono::seconds(1));
            }));
}

// Another process holding the lock |sql| takes, with its writes, until it
// commits as this object goes; made while this one holds no lock on the file.
struct OtherProcess {
  OtherProcess(const std::string& path, const std::string& sql) {
    if (socketpair(AF_UNIX, SOCK_STREAM, 0, m_ends) != 0 || (m_pid = fork()) < 0) abort();
    if (m_pid == 0) {
      close(m_ends[0]);
      sqlite3* db = NULL;
      sqlite3_open(path.c_str(), &db);
      char rc = static_cast<char>(sqlite3_exec(db, sql.c_str(), NULL, NULL, NULL));
      if (write(m_ends[1], &rc, 1) == 1 && read(m_ends[1], &rc, 1) == 0) {  // until closed
        sqlite3_exec(db, "COMMIT", NULL, NULL, NULL);
      }
      _exit(0);
    }
    close(m_ends[1]);
    char rc = -1;
    held = read(m_ends[0], &rc, 1) == 1 ? rc : -1;
  }
  ~OtherProcess() {
    close(m_ends[0]);
    waitpid(m_pid, NULL, 0);
  }
  int m_ends[2];
  pid_t m_pid;
  int held;  // |sql|'s result code
};

enum Condition { kExclusiveLock, kReservedLock, kBroken, kReadOnly, kFullDisk };

class StressTest : public SimTest {
 protected:
  // Menu 1 "Apps", its page 1 and boxes 1 "a" and 2 "b", in a file anyone
  // may reach (only its own mode refuses); the store stays open unless |close|.
  void WriteRows(bool close = false) {
    EXPECT_EQ(SQLITE_OK, fileshim::Install([](fileshim::Op op, const std::function<int()>& run) {
                int rc = run();
                g_refusedLocks += op == fileshim::Op::kLock && rc == SQLITE_BUSY;
                return rc;
              }));
    for (std::string dir = DbPath(); dir.size() > root.size(); chmod(dir.c_str(), 0755)) {
      dir.erase(dir.rfind('/'));
    }
    store._OpenDb();
    SqlProbe(DbPath()).Exec(
        "INSERT INTO Menus(name, type) VALUES('Apps', 0);"
        "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 1, 1);"
        "INSERT INTO Boxes(isFolder, pageId, appId, col, row, isPreload, isSystem, boxType, "
        "launchType) VALUES(0, 1, 'a', 1, 1, 0, 0, 0, 0), (0, 1, 'b', 2, 1, 0, 0, 0, 0);");
    if (close) store._CloseDb();
    rows = SqlProbe(DbPath()).Layout();
    device.ClearLogs();
  }

  // Every kind of store operation under |condition|, without a wait: its
  // answer, and under a lock the refused lock requests, six a statement.
  void EveryOperationUnder(Condition condition) {
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
#define OP(call, reads, ...) \
  {#call, [&] { return static_cast<int>(store.call); }, reads, __VA_ARGS__}
        // Inserts do not look at their step: they answer this connection's
        // last row id, or the id the row would have had; updates succeed.
        OP(InsertBoxData(box), false, {0, 0, -1, 0, 3}),
        OP(InsertBoxData("c", pageAdded), false, {0, 0, -1, 0, 3}),
        OP(UpdateBoxData(box), false, {1, 1, 1, 1, 1}),
        OP(DeleteBoxData(1), false, {0, 0, 0, 0, 0}),
        // A read-only file still takes a read transaction.
        OP(BeginTransaction() && store.CommitTransaction(), false, {0, 0, 0, 1, 1}),
        OP(GetMenuDataCount(), true, {0, 1, 0, 1, 1}),
        OP(GetMenuBoxData(2)->boxId, true, {0, 2, 0, 2, 2}),
        OP(GetBoxIdByAppId("b", &parentId, &pageId, &boxId), true, {0, 1, 0, 1, 1}),
        OP(GetBoxDataByAppId("b")->boxId, true, {0, 2, 0, 2, 2}),
        OP(GetBoxDataListByAlphabeticalOrder(1, false).size(), true, {0, 2, 0, 2, 2}),
        // A menu always has its first virtual page.
        OP(GetPageDataListByAlphabeticalOrder(1, false).size(), true, {1, 1, 1, 1, 1}),
#undef OP
    };
    for (const auto& c : cases) {
      g_refusedLocks = 0;
      EXPECT_EQ(0, Sleeps([&] { EXPECT_EQ(c.answers[condition], c.run()) << c.call; }));
      bool refused = condition == kExclusiveLock || (condition == kReservedLock && !c.reads);
      EXPECT_TRUE(refused ? g_refusedLocks > 0 && g_refusedLocks % 6 == 0 : g_refusedLocks == 0)
          << c.call << ": " << g_refusedLocks << " refused lock requests";
    }
  }

  // The operations while another process holds the lock |begin| takes and
  // adds a menu; once it commits every row is there, and the store writes.
  void UnderALock(const std::string& begin, Condition condition) {
    WriteRows();
    {
      OtherProcess other(DbPath(), begin + "; INSERT INTO Menus(name, type) VALUES('Other', 9)");
      ASSERT_EQ(SQLITE_OK, other.held);
      EveryOperationUnder(condition);
    }
    rows.insert(rows.begin() + 1, Row{"2", "Other", "9"});
    EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
    GameBoxData box;
    EXPECT_EQ(3, store.InsertBoxData(box));
  }

  // The rows in a closed file of |mode|, which only a user other than root
  // meets: "nobody" from here (real and effective, as access() asks about the
  // real one), root the saved user. False where root cannot be given up.
  bool WithMode(mode_t mode) {
    WriteRows(true);
    EXPECT_EQ(0, chmod(DbPath().c_str(), mode));
    return geteuid() != 0 || (nobody = setresuid(65534, 65534, 0) == 0);
  }
  void AsRootAgain() { nobody = nobody && setresuid(0, 0, 0) != 0; }
  ~StressTest() override { AsRootAgain(); }  // the sanitizers' checks at exit need root

  LauncherDataManager store;
  LauncherPackageManager packages;
  std::vector<Row> rows;
  bool nobody = false;
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

TEST_F(StressTest, UnreadableFileLeavesTheStoreUnopenedAnsweringFailures) {
  if (!WithMode(0)) GTEST_SKIP() << "cannot give up root here";
  EXPECT_TRUE(store.Initialize(packages));  // the ids are listed and nothing is stored
  EXPECT_EQ(nullptr, store.m_db);
  EveryOperationUnder(kBroken);
  AsRootAgain();
  EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
}

TEST_F(StressTest, ReadOnlyFileIsReadAndRefusesEveryWrite) {
  if (!WithMode(0444)) GTEST_SKIP() << "cannot give up root here";
  store._OpenDb();
  EveryOperationUnder(kReadOnly);
  EXPECT_EQ(std::vector<std::string>{"E sqlite error : attempt to write a readonly database"},
            EngineMessages());
  EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
}

// A file size limit fails a write with EFBIG, an I/O error to SQLite where a
// full disk's ENOSPC is SQLITE_FULL; the store treats both alike.
TEST_F(StressTest, FullDiskRefusesEveryWriteAndWritesAgainOnceFreed) {
  WriteRows();
  signal(SIGXFSZ, SIG_IGN);
  rlimit room, full;
  getrlimit(RLIMIT_FSIZE, &room);
  full = {0, room.rlim_max};
  ASSERT_EQ(0, setrlimit(RLIMIT_FSIZE, &full));
  EveryOperationUnder(kFullDisk);
  ASSERT_EQ(0, setrlimit(RLIMIT_FSIZE, &room));
  EXPECT_EQ(std::vector<std::string>{"E sqlite error : disk I/O error"}, EngineMessages());
  EXPECT_EQ(rows, SqlProbe(DbPath()).Layout());
  GameBoxData box;
  EXPECT_EQ(3, store.InsertBoxData(box));
}

TEST_F(StressTest, GarbageFileAnswersFailuresAndIsNeverOverwritten) {
  std::string garbage;
  for (int i = 0; i < 16384; ++i) garbage += static_cast<char>(i * 7 + 1);
  std::ofstream(DbPath(), std::ios::binary) << garbage;
  EXPECT_TRUE(store.Initialize(packages));
  EveryOperationUnder(kBroken);
  std::ifstream file(DbPath(), std::ios::binary);
  EXPECT_EQ(garbage, std::string(std::istreambuf_iterator<char>(file), {}));
}

}  // namespace
