#include "complete.h"

#include <set>
#include <sstream>

#include "calls.h"
#include "commands.h"
#include "sim/device.h"

namespace korrin_sim {

namespace {

// Class::Name and Name for each operation `call --list` shows.
void AddCallNames(std::set<std::string>& names) {
  std::ostringstream list;
  ListCalls(list);
  std::istringstream lines(list.str());
  std::string line;
  while (std::getline(lines, line)) {
    std::string name = line.substr(0, line.find(' '));
    names.insert(name);
    size_t colons = name.rfind("::");
    if (colons != std::string::npos) names.insert(name.substr(colons + 2));
  }
  names.insert({"--list", "--help"});
}

}  // namespace

std::vector<std::string> Completions(const std::string& before, const std::string& word) {
  std::istringstream split(before);
  std::vector<std::string> words;
  for (std::string w; split >> w;) words.push_back(w);
  std::set<std::string> names;
  const Command* command = words.empty() ? NULL : FindCommand(words[0]);
  if (words.empty() || (words.size() == 1 && words[0] == "help")) {
    for (const Command& c : Commands()) names.insert(c.name);
    names.insert({"expect", "quit", "exit", ".quit"});
  } else if (command != NULL && word.compare(0, 1, "-") == 0 && command->name != "call") {
    boost::program_options::options_description options = VisibleOptions(*command);
    for (const auto& option : options.options()) {
      names.insert("--" + option->long_name());
    }
  } else if (command != NULL && command->name == "call" &&
             (words.size() == 1 || (words.size() == 2 && words[1] == "--help"))) {
    AddCallNames(names);
  } else if (command != NULL && (command->name == "fail" || command->name == "count" ||
                                 command->name == "before")) {
    for (const std::string& call : sim::Device::PlatformCalls()) names.insert(call);
  }
  if (names.empty() && command != NULL) {
    for (const sim::Package& pkg : sim::Device::Get().Packages()) {
      names.insert(pkg.id);
      for (const sim::App& app : pkg.apps) names.insert(app.id);
    }
  }
  std::vector<std::string> matches;
  for (const std::string& name : names) {
    if (name.compare(0, word.size(), word) == 0) matches.push_back(name);
  }
  return matches;
}

}  // namespace korrin_sim
