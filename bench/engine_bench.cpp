// The engine end to end, through data_engin_initialization() and the
// simulated device: first launch of 100 to 10,000 games; one install, one
// update and one uninstall (which closes the gaps on a 1,000-box page) in a
// 10,000-box menu; the boot signal with 100 applications on the storage card.
// Each sits beside its floor: the SQLite calls the engine made on its
// connection during the operation, recorded and replayed (call_log.h). The
// platform calls the engine makes to the simulator (package events,
// application information, the bus) are not part of the floor, so a ratio
// counts them with the engine's own C++.
//
// The engine's two managers live as long as the process, so each iteration
// puts back, untimed and through a plain connection, the rows the operation
// changed (sqlite_sequence too, so that every iteration writes the same ids)
// and what the engine keeps that it would otherwise reuse: its application
// cache, which a first launch only fills when it is empty, and the storage
// card flags that a refresh clears. Re-running data_engin_initialization()
// reopens the database, so one process serves every layout.
//
// Rows come out in store_bench.cpp's table as STORAGE/engine:OPERATION/BOXES,
// and under `korrin-bench --callgrind` (bench/callgrind.sh) as instruction
// counts, in memory only (RunEngineUnderCallgrind below).
#include <benchmark/benchmark.h>
#include <dlfcn.h>
#include <sqlite3.h>
#include <stdlib.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <functional>
#include <iostream>
#include <map>
#include <memory>
#include <regex>
#include <string>
#include <vector>

#include "bench.h"
#include "call_log.h"
#include "korrin-data/korrin-data.h"
#include "sim/device.h"

namespace {

// Set while a first launch is recorded: the engine opens its connection
// inside the operation, so recording starts at that open.
bench::CallLog* g_recordNextOpen = nullptr;

}  // namespace

extern "C" int sqlite3_open(const char* path, sqlite3** db) {
  static const auto real = reinterpret_cast<int (*)(const char*, sqlite3**)>(
      dlsym(RTLD_NEXT, "sqlite3_open"));
  int rc = real(path, db);
  if (rc == SQLITE_OK && g_recordNextOpen != nullptr) {
    bench::StartRecording(*db, g_recordNextOpen);
    g_recordNextOpen = nullptr;
  }
  return rc;
}

namespace {

using bench::kDisk;
using bench::kMemory;
using bench::kStorageNames;
using bench::Storage;

// The menu's size; under callgrind a smaller run may lay out 1,000 boxes.
int g_menuBoxes = 10000;
const int kPageBoxes = 1000;
const int kCardApps = 100;
const char kNewGame[] = "com.ex.newgame";

std::string GameId(int i) { return "com.ex.game" + std::to_string(i); }
std::string GameLabel(int i) { return "Game " + std::to_string(i); }

sim::Device& Dev() { return sim::Device::Get(); }
LauncherDataManager& Store() { return korrin::DataManager(); }
LauncherPackageManager& Tracker() { return korrin::PackageManager(); }

void Exec(sqlite3* db, const std::string& sql) {
  char* error = NULL;
  if (sqlite3_exec(db, sql.c_str(), NULL, NULL, &error) != SQLITE_OK) {
    std::fprintf(stderr, "korrin-bench: %s: %s\n", sql.c_str(), error);
    std::abort();
  }
}

// A device root with its layout database, made once per storage and layout.
// The engine's connection points at the scene set up last.
class Scene {
 public:
  Scene(Storage storage, const std::string& name) {
    m_root = bench::MakeTempDir(storage, "korrin-engine-bench-" + name);
  }
  ~Scene() { std::filesystem::remove_all(m_root); }

  const std::string& Root() const { return m_root; }
  std::string DbPath() const { return Dev().HostPath("/opt/usr/apps/com.velmora.korrin/data/.game-data.db"); }

  // SQL through a connection of its own, as another process would.
  void Plain(const std::string& sql) const {
    sqlite3* db = NULL;
    if (sqlite3_open(DbPath().c_str(), &db) != SQLITE_OK) std::abort();
    Exec(db, sql);
    sqlite3_close(db);
  }

