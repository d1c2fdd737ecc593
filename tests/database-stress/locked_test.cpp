// The layout database while another process holds a lock on it. Every store
// operation gives up after the busy handler's five immediate retries and
// answers its failure value; once the lock is gone everything works again and
// every row written before it is still there.
//
// "Immediate" is shown without a clock. The store's connection goes through the
// file shim, which counts the lock requests the file refused: one try and
// five retries make six. The operations run on a thread where a seccomp
// filter turns every system call that waits for time into a counted SIGSYS,
// so any sleep between the retries, SQLite's or the handler's own, shows.
#include <dlog.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <signal.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "database-stress/store-log.h"
#include "engine/engine-test.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-package-manager/launcher-package-manager.h"
#include "support/file-shim.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

// ---- The watching VFS.

int g_refusedLocks = 0;

// Makes the file shim the default VFS, counting the lock requests the file
// refused, so that db_util_open's plain sqlite3_open goes through it.
void WatchTheFile() {
  ASSERT_EQ(SQLITE_OK, fileshim::Install([](fileshim::Op op, const std::function<int()>& perform) {
              int rc = perform();
              if (op == fileshim::Op::kLock && rc == SQLITE_BUSY) ++g_refusedLocks;
              return rc;
            }));
}

// ---- Catching sleeps.

volatile sig_atomic_t g_sleeps = 0;

// Runs |body| on a thread of its own on which every system call that waits
// for time fails at once (ENOSYS) and is counted in g_sleeps. The filter goes
// with the thread. False, with |body| not run, where seccomp is not offered.
bool RunWithoutSleeping(const std::function<void()>& body) {
  static const int kWaits[] = {
      SYS_nanosleep, SYS_clock_nanosleep, SYS_pselect6, SYS_ppoll,
#ifdef SYS_select
      SYS_select,
#endif
#ifdef SYS_poll
      SYS_poll,
#endif
  };
  const unsigned n = sizeof kWaits / sizeof kWaits[0];
  std::vector<sock_filter> filter = {
      BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr))};
  for (unsigned i = 0; i < n; ++i) {
    filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(kWaits[i]),
                              static_cast<unsigned char>(n - i), 0));
  }
  filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
  filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_TRAP));
  sock_fprog program = {static_cast<unsigned short>(filter.size()), filter.data()};

  struct sigaction counting = {};
  counting.sa_sigaction = [](int, siginfo_t*, void*) { ++g_sleeps; };
  counting.sa_flags = SA_SIGINFO;
  sigaction(SIGSYS, &counting, NULL);
  g_sleeps = 0;
  bool filtered = false;
  std::thread thread([&] {
    filtered = prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
               prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
    if (filtered) body();
  });
  thread.join();
  return filtered;
}

// ---- The other process.

bool WriteAll(int fd, const void* data, size_t size) {
  return write(fd, data, size) == static_cast<ssize_t>(size);
}

bool ReadAll(int fd, void* data, size_t size) {
  for (char* at = static_cast<char*>(data); size > 0;) {
    ssize_t got = read(fd, at, size);
    if (got <= 0) return false;
    at += got;
    size -= static_cast<size_t>(got);
  }
  return true;
}

// A process with a plain SQLite connection of its own to |path|, driven
// through two pipes: Run has it execute SQL and returns the result code there.
// A lock its SQL leaves (an open transaction) stays held until later SQL ends
// it or the process goes. It must be forked while this process holds no lock
// on the file: a child forked under one would inherit SQLite's in-memory
// record of that lock and believe it held it too.
class OtherProcess {
 public:
  explicit OtherProcess(const std::string& path) {
    int toChild[2];
    int toParent[2];
    if (pipe(toChild) != 0 || pipe(toParent) != 0) {
      ADD_FAILURE() << "no pipe";
      return;
    }
    m_pid = fork();
    if (m_pid < 0) ADD_FAILURE() << "no fork";
    if (m_pid == 0) {
      close(toChild[1]);
      close(toParent[0]);
      Serve(path, toChild[0], toParent[1]);
    }
    close(toChild[0]);
    close(toParent[1]);
    m_to = toChild[1];
    m_from = toParent[0];
  }

