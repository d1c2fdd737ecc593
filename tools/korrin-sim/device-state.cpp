#include "device-state.h"

#include <ctype.h>
#include <errno.h>
#include <stdio.h>
#include <string.h>

#include <algorithm>
#include <fstream>
#include <sstream>
#include <vector>

#include "cli.h"
#include "commands.h"
#include "session.h"
#include "sim/device.h"
#include "words.h"

namespace korrin_sim {

namespace {

const char kCardKey[] = "memory/sysman/mmc";
const char kScreenWidth[] = "tizen.org/feature/screen.width";
const char kScreenHeight[] = "tizen.org/feature/screen.height";

// The commands a device script may hold: they change the phone and nothing
// else.
const std::vector<std::string> kDeviceCommands = {"sample-device", "game", "package", "app",
                                                  "remove", "preference", "card", "screen",
                                                  "mdm"};

// |text| as one word of a command line that reads back as written.
std::string Word(const std::string& text) { return ShellWord(text); }

// " --name=VALUE": with '=', a value that starts with "--" stays a value.
std::string Option(const std::string& name, const std::string& value) {
  return " --" + name + "=" + Word(value);
}

std::string Flag(const std::string& name, bool value) {
  return " --" + name + (value ? "=true" : "=false");
}

template <typename T>
std::string Text(const T& optionalText, const T& base, const std::string& name) {
  if (!optionalText) return base ? " --no-" + name : "";
  return base && *base == *optionalText ? "" : Option(name, *optionalText);
}

// The options that turn |base| into |app|.
std::string AppOptions(const sim::App& app, const sim::App& base) {
  std::string out = Text(app.label, base.label, "label") + Text(app.icon, base.icon, "icon");
  if (app.type != base.type) out += Option("type", app.type);
  if (app.game != base.game) out += Flag("game", app.game);
  if (app.noDisplay != base.noDisplay) out += Flag("no-display", app.noDisplay);
  if (app.enabled != base.enabled) out += Flag("enabled", app.enabled);
  if (app.taskManage != base.taskManage) out += Flag("task-manage", app.taskManage);
  if (app.component != base.component) {
    size_t c = static_cast<size_t>(app.component);
    out += Option("component", c < kComponentNames.size() ? kComponentNames[c]
                                                          : std::to_string(app.component));
  }
  if (app.categories != base.categories) {
    for (const std::string& category : app.categories) out += Option("category", category);
  }
  if (app.metadata != base.metadata) {
    for (const auto& pair : app.metadata) out += Option("metadata", pair.first + "=" + pair.second);
  }
  return out;
}

std::string PackageOptions(const sim::Package& pkg) {
  sim::Package base = sim::MakePackage(pkg.id, {});
  std::string out;
  if (pkg.type != base.type) out += Option("pkg-type", pkg.type);
  if (pkg.system != base.system) out += Flag("system", pkg.system);
  if (pkg.removable != base.removable) out += Flag("removable", pkg.removable);
  if (pkg.preload != base.preload) out += Flag("preload", pkg.preload);
  if (pkg.supportDisable != base.supportDisable) out += Flag("support-disable", pkg.supportDisable);
  if (pkg.disabled != base.disabled) out += Flag("disabled", pkg.disabled);
  return out;
}

// A package of one game of its own id is a `game` line; any other a
// `package` line and an `app` line per application.
void WritePackage(const sim::Package& pkg, std::ostream& out) {
  if (pkg.apps.size() == 1 && pkg.apps[0].id == pkg.id && pkg.apps[0].game) {
    const sim::App& app = pkg.apps[0];
    bool labelled = app.label && !app.label->empty() && (*app.label)[0] != '-';
    sim::App base = sim::GameApp(app.id, labelled ? *app.label : app.id);
    out << "game " << Word(app.id) << " " << Word(*base.label) << AppOptions(app, base)
        << PackageOptions(pkg) << "\n";
    return;
  }
  out << "package " << Word(pkg.id) << PackageOptions(pkg) << "\n";
  for (const sim::App& app : pkg.apps) {
    out << "app " << Word(pkg.id) << " " << Word(app.id)
        << AppOptions(app, sim::PlainApp(app.id, app.id)) << "\n";
  }
}

const char* MdmStateName(mdm_status_t state) {
  return state == MDM_STATUS_ERROR ? "error" : state == MDM_RESTRICTED ? "restricted" : "allowed";
}

std::string CommandName(const std::string& line) {
  std::istringstream words(line);
  std::string name;
  words >> name;
  return name;
}

// Plays |lines| (numbered from 1, in |file|) on the phone, cleared first, in
// a session of its own, so that no held package or pending `before` line of
// the caller's takes them.
void Play(const std::vector<std::string>& lines, const std::string& file) {
  Session player(/*printActions=*/false, /*recordChanges=*/false);
  for (size_t i = 0; i < lines.size(); ++i) {
    try {
      if (i == 0) sim::Device::Get().ClearPhone();
      player.Execute(lines[i]);
    } catch (const std::exception& e) {
      throw UsageError(file + ":" + std::to_string(i + 1) + ": " + e.what());
    }
  }
  if (lines.empty()) sim::Device::Get().ClearPhone();
}

std::vector<std::string> Lines(std::istream& in) {
  std::vector<std::string> lines;
  for (std::string line; std::getline(in, line);) lines.push_back(line);
  return lines;
}

}  // namespace

std::string DeviceScript() {
  sim::Device& device = sim::Device::Get();
  std::ostringstream out;
  out << "# A simulated phone, as korrin-sim's device commands (`load` plays them).\n";
  for (const sim::Package& pkg : device.Packages()) WritePackage(pkg, out);
  const std::map<std::string, int>& info = device.SystemInfo();
  if (info.count(kScreenWidth) && info.count(kScreenHeight)) {
    out << "screen " << info.at(kScreenWidth) << " " << info.at(kScreenHeight) << "\n";
  }
  for (const auto& preference : device.Preferences()) {
    if (preference.first == kCardKey && (preference.second == 0 || preference.second == 1)) {
      out << "card " << (preference.second ? "in" : "out") << "\n";
    } else {
      out << "preference " << Word(preference.first) << " " << preference.second << "\n";
    }
  }
  if (!device.MdmReachable() || !device.MdmStates().empty()) {
    out << "mdm " << (device.MdmReachable() ? "reachable" : "unreachable");
    for (const auto& state : device.MdmStates()) {
      out << " " << Word(state.first + "=" + MdmStateName(state.second));
    }
    out << "\n";
  }
  return out.str();
}

std::string DeviceFile(const std::string& root) { return root + "/device.ksim"; }

void SaveDevice(const std::string& file) {
  std::string partial = file + ".partial";
  {
    std::ofstream out(partial, std::ios::trunc);
    out << DeviceScript();
    out.close();
    if (!out) throw UsageError("cannot write " + partial + ": " + strerror(errno));
  }
  if (rename(partial.c_str(), file.c_str()) != 0) {
    throw UsageError("cannot write " + file + ": " + strerror(errno));
  }
}

void LoadDevice(const std::string& file) {
  std::ifstream in(file);
  if (!in) throw UsageError("cannot read " + file + ": " + strerror(errno));
  std::vector<std::string> lines = Lines(in);
  Session checker(false, false);
  for (size_t i = 0; i < lines.size(); ++i) {
    std::string name = CommandName(lines[i]);
    if (name.empty() || name[0] == '#') continue;
    std::string where = file + ":" + std::to_string(i + 1) + ": ";
    if (std::find(kDeviceCommands.begin(), kDeviceCommands.end(), name) == kDeviceCommands.end()) {
      throw UsageError(where + "`" + name + "` is not a device command");
    }
    try {
      checker.Check(lines[i]);
    } catch (const std::exception& e) {
      throw UsageError(where + e.what());
    }
  }
  std::istringstream current(DeviceScript());
  std::vector<std::string> backup = Lines(current);
  try {
    Play(lines, file);
  } catch (...) {
    Play(backup, "(the phone before)");
    throw;
  }
}

// ---- `save` and `load`.

namespace {

void RunSave(Session&, const Args& args) {
  if (args.Has("FILE")) {
    SaveDevice(args.Text("FILE"));
  } else {
    Out() << DeviceScript();
  }
}

void RunLoad(Session&, const Args& args) { LoadDevice(args.Text("FILE")); }

void NoOptions(boost::program_options::options_description&) {}

}  // namespace

std::vector<Command> DeviceCommands() {
  return {
      {"save", "[FILE]", "save the phone as a script of device commands",
       "Writes the simulated phone (packages with every property of their\n"
       "applications, card, screen, policy, preferences) to FILE as the device\n"
       "commands that make it; without FILE prints them. `load FILE` brings it back.\n"
       "The layout database is not in it. Under --root (or --keep) korrin-sim keeps\n"
       "the phone so in ROOT/device.ksim, and loads it when it starts on that root.",
       "save phone.ksim\nload phone.ksim", false, Command::kOptions, NoOptions, RunSave},
      {"load", "FILE", "replace the phone with a saved one (no event)",
       "Replaces the phone's packages, card, screen, policy and preferences with those\n"
       "script FILE makes (written by `save`; device commands only), silently: no\n"
       "package event reaches the engine. A bad line changes nothing.",
       "load phone.ksim", true, Command::kOptions, NoOptions, RunLoad},
  };
}

}  // namespace korrin_sim
