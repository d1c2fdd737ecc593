// The launcher killed in the middle of a write. Children of the test process
// (each from the library as loaded) run the engine through the file shim and
// die with SIGKILL before a numbered file operation that changes files; the
// database left must check out, and the next start must take it as it
// stands. The same statements on the same files make the same operations, so
// a failing kill comes again at the same number.
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <random>

#include "korrin-data/korrin-data.h"
#include "support/file-shim.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace fs = std::filesystem;

namespace {

typedef std::vector<std::string> Lines;
typedef std::vector<Row> Layout;  // as SqlProbe::Layout reads it

// The head of a rollback journal whose transaction has not ended; a journal
// kept after its commit (PERSIST) starts with zeros.
const char kJournalMagic[] = "\xd9\xd5\x05\xf9\x20\xa1\x63\xd7";
const size_t kFirstBox = 2, kAppId = 4, kCol = 6, kRow = 7;  // in a one-page layout

long g_operations = 0;  // file operations the child made so far

class KilledTest : public SimTest {
 protected:
  struct Run {
    long operations;  // made, when it ran to the end
    Lines logs;       // EngineMessages meanwhile
  };

  // Runs |body| in a child that dies with SIGKILL before file operation
  // |killAt| (never when 0). Syncs are counted but skipped: SIGKILL loses
  // nothing that reached the kernel, and thousands of fsyncs take long.
  Run Child(long killAt, const std::function<void()>& body) {
    int ends[2];
    if (pipe(ends) != 0) abort();
    pid_t pid = fork();
    if (pid == 0) {
      close(ends[0]);
      g_operations = 0;
      fileshim::Install([killAt](fileshim::Op op, const std::function<int()>& perform) {
        if (op == fileshim::Op::kLock) return perform();
        if (++g_operations == killAt) raise(SIGKILL);
        return op == fileshim::Op::kSync ? SQLITE_OK : perform();
      });
      device.ClearLogs();
      body();
      FILE* out = fdopen(ends[1], "w");
      fprintf(out, "%ld\n", g_operations);
      for (const std::string& line : EngineMessages()) fprintf(out, "%s\n", line.c_str());
      fclose(out);
      _exit(0);  // not exit(): the test process's objects are not the child's to end
    }
    close(ends[1]);
    Run run = {-1, {}};
    FILE* in = fdopen(ends[0], "r");
    if (fscanf(in, "%ld\n", &run.operations) != 1) run.operations = -1;
    for (char line[4096]; fgets(line, sizeof line, in) != nullptr;) {
      run.logs.emplace_back(line, strcspn(line, "\n"));
    }
    fclose(in);
    int status = -1;
    waitpid(pid, &status, 0);
    bool killed = WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL;
    EXPECT_TRUE(killAt != 0 ? killed : WIFEXITED(status) && run.operations >= 0)
        << "the child ended with status " << status;
    return run;
  }

  // |count| kill points over operations 1 to |last|, one at a seeded place
  // in each equal stretch; KORRIN_KILL_SEED replaces the seed.
  std::vector<long> Plan(long last, int count) {
    const char* seed = getenv("KORRIN_KILL_SEED");
    std::mt19937 random(seed != nullptr ? atol(seed) : 20150601);
    std::vector<long> plan;
    for (int i = 0; i < count; ++i) {
      long from = 1 + last * i / count, to = std::max(from, last * (i + 1) / count);
      plan.push_back(std::uniform_int_distribution<long>(from, to)(random));
    }
    return plan;
  }

  // Kills |body| before operation |killAt|, reads what it left through a
  // copy (so that the next start is the first to open the file), then starts
  // the engine after |before|. Both databases must check out.
  struct Aftermath {
    Layout left;   // missing tables read as empty
    Lines logs;    // of the next start
    Layout after;  // it
  };
  Aftermath KillAndRestart(long killAt, const std::function<void()>& body,
                           const std::function<void()>& before = [] {}) {
    SCOPED_TRACE("killed before file operation " + std::to_string(killAt));
    Child(killAt, body);
    std::string journal = DbPath() + "-journal", copy = root + "/left.db";
    char head[8] = {};
    std::ifstream(journal, std::ios::binary).read(head, sizeof head);
    hotJournals += std::equal(head, head + sizeof head, kJournalMagic);
    fs::remove(copy + "-journal");
    fs::copy_file(DbPath(), copy, fs::copy_options::overwrite_existing);
    if (fs::exists(journal)) fs::copy_file(journal, copy + "-journal");
    SqlProbe left(copy);
    EXPECT_EQ("ok", left.Value("PRAGMA integrity_check"));
    left.Exec(
        "CREATE TABLE IF NOT EXISTS Menus(menuId); CREATE TABLE IF NOT EXISTS Pages(pageId);"
        "CREATE TABLE IF NOT EXISTS Boxes(boxId)");
    Lines logs = Child(0, [&] {
                   before();
                   data_engin_initialization();
                 }).logs;
    SqlProbe db(DbPath());
    EXPECT_EQ("ok", db.Value("PRAGMA integrity_check"));
    return Aftermath{left.Layout(), logs, db.Layout()};
  }

