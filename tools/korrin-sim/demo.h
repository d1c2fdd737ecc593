// The demo as a reader sees it: each step's command as a `$` line, the views
// with the grid cells that changed since the previous view marked, and the
// story's sentences. The story is a korrin-sim script whose `expect` blocks
// check the views as printed by the commands, unmarked.
#ifndef KORRIN_SIM_DEMO_H_
#define KORRIN_SIM_DEMO_H_

#include <istream>
#include <ostream>

namespace korrin_sim {

// Plays |story| on the device, showing it on |out| (with colours when
// |terminal|). False, with "demo:LINE: message" on stderr, at its first error.
bool PlayDemo(std::istream& story, std::ostream& out, bool terminal);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_DEMO_H_
