// The package tracker's application side: reading an application's
// information from the platform into the records it shares through its cache,
// listing the installed games and a package's applications, deactivated
// applications, and the device-management policy.
//
// Every log text below, and the odd steps some operations take (which calls a
// failure path names, where an iteration stops), are kept exactly as the
// launcher and its log readers expect them.
#include "launcher-package-manager/launcher-package-manager.h"

#include <app_control.h>
#include <app_manager.h>
#include <mdm.h>
#include <stdlib.h>
#include <string.h>

#include <algorithm>

#include "common/log.h"
#include "system-info/system-info.h"

namespace {

const char kDefaultIconPath[] =
    "/opt/usr/apps/com.velmora.korrin/res/images/common/default_app_icon.png";
// The device maker's own category and metadata key, under its authority.
const char kFloatingAppCategory[] = "http://velmora.com/category/floatingapp";
const char kMenuLaunchMetadataKey[] = "http://velmora.com/tizen/metadata/menu/launch/operation";

// A string the platform allocated for us, freed when it goes.
class PlatformText {
 public:
  PlatformText() : m_text(NULL) {}
  ~PlatformText() { free(m_text); }

  char** Out() {
    free(m_text);
    m_text = NULL;
    return &m_text;
  }
  const char* Get() const { return m_text; }
  bool IsEmpty() const { return m_text == NULL || m_text[0] == '\0'; }
  // For "%s": glibc prints a null string as "(null)"; say so portably.
  const char* ForLog() const { return m_text != NULL ? m_text : "(null)"; }

 private:
  PlatformText(const PlatformText&) = delete;
  PlatformText& operator=(const PlatformText&) = delete;

  char* m_text;
};

// A platform handle, released by |Destroy| when it goes if it was ever made.
template <typename Handle, int (*Destroy)(Handle)>
class ScopedHandle {
 public:
  ScopedHandle() : m_handle(NULL) {}
  ~ScopedHandle() {
    if (m_handle != NULL) Destroy(m_handle);
  }

  Handle* Out() { return &m_handle; }
  Handle& Get() { return m_handle; }
  // Drops, unreleased, what a refused create may have left in the handle.
  void Forget() { m_handle = NULL; }

 private:
  ScopedHandle(const ScopedHandle&) = delete;
  ScopedHandle& operator=(const ScopedHandle&) = delete;

  Handle m_handle;
};

typedef ScopedHandle<app_info_h, app_info_destroy> AppInfo;
typedef ScopedHandle<app_info_filter_h, app_info_filter_destroy> AppInfoFilter;
typedef ScopedHandle<package_info_h, package_info_destroy> PackageInfo;
typedef ScopedHandle<package_manager_filter_h, package_manager_filter_destroy> PackageFilter;

std::vector<std::string>* StringList(void* user_data) {
  return static_cast<std::vector<std::string>*>(user_data);
}

// A listing callback's two arguments: each missing one is logged, and the
// callback then ends the listing.
bool BothGiven(app_info_h info, void* user_data) {
  if (info == NULL) {
    KLOG(DLOG_ERROR, "(%s)", "NULL == handle");
    return false;
  }
  if (user_data == NULL) {
    KLOG(DLOG_ERROR, "(%s)", "NULL == user_data");
    return false;
  }
  return true;
}

// What _GetAppInfo reads of an application and of its package.
struct AppFacts {
  AppFacts()
      : isNoDisplay(false), isEnabled(true), isRemovable(true), isPreload(false),
        isSystem(false) {}
  PlatformText appId, pkgId, icon, label, type;
  bool isNoDisplay;
  bool isEnabled;
  bool isRemovable;
  bool isPreload;
  bool isSystem;
};

// Reads the package's flags into |facts|; the first failure is logged and ends
// the reading. The package's handle is released before the verdict.
bool ReadPackageFlags(AppFacts* facts) {
  PackageInfo pkgInfo;
  int rc = package_info_create(facts->pkgId.Get(), pkgInfo.Out());
  if (rc != PACKAGE_MANAGER_ERROR_NONE) {
    // Names the package manager's call, not the one made; kept.
    KLOG(DLOG_ERROR, "package_manager_get_package_info return [%d]", rc);
    pkgInfo.Forget();
    return false;
  }
  if ((rc = package_info_is_system_package(pkgInfo.Get(), &facts->isSystem)) !=
      PACKAGE_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "package_info_is_system_package return [%d]", rc);
    return false;
  }
  if ((rc = package_info_is_removable_package(pkgInfo.Get(), &facts->isRemovable)) !=
      PACKAGE_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "package_info_is_removable_package return [%d]", rc);
    return false;
  }
  if ((rc = package_info_is_preload_package(pkgInfo.Get(), &facts->isPreload)) !=
      PACKAGE_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "package_info_is_preload_package return [%d]", rc);
    return false;
  }
  return true;
}

