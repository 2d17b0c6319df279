// Checks of single values and the words for what is wrong with them.
#include "scene/scene_value.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <utility>

#include "scene/near_names.h"
#include "scene/scene_error.h"

namespace tessaly {

namespace {

constexpr std::size_t longestText = 1000;  // characters

// What the value is, for "got ...".
std::string described(const JsonNode& node) {
    switch (node.kind) {
        case JsonNode::Kind::Flag:
            return node.flag ? "true" : "false";
        case JsonNode::Kind::Number:
            return fmt::format("{}", node.number);
        case JsonNode::Kind::Text:
            return inQuotes(node.text);
        case JsonNode::Kind::List:
            return "a list";
        case JsonNode::Kind::Object:
            return "an object";
        default:
            return "null";
    }
}

bool plainWord(std::string_view text) {
    return !text.empty() && text.size() <= 40 && std::all_of(text.begin(), text.end(), [](char c) {
        return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
               c == '_' || c == '$';
    });
}

[[noreturn]] void failAt(const std::string& document,
                         int line,
                         const std::string& path,
                         std::string_view reason) {
    throw SceneError(
        fmt::format("{}:{}: {}{}{}", document, line, path, path.empty() ? "" : ": ", reason));
}

std::string listed(std::span<const std::string_view> choices) {
    std::string text;
    for (std::size_t i = 0; i < choices.size(); ++i) {
        text += i == 0 ? "" : i + 1 == choices.size() ? " or " : ", ";
        text += fmt::format("\"{}\"", choices[i]);
    }
    return text;
}

}  // namespace

SceneValue::SceneValue(const JsonNode& root, const std::string& document)
    : node(&root), name(&document) {}

SceneValue::SceneValue(const JsonNode& child, const SceneValue& parent, std::string childPath)
    : node(&child), name(parent.name), path(std::move(childPath)) {}

void SceneValue::fail(std::string_view reason) const { failAt(*name, node->line, path, reason); }

void SceneValue::failWrongKind(std::string_view wanted) const {
    fail(fmt::format("must be {}, got {}", wanted, described(*node)));
}

double SceneValue::number(double low, double high) const {
    if (!isNumber()) {
        failWrongKind("a number");
    }
    if (!(node->number >= low && node->number <= high)) {
        fail(fmt::format("must be {} to {}, got {}", low, high, node->number));
    }
    return node->number;
}

int SceneValue::wholeNumber(int low, int high) const {
    if (!isNumber() || node->number != std::floor(node->number)) {
        failWrongKind("a whole number");
    }
    return static_cast<int>(number(low, high));
}

bool SceneValue::flag() const {
    if (node->kind != JsonNode::Kind::Flag) {
        failWrongKind("true or false");
    }
    return node->flag;
}

std::string SceneValue::text() const {
    if (!isText()) {
        failWrongKind("a text");
    }
    // Continuation bytes of UTF-8 are no characters of their own.
    const auto length =
        static_cast<std::size_t>(std::count_if(node->text.begin(), node->text.end(), [](char c) {
            return (static_cast<unsigned char>(c) & 0xC0u) != 0x80u;
        }));
    if (length == 0 || length > longestText) {
        fail(fmt::format("must have 1 to {} characters, got {}", longestText, length));
    }
    std::string result = node->text;
    std::replace(result.begin(), result.end(), '\n', ' ');
    if (std::any_of(result.begin(), result.end(),
                    [](char c) { return (c >= '\0' && c < ' ') || c == '\x7f'; })) {
        fail("must have no control characters");
    }
    return result;
}

std::size_t SceneValue::choice(std::span<const std::string_view> choices) const {
    const auto found =
        isText() ? std::find(choices.begin(), choices.end(), node->text) : choices.end();
    if (found == choices.end()) {
        failWrongKind(listed(choices));
    }
    return static_cast<std::size_t>(found - choices.begin());
}

std::size_t SceneValue::listSize(std::size_t least, std::size_t most) const {
    if (!isList()) {
        failWrongKind("a list");
    }
    const std::size_t size = node->items.size();
    if (size < least || size > most) {
        fail(fmt::format("must have {}{} items, got {}", least,
                         least == most ? std::string() : fmt::format(" to {}", most), size));
    }
    return size;
}

SceneValue SceneValue::item(std::size_t index) const {
    return {node->items[index], *this, fmt::format("{}[{}]", path, index)};
}

std::size_t SceneValue::keyCount() const {
    if (!isObject()) {
        failWrongKind("an object");
    }
    return node->keys.size();
}

SceneValue SceneValue::keyValue(std::size_t index) const {
    return {node->items[index], *this, pathOfKey(node->keys[index].name)};
}

std::string SceneValue::pathOfKey(std::string_view key) const {
    if (!plainWord(key)) {
        return fmt::format("{}[{}]", path, inQuotes(key));
    }
    return path.empty() ? std::string(key) : fmt::format("{}.{}", path, key);
}

void SceneValue::allowOnly(std::span<const std::string_view> known) const {
    for (std::size_t i = 0; i < keyCount(); ++i) {
        if (std::find(known.begin(), known.end(), keyName(i)) == known.end()) {
            failAtKey(i, "unknown key" + didYouMean(keyName(i), known));
        }
    }
}

void SceneValue::failAtKey(std::size_t index, std::string_view reason) const {
    failAt(*name, node->keys[index].line, pathOfKey(keyName(index)), reason);
}

std::optional<SceneValue> SceneValue::find(std::string_view key) const {
    for (std::size_t i = 0; i < keyCount(); ++i) {
        if (keyName(i) == key) {
            return keyValue(i);
        }
    }
    return std::nullopt;
}

SceneValue SceneValue::need(std::string_view key) const {
    std::optional<SceneValue> value = find(key);
    if (!value) {
        fail(fmt::format("needs \"{}\"", key));
    }
    return *value;
}

double SceneValue::numberOr(std::string_view key, double low, double high, double otherwise) const {
    const std::optional<SceneValue> value = find(key);
    return value ? value->number(low, high) : otherwise;
}

bool SceneValue::flagOr(std::string_view key, bool otherwise) const {
    const std::optional<SceneValue> value = find(key);
    return value ? value->flag() : otherwise;
}

std::string SceneValue::textOr(std::string_view key, const std::string& otherwise) const {
    const std::optional<SceneValue> value = find(key);
    return value ? value->text() : otherwise;
}

}  // namespace tessaly
