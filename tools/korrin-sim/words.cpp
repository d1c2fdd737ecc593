// The shell's word splitting, done here: wordexp(3) would also expand
// variables and globs and run command substitution, which a script line
// must never do, and no Debian-packaged C++ library splits words by exactly
// these rules (Boost's split_unix treats every quote character alike and
// knows C escapes instead), so this small splitter is our own.
#include "words.h"

#include <ctype.h>
#include <stdio.h>
#include <string.h>

#include <algorithm>

#include "cli.h"

namespace korrin_sim {

namespace {

bool IsBlank(char c) { return c == ' ' || c == '\t'; }

int HexDigit(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

[[noreturn]] void Unterminated(const char* quote, const std::string& line, size_t opened) {
  std::string from = line.substr(opened, 24);
  throw UsageError(std::string("unterminated ") + quote + " at " + from +
                   (line.size() - opened > from.size() ? "..." : "") +
                   ": close it on the same line (`help quoting`)");
}

// The escape of $'...' at |line|[i] (after its backslash), appended to
// |word|; |i| ends on its last character.
void DollarEscape(const std::string& line, size_t& i, std::string& word) {
  static const char kFrom[] = "ntrabefv\\'\"";
  static const char kTo[] = "\n\t\r\a\b\x1b\f\v\\'\"";
  const char* found = strchr(kFrom, line[i]);
  if (found != NULL && *found != '\0') {
    word += kTo[found - kFrom];
  } else if (line[i] == 'x' && i + 1 < line.size() && HexDigit(line[i + 1]) >= 0) {
    int value = HexDigit(line[++i]);
    if (i + 1 < line.size() && HexDigit(line[i + 1]) >= 0) value = value * 16 + HexDigit(line[++i]);
    word += static_cast<char>(value);
  } else {
    word += '\\';
    word += line[i];
  }
}

}  // namespace

namespace {

bool IsNameStart(char c) { return isalpha(static_cast<unsigned char>(c)) != 0; }
bool IsNameChar(char c) { return isalnum(static_cast<unsigned char>(c)) || c == '_'; }

// At line[i] == '$' followed by a name: appends its value and leaves |i| on
// the name's last character. False, changing nothing, when no name follows.
bool ExpandName(const std::string& line, size_t& i, const NameValue& value, std::string& word) {
  if (!value || i + 1 == line.size() || !IsNameStart(line[i + 1])) return false;
  size_t end = i + 1;
  while (end < line.size() && IsNameChar(line[end])) ++end;
  word += value(line.substr(i + 1, end - i - 1));
  i = end - 1;
  return true;
}

}  // namespace

std::vector<std::string> SplitWords(const std::string& line, const NameValue& value) {
  std::vector<std::string> words;
  std::string word;
  bool inWord = false;  // a quoted empty part makes a word too
  for (size_t i = 0; i < line.size(); ++i) {
    char c = line[i];
    if (IsBlank(c)) {
      if (inWord) words.push_back(word);
      word.clear();
      inWord = false;
      continue;
    }
    inWord = true;
    size_t opened = i;
    if (c == '\\') {
      if (++i == line.size()) throw UsageError("a backslash ends the line: it escapes nothing");
      word += line[i];
    } else if (c == '\'') {
      size_t close = line.find('\'', i + 1);
      if (close == std::string::npos) Unterminated("single quote (')", line, opened);
      word += line.substr(i + 1, close - i - 1);
      i = close;
    } else if (c == '"') {
      for (++i; i < line.size() && line[i] != '"'; ++i) {
        if (line[i] == '\\' && i + 1 < line.size() && strchr("\"\\$", line[i + 1]) != NULL) {
          ++i;
        } else if (line[i] == '$' && ExpandName(line, i, value, word)) {
          continue;
        }
        word += line[i];
      }
      if (i == line.size()) Unterminated("double quote (\")", line, opened);
    } else if (c == '$' && i + 1 < line.size() && line[i + 1] == '\'') {
      for (i += 2; i < line.size() && line[i] != '\''; ++i) {
        if (line[i] == '\\' && i + 1 < line.size()) {
          DollarEscape(line, ++i, word);
        } else {
          word += line[i];
        }
      }
      if (i == line.size()) Unterminated("$'...' quote", line, opened);
    } else if (!(c == '$' && ExpandName(line, i, value, word))) {
      word += c;
    }
  }
  if (inWord) words.push_back(word);
  return words;
}

std::string ShellWord(const std::string& text) {
  static const char kPlain[] =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789.,:=/+-_@%^";
  if (!text.empty() && text.find_first_not_of(kPlain) == std::string::npos) return text;
  bool control = std::any_of(text.begin(), text.end(), [](char c) {
    return static_cast<unsigned char>(c) < 0x20 || c == 0x7f;
  });
  if (!control) {
    std::string word = "'";
    for (char c : text) word += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return word + "'";
  }
  return "$'" + Escaped(text, '\'') + "'";
}

std::string DidYouMean(const std::string& word, const std::vector<std::string>& known) {
  // Edit distance with adjacent swaps counted as one edit ("isntall").
  auto distance = [](const std::string& a, const std::string& b) {
    std::vector<std::vector<size_t> > d(a.size() + 1, std::vector<size_t>(b.size() + 1));
    for (size_t i = 0; i <= a.size(); ++i) d[i][0] = i;
    for (size_t j = 0; j <= b.size(); ++j) d[0][j] = j;
    for (size_t i = 1; i <= a.size(); ++i) {
      for (size_t j = 1; j <= b.size(); ++j) {
        d[i][j] = std::min({d[i - 1][j] + 1, d[i][j - 1] + 1,
                            d[i - 1][j - 1] + (a[i - 1] == b[j - 1] ? 0 : 1)});
        if (i > 1 && j > 1 && a[i - 1] == b[j - 2] && a[i - 2] == b[j - 1]) {
          d[i][j] = std::min(d[i][j], d[i - 2][j - 2] + 1);
        }
      }
    }
    return d[a.size()][b.size()];
  };
  const std::string* best = NULL;
  size_t bestDistance = 0;
  for (const std::string& name : known) {
    size_t d = distance(word, name);
    if (best == NULL || d < bestDistance) {
      best = &name;
      bestDistance = d;
    }
  }
  // Up to a third of the word wrong, at most two edits: a typo, not another word.
  if (best == NULL || bestDistance == 0 || bestDistance > 2 || bestDistance * 3 > word.size()) {
    return "";
  }
  return " (did you mean '" + *best + "'?)";
}

const char kQuotingHelp[] =
    "A line splits into words at blanks, as the POSIX shell splits them, but\n"
    "nothing is expanded ($name, *, ~ and `...` stay as written):\n"
    "  'text'    single quotes: every character as written, no escapes\n"
    "  \"text\"    double quotes: \\\" and \\\\ stand for \" and \\; any other\n"
    "            backslash stays as written (\"\\n\" is a backslash and an n)\n"
    "  \\c        outside quotes, a backslash takes the next character as it is\n"
    "  $'text'   C escapes: \\n \\t \\r \\xHH \\\\ \\' \\\" (a newline in a word)\n"
    "Parts next to each other join into one word (ab'c d'\"e\" is \"abc de\"), \"\" or\n"
    "'' is an empty word, and a quote left open is an error. A ' inside single\n"
    "quotes is written '\\'' (close, escaped quote, open again).";

}  // namespace korrin_sim
