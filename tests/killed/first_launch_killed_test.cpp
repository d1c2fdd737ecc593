// A launcher killed while its first launch fills the store. Each insert
// commits by itself, so a kill leaves the rows inserted so far, and the menu
// comes first: the next start trusts any store with a menu as it stands, and
// makes the whole first layout only when the menu never made it to the file.
#include <algorithm>
#include <cstdio>

#include "killed/killed-test.h"
#include "korrin-data/korrin-data.h"

namespace {

const int kGames = 2000;

class FirstLaunchKilledTest : public KilledTest {
 protected:
  FirstLaunchKilledTest() {
    char id[16];
    for (int i = 1; i <= kGames; ++i) {
      snprintf(id, sizeof id, "game%04d", i);
      device.AddGame(id, id);
      appIds.push_back(id);
    }
  }

  // The whole first layout in the order it is inserted: the menu "Apps", its
  // page, then a box per game, four to a row, holding only the id and place.
  std::vector<Row> FirstLayout() const {
    std::vector<Row> rows = {{"1", "Apps", "0"}, {"1", "0", "1", "1"}};
    for (int i = 0; i < kGames; ++i) {
      rows.push_back({std::to_string(i + 1), "0", "NULL", "1", appIds[i], "NULL",
                      std::to_string(i % 4 + 1), std::to_string(i / 4 + 1), "0", "0", "0", "0",
                      "NULL", "NULL"});
    }
    return rows;
  }

  static bool IsPrefix(const std::vector<Row>& part, const std::vector<Row>& whole) {
    return part.size() <= whole.size() && std::equal(part.begin(), part.end(), whole.begin());
  }

  // The first launch run to the end on a phone whose store does not exist
  // yet: what the next start must do when a kill left no menu. Returns the
  // file operations it made.
  long FirstLaunchOnANewPhone() {
    RemoveDatabase();
    Run run = RunToTheEnd(data_engin_initialization);
    firstLaunchLogs = run.logs;
    EXPECT_TRUE(FirstLayout() == SqlProbe(DbPath()).Layout());
    return run.operations;
  }

  // Kills the first launch at each point of |plan| and checks what the kill
  // left and what the next start makes of it.
  void KillFirstLaunches(const std::vector<Kill>& plan) {
    const std::vector<Row> complete = FirstLayout();
    for (const Kill& kill : plan) {
      SCOPED_TRACE(::testing::Message() << kill);
      RemoveDatabase();
      EXPECT_TRUE(RunChild(kill.point, data_engin_initialization).killed);

      Leftover left = WhatTheKillLeft();
      EXPECT_EQ("ok", left.integrity);
      EXPECT_TRUE(IsPrefix(left.layout, complete))
          << "not the rows of the first launch up to one: " << left.layout.size() << " rows";
      bool populated = !left.layout.empty();  // the menu is the first row
      leftAMenu += populated;
      hotJournals += left.hotJournal;

      Lines logs = NextStart();
      SqlProbe db(DbPath());
      EXPECT_EQ("ok", db.Value("PRAGMA integrity_check"));
      if (populated) {
        EXPECT_EQ(Lines{"W it's not the first launch"}, logs);
        EXPECT_EQ(left.layout, db.Layout()) << "the next start rewrote the store";
      } else {
        EXPECT_TRUE(firstLaunchLogs == logs) << "not logged as a first launch";
        EXPECT_TRUE(complete == db.Layout()) << "not a complete first launch";
      }
      if (HasFailure()) return;
    }
    Survived(plan.size(), std::to_string(leftAMenu) + " left a menu, " +
                              std::to_string(hotJournals) + " a live journal");
  }

  Lines appIds;
  Lines firstLaunchLogs;
  int leftAMenu = 0;
  int hotJournals = 0;
};

TEST_F(FirstLaunchKilledTest, AKillAnywhereLeavesALayoutTheNextStartTakesAsItIs) {
  long operations = FirstLaunchOnANewPhone();
  KillFirstLaunches(Plan(1, operations, 20));
  EXPECT_GT(hotJournals, 0) << "no kill fell inside a commit";
}

// The file operations of a first launch on a phone without games are those
// that make the schema and the menu, so these kills fall on either side of
// the menu's commit.
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
