// The geometry of the launcher's pages: which cell the next box takes, how
// many pages a number of boxes fills, and the ids of the pages the computed
// views make up. Cells are counted from 1 in reading order: along a row of
// |columns|, then down to the next row, for |rows| rows a page.
//
// Every walk over cells goes through GridCursor, and every quirk of the
// launcher's geometry is stated here, once.
#ifndef KORRIN_LAUNCHER_DATA_MANAGER_GRID_H_
#define KORRIN_LAUNCHER_DATA_MANAGER_GRID_H_

#include <limits.h>

namespace korrin {

struct Grid {
  int columns;  // cells in a row
  int rows;     // rows on a page
};

// A page that grows downward without limit.
const int kNoRowBound = INT_MAX;

// Folders are laid out 3 by 3, by the operations that know they are folders.
const Grid kFolderGrid = {3, 3};

// The uninstall compaction lays every page out four wide, folder pages too,
// with no row limit; kept as the launcher expects it.
const Grid kCompactionGrid = {4, kNoRowBound};

// The grid of a parent's pages: |menu| for a menu, kFolderGrid for a folder.
Grid ParentGrid(const Grid& menu, bool isFolder);

// The menu grid with no row limit, as the full rearrangement packs.
Grid Unbounded(const Grid& menu);

// The placement of a deactivated application and the packing that pours a
// menu's boxes over its pages allow two rows more than the menu grid; kept as
// the launcher expects it.
Grid WithTwoSpareRows(const Grid& menu);

// How many pages |boxCount| boxes fill, rounded up; the division is made in
// double precision, as the launcher makes it.
int PageCount(int boxCount, const Grid& grid);

// The computed views number their pages from here; stored pages never get near.
const int kVirtualPageBase = 100000;

// The id of the k-th virtual page (k from 1) of a menu: 100000 + k.
int VirtualPageId(int k);
// The id of the k-th virtual page of a folder: its boxId * 100000 + k. Like
// the device, the product wraps for very large box ids rather than failing.
int FolderVirtualPageId(int folderBoxId, int k);

// Walks cells in reading order. What follows the last cell of a page's last
// row is the cursor's end policy.
class GridCursor {
 public:
  enum EndPolicy {
    kWrap,     // row 1 again, on the same page
    kStop,     // the walk is over: Done()
    kNewPage,  // row 1 of the next page
  };

  // Starts in column 1, row 1 of page 0.
  GridCursor(const Grid& grid, EndPolicy atEnd);

  // Puts the cursor on any cell, inside the grid or not.
  void MoveTo(int col, int row);
  // The next cell. A column at or past the last wraps to the next row; a row
  // at or past the last ends the page. Never overflows.
  void Advance();

  bool Done() const { return done_; }
  bool AtFirstCell() const { return col_ == 1 && row_ == 1; }
  int page() const { return page_; }  // counted from 0
  int col() const { return col_; }
  int row() const { return row_; }

 private:
  Grid grid_;
  EndPolicy atEnd_;
  bool done_;
  int page_;
  int col_;
  int row_;
};

}  // namespace korrin

#endif  // KORRIN_LAUNCHER_DATA_MANAGER_GRID_H_
