// korrin-sim: the engine on a simulated device, for launcher engineers at a
// workstation.
//
//   korrin-sim demo [--root DIR]   a phone with a few dozen games: the layout
//                                  database is made, every game gets a box at
//                                  the end of the first menu with its label,
//                                  and the home screen is shown
#include <errno.h>
#include <stdlib.h>
#include <string.h>

#include <filesystem>
#include <iostream>
#include <string>
#include <vector>

#include "common/device-path.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-package-manager/launcher-package-manager.h"
#include "sim/device.h"

namespace {

const int kCellWidth = 20;

int Usage() {
  std::cerr << "usage: korrin-sim demo [--root DIR]\n";
  return 2;
}

// |text| cut or padded to |width| characters (UTF-8 aware).
std::string Cell(const std::string& text, size_t width) {
  std::string out;
  size_t chars = 0;
  for (size_t i = 0; i < text.size() && chars < width; ++chars) {
    size_t length = 1;
    while (i + length < text.size() && (text[i + length] & 0xC0) == 0x80) ++length;
    out += text.substr(i, length);
    i += length;
  }
  return out + std::string(width - chars, ' ');
}

void PrintTables(sqlite3* db) {
  sqlite3_stmt* stmt = NULL;
  sqlite3_prepare_v2(db, "SELECT sql FROM sqlite_master WHERE type = 'table' AND name != "
                         "'sqlite_sequence'", -1, &stmt, NULL);
  while (sqlite3_step(stmt) == SQLITE_ROW) {
    std::cout << "  " << sqlite3_column_text(stmt, 0) << "\n";
  }
  sqlite3_finalize(stmt);
}

// The pages of menu 1 as grids of four columns, one box name per cell.
void PrintHomeScreen(LauncherDataManager& store) {
  std::vector<boost::shared_ptr<GamePageData> > pages = store.GetPageDataList(1, false);
  for (size_t p = 0; p < pages.size(); ++p) {
    std::cout << "  page " << pages[p]->pageNo << "\n";
    std::vector<boost::shared_ptr<GameBoxData> > boxes = store.GetBoxDataList(pages[p]->pageId);
    int row = 0;
    for (size_t b = 0; b < boxes.size(); ++b) {
      if (boxes[b]->row != row) {
        if (row != 0) std::cout << "\n";
        row = boxes[b]->row;
        std::cout << "  " << Cell(std::to_string(row), 3);
      }
      std::cout << "| " << Cell(boxes[b]->name, kCellWidth);
    }
    std::cout << "\n";
  }
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
  device.LoadSampleDevice();

  int status = 0;
  {
    LauncherDataManager store;
    LauncherPackageManager packages;
    store._OpenDb();
    if (store.m_db == NULL) {
      for (const sim::LogLine& line : device.Logs()) std::cerr << line.text << "\n";
      return 1;
    }
    std::cout << "device root: " << root << "\n"
              << "layout database: " << korrin::DevicePath(korrin::kGameDataDbPath) << "\n";
    PrintTables(store.m_db);

    GameViewData apps;
    apps.name = "Apps";
    apps.type = 0;
    store.InsertMenuData(apps);
    std::vector<std::string> appIds;
    packages.GetAppIdList(appIds);
    std::cout << "\n" << appIds.size() << " displayable games on the device; each gets a box "
              << "at the end of menu " << apps.menuId << ":\n";
    for (size_t i = 0; i < appIds.size(); ++i) {
      bool pageAdded = false;
      boost::shared_ptr<GameBoxData> box =
          store.GetMenuBoxData(store.InsertBoxData(appIds[i], pageAdded));
      if (packages.GetAppInfo(box->appId, box)) store.UpdateBoxData(*box);
    }
    PrintHomeScreen(store);

    std::vector<boost::shared_ptr<GameBoxData> > sorted =
        store.GetBoxDataListByAlphabeticalOrder(apps.menuId, false);
    std::cout << "\nthe same menu in alphabetical order (first row):\n ";
    for (size_t i = 0; i < sorted.size() && sorted[i]->row == 1; ++i) {
      std::cout << " | " << Cell(sorted[i]->name, kCellWidth);
    }
    std::vector<std::string> deactivated = packages._GetDeactivatedAppIds();
    std::cout << "\n\ndeactivated applications:";
    for (size_t i = 0; i < deactivated.size(); ++i) std::cout << " " << deactivated[i];
    std::cout << "\n";
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
