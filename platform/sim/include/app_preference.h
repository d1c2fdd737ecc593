/* Simulated Tizen platform: preferences (app_preference.h). Integer values only. */
#ifndef __TIZEN_APPFW_PREFERENCE_H__
#define __TIZEN_APPFW_PREFERENCE_H__

#include "tizen.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef enum {
  PREFERENCE_ERROR_NONE = TIZEN_ERROR_NONE,
  PREFERENCE_ERROR_INVALID_PARAMETER = TIZEN_ERROR_INVALID_PARAMETER,
  PREFERENCE_ERROR_OUT_OF_MEMORY = TIZEN_ERROR_OUT_OF_MEMORY,
  PREFERENCE_ERROR_NO_KEY = TIZEN_ERROR_APPLICATION | 0x30,
  PREFERENCE_ERROR_IO_ERROR = TIZEN_ERROR_IO_ERROR
} preference_error_e;

/* PREFERENCE_ERROR_NO_KEY when |key| is absent. */
int preference_get_int(const char* key, int* value);
int preference_set_int(const char* key, int value);
int preference_is_existing(const char* key, bool* existing);
int preference_remove(const char* key);

#ifdef __cplusplus
}
#endif

#endif /* __TIZEN_APPFW_PREFERENCE_H__ */
