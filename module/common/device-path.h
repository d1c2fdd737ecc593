// The engine's fixed device paths, and the one seam through which they reach
// the file system: the identity on a device, and under the simulated device's
// root (KORRIN_SIM_ROOT) off the device.
#ifndef KORRIN_COMMON_DEVICE_PATH_H_
#define KORRIN_COMMON_DEVICE_PATH_H_

#include <string>

namespace korrin {

// The layout database, kept as the launcher expects it.
extern const char kGameDataDbPath[];

// Where |devicePath| lives on the machine that runs the engine.
std::string DevicePath(const char* devicePath);

}  // namespace korrin

#endif  // KORRIN_COMMON_DEVICE_PATH_H_
