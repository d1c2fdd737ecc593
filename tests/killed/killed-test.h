// KilledTest: the engine run in child processes that die with SIGKILL at a
// chosen file operation, and the database they leave read back by the test.
//
// The engine's managers live as long as the process, so every start of the
// engine is a child of its own, forked from a test process that never starts
// it: each child begins from the library as loaded. Kill points are numbered
// file operations that change files (writes, syncs, truncates, deletes), seen
// through the file shim and spread over a range by a seed. A process that runs
// the same statements on the same files makes the same operations in the same
// order, so a failing kill can be run again exactly.
#ifndef KORRIN_TESTS_KILLED_KILLED_TEST_H_
#define KORRIN_TESTS_KILLED_KILLED_TEST_H_

#include <functional>
#include <string>
#include <vector>

#include "support/sim-test.h"
#include "support/sql-probe.h"

typedef std::vector<std::string> Lines;

// Where a child dies, with SIGKILL: at file operation |op|, counted from 1 in
// the child, before it reaches the file or just after. Op 0 never comes.
struct KillPoint {
  long op = 0;
  bool afterIt = false;
};

// One kill of a plan, and how to find it again.
struct Kill {
  KillPoint point;
  int number;       // from 1
  int of;           // kills in the plan
  unsigned seed;    // of the plan
  long operations;  // in the range the plan spreads over
};
std::ostream& operator<<(std::ostream& out, const Kill& kill);

// What a killed child left, as the next reader of the file finds it.
struct Leftover {
  bool hotJournal;          // a transaction was under way: its journal is live
  std::string integrity;    // PRAGMA integrity_check
  std::vector<Row> layout;  // SqlProbe::Layout; tables not made yet read as empty
};

class KilledTest : public SimTest {
 protected:
  // How a child ended.
  struct Run {
    bool killed;      // by SIGKILL, at its kill point
    long operations;  // file operations it made, when it ran to the end
    Lines logs;       // what the engine logged meanwhile, as EngineMessages gives it
  };
  // Runs |body| in a child whose connections go through the file shim, dying
  // at |kill|. A child that neither ends nor dies by SIGKILL fails the test.
  Run RunChild(KillPoint kill, const std::function<void()>& body);
  // Runs |body| in a child to the end.
  Run RunToTheEnd(const std::function<void()>& body);
  // Starts the engine in a fresh child after |before|, runs it to the end and
  // returns what it logged.
  Lines NextStart(const std::function<void()>& before = [] {});

  // |count| kill points spread over operations |first| to |last|: one at a
  // seeded place in each of |count| equal stretches, before or after it as
  // the seed says, except the last, which comes after operation |last|: the
  // work all on file, the process killed before it could end. KORRIN_KILL_SEED
  // and KORRIN_KILLS, when set, replace the seed and the count of every plan.
  std::vector<Kill> Plan(long first, long last, int count);

  // The database a kill left, read through a copy (with its journal) so that
  // the next start of the engine is the first to open the file itself.
  Leftover WhatTheKillLeft();
  std::string JournalPath() const { return DbPath() + "-journal"; }
  // No database and no journal, as on a new phone.
  void RemoveDatabase();

  // Prints how many kills a test survived, and what they left:
  // "[ survived ] 25 kills: 25 left a menu, 4 a live journal".
  void Survived(int kills, const std::string& detail);
};

#endif  // KORRIN_TESTS_KILLED_KILLED_TEST_H_
