// korrin-soak: a seeded random stream of korrin-sim command lines played
// through korrin-sim's session. After every step the stored tables must be
// the model's and every platform handle the step took given back; else it
// prints the steps so far as a script, the log of the last step and the rows
// that differ, leaves the device in $TMPDIR and exits 1. The engine commits
// every statement on its own: a device in memory (TMPDIR=/dev/shm) is faster.
#include <package_manager.h>
#include <sqlite3.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <map>
#include <numeric>
#include <random>
#include <set>
#include <sstream>

#include <boost/program_options.hpp>

#include "cli.h"
#include "session.h"
#include "sim/device.h"
#include "words.h"

namespace {

// ---- The model: the device, the engine's package jobs and the tables it must
// have stored, from the engine's described behaviour, sharing no code with it.

struct Box {  // as stored, "" as NULL; a shortcut (box type 3) carries the texts
  int pageId, col, row;
  std::string appId, name;
  bool preload, system;
  int boxType, launchType;
  std::string iconPath, content;
};

class Model {
 public:
  // An install or update to |pkg|, or an uninstall: STARTED, the change, COMPLETED.
  void Send(const std::string& pkgId, int type, const sim::Package* pkg) {
    Event(pkgId, type, PACKAGE_MANAGER_EVENT_STATE_STARTED);
    if (pkg) packages[pkgId] = *pkg;
    if (!pkg) packages.erase(pkgId);
    Event(pkgId, type, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
  }
  // A start replaces the package's pending job (an uninstall's names its
  // applications while they can be read); other states change nothing.
  void Event(const std::string& pkgId, int type, int state) {
    if (!started) return;  // nobody listens yet
    if (state == PACKAGE_MANAGER_EVENT_STATE_STARTED) {
      jobs[pkgId] = Job{pkgId, type, {}};
      if (type == PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL) jobs[pkgId].apps = EventApps(pkgId);
    } else if (state == PACKAGE_MANAGER_EVENT_STATE_COMPLETED && jobs.count(pkgId)) {
      held.push_back(jobs[pkgId]);
      jobs.erase(pkgId);
      if (!paused) Listen();
    } else if (state == PACKAGE_MANAGER_EVENT_STATE_FAILED) {
      jobs.erase(pkgId);
    }
  }
  // Listening pauses while the store is first filled with every displayable,
  // enabled game by id, four to a row on page 1; |meanwhile| comes after.
  void Start(const sim::Package* meanwhile) {
    paused = true;
    std::set<std::string> games;
    for (const auto& pkg : packages) {
      for (const sim::App& app : pkg.second.apps) {
        if (!started && app.game && !app.noDisplay && app.enabled && !pkg.second.disabled) {
          games.insert(app.id);
        }
      }
    }
    if (!games.empty()) pages = 1;
    for (const std::string& appId : games) {
      int i = static_cast<int>(boxes.size());
      boxes[++lastBoxId] = Box{1, i % 4 + 1, i / 4 + 1, appId, "", 0, 0, 0, 0, "", ""};
    }
    started = true;
    if (meanwhile) Send(meanwhile->id, PACKAGE_MANAGER_EVENT_TYPE_INSTALL, meanwhile);
    Listen();
  }
  void Listen() {  // held jobs run in the order they completed
    paused = false;
    std::vector<Job> run;
    run.swap(held);
    for (const Job& job : run) Run(job);
  }

  // The tables as the engine must have stored them; none before the start.
  korrin_sim::Snapshot Expected() const {
    korrin_sim::Snapshot s;
    if (!started) return s;
    auto n = [](int value) { return std::to_string(value); };
    auto text = [](const std::string& t) { return t.empty() ? "NULL" : korrin_sim::Quote(t); };
    s.tables["Menus"].rows[1] = {"1", "\"Apps\"", "0"};  // the columns are the database's
    for (int id = 1; id <= pages; ++id) s.tables["Pages"].rows[id] = {n(id), "0", "1", n(id)};
    for (const auto& e : boxes) {
      const Box& b = e.second;
      s.tables["Boxes"].rows[e.first] = {n(e.first), "0", "NULL", n(b.pageId), text(b.appId),
                                         text(b.name), n(b.col), n(b.row), n(b.preload),
                                         n(b.system), n(b.boxType), n(b.launchType),
                                         text(b.iconPath), text(b.content)};
    }
    return s;
  }

  // ---- The state. The stream adds menu 1's pages in number order and none
  // goes: page k has pageId k and pageNo k.
  struct Job { std::string pkgId; int type; std::vector<sim::App> apps; };
  std::map<std::string, sim::Package> packages;  // on the device
  bool started = false, paused = false;
  std::map<std::string, Job> jobs;  // started, by package
  int pages = 0, lastBoxId = 0;
  std::map<int, Box> boxes;

 private:
  // Its applications up to the first that is not a game, but the hidden.
  std::vector<sim::App> EventApps(const std::string& pkgId) const {
    std::vector<sim::App> apps;
    if (!packages.count(pkgId)) return apps;
    for (const sim::App& app : packages.at(pkgId).apps) {
      if (!app.game) break;
      if (!app.noDisplay) apps.push_back(app);
    }
    return apps;
  }

  // A job reads the device when it runs (a held one at the replay). A new game
  // gets a box after the last box of the last page, with its label and flags;
  // an update rewrites those of a placed one, or takes it away when it
  // disables it. A missing label keeps the name.
  void Run(const Job& job) {
    bool update = job.type == PACKAGE_MANAGER_EVENT_TYPE_UPDATE;
    for (const sim::App& app : job.apps) Uninstalled(app.id);  // an uninstall
    if (!update && job.type != PACKAGE_MANAGER_EVENT_TYPE_INSTALL) return;
    for (const sim::App& app : EventApps(job.pkgId)) {
      const sim::Package& pkg = packages.at(job.pkgId);
      bool enabled = app.enabled && !pkg.disabled;
      if (!enabled && update) Uninstalled(app.id);
      Box* box = NULL;
      std::pair<int, int> last(1, 0);  // (row, col) on the last page: before its first cell
      for (auto& b : boxes) {
        if (b.second.appId == app.id && b.second.boxType != 3) box = &b.second;
        if (b.second.pageId == pages) last = std::max(last, {b.second.row, b.second.col});
      }
      if (!enabled || (box && !update)) continue;
      if (!box) {
        if (++last.second > 4) last = {last.first + 1, 1};
        pages = std::max(pages, 1);  // a first page when the menu has none
        box = &(boxes[++lastBoxId] =
                    Box{pages, last.second, last.first, app.id, "", 0, 0, 0, 0, "", ""});
      }
      if (app.label) box->name = *app.label;
      box->preload = pkg.preload;
      box->system = pkg.system;
    }
  }

  // Its box and shortcuts go; each page that lost one is packed four wide.
  void Uninstalled(const std::string& appId) {
    std::set<int> affected;
    for (auto b = boxes.begin(); b != boxes.end();) {
      if (b->second.appId == appId) affected.insert(b->second.pageId);
      b = b->second.appId == appId ? boxes.erase(b) : std::next(b);
    }
    for (int pageId : affected) {
      std::map<std::pair<int, int>, Box*> left;  // by (row, col)
      for (auto& b : boxes) {
        if (b.second.pageId == pageId) left[{b.second.row, b.second.col}] = &b.second;
      }
      int i = 0;
      for (auto& b : left) {
        b.second->col = i % 4 + 1;
        b.second->row = i++ / 4 + 1;
      }
    }
  }

  std::vector<Job> held;  // completed while paused
};

// ---- The stream.

// A small pool keeps the layout small however long the run.
const uint32_t kPool = 32;
const char* const kLabels[] = {"Tide", "Ember", "Racer", "Chess", "Nova", "Orbit", "it's on",
                               "\"quoted\"", "x'); DROP TABLE Boxes; --", "\xc3\x89" "checs",
                               "\xe6\xb8\xb8\xe6\x88\x8f"};

// One word of a command line, quoted as korrin-sim splits it.
std::string Arg(const std::string& text) { return korrin_sim::ShellWord(text); }

std::string Flag(const char* name, bool was, bool now) {
  return was == now ? "" : std::string(" --") + name + (now ? "" : "=false");
}

// The options of `package`, `app` and `update` that turn |was| into |now|.
std::string Options(const sim::Package& was, const sim::Package& now) {
  return Flag("preload", was.preload, now.preload) + Flag("system", was.system, now.system) +
         Flag("disabled", was.disabled, now.disabled);
}
std::string Options(const sim::App& was, const sim::App& now) {
  std::string options = Flag("game", was.game, now.game) +
                        Flag("enabled", was.enabled, now.enabled) +
                        Flag("no-display", was.noDisplay, now.noDisplay);
  if (now.label == was.label) return options;
  return options + (now.label ? " --label " + Arg(*now.label) : " --no-label");
}

// The same seed gives the same lines everywhere: draws use std::mt19937's raw
// output, which the standard fixes, not the library's distributions.
class Generator {
 public:
  explicit Generator(uint32_t seed) : m_rng(seed) {}

