// korrin-sim: the engine on a simulated device, for launcher engineers at a
// workstation. It plays the demo story, scenario scripts, or commands typed
// into a shell; `korrin-sim --help` lists the commands.
#include <errno.h>
#include <locale.h>
#include <signal.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>
#include <wchar.h>

#include <editline/readline.h>

#include <filesystem>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>
#include <vector>

#include <boost/program_options.hpp>

#include "calls.h"
#include "cli.h"
#include "complete.h"
#include "demo-story.h"
#include "demo.h"
#include "device-state.h"
#include "phone-db.h"
#include "serve.h"
#include "session.h"
#include "sim/device.h"
#include "words.h"

namespace po = boost::program_options;

namespace {

// Where this run's device lives: the folder --root names, or a fresh
// temporary one under $TMPDIR that goes at exit unless --keep. A kept root
// keeps the phone too (ROOT/device.ksim, beside its database), and a run that
// starts on a root holding one finds the phone as it was left.
struct DeviceRoot {
  std::string path;
  bool temporary;
  bool keep;
  bool kept() const { return !temporary || keep; }
};

// Lays out the device under |root|, making a temporary root when it names
// none. False, said on stderr, when that cannot be done.
bool UseDeviceRoot(DeviceRoot& root) {
  if (root.temporary) {
    const char* tmp = getenv("TMPDIR");
    std::string pattern = std::string(tmp != NULL && *tmp ? tmp : "/tmp") + "/korrin-sim-XXXXXX";
    std::vector<char> path(pattern.begin(), pattern.end());
    path.push_back('\0');
    if (mkdtemp(path.data()) == NULL) {
      std::cerr << "korrin-sim: cannot make a device root: " << strerror(errno) << "\n";
      return false;
    }
    root.path = path.data();
  }
  if (!sim::Device::Get().UseRoot(root.path)) {
    std::cerr << "korrin-sim: cannot lay out a device under " << root.path << "\n";
    return false;
  }
  std::string phone = korrin_sim::DeviceFile(root.path);
  if (!root.temporary && std::filesystem::exists(phone)) {
    try {
      korrin_sim::LoadDevice(phone);
    } catch (const std::exception& e) {
      std::cerr << "korrin-sim: " << e.what() << "\n";
      return false;
    }
  }
  return true;
}

// Writes the phone to |root|'s device file; a failure is said, not fatal.
void SaveDevice(const std::string& root) {
  try {
    korrin_sim::SaveDevice(korrin_sim::DeviceFile(root));
  } catch (const std::exception& e) {
    std::cerr << "korrin-sim: " << e.what() << "\n";
  }
}

// Ends a run with |status|: a kept root keeps the phone, and a temporary one
// goes, unless |inspect| keeps it (with its phone) to be looked into.
int Leave(const DeviceRoot& root, int status, bool inspect = false) {
  if (root.kept() || inspect) SaveDevice(root.path);
  if (root.temporary && root.keep) {
    std::cerr << "korrin-sim: the device is kept in " << root.path << "\n";
  }
  if (root.kept()) return status;
  if (inspect) {
    std::cerr << "korrin-sim: the device is left in " << root.path << "\n";
  } else {
    std::error_code ignored;
    std::filesystem::remove_all(root.path, ignored);
  }
  return status;
}

// The phone's database that `open` and --db bring in: the device root's
// database becomes a copy of |file|, or the file itself with |inPlace|.
struct Opened {
  std::string file;
  bool inPlace;
};

// Places |opened| (when given) under the root UseDeviceRoot laid out; false,
// said on stderr, when it cannot.
bool Place(const Opened* opened) {
  if (opened == NULL) return true;
  try {
    korrin_sim::PlaceDatabase(opened->file, opened->inPlace);
  } catch (const std::exception& e) {
    std::cerr << "korrin-sim: " << e.what() << "\n";
    return false;
  }
  return true;
}

int Demo(DeviceRoot root) {
  if (!UseDeviceRoot(root)) return 1;
  if (root.kept()) std::cout << "device root: " << root.path << "\n";
  std::istringstream story(kDemoStory);
  return Leave(root, korrin_sim::PlayDemo(story, std::cout, isatty(STDOUT_FILENO)) ? 0 : 1);
}

int Run(DeviceRoot root, const std::vector<std::string>& files, const Opened* opened = NULL) {
  if (files.empty()) {
    std::cerr << "korrin-sim: run what? usage: korrin-sim run [--root DIR] FILE... (-: stdin)\n";
    return 2;
  }
  for (const std::string& file : files) {
    if (file == "-") continue;  // standard input
    if (!std::ifstream(file)) {
      std::cerr << "korrin-sim: cannot read " << file << ": " << strerror(errno) << "\n";
      return 1;
    }
    // A folder opens, and reads as nothing: say so rather than play nothing.
    if (!std::filesystem::is_regular_file(file)) {
      std::cerr << "korrin-sim: cannot read " << file << ": not a regular file\n";
      return 1;
    }
  }
  if (!UseDeviceRoot(root)) return 1;
  if (!Place(opened)) return Leave(root, 1);
  korrin_sim::Session session;
  for (const std::string& file : files) {
    std::ifstream opened;
    if (file != "-") opened.open(file);
    std::istream& in = file == "-" ? std::cin : opened;
    // A failed script keeps its temporary root, to be looked into.
    if (!session.RunScript(in, file == "-" ? "stdin" : file, std::cerr)) {
      return Leave(root, 1, /*inspect=*/true);
    }
  }
  return Leave(root, 0);
}

// Ctrl-C drops the line being typed and prompts afresh, as a shell does.
// libedit's own handler would only pass the signal on, which ends the session,
// so the shell reads keys itself: an interrupted read ends the line as Enter
// does, and ReadLine throws that line away.
volatile sig_atomic_t interrupted = 0;

void OnInterrupt(int) { interrupted = 1; }

// One character for libedit, which takes the value returned as the character
// itself: UTF-8 is decoded here.
int ReadKey(FILE*) {
  mbstate_t state;
  memset(&state, 0, sizeof state);
  for (;;) {
    char byte;
    ssize_t got = read(STDIN_FILENO, &byte, 1);
    if (got < 0 && errno == EINTR) {
      if (interrupted) return '\n';
      continue;
    }
    if (got <= 0) return -1;
    wchar_t c;
    size_t length = mbrtowc(&c, &byte, 1, &state);
    if (length == static_cast<size_t>(-2)) continue;
    if (length == static_cast<size_t>(-1)) return static_cast<unsigned char>(byte);
    return static_cast<int>(c);
  }
}

// Tab: the words korrin_sim::Completions offers where the cursor is, never
// file names.
char* NextCompletion(const char* word, int state) {
  static std::vector<std::string> matches;
  static size_t next;
  if (state == 0) {
    size_t start = static_cast<size_t>(rl_point) - strlen(word);
    matches = korrin_sim::Completions(std::string(rl_line_buffer, start), word);
    next = 0;
  }
  return next < matches.size() ? strdup(matches[next++].c_str()) : NULL;
}

char** CompleteWord(const char* word, int, int) {
  rl_attempted_completion_over = 1;
  return rl_completion_matches(word, NextCompletion);
}

void SetUpTerminal() {
  setlocale(LC_CTYPE, "C.UTF-8");  // libedit shows and edits UTF-8 only in such a locale
  rl_catch_signals = 0;
  rl_getc_function = ReadKey;
  rl_attempted_completion_function = CompleteWord;
  struct sigaction action;
  memset(&action, 0, sizeof action);
  action.sa_handler = OnInterrupt;
  sigemptyset(&action.sa_mask);
  sigaction(SIGINT, &action, NULL);
}

// One line from the terminal with editing and history, or from a pipe.
bool ReadLine(const char* prompt, std::string& line) {
  if (!isatty(STDIN_FILENO)) return static_cast<bool>(std::getline(std::cin, line));
  interrupted = 0;  // a Ctrl-C while a command ran is not one for this line
  char* text = readline(prompt);
  while (interrupted) {
    interrupted = 0;
    free(text);
    text = readline(prompt);
  }
  if (text == NULL) {
    std::cout << std::endl;  // Ctrl-D leaves the terminal's prompt on a line of its own
    return false;
  }
  line = text;
  free(text);
  if (!line.empty()) add_history(line.c_str());
  return true;
}

int Serve(DeviceRoot root, const korrin_sim::ServeOptions& options, const Opened* opened) {
#ifdef KORRIN_SIM_SERVE
  if (!UseDeviceRoot(root)) return 1;
  if (!Place(opened)) return Leave(root, 1);
  korrin_sim::Session session;
  return Leave(root, korrin_sim::Serve(session, options));
#else
  (void)root;
  (void)options;
  (void)opened;
  std::cerr << "korrin-sim: this build has no `serve` (it was built without cpp-httplib)\n";
  return 2;
#endif
}

int Shell(DeviceRoot root, const Opened* opened = NULL) {
  if (!UseDeviceRoot(root)) return 1;
  if (!Place(opened)) return Leave(root, 1);
  if (opened != NULL) {
    std::cout << "the database of " << opened->file
              << (opened->inPlace ? " itself (--in-place): changes go to the file\n"
                                  : " as a copy: the file stays as it is\n")
              << "`start` opens it in the engine (for downloads, alphabetical, events)\n";
  }
  std::cout << "korrin-sim shell on the device in " << root.path
            << (root.kept() ? "" : " (removed at exit; --keep keeps it)")
            << "\n`help` lists the commands; Ctrl-D or `quit` ends.\n";
  const char* home = getenv("HOME");
  std::string history = std::string(home != NULL ? home : ".") + "/.korrin_sim_history";
  if (isatty(STDIN_FILENO)) SetUpTerminal();  // before libedit starts, in read_history
  read_history(history.c_str());
  korrin_sim::Session session;
  using Fed = korrin_sim::Session::Fed;
  Fed fed = Fed::kRan;
  std::string line;
  for (bool more = true; more;) {
    more = ReadLine(fed == Fed::kCollected ? "  ...> " : "korrin> ", line);
    if (more && fed != Fed::kCollected && korrin_sim::Session::IsQuit(line)) more = false;
    try {
      fed = more ? session.Feed(line) : session.Finish();
      if (fed == Fed::kChecked) std::cout << "as expected\n";
    } catch (const std::exception& e) {
      fed = Fed::kRan;
      std::cout << std::flush;
      std::cerr << e.what() << std::endl;
    }
    if (fed == Fed::kRan && root.kept()) SaveDevice(root.path);  // a few kilobytes: the phone survives a kill
  }
  write_history(history.c_str());
  return Leave(root, 0);
}

// `korrin-sim help WORD...`, read before the options: `help call --list` is
// a command's own words.
int Help(const std::vector<std::string>& words) {
  try {
    if (words.empty()) {
      korrin_sim::PrintCommandList(std::cout);
    } else if (words.size() == 1) {
      korrin_sim::PrintCommandHelp(words[0], std::cout);
    } else if (words[0] == "call" && (words[1] == "--list" || words[1] == "--help")) {
      korrin_sim::Call(std::vector<std::string>(words.begin() + 1, words.end()), std::cout);
    } else {
      std::cerr << "korrin-sim: help takes one COMMAND, or call --list / call --help NAME\n";
      return 2;
    }
    return 0;
  } catch (const korrin_sim::UsageError& e) {
    std::cerr << "korrin-sim: " << e.what() << "\n";
    return 2;
  }
}

// `korrin-sim COMMAND [ARGS] [--db FILE [--in-place]]`: one command, on a
// phone's database when --db names one, in a device root of its own.
int OneShot(int argc, char** argv) {
  const korrin_sim::Command& command = *korrin_sim::FindCommand(argv[1]);
  po::options_description own;
  own.add_options()("db", po::value<std::string>())("in-place", po::bool_switch())(
      "root", po::value<std::string>())("keep", po::bool_switch());
  po::variables_map values;
  std::vector<std::string> words;
  try {
    po::parsed_options parsed = po::command_line_parser(argc - 1, argv + 1)
                                    .options(own)
                                    .style(po::command_line_style::unix_style &
                                           ~po::command_line_style::allow_guessing)
                                    .allow_unregistered()
                                    .run();
    po::store(parsed, values);
    words = po::collect_unrecognized(parsed.options, po::include_positional);
  } catch (const po::error& e) {
    std::cerr << "korrin-sim: " << e.what() << " (korrin-sim --help)\n";
    return 2;
  }
  std::string line = command.name;
  for (const std::string& word : words) {
    line += " " + (command.parsing == korrin_sim::Command::kText ? word : korrin_sim::ShellWord(word));
  }
  DeviceRoot root{values.count("root") ? values["root"].as<std::string>() : "",
                  values.count("root") == 0, values["keep"].as<bool>()};
  if (!UseDeviceRoot(root)) return 1;
  Opened opened{values.count("db") ? values["db"].as<std::string>() : "",
                values["in-place"].as<bool>()};
  if (!Place(values.count("db") ? &opened : NULL)) return Leave(root, 1);
  korrin_sim::Session session;
  try {
    // These views are the engine's own answers: it needs the database open.
    if (command.name == "downloads" || command.name == "alphabetical") session.Execute("start");
    session.Execute(line);
  } catch (const std::exception& e) {
    std::cout << std::flush;
    std::cerr << "korrin-sim: " << e.what() << "\n";
    return Leave(root, 1);
  }
  return Leave(root, 0);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc >= 2 && strcmp(argv[1], "help") == 0) {
    return Help(std::vector<std::string>(argv + 2, argv + argc));
  }
  // korrin-sim counts the engine's failures after each command and keeps the
  // log for `log`: it echoes the log only when KORRIN_SIM_LOG asks.
  const char* echo = getenv("KORRIN_SIM_LOG");
  if (echo == NULL || *echo == '\0') sim::Device::Get().EchoLogs(false);
  if (argc > 1 && korrin_sim::FindCommand(argv[1]) != NULL) return OneShot(argc, argv);
  po::options_description visible("options");
  visible.add_options()("root", po::value<std::string>()->value_name("DIR"),
                        "keep the device (its phone and database) in DIR")(
      "keep", "keep the temporary device folder at exit")(
      "in-place", "open: change FILE itself, not a copy")(
      "db", po::value<std::string>()->value_name("FILE"),
      "serve: show a phone's layout database FILE (on a copy, as open does)")(
      "port", po::value<int>()->default_value(8080)->value_name("N"),
      "serve: the port on 127.0.0.1 (0: any free one)")(
      "script", po::value<std::string>()->value_name("FILE"), "serve: play FILE first")(
      "help", "list the commands")("version", "print korrin-sim's version and the library's");
  po::options_description all;
  all.add(visible).add_options()("mode", po::value<std::string>()->default_value("demo"))(
      "files", po::value<std::vector<std::string> >());
  po::positional_options_description order;
  order.add("mode", 1).add("files", -1);
  po::variables_map values;
  try {
    po::store(po::command_line_parser(argc, argv).options(all).positional(order).run(), values);
    po::notify(values);
  } catch (const po::unknown_option& e) {
    std::cerr << "korrin-sim: unknown option '" << e.get_option_name() << "'"
              << korrin_sim::DidYouMean(e.get_option_name(), {"--root", "--keep", "--in-place", "--db",
                                                              "--port", "--script", "--help",
                                                              "--version"})
              << " (korrin-sim --help)\n";
    return 2;
  } catch (const po::error& e) {
    std::cerr << "korrin-sim: " << e.what() << " (korrin-sim --help)\n";
    return 2;
  }
  if (values.count("version")) {
    std::cout << "korrin-sim " KORRIN_VERSION " (korrin-data " KORRIN_VERSION ")\n";
    return 0;
  }
  std::string mode = values["mode"].as<std::string>();
  DeviceRoot root{values.count("root") ? values["root"].as<std::string>() : "",
                  values.count("root") == 0, values.count("keep") > 0};
  std::vector<std::string> files =
      values.count("files") ? values["files"].as<std::vector<std::string> >()
                            : std::vector<std::string>();
  if (values.count("help")) return Help({});
  if (mode == "help") return Help(files);
  if (mode == "run") return Run(root, files);
  if (mode == "open") {
    if (files.empty()) {
      std::cerr << "korrin-sim: open what? usage: korrin-sim open FILE [SCRIPT...]\n";
      return 2;
    }
    Opened opened{files[0], values.count("in-place") > 0};
    std::vector<std::string> scripts(files.begin() + 1, files.end());
    return scripts.empty() ? Shell(root, &opened) : Run(root, scripts, &opened);
  }
  if (mode != "demo" && mode != "shell" && mode != "serve") {
    std::cerr << "korrin-sim: unknown mode '" << mode << "'"
              << korrin_sim::DidYouMean(mode, {"demo", "run", "shell", "open", "serve", "help"})
              << " (korrin-sim --help)\n";
    return 2;
  }
  if (!files.empty()) {
    std::cerr << "korrin-sim: " << mode << " takes no more words: '" << files[0]
              << "' (korrin-sim --help)\n";
    return 2;
  }
  if (mode == "serve") {
    korrin_sim::ServeOptions serve;
    serve.port = values["port"].as<int>();
    if (values.count("script")) serve.script = values["script"].as<std::string>();
    Opened opened{values.count("db") ? values["db"].as<std::string>() : "", false};
    return Serve(root, serve, values.count("db") ? &opened : NULL);
  }
  return mode == "demo" ? Demo(root) : Shell(root);
}
