// korrin-sim: the engine on a simulated device, for launcher engineers at a
// workstation.
//
//   korrin-sim demo [--root DIR]   a phone with a few dozen games: the engine
//                                  starts (first launch lays the games out),
//                                  a game is installed, and the home screen
//                                  is shown after each step
#include <errno.h>
#include <stdlib.h>
#include <string.h>

#include <filesystem>
#include <iostream>
#include <string>
#include <vector>

#include "common/device-path.h"
#include "korrin-data/korrin-data.h"
#include "sim/device.h"

namespace {

const int kCellWidth = 16;  // four cells and the row number fit 80 columns

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

// What the launcher shows for a box: its stored name, or else the label the
// platform gives its application.
std::string Label(LauncherPackageManager& packages, const GameBoxData& box) {
  if (!box.name.empty()) return box.name;
  boost::shared_ptr<GameBoxData> info(new GameBoxData(box));
  return packages.GetAppInfo(box.appId, info) ? info->name : box.appId;
}

// The pages of menu 1 as grids of four columns, one box name per cell.
void PrintHomeScreen(LauncherDataManager& store, LauncherPackageManager& packages) {
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
      std::cout << "| " << Cell(Label(packages, *boxes[b]), kCellWidth);
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
    // The launcher's own start: the engine lays the games out on first launch.
    data_engin_initialization();
    LauncherDataManager& store = korrin::DataManager();
    LauncherPackageManager& packages = korrin::PackageManager();
    if (store.m_db == NULL) {
      for (const sim::LogLine& line : device.Logs()) std::cerr << line.text << "\n";
      return 1;
    }
    std::cout << "device root: " << root << "\n"
              << "layout database: " << korrin::DevicePath(korrin::kGameDataDbPath) << "\n";

    std::cout << "\nfirst launch: every displayable game gets a box in menu \"Apps\":\n";
    PrintHomeScreen(store, packages);

    device.Install(sim::MakePackage("com.lumaforge.skyharbor",
                                    {sim::GameApp("com.lumaforge.skyharbor", "Sky Harbor")}));
    std::cout << "\nSky Harbor installed: its box goes after the last one:\n";
    PrintHomeScreen(store, packages);

    std::vector<std::string> deactivated = packages._GetDeactivatedAppIds();
    std::cout << "\ndeactivated applications:";
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
