/* Simulated Tizen platform: application control operations (app_control.h).
 * Only the operation names; launching is not simulated. */
#ifndef __TIZEN_APPFW_APP_CONTROL_H__
#define __TIZEN_APPFW_APP_CONTROL_H__

#include "tizen.h"

#define APP_CONTROL_OPERATION_MAIN "http://tizen.org/appcontrol/operation/main"
#define APP_CONTROL_OPERATION_DEFAULT "http://tizen.org/appcontrol/operation/default"

#endif /* __TIZEN_APPFW_APP_CONTROL_H__ */
