// How korrin-sim reads the words of a command line and writes them back:
// the POSIX shell's quoting, without its expansions, and the nearest known
// name for a mistyped one.
#ifndef KORRIN_SIM_WORDS_H_
#define KORRIN_SIM_WORDS_H_

#include <functional>
#include <string>
#include <vector>

namespace korrin_sim {

// The words of |line| as the POSIX shell splits them, expanding nothing:
// blanks separate words; a backslash outside quotes takes the next character
// as written; '...' is literal; "..." takes \" and \\ and keeps any other
// backslash; $'...' takes \n, \t, \r, \xHH, \\, \' and \" (POSIX.1-2024);
// adjacent parts join into one word, and "" is an empty word. Throws
// UsageError for an unterminated quote or a trailing backslash.
//
// With |value|, $NAME outside single quotes is replaced by value(NAME) (which
// may throw), and "\$" inside double quotes is a $.
typedef std::function<std::string(const std::string& name)> NameValue;
std::vector<std::string> SplitWords(const std::string& line, const NameValue& value = NameValue());

// |text| as one word that SplitWords reads back as |text|: as it is when
// plain, else in single quotes, or as $'...' when it holds control bytes.
std::string ShellWord(const std::string& text);

// " (did you mean 'NAME'?)" for the one of |known| nearest to |word| when it
// is close enough to be a typo, else "".
std::string DidYouMean(const std::string& word, const std::vector<std::string>& known);

// The text of `help quoting`.
extern const char kQuotingHelp[];

}  // namespace korrin_sim

#endif  // KORRIN_SIM_WORDS_H_
