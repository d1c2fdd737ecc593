#include "width.h"

#include <locale.h>
#include <string.h>
#include <wchar.h>

namespace korrin_sim {

namespace {

// The characters of |text| in order: where each starts, its length in bytes
// and its columns. |each| returns false to stop.
template <typename Each>
void ForEachCharacter(const std::string& text, Each each) {
  // The character type only: messages and numbers stay as they were.
  static const bool kUtf8 = setlocale(LC_CTYPE, "C.UTF-8") != NULL;
  (void)kUtf8;
  mbstate_t state;
  memset(&state, 0, sizeof state);
  for (size_t at = 0; at < text.size();) {
    wchar_t c;
    size_t length = mbrtowc(&c, text.data() + at, text.size() - at, &state);
    int columns = 1;
    if (length == 0) {
      length = 1;  // an embedded NUL
    } else if (length == static_cast<size_t>(-1) || length == static_cast<size_t>(-2)) {
      memset(&state, 0, sizeof state);
      length = 1;
    } else {
      columns = wcwidth(c);
      if (columns < 0) columns = 1;  // a control character shows as something
    }
    if (!each(at, length, static_cast<size_t>(columns))) return;
    at += length;
  }
}

}  // namespace

size_t TextColumns(const std::string& text) {
  size_t total = 0;
  ForEachCharacter(text, [&total](size_t, size_t, size_t columns) {
    total += columns;
    return true;
  });
  return total;
}

std::string FitColumns(const std::string& text, size_t columns) {
  size_t used = TextColumns(text);
  if (used <= columns) return text + std::string(columns - used, ' ');
  size_t end = 0;
  used = 0;
  ForEachCharacter(text, [&](size_t at, size_t length, size_t width) {
    if (used + width + 1 > columns) return false;
    used += width;
    end = at + length;
    return true;
  });
  return text.substr(0, end) + "~" + std::string(columns - used - 1, ' ');
}

}  // namespace korrin_sim
