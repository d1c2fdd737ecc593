#include "cli.h"

#include <errno.h>
#include <stdio.h>
#include <stdlib.h>

#include <iostream>
#include <limits>
#include <utility>

namespace korrin_sim {

namespace {

std::ostream* g_out = &std::cout;

// |text| as a whole decimal number within [low, high].
long long ParseRange(const std::string& text, const std::string& what, long long low,
                     long long high) {
  const char* begin = text.c_str();
  char* end = NULL;
  errno = 0;
  long long value = strtoll(begin, &end, 10);
  if (text.empty() || *end != '\0' || errno == ERANGE || value < low || value > high) {
    throw UsageError(what + ": '" + text + "' is not a number in " + std::to_string(low) +
                     ".." + std::to_string(high));
  }
  return value;
}

}  // namespace

std::ostream& Out() { return *g_out; }

void SetOut(std::ostream* out) { g_out = out != NULL ? out : &std::cout; }

namespace {
bool g_returned = false;
int g_returnedId = 0;
}  // namespace

void ReturnId(int id) {
  g_returned = true;
  g_returnedId = id;
}

bool TakeReturnedId(int* id) {
  if (g_returned && id != NULL) *id = g_returnedId;
  return std::exchange(g_returned, false);
}

int ParseInt(const std::string& text, const std::string& what) {
  return static_cast<int>(ParseRange(text, what, std::numeric_limits<int>::min(),
                                     std::numeric_limits<int>::max()));
}

long long ParseInt64(const std::string& text, const std::string& what) {
  return ParseRange(text, what, std::numeric_limits<long long>::min(),
                    std::numeric_limits<long long>::max());
}

unsigned int ParseUnsigned(const std::string& text, const std::string& what) {
  return static_cast<unsigned int>(
      ParseRange(text, what, 0, std::numeric_limits<unsigned int>::max()));
}

bool ParseBool(const std::string& text, const std::string& what) {
  if (text == "true" || text == "1") return true;
  if (text == "false" || text == "0") return false;
  throw UsageError(what + ": '" + text + "' is not true or false");
}

int ParseNamed(const std::string& text, const std::vector<std::string>& names,
               const std::string& what, bool numbers) {
  std::string all;
  for (size_t i = 0; i < names.size(); ++i) {
    if (text == names[i]) return static_cast<int>(i);
    all += (i > 0 ? ", " : "") + names[i];
  }
  if (!numbers) throw UsageError(what + ": '" + text + "' is not one of: " + all);
  try {
    return ParseInt(text, what);
  } catch (const UsageError&) {
    throw UsageError(what + ": '" + text + "' is not a number or one of: " + all);
  }
}

const std::vector<std::string> kEventTypeNames = {"install", "uninstall", "update"};
const std::vector<std::string> kEventStateNames = {"started", "processing", "completed",
                                                   "failed"};
const std::vector<std::string> kComponentNames = {"all", "ui", "service"};

std::string Escaped(const std::string& text, char quote) {
  std::string out;
  for (unsigned char c : text) {
    if (c == quote || c == '\\') {
      out += '\\';
      out += static_cast<char>(c);
    } else if (c == '\n') {
      out += "\\n";
    } else if (c == '\t') {
      out += "\\t";
    } else if (c < 0x20 || c == 0x7f) {
      char hex[5];
      snprintf(hex, sizeof hex, "\\x%02x", c);
      out += hex;
    } else {
      out += static_cast<char>(c);
    }
  }
  return out;
}

std::string Quote(const std::string& text) { return "\"" + Escaped(text, '"') + "\""; }

}  // namespace korrin_sim
