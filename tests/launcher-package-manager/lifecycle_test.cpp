// The manager's life (its listening client from construction to Terminate)
// and the device-management policy.
#include <mdm.h>
#include <package_manager.h>

#include <memory>

#include "package-manager-test.h"

namespace {

class LifecycleTest : public PackageManagerTest {};

TEST_F(LifecycleTest, ClientLivesFromConstructionUntilTerminateSucceedsOrIsNeverMade) {
  EXPECT_NE(nullptr, manager.m_pkgMgr);
  EXPECT_EQ(1, HandlesOpenedByTest());
  EXPECT_EQ(0, device.PackageListeners());  // nothing registered before Initialize
  {
    std::unique_ptr<LauncherPackageManager> another(new LauncherPackageManager);
    EXPECT_EQ(2, HandlesOpenedByTest());
  }
  EXPECT_EQ(1, HandlesOpenedByTest());

  EXPECT_TRUE(manager.Terminate());
  EXPECT_EQ(nullptr, manager.m_pkgMgr);
  EXPECT_EQ(0, HandlesOpenedByTest());
  EXPECT_TRUE(manager.Terminate());
  EXPECT_EQ(2, device.CallCount("package_manager_destroy"));  // another's, and one here

  // Without a client there is nothing to release.
  device.FailNext("package_manager_create", PACKAGE_MANAGER_ERROR_PERMISSION_DENIED);
  LauncherPackageManager without;
  EXPECT_EQ(nullptr, without.m_pkgMgr);
  EXPECT_TRUE(without.Terminate());
  EXPECT_EQ(2, device.CallCount("package_manager_destroy"));
  EXPECT_TRUE(EngineMessages().empty());

  // A release that fails keeps the client.
  struct {
    const char* call;
    int destroys;  // destroy calls made by the failing Terminate
  } cases[] = {{"package_manager_unset_event_cb", 0}, {"package_manager_destroy", 1}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.call);
    LauncherPackageManager other;
    device.ClearLogs();
    int destroys = device.CallCount("package_manager_destroy");
    device.FailNext(c.call, PACKAGE_MANAGER_ERROR_IO_ERROR);
    EXPECT_FALSE(other.Terminate());
    EXPECT_NE(nullptr, other.m_pkgMgr);
    EXPECT_EQ(destroys + c.destroys, device.CallCount("package_manager_destroy"));
    EXPECT_EQ(Ids{"E cannot free pkgmgr_client for listen."}, EngineMessages());
    EXPECT_EQ("Terminate", EngineLogs()[0].function);
  }
  EXPECT_EQ(0, HandlesOpenedByTest());  // each destructor tried again, and succeeded
}

// ---- Device-management policy.

TEST_F(LifecycleTest, PolicyAllowsUnlessTheServiceSaysOtherwiseAndRestrictionIsNeverAsked) {
  const Ids refused = {"E app[com.ex.racer] is not mdm allowed"};
  struct {
    const char* name;
    bool reachable;
    mdm_status_t state;
    bool allowed;
    Ids logs;
  } cases[] = {{"allowed", true, MDM_ALLOWED, true, {}},
               {"restricted", true, MDM_RESTRICTED, false, refused},
               {"any other state", true, MDM_STATUS_ERROR, false, refused},
               {"unreachable", false, MDM_RESTRICTED, true, {"E mdm_get_service() is failed"}}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    device.ClearLogs();
    device.SetMdm(c.reachable, {{"com.ex.racer", c.state}});
    EXPECT_EQ(c.allowed, manager.IsMDMAllowed("com.ex.racer"));
    EXPECT_EQ(c.logs, EngineMessages());
    EXPECT_EQ(0, LeftOpen());  // every connection released
  }

  // The restriction check is off: it never asks the service.
  device.ClearLogs();
  device.SetMdm(true, {{"com.ex.racer", MDM_RESTRICTED}});
  const int asked = device.CallCount("mdm_get_service");
  EXPECT_FALSE(manager.IsMDMRestriected("com.ex.racer"));
  EXPECT_EQ(asked, device.CallCount("mdm_get_service"));
  EXPECT_TRUE(EngineMessages().empty());
}

}  // namespace
