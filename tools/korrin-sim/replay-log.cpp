// From a phone's log to a scenario: the package tracker logs each job it runs
// as "#Step 3 size[N]", then for each of its N applications "appId[ID]"
// followed by "#8" (uninstall), "#9" (update), "appId[ID] mdm is not enabled"
// (install, policy service off) or nothing more (install with the policy
// service on). The package's own id is never logged, so a job is replayed as
// a package named after its first application.
#include <stdio.h>
#include <unistd.h>

#include <map>
#include <optional>
#include <regex>
#include <set>

#include "phone-db.h"

namespace korrin_sim {

namespace {

// The message of one line of dlogutil output, whatever its format; a line in
// none (raw, or the text under a `long` header) is its own message.
std::string Message(const std::string& line) {
  static const std::regex kFormats[] = {
      // threadtime: "MM-DD HH:MM:SS.mmm[+ZZZZ] PID TID P TAG: message"
      std::regex(R"(^\d\d-\d\d \d\d:\d\d:\d\d\.\d+\S* +\d+ +\d+ [VDIWEF] [^:]*: (.*)$)"),
      // time: "MM-DD HH:MM:SS.mmm[+ZZZZ] P/TAG(PID): message"
      std::regex(R"(^\d\d-\d\d \d\d:\d\d:\d\d\.\d+\S* [VDIWEF]/[^(]*\( *\d+\): (.*)$)"),
      // brief: "P/TAG(PID): message"
      std::regex(R"(^[VDIWEF]/[^(:]*\( *\d+\): (.*)$)"),
      // thread: "P(PID:TID) message"
      std::regex(R"(^[VDIWEF]\( *\d+: *\d+\) (.*)$)"),
      // process: "P(PID) message  (TAG)"
      std::regex(R"(^[VDIWEF]\( *\d+\) (.*)  \([^)]*\)$)"),
      // tag: "P/TAG: message"
      std::regex(R"(^[VDIWEF]/[^:]*: (.*)$)"),
  };
  std::smatch match;
  for (const std::regex& format : kFormats) {
    if (std::regex_match(line, match, format)) return match[1];
  }
  return line;
}

// The job lines, as the engine writes them after its "file: function(line) >  "
// prefix (which `log --message` leaves out).
const std::regex kPrefix(R"(^\S+: (\w+)\(\d+\) >  (.*)$)");
const std::regex kStep3(R"(^#Step 3 size\[(\d+)\]$)");
const std::regex kMdmOff(R"(^appId\[(.*)\] mdm is not enabled$)");
const std::regex kAppId(R"(^appId\[(.*)\]$)");

enum Kind { kUnknown, kInstall, kUpdate, kUninstall };
const char* const kKindNames[] = {"job", "install", "update", "uninstall"};

struct Job {
  int line;
  size_t size;
  std::vector<std::string> appIds;
  Kind kind = kUnknown;
};

// Writes the jobs as commands, keeping track of what the script has put on
// the simulated device, which an update or uninstall needs there.
class ScriptWriter {
 public:
  explicit ScriptWriter(std::ostream& out) : out_(out) {}

  void Write(const Job& job) {
    const std::vector<std::string>& apps = job.appIds;
    out_ << "# line " << job.line << ": " << kKindNames[job.kind] << " of " << Joined(apps)
         << "\n";
    if (job.kind == kInstall) {
      if (apps.size() == 1) {
        out_ << "install " << apps[0] << "\n";
      } else {
        out_ << "package " << apps[0] << " --held\n";
        for (const std::string& app : apps) out_ << "app " << apps[0] << " " << app << " --game\n";
        out_ << "install " << apps[0] << "\n";
      }
      for (const std::string& app : apps) packageOf_[app] = apps[0];
      return;
    }
    std::string pkg = PutOnDevice(apps);
    out_ << (job.kind == kUpdate ? "update " : "uninstall ") << pkg << "\n";
    if (job.kind == kUninstall) {
      for (auto it = packageOf_.begin(); it != packageOf_.end();) {
        it = it->second == pkg ? packageOf_.erase(it) : std::next(it);
      }
    }
  }

 private:
  static std::string Joined(const std::vector<std::string>& words) {
    std::string out;
    for (const std::string& word : words) out += (out.empty() ? "" : " ") + word;
    return out;
  }

