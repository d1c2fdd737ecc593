/* Simulated usage-log client (libcore-velmora-log-client): sends a bundle of
 * string pairs to a log provider of the device's usage-log service. */
#ifndef __VELMORA_LOG_MANAGER_H__
#define __VELMORA_LOG_MANAGER_H__

#include "bundle.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef enum {
  VELMORA_LOG_MANAGER_ERROR_NONE = TIZEN_ERROR_NONE,
  VELMORA_LOG_MANAGER_ERROR_INVALID_PARAMETER = TIZEN_ERROR_INVALID_PARAMETER,
  VELMORA_LOG_MANAGER_ERROR_OUT_OF_MEMORY = TIZEN_ERROR_OUT_OF_MEMORY,
  VELMORA_LOG_MANAGER_ERROR_IO_ERROR = TIZEN_ERROR_IO_ERROR
} velmora_log_manager_error_e;

typedef struct velmora_log_manager_s* velmora_log_manager_h;

/* Told the outcome of one insert; |request_id| is the one insert handed out. */
typedef void (*velmora_log_manager_insert_cb)(int result, int request_id, void* user_data);

int velmora_log_manager_create(velmora_log_manager_h* handle);
int velmora_log_manager_destroy(velmora_log_manager_h handle);
/* Sends a copy of |data| to the provider at |provider_uri|. |callback| may be
 * NULL; |request_id|, when not NULL, receives the request's id. */
int velmora_log_manager_insert(velmora_log_manager_h handle, const char* provider_uri,
                               bundle* data, velmora_log_manager_insert_cb callback,
                               void* user_data, int* request_id);

#ifdef __cplusplus
}
#endif

#endif /* __VELMORA_LOG_MANAGER_H__ */
