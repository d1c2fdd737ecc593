// The package tracker's storage-card side. Games on the removable card come
// and go with it, and at boot the card may be mounted only after the launcher
// has started: the launcher subscribes to the system bus's boot-done signal,
// and when it comes the card's status is read once and every cached
// application marked as living on the card is refreshed through the engine.
//
// Log texts are kept exactly as the launcher's log readers expect them, the
// one that names another handler included.
#include "launcher-package-manager/launcher-package-manager.h"

#include <app_preference.h>

#include "common/log.h"

namespace {

const int kBusInitTries = 10;
const char kBootDonePath[] = "/Org/Tizen/System/DeviceD/Core";
const char kBootDoneInterface[] = "org.tizen.system.deviced.core";
const char kBootDoneMember[] = "BootingDone";
const char kStorageCardStatusKey[] = "memory/sysman/mmc";

}  // namespace

LauncherPackageManager* LauncherPackageManager::s_bootSignalSubscriber = NULL;

bool LauncherPackageManager::_RegisterEdbusSignalHandler() {
  // Subscribed already: a second subscription would fire the handler twice
  // and leave the first connection open for good.
  if (m_bootSignalHandler != NULL) return true;
  bool initialised = false;
  for (int i = 0; i < kBusInitTries && !initialised; ++i) initialised = e_dbus_init() > 0;
  if (!initialised) {
    KLOG(DLOG_ERROR, "e_dbus_init failed");
    return false;
  }
  m_dbusConnection = e_dbus_bus_get(DBUS_BUS_SYSTEM);
  if (m_dbusConnection == NULL) {
    KLOG(DLOG_ERROR, "e_dbus_bus_get failed");
    e_dbus_shutdown();
    return false;
  }
  m_bootSignalHandler =
      e_dbus_signal_handler_add(m_dbusConnection, NULL, kBootDonePath, kBootDoneInterface,
                                kBootDoneMember, _BootingDoneSignalCb, NULL);
  if (m_bootSignalHandler == NULL) {
    KLOG(DLOG_ERROR, "edbus_coord_rotation_handler failed");
    e_dbus_connection_close(m_dbusConnection);
    m_dbusConnection = NULL;
    e_dbus_shutdown();
    return false;
  }
  s_bootSignalSubscriber = this;
  return true;
}

void LauncherPackageManager::UnregisterEdbusSignalHandler() {
  if (m_dbusConnection != NULL) {
    if (m_bootSignalHandler != NULL) {
      e_dbus_signal_handler_del(m_dbusConnection, m_bootSignalHandler);
      m_bootSignalHandler = NULL;
    }
    e_dbus_connection_close(m_dbusConnection);
    m_dbusConnection = NULL;
  }
  if (s_bootSignalSubscriber == this) s_bootSignalSubscriber = NULL;
  e_dbus_shutdown();
}

void LauncherPackageManager::OnMMCStatusChanged(int status) {
  m_isMmcInserted = status != 0;
  // The ids are taken first: a refresh may drop or replace the very cache
  // entry a walk would stand on.
  std::vector<std::string> onCard;
  for (std::map<std::string, boost::shared_ptr<GameBoxData> >::const_iterator it =
           m_appInfoCache.begin();
       it != m_appInfoCache.end(); ++it) {
    if (it->second->isOnStorageCard) onCard.push_back(it->second->appId);
  }
  for (size_t i = 0; i < onCard.size(); ++i) m_onStorageCardAppChanged(onCard[i].c_str());
}

void LauncherPackageManager::_BootingDoneSignalCb(void* data, DBusMessage*) {
  LauncherPackageManager* manager =
      data != NULL ? static_cast<LauncherPackageManager*>(data) : s_bootSignalSubscriber;
  if (manager == NULL) return;
  int status = 0;  // an unreadable status counts as no card
  if (preference_get_int(kStorageCardStatusKey, &status) != PREFERENCE_ERROR_NONE) status = 0;
  manager->OnMMCStatusChanged(status);
  manager->UnregisterEdbusSignalHandler();
}
