// Finding packages and applications by id as the device changes: the first
// of a repeated application id, ids changed in place, and filtered walks
// whose callbacks change the device under them.
#include <app_info.h>
#include <app_manager.h>
#include <package_manager.h>

#include <cstdlib>
#include <functional>
#include <string>
#include <vector>

#include "support/sim-test.h"

namespace {

class PackageLookupTest : public SimTest {
 protected:
  // The package that app_info_create finds |appId| in, or "" for none.
  std::string PackageOf(const std::string& appId) {
    app_info_h info = NULL;
    if (app_info_create(appId.c_str(), &info) != APP_MANAGER_ERROR_NONE) return "";
    char* pkgId = NULL;
    app_info_get_package(info, &pkgId);
    std::string result = pkgId != NULL ? pkgId : "";
    free(pkgId);
    app_info_destroy(info);
    return result;
  }

  // Every application id a filtered walk visits, calling |during| at the first.
  std::vector<std::string> WalkApps(std::function<void()> during) {
    struct Walk {
      std::vector<std::string> ids;
      std::function<void()> during;
    } walk{{}, during};
    app_info_filter_h filter = NULL;
    app_info_filter_create(&filter);
    app_info_filter_foreach_appinfo(
        filter,
        [](app_info_h info, void* data) {
          Walk* walk = static_cast<Walk*>(data);
          char* id = NULL;
          app_info_get_app_id(info, &id);
          walk->ids.push_back(id);
          free(id);
          if (walk->during) {
            walk->during();
            walk->during = nullptr;
          }
          return true;
        },
        &walk);
    app_info_filter_destroy(filter);
    return walk.ids;
  }

  std::vector<std::string> PackageIds() {
    std::vector<std::string> ids;
    for (const sim::Package& pkg : device.Packages()) ids.push_back(pkg.id);
    return ids;
  }
};

TEST_F(PackageLookupTest, ARepeatedAppIdIsFoundInItsFirstPackage) {
  device.AddPackage(sim::MakePackage("com.ex.a", {sim::GameApp("com.ex.shared", "A")}));
  device.AddPackage(sim::MakePackage("com.ex.b", {sim::GameApp("com.ex.shared", "B")}));
  EXPECT_EQ("com.ex.a", PackageOf("com.ex.shared"));

  device.AddPackage(sim::MakePackage("com.ex.a", {sim::GameApp("com.ex.other", "A")}));
  EXPECT_EQ("com.ex.b", PackageOf("com.ex.shared"));
  device.AddPackage(sim::MakePackage("com.ex.a", {sim::GameApp("com.ex.shared", "A")}));
  EXPECT_EQ("com.ex.a", PackageOf("com.ex.shared"));  // replaced where it stood, first again

  device.RemovePackage("com.ex.a");
  EXPECT_EQ("com.ex.b", PackageOf("com.ex.shared"));
  device.RemovePackage("com.ex.b");
  EXPECT_EQ("", PackageOf("com.ex.shared"));
}

TEST_F(PackageLookupTest, RemovalsKeepTheOthersFindableInOrder) {
  for (const char* id : {"com.ex.1", "com.ex.2", "com.ex.3", "com.ex.4"}) device.AddGame(id, id);
  device.RemovePackage("com.ex.2");
  device.Uninstall("com.ex.1");
  device.AddGame("com.ex.2", "Back");
  EXPECT_EQ((std::vector<std::string>{"com.ex.3", "com.ex.4", "com.ex.2"}), PackageIds());
  for (const char* id : {"com.ex.2", "com.ex.3", "com.ex.4"}) EXPECT_EQ(id, PackageOf(id));
  EXPECT_EQ("", PackageOf("com.ex.1"));
}

TEST_F(PackageLookupTest, IdsChangedInPlaceAreFoundByTheirNewName) {
  device.AddGame("com.ex.old", "Old");
  device.AddGame("com.ex.keep", "Keep");
  sim::Package* pkg = device.FindPackage("com.ex.old");
  PackageOf("com.ex.keep");  // a look-up between the loan and the change
  pkg->id = "com.ex.new";
  pkg->apps[0].id = "com.ex.new";
  EXPECT_EQ("com.ex.new", PackageOf("com.ex.new"));
  EXPECT_EQ("", PackageOf("com.ex.old"));
  EXPECT_EQ(nullptr, device.FindPackage("com.ex.old"));

  device.AddGame("com.ex.more", "More");
  EXPECT_EQ("com.ex.new", PackageOf("com.ex.new"));
  EXPECT_EQ("com.ex.more", PackageOf("com.ex.more"));
}

TEST_F(PackageLookupTest, AWalkSeesTheDeviceAsItWasWhenItBegan) {
  for (const char* id : {"com.ex.1", "com.ex.2", "com.ex.3"}) device.AddGame(id, id);
  EXPECT_EQ((std::vector<std::string>{"com.ex.1", "com.ex.2", "com.ex.3"}), WalkApps([&] {
              device.Uninstall("com.ex.2");
              device.Install(sim::MakePackage("com.ex.4", {sim::GameApp("com.ex.4", "4")}));
              device.FindApp("com.ex.3")->id = "com.ex.renamed";
            }));
  EXPECT_EQ((std::vector<std::string>{"com.ex.1", "com.ex.renamed", "com.ex.4"}),
            WalkApps(nullptr));
  EXPECT_EQ("com.ex.4", PackageOf("com.ex.4"));
  EXPECT_EQ(0, HandlesOpenedByTest());
}

}  // namespace
