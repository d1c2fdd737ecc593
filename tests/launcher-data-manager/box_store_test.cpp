// Boxes: the three statement forms, reads by id and by application id.
// (Failures: failures_test.cpp.)
#include "launcher-data-manager/store-test.h"

namespace {

class BoxStoreTest : public StoreTest {
 protected:
  BoxStoreTest() : page(AddPage(17, 1, true)) {}

  // A box with every stored member set to something recognisable.
  GameBoxData Box(bool isFolder, int boxType) {
    GameBoxData box;
    box.isFolder = isFolder;
    box.boxType = boxType;
    box.pageId = page;
    box.col = 2;
    box.row = 3;
    box.appId = "com.ex.racer";
    box.name = "Racer";
    box.iconPath = "/icons/racer.png";
    box.content = "race://start";
    box.isPreload = true;
    box.isSystem = true;
    box.launchType = 5;
    return box;
  }

  Row Stored(int boxId) {
    std::vector<Row> rows = db->Rows(
        "SELECT isFolder, pageParentId, pageId, appId, name, col, row, isPreload, isSystem, "
        "boxType, launchType, iconPath, content FROM Boxes WHERE boxId = " +
        std::to_string(boxId));
    return rows.empty() ? Row() : rows[0];
  }

  int page;
};

TEST_F(BoxStoreTest, InsertUsesTheFormOfTheBoxAndStoresEmptyTextsAsNull) {
  const std::string p = std::to_string(page);
  struct Case {
    const char* what;
    bool isFolder;
    int boxType;
    Row stored;
  } cases[] = {
      {"folder: name and appId, no icon or content", true, 0,
       {"1", "NULL", p, "com.ex.racer", "Racer", "2", "3", "1", "1", "0", "5", "NULL", "NULL"}},
      {"shortcut: everything", false, 3,
       {"0", "NULL", p, "com.ex.racer", "Racer", "2", "3", "1", "1", "3", "5",
        "/icons/racer.png", "race://start"}},
      {"application: only the id and the place", false, 0,
       {"0", "NULL", p, "com.ex.racer", "NULL", "2", "3", "1", "1", "0", "5", "NULL", "NULL"}},
      {"folder wins over type 3", true, 3,
       {"1", "NULL", p, "com.ex.racer", "Racer", "2", "3", "1", "1", "3", "5", "NULL", "NULL"}},
  };
  for (const Case& c : cases) {
    GameBoxData box = Box(c.isFolder, c.boxType);
    int id = store.InsertBoxData(box);
    EXPECT_GT(id, 0) << c.what;
    EXPECT_EQ(id, box.boxId) << c.what;
    EXPECT_EQ(c.stored, Stored(id)) << c.what;

    // Empty texts are stored as NULL, never as ''.
    Row empty = c.stored;
    for (int text : {3, 4, 11, 12}) empty[text] = "NULL";
    box.appId = box.name = box.iconPath = box.content = "";
    EXPECT_EQ(empty, Stored(store.InsertBoxData(box))) << c.what << ", empty texts";
  }
}

TEST_F(BoxStoreTest, UpdateUsesTheFormOfTheBox) {
  const std::string other = std::to_string(AddPage(1, 2));
  struct Case {
    const char* what;
    bool isFolder;
    int boxType;
    std::string name;
    Row stored;
  } cases[] = {
      {"folder: never a system box; appId, icon and content left alone", true, 0, "Puzzles",
       {"1", "NULL", other, "com.ex.racer", "Puzzles", "4", "3", "1", "0", "0", "5",
        "/icons/racer.png", "race://start"}},
      {"application: icon and content left alone", false, 0, "",
       {"0", "NULL", other, "com.ex.new", "NULL", "4", "3", "1", "1", "0", "5", "/icons/racer.png",
        "race://start"}},
      {"shortcut: every text", false, 3, "New",
       {"0", "NULL", other, "com.ex.new", "New", "4", "3", "1", "1", "3", "5", "/elsewhere.png",
        "NULL"}},
  };
  for (const Case& c : cases) {
    GameBoxData shortcut = Box(false, 3);
    int id = store.InsertBoxData(shortcut);
    GameBoxData box = Box(c.isFolder, c.boxType);
    box.boxId = id;
    box.pageId = std::stoi(other);
    box.col = 4;
    box.appId = "com.ex.new";
    box.name = c.name;
    box.iconPath = "/elsewhere.png";
    box.content = "";
    EXPECT_TRUE(store.UpdateBoxData(box)) << c.what;
    EXPECT_EQ(c.stored, Stored(id)) << c.what;
  }
}

// By box id every stored member and the parent through the page; by
// application id placement, name and flags only.
TEST_F(BoxStoreTest, ReadsByBoxIdGiveEveryStoredMemberAndByAppIdOnlyPlacementNameAndFlags) {
  GameBoxData box = Box(false, 3);
  store.InsertBoxData(box);
  box.parentId = 17;
  boost::shared_ptr<GameBoxData> read = store.GetMenuBoxData(box.boxId);
  EXPECT_EQ(Fields(box), Fields(*read));
  EXPECT_EQ("", read->pkgId);  // never stored

  GameBoxData folder = Box(true, 0);
  int id = store.InsertBoxData(folder);
  EXPECT_EQ((Row{std::to_string(id), "1", std::to_string(page), "17", "2", "3", "com.ex.racer",
                 "Racer", "1", "1", "0", "0", "", ""}),  // no type, launch type, icon, content
            Fields(*store.GetBoxDataByAppId("com.ex.racer")));
}

// ---- Look-ups by application id

TEST_F(BoxStoreTest, LookUpsByAppIdFindTheBoxAsGivenButNeverAShortcut) {
  int folderPage = AddPage(31, 1, true);
  int id = AddBox(folderPage, "com.ex.chess", 2, 1);
  int parentId = -1, pageId = -2, boxId = -3;
  EXPECT_TRUE(store.GetBoxIdByAppId("com.ex.chess", &parentId, &pageId, &boxId));
  EXPECT_EQ((std::vector<int>{31, folderPage, id}), (std::vector<int>{parentId, pageId, boxId}));

  // An empty id is looked up as given: it finds '', never NULL.
  int empty = AddBox(page, "", 1, 1);
  AddBoxSql("isFolder, pageId", "0, " + std::to_string(page));
  EXPECT_TRUE(store.GetBoxIdByAppId("", &parentId, &pageId, &boxId));
  EXPECT_EQ(empty, boxId);
  EXPECT_EQ(empty, store.GetBoxDataByAppId("")->boxId);
  EXPECT_TRUE(EngineLogs().empty());

  // A shortcut is a miss: the outputs stay, the record is fresh, the miss is logged.
  GameBoxData shortcut = Box(false, 3);
  store.InsertBoxData(shortcut);
  parentId = -1, pageId = -2, boxId = -3;
  EXPECT_FALSE(store.GetBoxIdByAppId("com.ex.racer", &parentId, &pageId, &boxId));
  EXPECT_EQ((std::vector<int>{-1, -2, -3}), (std::vector<int>{parentId, pageId, boxId}));
  EXPECT_EQ(Fields(GameBoxData()), Fields(*store.GetBoxDataByAppId("com.ex.racer")));
  EXPECT_EQ((std::vector<EngineLog>{{DLOG_ERROR, "launcher-data-manager.cpp", "GetBoxDataByAppId",
                                     "cannot find box with appid[com.ex.racer]"}}),
            EngineLogs());
}

}  // namespace
