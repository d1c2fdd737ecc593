// The simulated phone as a korrin-sim script: its packages (every property of
// every application), storage card, screen, device management and
// preferences, written as the device commands that make them. korrin-sim
// keeps a device root's phone in such a script beside its database, and
// `save` / `load` take snapshots in the same form; `run` replays one too.
#ifndef KORRIN_SIM_DEVICE_STATE_H_
#define KORRIN_SIM_DEVICE_STATE_H_

#include <string>

namespace korrin_sim {

// The script that makes the device's phone as it is now.
std::string DeviceScript();
// The file under device root |root| that keeps the phone between runs.
std::string DeviceFile(const std::string& root);
// Writes DeviceScript() to |file|, whole or not at all (written beside it,
// then renamed). Throws UsageError when it cannot.
void SaveDevice(const std::string& file);
// Replaces the phone with the one script |file| makes: its packages, card,
// screen, policy and preferences, silently (no event). Only device commands
// may appear in it. Throws UsageError, naming FILE:LINE, with the phone left
// as it was.
void LoadDevice(const std::string& file);

}  // namespace korrin_sim

#endif  // KORRIN_SIM_DEVICE_STATE_H_
