// dlog: every line is captured for the control interface and, on request,
// echoed to stderr in the form the device's log reader prints.
#include <dlog.h>

#include <stdio.h>
#include <unistd.h>

#include <string>

#include "state.h"

namespace {

char PriorityLetter(int prio) {
  static const char kLetters[] = "??VDIWEFS";
  return prio >= 0 && prio < DLOG_PRIO_MAX ? kLetters[prio] : '?';
}

int Record(int prio, const char* tag, const char* fmt, va_list ap) {
  if (fmt == NULL) return DLOG_ERROR_INVALID_PARAMETER;
  va_list measure;
  va_copy(measure, ap);
  int length = vsnprintf(NULL, 0, fmt, measure);
  va_end(measure);
  if (length < 0) return DLOG_ERROR_INVALID_PARAMETER;
  std::string text(static_cast<size_t>(length) + 1, '\0');
  vsnprintf(&text[0], text.size(), fmt, ap);
  text.resize(static_cast<size_t>(length));

  sim::State& state = sim::TheState();
  sim::LogLine line = {prio, tag != NULL ? tag : "", text};
  state.logs.push_back(line);
  if (state.echoLogs) {
    fprintf(stderr, "%c/%s(%d): %s\n", PriorityLetter(prio), line.tag.c_str(),
            static_cast<int>(getpid()), text.c_str());
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
