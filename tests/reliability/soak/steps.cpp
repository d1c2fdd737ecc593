#include "reliability/soak/steps.h"

#include <package_manager.h>

#include "reliability/soak/model.h"

namespace soak {

namespace {

// A small pool, so that packages come and go and ids are used again: the
// layout stays a few hundred boxes at most however long the run. Two ids
// carry a quote and non-ASCII bytes.
const int kPoolSize = 32;

const char* const kLabels[] = {
    "Tide", "Ember", "Racer", "Chess", "Quest", "Nova", "Blitz", "Orbit", "Solitaire",
    "it's on", "\"quoted\"", "x'); DROP TABLE Boxes; --", "\xc3\x89" "checs",
    "\xe6\xb8\xb8\xe6\x88\x8f",
};

const int kUnknownTypes[] = {3, 7, -1, 1000};
const int kUnknownStates[] = {4, 9, -1, -100};

std::string EventTypeName(int type) {
  switch (type) {
    case PACKAGE_MANAGER_EVENT_TYPE_INSTALL: return "install";
    case PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL: return "uninstall";
    case PACKAGE_MANAGER_EVENT_TYPE_UPDATE: return "update";
  }
  return "type " + std::to_string(type);
}

std::string EventStateName(int state) {
  switch (state) {
    case PACKAGE_MANAGER_EVENT_STATE_STARTED: return "STARTED";
    case PACKAGE_MANAGER_EVENT_STATE_PROCESSING: return "PROCESSING";
    case PACKAGE_MANAGER_EVENT_STATE_COMPLETED: return "COMPLETED";
    case PACKAGE_MANAGER_EVENT_STATE_FAILED: return "FAILED";
  }
  return "state " + std::to_string(state);
}

// In double quotes, with quotes and backslashes escaped.
std::string Quoted(const std::optional<std::string>& label) {
  if (!label) return "no-label";
  std::string text = "\"";
  for (char c : *label) text += c == '"' || c == '\\' ? std::string("\\") + c : std::string(1, c);
  return text + "\"";
}

// "a game \"Tide\" hidden": the letter after the package id, then its facts.
std::string DescribeApp(const sim::Package& pkg, const sim::App& app) {
  std::string letter = app.id.compare(0, pkg.id.size() + 1, pkg.id + ".") == 0
                           ? app.id.substr(pkg.id.size() + 1)
                           : app.id;
  std::string text = letter + (app.game ? " game " : " plain ") + Quoted(app.label);
  if (app.noDisplay) text += " hidden";
  if (!app.enabled) text += " off";
  if (app.component == PACKAGE_INFO_SERVICEAPP) text += " service";
  return text;
}

std::string DescribePackage(const sim::Package& pkg) {
  std::string text = pkg.id + " [";
  for (size_t i = 0; i < pkg.apps.size(); ++i) {
    text += (i ? ", " : "") + DescribeApp(pkg, pkg.apps[i]);
  }
  text += "]";
  if (pkg.preload) text += " preload";
  if (pkg.system) text += " system";
  if (pkg.disabled) text += " deactivated";
  return text;
}

}  // namespace

std::string Describe(const Step& step) {
  switch (step.op) {
    case Step::kQuietAdd: return "device quietly adds " + DescribePackage(step.pkg);
    case Step::kQuietRemove: return "device quietly removes " + step.pkgId;
    case Step::kStart:
      return "data_engin_initialization (first launch)" +
             (step.pkg.id.empty() ? "" : ", meanwhile install " + DescribePackage(step.pkg));
    case Step::kRestart: return "data_engin_initialization again";
    case Step::kInstall: return "install " + DescribePackage(step.pkg);
    case Step::kUpdate: return "update (" + step.change + ") " + DescribePackage(step.pkg);
    case Step::kUninstall: return "uninstall " + step.pkgId;
    case Step::kEvent:
      return "event " + EventTypeName(step.eventType) + " " + EventStateName(step.eventState) +
             " " + step.pkgId;
    case Step::kPause: return "PauseListenCb";
    case Step::kListen: return "StartListenCb";
    case Step::kAddPage: return "launcher adds page " + std::to_string(step.pageNo) + " to menu 1";
    case Step::kShortcut:
      return "launcher adds a shortcut of " + step.appId + " " + Quoted(step.name) + " on page " +
             std::to_string(step.pageId) + " at (" + std::to_string(step.col) + "," +
             std::to_string(step.row) + "), icon " + Quoted(step.iconPath) + ", content " +
             Quoted(step.content) + ", launchType " + std::to_string(step.launchType);
    case Step::kBootDone: {
      std::string text = "boot-done";
      text += step.subscribe ? " (subscribed)" : " (nobody subscribed)";
      text += step.card ? ", card in" : ", no card";
      if (!step.onCard.empty()) {
        text += ", on card:";
        for (const std::string& id : step.onCard) text += " " + id;
      }
      return text;
    }
  }
  return "?";
}

Generator::Generator(uint32_t seed) : m_rng(seed), m_setupSteps(-1) {}

// Rejection of the short top range keeps every value equally likely.
uint32_t Generator::Below(uint32_t n) {
  const uint32_t reject = static_cast<uint32_t>(-n) % n;  // 2^32 mod n
  uint32_t draw;
  do {
    draw = static_cast<uint32_t>(m_rng());
  } while (draw < reject);
  return draw % n;
}

Step Generator::Next(const Model& model) {
  if (!model.Started()) return Setup(model);

  int installed = static_cast<int>(model.Packages().size());
  struct Choice {
    int weight;
    int what;
  };
  enum {
    kInstall, kUpdate, kUninstall, kEvent, kQuiet, kPause, kListen, kBoot, kRestart, kPage,
    kShortcut
  };
  int pages = static_cast<int>(model.MenuPages().size());
  const Choice choices[] = {
      {4 + 16 * (kPoolSize - installed) / kPoolSize, kInstall},
      {installed ? 22 : 0, kUpdate},
      {installed ? 2 + 16 * installed / kPoolSize : 0, kUninstall},
      {16, kEvent},
      {5, kQuiet},
      {model.Paused() ? 0 : 3, kPause},
      {model.Paused() ? 12 : 1, kListen},  // paused for about a dozen steps
      {2, kBoot},
      {1, kRestart},
      {pages < 4 ? 1 : 0, kPage},
      {pages ? 3 : 0, kShortcut},
  };
  int total = 0;
  for (const Choice& c : choices) total += c.weight;
  int draw = static_cast<int>(Below(static_cast<uint32_t>(total)));
  int what = kRestart;
  for (const Choice& c : choices) {
    if (draw < c.weight) {
      what = c.what;
      break;
    }
    draw -= c.weight;
  }

  Step step;
  switch (what) {
    case kInstall: return Install(model);
    case kUpdate: return Update(model);
    case kUninstall:
      step.op = Step::kUninstall;
      step.pkgId = Pick(model.Packages()).id;
      return step;
    case kEvent: return RawEvent(model);
    case kQuiet:
      if (installed && OneIn(2)) {
        step.op = Step::kQuietRemove;
        step.pkgId = Pick(model.Packages()).id;
      } else {
        step.op = Step::kQuietAdd;
        step.pkg = NewPackage(PoolPackage());
        step.pkgId = step.pkg.id;
      }
      Touch(step.pkgId);
      return step;
    case kPause: step.op = Step::kPause; return step;
    case kListen: step.op = Step::kListen; return step;
    case kBoot: return BootDone(model);
    case kPage:
      step.op = Step::kAddPage;
      step.pageNo = model.MenuPages().empty() ? 1 : model.PageNo(model.MenuPages().back()) + 1;
      return step;
    case kShortcut: return Shortcut(model);
  }
  step.op = Step::kRestart;
  return step;
}

// A dozen packages at most, added before the engine first starts, and now
// and then an event that nobody hears yet.
Step Generator::Setup(const Model& model) {
  if (m_setupSteps < 0) m_setupSteps = static_cast<int>(Below(13));
  Step step;
  if (m_setupSteps-- > 0) {
    if (OneIn(4)) return RawEvent(model);
    step.op = Step::kQuietAdd;
    step.pkg = NewPackage(PoolPackage());
  } else {
    step.op = Step::kStart;
    if (OneIn(2)) step.pkg = NewPackage(PoolPackage());
  }
  return step;
}

Step Generator::Install(const Model& model) {
  std::string pkgId = PoolPackage();
  // Mostly a package the device lacks; now and then one installed again.
  for (int tries = 0; tries < 8 && model.Find(pkgId) != NULL; ++tries) pkgId = PoolPackage();
  Step step;
  step.op = Step::kInstall;
  step.pkg = NewPackage(pkgId);
  return step;
}

Step Generator::Update(const Model& model) {
  Step step;
  step.op = Step::kUpdate;
  if (OneIn(12)) {
    step.pkg = NewPackage(PoolPackage());
    step.change = model.Find(step.pkg.id) ? "new contents" : "an update installs it";
    return step;
  }
  step.pkg = Pick(model.Packages());
  sim::Package& pkg = step.pkg;
  if (pkg.apps.empty()) pkg.apps.push_back(NewApp(pkg.id, 'a'));
  sim::App& app = pkg.apps[Below(static_cast<uint32_t>(pkg.apps.size()))];
  std::string letter = app.id.substr(pkg.id.size() + 1);
  switch (Below(16)) {
    case 0: case 1: case 2: case 3: case 4:
      app.label = Label();
      step.change = "relabel " + letter + " " + Quoted(app.label);
      break;
    case 5: app.enabled = false; step.change = "disable " + letter; break;
    case 6: app.enabled = true; step.change = "enable " + letter; break;
    case 7: pkg.supportDisable = pkg.disabled = true; step.change = "deactivate"; break;
    case 8: pkg.disabled = false; step.change = "reactivate"; break;
    case 9: app.noDisplay = true; step.change = "hide " + letter; break;
    case 10: app.noDisplay = false; step.change = "show " + letter; break;
    case 11:
      app.game = !app.game;
      step.change = letter + (app.game ? " becomes a game" : " is no longer a game");
      break;
    case 12:
      step.change = "no change";
      // The first letter no application of the package holds: the platform
      // never has two applications of one id.
      for (char next = 'a'; next <= 'd'; ++next) {
        bool used = false;
        for (const sim::App& held : pkg.apps) used = used || held.id == pkg.id + "." + next;
        if (!used) {
          pkg.apps.push_back(NewApp(pkg.id, next));
          step.change = std::string("add ") + next;
          break;
        }
      }
      break;
    case 13:
      if (pkg.apps.size() > 1) {
        step.change = "drop " + letter;
        pkg.apps.erase(pkg.apps.begin() + (&app - &pkg.apps[0]));
      } else {
        step.change = "no change";
      }
      break;
    case 14:
      pkg.preload = !pkg.preload;
      pkg.system = OneIn(3) ? !pkg.system : pkg.system;
      step.change = "package flags";
      break;
    default:
      step.change = "no change";
      break;
  }
  return step;
}

Step Generator::RawEvent(const Model& model) {
  Step step;
  step.op = Step::kEvent;
  std::vector<std::string> pending = model.Pending();
  uint32_t whose = Below(10);
  if (whose < 4 && !pending.empty()) {
    step.pkgId = Pick(pending);
  } else if (whose < 8 && !m_recent.empty()) {
    step.pkgId = Pick(m_recent);
  } else {
    step.pkgId = PoolPackage();
  }
  Touch(step.pkgId);
  uint32_t type = Below(8);
  step.eventType = type < 7 ? static_cast<int>(type % 3)  // install, uninstall, update
                            : kUnknownTypes[Below(4)];
  uint32_t state = Below(50);
  step.eventState = state < 20   ? PACKAGE_MANAGER_EVENT_STATE_STARTED
                    : state < 35 ? PACKAGE_MANAGER_EVENT_STATE_COMPLETED
                    : state < 40 ? PACKAGE_MANAGER_EVENT_STATE_FAILED
                    : state < 44 ? PACKAGE_MANAGER_EVENT_STATE_PROCESSING
                                 : kUnknownStates[Below(4)];
  return step;
}

Step Generator::BootDone(const Model& model) {
  Step step;
  step.op = Step::kBootDone;
  step.subscribe = !OneIn(4);  // the signal ends each subscription
  step.card = static_cast<int>(Below(2));
  for (uint32_t n = Below(4); n > 0 && !model.Packages().empty(); --n) {
    const sim::Package& pkg = Pick(model.Packages());
    if (!pkg.apps.empty()) step.onCard.push_back(Pick(pkg.apps).id);
  }
  return step;
}

// A shortcut of an application on the device or gone from it, on any page
// of menu 1, in a free cell up to a row below the last: the launcher may
// leave cells free, and new boxes must still follow the last one.
Step Generator::Shortcut(const Model& model) {
  Step step;
  step.op = Step::kShortcut;
  step.pageId = Pick(model.MenuPages());
  if (!model.Packages().empty() && !OneIn(4)) {
    const sim::Package& pkg = Pick(model.Packages());
    step.appId = pkg.apps.empty() ? pkg.id + ".a" : Pick(pkg.apps).id;
  } else {
    step.appId = PoolPackage() + ".a";
  }
  std::optional<std::string> name = Label();
  step.name = name ? *name : "";
  step.iconPath = OneIn(4) ? "" : "/opt/usr/share/icons/shortcut-" + std::to_string(Below(9)) + ".png";
  step.content = OneIn(3) ? "" : "launch?mode=" + std::to_string(Below(9));
  step.launchType = static_cast<int>(Below(3));
  int rows = model.LastRow(step.pageId) + 1;
  do {
    step.col = 1 + static_cast<int>(Below(4));
    step.row = 1 + static_cast<int>(Below(static_cast<uint32_t>(rows)));
  } while (model.Occupied(step.pageId, step.col, step.row));
  return step;
}

// Mostly one game; now and then another application alone, or several
// applications of every kind together.
sim::Package Generator::NewPackage(const std::string& pkgId) {
  sim::Package pkg;
  pkg.id = pkgId;
  uint32_t shape = Below(10);
  size_t count = shape < 7 ? 1 : 2 + Below(3);
  for (size_t i = 0; i < count; ++i) {
    pkg.apps.push_back(NewApp(pkgId, static_cast<char>('a' + i)));
    if (shape < 6) pkg.apps.back().game = true;
    if (shape == 6) pkg.apps.back().game = false;
  }
  pkg.preload = OneIn(8);
  pkg.system = OneIn(10);
  pkg.supportDisable = OneIn(4);
  pkg.disabled = pkg.supportDisable && OneIn(10);
  return pkg;
}

sim::App Generator::NewApp(const std::string& pkgId, char letter) {
  sim::App app = sim::GameApp(pkgId + "." + letter, "");
  app.label = Label();
  app.game = !OneIn(4);
  app.noDisplay = OneIn(10);
  app.enabled = !OneIn(12);
  if (OneIn(12)) app.component = PACKAGE_INFO_SERVICEAPP;
  return app;
}

std::string Generator::PoolPackage() {
  uint32_t i = Below(kPoolSize);
  if (i == kPoolSize - 2) return "p'q";
  if (i == kPoolSize - 1) return "p\xc3\xa9";
  return "p" + std::to_string(i);
}

void Generator::Touch(const std::string& pkgId) {
  for (const std::string& id : m_recent) {
    if (id == pkgId) return;
  }
  if (m_recent.size() == 6) m_recent.erase(m_recent.begin());
  m_recent.push_back(pkgId);
}

std::optional<std::string> Generator::Label() {
  if (OneIn(20)) return std::nullopt;
  if (OneIn(25)) return std::string();
  std::string label = kLabels[Below(sizeof kLabels / sizeof kLabels[0])];
  if (OneIn(2)) label += " " + std::to_string(Below(10));
  return label;
}

}  // namespace soak
