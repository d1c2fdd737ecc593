/* Simulated Tizen platform: umbrella header (tizen.h). */
#ifndef __TIZEN_H__
#define __TIZEN_H__

#include "tizen_type.h"
#include "tizen_error.h"

#ifndef EXPORT_API
#define EXPORT_API __attribute__((visibility("default")))
#endif

#endif /* __TIZEN_H__ */
