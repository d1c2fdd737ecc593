// What the store's and the engine's benchmarks share: where a layout's files
// live, and how each side of an operation is counted under callgrind.
#ifndef KORRIN_BENCH_BENCH_H_
#define KORRIN_BENCH_BENCH_H_

#include <functional>
#include <string>

namespace bench {

enum Storage { kDisk, kMemory };
extern const char* const kStorageNames[2];  // "disk", "memory"

// A new folder on |storage| named |prefix| and a unique suffix: under
// $KORRIN_BENCH_DISK_DIR (default /var/tmp) or $KORRIN_BENCH_MEMORY_DIR
// (default /dev/shm, a tmpfs).
std::string MakeTempDir(Storage storage, const std::string& prefix);

// Runs |call| once to warm SQLite's caches, then |passes| times with callgrind
// collecting around the call alone (|prepare| and |restore|, if given, run
// before and after each, uncounted), and dumps the counts as NAME SIDE/PASSES.
void CountUnderCallgrind(const std::string& name, const char* side, int passes,
                         const std::function<void()>& prepare, const std::function<void()>& call,
                         const std::function<void()>& restore);

// engine_bench.cpp's rows under callgrind, counted the same way as the store's.
void RunEngineUnderCallgrind(const std::string& filter, int maxBoxes, int passes);

}  // namespace bench

#endif  // KORRIN_BENCH_BENCH_H_
