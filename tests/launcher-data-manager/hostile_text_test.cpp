// Text that tries to break out of its statement, or is merely unusual, goes
// through every text parameter and comes back byte for byte.
#include "launcher-data-manager/store-test.h"

namespace {

const std::string kHostileTexts[] = {
    "O'Brien \"the\" `racer`",
    "'); DROP TABLE boxes; --",
    "\"; DELETE FROM menus WHERE 1=1; --",
    "$name $appId ?1 :x @y",
    "%s%s%n%d",
    std::string(64 * 1024, 'w') + "\xe2\x98\x83",
    "Gr\xc3\xb6\xc3\x9f" "e \xe6\x97\xa5\xe6\x9c\xac \xf0\x9f\x8e\xae",  // Größe 日本 🎮
    "\xd9\x84\xd8\xb9\xd8\xa8\xd8\xa9 \xd8\xb3\xd8\xa8\xd8\xa7\xd9\x82",  // right to left
    "line one\nline two\r\nthree\ttabbed",
};

class HostileTextTest : public StoreTest, public ::testing::WithParamInterface<std::string> {};

TEST_P(HostileTextTest, EveryTextParameterRoundTripsAndTheTablesStayIntact) {
  const std::string& text = GetParam();
  GameViewData menu;
  menu.name = text;
  int menuId = store.InsertMenuData(menu);
  EXPECT_EQ(text, store.GetMenuData(menuId)->name);
  menu.name = text + text;
  EXPECT_TRUE(store.UpdateMenuData(menu));
  EXPECT_EQ(text + text, store.GetMenuDataList()[0]->name);

  // A shortcut carries all four texts.
  int page = AddPage(menuId, 1);
  GameBoxData box;
  box.pageId = page;
  box.boxType = 3;
  box.appId = text + "a";
  box.name = text + "n";
  box.iconPath = text + "i";
  box.content = text + "c";
  boost::shared_ptr<GameBoxData> read = store.GetMenuBoxData(store.InsertBoxData(box));
  EXPECT_EQ((Row{text + "a", text + "n", text + "i", text + "c"}),
            (Row{read->appId, read->name, read->iconPath, read->content}));
  box.name = text;
  box.content = "";
  store.UpdateBoxData(box);
  std::vector<boost::shared_ptr<GameBoxData> > listed = store.GetBoxDataListByAppId(text + "a", 3);
  ASSERT_EQ(1u, listed.size());
  EXPECT_EQ(text, listed[0]->name);
  EXPECT_EQ("", listed[0]->content);
  EXPECT_EQ(text + "i", store.GetBoxDataList(page)[0]->iconPath);

  // An application is found by its id as given; a folder keeps its name.
  GameBoxData app;
  app.pageId = page;
  app.appId = text;
  int appBox = store.InsertBoxData(app);
  GameBoxData folder;
  folder.isFolder = true;
  folder.pageId = page;
  folder.name = text;
  int folderBox = store.InsertBoxData(folder);
  EXPECT_EQ(appBox, store.GetBoxDataByAppId(text)->boxId);
  int parentId = 0, pageId = 0, boxId = 0;
  EXPECT_TRUE(store.GetBoxIdByAppId(text, &parentId, &pageId, &boxId));
  EXPECT_EQ(appBox, boxId);
  EXPECT_EQ(text, store.GetMenuBoxData(folderBox)->name);
  EXPECT_EQ(text, store.GetBoxDataListByDownload(1, false)[0]->appId);

  // A near miss finds nothing, and the id is logged as it is.
  store.GetBoxDataByAppId(text + "?");
  EXPECT_EQ(std::vector<std::string>{"E cannot find box with appid[" + text + "?]"},
            EngineMessages());
  EXPECT_EQ("1 1 3", Counts());
  EXPECT_EQ("Boxes,Menus,Pages,sqlite_sequence",
            db->Value("SELECT group_concat(name) FROM (SELECT name FROM sqlite_master "
                      "ORDER BY name)"));
}

INSTANTIATE_TEST_SUITE_P(Texts, HostileTextTest, ::testing::ValuesIn(kHostileTexts),
                         [](const ::testing::TestParamInfo<std::string>& info) {
                           return "text" + std::to_string(info.index);
                         });

}  // namespace
