// A korrin-sim session: the commands of scripts and of the shell, run one at
// a time against the one simulated device and the engine in this process.
#ifndef KORRIN_SIM_SESSION_H_
#define KORRIN_SIM_SESSION_H_

#include <stddef.h>

#include <deque>
#include <exception>
#include <istream>
#include <map>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include <boost/program_options/variables_map.hpp>

#include "commands.h"
#include "sim/device.h"
#include "views.h"

namespace korrin_sim {

class Session {
 public:
  // |printActions| false keeps what commands that change something print to
  // themselves (for `expect`), so that only views and `say` reach the screen.
  // |recordChanges| false spares the two reads of the whole database around
  // each such command, for drivers that never show `changes`.
  explicit Session(bool printActions = true, bool recordChanges = true);
  ~Session();

  // Runs one command line (comments and blank lines do nothing). Throws
  // UsageError, having changed nothing, when it cannot run as written.
  void Execute(const std::string& line);
  // `trace`: while on, the statements the store's connection runs are kept
  // until taken. Switching it on or off forgets those kept.
  void Trace(bool on);
  std::vector<std::string> TakeStatements();

  // Checks that |line| (not blank) would run, changing nothing.
  void Check(const std::string& line) const { Prepare(line); }

  // What Feed did with a line.
  enum class Fed {
    kRan,        // ran it as a command (a blank or comment line does nothing)
    kCollected,  // opened an `expect` block, or added a line to the open one
    kChecked,    // closed the block, which matched what was printed
  };
  // Takes the next line of a script or of the shell. `expect` alone on a
  // line opens a block; a blank line or `end` (blanks around it allowed)
  // closes it, and its lines are then compared with what the last command
  // printed. Any other line runs as Execute runs it. Throws UsageError as
  // Execute does, or with a diff when a block does not match.
  Fed Feed(const std::string& line);
  // The input has ended: an open block is closed and checked.
  Fed Finish();

  // `quit`, `exit` or `.quit` (blanks around it allowed): ends the shell, or
  // the script it stands in.
  static bool IsQuit(const std::string& line);

  // Plays a script to its end (or its `quit`), or to its first error, which
  // it reports as "FILE:LINE: message" on |errors| (a block's error at its
  // `expect`). True when every line ran.
  bool RunScript(std::istream& in, const std::string& file, std::ostream& errors);

  // ---- Named ids: `$last` and the names `let` binds, written $NAME.

  // Binds $NAME to |id|. Throws UsageError for a NAME that is not a word of
  // letters, digits and _ starting with a letter, or for "last".
  void Bind(const std::string& name, int id);
  void CheckName(const std::string& name) const;  // throws as Bind does
  // The id the last command run handed back (an insert's), if it did.
  std::optional<int> returned() const { return returned_; }
  // The id bound to $|name|; throws UsageError naming it when unbound.
  std::string Value(const std::string& name) const;

  // ---- For the commands.

  // Runs |line| when the engine next makes platform |call|; lines queued for
  // one call run on its successive calls, in order.
  void RunBefore(const std::string& call, const std::string& line);

  // The layout database on this machine.
  std::string DatabasePath() const;
  // Packages described with `package --held`: not on the device until an
  // install or update sends them.
  std::map<std::string, sim::Package>& held() { return held_; }
  // The log lines the last command that changed something wrote.
  size_t logMark() const { return logMark_; }
  const Snapshot& before() const { return before_; }
  const Snapshot& after() const { return after_; }

 private:
  struct Prepared {
    const Command* command;
    std::string rest;                // the line after the command's name
    std::vector<std::string> words;  // |rest| as words
    boost::program_options::variables_map values;
  };
  Prepared Prepare(const std::string& line) const;
  // Compares the lines of an `expect` block with what the last command
  // printed; throws UsageError with a diff when they differ.
  void Expect(const std::vector<std::string>& lines) const;
  // Has the first line waiting for |call| run when the engine next makes it.
  void ArmBefore(const std::string& call);
  // Points the trace at the store's connection of the moment: `start` opens
  // a new one.
  void FollowStoreTrace();

  Session(const Session&) = delete;
  Session& operator=(const Session&) = delete;

  // After a command at the outermost level: says on stderr how many failures
  // the engine logged while it ran (see FailureLogged in session.cpp).
  void ReportFailures(size_t logMark, bool action) const;

  bool printActions_;
  std::map<std::string, int> names_;  // bound by `let`; "last" by any insert
  std::optional<int> returned_;
  int depth_ = 0;      // commands running, one inside another (`let`, `before`)
  std::string where_;  // "FILE:LINE: " of the script line running, for reports
  bool recordChanges_;
  bool tracing_;
  std::vector<std::string> statements_;  // traced, not yet taken
  // The error of a `before` line, raised inside a platform call: kept until
  // the command around it returns, so that it never unwinds the engine.
  std::exception_ptr beforeError_;
  std::string lastOutput_;  // what the last command printed
  size_t logMark_;          // first log line of the last action
  Snapshot before_;         // the database around the last action
  Snapshot after_;
  std::map<std::string, sim::Package> held_;
  std::map<std::string, std::deque<std::string> > beforeCalls_;  // lines waiting, by call
  // The `expect` block being read, while one is open.
  std::optional<std::vector<std::string> > block_;
};

}  // namespace korrin_sim

#endif  // KORRIN_SIM_SESSION_H_
