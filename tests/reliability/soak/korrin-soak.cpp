// korrin-soak: the engine on a simulated device, fed a seeded random stream of
// package operations and events, its stored layout compared after every step
// with what the model says it must be.
//
//   TMPDIR=/dev/shm korrin-soak --seed 7 --events 100000
//
// prints "seed 7: 100000 events, layout matched" and the process's memory
// (VmRSS at the start, after a tenth of the run and at the end, and the peak),
// or the steps up to the first difference and both layouts, and exits 1. The
// engine commits every statement on its own, so on a disk the run waits on
// the disk's syncs: a device root in memory (TMPDIR or --root) makes it about
// ten times faster. The engine lives as long as the process: one run each.
#include <errno.h>
#include <sqlite3.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>

#include <chrono>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iomanip>
#include <iostream>
#include <memory>
#include <string>

#include <boost/program_options.hpp>

#include "korrin-data/korrin-data.h"
#include "sim/device.h"
#include "reliability/soak/model.h"
#include "reliability/soak/steps.h"

namespace po = boost::program_options;

namespace {

const char kDatabase[] = "/opt/usr/apps/com.velmora.korrin/data/.game-data.db";

// The three tables read with plain SQL through a read-only connection of the
// soak's own, each in one statement prepared once.
class Database {
 public:
  explicit Database(const std::string& path) : m_db(NULL), m_menus(NULL), m_pages(NULL),
                                               m_boxes(NULL) {
    if (sqlite3_open_v2(path.c_str(), &m_db, SQLITE_OPEN_READONLY, NULL) != SQLITE_OK) return;
    Prepare("SELECT menuId, name, type FROM Menus ORDER BY menuId", &m_menus);
    Prepare("SELECT pageId, isFolder, parentId, pageNo FROM Pages ORDER BY pageId", &m_pages);
    Prepare("SELECT boxId, isFolder, pageParentId, pageId, appId, name, col, row, isPreload, "
            "isSystem, boxType, launchType, iconPath, content FROM Boxes ORDER BY boxId",
            &m_boxes);
  }
  ~Database() {
    sqlite3_finalize(m_menus);
    sqlite3_finalize(m_pages);
    sqlite3_finalize(m_boxes);
    sqlite3_close(m_db);
  }

  // False, with SQLite's message, when a table cannot be read.
  bool Read(soak::Layout* layout, std::string* error) {
    layout->menus.clear();
    layout->pages.clear();
    layout->boxes.clear();
    if (m_boxes == NULL) return Failed(error);
    while (sqlite3_step(m_menus) == SQLITE_ROW) {
      layout->menus.push_back(soak::MenuRow{Integer(m_menus, 0), Str(m_menus, 1),
                                            Integer(m_menus, 2)});
    }
    while (sqlite3_step(m_pages) == SQLITE_ROW) {
      layout->pages.push_back(soak::PageRow{Integer(m_pages, 0), Integer(m_pages, 1),
                                            Integer(m_pages, 2), Integer(m_pages, 3)});
    }
    sqlite3_stmt* s = m_boxes;
    while (sqlite3_step(s) == SQLITE_ROW) {
      layout->boxes.push_back(soak::BoxRow{
          Integer(s, 0), Integer(s, 1), Integer(s, 2), Integer(s, 3), Str(s, 4), Str(s, 5),
          Integer(s, 6), Integer(s, 7), Integer(s, 8), Integer(s, 9), Integer(s, 10),
          Integer(s, 11), Str(s, 12), Str(s, 13)});
    }
    // A reset that reports an error tells that the walk above stopped early.
    bool ok = sqlite3_reset(m_menus) == SQLITE_OK && sqlite3_reset(m_pages) == SQLITE_OK &&
              sqlite3_reset(m_boxes) == SQLITE_OK;
    return ok || Failed(error);
  }

 private:
  void Prepare(const char* sql, sqlite3_stmt** stmt) {
    if (sqlite3_prepare_v2(m_db, sql, -1, stmt, NULL) != SQLITE_OK) *stmt = NULL;
  }
  bool Failed(std::string* error) {
    *error = m_db ? sqlite3_errmsg(m_db) : "cannot open the database";
    return false;
  }
  static soak::Int Integer(sqlite3_stmt* s, int i) {
    switch (sqlite3_column_type(s, i)) {
      case SQLITE_NULL: return std::nullopt;
      case SQLITE_INTEGER: return sqlite3_column_int64(s, i);
    }
    return INT64_MIN;  // shown as "?": never equal to what the model expects
  }
  static soak::Text Str(sqlite3_stmt* s, int i) {
    if (sqlite3_column_type(s, i) == SQLITE_NULL) return std::nullopt;
    const char* text = reinterpret_cast<const char*>(sqlite3_column_text(s, i));
    return std::string(text, static_cast<size_t>(sqlite3_column_bytes(s, i)));
  }

