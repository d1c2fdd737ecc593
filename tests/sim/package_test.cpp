// The simulated package manager: the events of installs, updates and
// uninstalls as listening clients hear them; and finding packages and
// applications by id as the device changes: the first of a repeated
// application id, ids changed in place, and filtered walks whose callbacks
// change the device under them.
#include <app_info.h>
#include <app_manager.h>
#include <package_manager.h>

#include <cstdlib>
#include <functional>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "support/sim-test.h"

namespace {

// What a listening client heard, one line per event, with whether the
// package's first application could be opened at that moment.
struct Heard {
  std::vector<std::string> events;
  std::string appId;
};

void Listen(const char* type, const char* package, package_manager_event_type_e eventType,
            package_manager_event_state_e eventState, int progress, package_manager_error_e error,
            void* user_data) {
  Heard* heard = static_cast<Heard*>(user_data);
  app_info_h info = NULL;
  bool readable = app_info_create(heard->appId.c_str(), &info) == APP_MANAGER_ERROR_NONE;
  if (readable) app_info_destroy(info);
  std::ostringstream line;
  line << type << " " << package << " " << eventType << " " << eventState << " " << progress << " "
       << error << (readable ? " readable" : "");
  heard->events.push_back(line.str());
}

class PackageTest : public SimTest {
 protected:
  PackageTest() {
    EXPECT_EQ(PACKAGE_MANAGER_ERROR_NONE, package_manager_create(&client));
    EXPECT_EQ(PACKAGE_MANAGER_ERROR_NONE, package_manager_set_event_cb(client, Listen, &heard));
  }
  ~PackageTest() override { package_manager_destroy(client); }

  package_manager_h client = NULL;
  Heard heard;
};

TEST_F(PackageTest, OperationsSendTheirEventsAroundTheChange) {
  sim::Package racer =
      sim::MakePackage("com.example.racer", {sim::GameApp("com.example.racer", "Racer")});
  heard.appId = "com.example.racer";

  device.Install(racer);
  racer.apps[0].label = "Racer Deluxe";
  device.Update(racer);
  ASSERT_EQ(1u, device.Packages().size());  // replaced where it stood
  EXPECT_EQ("Racer Deluxe", *device.Packages()[0].apps[0].label);
  // An id the removal frees; long enough to live outside the string object.
  EXPECT_TRUE(device.Uninstall(device.Packages()[0].id));
  EXPECT_FALSE(device.Uninstall("com.example.racer"));  // nothing sent

  EXPECT_EQ((std::vector<std::string>{
                "tpk com.example.racer 0 0 0 0",
                "tpk com.example.racer 0 1 60 0",
                "tpk com.example.racer 0 2 100 0 readable",
                "tpk com.example.racer 2 0 0 0 readable",
                "tpk com.example.racer 2 1 60 0 readable",
                "tpk com.example.racer 2 2 100 0 readable",
                "tpk com.example.racer 1 0 0 0 readable",  // uninstall starts while readable
                "tpk com.example.racer 1 1 60 0 readable",
                "tpk com.example.racer 1 2 100 0",
            }),
            heard.events);
}

TEST_F(PackageTest, ClientsHearRawEventsAsGivenAndOnlyWhatTheyAskFor) {
  device.EmitPackageEvent("wgt", "com.ex.ghost", PACKAGE_MANAGER_EVENT_TYPE_INSTALL,
                          PACKAGE_MANAGER_EVENT_STATE_FAILED, 30, PACKAGE_MANAGER_ERROR_IO_ERROR);
  device.EmitPackageEvent("tpk", "com.ex.ghost", 3, PACKAGE_MANAGER_EVENT_STATE_STARTED);
  EXPECT_EQ((std::vector<std::string>{"wgt com.ex.ghost 0 3 30 -5", "tpk com.ex.ghost 3 0 0 0"}),
            heard.events);
  heard.events.clear();

  Heard second;
  package_manager_h other = NULL;
  ASSERT_EQ(PACKAGE_MANAGER_ERROR_NONE, package_manager_create(&other));
  package_manager_set_event_cb(other, Listen, &second);
  EXPECT_EQ(2, device.PackageListeners());

  ASSERT_EQ(PACKAGE_MANAGER_ERROR_NONE,
            package_manager_set_event_status(other, PACKAGE_MANAGER_STATUS_TYPE_UNINSTALL));
  device.AddGame("com.ex.old", "Old");
  device.Install(sim::MakePackage("com.ex.new", {sim::GameApp("com.ex.new", "New")}));
  device.Uninstall("com.ex.old");
  EXPECT_EQ(6u, heard.events.size());
  EXPECT_EQ(3u, second.events.size());

  package_manager_unset_event_cb(client);
  EXPECT_EQ(1, device.PackageListeners());
  package_manager_destroy(other);
  EXPECT_EQ(0, device.PackageListeners());
  device.Uninstall("com.ex.new");
  EXPECT_EQ(6u, heard.events.size());
}

// ---- Finding packages and applications by id.

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

TEST_F(PackageLookupTest, RemovalsAndIdsChangedInPlaceKeepEveryPackageFindable) {
  for (const char* id : {"com.ex.1", "com.ex.2", "com.ex.3", "com.ex.4"}) device.AddGame(id, id);
  device.RemovePackage("com.ex.2");
  device.Uninstall("com.ex.1");
  device.AddGame("com.ex.2", "Back");
  Ids order;
  for (const sim::Package& pkg : device.Packages()) order.push_back(pkg.id);
  EXPECT_EQ((Ids{"com.ex.3", "com.ex.4", "com.ex.2"}), order);
  for (const std::string& id : order) EXPECT_EQ(id, PackageOf(id));
  EXPECT_EQ("", PackageOf("com.ex.1"));

  sim::Package* pkg = device.FindPackage("com.ex.3");
  PackageOf("com.ex.4");  // a look-up between the loan and the change
  pkg->id = pkg->apps[0].id = "com.ex.new";
  EXPECT_EQ("", PackageOf("com.ex.3"));
  EXPECT_EQ(nullptr, device.FindPackage("com.ex.3"));
  EXPECT_EQ("com.ex.new", PackageOf("com.ex.new"));
  device.AddGame("com.ex.more", "More");
  for (const char* id : {"com.ex.new", "com.ex.4", "com.ex.more"}) EXPECT_EQ(id, PackageOf(id));
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
