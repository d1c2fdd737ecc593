// The demo as the README runs it: a fresh device, a story that ends well, and
// nothing wider than an 80-column terminal.
#include <stdio.h>
#include <sys/wait.h>

#include <sstream>
#include <string>

#include <gtest/gtest.h>

namespace {

// Characters, counting a UTF-8 sequence as one.
size_t Width(const std::string& line) {
  size_t width = 0;
  for (unsigned char c : line) width += (c & 0xC0) != 0x80;
  return width;
}

TEST(DemoTest, EndsWellWithinEightyColumns) {
  std::string command = std::string(KORRIN_SIM) + " demo --root " + ROOT;
  ASSERT_EQ(0, system(("rm -rf " + std::string(ROOT)).c_str()));
  FILE* demo = popen(command.c_str(), "r");
  ASSERT_NE(nullptr, demo);
  std::string output;
  char buffer[4096];
  for (size_t n; (n = fread(buffer, 1, sizeof buffer, demo)) > 0;) output.append(buffer, n);
  int status = pclose(demo);
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << output;

  std::istringstream lines(output);
  std::string line;
  int count = 0;
  while (std::getline(lines, line)) {
    ++count;
    EXPECT_LE(Width(line), 80u) << line;
  }
  EXPECT_GT(count, 50) << output;  // every step showed its home screen
}

}  // namespace
