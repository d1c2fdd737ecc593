// Where a new application's box goes.
#include "launcher-data-manager/store-test.h"

#include <limits.h>

#include <functional>

namespace {

class PlacementTest : public StoreTest {
 protected:
  PlacementTest() : apps(AddMenu("Apps")) {}

  // "pageNo:col,row" of the box of |appId|.
  std::string PlaceOf(const std::string& appId) {
    return db->Value("SELECT p.pageNo || ':' || b.col || ',' || b.row FROM Boxes b, Pages p "
                     "ON p.pageId = b.pageId WHERE b.appId = '" + appId + "'");
  }

  int apps;
};

TEST_F(PlacementTest, FirstAppOfAnEmptyMenuOpensPageOne) {
  bool pageAdded = false;
  int id = store.InsertBoxData("com.ex.racer", pageAdded);
  EXPECT_TRUE(pageAdded);
  EXPECT_EQ((std::vector<Row>{{"0", "1", "1"}}),
            db->Rows("SELECT isFolder, parentId, pageNo FROM Pages"));
  EXPECT_EQ((std::vector<Row>{{std::to_string(id), "0", "com.ex.racer", "NULL", "1", "1", "0",
                               "0", "0", "0", "NULL", "NULL"}}),
            db->Rows("SELECT boxId, isFolder, appId, name, col, row, isPreload, isSystem, "
                     "boxType, launchType, iconPath, content FROM Boxes"));
}

// After the last box of the highest-numbered page, never in a hole.
TEST_F(PlacementTest, NextAppGoesAfterTheLastBoxOfTheLastPage) {
  struct Case {
    const char* name;
    std::function<void()> layout;
    const char* place;
    bool pageAdded;
  } cases[] = {
      {"on the last box's row, past the holes",
       [&] {
         int page = AddPage(apps, 1);
         AddBox(page, "a", 1, 1);
         AddBox(page, "b", 3, 7);
       },
       "1:4,7", false},
      {"after the fourth column: the next row", [&] { AddBox(AddPage(apps, 1), "a", 4, 7); },
       "1:1,8", false},
      {"the highest-numbered page of this menu",
       [&] {
         AddBox(AddPage(apps, 2), "b", 1, 1);
         AddBox(AddPage(apps, 1), "a", 4, 9);
         AddBox(AddPage(2, 3), "other menu", 4, 4);
         AddBox(AddPage(apps, 9, true), "folder 1", 4, 4);
       },
       "2:2,1", false},
      {"an empty last page: its first cell",
       [&] {
         AddBox(AddPage(apps, 1), "a", 2, 2);
         AddPage(apps, 2);
       },
       "2:1,1", false},
      {"row 0 at the fourth column: a new page", [&] { AddBox(AddPage(apps, 3), "a", 4, 0); },
       "4:1,1", true},
      {"a new page after page INT_MAX: its number wraps",
       [&] { AddBox(AddPage(apps, INT_MAX), "a", 4, 0); }, "-2147483648:1,1", true},
      {"row 0 short of the fourth column: followed", [&] { AddBox(AddPage(apps, 5), "a", 2, 0); },
       "5:3,0", false},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    db->Exec("DELETE FROM Boxes; DELETE FROM Pages");
    c.layout();
    bool pageAdded = false;
    store.InsertBoxData("new", pageAdded);
    EXPECT_EQ(c.place, PlaceOf("new"));
    EXPECT_EQ(c.pageAdded, pageAdded);
  }
  bool pageAdded = true;  // a placement that adds no page leaves the flag alone
  store.InsertBoxData("next", pageAdded);
  EXPECT_TRUE(pageAdded);
  EXPECT_EQ("5:4,0", PlaceOf("next"));
}

TEST_F(PlacementTest, AFullPageWrapsAfterRow40000AndForADeactivatedAppAfterRow40002) {
  FillPage(AddPage(apps, 1), 160000);
  bool pageAdded = false;
  store.InsertBoxData("next", pageAdded);
  EXPECT_TRUE(pageAdded);
  EXPECT_EQ("2:1,1", PlaceOf("next"));
  EXPECT_EQ("4,40000", CellOf("app159999"));  // the page was full

  // A deactivated application goes to the menu it is given, opening its first page.
  int other = AddMenu("Other");
  EXPECT_GT(store.InsertBoxDataForDeactivatedApp(other, "first"), 0);
  EXPECT_EQ((std::vector<Row>{{"0", std::to_string(other), "1", "1,1"}}),
            db->Rows("SELECT p.isFolder, p.parentId, p.pageNo, b.col || ',' || b.row FROM Pages "
                     "p, Boxes b ON b.pageId = p.pageId WHERE b.appId = 'first'"));
  int page = std::stoi(db->Value("SELECT pageId FROM Boxes WHERE appId = 'first'"));
  FillPage(page, 160000, "other");
  store.InsertBoxDataForDeactivatedApp(other, "row 40001");
  EXPECT_EQ("1:1,40001", PlaceOf("row 40001"));
  AddBox(page, "end of 40001", 4, 40001);
  store.InsertBoxDataForDeactivatedApp(other, "row 40002");
  EXPECT_EQ("1:1,40002", PlaceOf("row 40002"));
  AddBox(page, "last", 4, 40002);
  store.InsertBoxDataForDeactivatedApp(other, "wrapped");
  EXPECT_EQ("2:1,1", PlaceOf("wrapped"));
}

TEST_F(PlacementTest, DeletingADeactivatedAppPacksTheMenuWithoutGaps) {
  int first = AddPage(apps, 1);
  int second = AddPage(apps, 2);
  int gone = AddBox(first, "a", 1, 1);
  AddBox(first, "b", 3, 1);
  AddBox(second, "c", 2, 5);

  EXPECT_EQ(1, store.DeleteBoxDataForDeactivatedApp(apps, gone));
  EXPECT_EQ("1:1,1", PlaceOf("b"));
  EXPECT_EQ("1:2,1", PlaceOf("c"));
  EXPECT_EQ("1", db->Value("SELECT count(*) FROM Pages"));

  // An unknown box still packs the menu.
  db->Exec("UPDATE Boxes SET col = 4 WHERE appId = 'c'");
  EXPECT_EQ(1, store.DeleteBoxDataForDeactivatedApp(apps, 999));
  EXPECT_EQ("1:2,1", PlaceOf("c"));
}

}  // namespace
