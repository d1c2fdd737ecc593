// The soak's model: what the device holds, the package jobs the engine keeps,
// and the layout the engine must have stored after each step. It is written
// from the engine's described behaviour and shares no code with it, so that a
// difference between the two is a finding in one or the other.
#ifndef KORRIN_TESTS_SOAK_MODEL_H_
#define KORRIN_TESTS_SOAK_MODEL_H_

#include <cstdint>
#include <iosfwd>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "sim/device.h"
#include "reliability/soak/steps.h"

namespace soak {

typedef std::optional<int64_t> Int;        // none: SQL NULL
typedef std::optional<std::string> Text;  // none: SQL NULL

// One row of each table, every column as stored.
struct MenuRow {
  Int menuId;
  Text name;
  Int type;
};
struct PageRow {
  Int pageId, isFolder, parentId, pageNo;
};
struct BoxRow {
  Int boxId, isFolder, pageParentId, pageId;
  Text appId, name;
  Int col, row, isPreload, isSystem, boxType, launchType;
  Text iconPath, content;
};

bool operator==(const MenuRow& a, const MenuRow& b);
bool operator==(const PageRow& a, const PageRow& b);
bool operator==(const BoxRow& a, const BoxRow& b);

// The three tables, each by id.
struct Layout {
  std::vector<MenuRow> menus;
  std::vector<PageRow> pages;
  std::vector<BoxRow> boxes;
};

bool operator==(const Layout& a, const Layout& b);
inline bool operator!=(const Layout& a, const Layout& b) { return !(a == b); }

// Every row of both layouts, matched by table and id: rows that agree once,
// rows that differ as "- model" and "+ database" lines.
void PrintDiff(const Layout& model, const Layout& database, std::ostream& out);

class Model {
 public:
  Model();

  void Apply(const Step& step);
  // The tables as the engine must have stored them; empty before the start.
  Layout Expected() const;

  // ---- What the generator may look at.
  const std::vector<sim::Package>& Packages() const { return m_packages; }
  const sim::Package* Find(const std::string& pkgId) const;
  bool Started() const { return m_started; }
  bool Paused() const { return m_paused; }
  // Packages whose operation started and has not ended.
  std::vector<std::string> Pending() const;
  // The pages of menu 1 by number, and what their cells hold.
  std::vector<int> MenuPages() const;
  int PageNo(int pageId) const { return m_pageNo.at(pageId); }
  int LastRow(int pageId) const;  // 0 on an empty page
  bool Occupied(int pageId, int col, int row) const;

 private:
  struct Job {
    int kind;  // 0 unknown, 1 install, 2 uninstall, 3 update
    std::string pkgId;
    std::vector<std::string> appIds;
  };
  struct Box {
    int pageId;
    std::string appId;
    int col, row;
    std::string name;  // "" is stored as NULL, as are the texts below
    bool preload, system;
    int boxType, launchType;  // 3: a shortcut, which carries the two texts
    std::string iconPath, content;
  };
  typedef std::pair<int, int> Cell;  // (row, col): reading order

  static Step InstallOf(const sim::Package& pkg);

  // ---- The device.
  void Put(const sim::Package& pkg);
  void Remove(const std::string& pkgId);
  // The ids a package's event yields: its UI applications in order, up to
  // the first that is not a game, leaving out the hidden ones.
  std::vector<std::string> EventAppIds(const std::string& pkgId) const;
  const sim::App* FindApp(const std::string& appId, const sim::Package** pkg) const;

  // ---- The engine.
  void FirstLaunch();
  void Event(const std::string& pkgId, int type, int state);
  void Replay();
  void Run(const Job& job);
  void Installed(const std::string& appId, bool update);
  void Uninstalled(const std::string& appId);
  // A new box after the last box of the last page of menu 1.
  int Place(const std::string& appId);
  int Add(const Box& box);
  int NewPage(int pageNo);
  void Compact(int pageId);

  std::vector<sim::Package> m_packages;  // in the device's order
  bool m_started, m_paused;
  std::map<std::string, Job> m_pending;
  std::vector<Job> m_held;

  // ---- The layout: menu 1 and its pages, boxes by id and by cell.
  std::map<int, int> m_pageNo;                    // pageId -> pageNo
  std::map<int, std::map<Cell, int> > m_cells;   // pageId -> cell -> boxId
  std::map<int, Box> m_boxes;
  std::map<std::string, int> m_boxOf;  // appId -> boxId of its ordinary box
  std::multimap<std::string, int> m_shortcuts;  // appId -> boxId
  int m_nextPageId, m_nextBoxId;
};

}  // namespace soak

#endif  // KORRIN_TESTS_SOAK_MODEL_H_
