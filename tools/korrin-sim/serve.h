// `korrin-sim serve`: the session behind a page on the loopback address. The
// page draws the simulated phone's home screen from the layout database and
// the library's computed views; everything it does to the phone is a
// korrin-sim command line that the same session runs, so an edit made in the
// browser is one a script could make, and the session can be saved as one.
#ifndef KORRIN_SIM_SERVE_H_
#define KORRIN_SIM_SERVE_H_

#include <string>

namespace korrin_sim {

class Session;

struct ServeOptions {
  int port = 8080;     // 0: any free port
  std::string script;  // played before serving, when not empty
};

// Serves until the process is stopped. Prints the address on standard output
// once listening. Returns non-zero, said on stderr, when it cannot listen or
// the script fails.
int Serve(Session& session, const ServeOptions& options);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_SERVE_H_
