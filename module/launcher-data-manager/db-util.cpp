// Connection helpers of the layout database. The short, sleepless retry of the
// busy handler is intended: the launcher would rather fail a write than stall
// its main loop.
#include "launcher-data-manager/db-util.h"

#include <errno.h>
#include <unistd.h>

namespace {

const int kBusyRetries = 5;

// A non-root process that may not read the file gets SQLITE_PERM before
// SQLite is asked; any other failure of access() (no file yet) lets it go on.
bool IsReadDenied(const char* path) {
  return geteuid() != 0 && access(path, R_OK) != 0 && errno == EACCES;
}

// Installs the handlers; a connection that refuses them is closed, and the
// caller's handle cleared so that nobody closes it twice.
int InstallHandlers(sqlite3** db) {
  int rc = sqlite3_busy_handler(*db, db_util_busy_handler, NULL);
  if (rc != SQLITE_OK) {
    sqlite3_close(*db);
    *db = NULL;
    return rc;
  }
  sqlite3_collation_needed(*db, NULL, __db_util_collation_cb);
  return SQLITE_OK;
}

}  // namespace

extern "C" {

int db_util_busy_handler(void*, int count) { return count < kBusyRetries ? 1 : 0; }

void __db_util_collation_cb(void*, sqlite3*, int, const char*) {}

int db_util_open(const char* path, sqlite3** db, int) {
  if (path == NULL || db == NULL) return SQLITE_ERROR;
  if (IsReadDenied(path)) return SQLITE_PERM;
  int rc = sqlite3_open(path, db);
  if (rc != SQLITE_OK) return rc;
  return InstallHandlers(db);
}

int db_util_open_with_options(const char* path, sqlite3** db, int flags, const char* vfs) {
  if (path == NULL || db == NULL) return SQLITE_ERROR;
  if (IsReadDenied(path)) return SQLITE_PERM;
  int rc = sqlite3_open_v2(path, db, flags, vfs);
  if (rc != SQLITE_OK) return rc;
  return InstallHandlers(db);
}

int db_util_close(sqlite3* db) {
  int rc = sqlite3_close(db);
  if (rc != SQLITE_OK) {
    char* error = NULL;  // an error path that never gets a message; kept as it was
    sqlite3_free(error);
    return rc;
  }
  return SQLITE_OK;
}

}  // extern "C"