  // The command lines of the next step, which |model| takes in. Package
  // operations before the first start are heard by nobody.
  std::vector<std::string> Next(Model& model) {
    m_lines.clear();
    const uint32_t installed = static_cast<uint32_t>(model.packages.size());
    const bool on = model.started, paused = model.paused;
    const uint32_t weights[] = {
        4 + 16 * (kPool - installed) / kPool,         // install
        installed ? 22u : 0u,                         // update
        installed ? 2 + 16 * installed / kPool : 0u,  // uninstall
        16, 5, paused ? 0u : 3u, paused ? 12u : 1u,   // raw event, quiet change, pause, replay
        on ? 1u : 6u, on ? 2u : 0u,                   // start, boot-done
        on && model.pages < 4 ? 1u : 0u, model.pages ? 3u : 0u};  // page, shortcut
    uint32_t what = 0, draw = Below(std::accumulate(weights, weights + 11, 0u));
    for (; draw >= weights[what]; ++what) draw -= weights[what];
    std::string pkgId = what == 2 ? Pick(model.packages).id : Pool();
    sim::Package pkg;
    switch (what) {
      case 0:
        if (model.packages.count(pkgId)) return Update(model.packages.at(pkgId), model);
        Describe(pkg = NewPackage(pkgId), true);
        model.Send(pkgId, PACKAGE_MANAGER_EVENT_TYPE_INSTALL, &pkg);
        return Emit("install " + Arg(pkgId));
      case 1: return Update(Pick(model.packages), model);
      case 2:
        model.Send(pkgId, PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL, NULL);
        return Emit("uninstall " + Arg(pkgId));
      case 3: return RawEvents(model);
      case 4:  // a package taken away or added quietly
        m_last = pkgId;
        if (model.packages.erase(pkgId)) return Emit("remove " + Arg(pkgId));
        Describe(model.packages[pkgId] = NewPackage(pkgId), false);
        return m_lines;
      case 5: model.paused = true; return Emit("call PauseListenCb");
      case 6: model.Listen(); return Emit("call StartListenCb");
      case 7:  // the first time with a package installed once the games are listed
        if (!on && !model.packages.count(pkgId)) {
          Describe(pkg = NewPackage(pkgId), true);
          Emit("before app_info_filter_destroy install " + Arg(pkgId));
        }
        model.Start(pkg.id.empty() ? NULL : &pkg);
        return Emit("start --without boot-signal --without card-watch");  // BootDone subscribes
      case 8: return BootDone(model);
      case 9: return Emit("call InsertPageData parentId=1 pageNo=" + std::to_string(++model.pages));
    }
    return Shortcut(model);
  }

