#include "reliability/killed/killed-test.h"

#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <random>

#include "korrin-data/korrin-data.h"
#include "support/file-shim.h"

namespace fs = std::filesystem;

namespace {

// The head of a rollback journal whose transaction has not ended; a journal
// kept after its commit (PERSIST) starts with zeros.
const char kJournalMagic[] = "\xd9\xd5\x05\xf9\x20\xa1\x63\xd7";

long FromEnvironment(const char* name, long fallback) {
  const char* text = getenv(name);
  return text != nullptr && *text != '\0' ? strtol(text, nullptr, 10) : fallback;
}

long g_operations = 0;  // file operations the child made so far

// Counts the operations that change files and dies at |point|. Syncs are
// counted but skipped: SIGKILL loses nothing that reached the kernel, and
// without fsync thousands of autocommits take a fraction of a second.
void DieAt(KillPoint point) {
  g_operations = 0;
  int rc = fileshim::Install([point](fileshim::Op op, const std::function<int()>& perform) {
    if (op == fileshim::Op::kLock) return perform();
    long n = ++g_operations;
    if (n == point.op && !point.afterIt) raise(SIGKILL);
    int result = op == fileshim::Op::kSync ? SQLITE_OK : perform();
    if (n == point.op) raise(SIGKILL);
    return result;
  });
  if (rc != SQLITE_OK) abort();
}

}  // namespace

std::ostream& operator<<(std::ostream& out, const Kill& kill) {
  return out << "kill " << kill.number << " of " << kill.of << " (KORRIN_KILL_SEED=" << kill.seed
             << "): " << (kill.point.afterIt ? "after" : "before") << " file operation "
             << kill.point.op << " of " << kill.operations;
}

// The child writes its operation count, then its logs, a line each, to a pipe.
KilledTest::Run KilledTest::RunChild(KillPoint kill, const std::function<void()>& body) {
  int ends[2];
  if (pipe(ends) != 0) abort();
  pid_t pid = fork();
  if (pid == 0) {
    close(ends[0]);
    DieAt(kill);
    device.ClearLogs();
    body();
    FILE* out = fdopen(ends[1], "w");
    fprintf(out, "%ld\n", g_operations);
    for (const std::string& line : EngineMessages()) fprintf(out, "%s\n", line.c_str());
    fclose(out);
    _exit(0);  // not exit(): the test process's objects are not the child's to end
  }
  close(ends[1]);
  Run run = {false, 0, {}};
  FILE* in = fdopen(ends[0], "r");
  bool ended = fscanf(in, "%ld\n", &run.operations) == 1;
  for (char line[4096]; fgets(line, sizeof line, in) != nullptr;) {
    run.logs.emplace_back(line, strcspn(line, "\n"));
  }
  fclose(in);
  int status = -1;
  if (pid > 0) waitpid(pid, &status, 0);
  run.killed = WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL;
  if (!run.killed && (!ended || !WIFEXITED(status) || WEXITSTATUS(status) != 0)) {
    ADD_FAILURE() << "the child "
                  << (WIFSIGNALED(status) ? "died of signal " : "exited with status ")
                  << (WIFSIGNALED(status) ? WTERMSIG(status) : WEXITSTATUS(status));
  }
  return run;
}

KilledTest::Run KilledTest::RunToTheEnd(const std::function<void()>& body) {
  Run run = RunChild(KillPoint(), body);
  EXPECT_FALSE(run.killed);
  return run;
}

Lines KilledTest::AddGames(int count) {
  Lines ids;
  char id[16];
  for (int i = 1; i <= count; ++i) {
    snprintf(id, sizeof id, "game%04d", i);
    device.AddGame(id, id);
    ids.push_back(id);
  }
  return ids;
}

std::vector<Kill> KilledTest::Plan(long first, long last, int count) {
  unsigned seed = static_cast<unsigned>(FromEnvironment("KORRIN_KILL_SEED", 20150601));
  count = static_cast<int>(FromEnvironment("KORRIN_KILLS", count));
  std::mt19937 random(seed);
  std::vector<Kill> plan;
  long span = last - first + 1;
  for (int i = 0; i < count; ++i) {
    long from = first + span * i / count;
    long to = std::max(from, first + span * (i + 1) / count - 1);
    KillPoint point{std::uniform_int_distribution<long>(from, to)(random), random() % 2 == 1};
    plan.push_back(Kill{point, i + 1, count, seed, last});
  }
  if (!plan.empty()) plan.back().point = {last, true};
  return plan;
}

KilledTest::Aftermath KilledTest::KillAndRestart(KillPoint kill, const std::function<void()>& body,
                                                 const std::function<void()>& before) {
  EXPECT_TRUE(RunChild(kill, body).killed);
  std::string journal = DbPath() + "-journal", copy = root + "/leftover.db";
  char head[8] = {};
  std::ifstream(journal, std::ios::binary).read(head, sizeof head);
  hotJournals += std::equal(head, head + sizeof head, kJournalMagic);
  fs::remove(copy + "-journal");
  fs::copy_file(DbPath(), copy, fs::copy_options::overwrite_existing);
  if (fs::exists(journal)) fs::copy_file(journal, copy + "-journal");
  Aftermath after;
  SqlProbe leftover(copy);
  EXPECT_EQ("ok", leftover.Value("PRAGMA integrity_check"));
  // A kill while the schema was made leaves tables missing: make them empty.
  leftover.Exec(
      "create table if not exists Menus(menuId, name, type);"
      "create table if not exists Pages(pageId, isFolder, parentId, pageNo);"
      "create table if not exists Boxes(boxId)");
  after.left = leftover.Layout();
  after.logs = RunToTheEnd([&] {
                 before();
                 data_engin_initialization();
               }).logs;
  SqlProbe db(DbPath());
  EXPECT_EQ("ok", db.Value("PRAGMA integrity_check"));
  after.layout = db.Layout();
  return after;
}
