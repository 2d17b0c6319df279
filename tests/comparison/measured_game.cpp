// The game with the measured data set, and its rooms for the reference.
#include "comparison/measured_game.h"

#include <filesystem>
#include <map>
#include <string>
#include <utility>

#include "support/reference/reference_rooms.h"

namespace tessaly::test {

namespace {

const std::string dataDirectory = TESSALY_TEST_DATA;

const reference::Tail& tailOf(int preset, int sampleRate) {
    static std::map<std::pair<int, int>, reference::Tail> tails;
    const auto [at, fresh] = tails.try_emplace({preset, sampleRate});
    if (fresh) {
        at->second = reference::packedTailOf(dataDirectory, preset, sampleRate);
    }
    return at->second;
}

}  // namespace

bool measuredSetThere() { return std::filesystem::exists(dataDirectory + "/TSLdata511.dat"); }

Game& measuredGame() {
    static Game theGame(dataDirectory);
    return theGame;
}

void takeRooms(reference::Handler& handler) {
    handler.adjustOptions = [](reference::EngineOptions& options) {
        options.presetRow = reference::presetRowOf(options.earlyFlexRefPreset);
        if (options.qvReverb > 0) {
            options.tail = tailOf(options.qvReverb, options.sampleRate);
        }
    };
}

void setWalls(const std::array<float, 6>& metres) {
    measuredGame().library.setRoomDistances(metres);
    measuredGame().process.roomDistances = metres;
    measuredGame().process.roomDistancesSet = true;
}

}  // namespace tessaly::test
