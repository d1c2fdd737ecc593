// e_dbus on an in-process bus: the init count, connections, signal
// subscriptions, and the signals the control interface sends to them. A
// connection takes its remaining subscriptions with it when it closes.
#include <E_DBus.h>

#include <algorithm>

#include "state.h"

using sim::HandleKind;

namespace {

std::string Text(const char* text) { return text != NULL ? text : ""; }

bool Accepts(const std::string& wanted, const std::string& actual) {
  return wanted.empty() || wanted == actual;
}

bool Matches(const E_DBus_Signal_Handler& handler, const DBusMessage& message) {
  return Accepts(handler.sender, message.sender) && Accepts(handler.path, message.path) &&
         Accepts(handler.interface, message.interface) && Accepts(handler.member, message.member);
}

void RemoveHandler(E_DBus_Signal_Handler* handler) {
  std::vector<E_DBus_Signal_Handler*>& handlers = sim::TheState().held.busHandlers;
  handlers.erase(std::remove(handlers.begin(), handlers.end(), handler), handlers.end());
  sim::Untrack(handler, HandleKind::kBusSignalHandler);
  delete handler;
}

const char* Field(DBusMessage* message, std::string DBusMessage::*field) {
  return message != NULL ? (message->*field).c_str() : NULL;
}

}  // namespace

namespace sim {

int Device::SendBusSignal(const std::string& path, const std::string& interface,
                          const std::string& member, const std::string& sender) {
  if (TheState().held.busInitCount == 0) return 0;
  DBusMessage message{sender, path, interface, member};
  // A handler may delete itself, or others, while it runs.
  std::vector<E_DBus_Signal_Handler*> handlers = TheState().held.busHandlers;
  int called = 0;
  for (E_DBus_Signal_Handler* handler : handlers) {
    if (!IsLive(handler, HandleKind::kBusSignalHandler)) continue;
    if (handler->connection->type != DBUS_BUS_SYSTEM || !Matches(*handler, message)) continue;
    ++called;
    handler->callback(handler->data, &message);
  }
  return called;
}

int Device::SendBootDone() {
  return SendBusSignal("/Org/Tizen/System/DeviceD/Core", "org.tizen.system.deviced.core",
                       "BootingDone");
}

int Device::BusInitCount() const { return TheState().held.busInitCount; }

int Device::BusSubscriptions() const {
  return static_cast<int>(TheState().held.busHandlers.size());
}

}  // namespace sim

extern "C" {

int e_dbus_init(void) {
  if (sim::Enter("e_dbus_init")) return 0;
  return ++sim::TheState().held.busInitCount;
}

int e_dbus_shutdown(void) {
  sim::Count("e_dbus_shutdown");
  int& count = sim::TheState().held.busInitCount;
  if (count > 0) --count;
  return count;
}

E_DBus_Connection* e_dbus_bus_get(DBusBusType type) {
  if (sim::Enter("e_dbus_bus_get")) return NULL;
  if (sim::TheState().held.busInitCount == 0) return NULL;
  if (type != DBUS_BUS_SESSION && type != DBUS_BUS_SYSTEM && type != DBUS_BUS_STARTER) {
    return NULL;
  }
  E_DBus_Connection* connection = new E_DBus_Connection{type};
  sim::Track(connection, HandleKind::kBusConnection);
  return connection;
}

void e_dbus_connection_close(E_DBus_Connection* conn) {
  sim::Count("e_dbus_connection_close");
  if (!sim::Untrack(conn, HandleKind::kBusConnection)) return;
  std::vector<E_DBus_Signal_Handler*> handlers = sim::TheState().held.busHandlers;
  for (E_DBus_Signal_Handler* handler : handlers) {
    if (handler->connection == conn) RemoveHandler(handler);
  }
  delete conn;
}

E_DBus_Signal_Handler* e_dbus_signal_handler_add(E_DBus_Connection* conn, const char* sender,
                                                 const char* path, const char* interface,
                                                 const char* member, E_DBus_Signal_Cb cb_signal,
                                                 void* data) {
  if (sim::Enter("e_dbus_signal_handler_add")) return NULL;
  if (!sim::IsLive(conn, HandleKind::kBusConnection) || cb_signal == NULL) return NULL;
  E_DBus_Signal_Handler* handler = new E_DBus_Signal_Handler{
      conn, Text(sender), Text(path), Text(interface), Text(member), cb_signal, data};
  sim::Track(handler, HandleKind::kBusSignalHandler);
  sim::TheState().held.busHandlers.push_back(handler);
  return handler;
}

void e_dbus_signal_handler_del(E_DBus_Connection* conn, E_DBus_Signal_Handler* sh) {
  sim::Count("e_dbus_signal_handler_del");
  if (!sim::IsLive(sh, HandleKind::kBusSignalHandler) || sh->connection != conn) return;
  RemoveHandler(sh);
}

const char* dbus_message_get_path(DBusMessage* message) {
  return Field(message, &DBusMessage::path);
}

const char* dbus_message_get_interface(DBusMessage* message) {
  return Field(message, &DBusMessage::interface);
}

const char* dbus_message_get_member(DBusMessage* message) {
  return Field(message, &DBusMessage::member);
}

const char* dbus_message_get_sender(DBusMessage* message) {
  return Field(message, &DBusMessage::sender);
}

dbus_bool_t dbus_message_is_signal(DBusMessage* message, const char* iface,
                                   const char* signal_name) {
  return message != NULL && iface != NULL && signal_name != NULL &&
         message->interface == iface && message->member == signal_name;
}

}  // extern "C"
