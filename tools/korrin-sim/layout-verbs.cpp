// The layout verbs of korrin-sim: what a launcher does when the user makes a
// folder, moves, renames or removes a box, done through the store's public
// operations only, and `let`, which names the id a command hands back.
//
// Each verb reads and checks everything first and writes only when the whole
// change can be made: one that cannot be done changes nothing and says why.
#include <algorithm>
#include <string>
#include <vector>

#include "cli.h"
#include "commands.h"
#include "korrin-data/korrin-data.h"
#include "session.h"
#include "words.h"

namespace po = boost::program_options;

namespace korrin_sim {

namespace {

typedef boost::shared_ptr<GameBoxData> BoxPtr;

const int kFolderSide = 3;  // folder pages are 3 by 3

LauncherDataManager& Store() {
  if (korrin::DataManager().m_db == NULL) {
    throw UsageError("the engine has no database open: `start` it first");
  }
  return korrin::DataManager();
}

bool IsInt(const std::string& word) {
  return !word.empty() && word.find_first_not_of("-0123456789") == std::string::npos;
}

// APP (an application id) or BOX (a box id): its stored box.
GameBoxData FindBox(const std::string& word) {
  if (IsInt(word)) {
    BoxPtr box = Store().GetMenuBoxData(ParseInt(word, "BOX"));
    if (!box || box->boxId == 0) throw UsageError("no box " + word + " stored");
    return *box;
  }
  BoxPtr box = Store().GetBoxDataByAppId(word);
  if (!box || box->boxId == 0) throw UsageError("no box holds application '" + word + "'");
  return *box;
}

GameBoxData FindFolder(const std::string& word) {
  GameBoxData folder = FindBox(word);
  if (!folder.isFolder) throw UsageError("box " + std::to_string(folder.boxId) + " is no folder");
  return folder;
}

GamePageData FindPage(int pageId) {
  boost::shared_ptr<GamePageData> page = Store().GetMenuPageData(pageId);
  if (!page || page->pageId != pageId) {
    throw UsageError("no page " + std::to_string(pageId) + " stored");
  }
  return *page;
}

// Columns and rows of a page: 3 by 3 in a folder, the store's grid in a menu.
std::pair<int, int> GridOf(const GamePageData& page) {
  if (page.isFolder) return std::make_pair(kFolderSide, kFolderSide);
  return std::make_pair(Store().m_columns, Store().m_maxRows);
}

std::string CellName(int pageId, int col, int row) {
  return "page " + std::to_string(pageId) + " col " + std::to_string(col) + " row " +
         std::to_string(row);
}

// The box in that cell, if any.
BoxPtr BoxAt(int pageId, int col, int row) {
  for (const BoxPtr& box : Store().GetBoxDataList(pageId)) {
    if (box->col == col && box->row == row) return box;
  }
  return BoxPtr();
}

// The cell after the page's last box, in reading order; false when the page
// is full. An empty page starts at col 1, row 1.
bool NextFreeCell(const GamePageData& page, int* col, int* row) {
  std::pair<int, int> grid = GridOf(page);
  long long last = 0;  // cells before the free one, in reading order
  for (const BoxPtr& box : Store().GetBoxDataList(page.pageId)) {
    last = std::max(last, (box->row - 1LL) * grid.first + box->col);
  }
  if (last >= static_cast<long long>(grid.first) * grid.second) return false;
  *col = static_cast<int>(last % grid.first) + 1;
  *row = static_cast<int>(last / grid.first) + 1;
  return true;
}

// A new folder page after the folder's last; its id.
int AddFolderPage(int folderId, int pageNo) {
  GamePageData page;
  page.isFolder = true;
  page.parentId = folderId;
  page.pageNo = pageNo;
  int pageId = Store().InsertPageData(page);
  if (pageId <= 0) throw UsageError("the store could not add a page to folder " +
                                    std::to_string(folderId) + " (`log` says why)");
  return pageId;
}

void Place(GameBoxData box, int pageId, int col, int row) {
  box.pageId = pageId;
  box.col = col;
  box.row = row;
  if (!Store().UpdateBoxData(box)) {
    throw UsageError("the store could not move box " + std::to_string(box.boxId) +
                     " (`log` says why)");
  }
}

void RefuseFolderInFolder(const GameBoxData& box) {
  if (box.isFolder) {
    throw UsageError("box " + std::to_string(box.boxId) + " is a folder: folders hold no folders");
  }
}

void RunMakeFolder(Session&, const Args& args) {
  std::vector<std::string> apps = args.List("APP");
  std::vector<GameBoxData> boxes;
  for (const std::string& app : apps) {
    GameBoxData box = FindBox(app);
    RefuseFolderInFolder(box);
    for (const GameBoxData& other : boxes) {
      if (other.boxId == box.boxId) throw UsageError("'" + app + "' is named twice");
    }
    boxes.push_back(box);
  }
  GamePageData first = FindPage(boxes[0].pageId);
  if (first.isFolder) {
    throw UsageError("'" + apps[0] + "' is in a folder already: a folder takes a menu cell");
  }
  // Dropping one application on another: the folder takes the first one's cell.
  GameBoxData folder;
  folder.isFolder = true;
  folder.name = args.Text("NAME");
  folder.pageId = boxes[0].pageId;
  folder.col = boxes[0].col;
  folder.row = boxes[0].row;
  int folderId = Store().InsertBoxData(folder);
  if (folderId <= 0) throw UsageError("the store could not add the folder (`log` says why)");
  int pageId = 0;
  std::vector<int> menus;
  for (size_t i = 0; i < boxes.size(); ++i) {
    if (i % 9 == 0) pageId = AddFolderPage(folderId, static_cast<int>(i / 9) + 1);
    int menu = FindPage(boxes[i].pageId).parentId;
    if (!FindPage(boxes[i].pageId).isFolder && i > 0 &&
        std::find(menus.begin(), menus.end(), menu) == menus.end()) {
      menus.push_back(menu);
    }
    Place(boxes[i], pageId, static_cast<int>(i % 3) + 1, static_cast<int>(i % 9 / 3) + 1);
  }
  // The cells the other applications left close up, as on the phone.
  for (int menu : menus) Store()._ReorderData(menu, false);
  ReturnId(folderId);
  Out() << "folder " << Quote(folder.name) << " is box " << folderId << "\n";
}

void RunMove(Session&, const Args& args) {
  std::vector<std::string> where = args.List("to|into");
  GameBoxData box = FindBox(args.Text("APP|BOX"));
  std::string how = where.empty() ? "" : where[0];
  if (how == "into" && where.size() == 2) {
    GameBoxData folder = FindFolder(where[1]);
    RefuseFolderInFolder(box);
    std::vector<boost::shared_ptr<GamePageData> > pages =
        Store().GetPageDataList(folder.boxId, true);
    int col = 1, row = 1, pageId = 0;
    if (!pages.empty() && NextFreeCell(*pages.back(), &col, &row)) {
      pageId = pages.back()->pageId;
    } else {
      col = row = 1;
      pageId = AddFolderPage(folder.boxId, pages.empty() ? 1 : pages.back()->pageNo + 1);
    }
    Place(box, pageId, col, row);
    return;
  }
  if (how != "to" || where.size() != 4) {
    throw UsageError("usage: move APP|BOX to PAGE COL ROW, or move APP|BOX into FOLDER");
  }
  GamePageData page = FindPage(ParseInt(where[1], "PAGE"));
  int col = ParseInt(where[2], "COL"), row = ParseInt(where[3], "ROW");
  std::pair<int, int> grid = GridOf(page);
  std::string cell = CellName(page.pageId, col, row);
  if (col < 1 || col > grid.first || row < 1 || row > grid.second) {
    throw UsageError(cell + " is outside its " + std::to_string(grid.first) + " by " +
                     std::to_string(grid.second) + " grid");
  }
  if (page.isFolder) RefuseFolderInFolder(box);
  BoxPtr there = BoxAt(page.pageId, col, row);
  if (there && there->boxId != box.boxId) {
    throw UsageError(cell + " is taken by box " + std::to_string(there->boxId));
  }
  Place(box, page.pageId, col, row);
}

void RunRename(Session&, const Args& args) {
  GameBoxData box = FindBox(args.Text("BOX|FOLDER"));
  box.name = args.Text("NAME");
  if (!Store().UpdateBoxData(box)) throw UsageError("the store could not rename the box");
}

void RunRemoveBox(Session&, const Args& args) {
  GameBoxData box = FindBox(args.Text("BOX"));
  if (box.isFolder) {
    size_t held = 0;
    for (const boost::shared_ptr<GamePageData>& page : Store().GetPageDataList(box.boxId, true)) {
      held += Store().GetBoxDataList(page->pageId).size();
    }
    if (held > 0) {
      throw UsageError("folder " + std::to_string(box.boxId) + " holds " + std::to_string(held) +
                       (held == 1 ? " box" : " boxes") + ": move or remove them first");
    }
    Store().DeleteFolderPageData(box.boxId);
  }
  if (!Store().DeleteBoxData(box.boxId)) throw UsageError("the store could not delete the box");
}

void RunLet(Session& session, const Args& args) {
  std::string rest = args.rest();
  size_t equals = rest.find('=');
  if (equals == std::string::npos) throw UsageError("usage: let NAME = COMMAND... | let NAME = ID");
  std::string name = rest.substr(0, rest.find_last_not_of(" \t", equals - 1) + 1);
  std::string command = rest.substr(equals + 1);
  command.erase(0, command.find_first_not_of(" \t"));
  if (command.empty()) throw UsageError("let " + name + " = what?");
  // An id as it is, or another name's: `let x = 12`, `let x = $last`.
  std::vector<std::string> words =
      SplitWords(command, [&session](const std::string& bound) { return session.Value(bound); });
  if (words.size() == 1 && IsInt(words[0])) {
    session.Bind(name, ParseInt(words[0], "ID"));
    return;
  }
  session.CheckName(name);  // before the command runs
  session.Execute(command);
  if (!session.returned()) throw UsageError("`" + command + "` handed back no id to bind");
  session.Bind(name, *session.returned());
}

void NoOptions(po::options_description&) {}

}  // namespace

std::vector<Command> LayoutCommands() {
  const Command::Parsing kParsed = Command::kOptions;
  return {
      {"make-folder", "NAME APP...", "make a folder of applications, as a drop does",
       "Makes folder NAME where the first APP stood (as when the user drops one\n"
       "application on another), with its first folder page, and moves the APPs\n"
       "into it in order, 3 by 3: more than 9 make more folder pages. The cells the\n"
       "other APPs left in the menu close up (_ReorderData). APP is an application\n"
       "id or a box id. Prints the folder's box id, which becomes $last.\n"
       "(`folder BOXID` shows a folder; `make-folder` makes one.)",
       "let puzzles = make-folder Puzzles com.acme.tetra com.acme.sudoku\nfolder $puzzles",
       true, kParsed, NoOptions, RunMakeFolder},
      {"move", "APP|BOX to|into...", "move a box to a cell, or into a folder",
       "`move APP|BOX to PAGE COL ROW` puts the box in that cell of stored page PAGE\n"
       "(`layout --ids` shows page ids); a taken cell or one outside the page's grid\n"
       "(4 wide in a menu, 3 by 3 in a folder) is refused. `move APP|BOX into FOLDER`\n"
       "puts it in the cell after the last box of the folder's last page, on a new\n"
       "folder page when that one is full. The cell left behind stays empty. A\n"
       "folder never goes into a folder.",
       "move com.acme.tetra to 1 4 2\nmove com.acme.tetra into $puzzles", true, kParsed,
       NoOptions, RunMove},
      {"rename", "BOX|FOLDER NAME", "rename a folder or a shortcut",
       "Stores NAME as the box's name. A folder or a shortcut keeps it; an\n"
       "application's box shows it until the next update of its package stores the\n"
       "application's label again.",
       "rename $puzzles \"Brain Teasers\"", true, kParsed, NoOptions, RunRename},
      {"remove-box", "BOX", "delete a box, or an empty folder with its pages",
       "Deletes box BOX (or the box of application BOX); the application stays\n"
       "installed. A folder is deleted with its pages only when it holds nothing: a\n"
       "folder that holds boxes is refused.",
       "remove-box $puzzles", true, kParsed, NoOptions, RunRemoveBox},
      {"let", "NAME = COMMAND...", "name the id a command hands back",
       "Runs COMMAND and binds $NAME to the id it handed back (an insert's new id;\n"
       "make-folder's box), or binds it to an integer: `let NAME = 12`. $NAME then\n"
       "stands for it in any later line, and $last for the id of the last insert.\n"
       "An unbound $NAME is an error.",
       "let tetra = call InsertBoxData boxType=3 appId=com.acme.tetra name=T pageId=1\n"
       "call UpdateBoxData box:$tetra col=2",
       true, Command::kText, NoOptions, RunLet},
  };
}

}  // namespace korrin_sim
