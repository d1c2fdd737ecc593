// The package tracker's event side: package-manager events become one job per
// package operation, from its start to its completion, and a completed job
// becomes the engine's callbacks, one per application of the package. While
// the launcher's database is first built, completed jobs are held back and
// then replayed in the order they completed.
//
// Every log text below goes to the error priority and is kept exactly as the
// launcher's log readers expect it, trailing newlines included.
#include "launcher-package-manager/launcher-package-manager.h"

#include <string.h>

#include "common/log.h"
#include "system-info/system-info.h"

namespace {

// The platform may send event types and states that its enums do not name.
// Such a value must not be loaded as the enum (that is undefined behaviour),
// so it is read as the integer it arrived as.
template <typename Enum>
int RawValue(const Enum& value) {
  static_assert(sizeof(Enum) == sizeof(int), "package event enums are int-sized");
  int raw;
  memcpy(&raw, &value, sizeof raw);
  return raw;
}

typedef LauncherPackageManager Tracker;

// The job a started event opens. An uninstall lists the package's
// applications now: once the package is gone they can no longer be asked for.
boost::shared_ptr<Tracker::PkgData> NewJob(Tracker& manager, int eventType, const char* package) {
  boost::shared_ptr<Tracker::PkgData> job(new Tracker::PkgData);
  switch (eventType) {
    case PACKAGE_MANAGER_EVENT_TYPE_INSTALL:
      job->type = Tracker::PKG_JOB_INSTALL;
      break;
    case PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL:
      job->type = Tracker::PKG_JOB_UNINSTALL;
      job->appIds = manager._GetAppIds(package);
      break;
    case PACKAGE_MANAGER_EVENT_TYPE_UPDATE:
      job->type = Tracker::PKG_JOB_UPDATE;
      break;
    default:
      job->type = Tracker::PKG_JOB_NONE;
      KLOG(DLOG_ERROR, "Invalid event_type: %d\n", eventType);
      break;
  }
  job->pkgId = package != NULL ? package : "";
  return job;
}

}  // namespace

bool LauncherPackageManager::Initialize(
    const boost::function<void(const char*)>& onAppInstalled,
    const boost::function<void(const char*)>& onAppUpdated,
    const boost::function<void(const char*)>& onAppUninstalled,
    const boost::function<void(std::vector<std::string>)>& onDeactivatedAppIds,
    const boost::function<void(const char*)>& onStorageCardAppChanged) {
  m_onAppInstalled = onAppInstalled;
  m_onAppUpdated = onAppUpdated;
  m_onAppUninstalled = onAppUninstalled;
  m_onDeactivatedAppIds = onDeactivatedAppIds;
  m_onStorageCardAppChanged = onStorageCardAppChanged;
  // No status filter: every event type and state is heard.
  if (m_pkgMgr != NULL) package_manager_set_event_cb(m_pkgMgr, _PkgMgrClientListenCb, this);
  return true;
}

// Passing the enums on loads them, which clang's enum check would report for
// the out-of-range values the platform may send; they are read safely below.
#if defined(__clang__)
__attribute__((no_sanitize("enum")))
#endif
void LauncherPackageManager::_PkgMgrClientListenCb(const char* type, const char* package,
                                                   package_manager_event_type_e event_type,
                                                   package_manager_event_state_e event_state,
                                                   int progress, package_manager_error_e error,
                                                   void* user_data) {
  static_cast<LauncherPackageManager*>(user_data)->OnClientListenCb(
      type, package, event_type, event_state, progress, error, user_data);
}

