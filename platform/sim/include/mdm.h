/* Simulated device-management library (mdm.h): a connection to the policy
 * service and the policy state of one application. */
#ifndef __MDM_H__
#define __MDM_H__

#ifdef __cplusplus
extern "C" {
#endif

typedef enum {
  MDM_RESULT_SERVICE_NOT_ENABLED = -5,
  MDM_RESULT_ACCESS_DENIED = -4,
  MDM_RESULT_INVALID_PARAM = -3,
  MDM_RESULT_NOT_SUPPORTED = -2,
  MDM_RESULT_FAIL = -1,
  MDM_RESULT_SUCCESS = 0
} mdm_result_t;

typedef enum {
  MDM_STATUS_ERROR = -1,
  MDM_ALLOWED = 0,
  MDM_RESTRICTED = 1,
  MDM_ENABLED = 0,
  MDM_DISABLED = 1,
  MDM_FALSE = 0,
  MDM_TRUE = 1
} mdm_status_t;

/* MDM_RESULT_SUCCESS when connected; each success wants one release. */
mdm_result_t mdm_get_service(void);
int mdm_release_service(void);
/* MDM_STATUS_ERROR without a connection. */
mdm_status_t mdm_get_application_state(const char* app_id);

#ifdef __cplusplus
}
#endif

#endif /* __MDM_H__ */
