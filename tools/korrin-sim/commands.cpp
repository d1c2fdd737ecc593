#include "commands.h"

#include <package_manager.h>

#include <algorithm>
#include <sstream>
#include <stdexcept>

#include "calls.h"
#include "cli.h"
#include "korrin-data/korrin-data.h"
#include "phone-db.h"
#include "session.h"
#include "sim/device.h"
#include "views.h"
#include "words.h"

namespace po = boost::program_options;

namespace korrin_sim {

namespace {

sim::Device& Dev() { return sim::Device::Get(); }

// ---- Values that scripts name.

// Only the values the platform's type holds: the device keeps states as
// mdm_status_t, and loading any other value into one is undefined.
mdm_status_t ParseMdmState(const std::string& text) {
  int state = ParseNamed(text, {"error", "allowed", "restricted"}, "state") - 1;
  return static_cast<mdm_status_t>(state);  // MDM_STATUS_ERROR is -1
}

// ---- Package and application properties, as options.

void AddPackageOptions(po::options_description& options) {
  options.add_options()
      ("pkg-type", po::value<std::string>()->value_name("TYPE"),
       "package type events report (tpk)")
      ("system", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "a system package")
      ("removable", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "the user may remove it (true)")
      ("preload", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "came with the device")
      ("support-disable", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "the user may deactivate it")
      ("disabled", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "deactivated");
}

void AddAppOptions(po::options_description& options) {
  options.add_options()
      ("label", po::value<std::string>()->value_name("TEXT"), "the label")
      ("no-label", po::bool_switch(), "the platform gives no label")
      ("icon", po::value<std::string>()->value_name("PATH"), "the icon path")
      ("no-icon", po::bool_switch(), "the platform gives no icon path")
      ("type", po::value<std::string>()->value_name("TYPE"), "application type (capp)")
      ("game", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"), "a game")
      ("no-display", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "never shown in menus")
      ("enabled", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "enabled (true)")
      ("task-manage", po::value<bool>()->implicit_value(true, "true")->value_name("BOOL"),
       "shown in the task manager (true)")
      ("component", po::value<std::string>()->value_name("ui|service|all"),
       "component type (ui)")
      ("category", po::value<std::vector<std::string> >()->value_name("URI"),
       "a category (repeat for more)")
      ("metadata", po::value<std::vector<std::string> >()->value_name("KEY=VALUE"),
       "a metadata pair (repeat for more)");
}

template <typename T>
void Set(const Args& args, const std::string& name, T& field) {
  if (args.Has(name)) field = args.Get<T>(name);
}

void ApplyPackageOptions(const Args& args, sim::Package& pkg) {
  if (args.Has("pkg-type")) pkg.type = args.Text("pkg-type");
  Set(args, "system", pkg.system);
  Set(args, "removable", pkg.removable);
  Set(args, "preload", pkg.preload);
  Set(args, "support-disable", pkg.supportDisable);
  Set(args, "disabled", pkg.disabled);
}

// Throws before |app| changes when an option's value does not parse.
void ApplyAppOptions(const Args& args, sim::App& app) {
  sim::App changed = app;
  if (args.Has("label")) changed.label = args.Text("label");
  if (args.Get<bool>("no-label")) changed.label.reset();
  if (args.Has("icon")) changed.icon = args.Text("icon");
  if (args.Get<bool>("no-icon")) changed.icon.reset();
  if (args.Has("type")) changed.type = args.Text("type");
  Set(args, "game", changed.game);
  Set(args, "no-display", changed.noDisplay);
  Set(args, "enabled", changed.enabled);
  Set(args, "task-manage", changed.taskManage);
  if (args.Has("component")) {
    changed.component = static_cast<package_info_app_component_type_e>(
        ParseNamed(args.Text("component"), kComponentNames, "--component", true));
  }
  if (args.Has("category")) changed.categories = args.List("category");
  if (args.Has("metadata")) {
    changed.metadata.clear();
    for (const std::string& pair : args.List("metadata")) {
      size_t equals = pair.find('=');
      if (equals == std::string::npos) {
        throw UsageError("--metadata: '" + pair + "' is not KEY=VALUE");
      }
      changed.metadata.emplace_back(pair.substr(0, equals), pair.substr(equals + 1));
    }
  }
  app = changed;
}

void AddBothOptions(po::options_description& options) {
  AddPackageOptions(options);
  AddAppOptions(options);
}

// A package PKGID holding one application of the same id: a game labelled
// LABEL (or PKGID), with the options applied.
sim::Package OneAppPackage(const Args& args) {
  std::string id = args.Text("PKGID");
  sim::Package pkg =
      sim::MakePackage(id, {sim::GameApp(id, args.Has("LABEL") ? args.Text("LABEL") : id)});
  ApplyAppOptions(args, pkg.apps[0]);
  ApplyPackageOptions(args, pkg);
  return pkg;
}

// The package an `app` or `package` command describes: a held one, the
// installed one, or a new one.
sim::Package DescribedPackage(Session& session, const std::string& id) {
  if (session.held().count(id)) return session.held()[id];
  const sim::Package* installed = Dev().FindPackage(id);
  return installed != NULL ? *installed : sim::MakePackage(id, {});
}

void Store(Session& session, const sim::Package& pkg, bool hold) {
  if (hold || session.held().count(pkg.id)) {
    session.held()[pkg.id] = pkg;
  } else {
    Dev().AddPackage(pkg);
  }
}

// ---- The commands.

std::vector<sim::App>::iterator FindApp(sim::Package& pkg, const std::string& appId) {
  return std::find_if(pkg.apps.begin(), pkg.apps.end(),
                      [&](const sim::App& app) { return app.id == appId; });
}

void RunGame(Session&, const Args& args) {
  sim::Package pkg = sim::MakePackage(
      args.Text("APPID"),
      {sim::GameApp(args.Text("APPID"), args.Text(args.Has("LABEL") ? "LABEL" : "APPID"))});
  ApplyAppOptions(args, pkg.apps[0]);
  ApplyPackageOptions(args, pkg);
  Dev().AddPackage(pkg);
}

void RunPackage(Session& session, const Args& args) {
  sim::Package pkg = DescribedPackage(session, args.Text("PKGID"));
  ApplyPackageOptions(args, pkg);
  Store(session, pkg, args.Get<bool>("held"));
}

void RunApp(Session& session, const Args& args) {
  sim::Package pkg = DescribedPackage(session, args.Text("PKGID"));
  std::string appId = args.Text("APPID");
  std::vector<sim::App>::iterator app = FindApp(pkg, appId);
  if (app == pkg.apps.end()) app = pkg.apps.insert(app, sim::PlainApp(appId, appId));
  ApplyAppOptions(args, *app);
  Store(session, pkg, false);
}

void RunRemove(Session& session, const Args& args) {
  std::string id = args.Text("PKGID");
  if (session.held().erase(id) == 0 && !Dev().RemovePackage(id)) {
    throw UsageError("no package '" + id + "' on the device");
  }
}

// The held package PKGID when the command names nothing but it.
bool SendsHeld(Session& session, const Args& args) {
  return session.held().count(args.Text("PKGID")) && args.words().size() == 1;
}

void RunInstall(Session& session, const Args& args) {
  std::string id = args.Text("PKGID");
  bool held = SendsHeld(session, args);
  sim::Package pkg = held ? session.held()[id] : OneAppPackage(args);
  if (held) session.held().erase(id);
  Dev().Install(pkg);
}

// The installed package PKGID with LABEL and the options applied to one of
// its applications (--app, else the one named PKGID, else the first).
sim::Package UpdatedPackage(const Args& args) {
  std::string id = args.Text("PKGID");
  const sim::Package* installed = Dev().FindPackage(id);
  if (installed == NULL) throw UsageError("no package '" + id + "' on the device to update");
  sim::Package pkg = *installed;
  std::string appId = args.Has("app") ? args.Text("app") : id;
  std::vector<sim::App>::iterator app = FindApp(pkg, appId);
  if (app == pkg.apps.end() && args.Has("app")) {
    app = pkg.apps.insert(app, sim::GameApp(appId, appId));
  } else if (app == pkg.apps.end()) {
    if (pkg.apps.empty()) throw UsageError("package '" + id + "' has no application");
    app = pkg.apps.begin();
  }
  if (args.Has("LABEL")) app->label = args.Text("LABEL");
  ApplyAppOptions(args, *app);
  ApplyPackageOptions(args, pkg);
  return pkg;
}

void RunUpdate(Session& session, const Args& args) {
  std::string id = args.Text("PKGID");
  bool held = SendsHeld(session, args);
  sim::Package pkg = held ? session.held()[id] : UpdatedPackage(args);
  if (held) session.held().erase(id);
  Dev().Update(pkg);
}

void RunUninstall(Session&, const Args& args) {
  if (!Dev().Uninstall(args.Text("PKGID"))) {
    throw UsageError("no package '" + args.Text("PKGID") + "' on the device");
  }
}

void RunEvent(Session&, const Args& args) {
  int type = ParseNamed(args.Text("EVENT"), kEventTypeNames, "EVENT", true);
  int state = ParseNamed(args.Text("STATE"), kEventStateNames, "STATE", true);
  Dev().EmitPackageEvent(args.Text("pkg-type"), args.Text("PKGID"), type, state,
                         args.Get<int>("progress"), args.Get<int>("error"));
}

// What `start` did, for `boot-done` and `card` to tell and follow.
bool g_started = false;
bool g_watchingCard = false;       // the launcher's watch on the card status
int g_subscriptionsAtStart = -1;  // e_dbus_signal_handler_add calls; -1 when start subscribed

void RunBootDone(Session&, const Args&) {
  int handlers = Dev().SendBootDone();
  Out() << "BootingDone reached " << handlers << (handlers == 1 ? " handler" : " handlers");
  if (handlers == 0 && !g_started) {
    Out() << ": the engine is not started (`start` subscribes)";
  } else if (handlers == 0 &&
             Dev().CallCount("e_dbus_signal_handler_add") == g_subscriptionsAtStart) {
    Out() << ": `start --without boot-signal` left the subscription out "
             "(`call _RegisterEdbusSignalHandler` makes it)";
  }
  Out() << "\n";
}

void RunPreference(Session&, const Args& args) {
  if (args.Has("VALUE")) {
    Dev().SetPreference(args.Text("KEY"), ParseInt(args.Text("VALUE"), "VALUE"));
  } else {
    Dev().RemovePreference(args.Text("KEY"));
  }
}

void RunCard(Session&, const Args& args) {
  bool inserted = ParseNamed(args.Text("in|out"), {"in", "out"}, "card") == 0;
  Dev().SetStorageCard(inserted);
  if (g_watchingCard) korrin::PackageManager().OnMMCStatusChanged(inserted ? 1 : 0);
}

void RunScreen(Session&, const Args& args) {
  int width = ParseInt(args.Text("WIDTH"), "WIDTH");
  int height = ParseInt(args.Text("HEIGHT"), "HEIGHT");
  Dev().SetSystemInfo("http://tizen.org/feature/screen.width", width);
  Dev().SetSystemInfo("http://tizen.org/feature/screen.height", height);
}

void RunMdm(Session&, const Args& args) {
  bool reachable =
      ParseNamed(args.Text("reachable|unreachable"), {"unreachable", "reachable"}, "mdm");
  std::map<std::string, mdm_status_t> states;
  for (const std::string& pair : args.List("APPID=STATE")) {
    size_t equals = pair.find('=');
    if (equals == std::string::npos) throw UsageError("'" + pair + "' is not APPID=STATE");
    states[pair.substr(0, equals)] = ParseMdmState(pair.substr(equals + 1));
  }
  Dev().SetMdm(reachable, states);
}

void RunFail(Session&, const Args& args) {
  if (args.Text("CALL") == "clear") {
    if (args.Has("ERROR")) throw UsageError("`fail clear` takes nothing more");
    Dev().ClearFailures();
    return;
  }
  if (!args.Has("ERROR")) throw UsageError("missing ERROR (usage: fail CALL ERROR [once|always])");
  std::string call = args.Text("CALL");
  int error = ParseInt(args.Text("ERROR"), "ERROR");
  std::string how = args.Has("once|always") ? args.Text("once|always") : "once";
  bool always = ParseNamed(how, {"once", "always"}, "fail") != 0;
  try {
    if (always) {
      Dev().FailAlways(call, error);
    } else {
      Dev().FailNext(call, error, args.Get<int>("skip"));
    }
  } catch (const std::invalid_argument&) {
    throw UsageError("'" + call + "' is not a platform call the device knows");
  }
}

// The steps of the launcher's start-up after the engine's own, by name.
const std::vector<std::string> kStartSteps = {"boot-signal", "card-watch"};

void RunStart(Session&, const Args& args) {
  std::vector<std::string> without = args.List("without");
  for (const std::string& step : without) ParseNamed(step, kStartSteps, "--without");
  auto wanted = [&](const char* step) {
    return std::find(without.begin(), without.end(), step) == without.end();
  };
  data_engin_initialization();
  g_started = true;
  g_subscriptionsAtStart = -1;
  if (wanted("boot-signal") && !korrin::PackageManager()._RegisterEdbusSignalHandler()) {
    Out() << "boot-signal: the subscription failed (`log` says why)\n";
  } else if (!wanted("boot-signal")) {
    g_subscriptionsAtStart = Dev().CallCount("e_dbus_signal_handler_add");
  }
  g_watchingCard = wanted("card-watch");
}

void RunStop(Session&, const Args&) { data_engin_uninitialization(); }

void RunCall(Session&, const Args& args) { Call(args.words(), Out()); }

void RunOnCard(Session&, const Args& args) {
  std::vector<std::string> appIds = args.List("APPID");
  for (const std::string& appId : appIds) {
    if (Dev().FindApp(appId) == NULL) throw UsageError("no application '" + appId + "'");
  }
  LauncherPackageManager& packages = korrin::PackageManager();
  for (const std::string& appId : appIds) {
    if (packages.m_appInfoCache.count(appId) == 0 || !packages.m_appInfoCache[appId]) {
      boost::shared_ptr<GameBoxData> info(new GameBoxData());
      if (!packages.GetAppInfo(appId, info)) {
        Out() << appId << ": its information cannot be read\n";
        continue;
      }
    }
    packages.m_appInfoCache[appId]->isOnStorageCard = true;
  }
}

void RunBefore(Session& session, const Args& args) {
  std::string rest = args.rest();
  std::string call = rest.substr(0, rest.find_first_of(" \t"));
  std::string line = rest.size() > call.size() ? rest.substr(call.size() + 1) : "";
  if (call.empty() || line.find_first_not_of(" \t") == std::string::npos) {
    throw UsageError("usage: before CALL COMMAND...");
  }
  session.Check(line);
  try {
    Dev().CallCount(call);  // throws for a call the device does not know
  } catch (const std::invalid_argument&) {
    throw UsageError("'" + call + "' is not a platform call the device knows");
  }
  session.RunBefore(call, line);
}

void RunCount(Session&, const Args& args) {
  std::vector<std::string> calls = args.List("CALL");
  std::vector<int> counts;
  try {
    for (const std::string& call : calls) counts.push_back(Dev().CallCount(call));
  } catch (const std::invalid_argument& e) {
    throw UsageError(e.what());
  }
  for (size_t i = 0; i < calls.size(); ++i) Out() << calls[i] << " " << counts[i] << "\n";
}

void RunTrace(Session& session, const Args& args) {
  if (args.Has("on|off")) {
    session.Trace(ParseNamed(args.Text("on|off"), {"off", "on"}, "trace") != 0);
  } else {
    for (const std::string& sql : session.TakeStatements()) Out() << sql << "\n";
  }
}

void RunSampleDevice(Session&, const Args&) { Dev().LoadSampleDevice(); }

void RunSay(Session&, const Args& args) { Out() << args.rest() << "\n"; }

// --wide (grids only), --json and --csv.
void AddStyleOptions(po::options_description& options, bool grids) {
  if (grids) {
    options.add_options()("wide", po::bool_switch(),
                          "cut no label: columns as wide as their widest");
  }
  options.add_options()("json", po::bool_switch(), "as JSON: an array, one object a line")(
      "csv", po::bool_switch(), "as CSV (RFC 4180), a header line first");
}

ViewStyle StyleOf(const Args& args) {
  bool json = args.Get<bool>("json"), csv = args.Get<bool>("csv");
  if (json && csv) throw UsageError("--json or --csv, not both");
  ViewStyle style = {ViewStyle::kGrid, args.Has("wide") && args.Get<bool>("wide")};
  if (json) style.format = ViewStyle::kJson;
  if (csv) style.format = ViewStyle::kCsv;
  return style;
}

void RunLayout(Session& session, const Args& args) {
  int menuId = args.Has("MENUID") ? ParseInt(args.Text("MENUID"), "MENUID") : 1;
  PrintMenuLayout(session.DatabasePath(), menuId, args.Get<bool>("ids"), StyleOf(args), Out());
}

void RunFolder(Session& session, const Args& args) {
  PrintFolder(session.DatabasePath(), ParseInt(args.Text("BOXID"), "BOXID"),
              args.Get<bool>("ids"), StyleOf(args), Out());
}

LauncherDataManager& StartedStore() {
  if (korrin::DataManager().m_db == NULL) {
    throw UsageError("the engine has no database open: `start` it first");
  }
  return korrin::DataManager();
}

void RunDownloads(Session&, const Args& args) {
  LauncherDataManager& store = StartedStore();
  PrintComputedView(store.GetPageDataListByDownload(1, false),
                    store.GetBoxDataListByDownload(1, false), 4, StyleOf(args), Out());
}

void RunAlphabetical(Session&, const Args& args) {
  int parentId = args.Has("PARENTID") ? ParseInt(args.Text("PARENTID"), "PARENTID") : 1;
  bool folder = args.Get<bool>("folder");
  LauncherDataManager& store = StartedStore();
  PrintComputedView(store.GetPageDataListByAlphabeticalOrder(parentId, folder),
                    store.GetBoxDataListByAlphabeticalOrder(parentId, folder), folder ? 3 : 4,
                    StyleOf(args), Out());
}

void RunLog(Session& session, const Args& args) {
  int lowest = args.Has("priority") ? ParsePriority(args.Text("priority")) : 0;
  const std::vector<sim::LogLine>& lines = Dev().Logs();
  size_t first = args.Get<bool>("all") ? 0 : std::min(session.logMark(), lines.size());
  for (size_t i = first; i < lines.size(); ++i) {
    const sim::LogLine& line = lines[i];
    if (line.priority < lowest) continue;
    if (args.Has("grep") && line.text.find(args.Text("grep")) == std::string::npos) continue;
    if (args.Get<bool>("dlogutil")) {
      PrintDlogutilLine(line, Out());
    } else {
      PrintLogLine(line, args.Get<bool>("message"), Out());
    }
  }
}

void RunTables(Session& session, const Args& args) {
  PrintTables(session.DatabasePath(), args.List("TABLE"), StyleOf(args).format, Out());
}

void RunChanges(Session& session, const Args&) {
  PrintChanges(session.before(), session.after(), Out());
}

void RunHelp(Session&, const Args& args) {
  if (args.Has("COMMAND")) {
    PrintCommandHelp(args.Text("COMMAND"), Out());
  } else {
    PrintCommandList(Out());
  }
}

void NoOptions(po::options_description&) {}

std::vector<Command> MakeCommands() {
  const bool kAction = true, kView = false;
  const Command::Parsing kParsed = Command::kOptions, kRaw = Command::kWords,
                        kText = Command::kText;
  return {
      // ---- The device.
      {"sample-device", "", "add the demo's sample phone: 33 games and more",
       "Adds the sample device's packages (a few dozen games, other applications, a\n"
       "no-display service, a deactivated package), a 720x1280 screen, no card.",
       "sample-device", kAction, kParsed, NoOptions, RunSampleDevice},
      {"game", "APPID [LABEL]", "add a game package to the device (no event)",
       "Installs, silently, a package APPID holding one game APPID labelled LABEL\n"
       "(or APPID). Options change its properties (--label too).",
       "game com.acme.tetra \"Tetra Blocks\" --preload", kAction, kParsed, AddBothOptions,
       RunGame},
      {"package", "PKGID", "add or change a package (no event)",
       "Adds package PKGID, or changes the one described already. With --held it\n"
       "stays off the device until `install PKGID` or `update PKGID` sends it.",
       "package com.acme.pack --held\napp com.acme.pack com.acme.one --label One --game\n"
       "install com.acme.pack",
       kAction, kParsed,
       [](po::options_description& o) {
         AddPackageOptions(o);
         o.add_options()("held", po::bool_switch(), "describe it, install it later");
       },
       RunPackage},
      {"app", "PKGID APPID", "add or change an application (no event)",
       "Adds application APPID to package PKGID (made if missing), or changes it. A\n"
       "new application is a plain one labelled APPID; --game makes it a game.",
       "app com.acme.tetra com.acme.tetra --label \"Tetra 2\" --no-display", kAction, kParsed,
       AddAppOptions, RunApp},
      {"remove", "PKGID", "remove a package (no event)",
       "Removes package PKGID from the device, or forgets a held one, silently.",
       "remove com.acme.tetra", kAction, kParsed, NoOptions, RunRemove},
      {"preference", "KEY [VALUE]", "set an integer preference, or remove it",
       "Sets preference KEY to the integer VALUE; without VALUE removes it.",
       "preference memory/sysman/mmc 1", kAction, kParsed, NoOptions, RunPreference},
      {"card", "in|out", "insert or pull the storage card",
       "Sets the storage-card status (preference memory/sysman/mmc): 1 in, 0 out.\n"
       "After `start` (unless --without card-watch) the launcher sees the change and\n"
       "calls OnMMCStatusChanged with it.",
       "card out", kAction, kParsed, NoOptions,
       RunCard},
      {"screen", "WIDTH HEIGHT", "set the screen size",
       "Sets the platform's screen.width and screen.height features.", "screen 720 1280",
       kAction, kParsed, NoOptions, RunScreen},
      {"mdm", "reachable|unreachable [APPID=STATE...]", "set the policy service",
       "Makes the device-management service reachable or not, and gives applications\n"
       "a state: allowed, restricted or error. Unnamed ones are allowed.",
       "mdm reachable com.acme.tetra=restricted", kAction, kParsed, NoOptions, RunMdm},
      {"fail", "CALL [ERROR] [once|always]", "make a platform call fail; `fail clear`",
       "Makes platform call CALL (by its C name) return ERROR, an integer such as -22\n"
       "(invalid parameter): the next time (once, after --skip N others) or always.\n"
       "`fail clear` lifts every failure.",
       "fail app_info_get_label -22 once", kAction, kParsed,
       [](po::options_description& o) {
         o.add_options()("skip", po::value<int>()->default_value(0)->value_name("N"),
                         "let N calls pass first");
       },
       RunFail},
      {"before", "CALL COMMAND...", "run a command when the engine next makes CALL",
       "When the engine next makes platform call CALL, COMMAND runs first, in the\n"
       "middle of whatever the engine is doing: a package that completes while the\n"
       "launcher starts, say. Several `before` lines for one call run on its next\n"
       "calls, one each, in the order written.",
       "before app_info_filter_create install com.acme.late \"Late Game\"\nstart", kAction,
       kText, NoOptions, RunBefore},
      // ---- Events.
      {"install", "PKGID [LABEL]", "install a package, with its events",
       "Installs a package PKGID holding one game PKGID labelled LABEL (options change\n"
       "it), or the held package PKGID, sending STARTED, PROCESSING and COMPLETED.",
       "install com.acme.tetra \"Tetra Blocks\"", kAction, kParsed, AddBothOptions,
       RunInstall},
      {"update", "PKGID [LABEL]", "update a package, with its events",
       "Updates installed package PKGID, changing its application APPID (--app; by\n"
       "default the one named PKGID, else the first) by LABEL and the options, or sends\n"
       "the held package PKGID as the update.",
       "update com.acme.tetra \"Tetra Blocks 2\"\nupdate com.acme.tetra --enabled=false",
       kAction, kParsed,
       [](po::options_description& o) {
         AddBothOptions(o);
         o.add_options()("app", po::value<std::string>()->value_name("APPID"),
                         "the application to change (added if new)");
       },
       RunUpdate},
      {"uninstall", "PKGID", "uninstall a package, with its events",
       "Uninstalls package PKGID: STARTED while its applications can still be read,\n"
       "PROCESSING, then the package goes, then COMPLETED.",
       "uninstall com.acme.tetra", kAction, kParsed, NoOptions, RunUninstall},
      {"event", "EVENT STATE PKGID", "send one raw package event",
       "Sends one package event whatever the device holds. EVENT: install, uninstall,\n"
       "update or any integer; STATE: started, processing, completed, failed or any\n"
       "integer.",
       "event install started com.acme.ghost\nevent 7 -100 com.acme.ghost", kAction, kParsed,
       [](po::options_description& o) {
         o.add_options()("pkg-type", po::value<std::string>()->default_value("tpk"),
                         "package type")(
             "progress", po::value<int>()->default_value(0)->value_name("N"), "progress")(
             "error", po::value<int>()->default_value(0)->value_name("N"), "error code");
       },
       RunEvent},
      {"boot-done", "", "send the BootingDone signal on the system bus",
       "Sends deviced's BootingDone signal and says how many handlers it reached;\n"
       "`start` subscribes the engine, for the first signal only. Reaching none\n"
       "before `start` or after `start --without boot-signal`, it says so.",
       "boot-done", kAction, kParsed, NoOptions, RunBootDone},
      // ---- The engine.
      {"start", "", "the launcher start-up: engine, boot signal, card",
       "Does what the launcher application does at start-up:\n"
       "  engine       data_engin_initialization(): the first launch lays every game\n"
       "               out in menu 1 \"Apps\"\n"
       "  boot-signal  _RegisterEdbusSignalHandler(): `boot-done` reaches the engine,\n"
       "               which then looks up again the applications on the card\n"
       "  card-watch   the launcher watches the card status: `card in|out` calls\n"
       "               OnMMCStatusChanged(1|0)\n"
       "--without STEP leaves boot-signal or card-watch out, to make it by hand.",
       "start\nstart --without boot-signal --without card-watch", kAction, kParsed,
       [](po::options_description& o) {
         o.add_options()("without", po::value<std::vector<std::string> >()->value_name("STEP"),
                         "leave boot-signal or card-watch out (repeat for both)");
       },
       RunStart},
      {"stop", "", "data_engin_uninitialization()",
       "Calls data_engin_uninitialization(), which does nothing: the managers live\n"
       "until the process ends.",
       "stop", kAction, kParsed, NoOptions, RunStop},
      {"call", "NAME [ARG...]", "call an operation of the engine's managers",
       "Calls any public operation of LauncherDataManager, LauncherPackageManager,\n"
       "LogClientManager or SystemInfo and prints its result (first line), then its\n"
       "out-parameters and records, one per line. `call --list` lists them all and\n"
       "`call --help NAME` describes one. NAME is Class::Name, or Name alone when one\n"
       "class has it. Words are typed by the parameter: integers, true|false, texts\n"
       "((null) for a null const char*), records as FIELD=VALUE words.",
       "call GetMenuData 1\ncall GetBoxIdByAppId com.acme.tetra", kAction, kRaw, NoOptions,
       RunCall},
      {"on-card", "APPID...", "mark applications as living on the storage card",
       "Marks the cached information of each application as on the storage card, as\n"
       "the launcher application does (reading it into the cache first if needed).",
       "on-card com.acme.tetra", kAction, kParsed, NoOptions, RunOnCard},
      // ---- Views.
      {"layout", "[MENUID]", "show a menu's stored layout",
       "Shows menu MENUID (1) page by page as 4-column grids, each folder's pages\n"
       "(3 by 3) under the page holding it. [Name] is a folder, <Name> a shortcut.\n"
       "Cells are 16 terminal columns (CJK and emoji take two); a wider label is cut\n"
       "with ~. --json and --csv give one record a box: page, pageId, folder (its\n"
       "folder box, on a folder's page), boxId, col, row, label, appId, name,\n"
       "isFolder, boxType.",
       "layout --wide\nlayout --csv", kView, kParsed,
       [](po::options_description& o) {
         o.add_options()("ids", po::bool_switch(), "show box and page ids");
         AddStyleOptions(o, true);
       },
       RunLayout},
      {"folder", "BOXID", "show one folder's pages",
       "Shows the pages of folder box BOXID as 3-column grids, or as `layout` does\n"
       "with --wide, --json or --csv.",
       "folder 40 --ids", kView, kParsed,
       [](po::options_description& o) {
         o.add_options()("ids", po::bool_switch(), "show box and page ids");
         AddStyleOptions(o, true);
       },
       RunFolder},
      {"downloads", "", "show the download view",
       "Shows the engine's download view: the boxes not preloaded, on virtual pages;\n"
       "--wide, --json and --csv as for `layout`.",
       "downloads", kView, kParsed, [](po::options_description& o) { AddStyleOptions(o, true); },
       RunDownloads},
      {"alphabetical", "[PARENTID]", "show the alphabetical view",
       "Shows the engine's alphabetical view of menu PARENTID (1), or with --folder of\n"
       "folder box PARENTID; --wide, --json and --csv as for `layout`.",
       "alphabetical\nalphabetical 40 --folder", kView, kParsed,
       [](po::options_description& o) {
         o.add_options()("folder", po::bool_switch(), "PARENTID is a folder box");
         AddStyleOptions(o, true);
       },
       RunAlphabetical},
      {"log", "", "show the platform log",
       "Shows the log lines the last command that changed something wrote (--all:\n"
       "every line), as P/tag: text, a newline in a text as \\n. --message leaves out\n"
       "the \"file: function(line) >  \" prefix.\n"
       "After each command, korrin-sim says on stderr how many failures the engine\n"
       "logged. The engine logs much information at error priority (E/), so only E/\n"
       "lines that say something went wrong count: \"error\", \"fail\", \"cannot\",\n"
       "\"invalid\", \"Err :\", \"return [\", \"No page [\", \"No box [\"; not a call that\n"
       "said no with code 0 (\"FAILED [0]\") nor the look-up for an existing box that\n"
       "every install makes (\"cannot find box with appid\").",
       "log --priority E --grep \"Do not add\"", kView, kParsed,
       [](po::options_description& o) {
         o.add_options()("priority", po::value<std::string>()->value_name("V|D|I|W|E|F"),
                         "this priority and above")(
             "grep", po::value<std::string>()->value_name("TEXT"), "lines holding TEXT")(
             "all", po::bool_switch(), "every line since the start")(
             "message", po::bool_switch(), "leave out the file, function and line")(
             "dlogutil", po::bool_switch(), "as a phone's `dlogutil -v brief` prints it");
       },
       RunLog},
      {"trace", "[on|off]", "record the SQL the store runs, or show it",
       "`trace on` records each statement the store's connection runs, as it starts,\n"
       "with its parameters unbound; `trace` shows those recorded since the last\n"
       "`trace`. A connection that a command opens (`start`) is traced from the next\n"
       "command on.",
       "trace on\ncall GetMenuDataCount\ntrace", kView, kParsed, NoOptions, RunTrace},
      {"count", "CALL...", "how often the engine made platform calls",
       "Prints how many times each platform call was made since the device began.",
       "count preference_get_int mdm_get_service", kView, kParsed, NoOptions, RunCount},
      {"tables", "[TABLE...]", "show the raw tables",
       "Shows every row of the layout database's tables (Menus, Pages, Boxes). --json\n"
       "gives one object a row, its table first; --csv one table, named.",
       "tables Menus Pages\ntables Boxes --csv", kView, kParsed,
       [](po::options_description& o) { AddStyleOptions(o, false); }, RunTables},
      {"changes", "", "show what the last command did to the database",
       "Shows the rows the last command that changed something added (+), removed (-)\n"
       "and changed (~, column by column).",
       "uninstall com.acme.tetra\nchanges", kView, kParsed, NoOptions, RunChanges},
      {"say", "TEXT...", "print a sentence", "Prints its words: narration for stories.",
       "say Now the card comes out.", kView, kText, NoOptions, RunSay},
      {"help", "[COMMAND]", "list the commands, or describe one",
       "Lists the commands, or describes COMMAND with its options and an example.",
       "help install", kView, kParsed, NoOptions, RunHelp},
  };
}

// Script lines that are not commands (the session reads them itself), for
// `help` to describe as it does commands.
const std::vector<Command>& Topics() {
  static const std::vector<Command> topics = {
      {"expect", "", "check what the previous command printed",
       "The lines that follow, up to a blank line or `end`, must equal what the\n"
       "previous command printed. Runs of blanks count as one; trailing blanks do not\n"
       "count. A difference stops the script with a diff.",
       "layout\nexpect\nmenu 1 \"Apps\"\npage 1\n 1 | Tetra Blocks\nend", false,
       Command::kOptions, NoOptions, nullptr},
      {"quoting", "", "quotes and backslashes: how words split", kQuotingHelp,
       "install com.acme.c \"Don't Starve\" --preload\n"
       "game com.acme.o 'O'\\''Brien \"the\" Racer'\n"
       "call InsertMenuData name=$'two\\nlines' type=0\n"
       "game com.acme.x --label \"\"",
       false, Command::kOptions, NoOptions, nullptr},
      {"quit", "", "end the shell, or the script here (also exit, .quit)",
       "Ends the shell as Ctrl-D does; in a script, ends that script there: the\n"
       "lines after it do not run.",
       "quit", false, Command::kOptions, NoOptions, nullptr},
  };
  return topics;
}

const Command* Named(const std::vector<Command>& commands, const std::string& name) {
  for (const Command& command : commands) {
    if (command.name == name) return &command;
  }
  return NULL;
}

// One line of the command list: the synopsis, then the summary at column 32.
void PrintSummary(const Command& command, std::ostream& out) {
  std::string synopsis = command.name + (command.args.empty() ? "" : " " + command.args);
  // A long synopsis gets a line of its own, so that no line passes 80 columns.
  if (synopsis.size() >= 30) synopsis += "\n" + std::string(32, ' ');
  out << "  " << synopsis << std::string(synopsis.size() < 30 ? 30 - synopsis.size() : 0, ' ')
      << command.summary << "\n";
}

}  // namespace

bool Args::Has(const std::string& name) const { return values_.count(name) > 0; }

std::string Args::Text(const std::string& name) const {
  return Has(name) ? values_[name].as<std::string>() : std::string();
}

std::vector<std::string> Args::List(const std::string& name) const {
  return Has(name) ? values_[name].as<std::vector<std::string> >()
                   : std::vector<std::string>();
}

const std::vector<Command>& Commands() {
  static const std::vector<Command> commands = [] {
    std::vector<Command> all = MakeCommands();
    for (Command& c : DeviceCommands()) all.push_back(c);
    for (Command& c : LayoutCommands()) all.push_back(c);
    for (Command& c : PhonedbCommands()) all.push_back(c);
    return all;
  }();
  return commands;
}

const Command* FindCommand(const std::string& name) { return Named(Commands(), name); }

po::options_description VisibleOptions(const Command& command) {
  po::options_description options("options", 80, 40);
  command.options(options);
  return options;
}

void PrintCommandList(std::ostream& out) {
  out << "usage: korrin-sim [demo] [--root DIR | --keep]\n"
         "       korrin-sim run [--root DIR | --keep] FILE...    (FILE - is standard input)\n"
         "       korrin-sim shell [--root DIR | --keep]\n"
         "       korrin-sim open FILE [SCRIPT...] [--in-place] [--root DIR | --keep]\n"
         "       korrin-sim COMMAND [ARG...] [--db FILE [--in-place]]\n"
         "       korrin-sim serve [--root DIR | --db FILE] [--port N] [--script FILE]\n"
         "       korrin-sim help [COMMAND]\n"
         "       korrin-sim --version\n\n"
         "Without --root, the device lives in a fresh folder under $TMPDIR (/tmp),\n"
         "removed at exit unless --keep (or a failed `run`, which says so). A kept\n"
         "root keeps the phone in ROOT/device.ksim beside its database, and the next\n"
         "run on that root starts with both.\n"
         "`open` plays the scripts (or a shell) on a phone's layout database FILE: on\n"
         "a copy, or with --in-place on FILE itself; `start` opens it in the engine.\n"
         "A COMMAND alone runs once, with --db on a copy of FILE: `korrin-sim check\n"
         "--db phone.db` exits 1 when it finds a problem.\n"
         "`serve` shows the phone's home screen in a browser, live, on 127.0.0.1\n"
         "only (default port 8080): events, edits and the log, each edit also\n"
         "shown as the command that makes it; `serve --script tools/korrin-sim/\n"
         "demo.ksim` serves the demo.\n"
         "Scripts hold one command per line; # starts a comment line. Words split\n"
         "as in the POSIX shell, nothing expanded: `help quoting`.\n\n"
         "commands:\n";
  for (const Command& command : Commands()) PrintSummary(command, out);
  for (const Command& topic : Topics()) PrintSummary(topic, out);
  out << "\n`korrin-sim help COMMAND` describes one, with its options.\n\n"
         "a first script: the launcher starts on an empty phone, two games are\n"
         "installed and one uninstalled, and the layout is checked:\n"
         "  start\n"
         "  install com.acme.tetra \"Tetra Blocks\"\n"
         "  install com.acme.zeppelin \"Zeppelin\"\n"
         "  uninstall com.acme.tetra\n"
         "  layout\n"
         "  expect\n"
         "  menu 1 \"Apps\"\n"
         "  page 1\n"
         "   1 | Zeppelin\n"
         "  end\n";
}

void PrintCommandHelp(const std::string& name, std::ostream& out) {
  const Command* command = FindCommand(name);
  if (command == NULL) command = Named(Topics(), name);
  if (command == NULL) {
    std::vector<std::string> names;
    for (const Command& known : Commands()) names.push_back(known.name);
    for (const Command& topic : Topics()) names.push_back(topic.name);
    std::string hint = DidYouMean(name, names);
    throw UsageError("no command '" + name + "'" + (hint.empty() ? " (`help` lists them)" : hint));
  }
  if (command->name != "quoting") {  // a topic, not a line to write
    out << "usage: " << command->name << (command->args.empty() ? "" : " " + command->args)
        << "\n\n";
  }
  out << command->details << "\n";
  po::options_description options = VisibleOptions(*command);
  if (!options.options().empty()) out << "\n" << options;
  if (command->name == "call") {
    out << "\noperations:\n";
    ListCalls(out);
  }
  out << "\nexample:\n";
  std::istringstream example(command->example);
  std::string line;
  while (std::getline(example, line)) out << "  " << line << "\n";
}

}  // namespace korrin_sim
