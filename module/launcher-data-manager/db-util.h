// Opening and closing SQLite connections the way the launcher's database
// expects: a busy handler that retries five times at once without sleeping,
// and a collation hook. Exported with C linkage under the platform's names.
#ifndef KORRIN_LAUNCHER_DATA_MANAGER_DB_UTIL_H_
#define KORRIN_LAUNCHER_DATA_MANAGER_DB_UTIL_H_

#include <sqlite3.h>

#ifdef __cplusplus
extern "C" {
#endif

// Opens |path| with sqlite3_open into |*db|; |option| is ignored.
// Returns 0 (SQLITE_OK) on success; 1 (SQLITE_ERROR) when |path| or |db| is
// null, with nothing opened; 3 (SQLITE_PERM) when the process is not root and
// may not read the file; otherwise SQLite's result, with |*db| as SQLite left
// it (the caller closes it).
int db_util_open(const char* path, sqlite3** db, int option);

// As db_util_open, through sqlite3_open_v2 with |flags| and |vfs| (may be null).
int db_util_open_with_options(const char* path, sqlite3** db, int flags, const char* vfs);

// Closes |db|. Returns 0, or SQLite's result when the close failed.
int db_util_close(sqlite3* db);

// Collation-needed callback installed on every connection; it provides nothing.
void __db_util_collation_cb(void* data, sqlite3* db, int textRep, const char* name);

// ---- Exposed for tests.

// The busy handler installed on every connection: 1 (retry) while |count|,
// the number of earlier calls for this lock, is below 5; 0 (give up) after.
int db_util_busy_handler(void* data, int count);

#ifdef __cplusplus
}
#endif

#endif  // KORRIN_LAUNCHER_DATA_MANAGER_DB_UTIL_H_
