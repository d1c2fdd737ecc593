// Placement and packing: where a new box goes, and how the boxes of a parent
// are moved up to close the gaps. Both work only through the store's record
// operations and listings; none opens a transaction but RearrangeAppsPosition.
#include "launcher-data-manager/launcher-data-manager.h"

#include "launcher-data-manager/store-internal.h"

using korrin::Cell;
using korrin::Grid;
using korrin::GridCursor;

namespace {

int InsertPage(LauncherDataManager& store, int parentId, bool isFolder, int pageNo) {
  GamePageData page;
  page.isFolder = isFolder;
  page.parentId = parentId;
  page.pageNo = pageNo;
  return store.InsertPageData(page);
}

// Stores a new application box, of type 0 with only its id and place.
int InsertAppBox(LauncherDataManager& store, const std::string& appId, const Cell& cell) {
  GameBoxData box;
  box.pageId = cell.pageId;
  box.col = cell.col;
  box.row = cell.row;
  box.appId = appId;
  return store.InsertBoxData(box);
}

// Writes |boxes| in reading order from the first cell of |grid| until its page
// is full; the boxes after that keep their cells. Folder boxes are skipped,
// keeping their cells, when |skipFolders| is set. Returns how many were placed.
int PackBoxes(LauncherDataManager& store, const std::vector<BoxPtr>& boxes, const Grid& grid,
              bool skipFolders) {
  GridCursor cursor(grid, GridCursor::kStop);
  int placed = 0;
  for (size_t i = 0; i < boxes.size() && !cursor.Done(); ++i) {
    const BoxPtr& box = boxes[i];
    if (!box || (skipFolders && box->isFolder)) continue;
    box->col = cursor.col();
    box->row = cursor.row();
    store.UpdateBoxData(*box);
    ++placed;
    cursor.Advance();
  }
  return placed;
}

// Packs each page of a folder on the menu's width with no row bound; a nested
// folder keeps its cell and takes none. An empty page goes unless it is the
// folder's only one. The pages are not renumbered.
void PackFolderPages(LauncherDataManager& store, int folderBoxId) {
  std::vector<PagePtr> pages = store.GetPageDataList(folderBoxId, true);
  for (size_t i = 0; i < pages.size(); ++i) {
    std::vector<BoxPtr> boxes = store.GetBoxDataList(pages[i]->pageId);
    if (pages.size() > 1 && boxes.empty()) {
      store.DeletePageData(pages[i]->pageId);
    } else {
      PackBoxes(store, boxes, korrin::Unbounded(korrin::MenuGrid(store)), true);
    }
  }
}

// Numbers the pages from 1 in their order, deleting on the way each page left
// without boxes unless |keepEmpty| is set.
void RenumberPages(LauncherDataManager& store, const std::vector<PagePtr>& pages, bool keepEmpty) {
  int pageNo = 1;
  for (size_t i = 0; i < pages.size(); ++i) {
    if (!pages[i]) continue;
    if (!keepEmpty && store.GetBoxDataList(pages[i]->pageId).empty()) {
      store.DeletePageData(pages[i]->pageId);
    } else {
      pages[i]->pageNo = pageNo++;
      store.UpdatePageData(*pages[i]);
    }
  }
}

// The last box of the parent's last page, as a cell: column 0, row 1 when
// that page is empty, so that the next cell is its first.
Cell LastCell(LauncherDataManager& store, const GamePageData& page) {
  Cell cell = {page.pageId, 0, 1};
  std::vector<BoxPtr> boxes = store.GetBoxDataList(page.pageId);
  if (!boxes.empty() && boxes.back()) {
    cell.col = boxes.back()->col;
    cell.row = boxes.back()->row;
  }
  return cell;
}

}  // namespace

namespace korrin {

Grid MenuGrid(const LauncherDataManager& store) {
  Grid grid = {store.m_columns, store.m_maxRows};
  return grid;
}

bool FindCellAfterLastBox(LauncherDataManager& store, int parentId, bool isFolder,
                          const Grid& grid, Cell* cell, bool* pageAdded) {
  std::vector<PagePtr> pages = store.GetPageDataList(parentId, isFolder);
  if (pages.empty()) {
    Cell first = {InsertPage(store, parentId, isFolder, 1), 1, 1};
    *cell = first;
    *pageAdded = true;
    return true;
  }
  PagePtr last = pages.back();
  if (!last) return false;

  Cell lastBox = LastCell(store, *last);
  GridCursor cursor(grid, GridCursor::kNewPage);
  cursor.MoveTo(lastBox.col, lastBox.row);
  cursor.Advance();
  // A last box in row 0 starts a new page rather than being followed in row 1;
  // kept as the launcher expects it.
  bool wrappedFromRowZero = lastBox.row == 0 && cursor.row() == 1;
  if (cursor.page() > 0 || wrappedFromRowZero) {
    // A stored pageNo may be INT_MAX; the number wraps, as on the device.
    int pageNo = static_cast<int>(static_cast<unsigned>(last->pageNo) + 1u);
    Cell first = {InsertPage(store, parentId, isFolder, pageNo), 1, 1};
    *cell = first;
    *pageAdded = true;
    return true;
  }
  Cell next = {last->pageId, cursor.col(), cursor.row()};
  *cell = next;
  return true;
}

}  // namespace korrin

