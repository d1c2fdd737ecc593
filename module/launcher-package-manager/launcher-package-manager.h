// LauncherPackageManager: the launcher's one contact with the platform's
// application and package managers. It reads an application's information
// (label, icon, package, flags) into a GameBoxData and keeps those readings in
// a cache shared with its callers, lists the installed games and the
// applications of one package, finds deactivated applications, and asks the
// device-management policy about an application.
//
// Results, never exceptions: platform failures are logged and come back as
// false or as an empty list. Operations with a leading underscore are
// internal steps that stay callable; static members ending in Cb (and the two
// lower-case callbacks) are handed to the platform. One thread at a time: the
// manager takes no lock.
#ifndef KORRIN_LAUNCHER_PACKAGE_MANAGER_LAUNCHER_PACKAGE_MANAGER_H_
#define KORRIN_LAUNCHER_PACKAGE_MANAGER_LAUNCHER_PACKAGE_MANAGER_H_

#include <E_DBus.h>
#include <app_info.h>
#include <package_manager.h>

#include <map>
#include <string>
#include <vector>

#include <boost/function.hpp>
#include <boost/shared_ptr.hpp>

#include "launcher-data-manager/game-data.h"

class LauncherPackageManager {
 public:
  // The kind of a package job. The numbering is the launcher's own, not the
  // platform's: install (1) and update (3) differ only in the value-2 bit.
  enum PkgJobType : int {
    PKG_JOB_NONE = 0,
    PKG_JOB_INSTALL = 1,
    PKG_JOB_UNINSTALL = 2,
    PKG_JOB_UPDATE = 3
  };

  // One package operation, from its start to its completion.
  struct PkgData {
    PkgData() : type(PKG_JOB_NONE), reserved(0) {}

    PkgJobType type;
    int reserved;  // kept in the record as the launcher has it; never used
    std::string pkgId;
    std::vector<std::string> appIds;
  };

  // Creates the listening package-manager client; m_pkgMgr stays null,
  // silently, when that fails.
  LauncherPackageManager();
  // Terminate(), then the callbacks (the fifth first), the cache, the paused
  // jobs and the pending jobs, in that order.
  virtual ~LauncherPackageManager();

  // ---- Package events and jobs.

  // Copies the five callbacks into their slots, then registers for package
  // events when there is a client. Always true: without a client the manager
  // simply never hears of packages.
  bool Initialize(const boost::function<void(const char*)>& onAppInstalled,
                  const boost::function<void(const char*)>& onAppUpdated,
                  const boost::function<void(const char*)>& onAppUninstalled,
                  const boost::function<void(std::vector<std::string>)>& onDeactivatedAppIds,
                  const boost::function<void(const char*)>& onStorageCardAppChanged);
  // The platform's event callback; the user data is the manager, to which all
  // seven arguments go on unchanged.
  static void _PkgMgrClientListenCb(const char* type, const char* package,
                                    package_manager_event_type_e event_type,
                                    package_manager_event_state_e event_state, int progress,
                                    package_manager_error_e error, void* user_data);
  // One package event: STARTED records a job for the package (replacing any
  // pending one), COMPLETED takes it out and processes it, or holds it back
  // while paused, FAILED drops it. Type and state values outside the
  // platform's enums are logged, never trusted.
  void OnClientListenCb(const char* type, const char* package,
                        package_manager_event_type_e event_type,
                        package_manager_event_state_e event_state, int progress,
                        package_manager_error_e error, void* user_data);
  // Holds completed jobs back until StartListenCb. Always true.
  bool PauseListenCb();
  // Stops holding back, then processes the held jobs in completion order,
  // until none is left or a callback pauses again. Always true.
  bool StartListenCb();
  // Turns one completed job (never null) into the callbacks of its
  // applications. Always true; boost::bad_function_call when a slot it must
  // fire is empty.
  bool _DoPkgJob(boost::shared_ptr<PkgData> job);
  // Unregisters the event callback and destroys the client. True when there
  // is no client left; false, logged, keeping the client, when either call
  // fails.
  bool Terminate();

  // ---- Storage card and boot signal.

  // Subscribes to the system bus's boot-done signal. True when subscribed
  // (already, or now); false, logged, with no connection kept, otherwise. The
  // launcher has one manager: the latest to subscribe is the one the signal
  // acts on. Subscribe once the callbacks are in place (after Initialize):
  // the signal fires m_onStorageCardAppChanged.
  bool _RegisterEdbusSignalHandler();
  // Drops the subscription and the connection, if any, and shuts e_dbus down
  // in every case.
  void UnregisterEdbusSignalHandler();
  // Records |status| (0: no card) and fires m_onStorageCardAppChanged for
  // every cached application marked as living on the card, by id.
  void OnMMCStatusChanged(int status);
  // The boot-done handler, once per subscription: reads the storage-card
  // status (no card when unreadable), hands it to OnMMCStatusChanged and
  // unsubscribes. The subscription carries no user data; a null |data| means
  // the manager that subscribed.
  static void _BootingDoneSignalCb(void* data, DBusMessage* message);

  // ---- Application information.