  // Closing the pipe ends the process, and with it any lock still held.
  ~OtherProcess() {
    close(m_to);
    close(m_from);
    int status = 0;
    if (m_pid > 0) waitpid(m_pid, &status, 0);
  }

  // |sql|'s result code in the other process; -1 when it did not answer.
  int Run(const std::string& sql) {
    uint32_t size = static_cast<uint32_t>(sql.size());
    int rc = -1;
    if (!WriteAll(m_to, &size, sizeof size) || !WriteAll(m_to, sql.data(), size) ||
        !ReadAll(m_from, &rc, sizeof rc)) {
      return -1;
    }
    return rc;
  }

 private:
  [[noreturn]] static void Serve(const std::string& path, int in, int out) {
    sqlite3* db = NULL;
    sqlite3_open_v2(path.c_str(), &db, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE, "unix");
    uint32_t size = 0;
    while (ReadAll(in, &size, sizeof size)) {
      std::string sql(size, '\0');
      if (!ReadAll(in, &sql[0], size)) break;
      int rc = sqlite3_exec(db, sql.c_str(), NULL, NULL, NULL);
      if (!WriteAll(out, &rc, sizeof rc)) break;
    }
    _exit(0);
  }

  pid_t m_pid = -1;
  int m_to = -1;
  int m_from = -1;
};

// ---- The store under a lock.

class LockedTest : public SimTest {
 protected:
  LockedTest() { WatchTheFile(); }

  // Opens the store with menu 1 "Apps", its page 1 and boxes 1 "a" and 2 "b"
  // written through it, then starts the other process.
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

