// A JSON text as a tree that remembers the line of everything in it.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace tessaly {

struct JsonKey {
    std::string name;
    int line = 1;
};

struct JsonNode {
    enum class Kind { Null, Flag, Number, Text, List, Object };

    Kind kind = Kind::Null;
    int line = 1;                 ///< where it begins, from 1
    bool flag = false;            ///< of a Flag
    double number = 0.0;          ///< of a Number, finite
    std::string text;             ///< of a Text, valid UTF-8
    std::vector<JsonNode> items;  ///< of a List or an Object
    std::vector<JsonKey> keys;    ///< of an Object, one an item
};

/// Parses a whole text. Besides what JSON forbids, refuses repeated keys, more than 16 levels,
/// more than 100 keys in one object and more than 500000 values.
/// @param name  how the text is called in errors
/// @throws SceneError
JsonNode parseJson(std::string_view text, const std::string& name);

}  // namespace tessaly
