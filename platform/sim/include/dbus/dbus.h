/* Simulated libdbus: the few types the e_dbus calls use, and readers of a
 * received message. No connection of its own. */
#ifndef DBUS_H
#define DBUS_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef uint32_t dbus_bool_t;

typedef enum {
  DBUS_BUS_SESSION = 0,
  DBUS_BUS_SYSTEM = 1,
  DBUS_BUS_STARTER = 2
} DBusBusType;

typedef struct DBusMessage DBusMessage;
typedef struct DBusConnection DBusConnection;
typedef struct DBusPendingCall DBusPendingCall;

typedef struct DBusError DBusError;
struct DBusError {
  const char* name;
  const char* message;
  unsigned int dummy1 : 1;
  unsigned int dummy2 : 1;
  unsigned int dummy3 : 1;
  unsigned int dummy4 : 1;
  unsigned int dummy5 : 1;
  void* padding1;
};

const char* dbus_message_get_path(DBusMessage* message);
const char* dbus_message_get_interface(DBusMessage* message);
const char* dbus_message_get_member(DBusMessage* message);
const char* dbus_message_get_sender(DBusMessage* message);
dbus_bool_t dbus_message_is_signal(DBusMessage* message, const char* iface,
                                   const char* signal_name);

#ifdef __cplusplus
}
#endif

#endif /* DBUS_H */
