// The installed packages as the control interface sees them: adding, finding
// and removing them, and installs, updates and uninstalls that change the
// device between the events a listening client hears, in the platform's order.
#include <package_manager.h>

#include <algorithm>

#include "state.h"

namespace sim {

namespace {

const int kProcessingProgress = 60;

std::vector<Package>::iterator PackageNamed(const std::string& pkgId) {
  std::vector<Package>& packages = TheState().packages;
  return std::find_if(packages.begin(), packages.end(),
                      [&](const Package& pkg) { return pkg.id == pkgId; });
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
  std::vector<Package>::iterator found = PackageNamed(pkgId);
  return found == TheState().packages.end() ? NULL : &*found;
}

std::pair<const Package*, const App*> InstalledApp(const std::string& appId) {
  for (const Package& pkg : TheState().packages) {
    for (const App& app : pkg.apps) {
      if (app.id == appId) return std::make_pair(&pkg, &app);
    }
  }
  return std::pair<const Package*, const App*>(NULL, NULL);
}

app_info_s AppInfoOf(const Package& pkg, const App& app) {
  return app_info_s{app, pkg.id, app.enabled && !pkg.disabled, pkg.preload};
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
  std::vector<Package>::iterator found = PackageNamed(pkg.id);
  if (found != TheState().packages.end()) {
    *found = pkg;
  } else {
    TheState().packages.push_back(pkg);
  }
}

void Device::AddGame(const std::string& appId, const std::string& label) {
  AddPackage(MakePackage(appId, {GameApp(appId, label)}));
}

void Device::AddApp(const std::string& appId, const std::string& label) {
  AddPackage(MakePackage(appId, {PlainApp(appId, label)}));
}

bool Device::RemovePackage(const std::string& pkgId) {
  std::vector<Package>::iterator found = PackageNamed(pkgId);
  if (found == TheState().packages.end()) return false;
  TheState().packages.erase(found);
  return true;
}

const std::vector<Package>& Device::Packages() const { return TheState().packages; }

Package* Device::FindPackage(const std::string& pkgId) {
  return const_cast<Package*>(InstalledPackage(pkgId));
}

App* Device::FindApp(const std::string& appId) {
  return const_cast<App*>(InstalledApp(appId).second);
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
