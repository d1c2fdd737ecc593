// What the parts of korrin-sim share: the error a bad command raises, the
// stream a command prints to, and the way values are read and written.
#ifndef KORRIN_SIM_CLI_H_
#define KORRIN_SIM_CLI_H_

#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

namespace korrin_sim {

// A command that cannot run as written: unknown, or with an argument that
// does not parse. Raised before the command changes anything.
class UsageError : public std::runtime_error {
 public:
  explicit UsageError(const std::string& what) : std::runtime_error(what) {}
};

// Where the command being run prints. Callbacks that the engine fires later,
// in the middle of another command, print here too.
std::ostream& Out();
// Points Out() at |out| (null: standard output).
void SetOut(std::ostream* out);

// The id a command hands back (an insert's new id), for `$last` and `let`:
// ReturnId records it, TakeReturnedId takes it (false when none was handed).
void ReturnId(int id);
bool TakeReturnedId(int* id);

// Values as scripts write them. Each throws UsageError naming |what| (the
// argument's name) when |text| is not such a value.
int ParseInt(const std::string& text, const std::string& what);
long long ParseInt64(const std::string& text, const std::string& what);
unsigned int ParseUnsigned(const std::string& text, const std::string& what);
bool ParseBool(const std::string& text, const std::string& what);  // true|false|1|0

// |text| as one of |names| (its position), or, with |numbers|, as any
// integer: the platform may send values its enums do not name.
int ParseNamed(const std::string& text, const std::vector<std::string>& names,
               const std::string& what, bool numbers = false);

// Enum values by name, each standing for its position, which is its value on
// the platform.
extern const std::vector<std::string> kEventTypeNames;   // package_manager_event_type_e
extern const std::vector<std::string> kEventStateNames;  // package_manager_event_state_e
extern const std::vector<std::string> kComponentNames;   // package_info_app_component_type_e

// A text value as results print it: in double quotes, with \" and \\ escaped
// and other bytes below 0x20 as \n, \t or \xHH.
std::string Quote(const std::string& text);
// |text| with |quote| and backslashes escaped by a backslash, and control bytes
// as \n, \t or \xHH: the inside of Quote's quotes, or of a $'...' word.
std::string Escaped(const std::string& text, char quote);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_CLI_H_
