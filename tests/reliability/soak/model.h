// The soak's model: what the device holds, the package jobs the engine keeps,
// and the layout the engine must have stored after each step. It is written
// from the engine's described behaviour and shares no code with it, so that a
// difference between the two is a finding in one or the other.
#ifndef KORRIN_TESTS_SOAK_MODEL_H_
#define KORRIN_TESTS_SOAK_MODEL_H_

#include <map>
#include <string>
#include <vector>

#include "sim/device.h"
#include "views.h"

namespace soak {

// A box as stored; "" is stored as NULL. A shortcut (box type 3) carries the
// two texts.
struct Box {
  int pageId, col, row;
  std::string appId, name;
  bool preload, system;
  int boxType, launchType;
  std::string iconPath, content;
};

// A package operation from its start; an uninstall names its applications
// there, while they can still be read.
struct Job {
  std::string pkgId;
  int type;
  std::vector<sim::App> apps;
};

class Model {
 public:
  // ---- The steps, as the device and the launcher make them.
  void Put(const sim::Package& pkg) { packages[pkg.id] = pkg; }  // no event
  void Remove(const std::string& pkgId) { packages.erase(pkgId); }
  void Install(const sim::Package& pkg, int type);  // install or update, with events
  void Uninstall(const std::string& pkgId);
  void Event(const std::string& pkgId, int type, int state);
  // data_engin_initialization(): the first time, a first launch during which
  // |meanwhile| (unless null) is installed.
  void Start(const sim::Package* meanwhile);
  void Pause() { paused = true; }
  void Listen();
  void AddPage(int pageNo) { pages[nextPageId++] = pageNo; }
  void AddBox(const Box& box) { boxes[nextBoxId++] = box; }

  // The tables as the engine must have stored them; none before the start.
  korrin_sim::Snapshot Expected() const;

  // ---- The state, which the generator reads.
  std::map<std::string, sim::Package> packages;  // on the device
  bool started = false, paused = false;
  std::map<std::string, Job> jobs;  // started, by package
  std::map<int, int> pages;         // menu 1's, pageId -> pageNo
  std::map<int, Box> boxes;

 private:
  std::vector<sim::App> EventApps(const std::string& pkgId) const;
  void Run(const Job& job);
  void Uninstalled(const std::string& appId);
  Box& Place(const std::string& appId);

  std::vector<Job> held;  // completed while paused
  int nextPageId = 1, nextBoxId = 1;
};

}  // namespace soak

#endif  // KORRIN_TESTS_SOAK_MODEL_H_
