// The simulated application information: opening by id, the getters, and
// filtered queries, including what a disabled application reports.
#include <app_manager.h>
#include <stdlib.h>

#include <functional>

#include "support/sim-test.h"

namespace {

class AppInfoTest : public SimTest {
 protected:
  // A string the platform handed over, freed here; "<null>" for none.
  static std::string Take(char* text) {
    std::string taken = text != NULL ? text : "<null>";
    free(text);
    return taken;
  }

  static bool CollectId(app_info_h info, void* ids) {
    char* id = NULL;
    EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_get_app_id(info, &id));
    static_cast<std::vector<std::string>*>(ids)->push_back(Take(id));
    return true;
  }

  // The ids a filter that |build| sets up selects, in platform order.
  std::vector<std::string> Select(const std::function<void(app_info_filter_h)>& build) {
    app_info_filter_h filter = NULL;
    EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_filter_create(&filter));
    build(filter);
    std::vector<std::string> ids;
    EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_filter_foreach_appinfo(filter, CollectId, &ids));
    EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_filter_destroy(filter));
    return ids;
  }

  // A device with one of each: game, non-game, no-display, disabled, floating.
  void SetUpVariedDevice() {
    device.AddGame("com.ex.racer", "Racer");
    device.AddApp("com.ex.notes", "Notes");
    sim::App helper = sim::GameApp("com.ex.helper", "Helper");
    helper.noDisplay = true;
    device.AddPackage(sim::MakePackage("com.ex.helper", {helper}));
    sim::Package off = sim::MakePackage("com.ex.off", {sim::GameApp("com.ex.off", "Off")});
    off.disabled = true;
    device.AddPackage(off);
    sim::App calc = sim::PlainApp("com.ex.calc", "Calc");
    calc.categories = {"http://velmora.com/category/floatingapp"};
    calc.type = "webapp";
    device.AddPackage(sim::MakePackage("com.ex.calc", {calc}));
  }
};

TEST_F(AppInfoTest, DisabledApplicationsOpenAndSayTheyAreNotEnabled) {
  device.AddGame("com.ex.own", "Own");
  device.FindApp("com.ex.own")->enabled = false;
  device.AddGame("com.ex.pkg", "Pkg");
  device.FindPackage("com.ex.pkg")->disabled = true;

  for (const char* id : {"com.ex.own", "com.ex.pkg"}) {
    app_info_h info = NULL;
    ASSERT_EQ(APP_MANAGER_ERROR_NONE, app_info_create(id, &info)) << id;
    bool enabled = true;
    EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_is_enabled(info, &enabled));
    EXPECT_FALSE(enabled) << id;
    app_info_destroy(info);
  }
}

TEST_F(AppInfoTest, HandleOpenedBeforeAnUninstallKeepsAnswering) {
  device.AddGame("com.ex.racer", "Racer");
  app_info_h info = NULL;
  ASSERT_EQ(APP_MANAGER_ERROR_NONE, app_info_create("com.ex.racer", &info));
  device.RemovePackage("com.ex.racer");
  char* label = NULL;
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_get_label(info, &label));
  EXPECT_EQ("Racer", Take(label));
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_destroy(info));
  EXPECT_EQ(APP_MANAGER_ERROR_INVALID_PARAMETER, app_info_destroy(info));  // twice
  EXPECT_EQ(0, HandlesOpenedByTest());
}

TEST_F(AppInfoTest, FiltersSelectInInstallationOrderAndReachDisabledApps) {
  SetUpVariedDevice();
  struct Case {
    const char* name;
    std::function<void(app_info_filter_h)> build;
    std::vector<std::string> ids;
  } cases[] = {
      {"no filter",
       [](app_info_filter_h) {},
       {"com.ex.racer", "com.ex.notes", "com.ex.helper", "com.ex.off", "com.ex.calc"}},
      {"displayable",
       [](app_info_filter_h f) {
         app_info_filter_add_bool(f, PACKAGE_INFO_PROP_APP_NODISPLAY, false);
       },
       {"com.ex.racer", "com.ex.notes", "com.ex.off", "com.ex.calc"}},
      {"by id",
       [](app_info_filter_h f) {
         app_info_filter_add_string(f, PACKAGE_INFO_PROP_APP_ID, "com.ex.off");
       },
       {"com.ex.off"}},
      {"by type",
       [](app_info_filter_h f) {
         app_info_filter_add_string(f, PACKAGE_INFO_PROP_APP_TYPE, "webapp");
       },
       {"com.ex.calc"}},
      {"category and id, both needed",
       [](app_info_filter_h f) {
         app_info_filter_add_string(f, PACKAGE_INFO_PROP_APP_CATEGORY,
                                    "http://velmora.com/category/floatingapp");
         app_info_filter_add_string(f, PACKAGE_INFO_PROP_APP_ID, "com.ex.racer");
       },
       {}},
  };
  for (const Case& c : cases) EXPECT_EQ(c.ids, Select(c.build)) << c.name;
  EXPECT_EQ(0, HandlesOpenedByTest());
}

TEST_F(AppInfoTest, LentHandleIsNotTheCalleesToReleaseButCanBeCloned) {
  device.AddGame("com.ex.racer", "Racer");
  struct Seen {
    int destroyResult = 0;
    app_info_h clone = NULL;
  } seen;
  app_info_filter_h filter = NULL;
  app_info_filter_create(&filter);
  app_info_filter_foreach_appinfo(
      filter,
      [](app_info_h info, void* data) {
        Seen* seen = static_cast<Seen*>(data);
        seen->destroyResult = app_info_destroy(info);
        app_info_clone(&seen->clone, info);
        return true;
      },
      &seen);
  app_info_filter_destroy(filter);

  EXPECT_EQ(APP_MANAGER_ERROR_INVALID_PARAMETER, seen.destroyResult);
  EXPECT_EQ(1, HandlesOpenedByTest());  // the clone, and only it
  char* id = NULL;
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_info_get_app_id(seen.clone, &id));
  EXPECT_EQ("com.ex.racer", Take(id));
  app_info_destroy(seen.clone);
}

TEST_F(AppInfoTest, ApplicationManagerListingLeavesDisabledAppsOut) {
  SetUpVariedDevice();
  std::vector<std::string> ids;
  EXPECT_EQ(APP_MANAGER_ERROR_NONE, app_manager_foreach_app_info(CollectId, &ids));
  EXPECT_EQ(
      (std::vector<std::string>{"com.ex.racer", "com.ex.notes", "com.ex.helper", "com.ex.calc"}),
      ids);
}

}  // namespace
