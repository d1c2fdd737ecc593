#include "common/device-path.h"

#include <stdlib.h>

namespace korrin {

const char kGameDataDbPath[] = "/opt/usr/apps/com.velmora.korrin/data/.game-data.db";

std::string DevicePath(const char* devicePath) {
#ifdef KORRIN_SIM
  const char* root = getenv("KORRIN_SIM_ROOT");
  if (root != NULL) return std::string(root) + devicePath;
#endif
  return devicePath;
}

}  // namespace korrin
