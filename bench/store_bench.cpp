// Store operations on a layout of 10,000 boxes, each beside the same SQL run
// directly through SQLite. Prints every timing, then the ratio store / raw.
//
//   korrin-bench [--benchmark_filter=...]
#include <benchmark/benchmark.h>
#include <stdlib.h>

#include <filesystem>
#include <iomanip>
#include <iostream>
#include <map>
#include <string>

#include "common/device-path.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "sim/device.h"

namespace {

const int kBoxes = 10000;

// One device root and one store for the whole run, laid out once: menu 1 with
// one page of kBoxes named application boxes, in reading order.
class Layout {
 public:
  Layout() {
    char pattern[] = "/tmp/korrin-bench-XXXXXX";
    root = mkdtemp(pattern);
    sim::Device::Get().UseRoot(root);
    store._OpenDb();
    Exec("INSERT INTO Menus(name, type) VALUES('Apps', 0);"
         "INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(0, 1, 1);"
         "INSERT INTO Boxes(isFolder, pageId, appId, name, col, row, isPreload, isSystem, boxType, "
         "launchType) WITH RECURSIVE n(i) AS (SELECT 0 UNION ALL SELECT i + 1 FROM n WHERE i < " +
         std::to_string(kBoxes - 1) +
         ") SELECT 0, 1, 'com.ex.app' || i, 'Game ' || (i * 7919 % 10007), i % 4 + 1, i / 4 + 1, "
         "0, 0, 0, 0 FROM n;");
  }
  ~Layout() { std::filesystem::remove_all(root); }

  void Exec(const std::string& sql) { sqlite3_exec(store.m_db, sql.c_str(), NULL, NULL, NULL); }

  // Steps |sql| through SQLite alone, reading every column of every row.
  size_t Raw(const std::string& sql, const char* appId = NULL) {
    sqlite3_stmt* stmt = NULL;
    sqlite3_prepare_v2(store.m_db, sql.c_str(), -1, &stmt, NULL);
    if (appId != NULL) sqlite3_bind_text(stmt, 1, appId, -1, SQLITE_STATIC);
    size_t bytes = 0;
    while (sqlite3_step(stmt) == SQLITE_ROW) {
      for (int i = 0; i < sqlite3_column_count(stmt); ++i) {
        bytes += sqlite3_column_type(stmt, i) == SQLITE_TEXT ? sqlite3_column_bytes(stmt, i)
                                                             : sqlite3_column_int(stmt, i);
      }
    }
    sqlite3_finalize(stmt);
    return bytes;
  }

