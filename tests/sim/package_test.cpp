// The simulated package manager: the events of installs, updates and
// uninstalls as listening clients hear them.
#include <app_manager.h>
#include <package_manager.h>

#include <sstream>

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

TEST_F(PackageTest, RawEventsReachListenersAsGiven) {
  device.EmitPackageEvent("wgt", "com.ex.ghost", PACKAGE_MANAGER_EVENT_TYPE_INSTALL,
                          PACKAGE_MANAGER_EVENT_STATE_FAILED, 30, PACKAGE_MANAGER_ERROR_IO_ERROR);
  device.EmitPackageEvent("tpk", "com.ex.ghost", 3, PACKAGE_MANAGER_EVENT_STATE_STARTED);
  EXPECT_EQ((std::vector<std::string>{"wgt com.ex.ghost 0 3 30 -5", "tpk com.ex.ghost 3 0 0 0"}),
            heard.events);
}

TEST_F(PackageTest, ClientsHearOnlyWhatTheyAskFor) {
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

}  // namespace
