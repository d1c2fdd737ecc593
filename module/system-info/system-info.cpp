// System information: the screen-size class from the platform's screen
// features, the local day of the month, the device-management switch, and the
// launcher's own integer formatting.
#include "system-info/system-info.h"

#include <stdio.h>
#include <system_info.h>
#include <time.h>

#include "common/log.h"

namespace {

const char kScreenWidthKey[] = "http://tizen.org/feature/screen.width";
const char kScreenHeightKey[] = "http://tizen.org/feature/screen.height";
const int kUnknownScreen = 6;

struct ScreenClass {
  int width;
  int height;
  int screenClass;
};

// Portrait sizes only: a landscape reading of the same screen is unknown.
const ScreenClass kScreenClasses[] = {
    {480, 800, 0}, {320, 480, 1}, {800, 1280, 2}, {720, 1280, 3}, {1080, 1920, 4}, {540, 960, 5},
};

std::string Decimal(int value) {
  char text[256];
  snprintf(text, sizeof(text), "%d", value);
  return text;
}

}  // namespace

int SystemInfo::GetScreenResolution() {
  int width = 0;
  int height = 0;
  // The message names another platform call; kept as the launcher's log
  // readers know it.
  int rc = system_info_get_platform_int(kScreenWidthKey, &width);
  if (rc != SYSTEM_INFO_ERROR_NONE) {
    KLOG(DLOG_ERROR, "system_info_get_custom_int FAILED!!!! [%d]", rc);
    return kUnknownScreen;
  }
  rc = system_info_get_platform_int(kScreenHeightKey, &height);
  if (rc != SYSTEM_INFO_ERROR_NONE) {
    KLOG(DLOG_ERROR, "system_info_get_custom_int FAILED!!!! [%d]", rc);
    return kUnknownScreen;
  }
  for (size_t i = 0; i < sizeof(kScreenClasses) / sizeof(kScreenClasses[0]); ++i) {
    if (kScreenClasses[i].width == width && kScreenClasses[i].height == height) {
      return kScreenClasses[i].screenClass;
    }
  }
  return kUnknownScreen;
}

int SystemInfo::GetCurrentDate() {
  time_t now = time(NULL);
  struct tm* local = localtime(&now);
  return local != NULL ? local->tm_mday : 0;
}

bool SystemInfo::IsMdmEnabled() { return false; }

namespace Korrin3D {

std::string to_string(int value) { return Decimal(value); }

// Deliberately signed: the launcher shows large unsigned values as negative.
std::string to_string(unsigned int value) { return Decimal(static_cast<int>(value)); }

}  // namespace Korrin3D
