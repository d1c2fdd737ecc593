// Store operations on layouts of 100 to 100,000 boxes, each beside its SQLite
// floor (call_log.h): the same statements, in the same order, with the same
// commits, made straight through the C API. Each layout lives once on a disk
// file and once on a memory file system, since on a phone's flash every
// autocommit pays a sync. Prints one table: floor, store, their ratio, and
// per operation how both grow with the layout.
//
//   korrin-bench [--benchmark_filter=REGEX] [--benchmark_min_time=SECONDS]
//   names read STORAGE/OPERATION/BOXES/floor|store
//   KORRIN_BENCH_DISK_DIR (default /var/tmp) and KORRIN_BENCH_MEMORY_DIR
//   (default /dev/shm) say where the two database files go.
//   korrin-bench --callgrind [FILTER [MAX_BOXES]]: instruction counts instead,
//   run under valgrind by bench/callgrind.sh.
#include <benchmark/benchmark.h>
#include <stdlib.h>

#include <cmath>
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
#include "launcher-data-manager/launcher-data-manager.h"
#include "sim/device.h"

namespace {

using bench::kDisk;
using bench::kMemory;
using bench::kStorageNames;
using bench::Storage;
const int kSizes[] = {100, 1000, 10000, 100000};

// Menu 1 holds page 1 with |boxes| application boxes in reading order (ids 1
// to |boxes|). Menu 2 and its empty page 2 are there to be deleted and put
// back; so is the last box, whose row a temporary table keeps.
class Layout {
 public:
  Layout(Storage storage, int boxes) : boxes(boxes) {
    root = bench::MakeTempDir(storage, "korrin-bench");
    sim::Device::Get().UseRoot(root);
    store._OpenDb();
    Exec("INSERT INTO Menus(name, type) VALUES('Apps', 0);"
         "INSERT INTO Menus(name, type) VALUES('Spare', 0);"
         "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 1, 1);"
         "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 2, 1);"
         "INSERT INTO Boxes(isFolder, pageId, appId, name, col, row, isPreload, isSystem, boxType, "
         "launchType) WITH RECURSIVE n(i) AS (SELECT 0 UNION ALL SELECT i + 1 FROM n WHERE i < " +
         std::to_string(boxes - 1) +
         ") SELECT 0, 1, 'com.ex.app' || i, 'Game ' || (i * 7919 % 10007), i % 4 + 1, i / 4 + 1, "
         "0, 0, 0, 0 FROM n;"
         "CREATE TEMP TABLE victimMenu AS SELECT * FROM Menus WHERE menuId = 2;"
         "CREATE TEMP TABLE victimPage AS SELECT * FROM Pages WHERE pageId = 2;"
         "CREATE TEMP TABLE victimBox AS SELECT * FROM Boxes WHERE boxId = " +
         std::to_string(boxes) + ";");
  }
  ~Layout() { std::filesystem::remove_all(root); }

  void Exec(const std::string& sql) {
    char* error = NULL;
    if (sqlite3_exec(store.m_db, sql.c_str(), NULL, NULL, &error) != SQLITE_OK) {
      std::fprintf(stderr, "korrin-bench: %s: %s\n", sql.c_str(), error);
      std::abort();
    }
  }

  // A box in the middle of the page, and its application.
  int MiddleBox() const { return boxes / 2; }
  std::string MiddleApp() const { return "com.ex.app" + std::to_string(boxes / 2 - 1); }
  // That box as stored (the rows above hold box i + 1).
  GameBoxData MiddleRecord() const {
    int i = MiddleBox() - 1;
    GameBoxData box;
    box.boxId = MiddleBox();
    box.pageId = 1;
    box.appId = MiddleApp();
    box.name = "Game " + std::to_string(i * 7919 % 10007);
    box.col = i % 4 + 1;
    box.row = i / 4 + 1;
    return box;
  }

