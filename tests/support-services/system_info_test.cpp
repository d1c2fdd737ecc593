// System information: the screen-size class, the date and the launcher's
// integer text. (The policy switch is seen through IsMDMRestriected.)
#include <dlog.h>
#include <system_info.h>
#include <time.h>

#include "support/sim-test.h"
#include "system-info/system-info.h"

namespace {

const char kWidth[] = "http://tizen.org/feature/screen.width";
const char kHeight[] = "http://tizen.org/feature/screen.height";

class SystemInfoTest : public SimTest {};

TEST_F(SystemInfoTest, ScreenSizesMapToTheirClass) {
  struct {
    int width;
    int height;
    int screenClass;
  } cases[] = {
      {480, 800, 0},   {320, 480, 1}, {800, 1280, 2}, {720, 1280, 3},
      {1080, 1920, 4}, {540, 960, 5}, {1280, 720, 6},  // landscape is not known
      {1440, 2560, 6}, {720, 720, 6},
  };
  for (const auto& c : cases) {
    device.SetSystemInfo(kWidth, c.width);
    device.SetSystemInfo(kHeight, c.height);
    EXPECT_EQ(c.screenClass, SystemInfo::GetScreenResolution()) << c.width << "x" << c.height;
  }
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(SystemInfoTest, UnreadableScreenIsClassSixAfterOneLine) {
  struct {
    const char* name;
    bool hasWidth;
    int skip;  // successful reads before the failing one
    const char* message;
  } cases[] = {
      {"width fails", true, 0, "system_info_get_custom_int FAILED!!!! [-5]"},
      {"height fails", true, 1, "system_info_get_custom_int FAILED!!!! [-5]"},
      {"no width key", false, -1, "system_info_get_custom_int FAILED!!!! [-22]"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    device.Reset();
    if (c.hasWidth) device.SetSystemInfo(kWidth, 720);
    device.SetSystemInfo(kHeight, 1280);
    if (c.skip >= 0)
      device.FailNext("system_info_get_platform_int", SYSTEM_INFO_ERROR_IO_ERROR, c.skip);
    EXPECT_EQ(6, SystemInfo::GetScreenResolution());
    ASSERT_EQ(1u, EngineLogs().size());
    EXPECT_EQ((EngineLog{DLOG_ERROR, "system-info.cpp", "GetScreenResolution", c.message}),
              EngineLogs()[0]);
  }
}

TEST_F(SystemInfoTest, DateIsTheLocalDayOfTheMonth) {
  time_t now = time(NULL);
  int day = SystemInfo::GetCurrentDate();
  time_t after = time(NULL);
  struct tm before_tm = *localtime(&now);
  struct tm after_tm = *localtime(&after);
  EXPECT_TRUE(day == before_tm.tm_mday || day == after_tm.tm_mday);
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