// Writes what was read into the box; a text the platform did not give keeps
// the box's own, but for the icon, which falls back to the default.
void FillBox(const AppFacts& facts, GameBoxData* box) {
  if (facts.pkgId.Get() != NULL) box->pkgId = facts.pkgId.Get();
  if (facts.type.Get() != NULL) box->pkgType = facts.type.Get();
  box->iconPath = facts.icon.IsEmpty() ? kDefaultIconPath : facts.icon.Get();
  if (facts.appId.Get() != NULL) box->appId = facts.appId.Get();
  if (facts.label.Get() != NULL) box->name = facts.label.Get();
  box->isNoDisplay = facts.isNoDisplay;
  box->isEnabled = facts.isEnabled;
  box->isRemovable = facts.isRemovable;
  box->isPreload = facts.isPreload;
  box->isSystem = facts.isSystem;
  box->appSize = 0;
  box->isMdmRestricted = false;
}

}  // namespace

// ---------------------------------------------------------------------------
// Construction and teardown

LauncherPackageManager::LauncherPackageManager()
    : m_pkgMgr(NULL),
      m_isListenPaused(false),
      m_bootSignalHandler(NULL),
      m_dbusConnection(NULL),
      m_isMmcInserted(false) {
  if (package_manager_create(&m_pkgMgr) != PACKAGE_MANAGER_ERROR_NONE) m_pkgMgr = NULL;
}

LauncherPackageManager::~LauncherPackageManager() {
  if (s_bootSignalSubscriber == this) s_bootSignalSubscriber = NULL;
  Terminate();
  m_onStorageCardAppChanged.clear();
  m_onDeactivatedAppIds.clear();
  m_onAppUninstalled.clear();
  m_onAppUpdated.clear();
  m_onAppInstalled.clear();
  m_appInfoCache.clear();
  m_pkgJobList.clear();
  m_pkgJobMap.clear();
}

bool LauncherPackageManager::Terminate() {
  if (m_pkgMgr == NULL) return true;
  int rc = package_manager_unset_event_cb(m_pkgMgr);
  if (rc == PACKAGE_MANAGER_ERROR_NONE) rc = package_manager_destroy(m_pkgMgr);
  if (rc != PACKAGE_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "cannot free pkgmgr_client for listen.");
    return false;
  }
  m_pkgMgr = NULL;
  return true;
}

// ---------------------------------------------------------------------------
// Application information

bool LauncherPackageManager::GetAppInfo(std::string appId, boost::shared_ptr<GameBoxData> box) {
  std::map<std::string, boost::shared_ptr<GameBoxData> >::iterator found =
      m_appInfoCache.find(appId);
  if (found != m_appInfoCache.end()) {
    const GameBoxData& cached = *found->second;
    if (!cached.name.empty() && !cached.iconPath.empty()) {
      // What a reading fills or clears; the third and sixth flags are the
      // caller's own, and so are the box's placement and appId.
      box->pkgId = cached.pkgId;
      box->pkgType = cached.pkgType;
      box->iconPath = cached.iconPath;
      box->name = cached.name;
      box->isNoDisplay = cached.isNoDisplay;
      box->isEnabled = cached.isEnabled;
      box->isRemovable = cached.isRemovable;
      box->isUpdatable = cached.isUpdatable;
      box->appSize = cached.appSize;
      box->isPreload = cached.isPreload;
      box->isSystem = cached.isSystem;
      box->isMdmRestricted = cached.isMdmRestricted;
      box->isLocked = cached.isLocked;
      box->isOnStorageCard = cached.isOnStorageCard;
      KLOG(DLOG_ERROR, "Find a App Info Name[%s] enable[%d] system[%d]", box->name.c_str(),
           box->isEnabled, box->isSystem);
      return true;
    }
    m_appInfoCache.erase(found);
  }
  return _GetAppInfo(appId, box);
}

