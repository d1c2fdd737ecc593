// The computed views: the download order and the alphabetical order, each on
// virtual pages the store makes up, and the edits the launcher makes on the
// alphabetical view. m_pageMap and m_pageFlagMap remember the virtual pages
// handed out here, so that an edit can tell where a box was dropped.
#include "launcher-data-manager/launcher-data-manager.h"

#include <utility>

#include <boost/make_shared.hpp>
#include <boost/smart_ptr/make_shared_array.hpp>

#include "common/log.h"
#include "launcher-data-manager/store-internal.h"

using korrin::Cell;
using korrin::Grid;
using korrin::GridCursor;
using korrin::Statement;
using korrin::kPrepareLegacy;
using korrin::kPrepareV2;

namespace {

// The download view's records, made a block at a time: one allocation serves
// many rows, and each record handed out keeps its block alive. Blocks double
// from 8 to 256 records, so that a short list makes few spare records and a
// record kept alone holds at most 255 others.
class BoxBlocks {
 public:
  BoxBlocks() : m_next(0), m_size(0) {}

  BoxPtr Next() {
    if (m_next == m_size) {
      m_size = m_size == 0 ? 8 : (m_size < 256 ? m_size * 2 : 256);
      m_block = boost::make_shared<GameBoxData[]>(m_size);
      m_next = 0;
    }
    return BoxPtr(m_block, &m_block[m_next++]);
  }

 private:
  boost::shared_ptr<GameBoxData[]> m_block;
  size_t m_next;
  size_t m_size;
};

// The k-th virtual page of a parent, remembered for the edits.
PagePtr VirtualPage(int pageId, int parentId, bool isFolder, int k) {
  PagePtr page = boost::make_shared<GamePageData>();
  page->pageId = pageId;
  page->isFolder = isFolder;
  page->parentId = parentId;
  page->pageNo = k;
  return page;
}

}  // namespace

// ---------------------------------------------------------------------------
// The download view

std::vector<BoxPtr> LauncherDataManager::GetBoxDataListByDownload(int parentId, bool) {
  std::vector<BoxPtr> boxes;
  // No ORDER BY: SQLite walks boxes by boxId, which is the order they were added.
  korrin::SqlText sql;
  sql << "SELECT boxId, b.isFolder, appId, name "
      << "FROM boxes b, pages p ON p.pageId = b.pageId  "
      << "WHERE b.isFolder = 0 AND b.IsPreload = 0 AND b.boxType != " << kShortcutBoxType << " ";
  Statement stmt(m_db, sql.str(), kPrepareLegacy);
  GridCursor cursor(korrin::MenuGrid(*this), GridCursor::kNewPage);
  BoxBlocks records;
  while (stmt.Step()) {
    BoxPtr box = records.Next();
    box->boxId = stmt.Int(0);
    box->isFolder = stmt.Bool(1);
    box->appId = stmt.Text(2);
    box->name = stmt.Text(3);
    box->pageId = korrin::VirtualPageId(cursor.page() + 1);
    box->col = cursor.col();
    box->row = cursor.row();
    box->parentId = parentId;
    boxes.push_back(std::move(box));
    cursor.Advance();
  }
  return boxes;
}

std::vector<PagePtr> LauncherDataManager::GetPageDataListByDownload(int parentId, bool) {
  std::vector<PagePtr> pages;
  int pageCount = korrin::PageCount(_GetPageDataCountByDownload(parentId), korrin::MenuGrid(*this));
  for (int k = 1; k <= pageCount; ++k) {
    pages.push_back(VirtualPage(korrin::VirtualPageId(k), parentId, false, k));
    m_pageMap[pages.back()->pageId] = parentId;
  }
  return pages;
}

// ---------------------------------------------------------------------------
// The alphabetical view

