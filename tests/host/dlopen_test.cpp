// The engine loaded as a launcher loads it: dlopen on the built library, its C
// entry points found with dlsym, the layout read back with plain SQL.
//
// The managers are built when the library is loaded and live until the process
// ends, so every case needs a process of its own (CTest runs each case alone);
// a case refuses to run where the library is already loaded.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <package_manager.h>
#include <stdlib.h>

#include <filesystem>
#include <string>
#include <vector>

#include "sim/device.h"
#include "support/sql-probe.h"

namespace {

const char kDbDevicePath[] = "/opt/usr/apps/com.velmora.korrin/data/.game-data.db";

class LoadedLikeALauncher : public ::testing::Test {
 protected:
  LoadedLikeALauncher() : device(sim::Device::Get()) {
    char pattern[] = "/tmp/korrin-host-test-XXXXXX";
    if (mkdtemp(pattern) == NULL) {
      ADD_FAILURE() << "cannot make a device root";
      return;
    }
    root = pattern;
    device.Reset();
    EXPECT_TRUE(device.UseRoot(root));
    // Added out of order, with an id that sorts first only by bytes, one that
    // extends another, and an application that is not a game.
    device.AddGame("org.korrin.mahjong", "Mahjong");
    device.AddGame("org.korrin.chess", "Chess");
    device.AddApp("org.korrin.notes", "Notes");
    device.AddGame("org.korrin.Zoo", "Zoo");
    device.AddGame("org.korrin.chess2", "Chess 2");
    device.AddGame("org.korrin.tetra", "Tetra");
  }

  ~LoadedLikeALauncher() override {
    std::error_code ignored;
    if (!root.empty()) std::filesystem::remove_all(root, ignored);
  }

  // Opens the library and finds its three entry points; anything the process
  // should know before the load (an injected fault) is set by then.
  void Load() {
    ASSERT_EQ(dlopen(KORRIN_DATA_LIBRARY, RTLD_NOW | RTLD_NOLOAD), nullptr)
        << "the engine is already loaded: run each case in a process of its own";
    void* library = dlopen(KORRIN_DATA_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(library, nullptr) << dlerror();
    initialize = reinterpret_cast<void (*)()>(dlsym(library, "data_engin_initialization"));
    uninitialize = reinterpret_cast<void (*)()>(dlsym(library, "data_engin_uninitialization"));
    probe = reinterpret_cast<int (*)()>(dlsym(library, "korrin_data_probe"));
    ASSERT_NE(initialize, nullptr);
    ASSERT_NE(uninitialize, nullptr);
    ASSERT_NE(probe, nullptr);
  }

  // The boxes of the layout, in place order, as "appId (col,row)".
  std::vector<std::string> Boxes() {
    std::vector<std::string> boxes;
    for (const Row& row :
         Sql().Rows("SELECT appId, col, row FROM Boxes ORDER BY pageId, row, col")) {
      boxes.push_back(row[0] + " (" + row[1] + "," + row[2] + ")");
    }
    return boxes;
  }

  SqlProbe Sql() const { return SqlProbe(device.HostPath(kDbDevicePath)); }

  // What a first launch with the fixture's games leaves in the database.
  void ExpectFirstLaunch() {
    SqlProbe sql = Sql();
    EXPECT_EQ(sql.Rows("SELECT menuId, name FROM Menus"), (std::vector<Row>{{"1", "Apps"}}));
    std::vector<Row> pages = sql.Rows("SELECT pageId, isFolder, parentId, pageNo FROM Pages");
    ASSERT_EQ(pages.size(), 1u);
    EXPECT_EQ(pages[0], (Row{pages[0][0], "0", "1", "1"}));
    EXPECT_EQ(Boxes(),
              (std::vector<std::string>{"org.korrin.Zoo (1,1)", "org.korrin.chess (2,1)",
                                        "org.korrin.chess2 (3,1)", "org.korrin.mahjong (4,1)",
                                        "org.korrin.tetra (1,2)"}));
    EXPECT_EQ(sql.Value("SELECT count(*) FROM Boxes WHERE pageId != " + pages[0][0] +
                        " OR isFolder != 0 OR name IS NOT NULL"),
              "0")
        << "every box is an application on the one page, stored without its name";
  }

  sim::Device& device;
  std::string root;
  void (*initialize)() = nullptr;
  void (*uninitialize)() = nullptr;
  int (*probe)() = nullptr;
};

TEST_F(LoadedLikeALauncher, FirstLaunchThenEventsEvenAfterUninitialization) {
  ASSERT_NO_FATAL_FAILURE(Load());
  EXPECT_EQ(probe(), 1);
  initialize();
  ExpectFirstLaunch();
  uninitialize();
  device.Install(
      sim::MakePackage("org.korrin.arcade", {sim::GameApp("org.korrin.arcade", "Arcade")}));
  EXPECT_EQ(Boxes().back(), "org.korrin.arcade (2,2)") << "a new game goes at the end of menu 1";
  EXPECT_EQ(device.PackageListeners(), 1);
}

TEST_F(LoadedLikeALauncher, WithoutAPackageClientTheLayoutIsBuiltButNoPackageIsHeard) {
  device.FailNext("package_manager_create", PACKAGE_MANAGER_ERROR_IO_ERROR);
  ASSERT_NO_FATAL_FAILURE(Load());
  initialize();
  ExpectFirstLaunch();
  EXPECT_EQ(device.PackageListeners(), 0);
  device.Install(
      sim::MakePackage("org.korrin.arcade", {sim::GameApp("org.korrin.arcade", "Arcade")}));
  EXPECT_EQ(Boxes().size(), 5u);
}

}  // namespace
