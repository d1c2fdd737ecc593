// The installed packages as the control interface sees them: adding, finding
// and removing them, and installs, updates and uninstalls that change the
// device between the events a listening client hears, in the platform's order.
#include <package_manager.h>

#include <algorithm>

#include "state.h"

namespace sim {

namespace {

const int kProcessingProgress = 60;

const size_t kNowhere = static_cast<size_t>(-1);

// Adds the package at |p| of the list, behind every other: an application id
// already known keeps its first place.
void IndexPackage(PackageIndex& index, const Package& pkg, size_t p) {
  index.packages.emplace(pkg.id, p);
  for (size_t a = 0; a < pkg.apps.size(); ++a) {
    index.apps.emplace(pkg.apps[a].id, std::make_pair(p, a));
  }
}

// The index, fresh; NULL while packages are lent out to be changed in place.
const PackageIndex* Index() {
  State& state = TheState();
  PackageIndex& index = state.index;
  if (index.lent) return NULL;
  if (!index.fresh) {
    index.packages.clear();
    index.apps.clear();
    for (size_t p = 0; p < state.packages.size(); ++p) IndexPackage(index, state.packages[p], p);
    index.fresh = true;
  }
  return &index;
}

size_t PackageNamed(const std::string& pkgId) {
  const std::vector<Package>& packages = TheState().packages;
  if (const PackageIndex* index = Index()) {
    std::unordered_map<std::string, size_t>::const_iterator found = index->packages.find(pkgId);
    return found == index->packages.end() ? kNowhere : found->second;
  }
  for (size_t p = 0; p < packages.size(); ++p) {
    if (packages[p].id == pkgId) return p;
  }
  return kNowhere;
}

// Before a change the index does not follow: it is rebuilt when next asked.
void Changing() {
  TheState().index.fresh = false;
  TheState().index.lent = false;
}

bool SameIds(const Package& a, const Package& b) {
  if (a.id != b.id || a.apps.size() != b.apps.size()) return false;
  for (size_t i = 0; i < a.apps.size(); ++i) {
    if (a.apps[i].id != b.apps[i].id) return false;
  }
  return true;
}

// Takes the package at |p| out of a fresh index before it leaves the list, so
// that an uninstall among thousands of packages does not cost a rebuild.
void Unindex(State& state, size_t p) {
  PackageIndex& index = state.index;
  const std::vector<Package>& packages = state.packages;
  index.packages.erase(packages[p].id);
  std::vector<std::string> orphans;  // ids that may stand again further on
  for (const App& app : packages[p].apps) {
    auto found = index.apps.find(app.id);
    if (found == index.apps.end() || found->second.first != p) continue;
    index.apps.erase(found);
    orphans.push_back(app.id);
  }
  for (auto& entry : index.packages) {
    if (entry.second > p) --entry.second;
  }
  for (auto& entry : index.apps) {
    if (entry.second.first > p) --entry.second.first;
  }
  for (const std::string& id : orphans) {
    for (size_t q = p + 1; q < packages.size() && index.apps.count(id) == 0; ++q) {
      for (size_t a = 0; a < packages[q].apps.size(); ++a) {
        if (packages[q].apps[a].id == id) {
          index.apps.emplace(id, std::make_pair(q - 1, a));
          break;
        }
      }
    }
  }
}

// STARTED and PROCESSING, then |change| to the device, then COMPLETED.
template <typename Change>
void PlayOperation(const std::string& type, const std::string& pkgId, int eventType,
                   Change change) {
  DeliverPackageEvent(type, pkgId, eventType, PACKAGE_MANAGER_EVENT_STATE_STARTED, 0,
                      PACKAGE_MANAGER_ERROR_NONE);
  DeliverPackageEvent(type, pkgId, eventType, PACKAGE_MANAGER_EVENT_STATE_PROCESSING,
                      kProcessingProgress, PACKAGE_MANAGER_ERROR_NONE);
  change();
  DeliverPackageEvent(type, pkgId, eventType, PACKAGE_MANAGER_EVENT_STATE_COMPLETED, 100,
                      PACKAGE_MANAGER_ERROR_NONE);
}

}  // namespace

const Package* InstalledPackage(const std::string& pkgId) {
  size_t p = PackageNamed(pkgId);
  return p == kNowhere ? NULL : &TheState().packages[p];
}

std::pair<const Package*, const App*> InstalledApp(const std::string& appId) {
  const std::vector<Package>& packages = TheState().packages;
  if (const PackageIndex* index = Index()) {
    auto found = index->apps.find(appId);
    if (found == index->apps.end()) return std::pair<const Package*, const App*>(NULL, NULL);
    const Package& pkg = packages[found->second.first];
    return std::make_pair(&pkg, &pkg.apps[found->second.second]);
  }
  for (const Package& pkg : packages) {
    for (const App& app : pkg.apps) {
      if (app.id == appId) return std::make_pair(&pkg, &app);
    }
  }
  return std::pair<const Package*, const App*>(NULL, NULL);
}

app_info_s AppInfoOf(const Package& pkg, const App& app) { return AppInfoOf(pkg, App(app)); }

app_info_s AppInfoOf(const Package& pkg, App&& app) {
  bool enabled = app.enabled && !pkg.disabled;  // read before |app| is moved from
  return app_info_s{std::move(app), pkg.id, enabled, pkg.preload};
}

App GameApp(const std::string& appId, const std::string& label) {
  App app = PlainApp(appId, label);
  app.game = true;
  return app;
}

App PlainApp(const std::string& appId, const std::string& label) {
  App app;
  app.id = appId;
  app.label = label;
  app.icon = "/opt/usr/share/icons/default/small/" + appId + ".png";
  return app;
}

Package MakePackage(const std::string& pkgId, std::vector<App> apps) {
  Package pkg;
  pkg.id = pkgId;
  pkg.apps = std::move(apps);
  return pkg;
}

void Device::AddPackage(const Package& pkg) {
  State& state = TheState();
  size_t p = PackageNamed(pkg.id);
  if (p != kNowhere) {
    // An update that keeps the ids, the usual one, leaves the index as it is.
    if (!SameIds(state.packages[p], pkg)) Changing();
    state.packages[p] = pkg;
    return;
  }
  state.packages.push_back(pkg);
  if (state.index.fresh && !state.index.lent) {
    IndexPackage(state.index, state.packages.back(), state.packages.size() - 1);
  }
}

void Device::AddGame(const std::string& appId, const std::string& label) {
  AddPackage(MakePackage(appId, {GameApp(appId, label)}));
}

void Device::AddApp(const std::string& appId, const std::string& label) {
  AddPackage(MakePackage(appId, {PlainApp(appId, label)}));
}

bool Device::RemovePackage(const std::string& pkgId) {
  size_t p = PackageNamed(pkgId);
  if (p == kNowhere) return false;
  State& state = TheState();
  if (state.index.fresh && !state.index.lent) {
    Unindex(state, p);
  } else {
    Changing();
  }
  state.packages.erase(state.packages.begin() + p);
  return true;
}

const std::vector<Package>& Device::Packages() const { return TheState().packages; }

Package* Device::FindPackage(const std::string& pkgId) {
  Package* found = const_cast<Package*>(InstalledPackage(pkgId));
  if (found != NULL) TheState().index.lent = true;
  return found;
}

App* Device::FindApp(const std::string& appId) {
  App* found = const_cast<App*>(InstalledApp(appId).second);
  if (found != NULL) TheState().index.lent = true;
  return found;
}

// |pkg| is copied first: it may be a package of the device that a listener changes.
void Device::Install(const Package& pkg) {
  Package added = pkg;
  PlayOperation(added.type, added.id, PACKAGE_MANAGER_EVENT_TYPE_INSTALL,
                [&] { AddPackage(added); });
}

void Device::Update(const Package& pkg) {
  Package updated = pkg;
  PlayOperation(updated.type, updated.id, PACKAGE_MANAGER_EVENT_TYPE_UPDATE,
                [&] { AddPackage(updated); });
}

// |pkgId| is copied first: it may be the id of the package being removed.
bool Device::Uninstall(const std::string& pkgId) {
  std::string id = pkgId;
  const Package* pkg = InstalledPackage(id);
  if (pkg == NULL) return false;
  std::string type = pkg->type;
  PlayOperation(type, id, PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL, [&] { RemovePackage(id); });
  return true;
}

void Device::EmitPackageEvent(const std::string& type, const std::string& pkgId, int eventType,
                              int eventState, int progress, int error) {
  DeliverPackageEvent(type, pkgId, eventType, eventState, progress, error);
}

}  // namespace sim
