// Reads the tests' own lists of rooms, tails and the room menu.
#include "support/room_tables.h"

#include <fstream>
#include <sstream>
#include <stdexcept>

namespace tessaly::test {

namespace {

/// Lines of a list without its comments.
std::vector<std::string> linesOf(const char* name) {
    std::ifstream file(std::string(TESSALY_ROOM_LISTS) + "/" + name);
    if (!file) {
        throw std::runtime_error(std::string("cannot read ") + name);
    }
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);) {
        if (!line.empty() && line.front() != '#') {
            lines.push_back(line);
        }
    }
    return lines;
}

/// The columns of a line. A last column that is empty still counts.
std::vector<std::string> columnsOf(const std::string& line, std::size_t count) {
    std::vector<std::string> columns(1);
    for (const char character : line) {
        if (character == ';') {
            columns.emplace_back();
        } else if (character != ' ' || !columns.back().empty()) {
            columns.back() += character;
        }
    }
    for (std::string& column : columns) {
        column.erase(column.find_last_not_of(' ') + 1);
    }
    if (columns.size() != count) {
        throw std::runtime_error("wrong number of columns: " + line);
    }
    return columns;
}

template <typename T>
std::vector<T> numbersIn(const std::string& text) {
    std::istringstream stream(text);
    std::vector<T> numbers;
    for (T number; stream >> number;) {
        numbers.push_back(number);
    }
    if (!stream.eof()) {
        throw std::runtime_error("not a number: " + text);
    }
    return numbers;
}

template <typename T>
T numberIn(const std::string& text) {
    return numbersIn<T>(text).at(0);
}

bool yes(const std::string& text) {
    if (text != "yes" && text != "no") {
        throw std::runtime_error("neither yes nor no: " + text);
    }
    return text == "yes";
}

}  // namespace

std::vector<RoomLine> readRoomLines() {
    std::vector<RoomLine> rooms;
    for (const std::string& line : linesOf("rooms.txt")) {
        const std::vector<std::string> column = columnsOf(line, 13);
        RoomLine& room = rooms.emplace_back();
        room.preset = numberIn<int>(column[0]);
        room.records = numberIn<int>(column[1]);
        room.firSize = numberIn<int>(column[2]);
        room.gain = numberIn<float>(column[3]);
        room.cutOffs = numbersIn<float>(column[4]);
        room.walls = numbersIn<float>(column[5]);
        room.filtersRecords = yes(column[6]);
        room.filtersTail = yes(column[7]);
        room.azimuths = numbersIn<int>(column[8]);
        room.elevations = numbersIn<int>(column[9]);
        room.delays = numbersIn<int>(column[10]);
        room.gains = numbersIn<float>(column[11]);
        room.classes = numbersIn<int>(column[12]);
    }
    return rooms;
}

std::vector<TailLine> readTailLines() {
    std::vector<TailLine> tails;
    for (const std::string& line : linesOf("tails.txt")) {
        const std::vector<std::string> column = columnsOf(line, 5);
        tails.push_back({numberIn<int>(column[0]), numberIn<float>(column[1]),
                         numberIn<int>(column[2]), numbersIn<int>(column[3]), column[4]});
    }
    return tails;
}

std::vector<int> readRoomMenu() {
    std::vector<int> menu;
    for (const std::string& line : linesOf("menu.txt")) {
        const std::vector<int> presets = numbersIn<int>(line);
        menu.insert(menu.end(), presets.begin(), presets.end());
    }
    return menu;
}

}  // namespace tessaly::test