  // Fills |box| with the information of |appId|: from the cache when it holds
  // a record with a name and an icon path (the placement of |box| and its
  // appId stay as they were), otherwise read afresh. True when filled.
  bool GetAppInfo(std::string appId, boost::shared_ptr<GameBoxData> box);
  // Reads |appId| afresh, bypassing the cache (which the read still updates).
  bool GetAppName(std::string appId, boost::shared_ptr<GameBoxData> box);
  // Reads |appId| afresh. On success |box| itself becomes the cache entry of
  // its appId, so later changes the caller makes are seen through the cache.
  // A no-display application is refused: false, and |box| is untouched.
  bool _GetAppInfo(std::string appId, boost::shared_ptr<GameBoxData> box);
  // The same from an open application handle, which stays open.
  bool _GetAppInfo(app_info_h& info, boost::shared_ptr<GameBoxData> box);
  // Appends the ids of the enabled, displayable games to |appIds| and sorts
  // the whole of it. Fills the cache from the platform when it is empty, and
  // otherwise trusts it as it stands. False only when the platform query
  // could not be made.
  bool GetAppIdList(std::vector<std::string>& appIds);
  // The ids of the displayable applications of |pkgId|, or an empty list. The
  // listing stops at the package's first application that is not a game.
  std::vector<std::string> _GetAppIds(const char* pkgId);
  // Whether |appId| is a floating application or is declared to be launched
  // from the menu. False on any failure, and for an unknown application.
  bool _IsMenuLaunch(std::string appId);

  // Platform callbacks of the above. _GetAllAppsInfoCb: the user data is the
  // manager; caches every game it meets. _PkgMgrAppInfoGetListCb: the user
  // data is a std::vector<std::string>; stops at the first non-game.
  // _has_mini_app_cb and _app_metadata_list_cb: the user data is a bool set
  // on a match; both stop after the first call.
  static bool _GetAllAppsInfoCb(app_info_h info, void* user_data);
  static bool _PkgMgrAppInfoGetListCb(package_info_app_component_type_e type, const char* appId,
                                      void* user_data);
  static bool _has_mini_app_cb(app_info_h info, void* user_data);
  static bool _app_metadata_list_cb(const char* key, const char* value, void* user_data);

  // ---- Deactivated applications: never cached.

  // Hands the deactivated ids, when there are any, to m_onDeactivatedAppIds
  // (boost::bad_function_call if that slot is empty).
  void LoadDeactivatedAppList();
  // The ids of the displayable applications of the first deactivated package
  // whose applications could be listed.
  std::vector<std::string> _GetDeactivatedAppIds();
  // Fills the pkgId, iconPath and name of |box| for a deactivated |appId|, and
  // its pkgType when that can be read. False, |box| untouched, without a
  // package id or a label.
  bool _GetDeactivatedAppInfo(std::string appId, boost::shared_ptr<GameBoxData> box);
  // Fills the pkgType of |box|. False, |box| untouched, when it cannot be read.
  bool _GetDeactivatedPkgInfo(std::string appId, boost::shared_ptr<GameBoxData> box);

  // Platform callbacks of the above; the user data is a
  // std::vector<std::string> in each.
  static bool _PkgMgrDeactivatedPackageInfoGetListCb(package_info_h pkg, void* user_data);
  static bool _PkgMgrDeactivatedAppInfoGetListCb(package_info_app_component_type_e type,
                                                 const char* appId, void* user_data);
  static bool _PkgMgrDeactivatedAppInfoGetCb(app_info_h info, void* user_data);
  static bool _PkgMgrDeactivatedPkgInfoGetCb(app_info_h info, void* user_data);

  // ---- Device-management policy.

  // True unless the policy service answers that |appId| is not allowed; an
  // unreachable service allows everything.
  bool IsMDMAllowed(std::string appId);
  // True when policy checks are on and the service answers that |appId| is
  // restricted. The name is kept as the launcher calls it.
  bool IsMDMRestriected(std::string appId);

  // ---- Package jobs.
  std::map<std::string, boost::shared_ptr<PkgData> > m_pkgJobMap;  // started, not yet ended
  std::vector<boost::shared_ptr<PkgData> > m_pkgJobList;  // completed while paused, in order

  // ---- Application information last read, by application id. The records
  // are the very ones callers passed in.
  std::map<std::string, boost::shared_ptr<GameBoxData> > m_appInfoCache;

  // ---- Listening to package events.
  package_manager_h m_pkgMgr;  // null when creation failed or after Terminate
  boost::function<void(const char*)> m_onAppInstalled;
  boost::function<void(const char*)> m_onAppUpdated;
  boost::function<void(const char*)> m_onAppUninstalled;
  boost::function<void(std::vector<std::string>)> m_onDeactivatedAppIds;
  boost::function<void(const char*)> m_onStorageCardAppChanged;
  bool m_isListenPaused;

  // ---- Storage card and boot signal.
  E_DBus_Signal_Handler* m_bootSignalHandler;  // null when not subscribed
  E_DBus_Connection* m_dbusConnection;         // null when not connected
  bool m_isMmcInserted;                        // last status received
  // The manager the boot-done handler acts on, since the bus hands it no user
  // data: the latest to subscribe, until it unsubscribes or is destroyed.
  static LauncherPackageManager* s_bootSignalSubscriber;
};

#endif  // KORRIN_LAUNCHER_PACKAGE_MANAGER_LAUNCHER_PACKAGE_MANAGER_H_
