// Stored listings and the download view. (Failures: failures_test.cpp.)
#include "launcher-data-manager/store-test.h"

namespace {

class ListingsTest : public StoreTest {};

TEST_F(ListingsTest, PagesOfOneParentByPageNoAndBoxesOfAPageByRowThenColumnWithEveryColumn) {
  EXPECT_TRUE(store.GetPageDataList(1, false).empty());
  AddPage(1, 3);  // page 1
  AddPage(1, 1);  // page 2
  AddPage(1, 2);  // page 3
  AddPage(1, 1, true);  // page 4: folder 1's, another parent
  AddPage(2, 1);
  EXPECT_EQ((std::vector<Row>{{"2", "0", "1", "1"}, {"3", "0", "1", "2"}, {"1", "0", "1", "3"}}),
            Fields(store.GetPageDataList(1, false)));
  EXPECT_EQ((std::vector<Row>{{"4", "1", "1", "1"}}), Fields(store.GetPageDataList(1, true)));

  int page = AddPage(9, 1, true);
  AddBox(page, "b", 2, 1);
  AddBox(page, "c", 1, 2);
  AddBoxSql("isFolder, pageId, appId, name, col, row, isPreload, isSystem, boxType, launchType, "
            "iconPath, content",
            "1, " + std::to_string(page) + ", 'a', 'A', 1, 1, 0, 1, 3, 4, 'a.png', 'a://'");
  AddBox(AddPage(9, 2, true), "elsewhere", 1, 1);

  std::vector<boost::shared_ptr<GameBoxData> > boxes = store.GetBoxDataList(page);
  EXPECT_EQ((std::vector<std::pair<int, int> >{{1, 1}, {2, 1}, {1, 2}}), Cells(boxes));
  EXPECT_EQ((Row{"3", "1", std::to_string(page), "9", "1", "1", "a", "A", "0", "1", "3", "4",
                 "a.png", "a://"}),
            Fields(*boxes[0]));
  EXPECT_EQ("", boxes[1]->name);  // NULL in the table
}

TEST_F(ListingsTest, BoxesOfAnAppByTypeAcrossPagesInterleavedByCell) {
  AddPage(1, 1);
  AddPage(1, 2);
  const std::string columns = "isFolder, pageId, appId, col, row, boxType, name, content";
  AddBoxSql(columns, "0, 1, 'it''s', 3, 2, 3, 'late', 'x'");
  AddBoxSql(columns + ", isPreload, launchType, iconPath",
            "0, 2, 'it''s', 2, 1, 3, 'early', 'y', 1, 4, 'e.png'");
  AddBoxSql(columns, "0, 1, 'it''s', 1, 1, 0, 'plain', NULL");
  AddBoxSql(columns, "0, 1, 'other', 1, 1, 3, 'other', NULL");

  EXPECT_EQ((std::vector<Row>{
                {"2", "0", "2", "1", "2", "1", "it's", "early", "1", "0", "3", "4", "e.png", "y"},
                {"1", "0", "1", "1", "3", "2", "it's", "late", "0", "0", "3", "0", "", "x"}}),
            Fields(store.GetBoxDataListByAppId("it's", 3)));
  EXPECT_EQ(1u, store.GetBoxDataListByAppId("it's", 0).size());
  EXPECT_TRUE(store.GetBoxDataListByAppId("nobody", 3).empty());
  EXPECT_TRUE(EngineLogs().empty());
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
  EXPECT_EQ((std::vector<Row>{{"100001", "0", "3", "1"}}),
            Fields(store.GetPageDataListByDownload(3, false)));
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