  // The package holding |apps|: one the script installed, or one it adds now,
  // silently, named after the first (its label is not in the log).
  std::string PutOnDevice(const std::vector<std::string>& apps) {
    auto known = packageOf_.find(apps[0]);
    if (known != packageOf_.end()) return known->second;
    out_ << "# not installed by this script: on the device without an event, labelled by id\n"
         << "game " << apps[0] << " " << apps[0] << "\n";
    for (size_t i = 1; i < apps.size(); ++i) {
      out_ << "app " << apps[0] << " " << apps[i] << " --game\n";
    }
    for (const std::string& app : apps) packageOf_[app] = apps[0];
    return apps[0];
  }

  std::ostream& out_;
  std::map<std::string, std::string> packageOf_;
};

}  // namespace

int ReplayLog(std::istream& log, const std::string& name, std::ostream& out) {
  out << "# package jobs in " << name << ", replayed by korrin-sim replay-log\n"
      << "# the engine on the opened database (not a first launch there)\nstart\n";
  ScriptWriter writer(out);
  std::optional<Job> job;
  bool pending = false;  // the job's last application has no mark yet
  int jobs = 0;
  auto unplaced = [&](int number, const std::string& text, const std::string& why) {
    out << "# line " << number << " not placed (" << why << "): " << text << "\n";
  };
  // A job ends at its last application's mark, or (an install with the
  // policy service on leaves none) at the next job line or the log's end.
  auto finish = [&](int number, bool cut) {
    if (!job) return;
    if (pending && job->kind == kUnknown) job->kind = kInstall;
    if (job->appIds.size() < job->size && cut) {
      unplaced(job->line, "#Step 3 size[" + std::to_string(job->size) + "]",
               "the log ends after " + std::to_string(job->appIds.size()) + " of its applications");
    }
    if (!job->appIds.empty() && job->kind != kUnknown) {
      writer.Write(*job);
      ++jobs;
    }
    job.reset();
    pending = false;
    (void)number;
  };
  std::string line;
  int number = 0;
  while (std::getline(log, line)) {
    ++number;
    if (!line.empty() && line.back() == '\r') line.pop_back();
    // Most of a phone's log is other lines: pass them before any pattern.
    if (line.find("#Step 3") == std::string::npos && line.find("appId[") == std::string::npos &&
        line.find("#8") == std::string::npos && line.find("#9") == std::string::npos) {
      continue;
    }
    std::string text = Message(line);
    std::smatch match;
    if (std::regex_match(text, match, kPrefix)) {
      if (match[1] != "_DoPkgJob") continue;
      text = match[2];
    }
    if (std::regex_match(text, match, kStep3)) {
      finish(number, true);
      job = Job{number, std::stoul(match[1]), {}};
      if (job->size == 0) unplaced(number, text, "a job with no application does nothing");
    } else if (std::regex_match(text, match, kMdmOff)) {
      if (!job || !pending || job->appIds.back() != match[1].str()) {
        unplaced(number, text, "no application of a job waits for it");
        continue;
      }
      job->kind = kInstall;
      pending = false;
    } else if (std::regex_match(text, match, kAppId)) {
      if (!job || job->appIds.size() == job->size) {
        unplaced(number, text, job ? "more applications than its job's size" : "no job before it");
        continue;
      }
      if (pending) job->kind = kInstall;  // the one before had no mark
      job->appIds.push_back(match[1]);
      pending = true;
    } else if (text == "#8" || text == "#9") {
      Kind kind = text == "#8" ? kUninstall : kUpdate;
      if (!job || !pending || (job->kind != kUnknown && job->kind != kind)) {
        unplaced(number, text, !job || !pending ? "no application of a job waits for it"
                                                : "its job is of another kind");
        continue;
      }
      job->kind = kind;
      pending = false;
    } else {
      continue;
    }
    if (job && !pending && job->appIds.size() == job->size && job->kind != kUnknown) {
      finish(number, false);
    }
  }
  finish(number, true);
  return jobs;
}

void PrintDlogutilLine(const sim::LogLine& line, std::ostream& out) {
  static const char kLetters[] = "??VDIWEF";  // dlog's priorities, from DLOG_VERBOSE (2)
  char letter = line.priority >= 0 && line.priority < 8 ? kLetters[line.priority] : '?';
  char pid[16];
  snprintf(pid, sizeof pid, "%5d", static_cast<int>(getpid()));
  out << letter << "/" << line.tag << std::string(line.tag.size() < 8 ? 8 - line.tag.size() : 0, ' ')
      << "(" << pid << "): " << line.text << "\n";
}

}  // namespace korrin_sim
