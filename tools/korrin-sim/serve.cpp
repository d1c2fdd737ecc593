#include "serve.h"

#include <httplib.h>
#include <pthread.h>
#include <signal.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <fstream>
#include <iostream>
#include <mutex>
#include <set>
#include <sstream>
#include <thread>

#include <nlohmann/json.hpp>

#include "cli.h"
#include "korrin-data/korrin-data.h"
#include "phone-db.h"
#include "serve-page.h"
#include "session.h"
#include "views.h"

using nlohmann::json;

namespace korrin_sim {
namespace {

// What the page may run: events and settings of the phone, and edits of the
// layout. Nothing here names a file, so no request reaches the file system.
const std::set<std::string> kPageCommands = {
    "install", "update", "uninstall", "event",  "card",     "boot-done", "mdm",
    "fail",    "start",  "game",      "move",   "rename",   "remove-box", "make-folder",
    "folder",  "screen", "on-card",   "call"};

// Requests are small: a command line, or nothing.
const size_t kMaxRequestBytes = 16 * 1024;
// The log pane shows the newest lines.
const size_t kLogLines = 300;
// A long poll waits this long for a change before answering "unchanged".
const std::chrono::seconds kPollWait(20);

// ---- Reading the layout database, as the launcher's screen would.

// The layout's rows, or none when the database cannot be read (the engine
// has not made it yet, say): an empty phone.
struct LayoutRows {
  std::vector<Json> menus, pages, boxes;
};

LayoutRows ReadLayoutRows(const std::string& dbPath) {
  LayoutRows rows;
  try {
    Connection db(dbPath, /*readOnly=*/true);
    rows.menus = db.Rows("SELECT menuId, name FROM Menus ORDER BY menuId");
    rows.pages = db.Rows("SELECT pageId, isFolder, parentId, pageNo FROM Pages "
                         "ORDER BY pageNo, pageId");
    rows.boxes = db.Rows("SELECT boxId, isFolder, pageId, appId, name, col, row, boxType "
                         "FROM Boxes ORDER BY row, col, boxId");
  } catch (const UsageError&) {
  }
  return rows;
}

template <typename J>
std::string Text(const J& value) {
  return value.is_string() ? value.template get<std::string>() : "";
}
template <typename J>
int Int(const J& value) {
  return value.is_number_integer() ? value.template get<int>() : 0;
}

// The phone's applications by id, with whether their package is deactivated.
class AppIndex {
 public:
  AppIndex() {
    for (const sim::Package& pkg : sim::Device::Get().Packages()) {
      for (const sim::App& app : pkg.apps) apps_[app.id] = std::make_pair(&app, pkg.disabled);
    }
  }
  // The application, or null; |*deactivated| says whether its package is.
  const sim::App* Find(const std::string& appId, bool* deactivated) const {
    std::map<std::string, std::pair<const sim::App*, bool> >::const_iterator it = apps_.find(appId);
    *deactivated = it != apps_.end() && it->second.second;
    return it != apps_.end() ? it->second.first : NULL;
  }

