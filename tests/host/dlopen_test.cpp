// The engine loaded as a launcher loads it: dlopen on the built library, its C
// entry points found with dlsym, the layout read back with plain SQL. The
// managers are built as the library loads: the case refuses to run where it
// is loaded already.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <stdlib.h>

#include <filesystem>

#include "sim/device.h"
#include "support/sql-probe.h"

TEST(LoadedLikeALauncher, FirstLaunchThenEventsEvenAfterUninitialization) {
  char root[] = "/tmp/korrin-host-test-XXXXXX";
  ASSERT_NE(nullptr, mkdtemp(root));
  sim::Device& device = sim::Device::Get();
  ASSERT_TRUE(device.UseRoot(root));
  // Added out of order, with an id that sorts first only by bytes, one that
  // extends another, and an application that is not a game.
  for (const char* id : {"mahjong", "chess", "Zoo", "chess2", "tetra"}) device.AddGame(id, id);
  device.AddApp("notes", "Notes");

  ASSERT_EQ(nullptr, dlopen(KORRIN_DATA_LIBRARY, RTLD_NOW | RTLD_NOLOAD)) << "loaded already";
  void* library = dlopen(KORRIN_DATA_LIBRARY, RTLD_NOW | RTLD_LOCAL);
  ASSERT_NE(nullptr, library) << dlerror();
  auto probe = reinterpret_cast<int (*)()>(dlsym(library, "korrin_data_probe"));
  auto start = reinterpret_cast<void (*)()>(dlsym(library, "data_engin_initialization"));
  auto stop = reinterpret_cast<void (*)()>(dlsym(library, "data_engin_uninitialization"));
  ASSERT_TRUE(probe != nullptr && start != nullptr && stop != nullptr);
  EXPECT_EQ(1, probe());
  start();
  stop();
  device.Install(sim::MakePackage("arcade", {sim::GameApp("arcade", "Arcade")}));

  // Every game in byte order of id, four to a row, on page 1 of menu 1; only
  // the one installed since stores its name.
  EXPECT_EQ((std::vector<Row>{{"Apps", "1", "Zoo 1,1", ""}, {"Apps", "1", "chess 2,1", ""},
                              {"Apps", "1", "chess2 3,1", ""}, {"Apps", "1", "mahjong 4,1", ""},
                              {"Apps", "1", "tetra 1,2", ""},
                              {"Apps", "1", "arcade 2,2", "Arcade"}}),
            SqlProbe(device.HostPath("/opt/usr/apps/com.velmora.korrin/data/.game-data.db"))
                .Rows("SELECT m.name, pageNo, appId || ' ' || col || ',' || row, IFNULL(b.name, "
                      "'') FROM Menus m, Pages p, Boxes b ON p.parentId = m.menuId AND b.pageId "
                      "= p.pageId ORDER BY m.menuId, pageNo, row, col"));
  std::filesystem::remove_all(root);
}
