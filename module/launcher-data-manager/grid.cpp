#include "launcher-data-manager/grid.h"

#include <math.h>

namespace korrin {

Grid ParentGrid(const Grid& menu, bool isFolder) { return isFolder ? kFolderGrid : menu; }

Grid Unbounded(const Grid& menu) {
  Grid grid = {menu.columns, kNoRowBound};
  return grid;
}

Grid WithTwoSpareRows(const Grid& menu) {
  Grid grid = {menu.columns, menu.rows + 2};
  return grid;
}

int PageCount(int boxCount, const Grid& grid) {
  double cellsPerPage = static_cast<double>(grid.columns) * grid.rows;
  return static_cast<int>(ceil(boxCount / cellsPerPage));
}

int VirtualPageId(int k) { return kVirtualPageBase + k; }

int FolderVirtualPageId(int folderBoxId, int k) {
  unsigned base = static_cast<unsigned>(folderBoxId) * kVirtualPageBase;
  return static_cast<int>(base + static_cast<unsigned>(k));
}

GridCursor::GridCursor(const Grid& grid, EndPolicy atEnd)
    : grid_(grid), atEnd_(atEnd), done_(false), page_(0), col_(1), row_(1) {}

void GridCursor::MoveTo(int col, int row) {
  col_ = col;
  row_ = row;
}

void GridCursor::Advance() {
  if (col_ < grid_.columns) {
    ++col_;
    return;
  }
  col_ = 1;
  if (row_ < grid_.rows) {
    ++row_;
    return;
  }
  switch (atEnd_) {
    case kStop:
      done_ = true;
      break;
    case kNewPage:
      ++page_;
      row_ = 1;
      break;
    case kWrap:
      row_ = 1;
      break;
  }
}

}  // namespace korrin
