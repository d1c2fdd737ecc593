// Forwarding definitions of the SQLite calls the store makes, and the replay.
#include "call_log.h"

#include <dlfcn.h>

#include <cstdio>
#include <cstdlib>
#include <unordered_map>

namespace bench {
namespace {

// ---- recording state; one thread drives the store
sqlite3* g_db = nullptr;
CallLog* g_log = nullptr;
std::unordered_map<sqlite3_stmt*, int> g_slots;
// sqlite3_exec may run its statements through the public entry points; those
// inner calls belong to the exec and are not recorded on their own.
int g_execDepth = 0;

template <typename F>
F Real(const char* name) {
  void* f = dlsym(RTLD_NEXT, name);
  if (f == nullptr) {
    std::fprintf(stderr, "korrin-bench: no SQLite symbol %s\n", name);
    std::abort();
  }
  return reinterpret_cast<F>(f);
}
#define REAL(name) static const auto real = bench::Real<decltype(&name)>(#name)

bool Watching(sqlite3* db) { return g_log != nullptr && g_execDepth == 0 && db == g_db; }

int SlotOf(sqlite3_stmt* stmt) {
  if (g_log == nullptr || g_execDepth != 0) return -1;
  auto it = g_slots.find(stmt);
  return it == g_slots.end() ? -1 : it->second;
}

const char* Keep(const char* text, int length) {
  if (text == nullptr) return nullptr;
  g_log->m_texts.emplace_back(length < 0 ? std::string(text) : std::string(text, length));
  return g_log->m_texts.back().c_str();
}

void Add(Call call, int slot, int arg, const char* text = nullptr, bool transient = false) {
  g_log->m_calls.push_back(CallRecord{call, transient, slot, arg, text});
}

}  // namespace

void CallLog::Clear() {
  m_calls.clear();
  m_calls.shrink_to_fit();
  m_texts.clear();
  m_slots = 0;
}

void StartRecording(sqlite3* db, CallLog* log) {
  log->Clear();
  g_slots.clear();
  g_db = db;
  g_log = log;
}

void StopRecording() {
  g_log = nullptr;
  g_db = nullptr;
  g_slots.clear();
}

void CallLog::Replay(sqlite3* db) const {
  std::vector<sqlite3_stmt*> stmts(static_cast<size_t>(m_slots), nullptr);
  for (const CallRecord& c : m_calls) {
    sqlite3_stmt* stmt = c.slot >= 0 ? stmts[static_cast<size_t>(c.slot)] : nullptr;
    switch (c.call) {
      case Call::kPrepare:
        sqlite3_prepare(db, c.text, c.arg, &stmts[static_cast<size_t>(c.slot)], nullptr);
        break;
      case Call::kPrepareV2:
        sqlite3_prepare_v2(db, c.text, c.arg, &stmts[static_cast<size_t>(c.slot)], nullptr);
        break;
      case Call::kParameterIndex:
        sqlite3_bind_parameter_index(stmt, c.text);
        break;
      case Call::kBindText:
        sqlite3_bind_text(stmt, c.arg, c.text, -1, c.transient ? SQLITE_TRANSIENT : SQLITE_STATIC);
        break;
      case Call::kStep:
        sqlite3_step(stmt);
        break;
      case Call::kColumnInt:
        sqlite3_column_int(stmt, c.arg);
        break;
      case Call::kColumnText:
        sqlite3_column_text(stmt, c.arg);
        break;
      case Call::kColumnBytes:
        sqlite3_column_bytes(stmt, c.arg);
        break;
      case Call::kFinalize:
        sqlite3_finalize(stmt);
        break;
      case Call::kExec: {
        char* error = nullptr;
        sqlite3_exec(db, c.text, nullptr, nullptr, &error);
        sqlite3_free(error);
        break;
      }
      case Call::kLastInsertRowid:
        sqlite3_last_insert_rowid(db);
        break;
      case Call::kErrmsg:
        sqlite3_errmsg(db);
        break;
    }
  }
}

}  // namespace bench

// ---- the forwarding definitions (the store's imports resolve to these)
using bench::Add;
using bench::Real;
using bench::Call;
using bench::SlotOf;
using bench::Watching;

