// The SQLite floor of a store operation: the exact sequence of SQLite calls
// the operation made, recorded once and replayed straight through the C API.
//
// The benchmark binary defines the SQLite entry points the store imports, so
// the dynamic linker binds the library's calls to these definitions, which
// forward to the real SQLite. While a log is recording, each call on the
// watched connection is kept with its arguments: which prepare call and its
// length argument, every composed text as it was, every parameter look-up and
// bound text, every step and column read, finalize, exec, last row id. Replay
// repeats those calls in that order, so the floor prepares a fresh statement
// wherever the store composed one, commits wherever the store committed, and
// reads the columns the store read; only the store's own C++ (composing the
// text, building records) is absent. The store and the replay both pass
// through the same forwarding functions, so that cost falls on both sides.
#ifndef KORRIN_BENCH_CALL_LOG_H_
#define KORRIN_BENCH_CALL_LOG_H_

#include <sqlite3.h>

#include <cstdint>
#include <deque>
#include <string>
#include <vector>

namespace bench {

enum class Call : uint8_t {
  kPrepare,
  kPrepareV2,
  kParameterIndex,
  kBindText,
  kStep,
  kColumnInt,
  kColumnText,
  kColumnBytes,
  kFinalize,
  kExec,
  kLastInsertRowid,
  kErrmsg,
};

struct CallRecord {
  Call call;
  bool transient;  // bind_text given SQLITE_TRANSIENT rather than SQLITE_STATIC
  int slot;        // which prepared statement, in order of preparation
  int arg;         // column or parameter index; the length argument of a prepare
  const char* text;
};

class CallLog {
 public:
  bool empty() const { return m_calls.empty(); }
  size_t size() const { return m_calls.size(); }
  void Clear();
  // Makes the recorded calls again, on |db|.
  void Replay(sqlite3* db) const;

  // ---- filled while recording
  std::vector<CallRecord> m_calls;
  std::deque<std::string> m_texts;  // owns every text the records point to
  int m_slots = 0;
};

// Records the calls made on |db| into |log| until StopRecording().
void StartRecording(sqlite3* db, CallLog* log);
void StopRecording();

}  // namespace bench

#endif  // KORRIN_BENCH_CALL_LOG_H_
