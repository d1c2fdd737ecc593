// The sample device of the demo and of tests that want a lived-in phone: a
// few dozen games from invented studios, a game pack with two games, the
// maker's own applications, a no-display helper, a deactivated package, a web
// game and a game without an icon. Labels and ids are made up.
#include <app_control.h>

#include "state.h"

namespace sim {

namespace {

struct SampleGame {
  const char* id;
  const char* label;
};

const SampleGame kGames[] = {
    {"com.tidewright.lanternharbor", "Lantern Harbor"},
    {"com.tidewright.mossbackrally", "Mossback Rally"},
    {"com.quillpine.pebbleorchard", "Pebble Orchard"},
    {"com.quillpine.copperleafknights", "Copperleaf Knights"},
    {"com.starwick.orbitgardener", "Orbit Gardener"},
    {"com.starwick.gearboxriddles", "Gearbox Riddles"},
    {"com.ferrowind.nightjarlanes", "Nightjar Lanes"},
    {"com.ferrowind.marblemeadow", "Marble Meadow Run"},
    {"com.ottervale.glacierputt", "Glacier Putt"},
    {"com.inkmoor.wordthicket", "Word Thicket"},
    {"com.inkmoor.embertactics", "Ember Tactics"},
    {"com.inkmoor.kiteoverkelp", "Kite over Kelp"},
    {"com.sandreel.dunecourier", "Dune Courier"},
    {"com.sandreel.velvetgambit", "Velvet Gambit"},
    {"com.sandreel.burrowbakery", "Burrow Bakery"},
    {"com.pinecrest.hollowlanebowling", "Hollow Lane Bowling"},
    {"com.pinecrest.brickwindbandits", "Brickwind Bandits"},
    {"com.pinecrest.cometpickers", "Comet Pickers"},
    {"com.glowmark.lumenlabyrinth", "Lumen Labyrinth"},
    {"com.frostpath.snowfortsiege", "Snowfort Siegecraft"},
    {"com.frostpath.honeycombheist", "Honeycomb Heist"},
    {"com.reedlight.pixelpondkeeper", "Pixel Pondkeeper"},
    {"com.redmesa.canyonskittles", "Canyon Skittles"},
    {"com.redmesa.quartzquarry", "Quartz Quarry"},
    {"com.redmesa.abaconocturno", "\xc3\x81" "baco Nocturno"},
    {"com.redmesa.zephyrdrift", "zephyr drift"},
};

Package GamePackage(const std::string& id, const std::string& label) {
  return MakePackage(id, {GameApp(id, label)});
}

// Preloaded by the maker: not removable, but the user may deactivate it.
Package Preloaded(Package pkg) {
  pkg.preload = true;
  pkg.removable = false;
  pkg.supportDisable = true;
  return pkg;
}

Package MakerApp(const std::string& id, const std::string& label) {
  return Preloaded(MakePackage(id, {PlainApp(id, label)}));
}

}  // namespace

void Device::LoadSampleDevice() {
  for (const SampleGame& game : kGames) AddPackage(GamePackage(game.id, game.label));

  // A game with a background service that never shows on the home screen.
  Package ferret = GamePackage("com.ottervale.rocketferret", "Rocket Ferret");
  App sync = PlainApp("com.ottervale.rocketferret.sync", "Rocket Ferret Sync");
  sync.noDisplay = true;
  sync.component = PACKAGE_INFO_SERVICEAPP;
  ferret.apps.push_back(sync);
  AddPackage(ferret);

  AddPackage(MakePackage("com.starwick.tilepack",
                         {GameApp("com.starwick.tilepack.tide", "Tide Tiles"),
                          GameApp("com.starwick.tilepack.ember", "Ember Tiles")}));

  Package ferry = GamePackage("com.glowmark.paperferry", "Paper Ferry");
  ferry.type = "wgt";
  ferry.apps[0].type = "webapp";
  AddPackage(ferry);

  Package ledger = GamePackage("com.glowmark.runeledger", "Rune Ledger");
  ledger.apps[0].metadata.push_back(std::make_pair(
      std::string("http://velmora.com/tizen/metadata/menu/launch/operation"),
      std::string(APP_CONTROL_OPERATION_MAIN)));
  AddPackage(ledger);

  Package stones = GamePackage("com.reedlight.quietstones", "Quiet Stones");
  stones.apps[0].icon.reset();
  AddPackage(stones);

  AddPackage(Preloaded(GamePackage("com.reedlight.starlingpatience", "Starling Patience")));

  Package tortoise = Preloaded(GamePackage("com.frostpath.turbotortoise", "Turbo Tortoise"));
  tortoise.disabled = true;
  AddPackage(tortoise);

  // The maker's own applications.
  Package settings = MakerApp("com.velmora.settings", "Settings");
  settings.system = true;
  settings.supportDisable = false;
  AddPackage(settings);
  AddPackage(MakerApp("com.velmora.memo", "Memo"));
  AddPackage(MakerApp("com.velmora.gallery", "Gallery"));
  Package calculator = MakerApp("com.velmora.calculator", "Calculator");
  calculator.apps[0].categories.push_back("http://velmora.com/category/floatingapp");
  AddPackage(calculator);

  App booster = GameApp("com.velmora.gamebooster", "Game Booster");
  booster.noDisplay = true;
  AddPackage(Preloaded(MakePackage("com.velmora.gamebooster", {booster})));

  SetSystemInfo("http://tizen.org/feature/screen.width", 720);
  SetSystemInfo("http://tizen.org/feature/screen.height", 1280);
  SetStorageCard(false);
}

}  // namespace sim
