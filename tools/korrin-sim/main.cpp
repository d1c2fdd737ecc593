// korrin-sim: the engine on a simulated device, for launcher engineers at a
// workstation.
//
//   korrin-sim demo [--root DIR]   open the layout database on a fresh device
//                                  and show its schema
#include <stdlib.h>
#include <string.h>

#include <filesystem>
#include <iostream>
#include <string>

#include "common/device-path.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "sim/device.h"

namespace {

int Usage() {
  std::cerr << "usage: korrin-sim demo [--root DIR]\n";
  return 2;
}

void PrintSchema(sqlite3* db) {
  sqlite3_stmt* stmt = NULL;
  sqlite3_prepare_v2(db, "SELECT name, sql FROM sqlite_master WHERE type = 'table'", -1, &stmt,
                     NULL);
  while (sqlite3_step(stmt) == SQLITE_ROW) {
    std::cout << "  " << sqlite3_column_text(stmt, 0) << ": " << sqlite3_column_text(stmt, 1)
              << "\n";
  }
  sqlite3_finalize(stmt);
}

int Demo(std::string root) {
  bool temporary = root.empty();
  if (temporary) {
    char pattern[] = "/tmp/korrin-sim-XXXXXX";
    if (mkdtemp(pattern) == NULL) {
      std::cerr << "korrin-sim: cannot make a device root: " << strerror(errno) << "\n";
      return 1;
    }
    root = pattern;
  }
  sim::Device& device = sim::Device::Get();
  if (!device.UseRoot(root)) {
    std::cerr << "korrin-sim: cannot lay out a device under " << root << "\n";
    return 1;
  }

  int status = 0;
  {
    LauncherDataManager store;
    store._OpenDb();
    std::cout << "device root: " << root << "\n"
              << "layout database: " << korrin::DevicePath(korrin::kGameDataDbPath) << "\n";
    if (store.m_db == NULL || !device.Logs().empty()) {
      for (const sim::LogLine& line : device.Logs()) std::cerr << line.text << "\n";
      status = 1;
    } else {
      std::cout << "tables:\n";
      PrintSchema(store.m_db);
    }
  }
  if (temporary) std::filesystem::remove_all(root);
  return status;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2 || strcmp(argv[1], "demo") != 0) return Usage();
  std::string root;
  for (int i = 2; i < argc; ++i) {
    if (strcmp(argv[i], "--root") == 0 && i + 1 < argc) {
      root = argv[++i];
    } else {
      return Usage();
    }
  }
  return Demo(root);
}
