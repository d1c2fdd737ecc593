/* Simulated Tizen platform: system information (system_info.h). Integer
 * platform features only, such as "http://tizen.org/feature/screen.width". */
#ifndef __TIZEN_SYSTEM_SYSTEM_INFO_H__
#define __TIZEN_SYSTEM_SYSTEM_INFO_H__

#include "system_info_type.h"

#ifdef __cplusplus
extern "C" {
#endif

/* A key may leave out its leading "http://". An unknown key gives
 * SYSTEM_INFO_ERROR_INVALID_PARAMETER. */
int system_info_get_platform_int(const char* key, int* value);

#ifdef __cplusplus
}
#endif

#endif /* __TIZEN_SYSTEM_SYSTEM_INFO_H__ */
