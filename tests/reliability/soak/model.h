// The soak's model: what the device holds, the package jobs the engine keeps,
// and the tables the engine must have stored after each step. It is written
// from the engine's described behaviour and shares no code with it, so that a
// difference between the two is a finding in one or the other.
#ifndef KORRIN_TESTS_SOAK_MODEL_H_
#define KORRIN_TESTS_SOAK_MODEL_H_

#include <package_manager.h>

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
  // An install or update (|pkg| the new contents) or an uninstall (none):
  // the device's STARTED, the change, COMPLETED.
  void Send(const std::string& pkgId, int type, const sim::Package* pkg) {
    Event(pkgId, type, PACKAGE_MANAGER_EVENT_STATE_STARTED);
    if (pkg) packages[pkgId] = *pkg;
    if (!pkg) packages.erase(pkgId);
    Event(pkgId, type, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
  }
  // A start replaces the package's pending job; an uninstall names its
  // applications there, while they can still be read. A completion without a
  // start, PROCESSING and unknown states change nothing.
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
  // displayable, enabled game (of any component) is laid out by id, in byte
  // order, four to a row on page 1, its box holding only the id; |meanwhile|
  // (unless null) is installed once they are listed.
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
    if (!games.empty()) pages = 1;
    for (const std::string& appId : games) {
      int i = static_cast<int>(boxes.size());
      boxes[++lastBoxId] = Box{1, i % 4 + 1, i / 4 + 1, appId, "", 0, 0, 0, 0, "", ""};
    }
    started = true;
    if (meanwhile) Send(meanwhile->id, PACKAGE_MANAGER_EVENT_TYPE_INSTALL, meanwhile);
    Listen();
  }
  // Held jobs run in the order they completed.
  void Listen() {
    paused = false;
    std::vector<Job> run;
    run.swap(held);
    for (const Job& job : run) Run(job);
  }

  // The tables as the engine must have stored them; none before the start.
  korrin_sim::Snapshot Expected() const {
    korrin_sim::Snapshot s;
    if (!started) return s;
    auto n = [](int value) { return std::to_string(value); };
    auto text = [](const std::string& t) { return t.empty() ? "NULL" : korrin_sim::Quote(t); };
    s.tables["Menus"] = {{"menuId", "name", "type"}, {{1, {"1", "\"Apps\"", "0"}}}};
    s.tables["Pages"].columns = {"pageId", "isFolder", "parentId", "pageNo"};
    for (int id = 1; id <= pages; ++id) s.tables["Pages"].rows[id] = {n(id), "0", "1", n(id)};
    s.tables["Boxes"].columns = {"boxId", "isFolder", "pageParentId", "pageId", "appId", "name",
                                 "col", "row", "isPreload", "isSystem", "boxType", "launchType",
                                 "iconPath", "content"};
    for (const auto& e : boxes) {
      const Box& b = e.second;
      s.tables["Boxes"].rows[e.first] = {
          n(e.first), "0", "NULL", n(b.pageId), text(b.appId), text(b.name), n(b.col), n(b.row),
          n(b.preload), n(b.system), n(b.boxType), n(b.launchType), text(b.iconPath), text(b.content)};
    }
    return s;
  }

  // ---- The state, which the generator reads and the launcher's own steps
  // change: the stream adds menu 1's pages in number order and none goes, so
  // page k has pageId k and pageNo k.
  struct Job {
    std::string pkgId;
    int type;
    std::vector<sim::App> apps;  // an uninstall's
  };
  std::map<std::string, sim::Package> packages;  // on the device
  bool started = false, paused = false;
  std::map<std::string, Job> jobs;  // started, by package
  int pages = 0, lastBoxId = 0;
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
  // replay. A new game gets a box after the last box of the last page (never
  // in a free cell) with its label and flags; an update also rewrites those
  // of a placed one, or takes it away when it disables it. A missing label
  // keeps the name.
  void Run(const Job& job) {
    bool update = job.type == PACKAGE_MANAGER_EVENT_TYPE_UPDATE;
    if (job.type == PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL) {
      for (const sim::App& app : job.apps) Uninstalled(app.id);
    }
    if (!update && job.type != PACKAGE_MANAGER_EVENT_TYPE_INSTALL) return;
    for (const sim::App& app : EventApps(job.pkgId)) {
      const sim::Package& pkg = packages.at(job.pkgId);
      bool enabled = app.enabled && !pkg.disabled;
      if (!enabled && update) Uninstalled(app.id);
      Box* box = NULL;
      std::pair<int, int> last(1, 0);  // (row, col) on the last page: before its first cell
      for (auto& b : boxes) {
        if (b.second.appId == app.id && b.second.boxType != 3) box = &b.second;
        if (b.second.pageId == pages) last = std::max(last, {b.second.row, b.second.col});
      }
      if (!enabled || (box && !update)) continue;
      if (!box) {
        if (++last.second > 4) last = {last.first + 1, 1};
        pages = std::max(pages, 1);  // a first page when the menu has none
        box = &(boxes[++lastBoxId] =
                    Box{pages, last.second, last.first, app.id, "", 0, 0, 0, 0, "", ""});
      }
      if (app.label) box->name = *app.label;
      box->preload = pkg.preload;
      box->system = pkg.system;
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

  std::vector<Job> held;  // completed while paused
};

}  // namespace soak

#endif  // KORRIN_TESTS_SOAK_MODEL_H_
