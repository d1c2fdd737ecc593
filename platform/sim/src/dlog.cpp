// dlog: every line is captured for the control interface and, on request,
// echoed to stderr in the form the device's log reader prints.
#include <dlog.h>

#include <stdio.h>
#include <unistd.h>

#include <string>
#include <utility>

#include "state.h"

namespace {

char PriorityLetter(int prio) {
  static const char kLetters[] = "??VDIWEFS";
  return prio >= 0 && prio < DLOG_PRIO_MAX ? kLetters[prio] : '?';
}

int Record(int prio, const char* tag, const char* fmt, va_list ap) {
  if (fmt == NULL) return DLOG_ERROR_INVALID_PARAMETER;
  // Most lines fit the buffer and are formatted once; a longer one again, in full.
  char buffer[512];
  va_list retry;
  va_copy(retry, ap);
  int length = vsnprintf(buffer, sizeof buffer, fmt, ap);
  if (length < 0) {
    va_end(retry);
    return DLOG_ERROR_INVALID_PARAMETER;
  }
  std::string text;
  if (static_cast<size_t>(length) < sizeof buffer) {
    text.assign(buffer, static_cast<size_t>(length));
  } else {
    text.assign(static_cast<size_t>(length) + 1, '\0');
    vsnprintf(&text[0], text.size(), fmt, retry);
    text.resize(static_cast<size_t>(length));
  }
  va_end(retry);

  sim::State& state = sim::TheState();
  state.logs.push_back(sim::LogLine{prio, tag != NULL ? tag : "", std::move(text)});
  if (state.echoLogs) {
    const sim::LogLine& line = state.logs.back();
    fprintf(stderr, "%c/%s(%d): %s\n", PriorityLetter(prio), line.tag.c_str(),
            static_cast<int>(getpid()), line.text.c_str());
  }
  return length;
}

}  // namespace

extern "C" {

int dlog_vprint(log_priority prio, const char* tag, const char* fmt, va_list ap) {
  return Record(prio, tag, fmt, ap);
}

int dlog_print(log_priority prio, const char* tag, const char* fmt, ...) {
  va_list ap;
  va_start(ap, fmt);
  int written = Record(prio, tag, fmt, ap);
  va_end(ap);
  return written;
}

int __dlog_vprint(log_id_t, int prio, const char* tag, const char* fmt, va_list ap) {
  return Record(prio, tag, fmt, ap);
}

int __dlog_print(log_id_t, int prio, const char* tag, const char* fmt, ...) {
  va_list ap;
  va_start(ap, fmt);
  int written = Record(prio, tag, fmt, ap);
  va_end(ap);
  return written;
}

}  // extern "C"
