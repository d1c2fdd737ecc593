// Small stateless services for the launcher application and the package
// tracker: the device's screen-size class, the day of the month, whether
// device-management checks are on, and integers as decimal text.
#ifndef KORRIN_SYSTEM_INFO_SYSTEM_INFO_H_
#define KORRIN_SYSTEM_INFO_SYSTEM_INFO_H_

#include <string>

class SystemInfo {
 public:
  // The screen-size class of the portrait screen: 0 for 480x800, 1 for
  // 320x480, 2 for 800x1280, 3 for 720x1280, 4 for 1080x1920, 5 for 540x960;
  // 6 for any other size, and when the size cannot be read (logged).
  static int GetScreenResolution();
  // The day of the month, 1 to 31, in local time; 0 if the local time
  // cannot be read.
  static int GetCurrentDate();
  // Whether device-management policy checks are switched on: never, here.
  static bool IsMdmEnabled();
};

namespace Korrin3D {

// |value| in decimal.
std::string to_string(int value);
// |value| in decimal as a signed number: values above 2147483647 come out
// negative (4294967295 gives "-1"), as the launcher expects.
std::string to_string(unsigned int value);

}  // namespace Korrin3D

#endif  // KORRIN_SYSTEM_INFO_SYSTEM_INFO_H_
