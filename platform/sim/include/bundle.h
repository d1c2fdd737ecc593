/* Simulated Tizen platform: bundles of string pairs (bundle.h). */
#ifndef __BUNDLE_H__
#define __BUNDLE_H__

#include <errno.h>
#include <stddef.h>

#include "tizen_error.h"

/* The device header defines these three macros too; having them here keeps
 * code that would clash with them from building off the device. */
#ifndef API
#define API __attribute__((visibility("default")))
#endif
#ifndef likely
#define likely(x) __builtin_expect(x, 1)
#endif
#ifndef unlikely
#define unlikely(x) __builtin_expect(x, 0)
#endif

#ifdef __cplusplus
extern "C" {
#endif

typedef enum {
  BUNDLE_ERROR_NONE = TIZEN_ERROR_NONE,
  BUNDLE_ERROR_OUT_OF_MEMORY = TIZEN_ERROR_OUT_OF_MEMORY,
  BUNDLE_ERROR_INVALID_PARAMETER = TIZEN_ERROR_INVALID_PARAMETER,
  BUNDLE_ERROR_KEY_NOT_AVAILABLE = TIZEN_ERROR_KEY_NOT_AVAILABLE,
  BUNDLE_ERROR_KEY_EXISTS = TIZEN_ERROR_BUNDLE | 0x01
} bundle_error_e;

typedef struct _bundle_t bundle;
typedef unsigned char bundle_raw;

/* NULL on failure (get_last_result() tells why). */
bundle* bundle_create(void);
int bundle_free(bundle* b);
/* BUNDLE_ERROR_KEY_EXISTS when |key| is already there. */
int bundle_add_str(bundle* b, const char* key, const char* str);
/* |str| points into the bundle: do not free it. */
int bundle_get_str(bundle* b, const char* key, char** str);
int bundle_get_count(bundle* b);

#ifdef __cplusplus
}
#endif

#endif /* __BUNDLE_H__ */