  // Runs every kind of store operation while the other process, having
  // written a menu of its own, holds the lock |begin| takes. Each gives up at
  // once: six refusals, no sleep. Reads succeed when |readsWork|; writes never
  // do, and change no row.
  void EveryOperationUnder(const std::string& begin, bool readsWork) {
    std::vector<Row> before = probe->Layout();
    ASSERT_EQ(SQLITE_OK, other->Run(begin + "; INSERT INTO Menus(name, type) VALUES('Other', 9)"));
    GameViewData menu;
    menu.menuId = 1;
    menu.name = "Games";
    GamePageData page;
    page.pageId = 1;
    page.parentId = 1;
    page.pageNo = 2;
    GameBoxData box;
    box.boxId = 1;
    box.pageId = 1;
    box.appId = "c";
    int parentId = 0, pageId = 0, boxId = 0;
    const int read = readsWork ? 1 : 0;
    struct {
      const char* call;
      std::function<int()> run;
      bool writes;
      int answer;
    } cases[] = {
        // An insert does not look at its step: it answers the last row id
        // this connection made, box 2's, and writes that into the record.
        {"InsertMenuData", [&] { return store.InsertMenuData(menu); }, true, 2},
        {"InsertPageData", [&] { return store.InsertPageData(page); }, true, 2},
        {"InsertBoxData", [&] { return store.InsertBoxData(box); }, true, 2},
        // Nor does an update: true, with nothing written.
        {"UpdateMenuData", [&] { return store.UpdateMenuData(menu); }, true, true},
        {"UpdatePageData", [&] { return store.UpdatePageData(page); }, true, true},
        {"UpdateBoxData", [&] { return store.UpdateBoxData(box); }, true, true},
        {"DeleteMenuData", [&] { return store.DeleteMenuData(1); }, true, false},
        {"DeletePageData", [&] { return store.DeletePageData(1); }, true, false},
        {"DeleteFolderPageData", [&] { return store.DeleteFolderPageData(1); }, true, false},
        {"DeleteBoxData", [&] { return store.DeleteBoxData(1); }, true, false},
        {"BeginTransaction", [&] { return store.BeginTransaction(); }, true, false},
        {"GetMenuDataCount", [&] { return store.GetMenuDataCount(); }, false, read},
        {"GetBoxDataCount", [&] { return store.GetBoxDataCount(1); }, false, 2 * read},
        {"_GetPageDataCountByDownload", [&] { return store._GetPageDataCountByDownload(1); }, false,
         2 * read},
        {"GetMenuData", [&] { return store.GetMenuData(1)->menuId; }, false, read},
        {"GetMenuPageData", [&] { return store.GetMenuPageData(1)->pageId; }, false, read},
        {"GetMenuBoxData", [&] { return store.GetMenuBoxData(2)->boxId; }, false, 2 * read},
        {"GetBoxIdByAppId", [&] { return store.GetBoxIdByAppId("b", &parentId, &pageId, &boxId); },
         false, read},
        {"GetBoxDataByAppId", [&] { return store.GetBoxDataByAppId("b")->boxId; }, false, 2 * read},
        {"GetMenuDataList", [&] { return store.GetMenuDataList().size(); }, false, read},
        {"GetPageDataList", [&] { return store.GetPageDataList(1, false).size(); }, false, read},
        {"GetBoxDataList", [&] { return store.GetBoxDataList(1).size(); }, false, 2 * read},
        {"GetBoxDataListByAppId", [&] { return store.GetBoxDataListByAppId("a", 0).size(); }, false,
         read},
    };
    ASSERT_TRUE(RunWithoutSleeping([&] {
      for (const auto& c : cases) {
        g_refusedLocks = 0;
        EXPECT_EQ(c.answer, c.run()) << c.call;
        EXPECT_EQ(c.writes || !readsWork ? 6 : 0, g_refusedLocks) << c.call;
      }
    })) << "no seccomp here";
    EXPECT_EQ(0, g_sleeps);
    EXPECT_EQ(2, menu.menuId);
    std::vector<std::string> logs = {"E sqlite error : database is locked"};
    if (!readsWork) logs.push_back("E cannot find box with appid[b]");
    EXPECT_EQ(logs, EngineMessages());

    // Let go: the rows are as they were, with the other process's menu
    // added, and the store reads that menu and writes again.
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

// The only commit inside the library is the rearrangement's. Refused by a
// reader, it leaves the store inside its transaction holding the lock it
// asked for: once the reader is done nobody else can begin to read, and the
// store's later writes join the transaction, until the host commits.
TEST_F(LockedTest, CommitRefusedByAReaderLeavesTheTransactionOpenUntilCommittedAgain) {
  OpenWithRows();
  probe->Exec("UPDATE Boxes SET col = 3 WHERE appId = 'b'");  // a gap to close
  ASSERT_EQ(SQLITE_OK, other->Run("BEGIN; SELECT count(*) FROM Menus"));

  g_refusedLocks = 0;
  ASSERT_TRUE(RunWithoutSleeping([&] { store.RearrangeAppsPosition(); }));
  EXPECT_EQ(6, g_refusedLocks);
  EXPECT_EQ(0, g_sleeps);

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

  ASSERT_TRUE(RunWithoutSleeping([&] { EXPECT_TRUE(store.Initialize(packages)); }));
  EXPECT_EQ(0, g_sleeps);
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

// ---- The engine: a package installed while the file is locked.

class LockedEngineTest : public EngineTest {};

// The install's event finds the store refusing: the game gets no box, and is
// not placed later either, but the layout is kept and the engine goes on.
TEST_F(LockedEngineTest, InstallUnderALockIsLostAndTheLayoutKept) {
  AddGames({"Alpha", "Beta"});
  Start();
  std::vector<Row> before = db->Layout();
  OtherProcess other(DbPath());
  ASSERT_EQ(SQLITE_OK, other.Run("BEGIN EXCLUSIVE"));
  device.ClearLogs();

  ASSERT_TRUE(RunWithoutSleeping([&] { device.Install(Game("com.ex.new", "New")); }));
  EXPECT_EQ(0, g_sleeps);
  EXPECT_EQ(std::vector<std::string>{"E cannot find box with appid[com.ex.new]"},
            FromStore(EngineLogs()));

  ASSERT_EQ(SQLITE_OK, other.Run("COMMIT"));
  EXPECT_EQ(before, db->Layout());
  device.Install(Game("com.ex.later", "Later"));
  EXPECT_EQ((Lines{"alpha 1,1", "beta 2,1", "com.ex.later 3,1"}), Page(1));
}

}  // namespace
