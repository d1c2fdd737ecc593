#include "session.h"

#include <ctype.h>
#include <dlog.h>

#include <algorithm>
#include <iostream>
#include <sstream>
#include <utility>

#include <sqlite3.h>

#include <boost/program_options.hpp>
#include <dtl/dtl.hpp>

#include "cli.h"
#include "commands.h"
#include "common/device-path.h"
#include "korrin-data/korrin-data.h"
#include "words.h"

namespace po = boost::program_options;

namespace korrin_sim {

namespace {

// A positional argument of a synopsis such as "PKGID [LABEL]" or "[APPID...]".
struct Positional {
  std::string name;
  bool optional;
  bool repeated;
};

std::vector<Positional> Positionals(const std::string& synopsis) {
  std::vector<Positional> positionals;
  std::istringstream words(synopsis);
  std::string word;
  while (words >> word) {
    Positional p{word, false, false};
    if (p.name.front() == '[') {
      p.optional = true;
      p.name = p.name.substr(1, p.name.size() - 2);
    }
    if (p.name.size() > 3 && p.name.compare(p.name.size() - 3, 3, "...") == 0) {
      p.repeated = true;
      p.name.resize(p.name.size() - 3);
    }
    positionals.push_back(p);
  }
  return positionals;
}

// "--game false" would set --game and hand "false" to a positional argument:
// refuse it, since the value was meant for the option.
void RefuseSpacedFlagValue(const Command& command, const po::options_description& options,
                           const std::vector<std::string>& words) {
  static const std::vector<std::string> kBoolWords = {"true", "false", "yes", "no",
                                                      "on",   "off",   "1",   "0"};
  for (size_t i = 0; i + 1 < words.size(); ++i) {
    const std::string& word = words[i];
    if (word.compare(0, 2, "--") != 0 || word.find('=') != std::string::npos) continue;
    const po::option_description* option = options.find_nothrow(word.substr(2), false);
    if (option == NULL || !dynamic_cast<const po::typed_value<bool>*>(option->semantic().get()) ||
        std::find(kBoolWords.begin(), kBoolWords.end(), words[i + 1]) == kBoolWords.end()) {
      continue;
    }
    throw UsageError(command.name + ": write " + word + "=" + words[i + 1] + ", not " + word +
                     " " + words[i + 1]);
  }
}

// Parses |words| as |command|'s arguments into |values|; throws UsageError.
void Parse(const Command& command, const std::vector<std::string>& words,
           po::variables_map& values) {
  po::options_description all = VisibleOptions(command);
  po::positional_options_description order;
  std::vector<Positional> positionals = Positionals(command.args);
  for (const Positional& p : positionals) {
    if (p.repeated) {
      all.add_options()(p.name.c_str(), po::value<std::vector<std::string> >());
    } else {
      all.add_options()(p.name.c_str(), po::value<std::string>());
    }
    order.add(p.name.c_str(), p.repeated ? -1 : 1);
  }
  // Long options only, never abbreviated: "-5" is a number, "--lab" a mistake.
  int style = po::command_line_style::unix_style & ~po::command_line_style::allow_short &
              ~po::command_line_style::allow_guessing;
  try {
    RefuseSpacedFlagValue(command, all, words);
    po::store(po::command_line_parser(words).options(all).positional(order).style(style).run(),
              values);
    po::notify(values);
  } catch (const po::unknown_option& e) {
    po::options_description visible = VisibleOptions(command);
    std::vector<std::string> known;
    for (const auto& option : visible.options()) {
      known.push_back("--" + option->long_name());
    }
    std::string word = e.get_option_name();
    throw UsageError(command.name + ": unknown option '" + word + "'" +
                     DidYouMean(word.substr(0, word.find('=')), known));
  } catch (const po::error& e) {
    throw UsageError(command.name + ": " + e.what());
  }
  for (const Positional& p : positionals) {
    if (!p.optional && values.count(p.name) == 0) {
      throw UsageError(command.name + ": missing " + p.name + " (usage: " + command.name +
                       " " + command.args + ")");
    }
  }
}

// A line as `expect` compares it: runs of blanks as one, no trailing blanks.
std::string Normalized(const std::string& line) {
  std::string out;
  for (char c : line) {
    bool blank = c == ' ' || c == '\t';
    if (blank && (out.empty() || out.back() == ' ')) {
      if (out.empty()) out += ' ';
      continue;
    }
    out += blank ? ' ' : c;
  }
  if (out == " ") out.clear();
  while (!out.empty() && out.back() == ' ') out.pop_back();
  return out;
}

std::vector<std::string> NormalizedLines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  std::string line;
  while (std::getline(in, line)) lines.push_back(Normalized(line));
  while (!lines.empty() && lines.back().empty()) lines.pop_back();
  return lines;
}

// |line| after its first word, without the blanks around it.
std::string RestOfLine(const std::string& line) {
  size_t start = line.find_first_not_of(" \t");
  start = line.find_first_of(" \t", start);
  start = line.find_first_not_of(" \t", start);
  if (start == std::string::npos) return "";
  return line.substr(start, line.find_last_not_of(" \t") + 1 - start);
}

bool IsBlank(const std::string& line) { return Normalized(line).empty(); }

// Whether |line| holds |word| alone, blanks around it allowed.
bool IsOnly(const std::string& line, const std::string& word) {
  size_t first = line.find_first_not_of(" \t");
  return first != std::string::npos && Normalized(line.substr(first)) == word;
}

bool IsComment(const std::string& line) {
  size_t first = line.find_first_not_of(" \t");
  return first != std::string::npos && line[first] == '#';
}


bool IsNameStart(char c) { return std::isalpha(static_cast<unsigned char>(c)) != 0; }
bool IsNameChar(char c) { return std::isalnum(static_cast<unsigned char>(c)) != 0 || c == '_'; }

}  // namespace