 private:
  std::map<std::string, std::pair<const sim::App*, bool> > apps_;
};

// What a box shows, with the facts the screen draws it by: whether it has an
// icon, and whether its application is disabled or its package deactivated.
json BoxJson(const AppIndex& apps, int id, bool isFolder, int boxType, const std::string& appId,
             const std::string& name, int col, int row) {
  bool shortcut = boxType == kShortcutBoxType;
  std::string label = BoxLabel(isFolder, boxType, appId, name);
  if (isFolder || shortcut) label = label.substr(1, label.size() - 2);  // no [] or <>
  // Flags only when set: a home screen of 10,000 boxes stays a small answer.
  json box = {{"id", id}, {"col", col}, {"row", row}, {"label", label}};
  if (!appId.empty()) box["appId"] = appId;
  if (isFolder) box["folder"] = true;
  if (shortcut) box["shortcut"] = true;
  bool deactivated = false;
  const sim::App* app = isFolder || shortcut ? NULL : apps.Find(appId, &deactivated);
  if (!isFolder && !shortcut && (app == NULL || !app->icon || app->icon->empty())) {
    box["noIcon"] = true;
  }
  if (app != NULL && !app->enabled) box["disabled"] = true;
  if (deactivated) box["deactivated"] = true;
  return box;
}

// Menus with their pages, and folders with theirs, each page with its boxes.
json LayoutJson(const std::string& dbPath, const AppIndex& apps) {
  LayoutRows rows = ReadLayoutRows(dbPath);
  std::map<int, json> pages;  // pageId -> page
  for (const Json& p : rows.pages) {
    pages[Int(p["pageId"])] = {{"id", Int(p["pageId"])}, {"folder", Int(p["isFolder"]) != 0},
                               {"parent", Int(p["parentId"])}, {"no", Int(p["pageNo"])},
                               {"boxes", json::array()}};
  }
  for (const Json& b : rows.boxes) {
    std::map<int, json>::iterator page = pages.find(Int(b["pageId"]));
    if (page == pages.end()) continue;  // a box without a page is not on any screen
    page->second["boxes"].push_back(BoxJson(apps, Int(b["boxId"]), Int(b["isFolder"]) != 0,
                                            Int(b["boxType"]), Text(b["appId"]), Text(b["name"]),
                                            Int(b["col"]), Int(b["row"])));
  }
  json menus = json::array();
  json folders = json::object();
  for (const Json& m : rows.menus) {
    json menu = {{"id", Int(m["menuId"])}, {"name", Text(m["name"])}, {"pages", json::array()}};
    for (std::pair<const int, json>& page : pages) {
      if (!page.second["folder"] && page.second["parent"] == Int(m["menuId"])) {
        menu["pages"].push_back(page.second);
      }
    }
    menus.push_back(menu);
  }
  for (std::pair<const int, json>& page : pages) {
    if (page.second["folder"]) folders[std::to_string(Int(page.second["parent"]))].push_back(page.second);
  }
  return {{"menus", menus}, {"folders", folders}};
}

// A computed view's pages, each with the boxes the library put on it.
json ViewJson(const AppIndex& apps, const std::vector<boost::shared_ptr<GamePageData> >& pages,
              const std::vector<boost::shared_ptr<GameBoxData> >& boxes) {
  json view = json::array();
  for (const boost::shared_ptr<GamePageData>& page : pages) {
    json boxesOnPage = json::array();
    for (const boost::shared_ptr<GameBoxData>& box : boxes) {
      if (box->pageId != page->pageId) continue;
      boxesOnPage.push_back(BoxJson(apps, box->boxId, box->isFolder, box->boxType, box->appId, box->name,
                                    box->col, box->row));
    }
    view.push_back({{"id", page->pageId}, {"no", page->pageNo}, {"boxes", boxesOnPage}});
  }
  return view;
}

// One of the library's views of menu 1 (alphabetical or downloads), when the
// engine has a store; null otherwise.
json ComputedViewJson(const AppIndex& apps, const std::string& name) {
  LauncherDataManager& store = korrin::DataManager();
  if (store.m_db == NULL) return nullptr;
  if (name == "alphabetical") {
    return ViewJson(apps, store.GetPageDataListByAlphabeticalOrder(1, false),
                    store.GetBoxDataListByAlphabeticalOrder(1, false));
  }
  if (name == "downloads") {
    return ViewJson(apps, store.GetPageDataListByDownload(1, false),
                    store.GetBoxDataListByDownload(1, false));
  }
  return nullptr;
}

json LogJson() {
  const std::vector<sim::LogLine>& logs = sim::Device::Get().Logs();
  json lines = json::array();
  for (size_t i = logs.size() > kLogLines ? logs.size() - kLogLines : 0; i < logs.size(); ++i) {
    std::ostringstream line;
    PrintLogLine(logs[i], /*messageOnly=*/true, line);
    std::string text = line.str();
    if (!text.empty() && text.back() == '\n') text.pop_back();
    json entry = {{"priority", logs[i].priority}, {"text", text}};
    if (FailureLogged(logs[i])) entry["failure"] = true;
    lines.push_back(entry);
  }
  return lines;
}

// The phone's applications, for the panel's lists.
json AppsJson() {
  json apps = json::array();
  for (const sim::Package& pkg : sim::Device::Get().Packages()) {
    for (const sim::App& app : pkg.apps) {
      apps.push_back({{"appId", app.id}, {"pkgId", pkg.id},
                      {"label", app.label ? *app.label : std::string()}, {"game", app.game}});
    }
  }
  return apps;
}

json ErrorJson(const std::string& message) { return {{"error", message}}; }

// With its charset named, cpp-httplib leaves a JSON answer uncompressed: on the
// loopback address, compressing a large home screen costs far more than
// sending it.
void Reply(httplib::Response& res, int status, const json& body) {
  res.status = status;
  res.set_content(body.dump(), "application/json; charset=utf-8");
}

// ---- The server: one session, one request at a time.

class Server {
 public:
  Server(Session& session, const std::string& prelude)
      : session_(session), prelude_(prelude), version_(1) {}

