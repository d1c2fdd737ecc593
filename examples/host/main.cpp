// A launcher's first contact with the Korrin data engine: start it, then print
// the home screen it keeps (the pages of the first menu and their boxes).
//
// It builds only from an installed engine, through pkg-config. LIB is the
// library folder of the install: lib, or lib/<multiarch> in a build
// configured for prefix /usr.
//
//   cmake --install build --prefix "$PWD/out"
//   export PKG_CONFIG_PATH="$PWD/out/LIB/pkgconfig"
//   c++ examples/host/main.cpp -o host $(pkg-config --cflags --libs korrin-data)
//   LD_LIBRARY_PATH="$PWD/out/LIB" ./host
//
// Off the phone the engine runs on the simulated device, whose control header
// is then installed too: this host boots the sample phone first, in
// KORRIN_SIM_ROOT or else in a temporary folder. On a device the same source
// builds without that part.
#include <korrin-data/korrin-data.h>
#include <stdlib.h>

#include <iostream>
#include <string>

// (A device compiler may predate __has_include; it then skips this part.)
#if defined(__has_include)
#if __has_include(<sim/device.h>)
#include <ftw.h>
#include <sim/device.h>
#include <stdio.h>

#define HOST_ON_SIMULATED_DEVICE 1
#endif
#endif

int main() {
#ifdef HOST_ON_SIMULATED_DEVICE
  std::string temporaryRoot;
  const char* given = getenv("KORRIN_SIM_ROOT");
  if (given == NULL) {
    char pattern[] = "/tmp/korrin-host-XXXXXX";
    if (mkdtemp(pattern) == NULL) {
      std::cerr << "host: cannot make a device root\n";
      return 1;
    }
    temporaryRoot = pattern;
  }
  std::string root = given != NULL ? given : temporaryRoot;
  sim::Device& device = sim::Device::Get();
  if (!device.UseRoot(root)) {
    std::cerr << "host: cannot lay out a device under " << root << "\n";
    return 1;
  }
  device.LoadSampleDevice();
#endif

  data_engin_initialization();

  LauncherDataManager& store = korrin::DataManager();
  for (const auto& page : store.GetPageDataList(1, false)) {
    std::cout << "page " << page->pageNo << "\n";
    for (const auto& box : store.GetBoxDataList(page->pageId)) {
      std::cout << "  (" << box->col << "," << box->row << ") " << box->appId << "\n";
    }
  }

#ifdef HOST_ON_SIMULATED_DEVICE
  // The engine keeps the database open until the process ends; on Linux the
  // folder can go from under it.
  if (!temporaryRoot.empty()) {
    struct Remove {
      static int Entry(const char* path, const struct stat*, int, struct FTW*) {
        return remove(path);
      }
    };
    nftw(temporaryRoot.c_str(), Remove::Entry, 16, FTW_DEPTH | FTW_PHYS);
  }
#endif
  return 0;
}