int LauncherDataManager::InsertBoxData(std::string appId, bool& pageAdded) {
  Cell cell;
  if (!FindCellAfterLastBox(*this, korrin::kFirstMenuId, false, korrin::MenuGrid(*this), &cell,
                            &pageAdded)) {
    return -1;
  }
  return InsertAppBox(*this, appId, cell);
}

int LauncherDataManager::InsertBoxDataForDeactivatedApp(int menuId, std::string appId) {
  Cell cell;
  bool pageAdded = false;  // not reported to this caller
  Grid grid = korrin::WithTwoSpareRows(korrin::MenuGrid(*this));
  if (!FindCellAfterLastBox(*this, menuId, false, grid, &cell, &pageAdded)) return 0;
  return InsertAppBox(*this, appId, cell);
}

int LauncherDataManager::DeleteBoxDataForDeactivatedApp(int menuId, int boxId) {
  DeleteBoxData(boxId);
  _ReorderDataWithoutSpace(menuId, false);
  return 1;
}

void LauncherDataManager::_ReorderData(int parentId, bool isFolder) {
  std::vector<PagePtr> pages = GetPageDataList(parentId, isFolder);
  if (pages.empty()) return;

  Grid grid = korrin::ParentGrid(korrin::MenuGrid(*this), isFolder);
  int placed = 0;
  for (size_t i = 0; i < pages.size(); ++i) {
    if (!pages[i]) continue;
    placed += PackBoxes(*this, GetBoxDataList(pages[i]->pageId), grid, false);
  }

  // With nothing placed at all, empty pages are kept and only renumbered.
  RenumberPages(*this, pages, placed == 0);
}

void LauncherDataManager::_ReorderDataWithoutSpace(int parentId, bool isFolder) {
  std::vector<PagePtr> pages = GetPageDataList(parentId, isFolder);
  if (pages.empty()) return;

  std::vector<BoxPtr> queue;
  for (size_t i = 0; i < pages.size(); ++i) {
    std::vector<BoxPtr> boxes = GetBoxDataList(pages[i]->pageId);
    queue.insert(queue.end(), boxes.begin(), boxes.end());
  }

  // The menu grid whatever isFolder says; kept as the launcher expects it.
  GridCursor cursor(korrin::WithTwoSpareRows(korrin::MenuGrid(*this)), GridCursor::kNewPage);
  for (size_t next = 0; next < queue.size(); ++next) {
    size_t page = static_cast<size_t>(cursor.page());
    if (page >= pages.size()) break;  // the boxes left keep their cells
    GameBoxData& box = *queue[next];
    box.col = cursor.col();
    box.row = cursor.row();
    box.pageId = pages[page]->pageId;
    UpdateBoxData(box);
    cursor.Advance();
  }

  RenumberPages(*this, pages, false);
}

void LauncherDataManager::RearrangeAppsPosition() {
  BeginTransaction();
  std::vector<MenuPtr> menus = GetMenuDataList();
  for (size_t m = 0; m < menus.size(); ++m) {
    if (!menus[m]) continue;
    std::vector<PagePtr> pages = GetPageDataList(menus[m]->menuId, false);
    int pageNo = 1;
    for (size_t p = 0; p < pages.size(); ++p) {
      std::vector<BoxPtr> boxes = GetBoxDataList(pages[p]->pageId);
      // A menu's only page stays, empty or not.
      if (pages.size() > 1 && boxes.empty()) {
        DeletePageData(pages[p]->pageId);
        continue;
      }
      pages[p]->pageNo = pageNo++;
      UpdatePageData(*pages[p]);

      PackBoxes(*this, boxes, korrin::Unbounded(korrin::MenuGrid(*this)), false);
      for (size_t b = 0; b < boxes.size(); ++b) {
        if (boxes[b] && boxes[b]->isFolder) PackFolderPages(*this, boxes[b]->boxId);
      }
    }
  }
  CommitTransaction();
}
