// KilledTest: the engine run in forked children (each from the library as
// loaded) that die with SIGKILL at a numbered file operation that changes
// files, seen through the file shim. The same statements on the same files
// make the same operations, so a failing kill can be run again exactly.
#ifndef KORRIN_TESTS_KILLED_KILLED_TEST_H_
#define KORRIN_TESTS_KILLED_KILLED_TEST_H_

#include <cstdio>
#include <functional>
#include <iostream>
#include <string>
#include <vector>

#include "support/sim-test.h"
#include "support/sql-probe.h"

typedef std::vector<std::string> Lines;

// SIGKILL at file operation |op| (from 1; 0 never comes), before or after it.
struct KillPoint {
  long op = 0;
  bool afterIt = false;
};

// One kill of a plan, printed so that it can be found again.
struct Kill {
  KillPoint point;
  int number, of;  // this kill, from 1, of the plan's
  unsigned seed;
  long operations;  // the range the plan spreads over
};
std::ostream& operator<<(std::ostream& out, const Kill& kill);

class KilledTest : public SimTest {
 protected:
  struct Run {
    bool killed;      // by SIGKILL, at its kill point
    long operations;  // made, when it ran to the end
    Lines logs;       // EngineMessages meanwhile
  };
  // Runs |body| in a child through the file shim, dying at |kill|; a child
  // that neither ends cleanly nor dies by SIGKILL fails the test.
  Run RunChild(KillPoint kill, const std::function<void()>& body);
  Run RunToTheEnd(const std::function<void()>& body);
  // Adds games "game0001" to |count| to the device; returns their ids.
  Lines AddGames(int count);

  // |count| kills over operations |first|..|last|, one at a seeded place in
  // each equal stretch, except the last, which comes after |last|. The
  // environment's KORRIN_KILL_SEED and KORRIN_KILLS replace seed and count.
  std::vector<Kill> Plan(long first, long last, int count);

  void RemoveDatabase() {  // as on a new phone
    std::remove(DbPath().c_str());
    std::remove((DbPath() + "-journal").c_str());
  }

  // Kills |body| at |kill|, reads what it left through a copy (so that the
  // next engine start is the first to open the file), then starts the engine
  // after |before|. Checks both databases intact and counts live journals.
  struct Aftermath {
    std::vector<Row> left;    // SqlProbe::Layout; missing tables read as empty
    Lines logs;               // of the next start
    std::vector<Row> layout;  // after it
  };
  Aftermath KillAndRestart(
      KillPoint kill, const std::function<void()>& body,
      const std::function<void()>& before = [] {});
  int hotJournals = 0;

  void Survived(int kills, const std::string& detail) {
    std::cout << "[ survived ] " << kills << " kills: " << detail << ", " << hotJournals
              << " a live journal" << std::endl;
  }
};

#endif  // KORRIN_TESTS_KILLED_KILLED_TEST_H_
