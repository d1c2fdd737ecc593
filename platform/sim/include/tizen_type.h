/* Simulated Tizen platform: basic types (tizen_type.h). */
#ifndef __TIZEN_COMMON_TIZEN_TYPE_H__
#define __TIZEN_COMMON_TIZEN_TYPE_H__

#include <stdbool.h>

#ifndef NULL
#define NULL 0
#endif

#endif /* __TIZEN_COMMON_TIZEN_TYPE_H__ */
