// The grid alone, without a database: walks, page counts, virtual page ids.
#include "launcher-data-manager/grid.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using korrin::Grid;
using korrin::GridCursor;

// The cells a cursor visits, as "page:col,row" words, for |steps| at most.
std::string Walk(const Grid& grid, GridCursor::EndPolicy atEnd, int steps) {
  GridCursor cursor(grid, atEnd);
  std::string cells;
  for (int i = 0; i < steps && !cursor.Done(); ++i, cursor.Advance()) {
    cells += std::to_string(cursor.page()) + ":" + std::to_string(cursor.col()) + "," +
             std::to_string(cursor.row()) + " ";
  }
  return cells;
}

TEST(GridTest, EachEndPolicyAfterTheLastCell) {
  const Grid twoByTwo = {2, 2};
  EXPECT_EQ("0:1,1 0:2,1 0:1,2 0:2,2 1:1,1 1:2,1 ", Walk(twoByTwo, GridCursor::kNewPage, 6));
  EXPECT_EQ("0:1,1 0:2,1 0:1,2 0:2,2 0:1,1 0:2,1 ", Walk(twoByTwo, GridCursor::kWrap, 6));
  EXPECT_EQ("0:1,1 0:2,1 0:1,2 0:2,2 ", Walk(twoByTwo, GridCursor::kStop, 6));
}

TEST(GridTest, CellsOutsideTheGridAndRowsWithoutBound) {
  GridCursor cursor(Grid{4, 3}, GridCursor::kNewPage);
  cursor.MoveTo(7, 0);  // a column past the last goes on in the next row
  cursor.Advance();
  EXPECT_EQ(0, cursor.page());
  EXPECT_EQ(1, cursor.row());
  cursor.MoveTo(4, 5);  // a row past the last ends the page
  cursor.Advance();
  EXPECT_TRUE(cursor.AtFirstCell());
  EXPECT_EQ(1, cursor.page());

  GridCursor unbounded(korrin::kCompactionGrid, GridCursor::kStop);
  unbounded.MoveTo(4, korrin::kNoRowBound);  // no overflow past the last row
  unbounded.Advance();
  EXPECT_TRUE(unbounded.Done());
}

TEST(GridTest, PageCountsVirtualPagesAndDerivedGrids) {
  const Grid menu = {4, 40000};
  EXPECT_EQ(0, korrin::PageCount(0, menu));
  EXPECT_EQ(1, korrin::PageCount(160000, menu));
  EXPECT_EQ(2, korrin::PageCount(160001, menu));
  EXPECT_EQ(2, korrin::PageCount(10, korrin::ParentGrid(menu, true)));
  EXPECT_EQ(40002, korrin::WithTwoSpareRows(menu).rows);
  EXPECT_EQ(korrin::kNoRowBound, korrin::Unbounded(menu).rows);

  EXPECT_EQ(100001, korrin::VirtualPageId(1));
  EXPECT_EQ(700002, korrin::FolderVirtualPageId(7, 2));
  EXPECT_EQ(705032705, korrin::FolderVirtualPageId(50000, 1));  // wraps, as on the device
}

}  // namespace
