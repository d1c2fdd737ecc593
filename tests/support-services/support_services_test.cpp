// The support services: the usage-log client, and system information (the
// screen-size class, the date on a clock of the test's own, the launcher's
// integer text; the policy switch is seen through the policy script).
#include <stdint.h>
#include <stdlib.h>
#include <time.h>

#include "log-client-manager/log-client-manager.h"
#include "support/sim-test.h"
#include "system-info/system-info.h"

namespace {

int64_t g_fakeNow = 0;  // seconds since the epoch, or 0 for the real clock
int g_clockReads = 0;

}  // namespace

// The clock the library reads. This binary exports it, so the library's call
// binds here (on 32-bit ARM with 64-bit time the headers name it __time64,
// and so does this definition).
extern "C" time_t time(time_t* out) {
  ++g_clockReads;
  timespec now;
  clock_gettime(CLOCK_REALTIME, &now);
  time_t seconds = g_fakeNow != 0 ? static_cast<time_t>(g_fakeNow) : now.tv_sec;
  if (out != NULL) *out = seconds;
  return seconds;
}

namespace {

const char kWidth[] = "http://tizen.org/feature/screen.width";
const char kHeight[] = "http://tizen.org/feature/screen.height";

class SystemInfoTest : public SimTest {};
class LogClientTest : public SimTest {};

// Portrait sizes only: the same screen read in landscape is not known.
TEST_F(SystemInfoTest, ScreenSizesMapToTheirClass) {
  const int cases[][3] = {{480, 800, 0}, {720, 1280, 3}, {1080, 1920, 4}, {1280, 720, 6}};
  for (const auto& c : cases) {
    device.SetSystemInfo(kWidth, c[0]);
    device.SetSystemInfo(kHeight, c[1]);
    EXPECT_EQ(c[2], SystemInfo::GetScreenResolution()) << c[0] << "x" << c[1];
  }
}

// A 32-bit time_t ends in January 2038; the ARM build must see past it.
TEST_F(SystemInfoTest, DateIsTheLocalDayOfTheMonthAfter2038) {
  setenv("TZ", "UTC0", 1);
  tzset();
  g_fakeNow = 2214129600;  // 2040-02-29 12:00 UTC
  g_clockReads = 0;
  EXPECT_EQ(29, SystemInfo::GetCurrentDate());
  EXPECT_EQ(1, g_clockReads);  // the library read this clock, not the real one
  g_fakeNow = 0;
}

// Unsigned values past INT_MAX come out negative, as the launcher shows them.
TEST_F(SystemInfoTest, IntegersBecomeSignedDecimalText) {
  EXPECT_EQ("-42", Korrin3D::to_string(-42));
  EXPECT_EQ("2147483647", Korrin3D::to_string(2147483647u));
  EXPECT_EQ("-2147483648", Korrin3D::to_string(2147483648u));
}

typedef std::vector<std::pair<std::string, std::string>> Fields;

TEST_F(LogClientTest, AnEventCarriesOnlyTheKeysGivenToItsProviderAndNeedsAFeature) {
  {
    LogClientManager client;
    client.InsertLog("com.ex.racer", "launch", "x", "1", true);
    client.InsertLog(NULL, "launch", NULL, "", false);
    client.InsertLog("com.ex.racer", NULL, "x", "1", true);
  }
  const std::vector<sim::UsageLog>& sent = device.UsageLogs();
  ASSERT_EQ(2u, sent.size());
  EXPECT_EQ("content://com.velmora.provider.usagelog/log/report_app_status_survey",
            sent[0].provider);
  EXPECT_EQ((Fields{{"app_id", "com.ex.racer"}, {"feature", "launch"}, {"extra", "x"},
                    {"value", "1"}}),
            sent[0].fields);
  EXPECT_EQ("content://com.velmora.provider.usagelog/log/use_app_feature_survey",
            sent[1].provider);
  EXPECT_EQ((Fields{{"feature", "launch"}, {"value", ""}}), sent[1].fields);
  EXPECT_EQ(std::vector<std::string>{"E feature is NULL"}, EngineMessages());
  EXPECT_EQ(0, HandlesOpenedByTest());  // each bundle freed, the client closed
}

}  // namespace
