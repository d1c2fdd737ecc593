// korrin-soak: a seeded random stream of korrin-sim command lines (package
// operations, raw events, quiet changes of the device, pause and replay,
// boot-done, restarts, the launcher's own pages and shortcuts) played through
// korrin-sim's session, the stored layout compared after every step with what
// the model says it must be.
//
//   TMPDIR=/dev/shm korrin-soak --seed 7 --events 100000
//
// prints "seed 7: 100000 events, layout matched" and the process's memory
// (VmRSS at the start, after a tenth of the run and at the end, and the peak),
// or the steps up to the first difference as a korrin-sim script, the log of
// that step and the rows that differ, and exits 1. The engine commits every
// statement on its own, so on a disk the run waits on the disk's syncs: a
// device root in memory (TMPDIR or --root) makes it far faster. The engine
// lives as long as the process: one run each.
#include <errno.h>
#include <package_manager.h>
#include <sqlite3.h>
#include <stdlib.h>
#include <string.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <optional>
#include <random>
#include <set>
#include <sstream>

#include <boost/program_options.hpp>

#include "cli.h"
#include "reliability/soak/model.h"
#include "session.h"

namespace po = boost::program_options;
using soak::Model;

namespace {

// A small pool, so that packages come and go and ids are used again: the
// layout stays a few hundred boxes at most however long the run. Two ids
// carry a quote and non-ASCII bytes.
const uint32_t kPool = 32;
const char* const kLabels[] = {
    "Tide", "Ember", "Racer", "Chess", "Quest", "Nova", "Blitz", "Orbit", "Solitaire",
    "it's on", "\"quoted\"", "x'); DROP TABLE Boxes; --", "\xc3\x89" "checs",
    "\xe6\xb8\xb8\xe6\x88\x8f",
};
const int kOddTypes[] = {3, 7, -1, 1000};
const int kOddStates[] = {4, 9, -1, -100};

// One word of a command line, as korrin-sim splits it again.
std::string Arg(const std::string& text) {
  if (text.find_first_not_of("ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789.=") == std::string::npos) {
    return text;
  }
  std::string word = "\"";
  for (char c : text) word += (c == '"' || c == '\'' || c == '\\' ? "\\" : "") + std::string(1, c);
  return word + "\"";
}

std::string Flag(const char* name, bool was, bool now) {
  return was == now ? "" : std::string(" --") + name + (now ? "" : "=false");
}

std::string Named(const std::vector<std::string>& names, int value) {
  return value >= 0 && value < static_cast<int>(names.size()) ? names[value]
                                                               : std::to_string(value);
}

// The same seed gives the same lines on every platform: draws are made from
// std::mt19937's raw output, whose sequence the standard fixes, and never
// through the library's distributions, whose algorithms it leaves open.
class Generator {
 public:
  explicit Generator(uint32_t seed) : m_rng(seed) {}

  // The command lines of the next step, which |model| takes in. Package
  // operations before the first start are heard by nobody.
  std::vector<std::string> Next(Model& model) {
    m_lines.clear();
    const uint32_t installed = static_cast<uint32_t>(model.packages.size());
    const size_t pages = model.pages.size();
    const bool on = model.started;
    const uint32_t weights[] = {
        4 + 16 * (kPool - installed) / kPool,             // install
        installed ? 22u : 0u,                             // update
        installed ? 2 + 16 * installed / kPool : 0u,      // uninstall
        16, 5,                                            // raw event, quiet change
        model.paused ? 0u : 3u, model.paused ? 12u : 1u,  // pause; replay a dozen steps later
        on ? 1u : 12u, on ? 2u : 0u,                      // start, boot-done
        on && pages < 4 ? 1u : 0u, pages ? 3u : 0u,       // page, shortcut
    };
    uint32_t total = 0, what = 0;
    for (uint32_t weight : weights) total += weight;
    for (uint32_t draw = Below(total); draw >= weights[what]; ++what) draw -= weights[what];
    std::string pkgId = Pool();
    if (what == 0) {  // mostly a package the device lacks; now and then one installed again
      for (int tries = 0; tries < 8 && model.packages.count(pkgId); ++tries) pkgId = Pool();
      Send("install", NewPackage(pkgId), PACKAGE_MANAGER_EVENT_TYPE_INSTALL, model);
    } else if (what == 1) {
      Update(model);
    } else if (what == 2) {
      pkgId = Pick(model.packages).id;
      Emit("uninstall " + Arg(pkgId));
      model.Uninstall(pkgId);
    } else if (what == 3) {
      RawEvent(model);
    } else if (what == 4) {
      if (installed && OneIn(2)) {
        pkgId = Pick(model.packages).id;
        Emit("remove " + Arg(pkgId));
        model.packages.erase(pkgId);
      } else {
        sim::Package pkg = Describe(NewPackage(pkgId), false, model);
        model.packages[pkgId] = pkg;
      }
      Touch(pkgId);
    } else if (what == 5) {
      Emit("call PauseListenCb");
      model.paused = true;
    } else if (what == 6) {
      Emit("call StartListenCb");
      model.Listen();
    } else if (what == 7 && !on && OneIn(2)) {  // installed once the games are listed
      sim::Package pkg = Describe(NewPackage(pkgId), true, model);
      Emit("before app_info_filter_destroy install " + Arg(pkgId));
      Emit("start");
      model.Start(&pkg);
    } else if (what == 7) {
      Emit("start");
      model.Start(NULL);
    } else if (what == 8) {
      BootDone(model);
    } else if (what == 9) {
      int pageNo = 0;
      for (const auto& page : model.pages) pageNo = std::max(pageNo, page.second);
      Emit("call InsertPageData parentId=1 pageNo=" + std::to_string(pageNo + 1));
      model.AddPage(pageNo + 1);
    } else {
      Shortcut(model);
    }
    return m_lines;
  }

