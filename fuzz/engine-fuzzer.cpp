// A libFuzzer target for the whole engine on the simulated device. An input is
// a korrin-sim script, played line by line through korrin-sim's own session
// (none of its commands reaches host files outside the device root, or waits).
// The engine must come through without a crash, a sanitizer report, a leaked
// platform handle or a damaged schema. Each input starts where the engine has
// just started on an empty device, with empty tables; only the database file
// and SQLite's process-wide state carry over. KORRIN_FUZZ_TRACE=1 prints each
// line, and why it did not run (it could not, or Refused() it).
#include <E_DBus.h>
#include <sqlite3.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <sstream>

#include "cli.h"
#include "korrin-data/korrin-data.h"
#include "session.h"

namespace {

std::string g_root;  // the device root
std::error_code g_ignored;
std::ostream g_nowhere(nullptr);       // where commands print
std::map<std::string, int> g_handles;  // open between inputs

void Die(const std::string& message) {
  fprintf(stderr, "korrin-fuzz: %s\n", message.c_str());
  abort();
}

// Views tell nothing of the engine; commands that name a file would read or
// write the machine's. A release made to fail leaves its handle open for good.
// (Names are never quoted.)
std::string Refused(std::string line) {
  std::istringstream words(line);
  for (std::string w; words >> w;) {
    if (w == "layout" || w == "folder" || w == "tables" || w == "trace") return "a view";
    for (const char* file : {"save", "load", "export", "import", "replay-log"}) {
      if (w == file) return "a file";
    }
  }
  line.erase(std::remove_if(line.begin(), line.end(), [](char c) { return strchr("\"'\\", c); }),
             line.end());
  for (const char* release : {"destroy", "free", "release"}) {
    if (line.find("fail") != line.npos && line.find(release) != line.npos) return "a release";
  }
  return "";
}

void Sql(const char* sql) {
  sqlite3* db = korrin::DataManager().m_db;
  if (sqlite3_exec(db, sql, NULL, NULL, NULL) != SQLITE_OK) {
    Die(sql + (": " + std::string(sqlite3_errmsg(db))));
  }
}

void EndInput() {
  sim::Device& device = sim::Device::Get();
  device.Reset();  // first, so that no fault or pending line reaches what follows
  LauncherDataManager& store = korrin::DataManager();
  if (store.m_db != NULL && !sqlite3_get_autocommit(store.m_db)) store.RollbackTransaction();
  store.m_pageMap.clear();
  store.m_pageFlagMap.clear();
  LauncherPackageManager& tracker = korrin::PackageManager();
  if (tracker.m_dbusConnection != NULL) tracker.UnregisterEdbusSignalHandler();
  while (device.BusInitCount() > 0) e_dbus_shutdown();
  LauncherPackageManager::s_bootSignalSubscriber = NULL;
  if (tracker.m_pkgMgr == NULL) package_manager_create(&tracker.m_pkgMgr);
  tracker.m_appInfoCache.clear();
  tracker.m_pkgJobMap.clear();
  tracker.m_pkgJobList.clear();
  tracker.m_isMmcInserted = false;
  // Texts travel only through bound parameters, so every table is still there
  // (looked for before the connection is opened afresh, which would make them).
  if (store.m_db != NULL) Sql("SELECT 1 FROM Boxes, Pages, Menus LIMIT 0");
  // The engine's own callbacks, its connection, listening: as on a start.
  data_engin_initialization();

  std::map<std::string, int> open = device.OpenHandlesByKind();
  if (g_handles.empty()) g_handles = open;  // the first clean-up, before any input
  if (open != g_handles) {
    std::string text = "platform handles open after the input, not as before it:";
    for (const auto& kind : open) text += " " + kind.first + "=" + std::to_string(kind.second);
    Die(text);
  }
  Sql("DELETE FROM Boxes; DELETE FROM Pages; DELETE FROM Menus; DELETE FROM sqlite_sequence");
  device.Reset();  // the logs and call counts of the clean-up
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  // On tmpfs when there is one, as every commit syncs; a crash leaves it behind.
  std::string base = access("/dev/shm", W_OK) == 0 ? "/dev/shm" : "/tmp";
  g_root = base + "/korrin-fuzz-" + std::to_string(getpid());
  if (!sim::Device::Get().UseRoot(g_root)) Die("cannot make a device root");
  atexit([] { std::filesystem::remove_all(g_root, g_ignored); });
  korrin_sim::SetOut(&g_nowhere);

  // korrin-sim's usage-log client opens its handle on first use and keeps it.
  korrin_sim::Session().Execute("call InsertLog (null) (null) (null) (null) false");
  EndInput();
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  korrin_sim::Session session(false, false);  // lives until EndInput drops its pending lines
  std::istringstream script(std::string(reinterpret_cast<const char*>(bytes), size));
  std::string line;
  for (int n = 0; n < 200 && std::getline(script, line); ++n) {
    std::string note = Refused(line);
    try {
      if (note.empty()) session.Execute(line);
    } catch (const korrin_sim::UsageError& e) {
      note = e.what();
    } catch (const boost::bad_function_call& e) {  // an empty callback slot, as the launcher's
      note = e.what();
    }
    if (getenv("KORRIN_FUZZ_TRACE")) fprintf(stderr, "%s  # %s\n", line.c_str(), note.c_str());
  }
  EndInput();
  return 0;
}