  const int boxes;
  std::string root;
  LauncherDataManager store;
};

std::map<std::pair<int, int>, std::unique_ptr<Layout> > g_layouts;

Layout& LayoutFor(Storage storage, int boxes) {
  std::unique_ptr<Layout>& layout = g_layouts[std::make_pair(storage, boxes)];
  if (!layout) layout.reset(new Layout(storage, boxes));
  return *layout;
}

// One store operation: what the launcher calls, and how the state it changed
// is put back between iterations (untimed), so that every iteration of the
// store and of the floor meets the same database.
struct Operation {
  const char* name;
  std::function<void(Layout&)> run;
  std::function<void(Layout&)> restore;
  int maxBoxes[2];  // largest layout on disk, in memory
  // Untimed, before each call. SQLite skips writing a row rewritten with the
  // values it holds, so an update is first given something to change.
  std::function<void(Layout&)> prepare = nullptr;
};

void DropLastBox(Layout& l) { l.Exec("DELETE FROM Boxes WHERE boxId = last_insert_rowid()"); }
void DropLastPage(Layout& l) { l.Exec("DELETE FROM Pages WHERE pageId = last_insert_rowid()"); }
void DropLastMenu(Layout& l) { l.Exec("DELETE FROM Menus WHERE menuId = last_insert_rowid()"); }
void PutBackMenu(Layout& l) { l.Exec("INSERT INTO Menus SELECT * FROM temp.victimMenu"); }
void PutBackPage(Layout& l) { l.Exec("INSERT INTO Pages SELECT * FROM temp.victimPage"); }
void PutBackBox(Layout& l) { l.Exec("INSERT INTO Boxes SELECT * FROM temp.victimBox"); }

void Unpack(Layout& l) { l.Exec("UPDATE Boxes SET row = row + 1 WHERE pageId = 1"); }

const int kAll[2] = {100000, 100000};

std::vector<Operation> Operations() {
  typedef Layout L;
  std::vector<Operation> ops = {
      // ---- menus
      {"InsertMenuData", [](L& l) { GameViewData m; m.name = "Games"; m.type = 0;
                                    l.store.InsertMenuData(m); }, DropLastMenu, {kAll[0], kAll[1]}},
      {"UpdateMenuData", [](L& l) { GameViewData m; m.menuId = 1; m.name = "Apps"; m.type = 0;
                                    l.store.UpdateMenuData(m); }, nullptr, {kAll[0], kAll[1]},
       [](L& l) { l.Exec("UPDATE Menus SET name = 'Old', type = 1 WHERE menuId = 1"); }},
      {"DeleteMenuData", [](L& l) { l.store.DeleteMenuData(2); }, PutBackMenu, {kAll[0], kAll[1]}},
      {"GetMenuData", [](L& l) { l.store.GetMenuData(1); }, nullptr, {kAll[0], kAll[1]}},
      {"GetMenuDataCount", [](L& l) { l.store.GetMenuDataCount(); }, nullptr, {kAll[0], kAll[1]}},
      {"GetMenuDataList", [](L& l) { l.store.GetMenuDataList(); }, nullptr, {kAll[0], kAll[1]}},
      // ---- pages
      {"InsertPageData", [](L& l) { GamePageData p; p.parentId = 1; p.pageNo = 2;
                                    l.store.InsertPageData(p); }, DropLastPage, {kAll[0], kAll[1]}},
      {"UpdatePageData", [](L& l) { GamePageData p; p.pageId = 1; p.parentId = 1; p.pageNo = 1;
                                    l.store.UpdatePageData(p); }, nullptr, {kAll[0], kAll[1]},
       [](L& l) { l.Exec("UPDATE Pages SET pageNo = 9 WHERE pageId = 1"); }},
      {"DeletePageData", [](L& l) { l.store.DeletePageData(2); }, PutBackPage, {kAll[0], kAll[1]}},
      {"DeleteFolderPageData", [](L& l) { l.store.DeleteFolderPageData(2); }, PutBackPage,
       {kAll[0], kAll[1]}},
      {"GetMenuPageData", [](L& l) { l.store.GetMenuPageData(1); }, nullptr, {kAll[0], kAll[1]}},
      {"GetPageDataCount", [](L& l) { l.store.GetPageDataCount(1, false); }, nullptr,
       {kAll[0], kAll[1]}},
      {"_GetPageDataCountByDownload", [](L& l) { l.store._GetPageDataCountByDownload(1); },
       nullptr, {kAll[0], kAll[1]}},
      {"GetPageDataList", [](L& l) { l.store.GetPageDataList(1, false); }, nullptr,
       {kAll[0], kAll[1]}},
      // ---- boxes
      {"InsertBoxData", [](L& l) { GameBoxData b; b.pageId = 1; b.col = 1;
                                   b.row = l.boxes / 4 + 2; b.appId = "com.ex.new";
                                   l.store.InsertBoxData(b); }, DropLastBox, {kAll[0], kAll[1]}},
      {"InsertBoxData(shortcut)",
       [](L& l) { GameBoxData b; b.pageId = 1; b.col = 1; b.row = l.boxes / 4 + 2;
                  b.appId = "com.ex.new"; b.name = "New"; b.boxType = kShortcutBoxType;
                  b.iconPath = "/opt/icons/new.png"; b.content = "page=1";
                  l.store.InsertBoxData(b); }, DropLastBox, {kAll[0], kAll[1]}},
      {"UpdateBoxData", [](L& l) { GameBoxData b = l.MiddleRecord(); l.store.UpdateBoxData(b); },
       nullptr, {kAll[0], kAll[1]},
       [](L& l) { l.Exec("UPDATE Boxes SET launchType = 1 WHERE boxId = " +
                         std::to_string(l.MiddleBox())); }},
      {"DeleteBoxData", [](L& l) { l.store.DeleteBoxData(l.boxes); }, PutBackBox,
       {kAll[0], kAll[1]}},
      {"GetMenuBoxData", [](L& l) { l.store.GetMenuBoxData(l.MiddleBox()); }, nullptr,
       {kAll[0], kAll[1]}},
      {"GetBoxIdByAppId", [](L& l) { int parent = 0, page = 0, box = 0;
                                     l.store.GetBoxIdByAppId(l.MiddleApp(), &parent, &page, &box); },
       nullptr, {kAll[0], kAll[1]}},
      {"GetBoxDataByAppId", [](L& l) { l.store.GetBoxDataByAppId(l.MiddleApp()); }, nullptr,
       {kAll[0], kAll[1]}},
      {"GetBoxDataCount", [](L& l) { l.store.GetBoxDataCount(1); }, nullptr, {kAll[0], kAll[1]}},
      // ---- listings
      {"GetBoxDataList", [](L& l) { l.store.GetBoxDataList(1); }, nullptr, {kAll[0], kAll[1]}},
      {"GetBoxDataListByAppId", [](L& l) { l.store.GetBoxDataListByAppId(l.MiddleApp(), 0); },
       nullptr, {kAll[0], kAll[1]}},
      {"GetBoxDataListByDownload", [](L& l) { l.store.GetBoxDataListByDownload(1, false); },
       nullptr, {kAll[0], kAll[1]}},
      {"GetPageDataListByDownload", [](L& l) { l.store.GetPageDataListByDownload(1, false); },
       nullptr, {kAll[0], kAll[1]}},
      {"GetBoxDataListByAlphabeticalOrder",
       [](L& l) { l.store.GetBoxDataListByAlphabeticalOrder(1, false); }, nullptr,
       {kAll[0], kAll[1]}},
      {"...AlphabeticalOrderWithRealPage",
       [](L& l) { l.store.GetBoxDataListByAlphabeticalOrderWithRealPage(1, false); }, nullptr,
       {kAll[0], kAll[1]}},
      {"GetPageDataListByAlphabeticalOrder",
       [](L& l) { l.store.GetPageDataListByAlphabeticalOrder(1, false); }, nullptr,
       {kAll[0], kAll[1]}},
      // ---- placement and packing; each pass packs the page again after
      // Unpack has moved every box one row down.
      {"InsertBoxData(appId)", [](L& l) { bool pageAdded = false;
                                          l.store.InsertBoxData("com.ex.new", pageAdded); },
       DropLastBox, {kAll[0], kAll[1]}},
      {"RearrangeAppsPosition", [](L& l) { l.store.RearrangeAppsPosition(); }, nullptr,
       {kAll[0], kAll[1]}, Unpack},
      // One autocommit per box, on disk a sync each (some 15 ms here), hence
      // the smaller layouts there.
      {"_ReorderData", [](L& l) { l.store._ReorderData(1, false); }, nullptr, {100, 10000},
       Unpack},
      {"_ReorderDataWithoutSpace", [](L& l) { l.store._ReorderDataWithoutSpace(1, false); },
       nullptr, {100, 10000}, Unpack},
  };
  return ops;
}

// Iterations of one side. The restore runs with the clock paused.
template <typename Body>
void Measure(benchmark::State& state, Layout& layout, const Operation& op, Body body) {
  for (auto _ : state) {
    if (op.prepare) {
      state.PauseTiming();
      op.prepare(layout);
      state.ResumeTiming();
    }
    body();
    if (op.restore) {
      state.PauseTiming();
      op.restore(layout);
      state.ResumeTiming();
    }
  }
}

void Register(Storage storage, int boxes, const Operation& op) {
  std::string name = std::string(kStorageNames[storage]) + "/" + op.name + "/" +
                     std::to_string(boxes) + "/";
  auto log = std::make_shared<bench::CallLog>();
  double minTime = boxes >= 100000 ? 0.01 : 0.05;
  benchmark::RegisterBenchmark((name + "floor").c_str(), [=](benchmark::State& state) {
    Layout& layout = LayoutFor(storage, boxes);
    if (log->empty()) {
      if (op.prepare) op.prepare(layout);
      bench::StartRecording(layout.store.m_db, log.get());
      op.run(layout);
      bench::StopRecording();
      if (op.restore) op.restore(layout);
      if (log->empty()) state.SkipWithError("no SQLite call recorded; is the library bound to ours?");
    }
    Measure(state, layout, op, [&] { log->Replay(layout.store.m_db); });
    state.counters["calls"] = static_cast<double>(log->size());
  })->MinTime(minTime)->Unit(benchmark::kMicrosecond);
  benchmark::RegisterBenchmark((name + "store").c_str(), [=](benchmark::State& state) {
    log->Clear();  // the floor has run; its log can go
    Layout& layout = LayoutFor(storage, boxes);
    Measure(state, layout, op, [&] { op.run(layout); });
  })->MinTime(minTime)->Unit(benchmark::kMicrosecond);
}

// Under callgrind (bench/callgrind.sh): each operation matching |filter| on
// the memory layouts of at most |maxBoxes| boxes, floor then store, a warm-up
// pass and then kCallgrindPasses counted passes each. Only the calls
// themselves are collected; prepare and restore run with collection off. Each
// side ends in a dump named STORAGE/OPERATION/BOXES/SIDE/PASSES that the
// script turns into the table. Instruction counts do not depend on the
// machine's load, so these figures compare across runs.
const int kCallgrindPasses = 3;

void RunUnderCallgrind(const std::string& filter, int maxBoxes) {
  // The engine's rows first, as in the timed table.
  bench::RunEngineUnderCallgrind(filter, maxBoxes, kCallgrindPasses);
  std::regex wanted(filter);
  for (const Operation& op : Operations()) {
    for (int boxes : kSizes) {
      if (boxes > maxBoxes || boxes > op.maxBoxes[kMemory]) continue;
      std::string name = std::string(kStorageNames[kMemory]) + "/" + op.name + "/" +
                         std::to_string(boxes) + "/";
      if (!std::regex_search(name, wanted)) continue;
      Layout& layout = LayoutFor(kMemory, boxes);
      bench::CallLog log;
      if (op.prepare) op.prepare(layout);
      bench::StartRecording(layout.store.m_db, &log);
      op.run(layout);
      bench::StopRecording();
      if (op.restore) op.restore(layout);
      std::function<void()> prepare, restore;
      if (op.prepare) prepare = [&] { op.prepare(layout); };
      if (op.restore) restore = [&] { op.restore(layout); };
      bench::CountUnderCallgrind(name, "floor", kCallgrindPasses, prepare,
                                 [&] { log.Replay(layout.store.m_db); }, restore);
      bench::CountUnderCallgrind(name, "store", kCallgrindPasses, prepare,
                                 [&] { op.run(layout); }, restore);
      std::cerr << "." << std::flush;
    }
  }
  std::cerr << "\n";
}

// Keeps each run's time per iteration and prints them as one table at the end.
class TableReporter : public benchmark::BenchmarkReporter {
 public:
  bool ReportContext(const Context&) override { return true; }
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const Run& run : runs) {
      if (run.error_occurred || run.run_type != Run::RT_Iteration) continue;
      std::string name = run.run_name.function_name;
      size_t side = name.rfind('/');
      Row& row = Find(name.substr(0, side));
      double& seconds = name.substr(side + 1) == "floor" ? row.floor : row.store;
      double now = run.GetAdjustedRealTime() / benchmark::GetTimeUnitMultiplier(run.time_unit);
      // Of repetitions, the fastest: the one least disturbed by the machine.
      if (seconds <= 0 || now < seconds) seconds = now;
      std::cerr << "." << std::flush;
    }
  }
  // Rows come grouped by storage and operation, sizes ascending. The last row
  // of each group also shows how floor and store grow: the slope of log(time)
  // against log(boxes) from the group's first row (0 constant, 1 linear).
  void Finalize() override {
    std::cerr << "\n";
    std::printf("%-6s %-34s %6s %9s %9s %5s %6s %6s\n", "where", "operation", "boxes", "floor",
                "store", "ratio", "floor~", "store~");
    for (size_t i = 0; i < m_rows.size(); ++i) {
      const Row& row = m_rows[i];
      std::printf("%-6s %-34s %6s %9s %9s ", row.storage.c_str(), row.operation.c_str(),
                  row.boxes.c_str(), Time(row.floor).c_str(), Time(row.store).c_str());
      if (row.floor > 0 && row.store > 0) {
        std::printf("%5.2f", row.store / row.floor);
      } else {
        std::printf("%5s", "-");
      }
      size_t first = i;
      while (first > 0 && SameGroup(m_rows[first - 1], row)) --first;
      bool lastOfGroup = i + 1 == m_rows.size() || !SameGroup(m_rows[i + 1], row);
      if (lastOfGroup && first < i) {
        const Row& small = m_rows[first];
        double sizes = std::log(std::stod(row.boxes) / std::stod(small.boxes));
        std::printf(" %6s %6s", Slope(small.floor, row.floor, sizes).c_str(),
                    Slope(small.store, row.store, sizes).c_str());
      }
      std::printf("\n");
    }
  }

 private:
  struct Row {
    std::string key, storage, operation, boxes;
    double floor = 0, store = 0;  // seconds per iteration
  };
  static bool SameGroup(const Row& a, const Row& b) {
    return a.storage == b.storage && a.operation == b.operation;
  }
  static std::string Slope(double from, double to, double logSizes) {
    if (from <= 0 || to <= 0 || logSizes <= 0) return "-";
    char text[16];
    std::snprintf(text, sizeof text, "%.2f", std::log(to / from) / logSizes);
    return text;
  }
  Row& Find(const std::string& key) {
    for (Row& row : m_rows) {
      if (row.key == key) return row;
    }
    Row row;
    row.key = key;
    size_t a = key.find('/'), b = key.rfind('/');
    row.storage = key.substr(0, a);
    row.operation = key.substr(a + 1, b - a - 1);
    row.boxes = key.substr(b + 1);
    m_rows.push_back(row);
    return m_rows.back();
  }
  static std::string Time(double seconds) {
    char text[32];
    if (seconds <= 0) return "-";
    if (seconds < 1e-3) {
      std::snprintf(text, sizeof text, "%.2f us", seconds * 1e6);
    } else if (seconds < 1) {
      std::snprintf(text, sizeof text, "%.2f ms", seconds * 1e3);
    } else {
      std::snprintf(text, sizeof text, "%.2f s", seconds);
    }
    return text;
  }
  std::vector<Row> m_rows;
};

}  // namespace

int main(int argc, char** argv) {
  // korrin-bench --callgrind [FILTER [MAX_BOXES]], run by bench/callgrind.sh.
  if (argc > 1 && std::string(argv[1]) == "--callgrind") {
    RunUnderCallgrind(argc > 2 ? argv[2] : "", argc > 3 ? atoi(argv[3]) : 10000);
    g_layouts.clear();
    return 0;
  }
  benchmark::Initialize(&argc, argv);
  for (Storage storage : {kDisk, kMemory}) {
    for (const Operation& op : Operations()) {
      for (int boxes : kSizes) {
        if (boxes <= op.maxBoxes[storage]) Register(storage, boxes, op);
      }
    }
  }
  TableReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  g_layouts.clear();  // close the stores before the simulated device goes
  benchmark::Shutdown();
  return 0;
}
