// KillVfs: a thin SQLite VFS over the default one that counts the operations
// which change files (writes, syncs, truncates, deletes) and kills its own
// process with SIGKILL at a chosen one, before or after performing it. A
// process that runs the same statements on the same files makes the same
// operations in the same order, so a kill point is reproducible by number.
#ifndef KORRIN_TESTS_KILLED_KILL_VFS_H_
#define KORRIN_TESTS_KILLED_KILL_VFS_H_

namespace killvfs {

// Where the process dies: at file operation |op|, counted from 1 since
// Install, before it reaches the file or just after. Op 0 never comes.
struct KillPoint {
  long op = 0;
  bool afterIt = false;
};

// Registers the shim as the process's default VFS, so that every connection
// opened from now on goes through it, and sets where the process dies. Meant
// for a child process: it never returns from the operation it dies at.
void Install(KillPoint kill);

// File operations made since Install.
long Operations();

}  // namespace killvfs

#endif  // KORRIN_TESTS_KILLED_KILL_VFS_H_