  void AddGames(int count) {
    for (int i = 1; i <= count; ++i) {
      char id[16];
      snprintf(id, sizeof id, "game%02d", i);
      device.AddGame(id, id);
    }
  }

  void RemoveDatabase() {  // as on a new phone
    fs::remove(DbPath());
    fs::remove(DbPath() + "-journal");
  }

  int hotJournals = 0;
};

// Each insert of a first launch commits by itself and the menu comes first:
// the next start takes a store with a menu as it stands, and makes the whole
// first layout only when the menu never reached the file.
TEST_F(KilledTest, AFirstLaunchKilledAnywhereLeavesWhatTheNextStartTakesAsItStands) {
  long toTheMenu = Child(0, data_engin_initialization).operations;  // no game yet
  RemoveDatabase();
  AddGames(60);
  Run complete = Child(0, data_engin_initialization);
  const Layout firstLayout = SqlProbe(DbPath()).Layout();
  std::vector<long> plan = Plan(complete.operations, 20);
  for (long at = 1; at <= toTheMenu + 2; ++at) plan.push_back(at);
  int leftAMenu = 0;
  for (long at : plan) {
    RemoveDatabase();
    Aftermath a = KillAndRestart(at, data_engin_initialization);
    EXPECT_TRUE(a.left.size() <= firstLayout.size() &&
                std::equal(a.left.begin(), a.left.end(), firstLayout.begin()))
        << "killed at " << at << ", not a prefix of the first launch";
    leftAMenu += !a.left.empty();
    EXPECT_EQ(a.left.empty() ? complete.logs : Lines{"W it's not the first launch"}, a.logs);
    EXPECT_EQ(a.left.empty() ? firstLayout : a.left, a.after) << "killed at " << at;
  }
  EXPECT_LT(0, leftAMenu) << "no kill after the menu";
  EXPECT_GT(static_cast<int>(plan.size()), leftAMenu) << "no kill before the menu";
  EXPECT_LT(0, hotJournals) << "no kill fell inside a commit";
}

// The uninstall deletes the game's box, then rewrites every other box of the
// page from the first cell, each in a commit of its own, and nothing finishes
// a killed sequence later: the page is kept closed up to some box and as it
// was after it.
TEST_F(KilledTest, AnUninstallKilledWhileThePageClosesUpLeavesItClosedUpToABox) {
  AddGames(60);
  Child(0, data_engin_initialization);
  const Layout laidOut = SqlProbe(DbPath()).Layout();
  fs::copy_file(DbPath(), root + "/laid-out.db");
  auto uninstall = [&] {
    data_engin_initialization();
    device.Uninstall("game01");
  };
  // |laidOut| without game01, its first |moved| other boxes in the cells
  // from the first, four wide.
  auto closedUp = [&](size_t moved) {
    Layout rows(laidOut.begin(), laidOut.begin() + kFirstBox);
    for (size_t i = kFirstBox + 1; i < laidOut.size(); ++i) {
      rows.push_back(laidOut[i]);
      size_t rank = i - kFirstBox - 1;
      if (rank >= moved) continue;
      rows.back()[kCol] = std::to_string(rank % 4 + 1);
      rows.back()[kRow] = std::to_string(rank / 4 + 1);
    }
    return rows;
  };
  ASSERT_EQ("game01", laidOut[kFirstBox][kAppId]);
  int partly = 0;
  for (long at : Plan(Child(0, uninstall).operations, 20)) {
    RemoveDatabase();
    fs::copy_file(root + "/laid-out.db", DbPath());
    // The platform finished the uninstall; only the launcher was killed.
    Aftermath a = KillAndRestart(at, uninstall, [&] { device.RemovePackage("game01"); });
    EXPECT_EQ(Lines{"W it's not the first launch"}, a.logs);
    EXPECT_EQ(a.left, a.after) << "killed at " << at << ", the next start rewrote the store";
    size_t moved = 0;
    while (moved < laidOut.size() && closedUp(moved) != a.after) ++moved;
    EXPECT_TRUE(a.after == laidOut || moved < laidOut.size())
        << "killed at " << at << ", not the page closed up to a box and as it was after it";
    partly += moved > 0 && moved < laidOut.size() - kFirstBox - 1;
  }
  EXPECT_LT(0, partly) << "no kill fell while the page closed up";
}

}  // namespace
