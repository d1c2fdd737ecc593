// FileShim: a pass-through SQLite VFS over the default one, registered as the
// process's default so that every connection opened afterwards goes through
// it, with a test's hook around the file operations tests watch or break.
#ifndef KORRIN_TESTS_SUPPORT_FILE_SHIM_H_
#define KORRIN_TESTS_SUPPORT_FILE_SHIM_H_

#include <functional>

namespace fileshim {

enum class Op { kWrite, kTruncate, kSync, kDelete, kLock };

// Called in place of each such operation. |perform| makes it on the real file
// (or VFS) and returns its result code; what the hook returns is what SQLite
// gets, so it may also skip the operation or die before or after it.
typedef std::function<int(Op op, const std::function<int()>& perform)> Hook;

// Makes the shim the default VFS, with |hook| from now on in place of any
// earlier one. SQLITE_OK, or why the shim could not be registered.
int Install(Hook hook);

}  // namespace fileshim

#endif  // KORRIN_TESTS_SUPPORT_FILE_SHIM_H_