 private:
  uint32_t Below(size_t n) {  // uniform in [0, n): the short top range is rejected
    const uint32_t bound = static_cast<uint32_t>(n), reject = -bound % bound;
    uint32_t draw;
    do {
      draw = static_cast<uint32_t>(m_rng());
    } while (draw < reject);
    return draw % bound;
  }
  bool OneIn(uint32_t n) { return Below(n) == 0; }
  template <typename Map>
  const typename Map::mapped_type& Pick(const Map& map) {
    return std::next(map.begin(), Below(map.size()))->second;
  }
  void Emit(const std::string& line) { m_lines.push_back(line); }
  void Touch(const std::string& pkgId) {
    if (std::find(m_recent.begin(), m_recent.end(), pkgId) != m_recent.end()) return;
    if (m_recent.size() == 6) m_recent.erase(m_recent.begin());
    m_recent.push_back(pkgId);
  }
  std::string Pool() {
    uint32_t i = Below(kPool);
    return i == kPool - 2 ? "p'q" : i == kPool - 1 ? "p\xc3\xa9" : "p" + std::to_string(i);
  }
  std::optional<std::string> Label() {
    if (OneIn(20)) return std::nullopt;
    std::string label = kLabels[Below(sizeof kLabels / sizeof kLabels[0])];
    return OneIn(2) ? label + " " + std::to_string(Below(10)) : label;
  }

  // On korrin-sim's new application, so that what `app` does not set agrees.
  sim::App NewApp(const std::string& pkgId, char letter) {
    sim::App app = sim::PlainApp(pkgId + "." + letter, pkgId + "." + letter);
    app.label = Label();
    app.game = !OneIn(4);
    app.noDisplay = OneIn(10);
    app.enabled = !OneIn(12);
    if (OneIn(12)) app.component = PACKAGE_INFO_SERVICEAPP;
    return app;
  }
  // Mostly one game; now and then another application alone, or several
  // applications of every kind together.
  sim::Package NewPackage(const std::string& pkgId) {
    sim::Package pkg = sim::MakePackage(pkgId, {});
    uint32_t shape = Below(10);
    for (uint32_t i = 0, count = shape < 7 ? 1 : 2 + Below(3); i < count; ++i) {
      pkg.apps.push_back(NewApp(pkgId, static_cast<char>('a' + i)));
      if (shape < 7) pkg.apps.back().game = shape < 6;
    }
    pkg.preload = OneIn(8);
    pkg.system = OneIn(10);
    pkg.supportDisable = OneIn(4);
    pkg.disabled = pkg.supportDisable && OneIn(10);
    return pkg;
  }