  void Route(httplib::Server& http) {
    http.Get("/", [](const httplib::Request&, httplib::Response& res) {
      res.set_content(kServePageHtml, "text/html; charset=utf-8");
    });
    http.Get("/app.js", [](const httplib::Request&, httplib::Response& res) {
      res.set_content(kServePageJs, "text/javascript; charset=utf-8");
    });
    http.Get("/app.css", [](const httplib::Request&, httplib::Response& res) {
      res.set_content(kServePageCss, "text/css; charset=utf-8");
    });
    http.Get("/favicon.ico", [](const httplib::Request&, httplib::Response& res) {
      res.status = 204;  // the page has no icon; say so rather than "no such route"
    });
    http.Get("/api/state", [this](const httplib::Request& req, httplib::Response& res) {
      State(req, res);
    });
    http.Post("/api/command", [this](const httplib::Request& req, httplib::Response& res) {
      Command(req, res);
    });
    http.Get("/api/script", [this](const httplib::Request&, httplib::Response& res) {
      std::lock_guard<std::mutex> lock(mutex_);
      res.set_header("Content-Disposition", "attachment; filename=\"korrin-session.ksim\"");
      res.set_content(Script(), "text/plain; charset=utf-8");
    });
    http.set_error_handler([](const httplib::Request& req, httplib::Response& res) {
      if (res.status == 404) Reply(res, 404, ErrorJson("no such route: " + req.method + " " + req.path));
      if (res.status == 413) Reply(res, 413, ErrorJson("the request is larger than 16 KB"));
    });
    http.set_payload_max_length(kMaxRequestBytes);
  }

 private:
  // The whole state (with the computed view named by "view", if any), or,
  // when the page already has version |since|, the
  // first change after it (a long poll), or "unchanged" after a while.
  void State(const httplib::Request& req, httplib::Response& res) {
    std::unique_lock<std::mutex> lock(mutex_);
    if (req.has_param("since")) {
      long since = std::atol(req.get_param_value("since").c_str());
      if (!changed_.wait_for(lock, kPollWait, [&] { return version_ != since; })) {
        Reply(res, 200, {{"version", version_}, {"unchanged", true}});
        return;
      }
    }
    AppIndex apps;
    json state = LayoutJson(session_.DatabasePath(), apps);
    state["version"] = version_;
    state["started"] = korrin::DataManager().m_db != NULL;
    // Only the view the page shows: each is as large as the home screen.
    if (req.has_param("view")) {
      state["view"] = ComputedViewJson(apps, req.get_param_value("view"));
    }
    state["apps"] = AppsJson();
    state["calls"] = sim::Device::PlatformCalls();  // for the fault form
    state["log"] = LogJson();
    state["changes"] = changes_;
    state["commands"] = commands_;
    state["output"] = output_;
    Reply(res, 200, state);
  }

