// A launcher killed while its first launch fills the store. Each insert
// commits by itself and the menu comes first: the next start takes a store
// with a menu as it stands, and makes the whole first layout only when the
// menu never reached the file.
#include <algorithm>

#include "reliability/killed/killed-test.h"
#include "korrin-data/korrin-data.h"

namespace {

const int kGames = 2000;

class FirstLaunchKilledTest : public KilledTest {
 protected:
  FirstLaunchKilledTest() {
    Lines appIds = AddGames(kGames);
    // The first layout in insert order: menu "Apps", its page, a box per
    // game, four to a row.
    complete = {{"1", "Apps", "0"}, {"1", "0", "1", "1"}};
    for (int i = 0; i < kGames; ++i) {
      complete.push_back({std::to_string(i + 1), "0", "NULL", "1", appIds[i], "NULL",
                          std::to_string(i % 4 + 1), std::to_string(i / 4 + 1), "0", "0", "0", "0",
                          "NULL", "NULL"});
    }
  }

  // The first launch run to the end on a new phone: what the next start must
  // do when a kill left no menu. Returns its file operations.
  long FirstLaunchOnANewPhone() {
    RemoveDatabase();
    Run run = RunToTheEnd(data_engin_initialization);
    firstLaunchLogs = run.logs;
    EXPECT_TRUE(complete == SqlProbe(DbPath()).Layout());
    return run.operations;
  }

  void KillFirstLaunches(const std::vector<Kill>& plan) {
    for (const Kill& kill : plan) {
      SCOPED_TRACE(::testing::Message() << kill);
      RemoveDatabase();
      Aftermath after = KillAndRestart(kill.point, data_engin_initialization);
      const std::vector<Row>& left = after.left;
      EXPECT_TRUE(left.size() <= complete.size() &&
                  std::equal(left.begin(), left.end(), complete.begin()))
          << "not a prefix of the first launch: " << left.size() << " rows";
      if (!left.empty()) {  // the menu is the first row
        ++leftAMenu;
        EXPECT_EQ(Lines{"W it's not the first launch"}, after.logs);
        EXPECT_EQ(left, after.layout) << "the next start rewrote the store";
      } else {
        EXPECT_TRUE(firstLaunchLogs == after.logs) << "not logged as a first launch";
        EXPECT_TRUE(complete == after.layout) << "not a complete first launch";
      }
      if (HasFailure()) return;
    }
    Survived(plan.size(), std::to_string(leftAMenu) + " left a menu");
  }

  Lines firstLaunchLogs;
  std::vector<Row> complete;
  int leftAMenu = 0;
};

TEST_F(FirstLaunchKilledTest, AKillAnywhereLeavesALayoutTheNextStartTakesAsItIs) {
  KillFirstLaunches(Plan(1, FirstLaunchOnANewPhone(), 20));
  EXPECT_GT(hotJournals, 0) << "no kill fell inside a commit";
}

// Without games a first launch only makes the schema and the menu, so these
// kills fall on either side of the menu's commit.
TEST_F(FirstLaunchKilledTest, AKillBeforeTheMenuIsStoredEndsInACompleteFirstLaunch) {
  long toTheMenu = RunToTheEnd([&] {
                     device.Reset();
                     data_engin_initialization();
                   }).operations;
  ASSERT_GT(toTheMenu, 0);
  FirstLaunchOnANewPhone();
  std::vector<Kill> plan = Plan(1, toTheMenu + 4, 10);
  KillFirstLaunches(plan);
  EXPECT_LT(leftAMenu, static_cast<int>(plan.size())) << "no kill before the menu";
  EXPECT_GT(leftAMenu, 0) << "no kill after the menu";
}

}  // namespace