namespace {

// Records a prepare of either kind on the watched connection; returns |rc|.
// A -1 length reads to the terminator; the kept copy has one too.
int Prepared(Call call, sqlite3* db, const char* sql, int length, sqlite3_stmt** stmt, int rc) {
  if (Watching(db)) {
    int slot = bench::g_log->m_slots++;
    bench::g_slots[*stmt] = slot;
    Add(call, slot, length, bench::Keep(sql, length));
  }
  return rc;
}

}  // namespace

extern "C" {

int sqlite3_prepare(sqlite3* db, const char* sql, int length, sqlite3_stmt** stmt,
                    const char** tail) {
  REAL(sqlite3_prepare);
  return Prepared(Call::kPrepare, db, sql, length, stmt, real(db, sql, length, stmt, tail));
}

int sqlite3_prepare_v2(sqlite3* db, const char* sql, int length, sqlite3_stmt** stmt,
                       const char** tail) {
  REAL(sqlite3_prepare_v2);
  return Prepared(Call::kPrepareV2, db, sql, length, stmt, real(db, sql, length, stmt, tail));
}

int sqlite3_bind_parameter_index(sqlite3_stmt* stmt, const char* name) {
  REAL(sqlite3_bind_parameter_index);
  int slot = SlotOf(stmt);
  if (slot >= 0) Add(Call::kParameterIndex, slot, 0, bench::Keep(name, -1));
  return real(stmt, name);
}

int sqlite3_bind_text(sqlite3_stmt* stmt, int index, const char* text, int length,
                      void (*destructor)(void*)) {
  REAL(sqlite3_bind_text);
  int slot = SlotOf(stmt);
  if (slot >= 0) {
    Add(Call::kBindText, slot, index, bench::Keep(text, length), destructor != SQLITE_STATIC);
  }
  return real(stmt, index, text, length, destructor);
}

int sqlite3_step(sqlite3_stmt* stmt) {
  REAL(sqlite3_step);
  int slot = SlotOf(stmt);
  if (slot >= 0) Add(Call::kStep, slot, 0);
  return real(stmt);
}

int sqlite3_column_int(sqlite3_stmt* stmt, int column) {
  REAL(sqlite3_column_int);
  int slot = SlotOf(stmt);
  if (slot >= 0) Add(Call::kColumnInt, slot, column);
  return real(stmt, column);
}

const unsigned char* sqlite3_column_text(sqlite3_stmt* stmt, int column) {
  REAL(sqlite3_column_text);
  int slot = SlotOf(stmt);
  if (slot >= 0) Add(Call::kColumnText, slot, column);
  return real(stmt, column);
}

int sqlite3_column_bytes(sqlite3_stmt* stmt, int column) {
  REAL(sqlite3_column_bytes);
  int slot = SlotOf(stmt);
  if (slot >= 0) Add(Call::kColumnBytes, slot, column);
  return real(stmt, column);
}

int sqlite3_finalize(sqlite3_stmt* stmt) {
  REAL(sqlite3_finalize);
  int slot = SlotOf(stmt);
  if (slot >= 0) {
    Add(Call::kFinalize, slot, 0);
    bench::g_slots.erase(stmt);
  }
  return real(stmt);
}

int sqlite3_exec(sqlite3* db, const char* sql, int (*callback)(void*, int, char**, char**),
                 void* data, char** error) {
  REAL(sqlite3_exec);
  if (Watching(db)) Add(Call::kExec, -1, 0, bench::Keep(sql, -1));
  ++bench::g_execDepth;
  int rc = real(db, sql, callback, data, error);
  --bench::g_execDepth;
  return rc;
}

sqlite3_int64 sqlite3_last_insert_rowid(sqlite3* db) {
  REAL(sqlite3_last_insert_rowid);
  if (Watching(db)) Add(Call::kLastInsertRowid, -1, 0);
  return real(db);
}

const char* sqlite3_errmsg(sqlite3* db) {
  REAL(sqlite3_errmsg);
  if (Watching(db)) Add(Call::kErrmsg, -1, 0);
  return real(db);
}

}  // extern "C"
