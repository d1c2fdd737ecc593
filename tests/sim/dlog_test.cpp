// The simulated platform log and device root.
#include <dlog.h>
#include <unistd.h>

#include <fstream>

#include "common/device-path.h"
#include "common/log.h"
#include "support/sim-test.h"

namespace {

class DlogTest : public SimTest {};

TEST_F(DlogTest, CapturesPriorityTagAndFormattedText) {
  dlog_print(DLOG_WARN, "tag-a", "plain %s %d", "text", 7);
  __dlog_print(LOG_ID_MAIN, DLOG_ERROR, "tag-b", "%s", "second");

  ASSERT_EQ(2u, device.Logs().size());
  EXPECT_EQ(DLOG_WARN, device.Logs()[0].priority);
  EXPECT_EQ("tag-a", device.Logs()[0].tag);
  EXPECT_EQ("plain text 7", device.Logs()[0].text);
  EXPECT_EQ(DLOG_ERROR, device.Logs()[1].priority);
  EXPECT_EQ("second", device.Logs()[1].text);
}

TEST_F(DlogTest, EngineMacroWritesThePrefixUnderItsTag) {
  KLOG(DLOG_WARN, "it's not the first launch");
  ASSERT_EQ(1u, device.Logs().size());
  EXPECT_EQ("korrin", device.Logs()[0].tag);
  EXPECT_EQ("dlog_test.cpp: TestBody(" + std::to_string(__LINE__ - 3) +
                ") >  it's not the first launch",
            device.Logs()[0].text);
}

TEST_F(DlogTest, LongLinesAreKeptWhole) {
  std::string longText(100000, 'q');
  dlog_print(DLOG_INFO, "t", "%s", longText.c_str());
  ASSERT_EQ(1u, device.Logs().size());
  EXPECT_EQ(longText, device.Logs()[0].text);
}

TEST_F(DlogTest, EchoPrintsToStderrInReaderForm) {
  device.EchoLogs(true);
  testing::internal::CaptureStderr();
  dlog_print(DLOG_ERROR, "korrin", "broken %d", 3);
  std::string printed = testing::internal::GetCapturedStderr();
  device.EchoLogs(false);
  EXPECT_EQ("E/korrin(" + std::to_string(getpid()) + "): broken 3\n", printed);
}

TEST_F(DlogTest, ResetForgetsTheLog) {
  dlog_print(DLOG_INFO, "t", "x");
  device.Reset();
  EXPECT_TRUE(device.Logs().empty());
}

TEST_F(DlogTest, DevicePathsResolveUnderTheRoot) {
  EXPECT_EQ(root + "/opt/usr/apps/com.velmora.korrin/data/.game-data.db",
            korrin::DevicePath(korrin::kGameDataDbPath));
  // The launcher's data folder is laid out and writable.
  std::ofstream probe(device.HostPath("/opt/usr/apps/com.velmora.korrin/data/probe"));
  EXPECT_TRUE(probe.good());
}

}  // namespace
