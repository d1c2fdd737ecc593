/* Simulated Tizen platform: package manager (package_manager.h). */
#ifndef __TIZEN_APPFW_PACKAGE_MANAGER_H
#define __TIZEN_APPFW_PACKAGE_MANAGER_H

#include "tizen.h"
#include "package_info.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef enum {
  PACKAGE_MANAGER_ERROR_NONE = TIZEN_ERROR_NONE,
  PACKAGE_MANAGER_ERROR_INVALID_PARAMETER = TIZEN_ERROR_INVALID_PARAMETER,
  PACKAGE_MANAGER_ERROR_OUT_OF_MEMORY = TIZEN_ERROR_OUT_OF_MEMORY,
  PACKAGE_MANAGER_ERROR_IO_ERROR = TIZEN_ERROR_IO_ERROR,
  PACKAGE_MANAGER_ERROR_NO_SUCH_PACKAGE = TIZEN_ERROR_PACKAGE_MANAGER | 0x71,
  PACKAGE_MANAGER_ERROR_SYSTEM_ERROR = TIZEN_ERROR_PACKAGE_MANAGER | 0x72,
  PACKAGE_MANAGER_ERROR_PERMISSION_DENIED = TIZEN_ERROR_PERMISSION_DENIED
} package_manager_error_e;

typedef enum {
  PACKAGE_MANAGER_EVENT_TYPE_INSTALL = 0,
  PACKAGE_MANAGER_EVENT_TYPE_UNINSTALL = 1,
  PACKAGE_MANAGER_EVENT_TYPE_UPDATE = 2
} package_manager_event_type_e;

typedef enum {
  PACKAGE_MANAGER_EVENT_STATE_STARTED = 0,
  PACKAGE_MANAGER_EVENT_STATE_PROCESSING = 1,
  PACKAGE_MANAGER_EVENT_STATE_COMPLETED = 2,
  PACKAGE_MANAGER_EVENT_STATE_FAILED = 3
} package_manager_event_state_e;

/* Bit flags for package_manager_set_event_status; ALL (0) lets everything through. */
typedef enum {
  PACKAGE_MANAGER_STATUS_TYPE_ALL = 0x00,
  PACKAGE_MANAGER_STATUS_TYPE_INSTALL = 0x01,
  PACKAGE_MANAGER_STATUS_TYPE_UNINSTALL = 0x02,
  PACKAGE_MANAGER_STATUS_TYPE_UPGRADE = 0x04,
  PACKAGE_MANAGER_STATUS_TYPE_MOVE = 0x08,
  PACKAGE_MANAGER_STATUS_TYPE_CLEAR_DATA = 0x10,
  PACKAGE_MANAGER_STATUS_TYPE_INSTALL_PROGRESS = 0x20,
  PACKAGE_MANAGER_STATUS_TYPE_GET_SIZE = 0x40
} package_manager_status_type_e;

typedef enum {
  PACKAGE_MANAGER_REQUEST_MOVE_TO_INTERNAL = 0,
  PACKAGE_MANAGER_REQUEST_MOVE_TO_EXTERNAL = 1
} package_manager_move_type_e;

typedef enum {
  PACKAGE_MANAGER_COMPARE_MATCH = 0,
  PACKAGE_MANAGER_COMPARE_MISMATCH = 1,
  PACKAGE_MANAGER_COMPARE_LHS_NO_CERT = 2,
  PACKAGE_MANAGER_COMPARE_RHS_NO_CERT = 3,
  PACKAGE_MANAGER_COMPARE_BOTH_NO_CERT = 4
} package_manager_compare_result_type_e;

typedef enum {
  PACKAGE_MANAGER_PERMISSION_NORMAL = 0,
  PACKAGE_MANAGER_PERMISSION_SIGNATURE = 1,
  PACKAGE_MANAGER_PERMISSION_PRIVILEGE = 2
} package_manager_permission_type_e;

typedef enum {
  PACKAGE_MANAGER_REQUEST_MODE_DEFAULT = 0,
  PACKAGE_MANAGER_REQUEST_MODE_QUIET = 1
} package_manager_request_mode_e;

/* Unlike the application properties, these values are not the macro names. */
#define PACKAGE_MANAGER_PKGINFO_PROP_REMOVABLE "PMINFO_PKGINFO_PROP_PACKAGE_REMOVABLE"
#define PACKAGE_MANAGER_PKGINFO_PROP_READONLY "PMINFO_PKGINFO_PROP_PACKAGE_READONLY"
#define PACKAGE_MANAGER_PKGINFO_PROP_SUPPORT_DISABLE "PMINFO_PKGINFO_PROP_PACKAGE_SUPPORT_DISABLE"
#define PACKAGE_MANAGER_PKGINFO_PROP_DISABLE "PMINFO_PKGINFO_PROP_PACKAGE_DISABLE"
#define PACKAGE_MANAGER_PKGINFO_PROP_PRELOAD "PMINFO_PKGINFO_PROP_PACKAGE_PRELOAD"

typedef struct package_manager_s* package_manager_h;
typedef struct package_manager_filter_s* package_manager_filter_h;

typedef bool (*package_manager_package_info_cb)(package_info_h package_info, void* user_data);

/* |type| is the package type ("tpk", "wgt", ...), |package| its id; |progress|
 * runs from 0 to 100 and |error| means something only in the FAILED state. */
typedef void (*package_manager_event_cb)(const char* type, const char* package,
                                         package_manager_event_type_e event_type,
                                         package_manager_event_state_e event_state,
                                         int progress, package_manager_error_e error,
                                         void* user_data);

int package_manager_create(package_manager_h* manager);
int package_manager_destroy(package_manager_h manager);
int package_manager_set_event_status(package_manager_h manager, int status_type);
int package_manager_set_event_cb(package_manager_h manager, package_manager_event_cb callback,
                                 void* user_data);
int package_manager_unset_event_cb(package_manager_h manager);
/* Release the result with package_info_destroy. */
int package_manager_get_package_info(const char* package_id, package_info_h* package_info);

int package_manager_filter_create(package_manager_filter_h* handle);
int package_manager_filter_destroy(package_manager_filter_h handle);
int package_manager_filter_add_bool(package_manager_filter_h handle, const char* property,
                                    const bool value);
int package_manager_filter_count(package_manager_filter_h handle, int* count);
int package_manager_filter_foreach_package_info(package_manager_filter_h handle,
                                                package_manager_package_info_cb callback,
                                                void* user_data);

#ifdef __cplusplus
}
#endif

#endif /* __TIZEN_APPFW_PACKAGE_MANAGER_H */
