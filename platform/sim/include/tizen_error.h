/* Simulated Tizen platform: common error codes (tizen_error.h). */
#ifndef __TIZEN_COMMON_ERROR_H__
#define __TIZEN_COMMON_ERROR_H__

#include <errno.h>

#ifdef __cplusplus
extern "C" {
#endif

#define TIZEN_ERROR_MIN_PLATFORM_ERROR (-1073741824LL)

/* Module bases: module error codes are a module base OR a small code. */
#define TIZEN_ERROR_APPLICATION -0x01100000
#define TIZEN_ERROR_APPLICATION_MANAGER -0x01110000
#define TIZEN_ERROR_PACKAGE_MANAGER -0x01150000
#define TIZEN_ERROR_BUNDLE -0x01180000
#define TIZEN_ERROR_DLOG -0x02410000
#define TIZEN_ERROR_SYSTEM_INFORMATION -0x02450000

typedef enum {
  TIZEN_ERROR_NONE = 0,
  TIZEN_ERROR_NOT_PERMITTED = -EPERM,
  TIZEN_ERROR_IO_ERROR = -EIO,
  TIZEN_ERROR_OUT_OF_MEMORY = -ENOMEM,
  TIZEN_ERROR_PERMISSION_DENIED = -EACCES,
  TIZEN_ERROR_FILE_EXISTS = -EEXIST,
  TIZEN_ERROR_INVALID_PARAMETER = -EINVAL,
  TIZEN_ERROR_KEY_NOT_AVAILABLE = -ENOKEY,
  TIZEN_ERROR_UNKNOWN = (int)TIZEN_ERROR_MIN_PLATFORM_ERROR,
  TIZEN_ERROR_TIMED_OUT,
  TIZEN_ERROR_NOT_SUPPORTED
} tizen_error_e;

int get_last_result(void);
void set_last_result(int result);
char* get_error_message(int result);

#ifdef __cplusplus
}
#endif

#endif /* __TIZEN_COMMON_ERROR_H__ */
