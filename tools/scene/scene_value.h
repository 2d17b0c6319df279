// One value of a scene's text with its place in it, and the checks that name the place.
#pragma once

#include <cstddef>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "scene/json_tree.h"

namespace tessaly {

/// A view of a node. Node and document name live longer. All checks throw SceneError.
class SceneValue {
public:
    /// The whole document.
    SceneValue(const JsonNode& root, const std::string& document);

    /// @throws SceneError "document:line: path: reason", without the path for the whole document
    [[noreturn]] void fail(std::string_view reason) const;

    bool isNumber() const noexcept { return node->kind == JsonNode::Kind::Number; }
    bool isText() const noexcept { return node->kind == JsonNode::Kind::Text; }
    bool isList() const noexcept { return node->kind == JsonNode::Kind::List; }
    bool isObject() const noexcept { return node->kind == JsonNode::Kind::Object; }

    double number(double low, double high) const;
    int wholeNumber(int low, int high) const;
    bool flag() const;

    /// A text of 1 to 1000 characters without control characters; line ends become blanks.
    std::string text() const;

    /// @returns the index of the text among the choices, which must match exactly
    std::size_t choice(std::span<const std::string_view> choices) const;

    /// Number of items of a list; fails on anything else.
    std::size_t listSize(std::size_t least, std::size_t most) const;

    /// An item of a list.
    SceneValue item(std::size_t index) const;

    /// Number of keys of an object; fails on anything else.
    std::size_t keyCount() const;
    const std::string& keyName(std::size_t index) const { return node->keys[index].name; }
    SceneValue keyValue(std::size_t index) const;

    /// Fails, at the key's own line, on any key that is not listed.
    void allowOnly(std::span<const std::string_view> known) const;

    /// Fails about one key, at the key's own line.
    [[noreturn]] void failAtKey(std::size_t index, std::string_view reason) const;

    std::optional<SceneValue> find(std::string_view key) const;
    bool has(std::string_view key) const { return find(key).has_value(); }

    /// Fails if there is no such key.
    SceneValue need(std::string_view key) const;

    // Values that may be absent.
    double numberOr(std::string_view key, double low, double high, double otherwise) const;
    bool flagOr(std::string_view key, bool otherwise) const;
    std::string textOr(std::string_view key, const std::string& otherwise) const;

private:
    SceneValue(const JsonNode& child, const SceneValue& parent, std::string childPath);
    std::string pathOfKey(std::string_view key) const;
    [[noreturn]] void failWrongKind(std::string_view wanted) const;

    const JsonNode* node;
    const std::string* name;
    std::string path;
};

}  // namespace tessaly
