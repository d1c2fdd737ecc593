// The commands of korrin-sim, as one table: what each takes, what it does,
// and an example, which `help` prints. Options and positional arguments are
// parsed by Boost.Program_options before a command runs, so a command that
// does not parse never starts.
#ifndef KORRIN_SIM_COMMANDS_H_
#define KORRIN_SIM_COMMANDS_H_

#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include <boost/program_options.hpp>

namespace korrin_sim {

class Session;

// The parsed arguments of one command.
class Args {
 public:
  Args(const boost::program_options::variables_map& values, std::vector<std::string> words,
       std::string rest)
      : values_(values), words_(words), rest_(rest) {}

  bool Has(const std::string& name) const;
  std::string Text(const std::string& name) const;  // "" when absent
  std::vector<std::string> List(const std::string& name) const;
  template <typename T>
  T Get(const std::string& name) const {
    return values_[name].as<T>();
  }
  // The words after the command's name, as written (for `call` and `say`).
  const std::vector<std::string>& words() const { return words_; }
  // The rest of the line after the command's name, as typed.
  const std::string& rest() const { return rest_; }

 private:
  const boost::program_options::variables_map& values_;
  std::vector<std::string> words_;
  std::string rest_;
};

struct Command {
  std::string name;
  std::string args;     // positionals: "PKGID [LABEL]", "[APPID...]"
  std::string summary;  // one line, for --help
  std::string details;  // for `help COMMAND`
  std::string example;
  bool action;          // may change the device or the database; views do not
  // How the words after the name reach run(): parsed as options and
  // positionals, as plain words (`call`), or as the text typed (`say`).
  enum Parsing { kOptions, kWords, kText } parsing;
  std::function<void(boost::program_options::options_description&)> options;
  std::function<void(Session&, const Args&)> run;
};

// `save` and `load` (device-state.cpp).
std::vector<Command> DeviceCommands();
// make-folder, move, rename, remove-box and let (layout-verbs.cpp).
std::vector<Command> LayoutCommands();
// schema, sql, export, import, check and replay-log (phone-db.cpp).
std::vector<Command> PhonedbCommands();

const std::vector<Command>& Commands();
// The command, or null.
const Command* FindCommand(const std::string& name);
// The options |command| shows in its help and parses.
boost::program_options::options_description VisibleOptions(const Command& command);

// `korrin-sim --help`: every command, one line each, and a first script.
void PrintCommandList(std::ostream& out);
// `help COMMAND`: what it does, its options and an example; also for
// `expect`, which is read by the session rather than run. Throws UsageError
// for a name that is neither.
void PrintCommandHelp(const std::string& name, std::ostream& out);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_COMMANDS_H_
