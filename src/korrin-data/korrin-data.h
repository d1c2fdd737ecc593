// The data engine of the Korrin launcher: what a launcher application links
// against. It owns the two long-lived managers (one layout store, one package
// tracker), built when the library is loaded and destroyed when it is
// unloaded, and wires the tracker's package notifications to the store.
//
// A host calls data_engin_initialization() once from its main-loop thread,
// then uses the two managers through their public operations from that same
// thread. Everything, package events included, runs on that thread: the
// engine starts no thread and takes no lock.
#ifndef KORRIN_DATA_KORRIN_DATA_H_
#define KORRIN_DATA_KORRIN_DATA_H_

#include "launcher-data-manager/launcher-data-manager.h"
#include "launcher-package-manager/launcher-package-manager.h"

#ifdef __cplusplus
extern "C" {
#endif

// Hands the package tracker the five callbacks and starts listening, opens
// the layout database (filling it with the installed games on first launch)
// while completed package operations are held back, then processes those in
// completion order. No step's result is checked; calling it again repeats
// every step. The name is kept as launchers look it up.
void data_engin_initialization(void);

// Does nothing: the managers live until the library is unloaded.
void data_engin_uninitialization(void);

// Returns 1, and does nothing else: a host may look it up to see that the
// library is present and loadable.
int korrin_data_probe(void);

#ifdef __cplusplus
}  // extern "C"
#endif

namespace korrin {

// The library's two managers. They live as long as the library is loaded;
// the package manager is destroyed first at unload, then the store.
LauncherDataManager& DataManager();
LauncherPackageManager& PackageManager();

}  // namespace korrin

#endif  // KORRIN_DATA_KORRIN_DATA_H_
