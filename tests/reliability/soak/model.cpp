#include "reliability/soak/model.h"

#include <package_manager.h>

#include <algorithm>
#include <set>

#include "cli.h"

namespace soak {

namespace {

const int kColumns = 4;
const int kShortcut = 3;

std::string Int(int value) { return std::to_string(value); }
std::string Text(const std::string& text) {
  return text.empty() ? "NULL" : korrin_sim::Quote(text);
}

}  // namespace

void Model::Install(const sim::Package& pkg, int type) {
  Event(pkg.id, type, PACKAGE_MANAGER_EVENT_STATE_STARTED);
  Put(pkg);
  Event(pkg.id, type, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
}

void Model::Uninstall(const std::string& pkgId) {
  Event(pkgId, PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL, PACKAGE_MANAGER_EVENT_STATE_STARTED);
  Remove(pkgId);
  Event(pkgId, PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
}

// A start replaces a pending job of the package; a completion without one,
// PROCESSING and unknown states change nothing.
void Model::Event(const std::string& pkgId, int type, int state) {
  if (!started) return;  // nobody listens yet
  if (state == PACKAGE_MANAGER_EVENT_STATE_STARTED) {
    bool uninstall = type == PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL;
    jobs[pkgId] = Job{pkgId, type, uninstall ? EventApps(pkgId) : std::vector<sim::App>()};
  } else if (state == PACKAGE_MANAGER_EVENT_STATE_COMPLETED && jobs.count(pkgId)) {
    Job job = jobs[pkgId];
    jobs.erase(pkgId);
    if (paused) {
      held.push_back(job);
    } else {
      Run(job);
    }
  } else if (state == PACKAGE_MANAGER_EVENT_STATE_FAILED) {
    jobs.erase(pkgId);
  }
}

// Listening is paused while the store is filled. A first launch lays out
// every displayable, enabled game, any kind of application, in byte order of
// id, four to a row on page 1, their boxes holding nothing but the id.
void Model::Start(const sim::Package* meanwhile) {
  paused = true;
  if (!started) {
    std::set<std::string> games;
    for (const auto& entry : packages) {
      for (const sim::App& app : entry.second.apps) {
        if (app.game && !app.noDisplay && app.enabled && !entry.second.disabled) {
          games.insert(app.id);
        }
      }
    }
    int i = 0;
    for (const std::string& appId : games) {
      if (i == 0) AddPage(1);
      AddBox(Box{nextPageId - 1, i % kColumns + 1, i / kColumns + 1, appId, "", false, false, 0,
                 0, "", ""});
      ++i;
    }
  }
  started = true;
  if (meanwhile) Install(*meanwhile, PACKAGE_MANAGER_EVENT_TYPE_INSTALL);
  Listen();
}

void Model::Listen() {
  paused = false;
  std::vector<Job> jobs;
  jobs.swap(held);
  for (const Job& job : jobs) Run(job);
}

// The UI applications of the package up to the first that is not a game,
// leaving out the hidden ones.
std::vector<sim::App> Model::EventApps(const std::string& pkgId) const {
  std::vector<sim::App> apps;
  auto pkg = packages.find(pkgId);
  for (size_t i = 0; pkg != packages.end() && i < pkg->second.apps.size(); ++i) {
    const sim::App& app = pkg->second.apps[i];
    if (app.component != PACKAGE_INFO_UIAPP) continue;
    if (!app.game) break;
    if (!app.noDisplay) apps.push_back(app);
  }
  return apps;
}

// A job reads the device as it is when it runs, which for a held job is at
// the replay. A new game gets a box with its label and flags; an update also
// rewrites those of a placed one, or takes it away when it disables it. A
// missing label keeps the name.
void Model::Run(const Job& job) {
  if (job.type == PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL) {
    for (const sim::App& app : job.apps) Uninstalled(app.id);
    return;
  }
  bool update = job.type == PACKAGE_MANAGER_EVENT_TYPE_UPDATE;
  if (!update && job.type != PACKAGE_MANAGER_EVENT_TYPE_INSTALL) return;
  for (const sim::App& app : EventApps(job.pkgId)) {
    const sim::Package& pkg = packages.at(job.pkgId);
    bool enabled = app.enabled && !pkg.disabled;
    if (!enabled && update) Uninstalled(app.id);
    if (!enabled) continue;
    auto placed = std::find_if(boxes.begin(), boxes.end(), [&](const std::pair<const int, Box>& b) {
      return b.second.appId == app.id && b.second.boxType != kShortcut;
    });
    if (placed != boxes.end() && !update) continue;
    Box& box = placed != boxes.end() ? placed->second : Place(app.id);
    if (app.label) box.name = *app.label;
    box.preload = pkg.preload;
    box.system = pkg.system;
  }
}

// Its box and its shortcuts go, and each page that lost one is filled again
// from its first cell, four to a row, in reading order.
void Model::Uninstalled(const std::string& appId) {
  std::set<int> affected;
  for (auto b = boxes.begin(); b != boxes.end();) {
    if (b->second.appId != appId) {
      ++b;
      continue;
    }
    affected.insert(b->second.pageId);
    b = boxes.erase(b);
  }
  for (int pageId : affected) {
    std::vector<std::pair<std::pair<int, int>, Box*> > left;  // by (row, col)
    for (auto& b : boxes) {
      if (b.second.pageId == pageId) left.push_back({{b.second.row, b.second.col}, &b.second});
    }
    std::sort(left.begin(), left.end());
    for (size_t i = 0; i < left.size(); ++i) {
      left[i].second->col = static_cast<int>(i) % kColumns + 1;
      left[i].second->row = static_cast<int>(i) / kColumns + 1;
    }
  }
}

// A new box goes after the last box of the last page of menu 1, on a first
// page when there is none; never into a free cell.
Box& Model::Place(const std::string& appId) {
  if (pages.empty()) AddPage(1);
  auto last = std::max_element(pages.begin(), pages.end(),
                               [](const std::pair<const int, int>& a,
                                  const std::pair<const int, int>& b) { return a.second < b.second; });
  std::pair<int, int> cell(1, 0);  // (row, col): before the first cell
  for (const auto& b : boxes) {
    if (b.second.pageId == last->first) cell = std::max(cell, {b.second.row, b.second.col});
  }
  if (++cell.second > kColumns) cell = {cell.first + 1, 1};
  int boxId = nextBoxId;
  AddBox(Box{last->first, cell.second, cell.first, appId, "", false, false, 0, 0, "", ""});
  return boxes[boxId];
}

korrin_sim::Snapshot Model::Expected() const {
  korrin_sim::Snapshot s;
  if (!started) return s;
  s.tables["Menus"] = {{"menuId", "name", "type"}, {{1, {"1", "\"Apps\"", "0"}}}};
  korrin_sim::Snapshot::Table& p = s.tables["Pages"];
  p.columns = {"pageId", "isFolder", "parentId", "pageNo"};
  for (const auto& page : pages) p.rows[page.first] = {Int(page.first), "0", "1", Int(page.second)};
  korrin_sim::Snapshot::Table& b = s.tables["Boxes"];
  b.columns = {"boxId", "isFolder", "pageParentId", "pageId", "appId", "name", "col",
               "row", "isPreload", "isSystem", "boxType", "launchType", "iconPath", "content"};
  for (const auto& entry : boxes) {
    const Box& x = entry.second;
    b.rows[entry.first] = {Int(entry.first), "0", "NULL", Int(x.pageId), Text(x.appId),
                           Text(x.name), Int(x.col), Int(x.row), Int(x.preload), Int(x.system),
                           Int(x.boxType), Int(x.launchType), Text(x.iconPath), Text(x.content)};
  }
  return s;
}

}  // namespace soak
