// What the shell's Tab offers where a word is being typed.
#include "complete.h"

#include <gtest/gtest.h>

#include "sim/device.h"

namespace {

TEST(ShellCompletion, OffersWhatFitsWhereTheWordStands) {
  sim::Device::Get().AddGame("com.acme.tetra", "Tetra");
  sim::Device::Get().AddGame("com.acme.zeppelin", "Zeppelin");
  typedef std::vector<std::string> Words;
  struct Case {
    std::string before, word;
    Words offered;
  } cases[] = {
      {"", "lay", {"layout"}},
      {"  ", ".q", {".quit"}},
      {"help ", "qu", {"quit"}},
      {"layout ", "--", {"--csv", "--ids", "--json", "--wide"}},
      {"call ", "GetBoxIdByApp", {"GetBoxIdByAppId"}},
      {"call --help ",
       "LauncherDataManager::GetMenuDataC",
       {"LauncherDataManager::GetMenuDataCount"}},
      {"fail ", "app_info_get_lab", {"app_info_get_label"}},
      {"uninstall ", "com.acme.", {"com.acme.tetra", "com.acme.zeppelin"}},
      {"call GetBoxIdByAppId ", "com.acme.t", {"com.acme.tetra"}},
      {"nonsense ", "com", {}},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(c.offered, korrin_sim::Completions(c.before, c.word)) << c.before << c.word;
  }
}

}  // namespace