namespace {

// The boxes of one parent by name; ties keep SQLite's order.
std::string AlphabeticalBoxesSql(int parentId, bool isFolder) {
  korrin::SqlText sql;
  sql << "SELECT boxId, b.isFolder, appId, name, isPreload, isSystem, boxType, launchType, "
         "iconPath, content "
      << "FROM boxes b, pages p ON p.pageId = b.pageId "
      << "WHERE p.isFolder = " << isFolder << " AND p.parentId = " << parentId << " "
      << "ORDER BY name COLLATE NOCASE";
  return sql.str();
}

BoxPtr ReadAlphabeticalBox(const Statement& stmt) {
  BoxPtr box = boost::make_shared<GameBoxData>();
  box->boxId = stmt.Int(0);
  box->isFolder = stmt.Bool(1);
  box->appId = stmt.Text(2);
  box->name = stmt.Text(3);
  box->isPreload = stmt.Bool(4);
  box->isSystem = stmt.Bool(5);
  korrin::ReadBoxKind(stmt, 6, box.get());
  return box;
}

// The id of the k-th virtual page of a parent in the alphabetical view.
int AlphabeticalPageId(int parentId, bool isFolder, int k) {
  return isFolder ? korrin::FolderVirtualPageId(parentId, k) : korrin::VirtualPageId(k);
}

// Where a box was dropped in the alphabetical view.
struct DropTarget {
  int parentId;
  bool isFolder;
};

// A virtual page handed out by the page listing, else a stored page, else the
// parent the caller names. A miss leaves an empty entry in both maps, as the
// launcher has always done.
DropTarget FindDropTarget(LauncherDataManager& store, const GameBoxData& box) {
  DropTarget target = {store.m_pageMap[box.pageId], store.m_pageFlagMap[box.pageId]};
  if (target.parentId != 0) return target;
  PagePtr dropped = store.GetMenuPageData(box.pageId);
  if (dropped->pageId != 0) {
    target.parentId = dropped->parentId;
    target.isFolder = false;
  } else {
    KLOG(DLOG_ERROR, "No page [%d]", box.pageId);
    target.parentId = box.parentId;
    // Menus have small ids; a parent above 5 is taken for a folder box.
    target.isFolder = box.parentId > 5;
  }
  return target;
}

// Dropped within its own parent, a box only takes its new name.
void RenameBox(sqlite3* db, const GameBoxData& box) {
  korrin::SqlText sql;
  sql << "UPDATE boxes set "
      << "name = $name "
      << " WHERE boxId = " << box.boxId;
  Statement rename(db, sql.str(), kPrepareV2);
  // Like every update, an empty name is stored as NULL.
  rename.BindTextIfNotEmpty("$name", box.name);
  rename.Step();
}

}  // namespace

std::vector<BoxPtr> LauncherDataManager::GetBoxDataListByAlphabeticalOrder(int parentId,
                                                                           bool isFolder) {
  std::vector<BoxPtr> boxes;
  GridCursor cursor(korrin::ParentGrid(korrin::MenuGrid(*this), isFolder), GridCursor::kNewPage);
  Statement stmt(m_db, AlphabeticalBoxesSql(parentId, isFolder), kPrepareLegacy);
  while (stmt.Step()) {
    BoxPtr box = ReadAlphabeticalBox(stmt);
    box->pageId = AlphabeticalPageId(parentId, isFolder, cursor.page() + 1);
    box->col = cursor.col();
    box->row = cursor.row();
    boxes.push_back(std::move(box));
    cursor.Advance();
  }
  return boxes;
}

std::vector<BoxPtr> LauncherDataManager::GetBoxDataListByAlphabeticalOrderWithRealPage(
    int parentId, bool isFolder) {
  // The stored pages of every parent with this id, menu or folder alike: the
  // launcher's statement does not look at isFolder.
  std::vector<int> pageIds;
  korrin::SqlText pagesSql;
  pagesSql << "SELECT pageId from Pages "
           << "WHERE parentId = " << parentId << " "
           << "Order By pageNo ASC ";
  Statement pages(m_db, pagesSql.str(), kPrepareLegacy);
  while (pages.Step()) pageIds.push_back(pages.Int(0));

  std::vector<BoxPtr> boxes;
  GridCursor cursor(korrin::ParentGrid(korrin::MenuGrid(*this), isFolder), GridCursor::kNewPage);
  Statement stmt(m_db, AlphabeticalBoxesSql(parentId, isFolder), kPrepareLegacy);
  // The listing ends where the view would need a page the parent does not have.
  while (static_cast<size_t>(cursor.page()) < pageIds.size() && stmt.Step()) {
    BoxPtr box = ReadAlphabeticalBox(stmt);
    box->pageId = pageIds[cursor.page()];
    box->col = cursor.col();
    box->row = cursor.row();
    boxes.push_back(std::move(box));
    cursor.Advance();
  }
  return boxes;
}