  sqlite3* m_db;
  sqlite3_stmt* m_menus;
  sqlite3_stmt* m_pages;
  sqlite3_stmt* m_boxes;
};

// The value of |field| ("VmRSS", "VmHWM") in /proc/self/status, in kB.
long StatusKb(const std::string& field) {
  std::ifstream status("/proc/self/status");
  std::string line;
  while (std::getline(status, line)) {
    if (line.compare(0, field.size() + 1, field + ":") == 0) {
      return strtol(line.c_str() + field.size() + 1, NULL, 10);
    }
  }
  return -1;
}

void Drive(const soak::Step& step) {
  sim::Device& device = sim::Device::Get();
  LauncherPackageManager& packages = korrin::PackageManager();
  LauncherDataManager& store = korrin::DataManager();
  switch (step.op) {
    case soak::Step::kAddPage: {
      GamePageData page;
      page.parentId = 1;
      page.pageNo = step.pageNo;
      store.InsertPageData(page);
      break;
    }
    case soak::Step::kShortcut: {
      GameBoxData box;
      box.pageId = step.pageId;
      box.col = step.col;
      box.row = step.row;
      box.appId = step.appId;
      box.name = step.name;
      box.iconPath = step.iconPath;
      box.content = step.content;
      box.boxType = 3;
      box.launchType = step.launchType;
      store.InsertBoxData(box);
      break;
    }
    case soak::Step::kQuietAdd: device.AddPackage(step.pkg); break;
    case soak::Step::kQuietRemove: device.RemovePackage(step.pkgId); break;
    case soak::Step::kStart:
      if (!step.pkg.id.empty()) {
        // Right after the engine has listed the installed games.
        sim::Package pkg = step.pkg;
        device.BeforeNext("app_info_filter_destroy", [pkg] { sim::Device::Get().Install(pkg); });
      }
      data_engin_initialization();
      break;
    case soak::Step::kRestart: data_engin_initialization(); break;
    case soak::Step::kInstall: device.Install(step.pkg); break;
    case soak::Step::kUpdate: device.Update(step.pkg); break;
    case soak::Step::kUninstall: device.Uninstall(step.pkgId); break;
    case soak::Step::kEvent:
      device.EmitPackageEvent("tpk", step.pkgId, step.eventType, step.eventState);
      break;
    case soak::Step::kPause: packages.PauseListenCb(); break;
    case soak::Step::kListen: packages.StartListenCb(); break;
    case soak::Step::kBootDone:
      if (step.subscribe) packages._RegisterEdbusSignalHandler();
      device.SetPreference("memory/sysman/mmc", step.card);
      // The launcher marks the games on the card in the records it shares
      // with the engine's cache.
      for (const std::string& appId : step.onCard) {
        auto cached = packages.m_appInfoCache.find(appId);
        if (cached != packages.m_appInfoCache.end() && cached->second) {
          cached->second->isOnStorageCard = true;
        }
      }
      device.SendBusSignal("/Org/Tizen/System/DeviceD/Core", "org.tizen.system.deviced.core",
                           "BootingDone");
      break;
  }
}

// Self-test: a change behind the engine's back, which the next check must
// report. Moves the newest box down a row, or adds a stray one.
void Tamper(const std::string& path) {
  sqlite3* db = NULL;
  if (sqlite3_open_v2(path.c_str(), &db, SQLITE_OPEN_READWRITE, NULL) == SQLITE_OK) {
    sqlite3_exec(db, "UPDATE Boxes SET row = row + 1 WHERE boxId = (SELECT MAX(boxId) FROM Boxes)",
                 NULL, NULL, NULL);
    if (sqlite3_changes(db) == 0) {
      sqlite3_exec(db, "INSERT INTO Boxes(isFolder, pageId, appId, col, row) "
                   "VALUES(0, 1, 'stray', 1, 1)", NULL, NULL, NULL);
    }
  }
  sqlite3_close(db);
}

// The steps 1..|last| of |seed| again, from the generator and the model
// alone: they do not depend on the engine, so the stream is the same.
void PrintSteps(uint32_t seed, uint64_t last, std::ostream& out) {
  soak::Generator generator(seed);
  soak::Model model;
  for (uint64_t k = 1; k <= last; ++k) {
    soak::Step step = generator.Next(model);
    out << std::setw(7) << k << "  " << soak::Describe(step) << "\n";
    model.Apply(step);
  }
}

struct Options {
  uint32_t seed;
  uint64_t events;
  std::string root;
  bool trace;
  uint64_t tamperAt;
};

int Soak(const Options& options) {
  sim::Device& device = sim::Device::Get();
  std::string root = options.root;
  bool temporary = root.empty();
  if (temporary) {
    const char* tmp = getenv("TMPDIR");
    std::string pattern = std::string(tmp && *tmp ? tmp : "/tmp") + "/korrin-soak-XXXXXX";
    if (mkdtemp(&pattern[0]) == NULL) {
      std::cerr << "korrin-soak: cannot make a device root: " << strerror(errno) << "\n";
      return 2;
    }
    root = pattern;
  }
  if (!device.UseRoot(root)) {
    std::cerr << "korrin-soak: cannot lay out a device under " << root << "\n";
    return 2;
  }
  // The model starts from an empty store: a layout an earlier run left goes.
  const std::string path = device.HostPath(kDatabase);
  std::error_code ignored;
  std::filesystem::remove(path, ignored);
  std::filesystem::remove(path + "-journal", ignored);

  const long rssAtStart = StatusKb("VmRSS");
  const int handlesAtStart = device.OpenHandles();
  long rssWarm = -1;
  const uint64_t warm = options.events / 10;
  const auto began = std::chrono::steady_clock::now();
  soak::Generator generator(options.seed);
  soak::Model model;
  std::unique_ptr<Database> database;
  soak::Layout stored;
  for (uint64_t k = 1; k <= options.events; ++k) {
    soak::Step step = generator.Next(model);
    if (options.trace) std::cout << std::setw(7) << k << "  " << soak::Describe(step) << std::endl;
    Drive(step);
    model.Apply(step);
    if (k == options.tamperAt) Tamper(path);

    std::string error;
    bool read = true;
    if (!database && access(path.c_str(), F_OK) == 0) database.reset(new Database(path));
    if (database) {
      read = database->Read(&stored, &error);
    } else {
      stored = soak::Layout();
    }
    soak::Layout expected = model.Expected();
    // Every handle the engine opens for a step it must release in the step:
    // only the listening client stays, held since the library was loaded.
    const int handles = device.OpenHandles();
    if (!read || expected != stored || handles != handlesAtStart) {
      std::cout << "seed " << options.seed << ": ";
      if (!read || expected != stored) {
        std::cout << "the layout differs from the model";
      } else {
        std::cout << handles << " platform handles open (" << handlesAtStart << " before)";
      }
      std::cout << " after step " << k << " of " << options.events << "\n"
                << "steps 1.." << k << " (korrin-soak --seed " << options.seed << " --events "
                << k << " plays them again):\n";
      PrintSteps(options.seed, k, std::cout);
      std::cout << "engine log of step " << k << ":\n";
      for (const sim::LogLine& line : device.Logs()) {
        char priority = line.priority >= 0 && line.priority <= 8 ? "??VDIWEFS"[line.priority] : '?';
        std::cout << "  " << priority << "/" << line.tag << ": " << line.text << "\n";
      }
      std::cout << "platform handles open:";
      for (const auto& kind : device.OpenHandlesByKind()) {
        std::cout << " " << kind.first << " " << kind.second;
      }
      std::cout << "\n";
      if (!read) std::cout << "the database cannot be read: " << error << "\n";
      soak::PrintDiff(expected, stored, std::cout);
      std::cout << "the device is left in " << root << "\n";
      return 1;
    }
    device.ClearLogs();  // the device keeps every line otherwise
    if (k == warm) rssWarm = StatusKb("VmRSS");
  }
  const double seconds =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - began).count();

  std::cout << "seed " << options.seed << ": " << options.events << " events, layout matched\n";
  std::cout << "VmRSS " << rssAtStart << " kB at start";
  if (rssWarm >= 0) std::cout << ", " << rssWarm << " kB after " << warm << " events";
  std::cout << ", " << StatusKb("VmRSS") << " kB at end; VmHWM " << StatusKb("VmHWM")
            << " kB; " << std::fixed << std::setprecision(1) << seconds << " s\n";
  database.reset();
  if (temporary) std::filesystem::remove_all(root, ignored);
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
      ("trace", po::bool_switch(&options.trace), "print each step as it is played")
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