  // Emits the `package` and `app` lines that describe |pkg| (|held|: for an
  // install or update to send). korrin-sim builds on the installed package of
  // that id, or on an empty one, and keeps the applications |pkg| leaves out:
  // returns the package so described.
  sim::Package Describe(const sim::Package& pkg, bool held, const Model& model) {
    auto found = model.packages.find(pkg.id);
    sim::Package was = found != model.packages.end() ? found->second : sim::MakePackage(pkg.id, {});
    std::string flags = Flag("preload", was.preload, pkg.preload) +
                        Flag("system", was.system, pkg.system) +
                        Flag("support-disable", was.supportDisable, pkg.supportDisable) +
                        Flag("disabled", was.disabled, pkg.disabled);
    if (held || !flags.empty()) Emit("package " + Arg(pkg.id) + (held ? " --held" : "") + flags);
    sim::Package described = pkg;
    described.apps = was.apps;
    for (const sim::App& app : pkg.apps) {
      auto to = std::find_if(described.apps.begin(), described.apps.end(),
                             [&](const sim::App& a) { return a.id == app.id; });
      bool added = to == described.apps.end();
      if (added) to = described.apps.insert(to, sim::PlainApp(app.id, app.id));
      std::string options = Flag("game", to->game, app.game) +
                            Flag("no-display", to->noDisplay, app.noDisplay) +
                            Flag("enabled", to->enabled, app.enabled);
      if (app.label != to->label) options += app.label ? " --label " + Arg(*app.label) : " --no-label";
      if (app.component != to->component) {
        options += app.component == PACKAGE_INFO_SERVICEAPP ? " --component service" : " --component ui";
      }
      if (added || !options.empty()) Emit("app " + Arg(pkg.id) + " " + Arg(app.id) + options);
      *to = app;
    }
    return described;
  }
  void Send(const char* verb, const sim::Package& pkg, int type, Model& model) {
    sim::Package sent = Describe(pkg, true, model);
    Emit(verb + (" " + Arg(pkg.id)));
    model.Install(sent, type);
  }

  // One change to an installed package, or now and then a package of new
  // contents, which may not be installed yet.
  void Update(Model& model) {
    sim::Package pkg = OneIn(12) ? NewPackage(Pool()) : Pick(model.packages);
    sim::App& app = pkg.apps[Below(pkg.apps.size())];
    switch (Below(16)) {
      case 0: case 1: case 2: case 3: case 4: app.label = Label(); break;
      case 5: case 6: app.enabled = !app.enabled; break;
      case 7: pkg.supportDisable = pkg.disabled = true; break;
      case 8: pkg.disabled = false; break;
      case 9: case 10: app.noDisplay = !app.noDisplay; break;
      case 11: app.game = !app.game; break;
      case 12:
        if (pkg.apps.size() < 4) pkg.apps.push_back(NewApp(pkg.id, static_cast<char>('a' + pkg.apps.size())));
        break;
      case 13:
        pkg.preload = !pkg.preload;
        pkg.system = OneIn(3) != pkg.system;
        break;
    }
    Send("update", pkg, PACKAGE_MANAGER_EVENT_TYPE_UPDATE, model);
  }

  // Favours pending packages and those touched lately, so that one package
  // sees whole sequences (a quiet add, STARTED, FAILED, a late COMPLETED).
  void RawEvent(Model& model) {
    std::string pkgId;
    uint32_t whose = Below(10);
    if (whose < 4 && !model.jobs.empty()) {
      pkgId = Pick(model.jobs).pkgId;
    } else if (whose < 8 && !m_recent.empty()) {
      pkgId = m_recent[Below(m_recent.size())];
    } else {
      pkgId = Pool();
    }
    Touch(pkgId);
    uint32_t type = Below(8), state = Below(50);
    int eventType = type < 7 ? static_cast<int>(type % 3) : kOddTypes[Below(4)];
    int eventState = state < 20   ? PACKAGE_MANAGER_EVENT_STATE_STARTED
                     : state < 35 ? PACKAGE_MANAGER_EVENT_STATE_COMPLETED
                     : state < 40 ? PACKAGE_MANAGER_EVENT_STATE_FAILED
                     : state < 44 ? PACKAGE_MANAGER_EVENT_STATE_PROCESSING
                                  : kOddStates[Below(4)];
    Emit("event " + Named(korrin_sim::kEventTypeNames, eventType) + " " +
         Named(korrin_sim::kEventStateNames, eventState) + " " + Arg(pkgId));
    model.Event(pkgId, eventType, eventState);
  }