  void Command(const httplib::Request& req, httplib::Response& res) {
    json body;
    try {
      body = json::parse(req.body);
    } catch (const json::parse_error& e) {
      return Reply(res, 400, ErrorJson(std::string("the body is not JSON: ") + e.what()));
    }
    if (!body.is_object() || !body.contains("line") || !body["line"].is_string()) {
      return Reply(res, 400, ErrorJson("the body must be {\"line\": \"COMMAND ...\"}"));
    }
    std::string line = body["line"].get<std::string>();
    std::string name = line.substr(0, line.find_first_of(" \t"));
    if (kPageCommands.count(name) == 0) {
      return Reply(res, 403, ErrorJson("'" + name + "' cannot be run from the page"));
    }
    std::lock_guard<std::mutex> lock(mutex_);
    std::ostringstream printed;
    SetOut(&printed);
    try {
      session_.Execute(line);
    } catch (const std::exception& e) {
      SetOut(NULL);
      return Reply(res, 422, ErrorJson(e.what()));
    }
    SetOut(NULL);
    std::ostringstream changes;
    PrintChanges(session_.before(), session_.after(), changes);
    changes_ = changes.str();
    output_ = printed.str();
    commands_.push_back(line);
    ++version_;
    changed_.notify_all();
    Reply(res, 200, {{"command", line}, {"output", output_}, {"version", version_}});
  }

  // What the page did, after the script it was served with: replayable.
  std::string Script() const {
    std::string script = "# korrin-sim serve: a session saved from the page\n" + prelude_;
    if (!script.empty() && script.back() != '\n') script += "\n";
    for (const std::string& line : commands_) script += line + "\n";
    return script;
  }

  Session& session_;
  std::string prelude_;
  std::mutex mutex_;
  std::condition_variable changed_;
  long version_;
  std::vector<std::string> commands_;
  std::string changes_;
  std::string output_;
};

}  // namespace

int Serve(Session& session, const ServeOptions& options) {
  std::string prelude;
  if (!options.script.empty()) {
    std::ifstream in(options.script);
    std::stringstream text;
    text << in.rdbuf();
    prelude = text.str();
    std::istringstream script(prelude);
    // What the script prints is the page's to show: only its errors reach the terminal.
    std::ostringstream printed;
    SetOut(&printed);
    bool played = in && session.RunScript(script, options.script, std::cerr);
    SetOut(NULL);
    if (!played) return 1;
    std::cout << "korrin-sim serve: played " << options.script << "\n";
  }
  httplib::Server http;
  // cpp-httplib's default also sets SO_REUSEPORT, which lets a second server
  // take a port already served: a port in use must be refused instead.
  http.set_socket_options([](socket_t sock) {
    int yes = 1;
    setsockopt(sock, SOL_SOCKET, SO_REUSEADDR, &yes, sizeof yes);
  });
  Server server(session, prelude);
  server.Route(http);
  int port = options.port;
  if (port == 0) {
    port = http.bind_to_any_port("127.0.0.1");
  } else if (!http.bind_to_port("127.0.0.1", port)) {
    port = -1;
  }
  if (port < 0) {
    std::cerr << "korrin-sim serve: cannot listen on 127.0.0.1:" << options.port
              << " (is the port in use? --port 0 takes any free one)\n";
    return 1;
  }
  std::cout << "korrin-sim serve: http://127.0.0.1:" << port
            << "/ (the loopback address only; Ctrl-C stops)" << std::endl;
  // Ctrl-C or a TERM stops the server, so that the device root is left as
  // the other modes leave it: one thread waits for the signal, which every
  // other thread (the server's too) blocks.
  sigset_t stopSignals, before;
  sigemptyset(&stopSignals);
  sigaddset(&stopSignals, SIGINT);
  sigaddset(&stopSignals, SIGTERM);
  pthread_sigmask(SIG_BLOCK, &stopSignals, &before);
  std::atomic<bool> signalled(false);
  std::thread waiter([&] {
    int signal = 0;
    sigwait(&stopSignals, &signal);
    signalled = true;
    http.stop();
  });
  bool served = http.listen_after_bind();
  if (!signalled) kill(getpid(), SIGTERM);  // wakes the waiter: the server ended by itself
  waiter.join();
  pthread_sigmask(SIG_SETMASK, &before, NULL);
  return served ? 0 : 1;
}

}  // namespace korrin_sim
