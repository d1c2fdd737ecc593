#include "killed/killed-test.h"

#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iostream>
#include <random>

#include "korrin-data/korrin-data.h"
#include "support/file-shim.h"

namespace fs = std::filesystem;

namespace {

const unsigned kDefaultSeed = 20150601;

// The first bytes of a rollback journal whose transaction has not ended; a
// journal kept after its commit (journal mode PERSIST) starts with zeros.
const unsigned char kJournalMagic[] = {0xd9, 0xd5, 0x05, 0xf9, 0x20, 0xa1, 0x63, 0xd7};

bool StartsWithJournalMagic(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  char head[sizeof kJournalMagic] = {};
  return file.read(head, sizeof head) &&
         std::equal(head, head + sizeof head, reinterpret_cast<const char*>(kJournalMagic));
}

long FromEnvironment(const char* name, long fallback) {
  const char* text = getenv(name);
  return text != nullptr && *text != '\0' ? strtol(text, nullptr, 10) : fallback;
}

void WriteAll(int fd, const std::string& text) {
  for (size_t done = 0; done < text.size();) {
    ssize_t n = write(fd, text.data() + done, text.size() - done);
    if (n <= 0) return;
    done += static_cast<size_t>(n);
  }
}

// File operations the child made so far.
long g_operations = 0;

void Die() {
  kill(getpid(), SIGKILL);
  abort();  // not reached
}

// Counts the file operations that change files and dies at |point|.
//
// Syncs are counted but not performed. A process killed with SIGKILL loses
// nothing that already reached the kernel; what it cannot do is finish what it
// had not started. Skipping fsync keeps that intact and lets thousands of
// autocommits run in a fraction of a second.
void DieAt(KillPoint point) {
  g_operations = 0;
  int rc = fileshim::Install([point](fileshim::Op op, const std::function<int()>& perform) {
    if (op == fileshim::Op::kLock) return perform();
    long n = ++g_operations;
    if (n == point.op && !point.afterIt) Die();
    int result = op == fileshim::Op::kSync ? SQLITE_OK : perform();
    if (n == point.op) Die();
    return result;
  });
  if (rc != SQLITE_OK) abort();
}

// Runs |body| in a child process that dies at |point| and returns the child's
// wait status; |report| gets what the body returned, when it did.
int Fork(KillPoint point, const std::function<std::string()>& body, std::string* report) {
  int pipeEnds[2];
  if (pipe(pipeEnds) != 0) return -1;
  pid_t pid = fork();
  if (pid == 0) {
    close(pipeEnds[0]);
    DieAt(point);
    WriteAll(pipeEnds[1], body());
    // Not exit(): the test process's own objects are not the child's to end.
    _exit(0);
  }
  close(pipeEnds[1]);
  report->clear();
  char buffer[4096];
  for (ssize_t n; (n = read(pipeEnds[0], buffer, sizeof buffer)) > 0;) report->append(buffer, n);
  close(pipeEnds[0]);
  int status = -1;
  if (pid < 0 || waitpid(pid, &status, 0) != pid) return -1;
  return status;
}

std::string HowItEnded(int status) {
  if (WIFSIGNALED(status)) return "killed by signal " + std::to_string(WTERMSIG(status));
  if (WIFEXITED(status)) return "exited with status " + std::to_string(WEXITSTATUS(status));
  return "lost (wait status " + std::to_string(status) + ")";
}

Lines SplitLines(const std::string& text) {
  Lines lines;
  for (size_t at = 0, end; (end = text.find('\n', at)) != std::string::npos; at = end + 1) {
    lines.push_back(text.substr(at, end - at));
  }
  return lines;
}

}  // namespace

std::ostream& operator<<(std::ostream& out, const Kill& kill) {
  return out << "kill " << kill.number << " of " << kill.of << " (KORRIN_KILL_SEED=" << kill.seed
             << "): " << (kill.point.afterIt ? "after" : "before") << " file operation "
             << kill.point.op << " of " << kill.operations;
}

KilledTest::Run KilledTest::RunChild(KillPoint kill, const std::function<void()>& body) {
  std::string report;
  int status = Fork(
      kill,
      [&] {
        device.ClearLogs();
        body();
        std::string text = std::to_string(g_operations) + "\n";
        for (const std::string& line : EngineMessages()) text += line + "\n";
        return text;
      },
      &report);
  Run run = {WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL, 0, SplitLines(report)};
  if (!run.killed && (!WIFEXITED(status) || WEXITSTATUS(status) != 0 || run.logs.empty())) {
    ADD_FAILURE() << "the child " << HowItEnded(status);
  }
  if (!run.logs.empty()) {
    run.operations = std::stol(run.logs.front());
    run.logs.erase(run.logs.begin());
  }
  return run;
}

KilledTest::Run KilledTest::RunToTheEnd(const std::function<void()>& body) {
  Run run = RunChild(KillPoint(), body);
  EXPECT_FALSE(run.killed);
  return run;
}

Lines KilledTest::NextStart(const std::function<void()>& before) {
  return RunToTheEnd([&] {
           before();
           data_engin_initialization();
         })
      .logs;
}

std::vector<Kill> KilledTest::Plan(long first, long last, int count) {
  unsigned seed = static_cast<unsigned>(FromEnvironment("KORRIN_KILL_SEED", kDefaultSeed));
  count = static_cast<int>(FromEnvironment("KORRIN_KILLS", count));
  std::mt19937 random(seed);
  std::vector<Kill> plan;
  long span = last - first + 1;
  for (int i = 0; i < count; ++i) {
    long from = first + span * i / count;
    long to = std::max(from, first + span * (i + 1) / count - 1);
    Kill kill;
    kill.point.op = std::uniform_int_distribution<long>(from, to)(random);
    kill.point.afterIt = random() % 2 == 1;
    kill.number = i + 1;
    kill.of = count;
    kill.seed = seed;
    kill.operations = last;
    plan.push_back(kill);
  }
  if (!plan.empty()) plan.back().point = {last, true};
  return plan;
}

Leftover KilledTest::WhatTheKillLeft() {
  Leftover left;
  left.hotJournal = StartsWithJournalMagic(JournalPath());
  std::string copy = root + "/leftover.db";
  fs::remove(copy + "-journal");
  fs::copy_file(DbPath(), copy, fs::copy_options::overwrite_existing);
  if (fs::exists(JournalPath())) fs::copy_file(JournalPath(), copy + "-journal");
  SqlProbe db(copy);
  left.integrity = db.Value("PRAGMA integrity_check");
  // A kill while the schema was being made leaves tables missing; on the copy,
  // make them so that they read as empty.
  db.Exec(
      "create table if not exists Menus(menuId, name, type);"
      "create table if not exists Pages(pageId, isFolder, parentId, pageNo);"
      "create table if not exists Boxes(boxId)");
  left.layout = db.Layout();
  return left;
}

void KilledTest::RemoveDatabase() {
  fs::remove(DbPath());
  fs::remove(JournalPath());
}

void KilledTest::Survived(int kills, const std::string& detail) {
  std::cout << "[ survived ] " << kills << " kills: " << detail << std::endl;
}