bool LauncherPackageManager::GetAppName(std::string appId, boost::shared_ptr<GameBoxData> box) {
  return _GetAppInfo(appId, box);
}

bool LauncherPackageManager::_GetAppInfo(std::string appId, boost::shared_ptr<GameBoxData> box) {
  AppInfo info;
  int rc = app_info_create(appId.c_str(), info.Out());
  if (rc != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_create return [%d]", rc);
    return false;
  }
  return _GetAppInfo(info.Get(), box);
}

bool LauncherPackageManager::_GetAppInfo(app_info_h& info, boost::shared_ptr<GameBoxData> box) {
  AppFacts facts;
  bool read = false;

  // Each read runs only when the ones before it succeeded.
  int rc;
  if ((rc = app_info_get_app_id(info, facts.appId.Out())) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_get_app_id return [%d]", rc);
  } else if ((rc = app_info_is_nodisplay(info, &facts.isNoDisplay)) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_is_nodisplay return [%d]", rc);
  } else if (facts.isNoDisplay) {
    KLOG(DLOG_ERROR, "app[%s] is nodisplay app", facts.appId.ForLog());
    return false;
  } else if ((rc = app_info_get_package(info, facts.pkgId.Out())) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_get_package return [%d]", rc);
  } else if ((rc = app_info_get_icon(info, facts.icon.Out())) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_get_icon return [%d]", rc);
  } else if ((rc = app_info_get_label(info, facts.label.Out())) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_get_label return [%d]", rc);
  } else if ((rc = app_info_is_enabled(info, &facts.isEnabled)) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_get_label return [%d]", rc);  // the label's text, kept
  } else if ((rc = app_info_get_type(info, facts.type.Out())) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "app_info_get_type return [%d]", rc);
  } else {
    KLOG(DLOG_ERROR, " app_info_get_type appid[%s] pkg_id[%s] pkg_type[%s]", facts.appId.ForLog(),
         facts.pkgId.ForLog(), facts.type.ForLog());
    read = ReadPackageFlags(&facts);
  }
  if (!read) {
    KLOG(DLOG_ERROR, "AppId[%s] failed to get pkginfo", facts.appId.ForLog());
    return false;
  }

  FillBox(facts, box.get());
  KLOG(DLOG_ERROR, "Name[%s] enable[%d] system[%d]", facts.label.ForLog(), facts.isEnabled,
       facts.isSystem);
  m_appInfoCache[box->appId] = box;
  return true;
}

bool LauncherPackageManager::GetAppIdList(std::vector<std::string>& appIds) {
  KLOG(DLOG_WARN, "# BEGIN");
  app_info_filter_h handle = NULL;
  if (m_appInfoCache.empty()) {
    if (app_info_filter_create(&handle) != APP_MANAGER_ERROR_NONE) {
      KLOG(DLOG_ERROR, "(%s)", "APP_MANAGER_ERROR_NONE != app_info_filter_create(&handle)");
      return false;
    }
    if (app_info_filter_add_bool(handle, PACKAGE_INFO_PROP_APP_NODISPLAY, false) !=
            APP_MANAGER_ERROR_NONE ||
        app_info_filter_foreach_appinfo(handle, _GetAllAppsInfoCb, this) !=
            APP_MANAGER_ERROR_NONE) {
      app_info_filter_destroy(handle);
      return false;
    }
  }
  for (std::map<std::string, boost::shared_ptr<GameBoxData> >::const_iterator it =
           m_appInfoCache.begin();
       it != m_appInfoCache.end(); ++it) {
    if (it->second->isEnabled) appIds.push_back(it->second->appId);
  }
  std::sort(appIds.begin(), appIds.end());
  // Called with a null handle too when the cache was trusted, as the launcher does.
  app_info_filter_destroy(handle);
  KLOG(DLOG_WARN, "# END");
  return true;
}