void Session::Bind(const std::string& name, int id) {
  CheckName(name);
  names_[name] = id;
}

void Session::CheckName(const std::string& name) const {
  if (name.empty() || !IsNameStart(name[0]) ||
      !std::all_of(name.begin(), name.end(), IsNameChar)) {
    throw UsageError("'" + name + "' is not a name: letters, digits and _, a letter first");
  }
  if (name == "last") throw UsageError("$last is the last insert's id; `let` another name");
}

std::string Session::Value(const std::string& name) const {
  std::map<std::string, int>::const_iterator bound = names_.find(name);
  if (bound == names_.end()) {
    throw UsageError("$" + name + " is not bound" +
                     (name == "last" ? ": nothing was inserted yet"
                                     : ": `let " + name + " = COMMAND` binds it"));
  }
  return std::to_string(bound->second);
}

void Session::ReportFailures(size_t logMark, bool action) const {
  const std::vector<sim::LogLine>& logs = sim::Device::Get().Logs();
  size_t failures = 0;
  for (size_t i = logMark; i < logs.size(); ++i) failures += FailureLogged(logs[i]);
  if (failures == 0) return;
  std::cout << std::flush;
  std::cerr << where_ << failures << (failures == 1 ? " failure" : " failures")
            << " logged by the engine (`log " << (action ? "" : "--all ")
            << "--priority E` shows them)" << std::endl;
}

Session::Session(bool printActions, bool recordChanges)
    : printActions_(printActions), recordChanges_(recordChanges), tracing_(false), logMark_(0) {}

Session::~Session() {
  if (tracing_) Trace(false);  // the connection outlives the session
}

namespace {

int KeepStatement(unsigned, void* statements, void*, void* text) {
  static_cast<std::vector<std::string>*>(statements)->push_back(static_cast<const char*>(text));
  return 0;
}

}  // namespace

void Session::Trace(bool on) {
  tracing_ = on;
  statements_.clear();
  FollowStoreTrace();
}

std::vector<std::string> Session::TakeStatements() {
  std::vector<std::string> taken;
  taken.swap(statements_);
  return taken;
}

void Session::FollowStoreTrace() {
  sqlite3* db = korrin::DataManager().m_db;
  if (db == NULL) return;
  sqlite3_trace_v2(db, tracing_ ? SQLITE_TRACE_STMT : 0, tracing_ ? KeepStatement : NULL,
                   &statements_);
}

std::string Session::DatabasePath() const { return korrin::DevicePath(korrin::kGameDataDbPath); }

Session::Prepared Session::Prepare(const std::string& written) const {
  Prepared prepared;
  const std::string& line = written;
  std::string name = line.substr(line.find_first_not_of(" \t"));
  name = name.substr(0, name.find_first_of(" \t"));
  prepared.command = FindCommand(name);
  if (prepared.command == NULL) {
    std::vector<std::string> names;
    for (const Command& command : Commands()) names.push_back(command.name);
    std::string hint = DidYouMean(name, names);
    throw UsageError("unknown command '" + name + "'" +
                     (hint.empty() ? " (`help` lists the commands)" : hint));
  }
  prepared.rest = RestOfLine(line);
  if (prepared.command->parsing != Command::kText) {
    prepared.words =
        SplitWords(prepared.rest, [this](const std::string& name) { return Value(name); });
  }
  if (prepared.command->parsing == Command::kOptions) {
    Parse(*prepared.command, prepared.words, prepared.values);
  }
  return prepared;
}