 private:
  uint32_t Below(size_t n) { return static_cast<uint32_t>(m_rng() % n); }
  bool OneIn(uint32_t n) { return Below(n) == 0; }
  template <typename Map>
  const typename Map::mapped_type& Pick(const Map& map) {
    return std::next(map.begin(), Below(map.size()))->second;
  }
  std::vector<std::string> Emit(const std::string& line) {
    m_lines.push_back(line);
    return m_lines;
  }
  std::string Pool() {
    uint32_t i = Below(kPool);
    return i == 0 ? "p'q" : i == 1 ? "p\xc3\xa9" : "p" + std::to_string(i);
  }
  boost::optional<std::string> Label() {  // now and then none
    std::string label = kLabels[Below(std::size(kLabels))];
    if (OneIn(2)) label += " " + std::to_string(Below(10));
    return OneIn(20) ? boost::none : boost::optional<std::string>(label);
  }
  // Mostly one game; now and then another application, or several.
  sim::Package NewPackage(const std::string& pkgId) {
    sim::Package pkg = sim::MakePackage(pkgId, {});
    for (uint32_t shape = Below(10), i = 0; i < (shape < 7 ? 1 : 2 + shape % 3); ++i) {
      std::string appId = pkgId + "." + static_cast<char>('a' + i);
      pkg.apps.push_back(sim::PlainApp(appId, appId));
      sim::App& app = pkg.apps.back();
      app.label = Label();
      app.game = shape < 7 ? shape < 6 : !OneIn(4);
      app.noDisplay = OneIn(10);
      app.enabled = !OneIn(12);
    }
    pkg.preload = OneIn(8);
    pkg.system = OneIn(10);
    pkg.disabled = OneIn(40);
    return pkg;
  }

