// Stored listings and the download view.
#include "launcher-data-manager/store-test.h"

namespace {

class ListingsTest : public StoreTest {};

TEST_F(ListingsTest, PagesOfOneParentByPageNo) {
  EXPECT_TRUE(store.GetPageDataList(1, false).empty());
  int third = AddPage(1, 3);
  int first = AddPage(1, 1);
  int second = AddPage(1, 2);
  AddPage(1, 1, true);  // folder 1's page: another parent
  AddPage(2, 1);

  std::vector<boost::shared_ptr<GamePageData> > pages = store.GetPageDataList(1, false);
  ASSERT_EQ(3u, pages.size());
  EXPECT_EQ(first, pages[0]->pageId);
  EXPECT_EQ(second, pages[1]->pageId);
  EXPECT_EQ(third, pages[2]->pageId);
  EXPECT_EQ(3, pages[2]->pageNo);
  EXPECT_EQ(1, pages[2]->parentId);
  EXPECT_FALSE(pages[2]->isFolder);
  ASSERT_EQ(1u, store.GetPageDataList(1, true).size());
  EXPECT_TRUE(store.GetPageDataList(1, true)[0]->isFolder);
}

TEST_F(ListingsTest, BoxesOfAPageByRowThenColumn) {
  int page = AddPage(9, 1, true);
  AddBox(page, "b", 2, 1);
  AddBox(page, "c", 1, 2);
  AddBox(page, "a", 1, 1);
  AddBox(AddPage(9, 2, true), "elsewhere", 1, 1);

  std::vector<boost::shared_ptr<GameBoxData> > boxes = store.GetBoxDataList(page);
  EXPECT_EQ((std::vector<std::pair<int, int> >{{1, 1}, {2, 1}, {1, 2}}), Cells(boxes));
  EXPECT_EQ("a", boxes[0]->appId);
  EXPECT_EQ("", boxes[0]->name);  // NULL in the table
  EXPECT_EQ(9, boxes[0]->parentId);
  EXPECT_EQ(page, boxes[0]->pageId);
}

TEST_F(ListingsTest, BoxesOfAnAppByTypeAcrossPagesInterleavedByCell) {
  int first = AddPage(1, 1);
  int second = AddPage(1, 2);
  const std::string columns = "isFolder, pageId, appId, col, row, boxType, name, content";
  AddBoxSql(columns, "0, " + std::to_string(first) + ", 'it''s', 3, 2, 3, 'late', 'x'");
  AddBoxSql(columns, "0, " + std::to_string(second) + ", 'it''s', 2, 1, 3, 'early', 'y'");
  AddBoxSql(columns, "0, " + std::to_string(first) + ", 'it''s', 1, 1, 0, 'plain', NULL");
  AddBoxSql(columns, "0, " + std::to_string(first) + ", 'other', 1, 1, 3, 'other', NULL");

  std::vector<boost::shared_ptr<GameBoxData> > boxes = store.GetBoxDataListByAppId("it's", 3);
  ASSERT_EQ(2u, boxes.size());
  EXPECT_EQ("early", boxes[0]->name);
  EXPECT_EQ(second, boxes[0]->pageId);
  EXPECT_EQ(1, boxes[0]->parentId);
  EXPECT_EQ("y", boxes[0]->content);
  EXPECT_EQ("late", boxes[1]->name);
  EXPECT_EQ(1u, store.GetBoxDataListByAppId("it's", 0).size());
  EXPECT_TRUE(store.GetBoxDataListByAppId("nobody", 3).empty());
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(ListingsTest, FailedListingsAreEmpty) {
  AddBox(AddPage(1, 1), "a", 1, 1);
  Break("Boxes");
  EXPECT_TRUE(store.GetBoxDataList(1).empty());
  EXPECT_TRUE(store.GetBoxDataListByDownload(1, false).empty());
  EXPECT_TRUE(store.GetPageDataListByDownload(1, false).empty());
  EXPECT_TRUE(EngineLogs().empty());
  Break("Pages");
  EXPECT_TRUE(store.GetPageDataList(1, false).empty());
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(ListingsTest, FailedListingByAppIdLogsCompileAndBind) {
  Break("Boxes");
  EXPECT_TRUE(store.GetBoxDataListByAppId("com.ex.racer", 3).empty());
  const std::string sql =
      "SELECT boxId, b.isFolder, p.parentId, b.pageId, appId, name, col, row, isPreload, "
      "isSystem, boxType, launchType, iconPath, content FROM boxes b, pages p ON p.pageId = "
      "b.pageId WHERE appId = $appId AND boxType = 3 ORDER BY row, col";
  EXPECT_EQ((std::vector<EngineLog>{
                {DLOG_ERROR, "launcher-data-manager.cpp", "GetBoxDataListByAppId",
                 "sqlite error : [" + sql + ",no such table: boxes]"},
                {DLOG_ERROR, "launcher-data-manager.cpp", "GetBoxDataListByAppId",
                 "Bind Err : com.ex.racer\n"}}),
            EngineLogs());
}

// ---- The download view

TEST_F(ListingsTest, DownloadViewListsAppBoxesInInsertOrderFourToARow) {
  store.m_maxRows = 2;  // a small page, so that eight boxes fill it
  int menuPage = AddPage(1, 1);
  int folderPage = AddPage(30, 1, true);
  AddBox(menuPage, "a", 4, 9);
  AddBox(folderPage, "b", 1, 1);
  AddBox(menuPage, "c", 1, 1);
  AddBox(menuPage, "d", 2, 1);
  AddBox(AddPage(2, 1), "e", 3, 1);
  for (int i = 0; i < 4; ++i) AddBox(menuPage, "f", 1, 1);

  std::vector<boost::shared_ptr<GameBoxData> > boxes = store.GetBoxDataListByDownload(77, true);
  ASSERT_EQ(9u, boxes.size());
  for (size_t i = 0; i < boxes.size(); ++i) {
    EXPECT_EQ(std::string(1, i < 5 ? 'a' + i : 'f'), boxes[i]->appId);
    EXPECT_EQ(i < 8 ? 100001 : 100002, boxes[i]->pageId);
    EXPECT_EQ(77, boxes[i]->parentId);
  }
  EXPECT_EQ((std::vector<std::pair<int, int> >{
                {1, 1}, {2, 1}, {3, 1}, {4, 1}, {1, 2}, {2, 2}, {3, 2}, {4, 2}, {1, 1}}),
            Cells(boxes));
}

TEST_F(ListingsTest, DownloadPagesCoverTheCountedBoxes) {
  store.m_pageMap[5] = 5;
  EXPECT_TRUE(store.GetPageDataListByDownload(3, false).empty());
  EXPECT_EQ((std::map<int, int>{{5, 5}}), store.m_pageMap);

  int page = AddPage(1, 1);
  AddBox(page, "a", 1, 1);
  std::vector<boost::shared_ptr<GamePageData> > pages = store.GetPageDataListByDownload(3, false);
  ASSERT_EQ(1u, pages.size());
  EXPECT_EQ(100001, pages[0]->pageId);
  EXPECT_EQ(1, pages[0]->pageNo);
  EXPECT_EQ(3, pages[0]->parentId);
  EXPECT_FALSE(pages[0]->isFolder);
  EXPECT_EQ(3, store.m_pageMap[100001]);

  // The count takes shortcuts that the box listing leaves out.
  store.m_maxRows = 1;
  for (int i = 0; i < 4; ++i) {
    AddBoxSql("isFolder, pageId, appId, isPreload, boxType",
              "0, " + std::to_string(page) + ", 's', 0, 3");
  }
  EXPECT_EQ(2u, store.GetPageDataListByDownload(8, false).size());
  EXPECT_EQ(1u, store.GetBoxDataListByDownload(8, false).size());
  EXPECT_EQ(8, store.m_pageMap[100002]);
}

}  // namespace