 private:
  std::string m_root;
};

std::map<std::string, std::unique_ptr<Scene>> g_scenes;
std::string g_current;

// Makes |key| the device and database the engine works on; |build| lays the
// scene out the first time.
Scene& Enter(Storage storage, const std::string& key, std::function<void(Scene&)> build) {
  std::string full = std::string(kStorageNames[storage]) + "-" + key;
  std::unique_ptr<Scene>& scene = g_scenes[full];
  bool fresh = !scene;
  if (fresh) scene.reset(new Scene(storage, key));
  if (g_current != full) {
    Dev().Reset();
    Tracker().m_appInfoCache.clear();
    Dev().UseRoot(scene->Root());
    build(*scene);
    g_current = full;
  }
  return *scene;
}

// ---- First launch: |games| games on the device, an empty database.

void AddGames(int games) {
  for (int i = 0; i < games; ++i) Dev().AddGame(GameId(i), GameLabel(i));
}

void Empty(const Scene& scene) {
  scene.Plain("DELETE FROM Boxes; DELETE FROM Pages; DELETE FROM Menus; "
              "DELETE FROM sqlite_sequence;");
  Tracker().m_appInfoCache.clear();
  Dev().ClearLogs();
}

void RegisterFirstLaunch(Storage storage, int games) {
  std::string name = std::string(kStorageNames[storage]) + "/engine:FirstLaunch/" +
                     std::to_string(games) + "/";
  std::string key = "launch" + std::to_string(games);
  auto build = [games](Scene& scene) {
    AddGames(games);
    data_engin_initialization();  // makes the tables
    Empty(scene);
  };
  auto log = std::make_shared<bench::CallLog>();
  benchmark::RegisterBenchmark((name + "floor").c_str(), [=](benchmark::State& state) {
    Scene& scene = Enter(storage, key, build);
    if (log->empty()) {
      g_recordNextOpen = log.get();
      data_engin_initialization();
      bench::StopRecording();
      g_recordNextOpen = nullptr;
      if (log->empty()) state.SkipWithError("no SQLite call recorded");
    }
    for (auto _ : state) {
      state.PauseTiming();
      Empty(scene);
      state.ResumeTiming();
      // The engine closes a connection and opens one; so does the floor.
      sqlite3* db = NULL;
      sqlite3_open(scene.DbPath().c_str(), &db);
      log->Replay(db);
      sqlite3_close(db);
    }
    state.counters["calls"] = static_cast<double>(log->size());
  })->MinTime(0.05)->Unit(benchmark::kMicrosecond);
  benchmark::RegisterBenchmark((name + "store").c_str(), [=](benchmark::State& state) {
    log->Clear();
    Scene& scene = Enter(storage, key, build);
    for (auto _ : state) {
      state.PauseTiming();
      Empty(scene);
      state.ResumeTiming();
      data_engin_initialization();
    }
  })->MinTime(0.05)->Unit(benchmark::kMicrosecond);
}

// ---- Package events and the boot signal in a 10,000-box menu: ten pages of
// 1,000 boxes, game i at box i + 1 (one page in a short callgrind run).

int MenuPages() { return g_menuBoxes / kPageBoxes; }
// Mid-page, so that half the page moves up; on the fifth of ten pages.
int Uninstalled() { return std::max(MenuPages() / 2 - 1, 0) * kPageBoxes + kPageBoxes / 2; }
int UninstalledPage() { return Uninstalled() / kPageBoxes + 1; }
int Updated() { return MenuPages() * 7 / 10 * kPageBoxes + 123; }
std::string MenuKey() { return "menu" + std::to_string(g_menuBoxes); }

void BuildMenu(Scene& scene) {
  data_engin_initialization();  // an empty device: the tables and menu "Apps"
  std::string last = std::to_string(g_menuBoxes - 1);
  scene.Plain(
      "BEGIN;"
      "INSERT INTO Pages(isFolder, parentId, pageNo) WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL "
      "SELECT i + 1 FROM n WHERE i < " + std::to_string(MenuPages()) +
      ") SELECT 0, 1, i FROM n;"
      "INSERT INTO Boxes(isFolder, pageId, appId, name, col, row, isPreload, isSystem, boxType, "
      "launchType) WITH RECURSIVE n(i) AS (SELECT 0 UNION ALL SELECT i + 1 FROM n WHERE i < " +
      last + ") SELECT 0, i / " + std::to_string(kPageBoxes) + " + 1, 'com.ex.game' || i, "
      "'Game ' || i, i % " + std::to_string(kPageBoxes) + " % 4 + 1, i % " +
      std::to_string(kPageBoxes) + " / 4 + 1, 0, 0, 0, 0 FROM n;"
      "CREATE TABLE SavedPage AS SELECT * FROM Boxes WHERE pageId = " +
      std::to_string(UninstalledPage()) + ";"
      "COMMIT;");
  AddGames(g_menuBoxes);
  Dev().SetStorageCard(true);
  Dev().ClearLogs();
}

struct Event {
  const char* name;
  std::function<void()> run;
  std::function<void(const Scene&)> restore;  // untimed, after each call
  std::function<void()> prepare = nullptr;    // untimed, before each call
};

void Forget(const std::string& appId) {
  Tracker().m_appInfoCache.erase(appId);
  Dev().ClearLogs();
}

// The cache holds the card's applications, flagged as the launcher flags
// them; a refresh replaces each record with an unflagged one.
void FlagCardApps() {
  for (int n = 0; n < kCardApps; ++n) {
    std::string id = GameId(n * (g_menuBoxes / kCardApps));
    boost::shared_ptr<GameBoxData>& cached = Tracker().m_appInfoCache[id];
    if (!cached) {
      boost::shared_ptr<GameBoxData> box(new GameBoxData);
      Tracker().m_appInfoCache.erase(id);
      Tracker().GetAppInfo(id, box);
    }
    Tracker().m_appInfoCache[id]->isOnStorageCard = true;
  }
  Tracker()._RegisterEdbusSignalHandler();
}

std::vector<Event> Events() {
  std::string total = std::to_string(g_menuBoxes);
  return {
      {"engine:Install",
       [] { Dev().Install(sim::MakePackage(kNewGame, {sim::GameApp(kNewGame, "New Game")})); },
       [total](const Scene& scene) {
         scene.Plain(std::string("DELETE FROM Boxes WHERE appId = '") + kNewGame + "';"
                     "UPDATE sqlite_sequence SET seq = " + total + " WHERE name = 'Boxes';");
         Dev().RemovePackage(kNewGame);
         Forget(kNewGame);
       }},
      {"engine:Update",
       [] {
         std::string id = GameId(Updated());
         Dev().Update(sim::MakePackage(id, {sim::GameApp(id, GameLabel(Updated()) + " HD")}));
       },
       [](const Scene& scene) {
         scene.Plain("UPDATE Boxes SET name = '" + GameLabel(Updated()) + "' WHERE appId = '" +
                     GameId(Updated()) + "';");
         Forget(GameId(Updated()));
       }},
      {"engine:Uninstall(1000-box page)", [] { Dev().Uninstall(GameId(Uninstalled())); },
       [](const Scene& scene) {
         scene.Plain("BEGIN; DELETE FROM Boxes WHERE pageId = " +
                     std::to_string(UninstalledPage()) +
                     "; INSERT INTO Boxes SELECT * FROM SavedPage; COMMIT;");
         Dev().AddGame(GameId(Uninstalled()), GameLabel(Uninstalled()));
         Forget(GameId(Uninstalled()));
       }},
      {"engine:BootDone(100 on card)", [] { Dev().SendBootDone(); },
       [](const Scene&) { Dev().ClearLogs(); }, FlagCardApps},
  };
}

template <typename Body>
void Measure(benchmark::State& state, const Scene& scene, const Event& event, Body body) {
  for (auto _ : state) {
    if (event.prepare) {
      state.PauseTiming();
      event.prepare();
      state.ResumeTiming();
    }
    body();
    state.PauseTiming();
    event.restore(scene);
    state.ResumeTiming();
  }
}

void RegisterEvent(Storage storage, const Event& event) {
  std::string name = std::string(kStorageNames[storage]) + "/" + event.name + "/" +
                     std::to_string(g_menuBoxes) + "/";
  auto log = std::make_shared<bench::CallLog>();
  benchmark::RegisterBenchmark((name + "floor").c_str(), [=](benchmark::State& state) {
    Scene& scene = Enter(storage, MenuKey(), BuildMenu);
    if (log->empty()) {
      if (event.prepare) event.prepare();
      bench::StartRecording(Store().m_db, log.get());
      event.run();
      bench::StopRecording();
      event.restore(scene);
      if (log->empty()) state.SkipWithError("no SQLite call recorded");
    }
    // The floor replays only the SQL: the platform is left as the restore
    // leaves it, and a boot-done floor needs no flags.
    Measure(state, scene, event, [&] { log->Replay(Store().m_db); });
    state.counters["calls"] = static_cast<double>(log->size());
  })->MinTime(0.05)->Unit(benchmark::kMicrosecond);
  benchmark::RegisterBenchmark((name + "store").c_str(), [=](benchmark::State& state) {
    log->Clear();
    Scene& scene = Enter(storage, MenuKey(), BuildMenu);
    Measure(state, scene, event, [&] { event.run(); });
  })->MinTime(0.05)->Unit(benchmark::kMicrosecond);
}

// Registered as the binary loads, before store_bench.cpp's own, so these rows
// lead the table.
struct Registrar {
  Registrar() {
    for (Storage storage : {kDisk, kMemory}) {
      // On disk every box of a first launch is a commit with its syncs; the
      // larger launches there would take minutes per iteration.
      for (int games : {100, 1000, 10000}) {
        if (storage == kMemory || games <= 100) RegisterFirstLaunch(storage, games);
      }
      for (const Event& event : Events()) RegisterEvent(storage, event);
    }
  }
} g_registrar;


}  // namespace

