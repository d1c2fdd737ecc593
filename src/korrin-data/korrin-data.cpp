// The data engine: the library's two long-lived managers, its entry points,
// and the five callbacks that carry package events from the package tracker
// into the layout store. It holds no data of its own.
//
// The managers are ordinary static objects of this one file, so their order
// is fixed: the store and the package tracker are built at load in that
// order, and at unload the tracker goes first (its destructor stops
// listening) and the store second (its destructor closes the database).
#include "korrin-data/korrin-data.h"

#include <algorithm>

#include "common/log.h"
#include "launcher-data-manager/grid.h"

typedef boost::shared_ptr<GameBoxData> BoxPtr;

namespace {

LauncherDataManager g_dataManager;
LauncherPackageManager g_packageManager;

std::string AppIdText(const char* appId) { return appId != NULL ? appId : ""; }

// ---- Install, update and storage card. None of these handlers logs.

// A new box at the end of the first menu, then the application's label and
// flags written into it. A box whose information cannot be read stays as
// placed.
void PlaceNewBox(const std::string& appId) {
  bool pageAdded = false;
  int boxId = g_dataManager.InsertBoxData(appId, pageAdded);
  if (boxId < 1) return;
  BoxPtr box = g_dataManager.GetMenuBoxData(boxId);
  if (g_packageManager.GetAppInfo(box->appId, box)) g_dataManager.UpdateBoxData(*box);
}

// The box of |appId| when it has one. When it has none, one is placed, as
// an install does, and an empty pointer comes back.
BoxPtr FindOrPlaceBox(const char* appId) {
  std::string id = AppIdText(appId);
  BoxPtr existing = g_dataManager.GetBoxDataByAppId(id);
  if (existing->boxId != 0) return existing;
  PlaceNewBox(id);
  return BoxPtr();
}

// An install of an application that is placed already only refreshes what
// the package tracker knows of it: the launcher's row is never touched.
void OnAppInstalled(const char* appId) {
  BoxPtr existing = FindOrPlaceBox(appId);
  if (existing) g_packageManager.GetAppInfo(existing->appId, existing);
}

// An update places an application that has no box, and otherwise writes its
// fresh label into the box where it stands.
void OnAppUpdated(const char* appId) {
  BoxPtr existing = FindOrPlaceBox(appId);
  if (existing && g_packageManager.GetAppInfo(existing->appId, existing)) {
    g_dataManager.UpdateBoxData(*existing);
  }
}

// Only makes the package tracker read the application afresh; nothing is
// written.
void OnStorageCardAppChanged(const char* appId) {
  BoxPtr box = g_dataManager.GetBoxDataByAppId(AppIdText(appId));
  g_packageManager.GetAppInfo(box->appId, box);
}

// The engine has nothing to do with the deactivated applications left after
// an uninstall.
void OnDeactivatedAppIds(std::vector<std::string>) {}

// ---- Uninstall.

// Adds |pageId| to the pages to compact; false when it is there already.
bool NoteAffectedPage(std::vector<int>& pages, int pageId) {
  if (std::find(pages.begin(), pages.end(), pageId) != pages.end()) return false;
  pages.push_back(pageId);
  return true;
}

// Deletes the application's shortcut boxes. The name is the launcher's own:
// its log lines carry it.
void _removeShortcut(const std::string& appId, std::vector<int>& pages) {
  std::vector<BoxPtr> shortcuts = g_dataManager.GetBoxDataListByAppId(appId, kShortcutBoxType);
  for (size_t i = 0; i < shortcuts.size(); ++i) {
    const GameBoxData& shortcut = *shortcuts[i];
    g_dataManager.DeleteBoxData(shortcut.boxId);
    g_dataManager.GetMenuBoxData(shortcut.parentId);  // read as the launcher does; unused
    if (!NoteAffectedPage(pages, shortcut.pageId)) KLOG(DLOG_WARN, "Do not add page");
  }
}

// Rewrites every box left on the page from its first cell, in reading order.
void CloseGaps(int pageId) {
  std::vector<BoxPtr> boxes = g_dataManager.GetBoxDataList(pageId);
  korrin::GridCursor cursor(korrin::kCompactionGrid, korrin::GridCursor::kStop);
  for (size_t i = 0; i < boxes.size(); ++i) {
    boxes[i]->col = cursor.col();
    boxes[i]->row = cursor.row();
    g_dataManager.UpdateBoxData(*boxes[i]);
    cursor.Advance();
  }
}

// Takes every box of the application off the layout, its ordinary box and
// its shortcuts, then closes the gaps on each page that lost one. Pages left
// empty stay, pages keep their numbers, folders are not dissolved.
void OnAppUninstalled(const char* appIdText) {
  std::string appId = AppIdText(appIdText);
  std::vector<int> pages;  // in the order first met
  BoxPtr box = g_dataManager.GetBoxDataByAppId(appId);
  if (box->boxId >= 1) {
    g_dataManager.DeleteBoxData(box->boxId);
    g_dataManager.GetMenuBoxData(box->parentId);  // read as the launcher does; unused
    if (!NoteAffectedPage(pages, box->pageId)) KLOG(DLOG_WARN, "Do not add page");
  }
  _removeShortcut(appId, pages);
  for (size_t i = 0; i < pages.size(); ++i) CloseGaps(pages[i]);
}

}  // namespace

namespace korrin {

LauncherDataManager& DataManager() { return g_dataManager; }

LauncherPackageManager& PackageManager() { return g_packageManager; }

}  // namespace korrin

// No step's result is looked at: even a store that failed to open leaves the
// listener running, as the launcher expects.
void data_engin_initialization(void) {
  boost::function<void(const char*)> onAppInstalled = OnAppInstalled;
  boost::function<void(const char*)> onAppUpdated = OnAppUpdated;
  boost::function<void(const char*)> onAppUninstalled = OnAppUninstalled;
  boost::function<void(std::vector<std::string>)> onDeactivatedAppIds = OnDeactivatedAppIds;
  boost::function<void(const char*)> onStorageCardAppChanged = OnStorageCardAppChanged;

  g_packageManager.Initialize(onAppInstalled, onAppUpdated, onAppUninstalled,
                              onDeactivatedAppIds, onStorageCardAppChanged);
  // Operations that complete while the store is built are held back, not lost.
  g_packageManager.PauseListenCb();
  g_dataManager.Initialize(g_packageManager);
  g_packageManager.StartListenCb();
}

void data_engin_uninitialization(void) {}

int korrin_data_probe(void) { return 1; }
