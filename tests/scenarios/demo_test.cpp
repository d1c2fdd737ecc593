// The demo as the README runs it ends well, shows every step, and nothing of
// its own (the root is the user's path) is wider than an 80-column terminal.
#include <stdio.h>
#include <sys/wait.h>

#include <sstream>
#include <string>

#include <gtest/gtest.h>

TEST(DemoTest, EndsWellWithinEightyColumns) {
  ASSERT_EQ(0, system(("rm -rf '" + std::string(ROOT) + "'").c_str()));
  FILE* demo = popen((std::string(KORRIN_SIM) + " demo --root '" + ROOT + "'").c_str(), "r");
  ASSERT_NE(nullptr, demo);
  std::string output;
  char buffer[4096];
  for (size_t n; (n = fread(buffer, 1, sizeof buffer, demo)) > 0;) output.append(buffer, n);
  int status = pclose(demo);
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << output;
  std::istringstream lines(output);
  int count = 0;
  for (std::string line; std::getline(lines, line); ++count) {
    if (line.find(ROOT) != std::string::npos) line.erase(line.find(ROOT), sizeof ROOT - 1);
    size_t width = 0;  // a UTF-8 sequence is one character
    for (unsigned char c : line) width += (c & 0xC0) != 0x80;
    EXPECT_LE(width, 80u) << line;
  }
  EXPECT_GT(count, 50) << output;
  // Each step's command, and the cells changed since the previous view.
  EXPECT_NE(std::string::npos, output.find("$ install com.lumaforge.skyharbor \"Sky Harbor\"\n"));
  EXPECT_NE(std::string::npos, output.find(" 9 | Mossback Rally   |*Sky Harbor\n"));
}
