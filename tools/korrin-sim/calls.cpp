// The operations table behind `call`: one entry per public operation (each
// overload its own), in the order the headers declare them, with its argument
// syntax, one sentence of help, and a function that reads every argument,
// checks that none is left over, and only then calls and prints.
//
// Most entries are bound straight to the operation: its parameter types say
// how each word is read, and what it may hand back changed (records and
// lists taken by reference, boxes it fills) is printed after the result.
// Callbacks and out-parameters are written by hand.
#include "calls.h"

#include <app_info.h>
#include <package_info.h>
#include <package_manager.h>
#include <stdint.h>

#include <algorithm>
#include <exception>
#include <sstream>
#include <tuple>
#include <type_traits>
#include <variant>

#include "cli.h"
#include "korrin-data/korrin-data.h"
#include "log-client-manager/log-client-manager.h"
#include "system-info/system-info.h"
#include "words.h"

namespace korrin_sim {

namespace {

typedef LauncherDataManager Store_;
typedef LauncherPackageManager Tracker_;
typedef boost::shared_ptr<GameBoxData> BoxPtr;
typedef std::vector<std::string> Words;

// ---- The instances called: the engine's two managers, and a usage-log
// client made on first use and never destroyed (closing it at exit could
// reach the platform after the simulated device is gone).

template <class C>
C& Instance();
template <>
Store_& Instance() { return korrin::DataManager(); }
template <>
Tracker_& Instance() { return korrin::PackageManager(); }
template <>
LogClientManager& Instance() {
  static LogClientManager* client = new LogClientManager();
  return *client;
}
Tracker_& Tracker() { return Instance<Tracker_>(); }

// ---- Records as words: FIELD=VALUE to read, name=value to print.

template <class R>
struct Field {
  const char* name;
  std::variant<int R::*, bool R::*, int64_t R::*, std::string R::*> member;
};

template <class R>
struct RecordType {
  const char* tag;                // first word of a printed record
  const char* name;               // the class, for messages
  std::vector<Field<R> > fields;  // in declaration order
};

#define MENU(m) \
  { #m, &GameViewData::m }
#define PAGE(m) \
  { #m, &GamePageData::m }
#define BOX(m) \
  { #m, &GameBoxData::m }

const RecordType<GameViewData> kMenu = {
    "menu", "GameViewData", {MENU(menuId), MENU(name), MENU(type)}};
const RecordType<GamePageData> kPage = {
    "page", "GamePageData", {PAGE(pageId), PAGE(isFolder), PAGE(parentId), PAGE(pageNo)}};
const RecordType<GameBoxData> kBox = {
    "box", "GameBoxData",
    {BOX(boxId), BOX(pageId), BOX(parentId), BOX(isFolder), BOX(col), BOX(row), BOX(pkgId),
     BOX(appId), BOX(pkgType), BOX(name), BOX(iconPath), BOX(isNoDisplay), BOX(isEnabled),
     BOX(isNewBadge), BOX(isRemovable), BOX(isUpdatable), BOX(isSelected), BOX(appSize),
     BOX(isPreload), BOX(isSystem), BOX(isMdmRestricted), BOX(badgeCount), BOX(isLocked),
     BOX(isOnStorageCard), BOX(boxType), BOX(launchType), BOX(content), BOX(isMenuLaunch),
     BOX(launchOperation)}};

#undef BOX
#undef PAGE
#undef MENU

std::string Value(int value) { return std::to_string(value); }
std::string Value(int64_t value) { return std::to_string(value); }
std::string Value(bool value) { return value ? "true" : "false"; }
std::string Value(const std::string& value) { return Quote(value); }

void Parse(const std::string& text, const std::string& what, int& to) { to = ParseInt(text, what); }
void Parse(const std::string& text, const std::string& what, bool& to) {
  to = ParseBool(text, what);
}
void Parse(const std::string& text, const std::string&, std::string& to) { to = text; }
void Parse(const std::string& text, const std::string& what, int64_t& to) {
  to = ParseInt64(text, what);
}

template <class R>
std::string Format(const RecordType<R>& type, const R& record) {
  std::string line = type.tag;
  for (const Field<R>& field : type.fields) {
    line += std::string(" ") + field.name + "=";
    std::visit([&](auto member) { line += Value(record.*member); }, field.member);
  }
  return line;
}

// Sets the member that |word| (FIELD=VALUE) names.
template <class R>
void SetField(const RecordType<R>& type, const std::string& word, R& record) {
  size_t equals = word.find('=');
  if (equals == std::string::npos) throw UsageError("'" + word + "' is not FIELD=VALUE");
  std::string name = word.substr(0, equals);
  for (const Field<R>& field : type.fields) {
    if (name != field.name) continue;
    std::visit([&](auto member) { Parse(word.substr(equals + 1), name, record.*member); },
               field.member);
    return;
  }
  throw UsageError("'" + name + "' is not a member of " + type.name);
}

// The stored record of that id; throws UsageError when there is none.
GameViewData Stored(const RecordType<GameViewData>&, int id) {
  boost::shared_ptr<GameViewData> menu = Instance<Store_>().GetMenuData(id);
  if (!menu || menu->menuId != id) throw UsageError("no menu " + std::to_string(id) + " stored");
  return *menu;
}
GamePageData Stored(const RecordType<GamePageData>&, int id) {
  boost::shared_ptr<GamePageData> page = Instance<Store_>().GetMenuPageData(id);
  if (!page || page->pageId != id) throw UsageError("no page " + std::to_string(id) + " stored");
  return *page;
}
GameBoxData Stored(const RecordType<GameBoxData>&, int id) {
  boost::shared_ptr<GameBoxData> box = Instance<Store_>().GetMenuBoxData(id);
  if (!box || box->boxId != id) throw UsageError("no box " + std::to_string(id) + " stored");
  return *box;
}

// ---- Enumerations by name: each name stands for its position, which is its
// value on the platform (and in the tracker's job types).

const Words kJobTypes = {"none", "install", "uninstall", "update"};

std::string Join(const Words& words, const char* between) {
  std::string text;
  for (size_t i = 0; i < words.size(); ++i) text += (i > 0 ? between : "") + words[i];
  return text;
}

// ---- The arguments of one call, read in order. Each is named, in messages,
// by its placeholder in the operation's syntax.

class CallArgs {
 public:
  CallArgs(const Words& words, const std::string& syntax) : m_words(words), m_next(1) {
    std::istringstream placeholders(syntax);
    for (std::string name; placeholders >> name;) {
      if (name.front() == '[') name = name.substr(1, name.size() - 2);
      m_names.push_back(name);
    }
  }

  bool More() const { return m_next < m_words.size(); }
  std::string Text() { return Next("a word"); }
  // A word, or null for the word (null).
  const char* CText() {
    const std::string& word = Next("a word or (null)");
    return word == "(null)" ? NULL : word.c_str();
  }
  int Int() { return Parsed("an integer", ParseInt); }
  unsigned int Unsigned() { return Parsed("0..4294967295", ParseUnsigned); }
  bool Bool() { return Parsed("true or false", ParseBool); }
  // The position of the word among |names|; with |orInteger|, any integer
  // too, as the platform may send values its enums do not name.
  int Choice(const Words& names, bool orInteger = false) {
    std::string expected = Join(names, "|") + (orInteger ? " or an integer" : "");
    const std::string& word = Next(expected.c_str());  // before Name(), which names it
    return ParseNamed(word, names, Name(), orInteger);
  }
  // The remaining words, as a record of FIELD=VALUE words or as a list.
  // A first word TAG:ID (box:12) starts from the stored record, so that the
  // fields not given keep their stored values.
  template <class R>
  R Record(const RecordType<R>& type) {
    R record;
    std::string stored = std::string(type.tag) + ":";
    if (More() && m_words[m_next].compare(0, stored.size(), stored) == 0) {
      const std::string& word = m_words[m_next++];
      record = Stored(type, ParseInt(word.substr(stored.size()), word));
    }
    while (More()) SetField(type, m_words[m_next++], record);
    return record;
  }
  BoxPtr Box() { return BoxPtr(new GameBoxData(Record(kBox))); }
  Words Rest() {
    Words rest(m_words.begin() + m_next, m_words.end());
    m_next = m_words.size();
    return rest;
  }
  void End() const {
    if (More()) throw UsageError("unexpected argument '" + m_words[m_next] + "'");
  }

 private:
  const std::string& Next(const char* expected) {
    if (!More()) {
      std::string name = Name(m_next);
      if (name != expected) name += std::string(" (") + expected + ")";
      throw UsageError("missing " + name);
    }
    return m_words[m_next++];
  }
  template <class T>
  T Parsed(const char* expected, T (*parse)(const std::string&, const std::string&)) {
    const std::string& word = Next(expected);
    return parse(word, Name());
  }
  // The placeholder of word |index| (1 for the first argument), by default
  // of the word read last; words past the syntax's end belong to its last.
  std::string Name(size_t index = 0) const {
    if (index == 0) index = m_next - 1;
    if (m_names.empty()) return "argument";
    return m_names[std::min(index, m_names.size()) - 1];
  }

  const Words& m_words;  // the operation's name first
  size_t m_next;
  Words m_names;
};

// How a parameter of each type is read.
template <class T>
struct Tag {};
int Read(CallArgs& a, Tag<int>) { return a.Int(); }
unsigned int Read(CallArgs& a, Tag<unsigned int>) { return a.Unsigned(); }
bool Read(CallArgs& a, Tag<bool>) { return a.Bool(); }
std::string Read(CallArgs& a, Tag<std::string>) { return a.Text(); }
const char* Read(CallArgs& a, Tag<const char*>) { return a.CText(); }
GameViewData Read(CallArgs& a, Tag<GameViewData>) { return a.Record(kMenu); }
GamePageData Read(CallArgs& a, Tag<GamePageData>) { return a.Record(kPage); }
GameBoxData Read(CallArgs& a, Tag<GameBoxData>) { return a.Record(kBox); }
BoxPtr Read(CallArgs& a, Tag<BoxPtr>) { return a.Box(); }
Words Read(CallArgs& a, Tag<Words>) { return a.Rest(); }

// ---- Results.

void Show(std::ostream& out, bool value) { out << Value(value) << "\n"; }
void Show(std::ostream& out, int value) { out << value << "\n"; }
void Show(std::ostream& out, const std::string& text) { out << text << "\n"; }
void Show(std::ostream& out, const GameViewData& menu) { out << FormatMenu(menu) << "\n"; }
void Show(std::ostream& out, const GamePageData& page) { out << FormatPage(page) << "\n"; }
void Show(std::ostream& out, const GameBoxData& box) { out << FormatBox(box) << "\n"; }
template <class R>
void Show(std::ostream& out, const boost::shared_ptr<R>& record) {
  Show(out, *record);
}
template <class R>
void Show(std::ostream& out, const std::vector<boost::shared_ptr<R> >& list) {
  if (list.empty()) out << "(empty)\n";
  for (const boost::shared_ptr<R>& record : list) Show(out, record);
}
void Show(std::ostream& out, const Words& ids) {
  if (ids.empty()) out << "(empty)\n";
  for (const std::string& id : ids) out << Quote(id) << "\n";
}

void ShowUserData(std::ostream& out, bool found) { out << "user_data=" << Value(found) << "\n"; }
void ShowUserData(std::ostream& out, const Words& ids) { Show(out, ids); }

std::string FormatJob(const Tracker_::PkgData& job) {
  int type = job.type;
  bool named = type >= 0 && type < static_cast<int>(kJobTypes.size());
  std::string line = "job type=" + (named ? kJobTypes[type] : Value(type)) +
                     " reserved=" + Value(job.reserved) + " pkgId=" + Quote(job.pkgId) +
                     " appIds=";
  for (size_t i = 0; i < job.appIds.size(); ++i) {
    line += (i > 0 ? "," : "") + Quote(job.appIds[i]);
  }
  return line;
}

// ---- Calls bound to the operation: every parameter read (in order, as a
// braced list guarantees), the words checked for leftovers, then the call.
// What it may hand back changed, a record or list taken by reference or a box
// it fills through a shared pointer, is printed after the result.

template <class P, class V>
void ShowHandedBack(std::ostream& out, const V& value) {
  if constexpr (std::is_lvalue_reference_v<P> || std::is_same_v<P, BoxPtr>) Show(out, value);
}

template <class R, class... P, class F>
void Run(CallArgs& a, std::ostream& out, F call) {
  std::tuple<std::decay_t<P>...> values{Read(a, Tag<std::decay_t<P> >())...};
  a.End();
  if constexpr (std::is_void_v<R>) {
    std::apply(call, values);
  } else {
    Show(out, std::apply(call, values));
  }
  std::apply([&](const auto&... value) { (ShowHandedBack<P>(out, value), ...); }, values);
}

template <class C, class R, class... P>
void Invoke(R (C::*operation)(P...), CallArgs& a, std::ostream& out) {
  Run<R, P...>(a, out, [&](auto&... v) { return (Instance<C>().*operation)(v...); });
}

template <class R, class... P>
void Invoke(R (*operation)(P...), CallArgs& a, std::ostream& out) {
  Run<R, P...>(a, out, [&](auto&... v) { return operation(v...); });
}

template <auto operation>
void Bound(CallArgs& a, std::ostream& out) {
  Invoke(operation, a, out);
}

// ---- What the platform hands its callbacks, made for one call.

const char kAppInfoCreate[] = "app_info_create";
const char kPackageInfoCreate[] = "package_info_create";

// A handle opened by id, closed when it goes.
template <class H, int (*Create)(const char*, H*), int (*Destroy)(H), const char* kCreate>
class Handle {
 public:
  typedef H Type;

  explicit Handle(const std::string& id) : m_handle(NULL), m_rc(Create(id.c_str(), &m_handle)) {}
  ~Handle() {
    if (m_rc == 0) Destroy(m_handle);
  }
  // False, with the platform's error printed, when the handle did not open.
  bool Opened(std::ostream& out) const {
    if (m_rc != 0) out << kCreate << " failed: " << m_rc << "\n";
    return m_rc == 0;
  }
  H& Get() { return m_handle; }

 private:
  Handle(const Handle&) = delete;
  Handle& operator=(const Handle&) = delete;

  H m_handle;
  int m_rc;
};
typedef Handle<app_info_h, app_info_create, app_info_destroy, kAppInfoCreate> AppHandle;
typedef Handle<package_info_h, package_info_create, package_info_destroy, kPackageInfoCreate>
    PackageHandle;

// User data that is the tracker itself, which has nothing to print.
struct TheTracker {};
void* Pointer(TheTracker&) { return &Tracker(); }
template <class U>
void* Pointer(U& data) {
  return &data;
}
void ShowUserData(std::ostream&, TheTracker) {}

// A callback on a handle opened for the one argument (an id), with a fresh U
// as its user data, printed after the result.
template <class Open, bool (*callback)(typename Open::Type, void*), class U>
void OnHandle(CallArgs& a, std::ostream& out) {
  std::string id = a.Text();
  a.End();
  Open handle(id);
  if (!handle.Opened(out)) return;
  U data = U();
  Show(out, callback(handle.Get(), Pointer(data)));
  ShowUserData(out, data);
}

// A package's application callback: COMPONENT APPID, the ids it collects
// printed after the result.
template <bool (*callback)(package_info_app_component_type_e, const char*, void*)>
void OnPackageApp(CallArgs& a, std::ostream& out) {
  int component = a.Choice(kComponentNames, true);
  const char* id = a.CText();
  a.End();
  Words ids;
  Show(out, callback(static_cast<package_info_app_component_type_e>(component), id, &ids));
  Show(out, ids);
}

// A package event as words: TYPE PKG EVENT_TYPE STATE PROGRESS ERROR, sent
// to the platform's callback or |direct|ly to the tracker. Values outside the
// enums go on as the platform passes them: converted where they are passed,
// never held in a variable of the enum's type (loading one is undefined).
void OnEvent(CallArgs& a, bool direct) {
  const char* type = a.CText();
  const char* package = a.CText();
  int eventType = a.Choice(kEventTypeNames, true);
  int state = a.Choice(kEventStateNames, true);
  int progress = a.Int();
  int error = a.Int();
  a.End();
  if (direct) {
    Tracker().OnClientListenCb(type, package, static_cast<package_manager_event_type_e>(eventType),
                               static_cast<package_manager_event_state_e>(state), progress,
                               static_cast<package_manager_error_e>(error), &Tracker());
  } else {
    Tracker_::_PkgMgrClientListenCb(
        type, package, static_cast<package_manager_event_type_e>(eventType),
        static_cast<package_manager_event_state_e>(state), progress,
        static_cast<package_manager_error_e>(error), &Tracker());
  }
}

// Callbacks for the tracker's Initialize that say when they fire.
boost::function<void(const char*)> Announce(const char* slot) {
  return [slot](const char* appId) {
    Out() << slot << " " << (appId != NULL ? Quote(appId) : std::string("(null)")) << "\n";
  };
}
void AnnounceDeactivated(std::vector<std::string> appIds) {
  Out() << "onDeactivatedAppIds";
  for (const std::string& id : appIds) Out() << " " << Quote(id);
  Out() << "\n";
}

// ---- The table.

struct Operation {
  const char* cls;
  const char* name;
  const char* args;
  const char* help;
  void (*run)(CallArgs& a, std::ostream& out);
  // Whether the words are meant for this overload; null when there is one.
  bool (*shape)(const Words& words) = nullptr;
};

const char kStore[] = "LauncherDataManager";
const char kTracker[] = "LauncherPackageManager";
const char kLog[] = "LogClientManager";
const char kSystem[] = "SystemInfo";
const char kText[] = "Korrin3D";

bool FirstIs(const Words& w, const char* word) { return w.size() > 1 && w[1] == word; }
bool IsRecordForm(const Words& w) { return w.size() == 1 || w[1].find('=') != std::string::npos; }

// Entries bound to the operation of the same name.
#define KORRIN_BOUND(cls, Class, name, args, help) \
  { cls, #name, args, help, Bound<&Class::name> }
#define STORE(name, args, help) KORRIN_BOUND(kStore, LauncherDataManager, name, args, help)
#define TRACKER(name, args, help) KORRIN_BOUND(kTracker, LauncherPackageManager, name, args, help)
#define SYSTEM(name, help) KORRIN_BOUND(kSystem, SystemInfo, name, "", help)

const Operation kOperations[] = {
    // ---- The layout store.
    {kStore, "Initialize", "",
     "Opens the store; on first launch lays out menu \"Apps\" with the games the tracker lists.",
     [](CallArgs& a, std::ostream& out) {
       a.End();
       Show(out, Instance<Store_>().Initialize(Tracker()));
     }},
    STORE(_OpenDb, "", "Opens the layout database afresh and creates missing tables."),
    STORE(_CreateTables, "", "Runs the schema on the connection."),
    STORE(_CloseDb, "", "Closes the connection; prints db_util_close's result."),
    STORE(BeginTransaction, "", "Begins a transaction."),
    STORE(CommitTransaction, "", "Commits it."),
    STORE(RollbackTransaction, "", "Rolls it back."),
    STORE(InsertMenuData, "[MENU...]", "Stores the menu; prints its new menuId (or -1)."),
    STORE(GetMenuData, "MENUID", "The menu, or a record with menuId 0 and type -1."),
    STORE(UpdateMenuData, "[MENU...]", "Writes the name and type of menu menuId."),
    STORE(DeleteMenuData, "MENUID", "Deletes the menu row only."),
    STORE(GetMenuDataCount, "", "The number of menus."),
    STORE(GetMenuDataList, "", "Every menu, newest first."),
    STORE(InsertPageData, "[PAGE...]", "Stores the page; prints its new pageId (or -1)."),
    STORE(UpdatePageData, "[PAGE...]", "Writes the parentId and pageNo of page pageId."),
    STORE(DeletePageData, "PAGEID", "Deletes the page row only."),
    STORE(DeleteFolderPageData, "FOLDERBOXID", "Deletes the pages whose parent is FOLDERBOXID."),
    STORE(GetMenuPageData, "PAGEID", "The page, or a record with pageId 0."),
    STORE(GetPageDataCount, "MENUID ISFOLDER", "Always 0, as the launcher expects."),
    STORE(_GetPageDataCountByDownload, "MENUID",
          "Application boxes not preloaded, in the whole database."),
    STORE(InsertPageDataForAlphaBeticalOrder, "[PAGE...]", "A fixed -1."),
    STORE(UpdatePageDataForAlphaBeticalOrder, "[PAGE...]", "A fixed false."),
    STORE(DeletePageDataForAlphaBeticalOrder, "PAGEID", "A fixed false."),
    {kStore, "InsertBoxData", "[BOX...]", "Stores the box; prints its new boxId (or -1).",
     Bound<static_cast<int (Store_::*)(GameBoxData&)>(&Store_::InsertBoxData)>, IsRecordForm},
    STORE(UpdateBoxData, "[BOX...]", "Writes box boxId."),
    STORE(DeleteBoxData, "BOXID", "Deletes one box; a folder's pages stay."),
    STORE(GetMenuBoxData, "BOXID", "The box, or a record with boxId 0."),
    {kStore, "GetBoxIdByAppId", "APPID",
     "Finds the application's box: its parentId, pageId and boxId (0 when not found).",
     [](CallArgs& a, std::ostream& out) {
       std::string appId = a.Text();
       a.End();
       int parentId = 0, pageId = 0, boxId = 0;
       Show(out, Instance<Store_>().GetBoxIdByAppId(appId, &parentId, &pageId, &boxId));
       out << "parentId=" << parentId << " pageId=" << pageId << " boxId=" << boxId << "\n";
     }},
    STORE(GetBoxDataByAppId, "APPID", "The application's box, or a record with boxId 0."),
    STORE(GetBoxDataCount, "PAGEID", "Boxes on the page, folders included."),
    STORE(GetPageDataList, "PARENTID ISFOLDER",
          "Pages of a menu (false) or of a folder box (true), by pageNo."),
    STORE(GetBoxDataList, "PAGEID", "Boxes of the page, by row then col."),
    STORE(GetBoxDataListByAppId, "APPID BOXTYPE",
          "The application's boxes of that type, by row then col."),
    STORE(GetBoxDataListByDownload, "PARENTID ISFOLDER",
          "Boxes of downloaded applications, on virtual pages 100001 on."),
    STORE(GetPageDataListByDownload, "PARENTID ISFOLDER",
          "The virtual pages of the download view."),
    {kStore, "InsertBoxData", "APPID",
     "Places a box for APPID (a word without '=') after the last box of menu 1; prints the "
     "boxId (or -1) and pageAdded.",
     [](CallArgs& a, std::ostream& out) {
       std::string appId = a.Text();
       a.End();
       bool pageAdded = false;
       Show(out, Instance<Store_>().InsertBoxData(appId, pageAdded));
       out << "pageAdded=" << Value(pageAdded) << "\n";
     },
     [](const Words& w) { return !IsRecordForm(w); }},
    STORE(InsertBoxDataForDeactivatedApp, "MENUID APPID",
          "Places a box for a deactivated application; prints its boxId (or 0)."),
    STORE(DeleteBoxDataForDeactivatedApp, "MENUID BOXID",
          "Deletes the box and packs the menu; always 1."),
    STORE(_ReorderData, "PARENTID ISFOLDER", "Packs each page of the parent."),
    STORE(_ReorderDataWithoutSpace, "PARENTID ISFOLDER",
          "Pours the parent's boxes into its pages from the first cell on."),
    STORE(RearrangeAppsPosition, "", "Renumbers and packs every menu, in one transaction."),
    STORE(GetBoxDataListByAlphabeticalOrder, "PARENTID ISFOLDER",
          "The parent's boxes by name, on virtual pages."),
    STORE(GetBoxDataListByAlphabeticalOrderWithRealPage, "PARENTID ISFOLDER",
          "The same cells, on the parent's stored pages."),
    STORE(GetPageDataListByAlphabeticalOrder, "PARENTID ISFOLDER",
          "The virtual pages of the alphabetical view."),
    STORE(InsertBoxDataForAlphaBeticalOrder, "[BOX...]",
          "Stores the box after the last box of menu 1; prints its boxId (or -1)."),
    STORE(UpdateBoxDataForAlphaBeticalOrder, "[BOX...]",
          "Renames box boxId, or moves it to the page and parent given."),
    STORE(DeleteBoxDataForAlphaBeticalOrder, "BOXID",
          "Deletes the box and packs its old parent; always 0."),

    // ---- The package tracker.
    {kTracker, "Initialize", "print|empty",
     "Sets the five callbacks: print ones say when they fire, empty ones throw.",
     [](CallArgs& a, std::ostream& out) {
       bool print = a.Choice({"print", "empty"}) == 0;
       a.End();
       if (!print) return Show(out, Tracker().Initialize({}, {}, {}, {}, {}));
       Show(out, Tracker().Initialize(Announce("onAppInstalled"), Announce("onAppUpdated"),
                                      Announce("onAppUninstalled"), AnnounceDeactivated,
                                      Announce("onStorageCardAppChanged")));
     }},
    {kTracker, "_PkgMgrClientListenCb", "TYPE PKG EVENT_TYPE STATE PROGRESS ERROR",
     "A package event as the platform sends it, the tracker as user data. EVENT_TYPE: "
     "install|uninstall|update, STATE: started|processing|completed|failed, either by name "
     "or as an integer; TYPE and PKG may be (null).",
     [](CallArgs& a, std::ostream&) { OnEvent(a, false); }},
    {kTracker, "OnClientListenCb", "TYPE PKG EVENT_TYPE STATE PROGRESS ERROR",
     "The same event handed to the tracker directly.",
     [](CallArgs& a, std::ostream&) { OnEvent(a, true); }},
    TRACKER(PauseListenCb, "", "Holds completed package jobs back."),
    TRACKER(StartListenCb, "", "Processes the held jobs and stops holding back."),
    {kTracker, "_DoPkgJob", "TYPE PKGID [APPID...]",
     "Turns a completed job into callbacks; TYPE: none|install|uninstall|update or an integer.",
     [](CallArgs& a, std::ostream& out) {
       boost::shared_ptr<Tracker_::PkgData> job(new Tracker_::PkgData);
       job->type = static_cast<Tracker_::PkgJobType>(a.Choice(kJobTypes, true));
       job->pkgId = a.Text();
       job->appIds = a.Rest();
       a.End();
       Show(out, Tracker()._DoPkgJob(job));
       out << FormatJob(*job) << "\n";
     }},
    TRACKER(Terminate, "", "Stops listening and destroys the package-manager client."),
    TRACKER(_RegisterEdbusSignalHandler, "", "Subscribes to the boot-done signal."),
    TRACKER(UnregisterEdbusSignalHandler, "", "Unsubscribes and shuts e_dbus down."),
    TRACKER(OnMMCStatusChanged, "STATUS",
            "Records the card status (0: none) and announces the cached applications on it."),
    {kTracker, "_BootingDoneSignalCb", "[manager|(null)]",
     "The boot-done handler, with the tracker or (by default) null as data.",
     [](CallArgs& a, std::ostream&) {
       bool manager = a.More() && a.Choice({"manager", "(null)"}) == 0;
       a.End();
       Tracker_::_BootingDoneSignalCb(manager ? &Tracker() : NULL, NULL);
     }},
    TRACKER(GetAppInfo, "APPID [BOX...]",
            "Fills the box (preset by BOX) from the cache or the platform."),
    TRACKER(GetAppName, "APPID [BOX...]", "Fills the box from the platform."),
    {kTracker, "_GetAppInfo", "APPID [BOX...]",
     "Reads the application into the box, which becomes its cache entry.",
     Bound<static_cast<bool (Tracker_::*)(std::string, BoxPtr)>(&Tracker_::_GetAppInfo)>,
     [](const Words& w) { return !FirstIs(w, "--handle"); }},
    {kTracker, "_GetAppInfo", "--handle APPID [BOX...]",
     "The same from a handle opened with app_info_create(APPID).",
     [](CallArgs& a, std::ostream& out) {
       a.Text();  // --handle
       std::string appId = a.Text();
       BoxPtr box = a.Box();
       a.End();
       AppHandle info(appId);
       if (!info.Opened(out)) return;
       Show(out, Tracker()._GetAppInfo(info.Get(), box));
       Show(out, box);
     },
     [](const Words& w) { return FirstIs(w, "--handle"); }},
    TRACKER(GetAppIdList, "[APPID...]",
            "Adds the enabled, displayable games to the ids given and sorts them all."),
    TRACKER(_GetAppIds, "PKGID", "The displayable applications of the package."),
    TRACKER(_IsMenuLaunch, "APPID", "Whether it is floating or launched from the menu."),
    {kTracker, "_GetAllAppsInfoCb", "APPID",
     "The game-listing callback on app_info_create(APPID), the tracker as user data.",
     OnHandle<AppHandle, Tracker_::_GetAllAppsInfoCb, TheTracker>},
    {kTracker, "_PkgMgrAppInfoGetListCb", "COMPONENT APPID",
     "A package's application callback; prints the ids it collected. COMPONENT: "
     "all|ui|service or an integer.",
     OnPackageApp<Tracker_::_PkgMgrAppInfoGetListCb>},
    {kTracker, "_has_mini_app_cb", "APPID",
     "The floating-application callback on app_info_create(APPID); prints its flag.",
     OnHandle<AppHandle, Tracker_::_has_mini_app_cb, bool>},
    {kTracker, "_app_metadata_list_cb", "KEY VALUE",
     "The menu-launch metadata callback; prints its flag.",
     [](CallArgs& a, std::ostream& out) {
       const char* key = a.CText();
       const char* value = a.CText();
       a.End();
       bool found = false;
       Show(out, Tracker_::_app_metadata_list_cb(key, value, &found));
       ShowUserData(out, found);
     }},
    TRACKER(LoadDeactivatedAppList, "", "Hands the deactivated applications, if any, on."),
    TRACKER(_GetDeactivatedAppIds, "",
            "The displayable applications of the first listable deactivated package."),
    TRACKER(_GetDeactivatedAppInfo, "APPID [BOX...]",
            "Fills pkgId, iconPath, name and pkgType for a deactivated application."),
    TRACKER(_GetDeactivatedPkgInfo, "APPID [BOX...]", "Fills the box's pkgType."),
    {kTracker, "_PkgMgrDeactivatedPackageInfoGetListCb", "PKGID",
     "The deactivated-package callback on package_info_create(PKGID); prints the ids it "
     "collected.",
     OnHandle<PackageHandle, Tracker_::_PkgMgrDeactivatedPackageInfoGetListCb, Words>},
    {kTracker, "_PkgMgrDeactivatedAppInfoGetListCb", "COMPONENT APPID",
     "A deactivated package's application callback; prints the ids it collected.",
     OnPackageApp<Tracker_::_PkgMgrDeactivatedAppInfoGetListCb>},
    {kTracker, "_PkgMgrDeactivatedAppInfoGetCb", "APPID",
     "The callback on app_info_create(APPID); prints the package, icon and label it collected.",
     OnHandle<AppHandle, Tracker_::_PkgMgrDeactivatedAppInfoGetCb, Words>},
    {kTracker, "_PkgMgrDeactivatedPkgInfoGetCb", "APPID",
     "The callback on app_info_create(APPID); prints the type it collected.",
     OnHandle<AppHandle, Tracker_::_PkgMgrDeactivatedPkgInfoGetCb, Words>},
    TRACKER(IsMDMAllowed, "APPID", "Whether the policy allows the application."),
    TRACKER(IsMDMRestriected, "APPID", "Whether policy checks are on and restrict it."),

    // ---- Support services.
    KORRIN_BOUND(kLog, LogClientManager, InsertLog, "APPID FEATURE EXTRA VALUE ISAPPSTATUS",
                 "Sends one usage-log event; each text may be (null)."),
    SYSTEM(GetScreenResolution, "The screen-size class, 0 to 6."),
    SYSTEM(GetCurrentDate, "The day of the month."),
    SYSTEM(IsMdmEnabled, "Whether policy checks are on."),
    {kText, "to_string", "N", "N (an int) in decimal.",
     Bound<static_cast<std::string (*)(int)>(&Korrin3D::to_string)>,
     [](const Words& w) { return !FirstIs(w, "--unsigned"); }},
    {kText, "to_string", "--unsigned N", "N (0..4294967295) in decimal as a signed number.",
     [](CallArgs& a, std::ostream& out) {
       a.Text();  // --unsigned
       Invoke(static_cast<std::string (*)(unsigned int)>(&Korrin3D::to_string), a, out);
     },
     [](const Words& w) { return FirstIs(w, "--unsigned"); }},
};

#undef SYSTEM
#undef TRACKER
#undef STORE
#undef KORRIN_BOUND

std::string Signature(const Operation& op) {
  return std::string(op.cls) + "::" + op.name + (*op.args != '\0' ? " " : "") + op.args;
}

// Every overload |name| stands for: Class::Name, or Name in whichever class.
std::vector<const Operation*> Find(const std::string& name) {
  size_t colons = name.rfind("::");
  std::string cls = colons == std::string::npos ? "" : name.substr(0, colons);
  std::string op = colons == std::string::npos ? name : name.substr(colons + 2);
  std::vector<const Operation*> found;
  for (const Operation& candidate : kOperations) {
    if (op == candidate.name && (cls.empty() || cls == candidate.cls)) {
      found.push_back(&candidate);
    }
  }
  if (found.empty()) {
    std::vector<std::string> names;
    for (const Operation& known : kOperations) names.push_back(known.name);
    std::string hint = DidYouMean(op, names);
    throw UsageError("no operation " + name + (hint.empty() ? " (call --list shows them)" : hint));
  }
  return found;
}

// |text| in lines of at most 78 columns, each indented by four spaces.
void PrintWrapped(const std::string& text, std::ostream& out) {
  std::istringstream words(text);
  std::string line;
  for (std::string word; words >> word;) {
    if (!line.empty() && line.size() + 1 + word.size() > 74) {
      out << "    " << line << "\n";
      line.clear();
    }
    line += (line.empty() ? "" : " ") + word;
  }
  if (!line.empty()) out << "    " << line << "\n";
}

template <class R>
void PrintRecordHelp(const char* placeholder, const RecordType<R>& type, std::ostream& out) {
  std::string text = std::string("FIELD=VALUE words setting members of ") + type.name +
                     "; the others keep a new record's values, or the stored ones after a "
                     "first word " + type.tag + ":ID. FIELD:";
  for (const Field<R>& field : type.fields) text += std::string(" ") + field.name;
  out << placeholder << "\n";
  PrintWrapped(text, out);
}

}  // namespace

std::string FormatMenu(const GameViewData& menu) { return Format(kMenu, menu); }
std::string FormatPage(const GamePageData& page) { return Format(kPage, page); }
std::string FormatBox(const GameBoxData& box) { return Format(kBox, box); }

void Call(const std::vector<std::string>& words, std::ostream& out) {
  if (words.empty()) throw UsageError("call what? `help call` lists the operations");
  if (words[0] == "--list") {
    if (words.size() > 1) throw UsageError("--list takes nothing more");
    return ListCalls(out);
  }
  if (words[0] == "--help" && words.size() == 2) return HelpCall(words[1], out);
  std::vector<const Operation*> found = Find(words[0]);
  if (found.front()->cls != found.back()->cls) {
    throw UsageError(words[0] + " is in " + found.front()->cls + " and " + found.back()->cls +
                     ": write Class::" + words[0]);
  }
  const Operation* op = found.front();
  for (const Operation* overload : found) {
    if (overload->shape == nullptr || overload->shape(words)) {
      op = overload;
      break;
    }
  }
  CallArgs args(words, op->args);
  // A store's insert prints the new id first: it becomes `$last`.
  bool insert = op->cls == kStore && std::string(op->name).compare(0, 6, "Insert") == 0;
  std::stringstream result;
  try {
    op->run(args, insert ? result : out);
    if (insert) {
      out << result.str();
      int id = 0;
      if (result >> id && id > 0) ReturnId(id);
    }
  } catch (const UsageError& e) {
    throw UsageError(words[0] + ": " + e.what() + "; usage: call " + Signature(*op));
  } catch (const std::exception& e) {
    out << result.str() << "exception: " << e.what() << "\n";
  }
}

void ListCalls(std::ostream& out) {
  for (const Operation& op : kOperations) out << Signature(op) << "\n";
}

void HelpCall(const std::string& name, std::ostream& out) {
  std::string args;
  for (const Operation* op : Find(name)) {
    out << Signature(*op) << "\n";
    PrintWrapped(op->help, out);
    args += std::string(" ") + op->args;
  }
  if (args.find("MENU...") != std::string::npos) PrintRecordHelp("MENU...", kMenu, out);
  if (args.find("PAGE...") != std::string::npos) PrintRecordHelp("PAGE...", kPage, out);
  if (args.find("BOX...") != std::string::npos) PrintRecordHelp("BOX...", kBox, out);
}

}  // namespace korrin_sim
