/* Simulated EFL e_dbus (E_DBus.h): an in-process bus on which the simulated
 * device sends signals to the handlers added here. */
#ifndef E_DBUS_H
#define E_DBUS_H

#include <dbus/dbus.h>

#ifndef EAPI
#define EAPI __attribute__((visibility("default")))
#endif

#define E_DBUS_VERSION_MAJOR 1
#define E_DBUS_VERSION_MINOR 8

#define E_DBUS_FDO_BUS "org.freedesktop.DBus"
#define E_DBUS_FDO_PATH "/org/freedesktop/DBus"
#define E_DBUS_FDO_INTERFACE E_DBUS_FDO_BUS
#define E_DBUS_FDO_INTERFACE_PROPERTIES "org.freedesktop.DBus.Properties"

#ifdef __cplusplus
extern "C" {
#endif

typedef struct E_DBus_Connection E_DBus_Connection;
typedef struct E_DBus_Object E_DBus_Object;
typedef struct E_DBus_Interface E_DBus_Interface;
typedef struct E_DBus_Signal_Handler E_DBus_Signal_Handler;
typedef struct E_DBus_Callback E_DBus_Callback;

typedef void (*E_DBus_Signal_Cb)(void* data, DBusMessage* msg);
typedef void (*E_DBus_Method_Return_Cb)(void* data, DBusMessage* msg, DBusError* error);

/* The init count: 1 or more on success, 0 on failure. */
EAPI int e_dbus_init(void);
/* The count left; 0 once fully shut down. */
EAPI int e_dbus_shutdown(void);

/* NULL on failure. */
EAPI E_DBus_Connection* e_dbus_bus_get(DBusBusType type);
EAPI void e_dbus_connection_close(E_DBus_Connection* conn);

/* A NULL or empty sender, path, interface or member matches anything. NULL on
 * failure. */
EAPI E_DBus_Signal_Handler* e_dbus_signal_handler_add(E_DBus_Connection* conn,
                                                      const char* sender, const char* path,
                                                      const char* interface,
                                                      const char* member,
                                                      E_DBus_Signal_Cb cb_signal, void* data);
EAPI void e_dbus_signal_handler_del(E_DBus_Connection* conn, E_DBus_Signal_Handler* sh);

#ifdef __cplusplus
}
#endif

#endif /* E_DBUS_H */
