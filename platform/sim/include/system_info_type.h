/* Simulated Tizen platform: system information types (system_info_type.h). */
#ifndef __TIZEN_SYSTEM_SYSTEM_INFO_TYPE_H__
#define __TIZEN_SYSTEM_SYSTEM_INFO_TYPE_H__

#include "tizen.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef enum {
  SYSTEM_INFO_ERROR_NONE = TIZEN_ERROR_NONE,
  SYSTEM_INFO_ERROR_INVALID_PARAMETER = TIZEN_ERROR_INVALID_PARAMETER,
  SYSTEM_INFO_ERROR_OUT_OF_MEMORY = TIZEN_ERROR_OUT_OF_MEMORY,
  SYSTEM_INFO_ERROR_IO_ERROR = TIZEN_ERROR_IO_ERROR,
  SYSTEM_INFO_ERROR_PERMISSION_DENIED = TIZEN_ERROR_PERMISSION_DENIED
} system_info_error_e;

#ifdef __cplusplus
}
#endif

#endif /* __TIZEN_SYSTEM_SYSTEM_INFO_TYPE_H__ */