  // A new package from korrin-sim's empty one and new applications.
  void Describe(const sim::Package& pkg, bool held) {
    Emit("package " + Arg(pkg.id) + (held ? " --held" : "") +
         Options(sim::MakePackage(pkg.id, {}), pkg));
    for (const sim::App& app : pkg.apps) {
      Emit("app " + Arg(pkg.id) + " " + Arg(app.id) + Options(sim::PlainApp(app.id, app.id), app));
    }
  }

  // One change to the installed package |was| or one of its applications.
  std::vector<std::string> Update(const sim::Package& was, Model& model) {
    sim::Package pkg = was;
    sim::App& app = pkg.apps[Below(pkg.apps.size())];
    const sim::App before = app;
    switch (Below(16)) {
      case 0: case 1: case 2: case 3: case 4: app.label = Label(); break;
      case 5: case 6: app.enabled = !app.enabled; break;
      case 7: case 8: pkg.disabled = !pkg.disabled; break;
      case 9: case 10: app.noDisplay = !app.noDisplay; break;
      case 11: app.game = !app.game; break;
      case 13: pkg.preload = !pkg.preload; pkg.system = OneIn(3) != pkg.system; break;
    }
    Emit("update " + Arg(pkg.id) + " --app " + Arg(app.id) + Options(was, pkg) +
         Options(before, app));
    model.Send(pkg.id, PACKAGE_MANAGER_EVENT_TYPE_UPDATE, &pkg);  // |was| is the model's
    return m_lines;
  }

  // One to three raw events for one package, mostly one with a pending job or
  // the one touched last: a quiet add, STARTED, FAILED, a late COMPLETED.
  std::vector<std::string> RawEvents(Model& model) {
    uint32_t whose = Below(10);
    m_last = whose < 4 && !model.jobs.empty() ? Pick(model.jobs).pkgId
             : whose < 8 && !m_last.empty()   ? m_last
                                              : Pool();
    for (uint32_t n = 1 + Below(3), type, state; n > 0; --n) {
      type = Below(10), state = Below(50);
      const int eventType = type < 9 ? static_cast<int>(type % 3) : 7;  // 7: nobody knows it
      const int eventState = state < 20   ? PACKAGE_MANAGER_EVENT_STATE_STARTED
                             : state < 35 ? PACKAGE_MANAGER_EVENT_STATE_COMPLETED
                             : state < 45 ? PACKAGE_MANAGER_EVENT_STATE_FAILED
                                          : PACKAGE_MANAGER_EVENT_STATE_PROCESSING;
      model.Event(m_last, eventType, eventState);
      Emit("event " + (type < 9 ? korrin_sim::kEventTypeNames[eventType] : "7") + " " +
           korrin_sim::kEventStateNames[eventState] + " " + Arg(m_last));
    }
    return m_lines;
  }
  // The layout stays: games on the card are only read again.
  std::vector<std::string> BootDone(const Model& model) {
    if (!OneIn(4)) Emit("call _RegisterEdbusSignalHandler");  // the signal ends it
    Emit(OneIn(2) ? "card in" : "card out");
    if (!model.packages.empty() && OneIn(2)) {
      const sim::Package& pkg = Pick(model.packages);
      Emit("on-card " + Arg(pkg.apps[Below(pkg.apps.size())].id));
    }
    return Emit("boot-done");
  }

