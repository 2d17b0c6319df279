// Walks through a document tag by tag.
#include "tools/render/xml_check.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <set>
#include <vector>

namespace tessaly {

namespace {

std::string entityFault(std::string_view text) {
    constexpr std::array<std::string_view, 5> known = {"&amp;", "&lt;", "&gt;", "&quot;", "&apos;"};
    for (std::size_t at = text.find('&'); at != text.npos; at = text.find('&', at + 1)) {
        const std::string_view rest = text.substr(at);
        if (std::none_of(known.begin(), known.end(), [&](auto e) { return rest.starts_with(e); })) {
            return "unknown entity at " + std::string(rest.substr(0, 10));
        }
    }
    return "";
}

std::string_view takeName(std::string_view& text) {
    const auto end = std::find_if(text.begin(), text.end(), [](unsigned char c) {
        return !(std::isalnum(c) != 0 || c == '-' || c == ':' || c == '_');
    });
    const std::string_view name = text.substr(0, static_cast<std::size_t>(end - text.begin()));
    text.remove_prefix(name.size());
    return name;
}

void skipBlanks(std::string_view& text) {
    while (!text.empty() && std::isspace(static_cast<unsigned char>(text.front())) != 0) {
        text.remove_prefix(1);
    }
}

// The attributes of a tag, name="value" each, up to the end of the text.
std::string attributeFault(std::string_view text) {
    std::set<std::string_view> seen;
    for (skipBlanks(text); !text.empty(); skipBlanks(text)) {
        const std::string_view name = takeName(text);
        if (name.empty() || !seen.insert(name).second) {
            return "bad or repeated attribute at " + std::string(text.substr(0, 20));
        }
        if (!text.starts_with("=\"")) {
            return "attribute without quoted value: " + std::string(name);
        }
        text.remove_prefix(2);
        const std::size_t end = text.find('"');
        if (end == text.npos) {
            return "open quote of " + std::string(name);
        }
        const std::string_view value = text.substr(0, end);
        if (value.find('<') != value.npos || !entityFault(value).empty()) {
            return "bad value of " + std::string(name);
        }
        text.remove_prefix(end + 1);
    }
    return "";
}

}  // namespace

std::string xmlFault(std::string_view document) {
    if (document.starts_with("<?xml")) {
        document.remove_prefix(std::min(document.find("?>") + 2, document.size()));
    }
    std::vector<std::string_view> open;
    bool rootSeen = false;
    while (!document.empty()) {
        const std::size_t tag = document.find('<');
        const std::string_view text = document.substr(0, tag);
        if (std::string fault = entityFault(text); !fault.empty()) {
            return fault;
        }
        const bool blank = text.find_first_not_of(" \n\t\r") == text.npos;
        if (open.empty() && !blank) {
            return "text outside of the root";
        }
        if (tag == document.npos) {
            break;
        }
        const std::size_t end = document.find('>', tag);
        if (end == document.npos) {
            return "open tag at the end";
        }
        std::string_view inside = document.substr(tag + 1, end - tag - 1);
        document.remove_prefix(end + 1);
        if (inside.starts_with('/')) {
            inside.remove_prefix(1);
            if (open.empty() || open.back() != inside) {
                return "closes what is not open: " + std::string(inside);
            }
            open.pop_back();
            continue;
        }
        const bool empty = inside.ends_with('/');
        if (empty) {
            inside.remove_suffix(1);
        }
        if (open.empty() && rootSeen) {
            return "a second root";
        }
        rootSeen = true;
        const std::string_view name = takeName(inside);
        if (name.empty()) {
            return "tag without a name";
        }
        if (std::string fault = attributeFault(inside); !fault.empty()) {
            return fault;
        }
        if (!empty) {
            open.push_back(name);
        }
    }
    if (!open.empty()) {
        return "never closed: " + std::string(open.back());
    }
    return rootSeen ? "" : "no element at all";
}

int countElements(std::string_view document, std::string_view name) {
    const std::string start = "<" + std::string(name);
    int count = 0;
    for (std::size_t at = document.find(start); at != document.npos;
         at = document.find(start, at + 1)) {
        const char after = document[at + start.size()];
        count += after == ' ' || after == '>' || after == '/' ? 1 : 0;
    }
    return count;
}

}  // namespace tessaly