bool LauncherPackageManager::_GetAllAppsInfoCb(app_info_h info, void* user_data) {
  if (!BothGiven(info, user_data)) return false;
  bool isGame = false;
  int rc = app_info_is_game(info, &isGame);
  if (rc != APP_MANAGER_ERROR_NONE || !isGame) {
    KLOG(DLOG_ERROR, " app_info_is_game FAILED [%d] [%d]", rc, isGame);
    return true;
  }
  boost::shared_ptr<GameBoxData> record(new GameBoxData);
  static_cast<LauncherPackageManager*>(user_data)->_GetAppInfo(info, record);
  return true;
}

std::vector<std::string> LauncherPackageManager::_GetAppIds(const char* pkgId) {
  KLOG(DLOG_ERROR, "BEGIN");
  std::vector<std::string> appIds;
  {
    PackageInfo pkgInfo;  // released before the ids are logged
    if (package_manager_get_package_info(pkgId, pkgInfo.Out()) != PACKAGE_MANAGER_ERROR_NONE) {
      KLOG(DLOG_ERROR, "package_manager_get_package_info[%s] != PACKAGE_MANAGER_ERROR_NONE",
           pkgId != NULL ? pkgId : "(null)");
    } else if (package_info_foreach_app_from_package(pkgInfo.Get(), PACKAGE_INFO_UIAPP,
                                                     _PkgMgrAppInfoGetListCb, &appIds) !=
               PACKAGE_MANAGER_ERROR_NONE) {
      KLOG(DLOG_ERROR, "package_info_foreach_app_from_package != PACKAGE_MANAGER_ERROR_NONE");
      if (package_info_foreach_app_from_package(pkgInfo.Get(), PACKAGE_INFO_ALLAPP,
                                                _PkgMgrAppInfoGetListCb, &appIds) !=
          PACKAGE_MANAGER_ERROR_NONE) {
        KLOG(DLOG_ERROR,
             "try again package_info_foreach_app_from_package != PACKAGE_MANAGER_ERROR_NONE");
      }
    }
  }
  for (size_t i = 0; i < appIds.size(); ++i) KLOG(DLOG_ERROR, "##### [%s]", appIds[i].c_str());
  KLOG(DLOG_ERROR, "END");
  return appIds;
}

bool LauncherPackageManager::_PkgMgrAppInfoGetListCb(package_info_app_component_type_e,
                                                     const char* appId, void* user_data) {
  std::vector<std::string>* appIds = StringList(user_data);
  AppInfo info;
  if (app_info_create(appId, info.Out()) != APP_MANAGER_ERROR_NONE) return false;

  // Stopping at the first non-game ends the whole package's listing; kept.
  bool goOn = false;
  bool isGame = true;
  int rc = app_info_is_game(info.Get(), &isGame);
  KLOG(DLOG_ERROR, "App [%s], [%d] [%d]", appId, rc, isGame);
  bool isNoDisplay = false;
  if (rc == APP_MANAGER_ERROR_NONE && isGame &&
      app_info_is_nodisplay(info.Get(), &isNoDisplay) == APP_MANAGER_ERROR_NONE) {
    if (isNoDisplay) {
      KLOG(DLOG_ERROR, "this package is no display");
      goOn = true;
    } else {
      PlatformText id;
      if (app_info_get_app_id(info.Get(), id.Out()) == APP_MANAGER_ERROR_NONE &&
          id.Get() != NULL) {
        appIds->push_back(id.Get());
        goOn = true;
      }
    }
  }
  if (goOn) {
    for (size_t i = 0; i < appIds->size(); ++i) {
      KLOG(DLOG_ERROR, "##### [%s]", (*appIds)[i].c_str());
    }
  }
  return goOn;
}

