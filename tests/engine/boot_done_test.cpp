// The storage card at boot: the launcher subscribes to the boot-done signal,
// and when it comes the games marked as living on the card are read afresh.
#include <app_preference.h>

#include <algorithm>

#include "engine/engine-test.h"

namespace {

class BootDoneTest : public EngineTest {
 protected:
  int SendBootDone() {
    return device.SendBusSignal("/Org/Tizen/System/DeviceD/Core",
                                "org.tizen.system.deviced.core", "BootingDone");
  }
};

TEST_F(BootDoneTest, BootDoneRefreshesTheCardsGamesOnceAndWritesNothing) {
  AddGames({"Alpha", "Bravo", "Charlie", "Delta"});
  Start();
  device.Update(Game("charlie", "Charlie"));  // a labelled row, to see that none is rewritten
  ASSERT_TRUE(packages._RegisterEdbusSignalHandler());
  device.SetPreference("memory/sysman/mmc", 1);
  // The launcher marks the games on the card in the records it shares with
  // the cache; one of them has lost its label since it was read.
  packages.m_appInfoCache["bravo"]->isOnStorageCard = true;
  packages.m_appInfoCache["delta"]->isOnStorageCard = true;
  packages.m_appInfoCache["delta"]->name.clear();
  std::vector<Row> before = db->Layout();
  device.ClearLogs();

  EXPECT_EQ(1, SendBootDone());
  EXPECT_TRUE(packages.m_isMmcInserted);
  EXPECT_EQ(before, db->Layout());
  Lines logs = EngineMessages();
  // Bravo is answered from the cache; Delta is read from the platform again.
  EXPECT_EQ(1, std::count(logs.begin(), logs.end(),
                          "E Find a App Info Name[Bravo] enable[1] system[0]"));
  EXPECT_EQ(1, std::count(logs.begin(), logs.end(), "E Name[Delta] enable[1] system[0]"));
  EXPECT_FALSE(packages.m_appInfoCache["delta"]->isOnStorageCard);
  EXPECT_EQ("Delta", packages.m_appInfoCache["delta"]->name);

  // The subscription went with the first signal.
  EXPECT_EQ(0, device.BusSubscriptions());
  EXPECT_EQ(0, device.BusInitCount());
  EXPECT_EQ(nullptr, packages.m_dbusConnection);
  device.ClearLogs();
  EXPECT_EQ(0, SendBootDone());
  EXPECT_TRUE(EngineMessages().empty());
}

}  // namespace