void Session::Execute(const std::string& line) {
  if (IsBlank(line) || IsComment(line)) return;
  Prepared prepared = Prepare(line);
  const Command& command = *prepared.command;

  Snapshot before;
  size_t logMark = sim::Device::Get().Logs().size();
  bool record = command.action && recordChanges_;
  if (record) before = TakeSnapshot(DatabasePath());
  // A command may run inside another (see `before`): print where it prints.
  std::ostream& outer = Out();
  std::ostringstream output;
  SetOut(&output);
  FollowStoreTrace();
  returned_.reset();
  TakeReturnedId(NULL);  // one a failed command left
  ++depth_;
  try {
    command.run(*this, Args(prepared.values, prepared.words, prepared.rest));
  } catch (...) {
    --depth_;
    SetOut(&outer);
    beforeError_ = nullptr;  // the command's own error is the one to tell
    throw;
  }
  --depth_;
  SetOut(&outer);
  int id = 0;
  if (TakeReturnedId(&id)) returned_ = names_["last"] = id;
  if (beforeError_) std::rethrow_exception(std::exchange(beforeError_, nullptr));
  lastOutput_ = output.str();
  if (command.action) {
    before_ = before;
    if (record) after_ = TakeSnapshot(DatabasePath());
    logMark_ = logMark;
  }
  if (&outer != &std::cout) {
    outer << lastOutput_;
  } else if (printActions_ || !command.action) {
    std::cout << lastOutput_ << std::flush;
  }
  if (depth_ == 0) ReportFailures(logMark, command.action);
}

void Session::RunBefore(const std::string& call, const std::string& line) {
  std::deque<std::string>& queue = beforeCalls_[call];
  queue.push_back(line);
  if (queue.size() == 1) ArmBefore(call);  // otherwise armed already
}

void Session::ArmBefore(const std::string& call) {
  sim::Device::Get().BeforeNext(call, [this, call]() {
    std::string next = beforeCalls_[call].front();
    beforeCalls_[call].pop_front();
    try {
      Execute(next);
    } catch (...) {
      if (!beforeError_) beforeError_ = std::current_exception();
    }
    if (!beforeCalls_[call].empty()) ArmBefore(call);  // for the call after this one
  });
}

void Session::Expect(const std::vector<std::string>& expectedLines) const {
  std::vector<std::string> expected;
  for (const std::string& line : expectedLines) expected.push_back(Normalized(line));
  while (!expected.empty() && expected.back().empty()) expected.pop_back();
  std::vector<std::string> printed = NormalizedLines(lastOutput_);
  if (expected == printed) return;
  dtl::Diff<std::string> diff(expected, printed);
  diff.compose();
  std::ostringstream message;
  message << "expect: the previous command printed something else (-expected +printed):";
  for (const std::pair<std::string, dtl::elemInfo>& step : diff.getSes().getSequence()) {
    char mark = step.second.type == dtl::SES_DELETE ? '-'
                : step.second.type == dtl::SES_ADD  ? '+'
                                                    : ' ';
    message << "\n" << mark << step.first;
  }
  throw UsageError(message.str());
}

Session::Fed Session::Feed(const std::string& line) {
  if (!block_) {
    if (!IsOnly(line, "expect")) {
      Execute(line);
      return Fed::kRan;
    }
    block_.emplace();
    return Fed::kCollected;
  }
  if (!IsBlank(line) && !IsOnly(line, "end")) {
    block_->push_back(line);
    return Fed::kCollected;
  }
  std::vector<std::string> block = std::move(*block_);
  block_.reset();
  Expect(block);
  return Fed::kChecked;
}

Session::Fed Session::Finish() { return block_ ? Feed("") : Fed::kRan; }

bool Session::IsQuit(const std::string& line) {
  size_t first = line.find_first_not_of(" \t");
  if (first == std::string::npos) return false;
  std::string word = line.substr(first, line.find_last_not_of(" \t") + 1 - first);
  return word == "quit" || word == "exit" || word == ".quit";
}

bool Session::RunScript(std::istream& in, const std::string& file, std::ostream& errors) {
  std::string line;
  int number = 0;
  int at = 0;  // where an error is told: its line, or the `expect` of its block
  try {
    while (std::getline(in, line)) {
      ++number;
      if (!block_) at = number;
      if (!block_ && IsQuit(line)) break;
      where_ = file + ":" + std::to_string(number) + ": ";
      Feed(line);
    }
    Finish();
    where_.clear();
  } catch (const std::exception& e) {
    where_.clear();
    std::cout << std::flush;
    errors << file << ":" << at << ": " << e.what() << std::endl;
    return false;
  }
  return true;
}

}  // namespace korrin_sim
