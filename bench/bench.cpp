#include "bench.h"

#include <stdlib.h>
#include <valgrind/callgrind.h>

namespace bench {

const char* const kStorageNames[2] = {"disk", "memory"};

std::string MakeTempDir(Storage storage, const std::string& prefix) {
  const char* dir = getenv(storage == kDisk ? "KORRIN_BENCH_DISK_DIR" : "KORRIN_BENCH_MEMORY_DIR");
  std::string pattern = std::string(dir != NULL        ? dir
                                    : storage == kDisk ? "/var/tmp"
                                                       : "/dev/shm") +
                        "/" + prefix + "-XXXXXX";
  return mkdtemp(&pattern[0]);
}

void CountUnderCallgrind(const std::string& name, const char* side, int passes,
                         const std::function<void()>& prepare, const std::function<void()>& call,
                         const std::function<void()>& restore) {
  for (int pass = 0; pass <= passes; ++pass) {
    if (pass == 1) CALLGRIND_ZERO_STATS;  // pass 0 warms SQLite's caches
    if (prepare) prepare();
    if (pass > 0) CALLGRIND_TOGGLE_COLLECT;
    call();
    if (pass > 0) CALLGRIND_TOGGLE_COLLECT;
    if (restore) restore();
  }
  // Named: the macro's statements outlive a temporary.
  std::string dump = name + side + "/" + std::to_string(passes);
  CALLGRIND_DUMP_STATS_AT(dump.c_str());
}

}  // namespace bench
