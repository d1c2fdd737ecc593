// How wide a text shows in a terminal, in columns: CJK characters and most
// emoji take two, combining marks none. The C library's wcwidth decides, in
// the C.UTF-8 character type; bytes that are not UTF-8 take one column each.
#ifndef KORRIN_SIM_WIDTH_H_
#define KORRIN_SIM_WIDTH_H_

#include <stddef.h>

#include <string>

namespace korrin_sim {

size_t TextColumns(const std::string& text);

// |text| padded with blanks to |columns|; a wider one is cut, between whole
// characters, to fit with a "~" after it.
std::string FitColumns(const std::string& text, size_t columns);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_WIDTH_H_
