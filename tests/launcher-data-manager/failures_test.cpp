// What each store operation answers when its statements cannot compile: the
// launcher tells a failure by these values alone, and only three operations
// log anything.
#include "launcher-data-manager/store-test.h"

#include <functional>

namespace {

class StoreFailureTest : public StoreTest {
 protected:
  StoreFailureTest() : page(AddPage(AddMenu("Apps"), 1)), box(AddBox(page, "a", 1, 1)) {
    Break("Menus");
    Break("Pages");
    Break("Boxes");
  }

  int page;
  int box;
};

TEST_F(StoreFailureTest, EveryOtherOperationAnswersItsFailureValueQuietly) {
  GameViewData menu;
  menu.menuId = 5;
  menu.name = "x";
  GamePageData pageRecord;
  pageRecord.pageId = 77;
  GameBoxData boxRecord;
  boxRecord.boxId = 88;
  int parentId = 7, pageId = 7, boxId = 7;
  struct {
    const char* call;
    std::function<int()> run;
    int answer;
  } cases[] = {
      {"InsertMenuData", [&] { return store.InsertMenuData(menu); }, -1},
      {"UpdateMenuData", [&] { return store.UpdateMenuData(menu); }, false},
      {"DeleteMenuData", [&] { return store.DeleteMenuData(1); }, false},
      {"GetMenuDataCount", [&] { return store.GetMenuDataCount(); }, 0},
      {"GetMenuDataList", [&] { return store.GetMenuDataList().size(); }, 0},
      {"InsertPageData", [&] { return store.InsertPageData(pageRecord); }, -1},
      {"UpdatePageData", [&] { return store.UpdatePageData(pageRecord); }, false},
      {"DeletePageData", [&] { return store.DeletePageData(page); }, false},
      {"DeleteFolderPageData", [&] { return store.DeleteFolderPageData(1); }, false},
      {"GetPageDataList", [&] { return store.GetPageDataList(1, false).size(); }, 0},
      {"InsertBoxData", [&] { return store.InsertBoxData(boxRecord); }, -1},
      {"UpdateBoxData: the launcher never hears", [&] { return store.UpdateBoxData(boxRecord); },
       true},
      {"GetBoxDataCount", [&] { return store.GetBoxDataCount(page); }, 0},
      {"GetBoxIdByAppId", [&] { return store.GetBoxIdByAppId("a", &parentId, &pageId, &boxId); },
       false},
      {"GetBoxDataList", [&] { return store.GetBoxDataList(page).size(); }, 0},
      {"_GetPageDataCountByDownload", [&] { return store._GetPageDataCountByDownload(1); }, 0},
      {"GetBoxDataListByDownload", [&] { return store.GetBoxDataListByDownload(1, false).size(); },
       0},
      {"GetPageDataListByDownload",
       [&] { return store.GetPageDataListByDownload(1, false).size(); }, 0},
  };
  for (const auto& c : cases) EXPECT_EQ(c.answer, c.run()) << c.call;

  // Records are left as they were, and reads give fresh ones.
  EXPECT_EQ(5, menu.menuId);
  EXPECT_EQ(77, pageRecord.pageId);
  EXPECT_EQ(88, boxRecord.boxId);
  EXPECT_EQ((std::vector<int>{7, 7, 7}), (std::vector<int>{parentId, pageId, boxId}));
  EXPECT_EQ(Fields(GameViewData()), Fields(*store.GetMenuData(1)));
  EXPECT_EQ(Fields(GamePageData()), Fields(*store.GetMenuPageData(page)));
  EXPECT_EQ(Fields(GameBoxData()), Fields(*store.GetMenuBoxData(box)));
  EXPECT_TRUE(EngineLogs().empty());
}

TEST_F(StoreFailureTest, DeleteAndTheLookUpsByAppIdLogEachStepThatFailed) {
  EXPECT_FALSE(store.DeleteBoxData(box));
  EXPECT_EQ(0, store.GetBoxDataByAppId("com.ex.racer")->boxId);
  EXPECT_TRUE(store.GetBoxDataListByAppId("com.ex.racer", 3).empty());

  // The look-ups try every step regardless of the one before.
  const std::string one =
      "SELECT b.boxId, b.isFolder, p.pageId, col, row, appId, name, p.parentId, isPreload, "
      "isSystem FROM boxes b, pages p ON b.pageId = p.pageId WHERE b.appId = $appId AND "
      "b.boxType != 3 ";
  const std::string list =
      "SELECT boxId, b.isFolder, p.parentId, b.pageId, appId, name, col, row, isPreload, "
      "isSystem, boxType, launchType, iconPath, content FROM boxes b, pages p ON p.pageId = "
      "b.pageId WHERE appId = $appId AND boxType = 3 ORDER BY row, col";
  const std::string file = "launcher-data-manager.cpp";
  EXPECT_EQ((std::vector<EngineLog>{
                {DLOG_ERROR, file, "DeleteBoxData", "sqlite error : no such table: boxes"},
                {DLOG_ERROR, file, "GetBoxDataByAppId",
                 "sqlite error : [" + one + ",no such table: boxes]"},
                {DLOG_ERROR, file, "GetBoxDataByAppId", "Bind Err : com.ex.racer\n"},
                {DLOG_ERROR, file, "GetBoxDataByAppId", "cannot find box with appid[com.ex.racer]"},
                {DLOG_ERROR, file, "GetBoxDataListByAppId",
                 "sqlite error : [" + list + ",no such table: boxes]"},
                {DLOG_ERROR, file, "GetBoxDataListByAppId", "Bind Err : com.ex.racer\n"}}),
            EngineLogs());
}

}  // namespace
