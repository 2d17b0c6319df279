// Builds the tree from the JSON library's events, counting the lines it has read.
#include "scene/json_tree.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <nlohmann/json.hpp>
#include <utility>

#include "scene/near_names.h"
#include "scene/scene_error.h"

namespace tessaly {

namespace {

constexpr std::size_t deepest = 16;         // levels of lists and objects
constexpr std::size_t mostKeys = 100;       // in one object
constexpr std::size_t mostValues = 500000;  // in a text
constexpr std::size_t longestReason = 160;  // characters of the JSON library's own words

// Hands out the characters of a text and tells how far the reader has got.
class WatchedIterator {
public:
    using iterator_category = std::input_iterator_tag;
    using value_type = char;
    using difference_type = std::ptrdiff_t;
    using pointer = const char*;
    using reference = const char&;

    WatchedIterator(const char* position, const char** reached) : at(position), seen(reached) {}

    reference operator*() const { return *at; }
    WatchedIterator& operator++() {
        *seen = ++at;
        return *this;
    }
    WatchedIterator operator++(int) {
        const WatchedIterator before = *this;
        ++*this;
        return before;
    }
    bool operator==(const WatchedIterator& other) const { return at == other.at; }
    bool operator!=(const WatchedIterator& other) const { return at != other.at; }

private:
    const char* at;
    const char** seen;
};

// The JSON library's words without its own name and position, fit for one line.
std::string plainReason(std::string_view words) {
    for (const std::string_view skipped : {"] ", "column ", ": ", "syntax error "}) {
        const std::size_t found = words.find(skipped);
        if (found != std::string_view::npos) {
            words.remove_prefix(found + skipped.size());
        }
    }
    std::string reason;
    for (const char c : words.substr(0, longestReason)) {
        reason.push_back(c >= ' ' && c <= '~' ? c : '?');
    }
    return reason + (words.size() > longestReason ? "..." : "");
}

// Receives the events. Each is told right after its last character was read, a number after the
// character that ended it.
class TreeBuilder {
public:
    TreeBuilder(std::string_view text, const std::string& documentName)
        : counted(text.data()), seen(text.data()), name(documentName) {}

    const char** reached() { return &seen; }
    JsonNode take() { return std::move(root); }

    bool null() { return leaf({}, line()); }
    bool boolean(bool value) {
        JsonNode node;
        node.kind = JsonNode::Kind::Flag;
        node.flag = value;
        return leaf(std::move(node), line());
    }
    bool number_integer(std::int64_t value) { return number(static_cast<double>(value)); }
    bool number_unsigned(std::uint64_t value) { return number(static_cast<double>(value)); }
    bool number_float(double value, const std::string&) { return number(value); }
    bool string(std::string& value) {
        JsonNode node;
        node.kind = JsonNode::Kind::Text;
        node.text = std::move(value);
        return leaf(std::move(node), line());
    }
    bool binary(nlohmann::json::binary_t&) { return false; }  // never in a text
    bool start_object(std::size_t) { return open(JsonNode::Kind::Object); }
    bool start_array(std::size_t) { return open(JsonNode::Kind::List); }
    bool end_object() { return close(); }
    bool end_array() { return close(); }

    bool key(std::string& value) {
        std::vector<JsonKey>& keys = levels.back()->keys;
        const auto same = std::find_if(keys.begin(), keys.end(),
                                       [&](const JsonKey& key) { return key.name == value; });
        if (same != keys.end()) {
            fail(line(),
                 fmt::format("repeated key {}, first on line {}", inQuotes(value), same->line));
        }
        if (keys.size() == mostKeys) {
            fail(line(), fmt::format("more than {} keys in one object", mostKeys));
        }
        keys.push_back({std::move(value), line()});
        return true;
    }

    bool parse_error(std::size_t, const std::string&, const nlohmann::json::exception& error) {
        fail(lineBeforeLast(), "not valid JSON: " + plainReason(error.what()));
    }

private:
    [[noreturn]] void fail(int atLine, const std::string& reason) const {
        throw SceneError(fmt::format("{}:{}: {}", name, atLine, reason));
    }

    int lineOf(const char* position) {
        currentLine += static_cast<int>(std::count(counted, std::max(counted, position), '\n'));
        counted = std::max(counted, position);
        return currentLine;
    }
    int line() { return lineOf(seen); }
    int lineBeforeLast() { return lineOf(seen == counted ? seen : seen - 1); }

    bool number(double value) {
        JsonNode node;
        node.kind = JsonNode::Kind::Number;
        node.number = value;
        return leaf(std::move(node), lineBeforeLast());
    }

    JsonNode& add(JsonNode node, int atLine) {
        if (++values > mostValues) {
            fail(atLine, fmt::format("more than {} values", mostValues));
        }
        node.line = atLine;
        if (levels.empty()) {
            root = std::move(node);
            return root;
        }
        return levels.back()->items.emplace_back(std::move(node));
    }

    bool leaf(JsonNode node, int atLine) {
        add(std::move(node), atLine);
        return true;
    }

    bool open(JsonNode::Kind kind) {
        if (levels.size() == deepest) {
            fail(line(), fmt::format("more than {} levels of lists and objects", deepest));
        }
        JsonNode node;
        node.kind = kind;
        // Stays where it is while it is open: only the innermost open node gets new items.
        levels.push_back(&add(std::move(node), line()));
        return true;
    }

    bool close() {
        levels.pop_back();
        return true;
    }

    JsonNode root;
    std::vector<JsonNode*> levels;
    std::size_t values = 0;
    const char* counted;  // lines are counted up to here
    const char* seen;     // the JSON library has read up to here
    int currentLine = 1;
    const std::string& name;
};

}  // namespace

JsonNode parseJson(std::string_view text, const std::string& name) {
    TreeBuilder builder(text, name);
    const char* end = text.data() + text.size();
    const bool complete =
        nlohmann::json::sax_parse(WatchedIterator(text.data(), builder.reached()),
                                  WatchedIterator(end, builder.reached()), &builder);
    if (!complete) {
        throw SceneError(fmt::format("{}: not valid JSON", name));
    }
    return builder.take();
}

}  // namespace tessaly
