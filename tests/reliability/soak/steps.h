// The soak's steps, and the generator that draws a random but reproducible
// stream of them: package operations, raw package events, quiet changes of
// the device, pause and replay of listening, boot-done, restarts, and the
// launcher's own pages and shortcuts, which give the placement and the gap
// closing more than one page and cells left free.
#ifndef KORRIN_TESTS_SOAK_STEPS_H_
#define KORRIN_TESTS_SOAK_STEPS_H_

#include <cstdint>
#include <optional>
#include <random>
#include <string>
#include <vector>

#include "sim/device.h"

namespace soak {

class Model;

struct Step {
  enum Op {
    kQuietAdd,     // the device gains (or replaces) |pkg| without an event
    kQuietRemove,  // the device loses |pkgId| without an event
    kStart,        // data_engin_initialization(), the first time; |pkg|, if named,
                   // is installed while the store is being filled
    kRestart,      // data_engin_initialization() again
    kInstall,      // |pkg| installed: STARTED, PROCESSING, COMPLETED
    kUpdate,       // |pkg| updated: the same
    kUninstall,    // |pkgId| uninstalled: the same
    kEvent,        // one raw event of |eventType| and |eventState| for |pkgId|
    kPause,        // PauseListenCb()
    kListen,       // StartListenCb()
    kBootDone,     // the card status, games marked on the card, the signal
    kAddPage,      // the launcher appends page |pageNo| to menu 1
    kShortcut,     // the launcher stores a shortcut (box type 3) of |appId|
  };
  Op op;
  sim::Package pkg;
  std::string pkgId;
  std::string change;  // what an update changes, for the reader
  int eventType = 0, eventState = 0;
  bool subscribe = false;            // boot-done: subscribe first
  int card = 0;                      // boot-done: the storage-card status
  std::vector<std::string> onCard;  // boot-done: marked as living on the card
  // The launcher's page and shortcut: the page number, and the shortcut's
  // page, cell and what it carries ("" is stored as NULL).
  int pageNo = 0, pageId = 0, col = 0, row = 0, launchType = 0;
  std::string appId, name, iconPath, content;
};

// One line a person reads: "install p7 [a game \"Tide\", b plain \"Notes\" hidden]".
std::string Describe(const Step& step);

// The same seed gives the same steps on every platform: draws are made from
// std::mt19937's raw output, whose sequence the standard fixes, and never
// through the library's distributions, whose algorithms it leaves open.
class Generator {
 public:
  explicit Generator(uint32_t seed);

  // The next step, drawn from what |model| says the device and engine hold.
  Step Next(const Model& model);

 private:
  uint32_t Below(uint32_t n);  // uniform in [0, n)
  bool OneIn(uint32_t n) { return Below(n) == 0; }
  template <typename T>
  const T& Pick(const std::vector<T>& items) {
    return items[Below(static_cast<uint32_t>(items.size()))];
  }

  Step Setup(const Model& model);
  Step Install(const Model& model);
  Step Update(const Model& model);
  Step RawEvent(const Model& model);
  Step BootDone(const Model& model);
  Step Shortcut(const Model& model);
  sim::Package NewPackage(const std::string& pkgId);
  sim::App NewApp(const std::string& pkgId, char letter);
  std::string PoolPackage();
  void Touch(const std::string& pkgId);
  std::optional<std::string> Label();

  std::mt19937 m_rng;
  int m_setupSteps;  // quiet adds before the start
  // Packages that raw events and quiet changes touched lately: further raw
  // events favour them, so that one package sees whole sequences (a quiet
  // add, STARTED, FAILED, a late COMPLETED) rather than lone events.
  std::vector<std::string> m_recent;
};

}  // namespace soak

#endif  // KORRIN_TESTS_SOAK_STEPS_H_
