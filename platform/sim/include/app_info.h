/* Simulated Tizen platform: application information (app_info.h). */
#ifndef __TIZEN_APPFW_APP_INFO_H
#define __TIZEN_APPFW_APP_INFO_H

#include "tizen.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef struct app_info_s* app_info_h;
typedef struct app_info_filter_s* app_info_filter_h;
typedef struct app_info_metadata_filter_s* app_info_metadata_filter_h;

typedef enum {
  APP_INFO_EVENT_INSTALLED = 0,
  APP_INFO_EVENT_UNINSTALLED = 1,
  APP_INFO_EVENT_UPDATED = 2
} app_info_event_e;

/* The app_info_h given to the callback belongs to the platform and lives only
 * for the call; app_info_clone keeps a copy. */
typedef bool (*app_info_filter_cb)(app_info_h app_info, void* user_data);
typedef bool (*app_info_metadata_cb)(const char* metadata_key, const char* metadata_value,
                                     void* user_data);

#define PACKAGE_INFO_PROP_APP_ID "PACKAGE_INFO_PROP_APP_ID"
#define PACKAGE_INFO_PROP_APP_TYPE "PACKAGE_INFO_PROP_APP_TYPE"
#define PACKAGE_INFO_PROP_APP_CATEGORY "PACKAGE_INFO_PROP_APP_CATEGORY"
#define PACKAGE_INFO_PROP_APP_NODISPLAY "PACKAGE_INFO_PROP_APP_NODISPLAY"
#define PACKAGE_INFO_PROP_APP_TASKMANAGE "PACKAGE_INFO_PROP_APP_TASKMANAGE"

int app_info_create(const char* app_id, app_info_h* app_info);
int app_info_destroy(app_info_h app_info);
int app_info_clone(app_info_h* clone, app_info_h app_info);

/* Strings come back as heap copies that the caller frees. */
int app_info_get_app_id(app_info_h app_info, char** app_id);
int app_info_get_package(app_info_h app_info, char** package);
int app_info_get_icon(app_info_h app_info, char** path);
int app_info_get_label(app_info_h app_info, char** label);
int app_info_get_type(app_info_h app_info, char** type);
int app_info_is_nodisplay(app_info_h app_info, bool* nodisplay);
int app_info_is_enabled(app_info_h app_info, bool* enabled);
int app_info_is_preload(app_info_h app_info, bool* preload);
int app_info_foreach_metadata(app_info_h app_info, app_info_metadata_cb callback,
                              void* user_data);

/* The device maker's extension: whether the application is a game. */
int app_info_is_game(app_info_h app_info, bool* is_game);

int app_info_filter_create(app_info_filter_h* handle);
int app_info_filter_destroy(app_info_filter_h handle);
int app_info_filter_add_bool(app_info_filter_h handle, const char* property, const bool value);
int app_info_filter_add_string(app_info_filter_h handle, const char* property,
                               const char* value);
int app_info_filter_count_appinfo(app_info_filter_h handle, int* count);
int app_info_filter_foreach_appinfo(app_info_filter_h handle, app_info_filter_cb callback,
                                    void* user_data);

#ifdef __cplusplus
}
#endif

#endif /* __TIZEN_APPFW_APP_INFO_H */
