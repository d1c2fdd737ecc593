// The engine's one way to the platform log: tag "korrin", and every message
// prefixed with the source file's base name, the function and the line.
#ifndef KORRIN_COMMON_LOG_H_
#define KORRIN_COMMON_LOG_H_

#include <dlog.h>
#include <string.h>

#define KORRIN_LOG_TAG "korrin"

#define KORRIN_BASE_NAME (strrchr(__FILE__, '/') ? strrchr(__FILE__, '/') + 1 : __FILE__)

// KLOG(DLOG_ERROR, "sqlite error : [%d]", rc). The prefix, with its two blanks
// after ">", is kept as the launcher's log readers expect it.
#define KLOG(priority, fmt, ...)                                                       \
  __dlog_print(LOG_ID_MAIN, priority, KORRIN_LOG_TAG, "%s: %s(%d) >  " fmt, KORRIN_BASE_NAME, \
               __FUNCTION__, __LINE__, ##__VA_ARGS__)

#endif  // KORRIN_COMMON_LOG_H_
