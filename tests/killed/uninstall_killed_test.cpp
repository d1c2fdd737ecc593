// A launcher killed while it takes an uninstalled game off a page of 1,000
// boxes. The handler deletes the game's box, then rewrites every other box of
// the page from the first cell, each in a commit of its own; a kill stops that
// sequence anywhere, and nothing finishes it later. The next start keeps what
// the kill left: every other game has its one box, and the page is closed up
// to some box and as it was after it.
#include <cstdio>
#include <filesystem>

#include "killed/killed-test.h"
#include "korrin-data/korrin-data.h"

namespace {

const int kGames = 1000;

class UninstallKilledTest : public KilledTest {
 protected:
  // A phone with 1,000 games whose launcher has laid them out on one page.
  void SetUp() override {
    char id[16];
    for (int i = 1; i <= kGames; ++i) {
      snprintf(id, sizeof id, "game%04d", i);
      device.AddGame(id, id);
    }
    ASSERT_GT(RunToTheEnd(data_engin_initialization).operations, kGames);
    std::filesystem::copy_file(DbPath(), LaidOutCopy());
    SqlProbe db(DbPath());
    laidOut = db.Layout();
    ASSERT_EQ(2u + kGames, laidOut.size());
  }

  std::string LaidOutCopy() const { return root + "/laid-out.db"; }

  void RestoreLayout() {
    RemoveDatabase();
    std::filesystem::copy_file(LaidOutCopy(), DbPath());
  }

  // The layout after the uninstall of |gone| has deleted its box and rewritten
  // the first |moved| of the others into the cells from the first. The menu
  // and its page lead; the boxes follow by boxId, which on this page is also
  // by row, then col.
  std::vector<Row> Uninstalled(const std::string& gone, size_t moved) const {
    std::vector<Row> rows(laidOut.begin(), laidOut.begin() + kFirstBox);
    size_t rank = 0;
    for (size_t i = kFirstBox; i < laidOut.size(); ++i) {
      if (laidOut[i][kAppId] == gone) continue;
      rows.push_back(laidOut[i]);
      if (rank < moved) PutInCell(rank, &rows.back());
      ++rank;
    }
    return rows;
  }

  // How many boxes, from the first, stand where the closed-up page puts them.
  static size_t MovedBoxes(const std::vector<Row>& layout) {
    size_t rank = 0;
    for (size_t i = kFirstBox; i < layout.size(); ++i, ++rank) {
      Row box = layout[i];
      PutInCell(rank, &box);
      if (box != layout[i]) break;
    }
    return rank;
  }

  // Puts |box| into the |rank|-th cell of a page four wide.
  static void PutInCell(size_t rank, Row* box) {
    (*box)[kCol] = std::to_string(rank % 4 + 1);
    (*box)[kRow] = std::to_string(rank / 4 + 1);
  }

  // Where things are in a layout read by SqlProbe::Layout.
  static const size_t kFirstBox = 2, kAppId = 4, kCol = 6, kRow = 7;

  // Kills the launcher at each point of a plan of |kills| over the uninstall
  // of |gone|, and checks what the kill left and what the next start keeps.
  void KillUninstallsOf(const std::string& gone, int kills) {
    auto uninstall = [&] {
      data_engin_initialization();
      device.Uninstall(gone);
    };
    RestoreLayout();
    long operations = RunToTheEnd(uninstall).operations;
    EXPECT_TRUE(Uninstalled(gone, kGames - 1) == SqlProbe(DbPath()).Layout());

    int leftTheBox = 0, partly = 0, hotJournals = 0;
    std::vector<Kill> plan = Plan(1, operations, kills);
    for (const Kill& kill : plan) {
      SCOPED_TRACE(::testing::Message() << "uninstalling " << gone << ", " << kill);
      RestoreLayout();
      EXPECT_TRUE(RunChild(kill.point, uninstall).killed);

      Leftover left = WhatTheKillLeft();
      EXPECT_EQ("ok", left.integrity);
      hotJournals += left.hotJournal;
      // The platform finished the uninstall; only the launcher was killed.
      Lines logs = NextStart([&] { device.RemovePackage(gone); });
      EXPECT_EQ(Lines{"W it's not the first launch"}, logs);

      SqlProbe db(DbPath());
      EXPECT_EQ("ok", db.Value("PRAGMA integrity_check"));
      std::vector<Row> layout = db.Layout();
      EXPECT_TRUE(left.layout == layout) << "the next start rewrote the store";
      const std::string others = "FROM Boxes WHERE appId != '" + gone + "'";
      EXPECT_EQ("999", db.Value("SELECT COUNT(*) " + others));
      EXPECT_EQ("999", db.Value("SELECT COUNT(DISTINCT appId) " + others));
      if (db.Value("SELECT COUNT(*) FROM Boxes WHERE appId = '" + gone + "'") == "1") {
        // Its box goes first: a page that still holds it was not touched.
        EXPECT_TRUE(laidOut == layout) << "the page changed before the box went";
        ++leftTheBox;
      } else {
        size_t moved = MovedBoxes(layout);
        EXPECT_TRUE(Uninstalled(gone, moved) == layout)
            << "not the page closed up to box " << moved << " and as it was after it";
        partly += moved < kGames - 1;
      }
      if (HasFailure()) return;
    }
    Survived(plan.size(), std::to_string(leftTheBox) + " left the box, " + std::to_string(partly) +
                              " a page closed up part of the way, " + std::to_string(hotJournals) +
                              " a live journal");
  }

  std::vector<Row> laidOut;
};

// Where the game's box stands decides how much of the page moves: the boxes
// before it are rewritten where they stand, which SQLite finds unchanged and
// does not write, so each has its own range of kill points.

TEST_F(UninstallKilledTest, KilledWhileTheWholePageMovesUp) { KillUninstallsOf("game0001", 20); }

TEST_F(UninstallKilledTest, KilledWhileTheSecondHalfOfThePageMovesUp) {
  KillUninstallsOf("game0501", 15);
}

TEST_F(UninstallKilledTest, KilledWhileOnlyTheLastBoxGoes) { KillUninstallsOf("game1000", 5); }

}  // namespace
