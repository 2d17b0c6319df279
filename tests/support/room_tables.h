// The rooms, tails and the room menu as they were authored, read from the tests' own lists.
#pragma once

#include <string>
#include <vector>

namespace tessaly::test {

/// One line of engine/data/rooms.txt; lists in record order.
struct RoomLine {
    int preset = 0;
    int records = 0;
    int firSize = 0;             ///< frames
    float gain = 0.0f;           ///< linear
    std::vector<float> cutOffs;  ///< Hz: class 0, class 1, tail
    std::vector<float> walls;    ///< metres: above, below, front, back, both sides; -1 none
    bool filtersRecords = false;
    bool filtersTail = false;
    std::vector<int> azimuths;    ///< degrees
    std::vector<int> elevations;  ///< degrees
    std::vector<int> delays;      ///< samples at 44100 Hz
    std::vector<float> gains;     ///< linear
    std::vector<int> classes;     ///< 0 or 1
};

/// One line of engine/data/tails.txt.
struct TailLine {
    int preset = 0;
    float gain = 0.0f;        ///< linear
    int length48000 = 0;      ///< frames as authored; 0: no tail
    std::vector<int> frames;  ///< as loaded at 24000, 44100 and 48000 Hz
    std::string name;         ///< with its leading "/"
};

/// The lists, in file order. Each throws std::runtime_error if its file cannot be read or a line
/// has the wrong number of columns.
std::vector<RoomLine> readRoomLines();
std::vector<TailLine> readTailLines();
/// Preset by "Room Selection"; 0: no room.
std::vector<int> readRoomMenu();

}  // namespace tessaly::test
