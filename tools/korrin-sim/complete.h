// What the shell's Tab offers: command names, a command's options, `call`
// names, platform call names and the device's application and package ids.
#ifndef KORRIN_SIM_COMPLETE_H_
#define KORRIN_SIM_COMPLETE_H_

#include <string>
#include <vector>

namespace korrin_sim {

// The words that may stand where |word| is being typed after |before| (the
// line up to it), in order, each beginning with |word|.
std::vector<std::string> Completions(const std::string& before, const std::string& word);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_COMPLETE_H_
