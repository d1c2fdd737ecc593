// Finding packages and applications by id as the device changes: the first
// of a repeated application id, ids changed in place, and filtered walks
// whose callbacks change the device under them.
#include <app_info.h>
#include <app_manager.h>

#include <cstdlib>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "support/sim-test.h"

namespace {

typedef std::vector<std::string> Ids;

class PackageLookupTest : public SimTest {
 protected:
  // The package that app_info_create finds |appId| in, or "" for none.
  std::string PackageOf(const std::string& appId) {
    app_info_h info = NULL;
    char* pkgId = NULL;
    if (app_info_create(appId.c_str(), &info) != APP_MANAGER_ERROR_NONE) return "";
    app_info_get_package(info, &pkgId);
    app_info_destroy(info);
    std::string result = pkgId != NULL ? pkgId : "";
    free(pkgId);
    return result;
  }

  // Every application id a filtered walk visits, calling |atFirst| at the first.
  Ids WalkApps(std::function<void()> atFirst) {
    walked.clear();
    during = atFirst;
    app_info_filter_h filter = NULL;
    app_info_filter_create(&filter);
    app_info_filter_foreach_appinfo(
        filter,
        [](app_info_h info, void* self) {
          auto* test = static_cast<PackageLookupTest*>(self);
          char* id = NULL;
          app_info_get_app_id(info, &id);
          test->walked.push_back(id);
          free(id);
          if (auto call = std::exchange(test->during, nullptr)) call();
          return true;
        },
        this);
    app_info_filter_destroy(filter);
    return walked;
  }
  Ids walked;
  std::function<void()> during;
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
  Ids order;
  for (const sim::Package& pkg : device.Packages()) order.push_back(pkg.id);
  EXPECT_EQ((Ids{"com.ex.3", "com.ex.4", "com.ex.2"}), order);
  for (const std::string& id : order) EXPECT_EQ(id, PackageOf(id));
  EXPECT_EQ("", PackageOf("com.ex.1"));
}

TEST_F(PackageLookupTest, IdsChangedInPlaceAreFoundByTheirNewName) {
  for (const char* id : {"com.ex.old", "com.ex.keep"}) device.AddGame(id, id);
  sim::Package* pkg = device.FindPackage("com.ex.old");
  PackageOf("com.ex.keep");  // a look-up between the loan and the change
  pkg->id = pkg->apps[0].id = "com.ex.new";
  EXPECT_EQ("", PackageOf("com.ex.old"));
  EXPECT_EQ(nullptr, device.FindPackage("com.ex.old"));
  EXPECT_EQ("com.ex.new", PackageOf("com.ex.new"));
  device.AddGame("com.ex.more", "More");
  for (const char* id : {"com.ex.new", "com.ex.more"}) EXPECT_EQ(id, PackageOf(id));
}

TEST_F(PackageLookupTest, AWalkSeesTheDeviceAsItWasWhenItBegan) {
  for (const char* id : {"com.ex.1", "com.ex.2", "com.ex.3"}) device.AddGame(id, id);
  EXPECT_EQ((Ids{"com.ex.1", "com.ex.2", "com.ex.3"}), WalkApps([&] {
              device.Uninstall("com.ex.2");
              device.Install(sim::MakePackage("com.ex.4", {sim::GameApp("com.ex.4", "4")}));
              device.FindApp("com.ex.3")->id = "com.ex.renamed";
            }));
  EXPECT_EQ((Ids{"com.ex.1", "com.ex.renamed", "com.ex.4"}), WalkApps(nullptr));
  EXPECT_EQ("com.ex.4", PackageOf("com.ex.4"));
  EXPECT_EQ(0, HandlesOpenedByTest());
}

}  // namespace
