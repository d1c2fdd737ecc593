#include "reliability/soak/model.h"

#include <package_manager.h>

#include <algorithm>
#include <cstdint>
#include <ostream>
#include <set>

namespace soak {

namespace {

// The grid of a menu page: four columns, and so many rows that a page never
// fills in practice.
const int kColumns = 4;
const int kMaxRows = 40000;
const int kMenuId = 1;

std::string Show(const Int& value) {
  if (!value) return "NULL";
  if (*value == INT64_MIN) return "?";  // stored as something other than an integer
  return std::to_string(*value);
}

std::string Show(const Text& value) {
  if (!value) return "NULL";
  std::string text = "\"";
  for (char c : *value) text += c == '"' || c == '\\' ? std::string("\\") + c : std::string(1, c);
  return text + "\"";
}

std::string Render(const MenuRow& m) {
  return "menu " + Show(m.menuId) + " " + Show(m.name) + " type " + Show(m.type);
}

std::string Render(const PageRow& p) {
  return "page " + Show(p.pageId) + " isFolder " + Show(p.isFolder) + " parent " +
         Show(p.parentId) + " no " + Show(p.pageNo);
}

// The columns the engine only ever writes as 0 or NULL for an application
// box are shown only when they hold something else.
std::string Render(const BoxRow& b) {
  std::string text = "box " + Show(b.boxId) + " page " + Show(b.pageId) + " (" + Show(b.col) +
                     "," + Show(b.row) + ") " + Show(b.appId) + " " + Show(b.name) +
                     " preload " + Show(b.isPreload) + " system " + Show(b.isSystem);
  if (b.isFolder != Int(0)) text += " isFolder " + Show(b.isFolder);
  if (b.pageParentId) text += " pageParentId " + Show(b.pageParentId);
  if (b.boxType != Int(0)) text += " boxType " + Show(b.boxType);
  if (b.launchType != Int(0)) text += " launchType " + Show(b.launchType);
  if (b.iconPath) text += " iconPath " + Show(b.iconPath);
  if (b.content) text += " content " + Show(b.content);
  return text;
}

Text OrNull(const std::string& text) { return text.empty() ? Text() : Text(text); }

Int KeyOf(const MenuRow& row) { return row.menuId; }
Int KeyOf(const PageRow& row) { return row.pageId; }
Int KeyOf(const BoxRow& row) { return row.boxId; }

// Both sides are in id order; a row without an id sorts first.
template <typename Row>
void DiffTable(const std::vector<Row>& model, const std::vector<Row>& database,
               std::ostream& out) {
  size_t m = 0, d = 0;
  while (m < model.size() || d < database.size()) {
    bool takeModel = d == database.size() ||
                     (m < model.size() && KeyOf(model[m]) < KeyOf(database[d]));
    bool takeDatabase = m == model.size() ||
                        (d < database.size() && KeyOf(database[d]) < KeyOf(model[m]));
    if (takeModel) {
      out << "- " << Render(model[m++]) << "\n";
    } else if (takeDatabase) {
      out << "+ " << Render(database[d++]) << "\n";
    } else if (model[m] == database[d]) {
      out << "  " << Render(model[m]) << "\n";
      ++m, ++d;
    } else {
      out << "- " << Render(model[m++]) << "\n";
      out << "+ " << Render(database[d++]) << "\n";
    }
  }
}

}  // namespace

bool operator==(const MenuRow& a, const MenuRow& b) {
  return a.menuId == b.menuId && a.name == b.name && a.type == b.type;
}

bool operator==(const PageRow& a, const PageRow& b) {
  return a.pageId == b.pageId && a.isFolder == b.isFolder && a.parentId == b.parentId &&
         a.pageNo == b.pageNo;
}

bool operator==(const BoxRow& a, const BoxRow& b) {
  return a.boxId == b.boxId && a.isFolder == b.isFolder && a.pageParentId == b.pageParentId &&
         a.pageId == b.pageId && a.appId == b.appId && a.name == b.name && a.col == b.col &&
         a.row == b.row && a.isPreload == b.isPreload && a.isSystem == b.isSystem &&
         a.boxType == b.boxType && a.launchType == b.launchType && a.iconPath == b.iconPath &&
         a.content == b.content;
}

bool operator==(const Layout& a, const Layout& b) {
  return a.menus == b.menus && a.pages == b.pages && a.boxes == b.boxes;
}

void PrintDiff(const Layout& model, const Layout& database, std::ostream& out) {
  out << "layout (\"-\" only the model, \"+\" only the database):\n";
  DiffTable(model.menus, database.menus, out);
  DiffTable(model.pages, database.pages, out);
  DiffTable(model.boxes, database.boxes, out);
}

Model::Model()
    : m_started(false), m_paused(false), m_nextPageId(1), m_nextBoxId(1) {}

const sim::Package* Model::Find(const std::string& pkgId) const {
  for (const sim::Package& pkg : m_packages) {
    if (pkg.id == pkgId) return &pkg;
  }
  return NULL;
}

std::vector<std::string> Model::Pending() const {
  std::vector<std::string> ids;
  for (const auto& entry : m_pending) ids.push_back(entry.first);
  return ids;
}

std::vector<int> Model::MenuPages() const {
  std::vector<std::pair<int, int> > byNumber;  // (pageNo, pageId)
  for (const auto& page : m_pageNo) byNumber.push_back(std::make_pair(page.second, page.first));
  std::sort(byNumber.begin(), byNumber.end());
  std::vector<int> ids;
  for (const auto& page : byNumber) ids.push_back(page.second);
  return ids;
}

int Model::LastRow(int pageId) const {
  const std::map<Cell, int>& cells = m_cells.at(pageId);
  return cells.empty() ? 0 : cells.rbegin()->first.first;
}

bool Model::Occupied(int pageId, int col, int row) const {
  return m_cells.at(pageId).count(Cell(row, col)) != 0;
}

void Model::Apply(const Step& step) {
  switch (step.op) {
    case Step::kQuietAdd: Put(step.pkg); break;
    case Step::kQuietRemove: Remove(step.pkgId); break;
    case Step::kStart:
      // Listening begins, paused while the store is first filled from the
      // games listed before the install; that install is held and placed
      // after them.
      m_started = true;
      m_paused = true;
      FirstLaunch();
      if (!step.pkg.id.empty()) Apply(InstallOf(step.pkg));
      Replay();
      break;
    case Step::kRestart:
      m_paused = true;  // the store is populated already: nothing to fill
      Replay();
      break;
    case Step::kInstall:
    case Step::kUpdate: {
      int type = step.op == Step::kInstall ? PACKAGE_MANAGER_EVENT_TYPE_INSTALL
                                           : PACKAGE_MANAGER_EVENT_TYPE_UPDATE;
      Event(step.pkg.id, type, PACKAGE_MANAGER_EVENT_STATE_STARTED);
      Event(step.pkg.id, type, PACKAGE_MANAGER_EVENT_STATE_PROCESSING);
      Put(step.pkg);
      Event(step.pkg.id, type, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
      break;
    }
    case Step::kUninstall: {
      if (Find(step.pkgId) == NULL) break;  // the device sends nothing
      const int type = PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL;
      Event(step.pkgId, type, PACKAGE_MANAGER_EVENT_STATE_STARTED);
      Event(step.pkgId, type, PACKAGE_MANAGER_EVENT_STATE_PROCESSING);
      Remove(step.pkgId);
      Event(step.pkgId, type, PACKAGE_MANAGER_EVENT_STATE_COMPLETED);
      break;
    }
    case Step::kEvent: Event(step.pkgId, step.eventType, step.eventState); break;
    case Step::kPause: m_paused = true; break;
    case Step::kListen: Replay(); break;
    case Step::kBootDone: break;  // games on the card are only read again
    case Step::kAddPage: NewPage(step.pageNo); break;
    case Step::kShortcut: {
      int boxId = Add(Box{step.pageId, step.appId, step.col, step.row, step.name, false, false, 3,
                          step.launchType, step.iconPath, step.content});
      m_shortcuts.insert(std::make_pair(step.appId, boxId));
      break;
    }
  }
}

Step Model::InstallOf(const sim::Package& pkg) {
  Step install;
  install.op = Step::kInstall;
  install.pkg = pkg;
  return install;
}

Layout Model::Expected() const {
  Layout layout;
  if (!m_started) return layout;
  layout.menus.push_back(MenuRow{kMenuId, std::string("Apps"), 0});
  for (const auto& page : m_pageNo) {
    layout.pages.push_back(PageRow{page.first, 0, kMenuId, page.second});
  }
  for (const auto& entry : m_boxes) {
    const Box& b = entry.second;
    layout.boxes.push_back(BoxRow{entry.first, 0, std::nullopt, b.pageId, b.appId, OrNull(b.name),
                                  b.col, b.row, b.preload, b.system, b.boxType, b.launchType,
                                  OrNull(b.iconPath), OrNull(b.content)});
  }
  return layout;
}

// ---- The device.

void Model::Put(const sim::Package& pkg) {
  for (sim::Package& held : m_packages) {
    if (held.id == pkg.id) {
      held = pkg;  // replaced where it stands
      return;
    }
  }
  m_packages.push_back(pkg);
}

void Model::Remove(const std::string& pkgId) {
  for (size_t i = 0; i < m_packages.size(); ++i) {
    if (m_packages[i].id == pkgId) {
      m_packages.erase(m_packages.begin() + i);
      return;
    }
  }
}

std::vector<std::string> Model::EventAppIds(const std::string& pkgId) const {
  std::vector<std::string> ids;
  const sim::Package* pkg = Find(pkgId);
  if (pkg == NULL) return ids;
  for (const sim::App& app : pkg->apps) {
    if (app.component != PACKAGE_INFO_UIAPP) continue;
    if (!app.game) break;
    if (!app.noDisplay) ids.push_back(app.id);
  }
  return ids;
}

const sim::App* Model::FindApp(const std::string& appId, const sim::Package** owner) const {
  for (const sim::Package& pkg : m_packages) {
    for (const sim::App& app : pkg.apps) {
      if (app.id == appId) {
        *owner = &pkg;
        return &app;
      }
    }
  }
  return NULL;
}

// ---- The engine.

// Every displayable, enabled game on the device, any kind of application, in
// byte order of id, four to a row from the first cell; their boxes carry
// nothing but the id.
void Model::FirstLaunch() {
  std::set<std::string> games;
  for (const sim::Package& pkg : m_packages) {
    for (const sim::App& app : pkg.apps) {
      if (app.game && !app.noDisplay && app.enabled && !pkg.disabled) games.insert(app.id);
    }
  }
  int col = 1, row = 1, pageId = 0;
  for (const std::string& appId : games) {
    if (col == 1 && row == 1) pageId = NewPage(1);
    m_boxOf[appId] = Add(Box{pageId, appId, col, row, "", false, false, 0, 0, "", ""});
    if (++col > kColumns) {
      col = 1;
      if (++row > kMaxRows) row = 1;
    }
  }
}

void Model::Event(const std::string& pkgId, int type, int state) {
  if (!m_started) return;  // nobody listens yet
  switch (state) {
    case PACKAGE_MANAGER_EVENT_STATE_STARTED: {
      Job job;
      job.kind = type == PACKAGE_MANAGER_EVENT_TYPE_INSTALL     ? 1
                 : type == PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL ? 2
                 : type == PACKAGE_MANAGER_EVENT_TYPE_UPDATE    ? 3
                                                                : 0;
      job.pkgId = pkgId;
      // An uninstall's applications must be named while they still exist.
      if (job.kind == 2) job.appIds = EventAppIds(pkgId);
      m_pending[pkgId] = job;
      break;
    }
    case PACKAGE_MANAGER_EVENT_STATE_COMPLETED: {
      auto found = m_pending.find(pkgId);
      if (found == m_pending.end()) break;
      Job job = found->second;
      m_pending.erase(found);
      if (m_paused) {
        m_held.push_back(job);
      } else {
        Run(job);
      }
      break;
    }
    case PACKAGE_MANAGER_EVENT_STATE_FAILED: m_pending.erase(pkgId); break;
    default: break;  // PROCESSING, and states nobody knows
  }
}

void Model::Replay() {
  m_paused = false;
  std::vector<Job> held;
  held.swap(m_held);
  for (const Job& job : held) Run(job);
}

// A job reads the device as it is when it runs, which for a held job is at
// replay, not at completion.
void Model::Run(const Job& job) {
  if (job.kind == 0) return;
  std::vector<std::string> ids = job.kind == 2 ? job.appIds : EventAppIds(job.pkgId);
  for (const std::string& appId : ids) {
    if (job.kind == 2) {
      Uninstalled(appId);
      continue;
    }
    const sim::Package* pkg = NULL;
    const sim::App* app = FindApp(appId, &pkg);
    if (app == NULL || app->noDisplay) continue;  // its information cannot be read
    bool enabled = app->enabled && !pkg->disabled;
    if (job.kind == 3 && !enabled) {
      Uninstalled(appId);  // an update that disables a game takes its box away
    } else if (enabled) {
      Installed(appId, job.kind == 3);
    }
  }
}

// A new game gets a box with its label; an update also relabels a placed
// one, while an install leaves it alone. A missing label keeps the name.
void Model::Installed(const std::string& appId, bool update) {
  auto found = m_boxOf.find(appId);
  if (found != m_boxOf.end() && !update) return;
  int boxId = found != m_boxOf.end() ? found->second : Place(appId);
  const sim::Package* pkg = NULL;
  const sim::App* app = FindApp(appId, &pkg);
  Box& box = m_boxes[boxId];
  if (app->label) box.name = *app->label;
  box.preload = pkg->preload;
  box.system = pkg->system;
}

// Its box and its shortcuts go, and each page that lost one closes its gaps.
void Model::Uninstalled(const std::string& appId) {
  std::vector<int> gone;
  auto found = m_boxOf.find(appId);
  if (found != m_boxOf.end()) {
    gone.push_back(found->second);
    m_boxOf.erase(found);
  }
  auto shortcuts = m_shortcuts.equal_range(appId);
  for (auto s = shortcuts.first; s != shortcuts.second; ++s) gone.push_back(s->second);
  m_shortcuts.erase(shortcuts.first, shortcuts.second);
  std::set<int> pages;
  for (int boxId : gone) {
    const Box& box = m_boxes[boxId];
    pages.insert(box.pageId);
    m_cells[box.pageId].erase(Cell(box.row, box.col));
    m_boxes.erase(boxId);
  }
  for (int pageId : pages) Compact(pageId);
}

int Model::Place(const std::string& appId) {
  int pageId = 0, col = 1, row = 1;
  if (m_pageNo.empty()) {
    pageId = NewPage(1);
  } else {
    auto last = std::max_element(
        m_pageNo.begin(), m_pageNo.end(),
        [](const std::pair<const int, int>& a, const std::pair<const int, int>& b) {
          return a.second < b.second;
        });
    pageId = last->first;
    const std::map<Cell, int>& cells = m_cells[pageId];
    int lastCol = 0, lastRow = 1;  // an empty page: before its first cell
    if (!cells.empty()) {
      lastRow = cells.rbegin()->first.first;
      lastCol = cells.rbegin()->first.second;
    }
    col = lastCol + 1;
    row = lastRow;
    if (col > kColumns) {
      col = 1;
      ++row;
      if (row > kMaxRows || row == 1) {
        pageId = NewPage(last->second + 1);
        row = 1;
      }
    }
  }
  int boxId = Add(Box{pageId, appId, col, row, "", false, false, 0, 0, "", ""});
  m_boxOf[appId] = boxId;
  return boxId;
}

int Model::Add(const Box& box) {
  int boxId = m_nextBoxId++;
  m_boxes[boxId] = box;
  m_cells[box.pageId][Cell(box.row, box.col)] = boxId;
  return boxId;
}

int Model::NewPage(int pageNo) {
  int pageId = m_nextPageId++;
  m_pageNo[pageId] = pageNo;
  m_cells[pageId];
  return pageId;
}

// The boxes left on a page move up to fill it from the first cell, four to
// a row, in reading order.
void Model::Compact(int pageId) {
  std::map<Cell, int>& cells = m_cells[pageId];
  std::vector<int> order;
  for (const auto& cell : cells) order.push_back(cell.second);
  cells.clear();
  for (size_t i = 0; i < order.size(); ++i) {
    Box& box = m_boxes[order[i]];
    box.col = static_cast<int>(i % kColumns) + 1;
    box.row = static_cast<int>(i / kColumns) + 1;
    cells[Cell(box.row, box.col)] = order[i];
  }
}

}  // namespace soak