bool LauncherPackageManager::_IsMenuLaunch(std::string appId) {
  AppInfoFilter handle;
  if (app_info_filter_create(handle.Out()) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "(%s)", "APP_MANAGER_ERROR_NONE != app_info_filter_create(&handle)");
    return false;
  }
  bool found = false;
  if (app_info_filter_add_string(handle.Get(), PACKAGE_INFO_PROP_APP_CATEGORY,
                                 kFloatingAppCategory) != APP_MANAGER_ERROR_NONE ||
      app_info_filter_add_string(handle.Get(), PACKAGE_INFO_PROP_APP_ID, appId.c_str()) !=
          APP_MANAGER_ERROR_NONE ||
      app_info_filter_foreach_appinfo(handle.Get(), _has_mini_app_cb, &found) !=
          APP_MANAGER_ERROR_NONE) {
    return false;
  }
  if (!found) {
    AppInfo info;
    if (app_info_create(appId.c_str(), info.Out()) != APP_MANAGER_ERROR_NONE) return false;
    if (app_info_foreach_metadata(info.Get(), _app_metadata_list_cb, &found) !=
        APP_MANAGER_ERROR_NONE) {
      found = false;
    }
  }
  return found;
}

bool LauncherPackageManager::_has_mini_app_cb(app_info_h info, void* user_data) {
  if (!BothGiven(info, user_data)) return false;
  *static_cast<bool*>(user_data) = true;
  return false;
}

// Only the first metadata pair is ever looked at: the walk stops after it.
bool LauncherPackageManager::_app_metadata_list_cb(const char* key, const char* value,
                                                   void* user_data) {
  if (user_data == NULL) {
    KLOG(DLOG_ERROR, "(%s)", "NULL == user_data");
    return false;
  }
  if (key != NULL && value != NULL && strcmp(key, kMenuLaunchMetadataKey) == 0 &&
      strcmp(value, APP_CONTROL_OPERATION_MAIN) == 0) {
    *static_cast<bool*>(user_data) = true;
  }
  return false;
}

// ---------------------------------------------------------------------------
// Deactivated applications

void LauncherPackageManager::LoadDeactivatedAppList() {
  std::vector<std::string> appIds = _GetDeactivatedAppIds();
  if (appIds.empty()) return;
  m_onDeactivatedAppIds(appIds);
}

std::vector<std::string> LauncherPackageManager::_GetDeactivatedAppIds() {
  std::vector<std::string> appIds;
  PackageFilter filter;
  if (package_manager_filter_create(filter.Out()) != PACKAGE_MANAGER_ERROR_NONE ||
      filter.Get() == NULL) {
    return appIds;
  }
  if (package_manager_filter_add_bool(filter.Get(), PACKAGE_MANAGER_PKGINFO_PROP_SUPPORT_DISABLE,
                                      true) == PACKAGE_MANAGER_ERROR_NONE &&
      package_manager_filter_add_bool(filter.Get(), PACKAGE_MANAGER_PKGINFO_PROP_DISABLE, true) ==
          PACKAGE_MANAGER_ERROR_NONE) {
    package_manager_filter_foreach_package_info(filter.Get(),
                                                _PkgMgrDeactivatedPackageInfoGetListCb, &appIds);
  }
  return appIds;
}

// Goes on to the next package only when this one's applications could not be
// listed, so only the first listable package is reported; kept.
bool LauncherPackageManager::_PkgMgrDeactivatedPackageInfoGetListCb(package_info_h pkg,
                                                                    void* user_data) {
  return package_info_foreach_app_from_package(pkg, PACKAGE_INFO_ALLAPP,
                                               _PkgMgrDeactivatedAppInfoGetListCb,
                                               user_data) != PACKAGE_MANAGER_ERROR_NONE;
}

bool LauncherPackageManager::_PkgMgrDeactivatedAppInfoGetListCb(
    package_info_app_component_type_e, const char* appId, void* user_data) {
  AppInfo info;
  if (app_info_create(appId, info.Out()) != APP_MANAGER_ERROR_NONE) return true;
  bool isNoDisplay = false;
  app_info_is_nodisplay(info.Get(), &isNoDisplay);
  if (!isNoDisplay) {
    PlatformText id;
    if (app_info_get_app_id(info.Get(), id.Out()) == APP_MANAGER_ERROR_NONE && id.Get() != NULL) {
      StringList(user_data)->push_back(id.Get());
    }
  }
  return true;
}

