// The launcher killed in the middle of a write: forked children run the
// engine on nine games through the file shim and die with SIGKILL before one
// file operation, each in turn (the same statements make the same
// operations); the database left must check out, and the next start must
// take it as it stands.
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <functional>

#include "korrin-data/korrin-data.h"
#include "support/file-shim.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace fs = std::filesystem;

namespace {

typedef std::vector<std::string> Lines;
typedef std::vector<Row> Layout;  // as SqlProbe::Layout reads it

const size_t kFirstBox = 2, kCol = 6, kRow = 7;  // in a one-page layout
const Lines kNotFirst = {"W it's not the first launch"};

long g_operations = 0;  // file operations the child made so far

class KilledTest : public SimTest {
 protected:
  KilledTest() {
    for (char id[] = "game1"; id[4] <= '9'; ++id[4]) device.AddGame(id, id);
  }

  // Runs |body| in a child that dies with SIGKILL before file operation
  // |killAt| (never when 0); the operations it made and its logs if it ended.
  // Syncs are counted but skipped: SIGKILL loses nothing the kernel has.
  std::pair<long, Lines> Child(long killAt, const std::function<void()>& body) {
    const std::string report = root + "/child-report";
    fs::remove(report);
    pid_t pid = fork();
    if (pid == 0) {
      fileshim::Install([killAt](fileshim::Op op, const std::function<int()>& perform) {
        if (op == fileshim::Op::kLock) return perform();
        if (++g_operations == killAt) raise(SIGKILL);
        return op == fileshim::Op::kSync ? SQLITE_OK : perform();
      });
      device.ClearLogs();
      body();
      std::ofstream out(report);
      out << g_operations << "\n";
      for (const std::string& line : EngineMessages()) out << line << "\n";
      out.close();
      _exit(0);  // not exit(): the test process's objects are not the child's to end
    }
    int status = -1;
    waitpid(pid, &status, 0);
    EXPECT_TRUE(killAt != 0 ? WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL
                            : WIFEXITED(status) && WEXITSTATUS(status) == 0)
        << "the child ended with status " << status;
    std::pair<long, Lines> run(-1, Lines());
    std::ifstream in(report);
    in >> run.first;
    in.ignore();
    for (std::string line; std::getline(in, line);) run.second.push_back(line);
    return run;
  }

  // Kills |body| on the database |from| (none if empty) before operation
  // |killAt|, starts the engine after |before|: its logs, and the layout.
  std::pair<Lines, Layout> KillAndRestart(const std::string& from, long killAt,
                                          const std::function<void()>& body,
                                          const std::function<void()>& before = [] {}) {
    fs::remove(DbPath() + "-journal");
    fs::remove(DbPath());
    if (!from.empty()) fs::copy_file(from, DbPath());
    Child(killAt, body);
    Lines logs = Child(0, [&] {
                   before();
                   data_engin_initialization();
                 }).second;
    SqlProbe db(DbPath());
    EXPECT_EQ("ok", db.Value("PRAGMA integrity_check")) << "killed at " << killAt;
    return std::make_pair(logs, db.Layout());
  }
};

// Each insert of a first launch commits by itself and the menu comes first:
// the next start takes a store with a menu as it stands, and makes the whole
// first layout only when the menu never reached the file.
TEST_F(KilledTest, AFirstLaunchKilledAnywhereLeavesWhatTheNextStartTakesAsItStands) {
  std::pair<long, Lines> complete = Child(0, data_engin_initialization);
  const Layout firstLayout = SqlProbe(DbPath()).Layout();
  for (long at = 1; at <= complete.first; ++at) {
    std::pair<Lines, Layout> next = KillAndRestart("", at, data_engin_initialization);
    const Layout& after = next.second;
    EXPECT_TRUE(next.first == complete.second
                    ? after == firstLayout
                    : next.first == kNotFirst && after.size() <= firstLayout.size() &&
                          std::equal(after.begin(), after.end(), firstLayout.begin()))
        << "killed at " << at << ": not the first launch, nor a part of it taken as it stands";
  }
}

// The uninstall deletes the game's box, then rewrites every other box from
// the first cell, each in a commit of its own, and nothing finishes a killed
// sequence: the page stays closed up to some box and as it was after it.
TEST_F(KilledTest, AnUninstallKilledWhileThePageClosesUpLeavesItClosedUpToABox) {
  Child(0, data_engin_initialization);
  const Layout laidOut = SqlProbe(DbPath()).Layout();
  const std::string laidOutFile = root + "/laid-out.db";
  fs::copy_file(DbPath(), laidOutFile);
  // |laidOut| without game1's box, the first |moved| others in the cells
  // from the first, four wide.
  auto closedUp = [&](size_t moved) {
    Layout rows(laidOut.begin(), laidOut.begin() + kFirstBox);
    for (size_t i = kFirstBox + 1, rank = 0; i < laidOut.size(); ++i, ++rank) {
      rows.push_back(laidOut[i]);
      if (rank >= moved) continue;
      rows.back()[kCol] = std::to_string(rank % 4 + 1);
      rows.back()[kRow] = std::to_string(rank / 4 + 1);
    }
    return rows;
  };
  auto uninstall = [&] {
    data_engin_initialization();
    device.Uninstall("game1");
  };
  const long operations = Child(0, uninstall).first;
  EXPECT_EQ(closedUp(laidOut.size()), SqlProbe(DbPath()).Layout()) << "not closed up at the end";
  for (long at = 1; at <= operations; ++at) {
    // The platform finished the uninstall; only the launcher was killed.
    std::pair<Lines, Layout> next =
        KillAndRestart(laidOutFile, at, uninstall, [&] { device.RemovePackage("game1"); });
    EXPECT_EQ(kNotFirst, next.first);
    size_t moved = 0;
    while (moved < laidOut.size() && closedUp(moved) != next.second) ++moved;
    EXPECT_TRUE(next.second == laidOut || moved < laidOut.size())
        << "killed at " << at << ": not the page closed up to a box and as it was after it";
  }
}

}  // namespace
