// The simulated Tizen device behind the platform's C calls, and the control
// interface through which tests and tools set it up and watch it.
//
// There is one device per process. Its C calls (dlog, and the application,
// package, preference and bus calls added beside it) read and change the state
// kept here; nothing is delivered on another thread.
#ifndef KORRIN_SIM_DEVICE_H_
#define KORRIN_SIM_DEVICE_H_

#include <string>
#include <vector>

namespace sim {

// One line of the platform log, as the engine wrote it.
struct LogLine {
  int priority;      // dlog priority: DLOG_WARN is 5, DLOG_ERROR is 6
  std::string tag;
  std::string text;  // the formatted message
};

class Device {
 public:
  // The device of this process.
  static Device& Get();

  // Forgets everything the device was told or recorded, as if freshly booted.
  // The device root stays where it is.
  void Reset();

  // ---- Device root: where the device's file system lives on this machine.

  // Lays out |dir| as an installed launcher finds its device (the launcher's
  // data folder exists) and points KORRIN_SIM_ROOT at it. Returns false when a
  // folder cannot be made.
  bool UseRoot(const std::string& dir);
  // The current root (KORRIN_SIM_ROOT), or "" when none is set.
  std::string Root() const;
  // |devicePath| (an absolute path on the device) as a path on this machine.
  std::string HostPath(const std::string& devicePath) const;

  // ---- Platform log.

  // Every dlog line since the last Reset or ClearLogs, oldest first.
  const std::vector<LogLine>& Logs() const;
  void ClearLogs();
  // Also print each new line to stderr as "P/tag(pid): text". On by default
  // when the environment sets KORRIN_SIM_LOG=stderr.
  void EchoLogs(bool on);

 private:
  Device();
  Device(const Device&);
  Device& operator=(const Device&);
};

}  // namespace sim

#endif  // KORRIN_SIM_DEVICE_H_