bool LauncherPackageManager::_GetDeactivatedAppInfo(std::string appId,
                                                    boost::shared_ptr<GameBoxData> box) {
  AppInfoFilter filter;
  if (app_info_filter_create(filter.Out()) != APP_MANAGER_ERROR_NONE) return false;
  std::vector<std::string> texts;  // package id, icon path, label
  if (app_info_filter_add_string(filter.Get(), PACKAGE_INFO_PROP_APP_ID, appId.c_str()) !=
          APP_MANAGER_ERROR_NONE ||
      app_info_filter_foreach_appinfo(filter.Get(), _PkgMgrDeactivatedAppInfoGetCb, &texts) !=
          APP_MANAGER_ERROR_NONE ||
      texts.size() != 3) {
    return false;
  }
  box->pkgId = texts[0];
  box->iconPath = texts[1];
  box->name = texts[2];
  _GetDeactivatedPkgInfo(appId, box);  // before this filter goes, as the launcher does
  return true;
}

bool LauncherPackageManager::_GetDeactivatedPkgInfo(std::string appId,
                                                    boost::shared_ptr<GameBoxData> box) {
  AppInfoFilter filter;
  if (app_info_filter_create(filter.Out()) != APP_MANAGER_ERROR_NONE) return false;
  std::vector<std::string> texts;  // the type
  bool read =
      app_info_filter_add_string(filter.Get(), PACKAGE_INFO_PROP_APP_ID, appId.c_str()) ==
          APP_MANAGER_ERROR_NONE &&
      app_info_filter_foreach_appinfo(filter.Get(), _PkgMgrDeactivatedPkgInfoGetCb, &texts) ==
          APP_MANAGER_ERROR_NONE &&
      texts.size() == 1;
  if (read) box->pkgType = texts[0];
  return read;
}

bool LauncherPackageManager::_PkgMgrDeactivatedAppInfoGetCb(app_info_h info, void* user_data) {
  bool isEnabled = false;
  if (app_info_is_enabled(info, &isEnabled) != APP_MANAGER_ERROR_NONE) return false;
  PlatformText pkgId, icon, label;
  if (app_info_get_package(info, pkgId.Out()) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "Failed to get pkgid");
  }
  if (app_info_get_icon(info, icon.Out()) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "Failed to get icon");
  }
  if (app_info_get_label(info, label.Out()) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "Failed to get name");
  }
  std::vector<std::string>* texts = StringList(user_data);
  if (pkgId.Get() != NULL) texts->push_back(pkgId.Get());
  texts->push_back(icon.IsEmpty() ? kDefaultIconPath : icon.Get());
  if (label.Get() != NULL) texts->push_back(label.Get());
  return false;
}

bool LauncherPackageManager::_PkgMgrDeactivatedPkgInfoGetCb(app_info_h info, void* user_data) {
  bool isEnabled = false;
  if (app_info_is_enabled(info, &isEnabled) != APP_MANAGER_ERROR_NONE) return false;
  PlatformText pkgId, type;
  if (app_info_get_package(info, pkgId.Out()) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "Failed to get pkgid");
  }
  if (app_info_get_type(info, type.Out()) != APP_MANAGER_ERROR_NONE) {
    KLOG(DLOG_ERROR, "Failed to get type");
  }
  if (type.Get() != NULL) StringList(user_data)->push_back(type.Get());
  return false;
}

// ---------------------------------------------------------------------------
// Device-management policy. Allowed is state 0 and restricted state 1; an
// unreachable service allows everything and restricts nothing.

bool LauncherPackageManager::IsMDMAllowed(std::string appId) {
  if (mdm_get_service() != MDM_RESULT_SUCCESS) {
    KLOG(DLOG_ERROR, "mdm_get_service() is failed");
    return true;
  }
  bool allowed = mdm_get_application_state(appId.c_str()) == MDM_ALLOWED;
  if (!allowed) KLOG(DLOG_ERROR, "app[%s] is not mdm allowed", appId.c_str());
  mdm_release_service();
  return allowed;
}

bool LauncherPackageManager::IsMDMRestriected(std::string appId) {
  if (!SystemInfo::IsMdmEnabled()) return false;
  if (mdm_get_service() != MDM_RESULT_SUCCESS) {
    KLOG(DLOG_ERROR, "mdm_get_service() is failed");
    return false;
  }
  bool restricted = mdm_get_application_state(appId.c_str()) == MDM_RESTRICTED;
  if (restricted) KLOG(DLOG_ERROR, "app[%s] is mdm restriected", appId.c_str());
  mdm_release_service();
  return restricted;
}
