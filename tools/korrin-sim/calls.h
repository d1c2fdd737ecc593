// The `call` command of korrin-sim: any public operation of the engine's
// classes (the layout store, the package tracker, the usage-log client and
// the system services), called with arguments typed as words, its result and
// everything it hands back printed one item per line.
//
// The store and the package tracker are the engine's own two managers; the
// usage-log client is one made on its first call and kept for the process.
#ifndef KORRIN_SIM_CALLS_H_
#define KORRIN_SIM_CALLS_H_

#include <ostream>
#include <string>
#include <vector>

#include "launcher-data-manager/game-data.h"

namespace korrin_sim {

// `call NAME ARG...`: |words| holds NAME (`Class::Name`, or `Name` when one
// class alone has it) and its arguments. Every argument is read before
// anything is called: an unknown NAME or a bad, missing or extra argument
// throws UsageError, naming the argument and what was expected, with nothing
// changed. Then the one call is made and its result printed to |out|: the
// return value first (nothing for void), then each out-parameter, record
// passed by reference and callback user data. An exception from the engine
// prints "exception: WHAT" and is not raised further.
// The NAME `--list` runs ListCalls, `--help NAME` HelpCall.
void Call(const std::vector<std::string>& words, std::ostream& out);

// Every callable operation, one per line, "Class::Name ARGS", in header order.
void ListCalls(std::ostream& out);

// The syntax and purpose of every overload of |name| (with or without its
// class). Throws UsageError when no class has it.
void HelpCall(const std::string& name, std::ostream& out);

// A record on one line, every member in declaration order as name=value
// (texts quoted, flags true or false), after the word menu, page or box.
std::string FormatMenu(const GameViewData& menu);
std::string FormatPage(const GamePageData& page);
std::string FormatBox(const GameBoxData& box);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_CALLS_H_
