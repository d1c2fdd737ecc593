// What the store's own files share: the menu grid, where a new box goes, and
// the reading of a box's kind. Not part of the store's public face.
#ifndef KORRIN_LAUNCHER_DATA_MANAGER_STORE_INTERNAL_H_
#define KORRIN_LAUNCHER_DATA_MANAGER_STORE_INTERNAL_H_

#include "launcher-data-manager/grid.h"
#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-data-manager/statement.h"

// The records the store hands out, shared with the caller.
typedef boost::shared_ptr<GameViewData> MenuPtr;
typedef boost::shared_ptr<GamePageData> PagePtr;
typedef boost::shared_ptr<GameBoxData> BoxPtr;

namespace korrin {

// New applications always go to this menu.
const int kFirstMenuId = 1;

// A menu page: m_columns wide, m_maxRows deep.
Grid MenuGrid(const LauncherDataManager& store);

// A cell on a stored page.
struct Cell {
  int pageId;
  int col;
  int row;
};

// Where a new box of the parent goes: after the last box of its last page,
// on |grid|; on a new page, numbered after the last, when the grid's page is
// full or when that last box stood in row 0; on a first page when the parent
// has none. Sets |*pageAdded| when it made a page. Returns false when the last
// page is unreadable. A new box never fills a hole.
bool FindCellAfterLastBox(LauncherDataManager& store, int parentId, bool isFolder,
                          const Grid& grid, Cell* cell, bool* pageAdded);

// Reads boxType, launchType, iconPath and content, in this order from |first|.
void ReadBoxKind(const Statement& stmt, int first, GameBoxData* box);

}  // namespace korrin

#endif  // KORRIN_LAUNCHER_DATA_MANAGER_STORE_INTERNAL_H_
