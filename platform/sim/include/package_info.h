/* Simulated Tizen platform: package information (package_info.h). */
#ifndef __TIZEN_APPFW_PACKAGE_INFO_H
#define __TIZEN_APPFW_PACKAGE_INFO_H

#include "tizen.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef struct package_info_s* package_info_h;

typedef enum {
  PACKAGE_INFO_ALLAPP = 0,
  PACKAGE_INFO_UIAPP = 1,
  PACKAGE_INFO_SERVICEAPP = 2
} package_info_app_component_type_e;

typedef enum {
  PACKAGE_INFO_INTERNAL_STORAGE = 0,
  PACKAGE_INFO_EXTERNAL_STORAGE = 1
} package_info_installed_storage_type_e;

typedef bool (*package_info_app_cb)(package_info_app_component_type_e comp_type,
                                    const char* app_id, void* user_data);

int package_info_create(const char* package, package_info_h* package_info);
int package_info_destroy(package_info_h package_info);
int package_info_is_system_package(package_info_h package_info, bool* system);
int package_info_is_removable_package(package_info_h package_info, bool* removable);
int package_info_is_preload_package(package_info_h package_info, bool* preload);
/* The component type comes before the callback. */
int package_info_foreach_app_from_package(package_info_h package_info,
                                          package_info_app_component_type_e comp_type,
                                          package_info_app_cb callback, void* user_data);

#ifdef __cplusplus
}
#endif

#endif /* __TIZEN_APPFW_PACKAGE_INFO_H */
