// A launcher killed while it takes an uninstalled game off a page of 1,000
// boxes. The handler deletes the game's box, then rewrites every other box
// from the first cell, each in a commit of its own; nothing finishes a killed
// sequence later. The next start keeps what the kill left: every other game
// has its one box, and the page is closed up to some box and as it was after.
#include <filesystem>

#include "reliability/killed/killed-test.h"
#include "korrin-data/korrin-data.h"

namespace {

const int kGames = 1000;
// Where things are in a layout read by SqlProbe::Layout.
const size_t kFirstBox = 2, kAppId = 4, kCol = 6, kRow = 7;

// Puts |box| into the |rank|-th cell of a page four wide.
void PutInCell(size_t rank, Row* box) {
  (*box)[kCol] = std::to_string(rank % 4 + 1);
  (*box)[kRow] = std::to_string(rank / 4 + 1);
}

// How many boxes, from the first, stand where the closed-up page puts them.
size_t MovedBoxes(const std::vector<Row>& layout) {
  size_t rank = 0;
  for (size_t i = kFirstBox; i < layout.size(); ++i, ++rank) {
    Row box = layout[i];
    PutInCell(rank, &box);
    if (box != layout[i]) break;
  }
  return rank;
}

class UninstallKilledTest : public KilledTest {
 protected:
  void SetUp() override {  // 1,000 games laid out on one page
    AddGames(kGames);
    ASSERT_GT(RunToTheEnd(data_engin_initialization).operations, kGames);
    std::filesystem::copy_file(DbPath(), root + "/laid-out.db");
    laidOut = SqlProbe(DbPath()).Layout();
    ASSERT_EQ(2u + kGames, laidOut.size());
  }

  void RestoreLayout() {
    RemoveDatabase();
    std::filesystem::copy_file(root + "/laid-out.db", DbPath());
  }

  // The layout once |gone|'s box is deleted and the first |moved| others are
  // rewritten from the first cell; boxes by boxId, here also by row and col.
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

  void KillUninstallsOf(const std::string& gone, int kills) {
    auto uninstall = [&] {
      data_engin_initialization();
      device.Uninstall(gone);
    };
    RestoreLayout();
    long operations = RunToTheEnd(uninstall).operations;
    EXPECT_TRUE(Uninstalled(gone, kGames - 1) == SqlProbe(DbPath()).Layout());

    int leftTheBox = 0, partly = 0;
    std::vector<Kill> plan = Plan(1, operations, kills);
    for (const Kill& kill : plan) {
      SCOPED_TRACE(::testing::Message() << "uninstalling " << gone << ", " << kill);
      RestoreLayout();
      // The platform finished the uninstall; only the launcher was killed.
      Aftermath after = KillAndRestart(kill.point, uninstall, [&] { device.RemovePackage(gone); });
      EXPECT_EQ(Lines{"W it's not the first launch"}, after.logs);
      const std::vector<Row>& layout = after.layout;
      EXPECT_TRUE(after.left == layout) << "the next start rewrote the store";
      SqlProbe db(DbPath());
      const std::string others = " FROM Boxes WHERE appId != '" + gone + "'";
      EXPECT_EQ("999 999", db.Value("SELECT COUNT(*) || ' ' || COUNT(DISTINCT appId)" + others));
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
                              " a page closed up part of the way");
  }

  std::vector<Row> laidOut;
};

// Boxes before the game's are rewritten where they stand, which SQLite does
// not write, so where the box stands decides the range of kill points.
TEST_F(UninstallKilledTest, KilledWhileTheWholePageMovesUp) { KillUninstallsOf("game0001", 20); }
TEST_F(UninstallKilledTest, KilledWhileTheSecondHalfOfThePageMovesUp) {
  KillUninstallsOf("game0501", 15);
}
TEST_F(UninstallKilledTest, KilledWhileOnlyTheLastBoxGoes) { KillUninstallsOf("game1000", 5); }

}  // namespace