  // The layout does not change: games on the card are only read again.
  void BootDone(const Model& model) {
    if (!OneIn(4)) Emit("call _RegisterEdbusSignalHandler");  // the signal ends it
    Emit(OneIn(2) ? "card in" : "card out");
    std::string onCard;
    for (uint32_t n = Below(4); n > 0 && !model.packages.empty(); --n) {
      const sim::Package& pkg = Pick(model.packages);
      onCard += " " + Arg(pkg.apps[Below(pkg.apps.size())].id);
    }
    if (!onCard.empty()) Emit("on-card" + onCard);
    Emit("boot-done");
  }

  // A shortcut of an application on the device or gone from it, on any page
  // of menu 1, in a free cell up to a row below the last: the launcher may
  // leave cells free, and new boxes must still follow the last one.
  void Shortcut(Model& model) {
    std::string appId = Pool() + ".a";
    if (!model.packages.empty() && !OneIn(4)) {
      const sim::Package& pkg = Pick(model.packages);
      appId = pkg.apps[Below(pkg.apps.size())].id;
    }
    soak::Box box{std::next(model.pages.begin(), Below(model.pages.size()))->first, 0, 0, appId,
                  Label().value_or(""), false, false, 3, static_cast<int>(Below(3)),
                  OneIn(4) ? "" : "/opt/usr/share/icons/shortcut-" + std::to_string(Below(9)) + ".png",
                  OneIn(3) ? "" : "launch?mode=" + std::to_string(Below(9))};
    std::set<std::pair<int, int> > taken;
    int rows = 1;
    for (const auto& b : model.boxes) {
      if (b.second.pageId != box.pageId) continue;
      taken.insert({b.second.col, b.second.row});
      rows = std::max(rows, b.second.row + 1);
    }
    do {
      box.col = 1 + static_cast<int>(Below(4));
      box.row = 1 + static_cast<int>(Below(rows));
    } while (taken.count({box.col, box.row}));
    std::string line = "call InsertBoxData boxType=3 pageId=" + std::to_string(box.pageId) +
                       " col=" + std::to_string(box.col) + " row=" + std::to_string(box.row) +
                       " launchType=" + std::to_string(box.launchType) + " " + Arg("appId=" + appId);
    if (!box.name.empty()) line += " " + Arg("name=" + box.name);
    if (!box.iconPath.empty()) line += " " + Arg("iconPath=" + box.iconPath);
    if (!box.content.empty()) line += " " + Arg("content=" + box.content);
    Emit(line);
    model.AddBox(box);
  }

