// The fixture of the package tracker's tests: a manager on a fresh simulated
// device, and a few verbs to set the device up and look at the results.
#ifndef KORRIN_TESTS_LAUNCHER_PACKAGE_MANAGER_PACKAGE_MANAGER_TEST_H_
#define KORRIN_TESTS_LAUNCHER_PACKAGE_MANAGER_PACKAGE_MANAGER_TEST_H_

#include <boost/shared_ptr.hpp>

#include "launcher-package-manager/launcher-package-manager.h"
#include "support/sim-test.h"

typedef std::vector<std::string> Ids;

// The launcher's icon for applications that have none.
inline const char* DefaultIcon() {
  return "/opt/usr/apps/com.velmora.korrin/res/images/common/default_app_icon.png";
}

class PackageManagerTest : public SimTest {
 protected:
  static boost::shared_ptr<GameBoxData> NewBox() {
    return boost::shared_ptr<GameBoxData>(new GameBoxData);
  }

  // What a reading fills, as text: pkgId, appId, pkgType, name, iconPath, then
  // isNoDisplay, isEnabled, isRemovable, isPreload, isSystem, isMdmRestricted
  // as a digit each, a blank and appSize: "010100 0".
  static Ids Facts(const GameBoxData& b) {
    std::string flags;
    for (bool flag : {b.isNoDisplay, b.isEnabled, b.isRemovable, b.isPreload, b.isSystem,
                      b.isMdmRestricted}) {
      flags += flag ? '1' : '0';
    }
    return {b.pkgId, b.appId, b.pkgType, b.name, b.iconPath,
            flags + " " + std::to_string(b.appSize)};
  }

  // Handles still open beyond the manager's own listening client.
  int LeftOpen() const { return HandlesOpenedByTest() - (manager.m_pkgMgr != NULL ? 1 : 0); }

  LauncherPackageManager manager;
};

#endif  // KORRIN_TESTS_LAUNCHER_PACKAGE_MANAGER_PACKAGE_MANAGER_TEST_H_