void LauncherPackageManager::OnClientListenCb(const char*, const char* package,
                                              package_manager_event_type_e event_type,
                                              package_manager_event_state_e event_state, int,
                                              package_manager_error_e, void*) {
  std::string pkgId = package != NULL ? package : "";
  int eventType = RawValue(event_type);
  int eventState = RawValue(event_state);

  switch (eventState) {
    case PACKAGE_MANAGER_EVENT_STATE_STARTED:
      m_pkgJobMap[pkgId] = NewJob(*this, eventType, package);  // a pending job is dropped
      break;
    case PACKAGE_MANAGER_EVENT_STATE_PROCESSING:
      break;
    case PACKAGE_MANAGER_EVENT_STATE_COMPLETED: {
      KLOG(DLOG_ERROR, "#Step 1");
      std::map<std::string, boost::shared_ptr<PkgData> >::iterator found =
          m_pkgJobMap.find(pkgId);
      if (found == m_pkgJobMap.end()) return;  // its start was never heard
      KLOG(DLOG_ERROR, "#Step 2");
      boost::shared_ptr<PkgData> job = found->second;
      m_pkgJobMap.erase(found);
      if (m_isListenPaused) {
        m_pkgJobList.push_back(job);
      } else {
        _DoPkgJob(job);
      }
      break;
    }
    case PACKAGE_MANAGER_EVENT_STATE_FAILED:
      m_pkgJobMap.erase(pkgId);
      break;
    default:
      KLOG(DLOG_ERROR, "Invalid event_state: %d\n", eventState);
      break;
  }
}

bool LauncherPackageManager::PauseListenCb() {
  m_isListenPaused = true;
  return true;
}

bool LauncherPackageManager::StartListenCb() {
  m_isListenPaused = false;
  // Each job leaves the list before it runs, so a callback that pauses again
  // holds the rest back, and one that starts a replay of its own runs none
  // of them twice.
  while (!m_pkgJobList.empty() && !m_isListenPaused) {
    boost::shared_ptr<PkgData> job = m_pkgJobList.front();
    m_pkgJobList.erase(m_pkgJobList.begin());
    _DoPkgJob(job);
  }
  return true;
}

bool LauncherPackageManager::_DoPkgJob(boost::shared_ptr<PkgData> job) {
  PkgData& pkg = *job;
  // Install and update share this bit; an uninstall keeps the ids it took at
  // its start, and an update's fresh list wins over anything earlier.
  if (pkg.type & PKG_JOB_INSTALL) pkg.appIds = _GetAppIds(pkg.pkgId.c_str());
  KLOG(DLOG_ERROR, "#Step 3 size[%d]", static_cast<int>(pkg.appIds.size()));

  for (size_t i = 0; i < pkg.appIds.size(); ++i) {
    const std::string appId = pkg.appIds[i];
    KLOG(DLOG_ERROR, "appId[%s]", appId.c_str());
    m_appInfoCache.erase(appId);  // read anew from here on

    if (pkg.type == PKG_JOB_UNINSTALL) {
      KLOG(DLOG_ERROR, "#8");
      m_onAppUninstalled(appId.c_str());
    } else if (pkg.type == PKG_JOB_UPDATE) {
      KLOG(DLOG_ERROR, "#9");
      boost::shared_ptr<GameBoxData> box(new GameBoxData);
      if (!_GetAppInfo(appId, box)) continue;
      // An update that disables an application takes it off the launcher,
      // whatever the policy says. The policy is asked by package, on purpose.
      if (!box->isEnabled) {
        m_onAppUninstalled(appId.c_str());
      } else if (!SystemInfo::IsMdmEnabled() || IsMDMAllowed(pkg.pkgId)) {
        m_onAppUpdated(appId.c_str());
      }
    } else if (pkg.type == PKG_JOB_INSTALL) {
      boost::shared_ptr<GameBoxData> box(new GameBoxData);
      if (!_GetAppInfo(appId, box)) continue;
      if (SystemInfo::IsMdmEnabled()) {
        if (box->isEnabled && IsMDMAllowed(pkg.pkgId)) m_onAppInstalled(appId.c_str());
      } else {
        KLOG(DLOG_ERROR, "appId[%s] mdm is not enabled", appId.c_str());
        if (box->isEnabled) m_onAppInstalled(appId.c_str());
      }
    }
  }

  if (pkg.type == PKG_JOB_UNINSTALL) {
    std::vector<std::string> deactivated = _GetDeactivatedAppIds();
    if (!deactivated.empty()) m_onDeactivatedAppIds(deactivated);
  }
  return true;
}
