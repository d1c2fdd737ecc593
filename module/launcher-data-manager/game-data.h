// The three layout records: a menu owns pages, a page owns boxes, and a box is
// one application's icon or a folder that owns pages of its own.
//
// They are plain values handed around as boost::shared_ptr and listed in
// std::vectors of them; whoever holds a pointer owns the record with everyone
// else who holds one. Members stand in the order the launcher expects.
#ifndef KORRIN_LAUNCHER_DATA_MANAGER_GAME_DATA_H_
#define KORRIN_LAUNCHER_DATA_MANAGER_GAME_DATA_H_

#include <stdint.h>

#include <string>

// A box of this type is a shortcut: it carries its own name, icon path and
// content, and is never found by application id.
const int kShortcutBoxType = 3;

// One menu; a row of table Menus.
class GameViewData {
 public:
  GameViewData() : menuId(0), type(-1) {}
  virtual ~GameViewData() {}

  int menuId;        // 0 until stored
  std::string name;  // the only menu the system makes is "Apps"
  int type;          // -1 in a new record and in a menu not found
};

// One page of a menu (isFolder false, parentId a menuId) or of a folder
// (isFolder true, parentId the folder box's boxId); a row of table Pages.
class GamePageData {
 public:
  GamePageData() : pageId(0), isFolder(false), parentId(0), pageNo(0) {}
  virtual ~GamePageData() {}

  int pageId;    // 0 until stored
  bool isFolder;
  int parentId;
  int pageNo;    // position among the owner's pages, from 1
};

// One box: an application's icon or a folder; a row of table Boxes. The
// members from pkgId to the end that have no column are application facts
// filled by the package side and never stored.
class GameBoxData {
 public:
  GameBoxData()
      : boxId(0), pageId(0), parentId(0), isFolder(false), col(0), row(0),
        isNoDisplay(false), isEnabled(false), isNewBadge(false), isRemovable(false),
        isUpdatable(false), isSelected(false), appSize(0), isPreload(false),
        isSystem(false), isMdmRestricted(false), badgeCount(0), isLocked(false),
        isOnStorageCard(false), boxType(0), launchType(0), isMenuLaunch(false) {}
  virtual ~GameBoxData() {}

  // ---- Placement.
  int boxId;         // 0 until stored
  int pageId;        // the page that holds the box
  int parentId;      // owner of that page, read through the page; never stored
  bool isFolder;
  int col;           // from 1, left to right
  int row;           // from 1, top to bottom

  // ---- What the box shows, and application facts.
  std::string pkgId;
  std::string appId;
  std::string pkgType;
  std::string name;
  std::string iconPath;
  bool isNoDisplay;
  bool isEnabled;
  bool isNewBadge;
  bool isRemovable;
  bool isUpdatable;
  bool isSelected;
  int64_t appSize;
  bool isPreload;
  bool isSystem;
  bool isMdmRestricted;
  int badgeCount;
  bool isLocked;
  bool isOnStorageCard;  // set by the launcher application; the engine only clears it
  int boxType;           // kShortcutBoxType for a shortcut
  int launchType;
  std::string content;   // kept with a box of type 3
  bool isMenuLaunch;
  std::string launchOperation;
};

#endif  // KORRIN_LAUNCHER_DATA_MANAGER_GAME_DATA_H_
