// The shim's VFS is a copy of the real one with its own xOpen and xDelete. Its
// file object is the real one's with a header in front, and each method passes
// the call on, through the hook for the operations it watches.
#include "support/file-shim.h"

#include <sqlite3.h>

#include <algorithm>

namespace fileshim {
namespace {

sqlite3_vfs* g_real = nullptr;
sqlite3_vfs g_shim;
Hook g_hook;

struct File {
  sqlite3_file base;
  sqlite3_file* real;  // the real VFS's file, right behind this header
};

sqlite3_file* Real(sqlite3_file* f) { return reinterpret_cast<File*>(f)->real; }
const sqlite3_io_methods* Io(sqlite3_file* f) { return Real(f)->pMethods; }

int Hooked(Op op, const std::function<int()>& perform) {
  return g_hook ? g_hook(op, perform) : perform();
}

// A file's methods have the real file's version, so that SQLite neither asks
// for shared memory or memory mapping the real file lacks nor goes without
// what it has. A method past that version is never called.
sqlite3_io_methods Methods(int version) {
  sqlite3_io_methods io = {};
  io.iVersion = version;
  io.xClose = [](sqlite3_file* f) { return Io(f)->xClose(Real(f)); };
  io.xRead = [](sqlite3_file* f, void* p, int n, sqlite3_int64 at) {
    return Io(f)->xRead(Real(f), p, n, at);
  };
  io.xWrite = [](sqlite3_file* f, const void* p, int n, sqlite3_int64 at) {
    return Hooked(Op::kWrite, [&] { return Io(f)->xWrite(Real(f), p, n, at); });
  };
  io.xTruncate = [](sqlite3_file* f, sqlite3_int64 size) {
    return Hooked(Op::kTruncate, [&] { return Io(f)->xTruncate(Real(f), size); });
  };
  io.xSync = [](sqlite3_file* f, int flags) {
    return Hooked(Op::kSync, [&] { return Io(f)->xSync(Real(f), flags); });
  };
  io.xFileSize = [](sqlite3_file* f, sqlite3_int64* size) {
    return Io(f)->xFileSize(Real(f), size);
  };
  io.xLock = [](sqlite3_file* f, int level) {
    return Hooked(Op::kLock, [&] { return Io(f)->xLock(Real(f), level); });
  };
  io.xUnlock = [](sqlite3_file* f, int level) { return Io(f)->xUnlock(Real(f), level); };
  io.xCheckReservedLock = [](sqlite3_file* f, int* out) {
    return Io(f)->xCheckReservedLock(Real(f), out);
  };
  io.xFileControl = [](sqlite3_file* f, int op, void* arg) {
    return Io(f)->xFileControl(Real(f), op, arg);
  };
  io.xSectorSize = [](sqlite3_file* f) { return Io(f)->xSectorSize(Real(f)); };
  io.xDeviceCharacteristics = [](sqlite3_file* f) {
    return Io(f)->xDeviceCharacteristics(Real(f));
  };
  io.xShmMap = [](sqlite3_file* f, int region, int size, int extend, void volatile** out) {
    return Io(f)->xShmMap(Real(f), region, size, extend, out);
  };
  io.xShmLock = [](sqlite3_file* f, int at, int n, int flags) {
    return Io(f)->xShmLock(Real(f), at, n, flags);
  };
  io.xShmBarrier = [](sqlite3_file* f) { Io(f)->xShmBarrier(Real(f)); };
  io.xShmUnmap = [](sqlite3_file* f, int drop) { return Io(f)->xShmUnmap(Real(f), drop); };
  io.xFetch = [](sqlite3_file* f, sqlite3_int64 at, int n, void** out) {
    return Io(f)->xFetch(Real(f), at, n, out);
  };
  io.xUnfetch = [](sqlite3_file* f, sqlite3_int64 at, void* p) {
    return Io(f)->xUnfetch(Real(f), at, p);
  };
  return io;
}
const sqlite3_io_methods kMethods[] = {Methods(1), Methods(2), Methods(3)};

int Open(sqlite3_vfs*, const char* name, sqlite3_file* file, int flags, int* outFlags) {
  File* shim = reinterpret_cast<File*>(file);
  shim->real = reinterpret_cast<sqlite3_file*>(shim + 1);
  int rc = g_real->xOpen(g_real, name, shim->real, flags, outFlags);
  const sqlite3_io_methods* real = shim->real->pMethods;
  // SQLite reads pMethods whatever the result, and closes the file when set.
  int version = real == nullptr ? 0 : std::min(std::max(real->iVersion, 1), 3);
  file->pMethods = real == nullptr ? nullptr : &kMethods[version - 1];
  return rc;
}

int Delete(sqlite3_vfs*, const char* name, int syncDir) {
  return Hooked(Op::kDelete, [&] { return g_real->xDelete(g_real, name, syncDir); });
}

}  // namespace

int Install(Hook hook) {
  g_hook = std::move(hook);
  if (g_real == nullptr) {
    g_real = sqlite3_vfs_find(nullptr);
    if (g_real == nullptr) return SQLITE_ERROR;
    g_shim = *g_real;
    g_shim.zName = "korrin-shim";
    g_shim.szOsFile = static_cast<int>(sizeof(File)) + g_real->szOsFile;
    g_shim.xOpen = Open;
    g_shim.xDelete = Delete;
  }
  return sqlite3_vfs_register(&g_shim, 1);
}

}  // namespace fileshim