std::vector<PagePtr> LauncherDataManager::GetPageDataListByAlphabeticalOrder(int parentId,
                                                                            bool isFolder) {
  korrin::SqlText sql;
  sql << "SELECT COUNT(*) "
      << "FROM boxes b, pages p ON p.pageId = b.pageId "
      << "WHERE p.isFolder = " << isFolder << " AND p.parentId = " << parentId;
  Statement count(m_db, sql.str(), kPrepareLegacy);
  int boxCount = count.Step() ? count.Int(0) : 0;

  int pageCount = korrin::PageCount(boxCount, korrin::ParentGrid(korrin::MenuGrid(*this), isFolder));
  // An empty menu still shows one page; an empty folder shows none.
  if (!isFolder && pageCount == 0) pageCount = 1;

  std::vector<PagePtr> pages;
  for (int k = 1; k <= pageCount; ++k) {
    pages.push_back(VirtualPage(AlphabeticalPageId(parentId, isFolder, k), parentId, isFolder, k));
    m_pageMap[pages.back()->pageId] = parentId;
    m_pageFlagMap[pages.back()->pageId] = isFolder;
  }
  return pages;
}

int LauncherDataManager::InsertBoxDataForAlphaBeticalOrder(GameBoxData& box) {
  Cell cell;
  bool pageAdded = false;  // not reported to this caller
  if (!FindCellAfterLastBox(*this, korrin::kFirstMenuId, false, korrin::MenuGrid(*this), &cell,
                            &pageAdded)) {
    return -1;
  }
  box.pageId = cell.pageId;
  box.col = cell.col;
  box.row = cell.row;
  return InsertBoxData(box);
}

int LauncherDataManager::UpdateBoxDataForAlphaBeticalOrder(GameBoxData& box) {
  BoxPtr stored = GetMenuBoxData(box.boxId);
  if (stored->boxId == 0) {
    KLOG(DLOG_ERROR, "No box [%d]", box.boxId);
    return 0;
  }
  PagePtr oldPage = GetMenuPageData(stored->pageId);
  if (oldPage->pageId == 0) {
    KLOG(DLOG_ERROR, "No page [%d]", stored->pageId);
    return 0;
  }
  if (oldPage->parentId == 0) {
    KLOG(DLOG_ERROR, "invalid page parent id");
    return 0;
  }

  DropTarget target = FindDropTarget(*this, box);
  if (target.parentId == oldPage->parentId) {
    RenameBox(m_db, box);
    return 0;
  }

  Cell cell;
  bool pageAdded = false;  // not reported to this caller
  Grid grid = korrin::ParentGrid(korrin::MenuGrid(*this), target.isFolder);
  if (!FindCellAfterLastBox(*this, box.parentId, target.isFolder, grid, &cell, &pageAdded)) {
    return 0;
  }
  box.pageId = cell.pageId;
  box.col = cell.col;
  box.row = cell.row;
  bool updated = UpdateBoxData(box);
  if (updated) _ReorderData(oldPage->parentId, oldPage->isFolder);
  return updated;
}

int LauncherDataManager::DeleteBoxDataForAlphaBeticalOrder(int boxId) {
  BoxPtr box = GetMenuBoxData(boxId);
  if (box->boxId == 0) {
    KLOG(DLOG_ERROR, "No box [%d]", boxId);
    return 0;
  }
  PagePtr page = GetMenuPageData(box->pageId);
  if (page->pageId == 0) {
    KLOG(DLOG_ERROR, "No page [%d]", box->pageId);
    return 0;
  }
  DeleteBoxData(boxId);
  _ReorderData(page->parentId, page->isFolder);
  return 0;
}
