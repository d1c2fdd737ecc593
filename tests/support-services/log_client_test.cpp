// The usage-log client: which keys an event carries and where it goes.
#include <bundle.h>

#include "log-client-manager/log-client-manager.h"
#include "support/sim-test.h"

namespace {

typedef std::vector<std::pair<std::string, std::string>> Fields;

const char kStatus[] = "content://com.velmora.provider.usagelog/log/report_app_status_survey";
const char kFeatureUse[] = "content://com.velmora.provider.usagelog/log/use_app_feature_survey";

class LogClientTest : public SimTest {};

TEST_F(LogClientTest, EventsCarryOnlyTheKeysGivenToTheSelectedProviderAndNeedAFeature) {
  struct {
    const char* appId;
    const char* extra;
    const char* value;
    bool isAppStatus;
    const char* provider;
    Fields fields;
  } cases[] = {
      {"com.ex.racer", "x", "1", true, kStatus,
       {{"app_id", "com.ex.racer"}, {"feature", "launch"}, {"extra", "x"}, {"value", "1"}}},
      {NULL, "x", NULL, false, kFeatureUse, {{"feature", "launch"}, {"extra", "x"}}},
      {"com.ex.racer", NULL, "", false, kFeatureUse,
       {{"app_id", "com.ex.racer"}, {"feature", "launch"}, {"value", ""}}},
      {NULL, NULL, NULL, true, kStatus, {{"feature", "launch"}}},
  };
  {
    LogClientManager client;
    for (const auto& c : cases) {
      client.InsertLog(c.appId, "launch", c.extra, c.value, c.isAppStatus);
    }
    EXPECT_TRUE(EngineLogs().empty());
    // Without a feature nothing is packed or sent.
    client.InsertLog("com.ex.racer", NULL, "x", "1", true);
  }
  ASSERT_EQ(4u, device.UsageLogs().size());
  for (size_t i = 0; i < 4; ++i) {
    EXPECT_EQ(cases[i].provider, device.UsageLogs()[i].provider) << i;
    EXPECT_EQ(cases[i].fields, device.UsageLogs()[i].fields) << i;
  }
  EXPECT_EQ(4, device.CallCount("bundle_create"));
  EXPECT_EQ(std::vector<std::string>{"E feature is NULL"}, EngineMessages());
  EXPECT_EQ(0, HandlesOpenedByTest());
}

TEST_F(LogClientTest, FailuresOfTheClientAreNotFatal) {
  const std::pair<const char*, size_t> cases[] = {{"velmora_log_manager_create", 0},
                                                  {"bundle_create", 0},
                                                  {"bundle_add_str", 1},  // the key left out
                                                  {"velmora_log_manager_insert", 0}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.first);
    device.Reset();
    device.FailNext(c.first, -5);
    {
      LogClientManager client;
      client.InsertLog("com.ex.racer", "launch", NULL, NULL, true);
    }
    EXPECT_EQ(c.second, device.UsageLogs().size());
    EXPECT_EQ(0, HandlesOpenedByTest());
  }
}

}  // namespace
