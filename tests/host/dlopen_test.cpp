// The engine loaded as a launcher loads it: dlopen on the built library, its C
// entry points found with dlsym, the layout read back with plain SQL. The
// managers are built as the library loads, so each case needs a process of
// its own (CTest runs each alone); a case refuses to run where it is loaded.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <package_manager.h>
#include <stdlib.h>

#include <filesystem>

#include "sim/device.h"
#include "support/sql-probe.h"

namespace {

class LoadedLikeALauncher : public ::testing::Test {
 protected:
  LoadedLikeALauncher() {
    char pattern[] = "/tmp/korrin-host-test-XXXXXX";
    root = mkdtemp(pattern) != NULL ? pattern : "";
    device.Reset();
    EXPECT_TRUE(device.UseRoot(root));
    // Added out of order, with an id that sorts first only by bytes, one that
    // extends another, and an application that is not a game.
    for (const char* id : {"mahjong", "chess", "Zoo", "chess2", "tetra"}) device.AddGame(id, id);
    device.AddApp("notes", "Notes");
  }
  ~LoadedLikeALauncher() override { std::filesystem::remove_all(root); }

  // Opens the library and starts the engine through its entry points;
  // anything the process should know before the load (a fault) is set by then.
  void LoadAndStart() {
    ASSERT_EQ(dlopen(KORRIN_DATA_LIBRARY, RTLD_NOW | RTLD_NOLOAD), nullptr)
        << "the engine is already loaded: run each case in a process of its own";
    void* library = dlopen(KORRIN_DATA_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(library, nullptr) << dlerror();
    auto entry = [library](const char* name) {
      void* found = dlsym(library, name);
      EXPECT_NE(found, nullptr) << name;
      return found;
    };
    auto probe = reinterpret_cast<int (*)()>(entry("korrin_data_probe"));
    auto start = reinterpret_cast<void (*)()>(entry("data_engin_initialization"));
    auto stop = reinterpret_cast<void (*)()>(entry("data_engin_uninitialization"));
    ASSERT_FALSE(HasFailure());
    EXPECT_EQ(1, probe());
    start();
    stop();
  }

  // Menus, pages and boxes, each box as "appId col,row" on page 1 of menu 1.
  std::vector<Row> Layout() {
    return SqlProbe(device.HostPath("/opt/usr/apps/com.velmora.korrin/data/.game-data.db"))
        .Rows("SELECT m.name, p.pageNo, appId || ' ' || col || ',' || row, IFNULL(b.name, '') "
              "FROM Menus m, Pages p, Boxes b ON p.parentId = m.menuId AND b.pageId = p.pageId "
              "ORDER BY m.menuId, p.pageNo, row, col");
  }

  sim::Device& device = sim::Device::Get();
  std::string root;
  const std::vector<Row> firstLaunch = {{"Apps", "1", "Zoo 1,1", ""},
                                        {"Apps", "1", "chess 2,1", ""},
                                        {"Apps", "1", "chess2 3,1", ""},
                                        {"Apps", "1", "mahjong 4,1", ""},
                                        {"Apps", "1", "tetra 1,2", ""}};
};

TEST_F(LoadedLikeALauncher, FirstLaunchThenEventsEvenAfterUninitialization) {
  ASSERT_NO_FATAL_FAILURE(LoadAndStart());
  std::vector<Row> layout = firstLaunch;
  EXPECT_EQ(layout, Layout());
  EXPECT_EQ(1, device.PackageListeners());
  device.Install(sim::MakePackage("arcade", {sim::GameApp("arcade", "Arcade")}));
  layout.push_back({"Apps", "1", "arcade 2,2", "Arcade"});
  EXPECT_EQ(layout, Layout());
}

TEST_F(LoadedLikeALauncher, WithoutAPackageClientTheLayoutIsBuiltButNoPackageIsHeard) {
  device.FailNext("package_manager_create", PACKAGE_MANAGER_ERROR_IO_ERROR);
  ASSERT_NO_FATAL_FAILURE(LoadAndStart());
  EXPECT_EQ(0, device.PackageListeners());
  device.Install(sim::MakePackage("arcade", {sim::GameApp("arcade", "Arcade")}));
  EXPECT_EQ(firstLaunch, Layout());
}

}  // namespace
