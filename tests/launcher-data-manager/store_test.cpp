// What a korrin-sim script cannot hand the store (tests/scenarios/store-*.ksim
// cover the rest): texts too long for a script line or holding a NUL, and
// pages too full to build in one.
#include <dlog.h>

#include "launcher-data-manager/launcher-data-manager.h"
#include "support/sim-test.h"
#include "support/sql-probe.h"

namespace {

class StoreTest : public SimTest {
 protected:
  StoreTest() : db(DbPath()) {
    store._OpenDb();
    device.ClearLogs();
  }

  LauncherDataManager store;
  SqlProbe db;
};

TEST_F(StoreTest, AVeryLongIdRoundTripsThroughEveryTextParameter) {
  const std::string text = std::string(64 * 1024, 'w') + "\xe2\x98\x83";
  GameViewData menu;
  menu.name = text;
  store.InsertMenuData(menu);
  EXPECT_EQ(text, store.GetMenuDataList()[0]->name);
  bool pageAdded = false;
  int app = store.InsertBoxData(text, pageAdded);
  GameBoxData shortcut;
  shortcut.pageId = 1;
  shortcut.boxType = kShortcutBoxType;
  shortcut.appId = shortcut.name = shortcut.iconPath = shortcut.content = text;
  store.InsertBoxData(shortcut);

  EXPECT_EQ(app, store.GetBoxDataByAppId(text)->boxId);
  std::vector<boost::shared_ptr<GameBoxData>> listed = store.GetBoxDataListByAppId(text, kShortcutBoxType);
  ASSERT_EQ(1u, listed.size());
  EXPECT_EQ((Row{text, text, text}),
            (Row{listed[0]->name, listed[0]->iconPath, listed[0]->content}));
  store.GetBoxDataByAppId(text + "?");
  EXPECT_EQ(std::vector<std::string>{"E cannot find box with appid[" + text + "?]"},
            EngineMessages());
}

TEST_F(StoreTest, ATextThatAnotherToolStoredWithANulReadsWhole) {
  db.Exec("INSERT INTO Menus(name, type) VALUES('a' || char(0) || 'b', 0)");
  EXPECT_EQ(std::string("a\0b", 3), store.GetMenuData(1)->name);
}

// A menu page ends after m_maxRows rows (40000 on a device, too many for a
// script to fill; two here); a deactivated application's placement lets it
// run two rows further.
TEST_F(StoreTest, APlacementOpensAPageAfterTheLastRowOrForADeactivatedAppTwoRowsLater) {
  store.m_maxRows = 2;
  bool pageAdded = false;
  for (int i = 0; i < 9; ++i) store.InsertBoxData("menu", pageAdded);
  for (int i = 0; i < 17; ++i) store.InsertBoxDataForDeactivatedApp(2, "deactivated");
  EXPECT_EQ("1:4,2 2:1,1 3:4,4 4:1,1",
            db.Value("SELECT group_concat(pageId || ':' || col || ',' || row, ' ') FROM Boxes "
                     "WHERE boxId IN (8, 9, 25, 26)"));
}

// The computed views and the packing turn a page after m_maxRows rows as well.
TEST_F(StoreTest, TheViewsAndThePackingTurnAPageAfterTheLastRow) {
  store.m_maxRows = 2;
  bool pageAdded = false;
  for (int i = 0; i < 9; ++i) store.InsertBoxData("app", pageAdded);
  EXPECT_EQ(100002, store.GetBoxDataListByDownload(1, false).back()->pageId);
  EXPECT_EQ(2u, store.GetPageDataListByDownload(1, false).size());
  EXPECT_EQ(100002, store.GetBoxDataListByAlphabeticalOrder(1, false).back()->pageId);
  EXPECT_EQ(2u, store.GetPageDataListByAlphabeticalOrder(1, false).size());
  db.Exec("UPDATE Boxes SET pageId = 1, col = 9, row = 9");
  store._ReorderData(1, false);
  EXPECT_EQ("1,1 4,2 9,9 1", db.Value("SELECT group_concat(col || ',' || row, ' ') || ' ' || "
                                      "(SELECT COUNT(*) FROM Pages) FROM Boxes WHERE boxId IN "
                                      "(1, 8, 9)"));
}

}  // namespace
