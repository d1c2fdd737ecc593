#include "demo.h"

#include <algorithm>
#include <iostream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "cli.h"
#include "commands.h"
#include "session.h"

namespace korrin_sim {

namespace {

const char kDim[] = "\033[2m";
const char kReverse[] = "\033[7m";
const char kPlain[] = "\033[0m";

std::string Trimmed(const std::string& text) {
  size_t first = text.find_first_not_of(" \t");
  if (first == std::string::npos) return "";
  return text.substr(first, text.find_last_not_of(" \t") + 1 - first);
}

// Whether |line| is a grid row, " 9 | Mossback Rally   | Sky Harbor", and
// where its first '|' stands.
bool IsGridRow(const std::string& line, size_t& bar) {
  size_t digits = line.find_first_not_of(' ');
  if (digits == std::string::npos || !isdigit(static_cast<unsigned char>(line[digits]))) {
    return false;
  }
  size_t end = line.find_first_not_of("0123456789", digits);
  if (end == std::string::npos || line.compare(end, 3, " | ") != 0) return false;
  bar = end + 1;
  return true;
}

// |command| as a "$ " line, or when longer than 80 columns as two broken
// between words (not inside quotes) near the middle, with a shell's " \"
// continuation.
std::string Prompted(const std::string& command) {
  std::vector<size_t> breaks;  // blanks outside quotes
  bool quoted = false;
  for (size_t i = 0; i < command.size(); ++i) {
    if (command[i] == '"') quoted = !quoted;
    if (command[i] == ' ' && !quoted) breaks.push_back(i);
  }
  size_t best = std::string::npos, widest = command.size() + 2;
  for (size_t at : breaks) {
    size_t wider = std::max(at + 4, command.size() - at + 3);  // "$ ...\", "    ..."
    if (command.size() + 2 > 80 && wider < widest) best = at, widest = wider;
  }
  if (best == std::string::npos) return "$ " + command + "\n";
  return "$ " + command.substr(0, best) + " \\\n    " + command.substr(best + 1) + "\n";
}

// Marks the grid cells of each view that differ from the same view's cell
// (same heading, row and column) the last time it was shown.
class ChangeMarks {
 public:
  explicit ChangeMarks(bool terminal) : terminal_(terminal), explained_(false) {}

  std::string Mark(const std::string& view, const std::string& text) {
    std::map<std::string, std::string>& previous = cells_[view];
    std::map<std::string, std::string> now;
    std::istringstream in(text);
    std::ostringstream out;
    std::string heading;
    bool marked = false;
    for (std::string line; std::getline(in, line);) {
      size_t bar;
      if (!IsGridRow(line, bar)) {
        heading = Trimmed(line);
        out << line << "\n";
        continue;
      }
      std::string row = heading + "|" + Trimmed(line.substr(0, bar));
      out << line.substr(0, bar);
      std::istringstream segments(line.substr(bar + 1));
      int column = 0;
      for (std::string segment; std::getline(segments, segment, '|');) {
        std::string key = row + "|" + std::to_string(++column);
        std::string cell = Trimmed(segment);
        now[key] = cell;
        bool changed = !previous.empty() && previous[key] != cell && !cell.empty();
        marked = marked || changed;
        out << "|" << (changed ? Marked(segment, cell) : segment);
      }
      out << "\n";
    }
    previous = now;
    if (marked && !explained_) {
      explained_ = true;
      out << (terminal_ ? "(reversed: changed since the previous view)\n"
                        : "(*: changed since the previous view)\n");
    }
    return out.str();
  }

 private:
  // " Sky Harbor      " as "*Sky Harbor      ", or in reverse video: the
  // row keeps its width.
  std::string Marked(const std::string& segment, const std::string& cell) const {
    if (!terminal_) return "*" + segment.substr(1);
    size_t start = segment.find(cell);
    return segment.substr(0, start) + kReverse + cell + kPlain +
           segment.substr(start + cell.size());
  }

  bool terminal_;
  bool explained_;
  std::map<std::string, std::map<std::string, std::string> > cells_;  // by view
};

}  // namespace

bool PlayDemo(std::istream& story, std::ostream& out, bool terminal) {
  using Fed = Session::Fed;
  Session session(/*printActions=*/false);
  ChangeMarks marks(terminal);
  int number = 0, at = 0;
  Fed fed = Fed::kRan;
  try {
    for (std::string line; std::getline(story, line);) {
      ++number;
      std::string text = Trimmed(line);
      std::string name = text.substr(0, text.find_first_of(" \t"));
      if (fed == Fed::kCollected || text.empty() || text[0] == '#' || text == "expect") {
        if (fed != Fed::kCollected) at = number;
        fed = session.Feed(line);
        continue;
      }
      at = number;
      if (name != "say") out << (terminal ? kDim : "") << Prompted(text) << (terminal ? kPlain : "");
      std::ostringstream printed;
      SetOut(&printed);
      try {
        fed = session.Feed(line);
      } catch (...) {
        SetOut(NULL);
        throw;
      }
      SetOut(NULL);
      const Command* command = FindCommand(name);
      if (command != NULL && !command->action) out << marks.Mark(name, printed.str());
      out << std::flush;
    }
    session.Finish();
  } catch (const std::exception& e) {
    out << std::flush;
    std::cerr << "demo:" << at << ": " << e.what() << std::endl;
    return false;
  }
  return true;
}

}  // namespace korrin_sim