namespace bench {

// The engine rows under callgrind, in memory only. A first launch of N games
// writes N boxes one commit at a time, about what the store's operations cost
// on ten times the boxes, so launches go up to a tenth of |maxBoxes|. The
// events run in the 10,000-box menu, or in a 1,000-box one (a single page)
// when |maxBoxes| is below 10,000.
void RunEngineUnderCallgrind(const std::string& filter, int maxBoxes, int passes) {
  std::regex wanted(filter);
  const Storage storage = kMemory;
  const std::string prefix = std::string(kStorageNames[storage]) + "/";
  for (int games : {100, 1000, 10000}) {
    if (games > std::max(maxBoxes / 10, 100)) continue;
    std::string name = prefix + "engine:FirstLaunch/" + std::to_string(games) + "/";
    if (!std::regex_search(name, wanted)) continue;
    Scene& scene = Enter(storage, "launch" + std::to_string(games), [games](Scene& s) {
      AddGames(games);
      data_engin_initialization();
      Empty(s);
    });
    CallLog log;
    Empty(scene);
    g_recordNextOpen = &log;
    data_engin_initialization();
    StopRecording();
    g_recordNextOpen = nullptr;
    auto empty = [&] { Empty(scene); };
    // The engine closes a connection and opens one; so does the floor. The
    // path comes from the simulator, so it is found outside the count.
    const std::string path = scene.DbPath();
    bench::CountUnderCallgrind(name, "floor", passes, empty, [&] {
      sqlite3* db = NULL;
      sqlite3_open(path.c_str(), &db);
      log.Replay(db);
      sqlite3_close(db);
    }, nullptr);
    bench::CountUnderCallgrind(name, "store", passes, empty, [] { data_engin_initialization(); },
                               nullptr);
    std::cerr << "." << std::flush;
  }
  g_menuBoxes = maxBoxes >= 10000 ? 10000 : 1000;
  for (const Event& event : Events()) {
    std::string name = prefix + event.name + "/" + std::to_string(g_menuBoxes) + "/";
    if (!std::regex_search(name, wanted)) continue;
    Scene& scene = Enter(storage, MenuKey(), BuildMenu);
    CallLog log;
    if (event.prepare) event.prepare();
    StartRecording(Store().m_db, &log);
    event.run();
    StopRecording();
    event.restore(scene);
    auto restore = [&] { event.restore(scene); };
    bench::CountUnderCallgrind(name, "floor", passes, event.prepare,
                               [&] { log.Replay(Store().m_db); }, restore);
    bench::CountUnderCallgrind(name, "store", passes, event.prepare, event.run, restore);
    std::cerr << "." << std::flush;
  }
  g_menuBoxes = 10000;
}

}  // namespace bench