  std::mt19937 m_rng;
  std::vector<std::string> m_recent;  // packages raw events and quiet changes touched lately
  std::vector<std::string> m_lines;   // of the step being drawn
};

// ---- The run.

bool Same(const korrin_sim::Snapshot& a, const korrin_sim::Snapshot& b) {
  return std::equal(a.tables.begin(), a.tables.end(), b.tables.begin(), b.tables.end(),
                    [](const auto& x, const auto& y) {
                      return x.first == y.first && x.second.columns == y.second.columns &&
                             x.second.rows == y.second.rows;
                    });
}

// The value of |field| ("VmRSS", "VmHWM") in /proc/self/status, in kB.
long StatusKb(const std::string& field) {
  std::ifstream status("/proc/self/status");
  std::string line;
  while (std::getline(status, line)) {
    if (line.compare(0, field.size() + 1, field + ":") == 0) return atol(line.c_str() + field.size() + 1);
  }
  return -1;
}

// The steps 1..|last| of |seed| again, from the generator and the model
// alone: they do not depend on the engine, so the stream is the same.
std::string Script(uint32_t seed, uint64_t last) {
  Generator generator(seed);
  Model model;
  std::ostringstream script;
  for (uint64_t k = 1; k <= last; ++k) {
    script << "# step " << k << "\n";
    for (const std::string& line : generator.Next(model)) script << line << "\n";
  }
  return script.str();
}

struct Options {
  uint32_t seed;
  uint64_t events, tamperAt;
  std::string root;
};

int Soak(const Options& options) {
  sim::Device& device = sim::Device::Get();
  std::string root = options.root;
  if (root.empty()) {
    const char* tmp = getenv("TMPDIR");
    root = std::string(tmp && *tmp ? tmp : "/tmp") + "/korrin-soak-XXXXXX";
    if (mkdtemp(&root[0]) == NULL) {
      std::cerr << "korrin-soak: cannot make a device root: " << strerror(errno) << "\n";
      return 2;
    }
  }
  if (!device.UseRoot(root)) {
    std::cerr << "korrin-soak: cannot lay out a device under " << root << "\n";
    return 2;
  }
  korrin_sim::Session session(/*printActions=*/false);
  // The model starts from an empty store: a layout an earlier run left goes.
  const std::string path = session.DatabasePath();
  std::filesystem::remove(path);
  std::filesystem::remove(path + "-journal");

  const long rssAtStart = StatusKb("VmRSS");
  long rssWarm = -1;
  const int handlesAtStart = device.OpenHandles();
  Generator generator(options.seed);
  Model model;
  for (uint64_t k = 1; k <= options.events; ++k) {
    device.ClearLogs();  // the device keeps every line otherwise
    for (const std::string& line : generator.Next(model)) {
      try {
        session.Execute(line);
      } catch (const std::exception& e) {
        std::cerr << "korrin-soak: step " << k << ": " << line << ": " << e.what() << "\n";
        return 2;
      }
    }
    if (k == options.tamperAt) {  // self-test: the newest box moved down a row
      sqlite3* db = NULL;
      sqlite3_open(path.c_str(), &db);
      sqlite3_exec(db, "UPDATE Boxes SET row = row + 1 WHERE boxId = (SELECT MAX(boxId) FROM Boxes)",
                   NULL, NULL, NULL);
      sqlite3_close(db);
    }
    const korrin_sim::Snapshot expected = model.Expected();
    const korrin_sim::Snapshot stored = korrin_sim::TakeSnapshot(path);
    // Every handle the engine opens for a step it must release in the step:
    // only the listening client stays, held since the library was loaded.
    const int handles = device.OpenHandles();
    if (!Same(expected, stored) || handles != handlesAtStart) {
      std::cout << "seed " << options.seed << ": ";
      if (handles == handlesAtStart) {
        std::cout << "the layout differs from the model";
      } else {
        std::cout << handles << " platform handles open (" << handlesAtStart << " before)";
      }
      const std::string script = Script(options.seed, k);
      std::ofstream(root + "/steps.ksim") << script;
      std::cout << " after step " << k << " of " << options.events << "\n"
                << "steps 1.." << k << " as a script (`korrin-sim run " << root
                << "/steps.ksim` plays it again):\n" << script << "log of step " << k << ":\n";
      session.Execute("log --all");
      std::cout << "platform handles open:";
      for (const auto& kind : device.OpenHandlesByKind()) {
        std::cout << " " << kind.first << " " << kind.second;
      }
      std::cout << "\nrows the database (+) and the model (-) disagree on:\n";
      korrin_sim::PrintChanges(expected, stored, std::cout);
      std::cout << "the device is left in " << root << "\n";
      return 1;
    }
    if (k == options.events / 10) rssWarm = StatusKb("VmRSS");
  }
  std::cout << "seed " << options.seed << ": " << options.events << " events, layout matched\n"
            << "VmRSS " << rssAtStart << " kB at start, " << rssWarm << " kB after a tenth, "
            << StatusKb("VmRSS") << " kB at end; VmHWM " << StatusKb("VmHWM") << " kB\n";
  if (options.root.empty()) std::filesystem::remove_all(root);
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  Options options;
  po::options_description visible("korrin-soak options");
  visible.add_options()
      ("seed", po::value<uint32_t>(&options.seed)->default_value(1), "the stream's seed")
      ("events", po::value<uint64_t>(&options.events)->default_value(1000),
       "steps to play and check")
      ("root", po::value<std::string>(&options.root)->value_name("DIR"),
       "keep the device and its database in DIR, replacing a database left there "
       "(default: a temporary folder, removed unless the run fails)")
      ("tamper-at", po::value<uint64_t>(&options.tamperAt)->default_value(0)->value_name("K"),
       "self-test: change the database behind the engine's back after step K")
      ("help", "show these options");
  po::variables_map values;
  try {
    po::store(po::parse_command_line(argc, argv, visible), values);
    po::notify(values);
  } catch (const po::error& e) {
    std::cerr << "korrin-soak: " << e.what() << " (korrin-soak --help)\n";
    return 2;
  }
  if (values.count("help")) {
    std::cout << "usage: korrin-soak [--seed N] [--events N] [--root DIR]\n" << visible;
    return 0;
  }
  return Soak(options);
}
