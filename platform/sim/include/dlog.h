/* Simulated Tizen platform: the platform log (dlog.h). */
#ifndef _DLOG_H_
#define _DLOG_H_

#include <stdarg.h>
#include <string.h>

#include "tizen_error.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef enum {
  DLOG_ERROR_NONE = TIZEN_ERROR_NONE,
  DLOG_ERROR_INVALID_PARAMETER = TIZEN_ERROR_INVALID_PARAMETER,
  DLOG_ERROR_NOT_PERMITTED = TIZEN_ERROR_NOT_PERMITTED
} dlog_error_e;

typedef enum {
  DLOG_UNKNOWN = 0,
  DLOG_DEFAULT,
  DLOG_VERBOSE,
  DLOG_DEBUG,
  DLOG_INFO,
  DLOG_WARN,
  DLOG_ERROR,
  DLOG_FATAL,
  DLOG_SILENT,
  DLOG_PRIO_MAX
} log_priority;

typedef enum {
  LOG_ID_MAIN = 0,
  LOG_ID_RADIO,
  LOG_ID_SYSTEM,
  LOG_ID_APPS,
  LOG_ID_MAX
} log_id_t;

/* The format attributes are the simulator's own: the device headers carry none,
 * but checking the engine's formats off the device costs nothing. */
int dlog_print(log_priority prio, const char* tag, const char* fmt, ...)
    __attribute__((format(printf, 3, 4)));
int dlog_vprint(log_priority prio, const char* tag, const char* fmt, va_list ap)
    __attribute__((format(printf, 3, 0)));
int __dlog_print(log_id_t log_id, int prio, const char* tag, const char* fmt, ...)
    __attribute__((format(printf, 4, 5)));
int __dlog_vprint(log_id_t log_id, int prio, const char* tag, const char* fmt, va_list ap)
    __attribute__((format(printf, 4, 0)));

#ifdef __cplusplus
}
#endif

#endif /* _DLOG_H_ */