  // A shortcut below a page's last row leaves cells free: new boxes follow it.
  std::vector<std::string> Shortcut(Model& model) {
    const sim::Package* pkg = model.packages.empty() || OneIn(4) ? NULL : &Pick(model.packages);
    Box box{1 + static_cast<int>(Below(model.pages)), 1 + static_cast<int>(Below(4)), 1,
            pkg ? pkg->apps[Below(pkg->apps.size())].id : Pool() + ".a", Label().value_or(""),
            false, false, 3, static_cast<int>(Below(3)),
            OneIn(4) ? "" : "/opt/usr/share/icons/shortcut-" + std::to_string(Below(9)) + ".png",
            OneIn(3) ? "" : "launch?mode=" + std::to_string(Below(9))};
    for (const auto& b : model.boxes) {
      if (b.second.pageId == box.pageId) box.row = std::max(box.row, b.second.row + 1);
    }
    model.boxes[++model.lastBoxId] = box;
    return Emit("call InsertBoxData boxType=3 pageId=" + std::to_string(box.pageId) +
                " col=" + std::to_string(box.col) + " row=" + std::to_string(box.row) +
                " launchType=" + std::to_string(box.launchType) + " " + Arg("appId=" + box.appId) +
                " " + Arg("name=" + box.name) + " " + Arg("iconPath=" + box.iconPath) + " " +
                Arg("content=" + box.content));
  }

  std::mt19937 m_rng;
  std::string m_last;  // the package quiet changes and raw events touched last
  std::vector<std::string> m_lines;  // of the step being drawn
};

// ---- The run.

int Soak(uint32_t seed, uint64_t events, uint64_t tamperAt) {
  const std::string root =
      std::filesystem::temp_directory_path() / ("korrin-soak-" + std::to_string(getpid()));
  std::filesystem::remove_all(root);  // left by an earlier process of this id
  sim::Device& device = sim::Device::Get();
  if (!device.UseRoot(root)) {
    std::cerr << "korrin-soak: cannot lay out a device under " << root << "\n";
    return 2;
  }
  korrin_sim::Session session(/*printActions=*/false, /*recordChanges=*/false);
  const std::string path = session.DatabasePath();
  const int handles = device.OpenHandles();  // the listening client's, held since the load
  Generator generator(seed);
  Model model;
  for (uint64_t k = 1; k <= events; ++k) {
    device.ClearLogs();  // the device keeps every line otherwise
    // A line korrin-sim refuses is the generator's mistake, and ends the run.
    for (const std::string& line : generator.Next(model)) session.Execute(line);
    if (k == tamperAt) {  // self-test: the newest box moves down a row
      sqlite3* db = NULL;
      sqlite3_open(path.c_str(), &db);
      sqlite3_exec(db, "UPDATE Boxes SET row = row + 1 WHERE boxId = "
                       "(SELECT MAX(boxId) FROM Boxes)", NULL, NULL, NULL);
      sqlite3_close(db);
    }
    std::ostringstream diff, script;  // the rows that differ, or "no changes"
    korrin_sim::PrintChanges(model.Expected(), korrin_sim::TakeSnapshot(path), diff);
    if (diff.str() == "no changes\n" && device.OpenHandles() == handles) continue;
    Generator again(seed);  // the generator and a model alone draw the same steps again
    Model untouched;
    for (uint64_t j = 1; j <= k; ++j) {
      script << "# step " << j << "\n";
      for (const std::string& line : again.Next(untouched)) script << line << "\n";
    }
    std::ofstream(root + "/steps.ksim") << script.str();
    std::cout << "seed " << seed << ": after step " << k << " of " << events << ", "
              << device.OpenHandles() << " platform handles open (" << handles << " before)\n"
              << "steps 1.." << k << " (`korrin-sim run " << root << "/steps.ksim` plays them):\n"
              << script.str() << "log of step " << k << ":\n";
    session.Execute("log --all");
    std::cout << "rows that differ (- the model's, + the database's, ~ changed there):\n"
              << diff.str();
    if (tamperAt) std::filesystem::remove_all(root);  // a self-test keeps nothing
    return 1;
  }
  std::cout << "seed " << seed << ": " << events << " events, layout matched\n";
  std::filesystem::remove_all(root);
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  namespace po = boost::program_options;
  uint32_t seed;
  uint64_t events, tamperAt;
  po::options_description options("usage: korrin-soak [--seed N] [--events N]");
  options.add_options()("seed", po::value(&seed)->default_value(1), "the stream's seed")(
      "events", po::value(&events)->default_value(1000), "steps to play and check")(
      "tamper-at", po::value(&tamperAt)->default_value(0)->value_name("K"),
      "self-test: move a box behind the engine's back after step K");
  po::variables_map values;
  try {
    po::store(po::parse_command_line(argc, argv, options), values);
    po::notify(values);
  } catch (const po::error& e) {
    std::cerr << "korrin-soak: " << e.what() << "\n" << options;
    return 2;
  }
  return Soak(seed, events, tamperAt);
}