  std::string root;
  LauncherDataManager store;
};

Layout& TheLayout() {
  static Layout layout;
  return layout;
}

const char kBoxListSql[] =
    "SELECT boxId, b.isFolder, b.pageId, col, row, appId, name, p.parentId, isPreload, isSystem, "
    "boxType, launchType, iconPath, content FROM boxes b, pages p ON p.pageId = b.pageId  WHERE "
    "b.pageId = 1 ORDER BY row, col";
const char kByAppIdSql[] =
    "SELECT b.boxId, b.isFolder, p.pageId, col, row, appId, name, p.parentId, isPreload, "
    "isSystem FROM boxes b, pages p ON b.pageId = p.pageId WHERE b.appId = $appId AND b.boxType "
    "!= 3 ";
const char kAlphabeticalSql[] =
    "SELECT boxId, b.isFolder, appId, name, isPreload, isSystem, boxType, launchType, iconPath, "
    "content FROM boxes b, pages p ON p.pageId = b.pageId WHERE p.isFolder = 0 AND p.parentId = "
    "1 ORDER BY name COLLATE NOCASE";

void Store_GetBoxDataList(benchmark::State& state) {
  for (auto _ : state) benchmark::DoNotOptimize(TheLayout().store.GetBoxDataList(1));
}
void Raw_GetBoxDataList(benchmark::State& state) {
  for (auto _ : state) benchmark::DoNotOptimize(TheLayout().Raw(kBoxListSql));
}

void Store_GetBoxDataByAppId(benchmark::State& state) {
  for (auto _ : state) {
    benchmark::DoNotOptimize(TheLayout().store.GetBoxDataByAppId("com.ex.app5000"));
  }
}
void Raw_GetBoxDataByAppId(benchmark::State& state) {
  for (auto _ : state) benchmark::DoNotOptimize(TheLayout().Raw(kByAppIdSql, "com.ex.app5000"));
}

void Store_AlphabeticalList(benchmark::State& state) {
  for (auto _ : state) {
    benchmark::DoNotOptimize(TheLayout().store.GetBoxDataListByAlphabeticalOrder(1, false));
  }
}
void Raw_AlphabeticalList(benchmark::State& state) {
  for (auto _ : state) benchmark::DoNotOptimize(TheLayout().Raw(kAlphabeticalSql));
}

// A placement reads the last page whole to find its last box, then inserts.
void Store_PlaceNewApp(benchmark::State& state) {
  Layout& layout = TheLayout();
  for (auto _ : state) {
    bool pageAdded = false;
    int id = layout.store.InsertBoxData("com.ex.new", pageAdded);
    state.PauseTiming();
    layout.store.DeleteBoxData(id);
    state.ResumeTiming();
  }
}
void Raw_PlaceNewApp(benchmark::State& state) {
  Layout& layout = TheLayout();
  for (auto _ : state) {
    layout.Raw("SELECT pageId, isFolder, parentId, pageNo FROM pages WHERE isFolder = 0 AND "
               "parentId = 1 ORDER BY pageNo ASC");
    layout.Raw(kBoxListSql);
    layout.Exec("INSERT INTO boxes(isFolder, pageId, appId, col, row, isPreload, isSystem, "
                "boxType, launchType) VALUES(0, 1, 'com.ex.new', 1, 2501, 0, 0, 0, 0) ");
    state.PauseTiming();
    layout.Exec("DELETE FROM boxes WHERE appId = 'com.ex.new'");
    state.ResumeTiming();
  }
}

// Every box rewritten in one transaction.
void Store_RearrangeAppsPosition(benchmark::State& state) {
  for (auto _ : state) TheLayout().store.RearrangeAppsPosition();
}
void Raw_RearrangeAppsPosition(benchmark::State& state) {
  Layout& layout = TheLayout();
  for (auto _ : state) {
    layout.Exec("BEGIN IMMEDIATE TRANSACTION");
    layout.Raw(kBoxListSql);
    sqlite3_stmt* stmt = NULL;
    sqlite3_prepare_v2(layout.store.m_db, "UPDATE boxes set col = ?, row = ? WHERE boxId = ?", -1,
                       &stmt, NULL);
    for (int i = 0; i < kBoxes; ++i) {
      sqlite3_bind_int(stmt, 1, i % 4 + 1);
      sqlite3_bind_int(stmt, 2, i / 4 + 1);
      sqlite3_bind_int(stmt, 3, i + 1);
      sqlite3_step(stmt);
      sqlite3_reset(stmt);
    }
    sqlite3_finalize(stmt);
    layout.Exec("COMMIT TRANSACTION");
  }
}

BENCHMARK(Store_GetBoxDataList)->Unit(benchmark::kMillisecond);
BENCHMARK(Raw_GetBoxDataList)->Unit(benchmark::kMillisecond);
BENCHMARK(Store_GetBoxDataByAppId)->Unit(benchmark::kMicrosecond);
BENCHMARK(Raw_GetBoxDataByAppId)->Unit(benchmark::kMicrosecond);
BENCHMARK(Store_AlphabeticalList)->Unit(benchmark::kMillisecond);
BENCHMARK(Raw_AlphabeticalList)->Unit(benchmark::kMillisecond);
BENCHMARK(Store_PlaceNewApp)->Unit(benchmark::kMillisecond);
BENCHMARK(Raw_PlaceNewApp)->Unit(benchmark::kMillisecond);
BENCHMARK(Store_RearrangeAppsPosition)->Unit(benchmark::kMillisecond);
BENCHMARK(Raw_RearrangeAppsPosition)->Unit(benchmark::kMillisecond);

// Shows each run as usual and keeps its time per iteration for the ratios.
class RatioReporter : public benchmark::ConsoleReporter {
 public:
  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& run : runs) times[run.benchmark_name()] = run.GetAdjustedRealTime();
  }

  void PrintRatios() const {
    std::cout << "\nstore / raw SQL, same run:\n";
    for (const auto& entry : times) {
      if (entry.first.rfind("Store_", 0) != 0) continue;
      std::string operation = entry.first.substr(6);
      auto raw = times.find("Raw_" + operation);
      if (raw == times.end() || raw->second <= 0) continue;
      std::cout << "  " << std::left << std::setw(28) << operation << std::fixed
                << std::setprecision(2) << entry.second / raw->second << "\n";
    }
  }

  std::map<std::string, double> times;
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  RatioReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  reporter.PrintRatios();
  benchmark::Shutdown();
  return 0;
}
