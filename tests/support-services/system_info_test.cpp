// System information: the screen-size class, the date and the launcher's
// integer text. (The policy switch is seen through IsMDMRestriected.)
#include <dlog.h>
#include <system_info.h>
#include <stdint.h>
#include <stdlib.h>
#include <time.h>

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

TEST_F(SystemInfoTest, ScreenSizesMapToTheirClass) {
  const int cases[][3] = {{480, 800, 0},   {320, 480, 1}, {800, 1280, 2}, {720, 1280, 3},
                          {1080, 1920, 4}, {540, 960, 5}, {1280, 720, 6},  // landscape is not known
                          {1440, 2560, 6}, {720, 720, 6}};
  for (const auto& c : cases) {
    device.SetSystemInfo(kWidth, c[0]);
    device.SetSystemInfo(kHeight, c[1]);
    EXPECT_EQ(c[2], SystemInfo::GetScreenResolution()) << c[0] << "x" << c[1];
  }
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(SystemInfoTest, UnreadableScreenIsClassSixAfterOneLine) {
  struct {
    const char* name;
    bool hasWidth;
    int skip;  // successful reads before the failing one; -1: none fails
    int code;  // what the log line reports
  } cases[] = {
      {"width fails", true, 0, -5}, {"height fails", true, 1, -5}, {"no key", false, -1, -22}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    device.Reset();
    if (c.hasWidth) device.SetSystemInfo(kWidth, 720);
    device.SetSystemInfo(kHeight, 1280);
    if (c.skip >= 0)
      device.FailNext("system_info_get_platform_int", SYSTEM_INFO_ERROR_IO_ERROR, c.skip);
    EXPECT_EQ(6, SystemInfo::GetScreenResolution());
    EXPECT_EQ((std::vector<EngineLog>{{DLOG_ERROR, "system-info.cpp", "GetScreenResolution",
                                       "system_info_get_custom_int FAILED!!!! [" +
                                           std::to_string(c.code) + "]"}}),
              EngineLogs());
  }
}

TEST_F(SystemInfoTest, DateIsTheLocalDayOfTheMonth) {
  time_t before = time(NULL);
  int day = SystemInfo::GetCurrentDate();
  time_t after = time(NULL);
  EXPECT_TRUE(day == localtime(&before)->tm_mday || day == localtime(&after)->tm_mday);
}

// A 32-bit time_t ends in January 2038; the ARM build must see past it.
TEST_F(SystemInfoTest, DateIsRightAfter2038) {
  setenv("TZ", "UTC0", 1);
  tzset();
  g_fakeNow = 2214129600;  // 2040-02-29 12:00 UTC
  g_clockReads = 0;
  EXPECT_EQ(29, SystemInfo::GetCurrentDate());
  EXPECT_EQ(1, g_clockReads);  // the library read this clock, not the real one
  g_fakeNow = 0;
}

TEST_F(SystemInfoTest, IntegersBecomeSignedDecimalText) {
  EXPECT_EQ("0", Korrin3D::to_string(0));
  EXPECT_EQ("-42", Korrin3D::to_string(-42));
  EXPECT_EQ("-2147483648", Korrin3D::to_string(-2147483647 - 1));
  EXPECT_EQ("0", Korrin3D::to_string(0u));
  EXPECT_EQ("2147483647", Korrin3D::to_string(2147483647u));
  EXPECT_EQ("-2147483648", Korrin3D::to_string(2147483648u));
  EXPECT_EQ("-1", Korrin3D::to_string(4294967295u));
}

}  // namespace
