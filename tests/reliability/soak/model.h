// The soak's model: what the device holds, the package jobs the engine keeps,
// and the layout the engine must have stored after each step. It is written
// from the engine's described behaviour and shares no code with it, so that a
// difference between the two is a finding in one or the other.
#ifndef KORRIN_TESTS_SOAK_MODEL_H_
#define KORRIN_TESTS_SOAK_MODEL_H_

#include <package_manager.h>

#include <algorithm>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "cli.h"
#include "sim/device.h"
#include "views.h"

namespace soak {

// A box as stored, "" as NULL. A shortcut (box type 3) carries the texts.
struct Box {
  int pageId, col, row;
  std::string appId, name;
  bool preload, system;
  int boxType, launchType;
  std::string iconPath, content;
};

class Model {
 public:
  // ---- The steps, as the device and the launcher make them.

  // An install or update: the device's STARTED, the package, COMPLETED.
  void Install(const sim::Package& pkg, int type) {
    Event(pkg.id, type, PACKAGE_MANAGER_EVENT_STATE_STARTED);
    packages[pkg.id] = pkg;
    Event(pkg.id, type, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
  }
  void Uninstall(const std::string& pkgId) {
    Event(pkgId, PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL, PACKAGE_MANAGER_EVENT_STATE_STARTED);
    packages.erase(pkgId);
    Event(pkgId, PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
  }
  // A start replaces the package's pending job; an uninstall names its
  // applications there, while they can still be read. A completion without
  // a start, PROCESSING and unknown states change nothing.
  void Event(const std::string& pkgId, int type, int state) {
    if (!started) return;  // nobody listens yet
    if (state == PACKAGE_MANAGER_EVENT_STATE_STARTED) {
      jobs[pkgId] = Job{pkgId, type, {}};
      if (type == PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL) jobs[pkgId].apps = EventApps(pkgId);
    } else if (state == PACKAGE_MANAGER_EVENT_STATE_COMPLETED && jobs.count(pkgId)) {
      held.push_back(jobs[pkgId]);
      jobs.erase(pkgId);
      if (!paused) Listen();
    } else if (state == PACKAGE_MANAGER_EVENT_STATE_FAILED) {
      jobs.erase(pkgId);
    }
  }
  // Listening pauses while the store is filled. The first time, every
  // displayable, enabled game, any kind of application, is laid out in byte
  // order of id, four to a row on page 1, its box holding only the id; then
  // |meanwhile| (unless null) is installed.
  void Start(const sim::Package* meanwhile) {
    paused = true;
    std::set<std::string> games;
    for (const auto& pkg : packages) {
      for (const sim::App& app : pkg.second.apps) {
        if (!started && app.game && !app.noDisplay && app.enabled && !pkg.second.disabled) {
          games.insert(app.id);
        }
      }
    }
    int i = 0;
    for (const std::string& appId : games) {
      if (i == 0) AddPage(1);
      AddBox(Box{nextPageId - 1, i % 4 + 1, i / 4 + 1, appId, "", false, false, 0, 0, "", ""});
      ++i;
    }
    started = true;
    if (meanwhile) Install(*meanwhile, PACKAGE_MANAGER_EVENT_TYPE_INSTALL);
    Listen();
  }
  // Held jobs run in the order they completed.
  void Listen() {
    paused = false;
    std::vector<Job> run;
    run.swap(held);
    for (const Job& job : run) Run(job);
  }
  void AddPage(int pageNo) { pages[nextPageId++] = pageNo; }
  void AddBox(const Box& box) { boxes[nextBoxId++] = box; }

  // The tables as the engine must have stored them; none before the start.
  korrin_sim::Snapshot Expected() const {
    korrin_sim::Snapshot s;
    if (!started) return s;
    auto n = [](int value) { return std::to_string(value); };
    auto text = [](const std::string& t) { return t.empty() ? "NULL" : korrin_sim::Quote(t); };
    s.tables["Menus"] = {{"menuId", "name", "type"}, {{1, {"1", "\"Apps\"", "0"}}}};
    korrin_sim::Snapshot::Table& p = s.tables["Pages"];
    p.columns = {"pageId", "isFolder", "parentId", "pageNo"};
    for (const auto& page : pages) p.rows[page.first] = {n(page.first), "0", "1", n(page.second)};
    korrin_sim::Snapshot::Table& b = s.tables["Boxes"];
    b.columns = {"boxId", "isFolder", "pageParentId", "pageId", "appId", "name", "col",
                 "row", "isPreload", "isSystem", "boxType", "launchType", "iconPath", "content"};
    for (const auto& e : boxes) {
      const Box& x = e.second;
      b.rows[e.first] = {n(e.first), "0", "NULL", n(x.pageId), text(x.appId), text(x.name),
                         n(x.col), n(x.row), n(x.preload), n(x.system), n(x.boxType),
                         n(x.launchType), text(x.iconPath), text(x.content)};
    }
    return s;
  }

  // ---- The state, which the generator reads.
  struct Job {
    std::string pkgId;
    int type;
    std::vector<sim::App> apps;  // an uninstall's
  };
  std::map<std::string, sim::Package> packages;  // on the device
  bool started = false, paused = false;
  std::map<std::string, Job> jobs;  // started, by package
  std::map<int, int> pages;         // menu 1's: pageId -> pageNo
  std::map<int, Box> boxes;

 private:
  // The UI applications of the package up to the first that is not a game,
  // leaving out the hidden ones.
  std::vector<sim::App> EventApps(const std::string& pkgId) const {
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

  // A job reads the device as it is when it runs: for a held job, at the
  // replay. A new game gets a box with its label and flags; an update also
  // rewrites those of a placed one, or takes it away when it disables it. A
  // missing label keeps the name.
  void Run(const Job& job) {
    bool update = job.type == PACKAGE_MANAGER_EVENT_TYPE_UPDATE;
    if (job.type == PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL) {
      for (const sim::App& app : job.apps) Uninstalled(app.id);
    } else if (update || job.type == PACKAGE_MANAGER_EVENT_TYPE_INSTALL) {
      for (const sim::App& app : EventApps(job.pkgId)) {
        const sim::Package& pkg = packages.at(job.pkgId);
        bool enabled = app.enabled && !pkg.disabled;
        if (!enabled && update) Uninstalled(app.id);
        auto placed = std::find_if(boxes.begin(), boxes.end(), [&](const std::pair<const int, Box>& b) {
          return b.second.appId == app.id && b.second.boxType != 3;
        });
        if (!enabled || (placed != boxes.end() && !update)) continue;
        Box& box = placed != boxes.end() ? placed->second : Place(app.id);
        if (app.label) box.name = *app.label;
        box.preload = pkg.preload;
        box.system = pkg.system;
      }
    }
  }

  // Its box and its shortcuts go, and each page that lost one is filled
  // again from its first cell, four to a row, in reading order.
  void Uninstalled(const std::string& appId) {
    std::set<int> affected;
    for (auto b = boxes.begin(); b != boxes.end();) {
      if (b->second.appId == appId) affected.insert(b->second.pageId);
      b = b->second.appId == appId ? boxes.erase(b) : std::next(b);
    }
    for (int pageId : affected) {
      std::map<std::pair<int, int>, Box*> left;  // by (row, col)
      for (auto& b : boxes) {
        if (b.second.pageId == pageId) left[{b.second.row, b.second.col}] = &b.second;
      }
      int i = 0;
      for (auto& b : left) {
        b.second->col = i % 4 + 1;
        b.second->row = i++ / 4 + 1;
      }
    }
  }

  // A new box goes after the last box of the last page of menu 1, on a first
  // page when there is none; never into a free cell.
  Box& Place(const std::string& appId) {
    if (pages.empty()) AddPage(1);
    int last = std::max_element(pages.begin(), pages.end(), [](const std::pair<const int, int>& a,
                                                                const std::pair<const int, int>& b) {
                 return a.second < b.second;
               })->first;
    std::pair<int, int> cell(1, 0);  // (row, col): before the first cell
    for (const auto& b : boxes) {
      if (b.second.pageId == last) cell = std::max(cell, {b.second.row, b.second.col});
    }
    if (++cell.second > 4) cell = {cell.first + 1, 1};
    AddBox(Box{last, cell.second, cell.first, appId, "", false, false, 0, 0, "", ""});
    return boxes.rbegin()->second;
  }

  std::vector<Job> held;  // completed while paused
  int nextPageId = 1, nextBoxId = 1;
};

}  // namespace soak

#endif  // KORRIN_TESTS_SOAK_MODEL_H_
