// The shim wraps the default VFS the usual way: its file object is the real
// one's with a header in front, and each method passes the call on. Only the
// methods that change a file are counted.
//
// Syncs are counted but not performed. A process killed with SIGKILL loses
// nothing that already reached the kernel; what it cannot do is finish what it
// had not started. Skipping fsync keeps that intact and lets thousands of
// autocommits run in a fraction of a second.
#include "killed/kill-vfs.h"

#include <signal.h>
#include <sqlite3.h>
#include <unistd.h>

#include <cstdlib>

namespace killvfs {
namespace {

sqlite3_vfs* g_real = nullptr;
KillPoint g_kill;
long g_operations = 0;

void Die() {
  kill(getpid(), SIGKILL);
  abort();  // not reached
}

// Counts one file operation, dying before or after it when its turn has come.
template <typename Operation>
int Counted(Operation perform) {
  long op = ++g_operations;
  if (op == g_kill.op && !g_kill.afterIt) Die();
  int rc = perform();
  if (op == g_kill.op) Die();
  return rc;
}

struct File {
  sqlite3_file base;
  sqlite3_file* real;  // the wrapped VFS's file, right behind this header
};

sqlite3_file* Real(sqlite3_file* file) { return reinterpret_cast<File*>(file)->real; }
const sqlite3_io_methods* Io(sqlite3_file* file) { return Real(file)->pMethods; }

int Close(sqlite3_file* f) { return Io(f)->xClose(Real(f)); }
int Read(sqlite3_file* f, void* data, int n, sqlite3_int64 at) {
  return Io(f)->xRead(Real(f), data, n, at);
}
int Write(sqlite3_file* f, const void* data, int n, sqlite3_int64 at) {
  return Counted([&] { return Io(f)->xWrite(Real(f), data, n, at); });
}
int Truncate(sqlite3_file* f, sqlite3_int64 size) {
  return Counted([&] { return Io(f)->xTruncate(Real(f), size); });
}
int Sync(sqlite3_file*, int) {
  return Counted([] { return SQLITE_OK; });
}
int FileSize(sqlite3_file* f, sqlite3_int64* size) { return Io(f)->xFileSize(Real(f), size); }
int Lock(sqlite3_file* f, int level) { return Io(f)->xLock(Real(f), level); }
int Unlock(sqlite3_file* f, int level) { return Io(f)->xUnlock(Real(f), level); }
int CheckReservedLock(sqlite3_file* f, int* out) { return Io(f)->xCheckReservedLock(Real(f), out); }
int FileControl(sqlite3_file* f, int op, void* arg) {
  return Io(f)->xFileControl(Real(f), op, arg);
}
int SectorSize(sqlite3_file* f) { return Io(f)->xSectorSize(Real(f)); }
int DeviceCharacteristics(sqlite3_file* f) { return Io(f)->xDeviceCharacteristics(Real(f)); }
int ShmMap(sqlite3_file* f, int region, int size, int extend, void volatile** out) {
  return Io(f)->xShmMap(Real(f), region, size, extend, out);
}
int ShmLock(sqlite3_file* f, int offset, int n, int flags) {
  return Io(f)->xShmLock(Real(f), offset, n, flags);
}
void ShmBarrier(sqlite3_file* f) { Io(f)->xShmBarrier(Real(f)); }
int ShmUnmap(sqlite3_file* f, int deleteFlag) { return Io(f)->xShmUnmap(Real(f), deleteFlag); }
int Fetch(sqlite3_file* f, sqlite3_int64 at, int n, void** out) {
  return Io(f)->xFetch(Real(f), at, n, out);
}
int Unfetch(sqlite3_file* f, sqlite3_int64 at, void* p) { return Io(f)->xUnfetch(Real(f), at, p); }

sqlite3_io_methods FileMethods() {
  sqlite3_io_methods io = {};
  io.iVersion = 3;  // as the default unix VFS's files are; Open checks that
  io.xClose = Close;
  io.xRead = Read;
  io.xWrite = Write;
  io.xTruncate = Truncate;
  io.xSync = Sync;
  io.xFileSize = FileSize;
  io.xLock = Lock;
  io.xUnlock = Unlock;
  io.xCheckReservedLock = CheckReservedLock;
  io.xFileControl = FileControl;
  io.xSectorSize = SectorSize;
  io.xDeviceCharacteristics = DeviceCharacteristics;
  io.xShmMap = ShmMap;
  io.xShmLock = ShmLock;
  io.xShmBarrier = ShmBarrier;
  io.xShmUnmap = ShmUnmap;
  io.xFetch = Fetch;
  io.xUnfetch = Unfetch;
  return io;
}
const sqlite3_io_methods kFileMethods = FileMethods();

int Open(sqlite3_vfs*, const char* name, sqlite3_file* file, int flags, int* outFlags) {
  File* shim = reinterpret_cast<File*>(file);
  shim->real = reinterpret_cast<sqlite3_file*>(shim + 1);
  int rc = g_real->xOpen(g_real, name, shim->real, flags, outFlags);
  const sqlite3_io_methods* methods = shim->real->pMethods;
  if (methods != nullptr && methods->iVersion < kFileMethods.iVersion) abort();
  // SQLite reads pMethods whatever the result, and closes the file when set.
  file->pMethods = methods != nullptr ? &kFileMethods : nullptr;
  return rc;
}

int Delete(sqlite3_vfs*, const char* name, int /* syncDir */) {
  return Counted([&] { return g_real->xDelete(g_real, name, 0 /* no fsync, as above */); });
}
int Access(sqlite3_vfs*, const char* name, int flags, int* out) {
  return g_real->xAccess(g_real, name, flags, out);
}
int FullPathname(sqlite3_vfs*, const char* name, int n, char* out) {
  return g_real->xFullPathname(g_real, name, n, out);
}
void* DlOpen(sqlite3_vfs*, const char* name) { return g_real->xDlOpen(g_real, name); }
void DlError(sqlite3_vfs*, int n, char* out) { g_real->xDlError(g_real, n, out); }
void (*DlSym(sqlite3_vfs*, void* lib, const char* symbol))(void) {
  return g_real->xDlSym(g_real, lib, symbol);
}
void DlClose(sqlite3_vfs*, void* lib) { g_real->xDlClose(g_real, lib); }
int Randomness(sqlite3_vfs*, int n, char* out) { return g_real->xRandomness(g_real, n, out); }
int Sleep(sqlite3_vfs*, int micros) { return g_real->xSleep(g_real, micros); }
int CurrentTime(sqlite3_vfs*, double* out) { return g_real->xCurrentTime(g_real, out); }
int GetLastError(sqlite3_vfs*, int n, char* out) { return g_real->xGetLastError(g_real, n, out); }
int CurrentTimeInt64(sqlite3_vfs*, sqlite3_int64* out) {
  return g_real->xCurrentTimeInt64(g_real, out);
}

sqlite3_vfs g_shim = {};

}  // namespace

void Install(KillPoint kill) {
  g_kill = kill;
  g_operations = 0;
  if (g_real != nullptr) return;
  g_real = sqlite3_vfs_find(nullptr);
  if (g_real == nullptr || g_real->iVersion < 2) abort();
  g_shim.iVersion = 2;  // the system-call overrides of version 3 stay the real VFS's
  g_shim.szOsFile = static_cast<int>(sizeof(File)) + g_real->szOsFile;
  g_shim.mxPathname = g_real->mxPathname;
  g_shim.zName = "korrin-kill";
  g_shim.xOpen = Open;
  g_shim.xDelete = Delete;
  g_shim.xAccess = Access;
  g_shim.xFullPathname = FullPathname;
  g_shim.xDlOpen = DlOpen;
  g_shim.xDlError = DlError;
  g_shim.xDlSym = DlSym;
  g_shim.xDlClose = DlClose;
  g_shim.xRandomness = Randomness;
  g_shim.xSleep = Sleep;
  g_shim.xCurrentTime = CurrentTime;
  g_shim.xGetLastError = GetLastError;
  g_shim.xCurrentTimeInt64 = CurrentTimeInt64;
  if (sqlite3_vfs_register(&g_shim, 1) != SQLITE_OK) abort();
}

long Operations() { return g_operations; }

}  // namespace killvfs
