// Plain `name: value` text, so that people can read it too.
#include "data/manifest.h"

#include <fmt/format.h>

#include <algorithm>
#include <charconv>
#include <sstream>

namespace tessaly::data {

namespace {

constexpr const char* manifestTitle = "Tessaly data set";
constexpr const char* attributionTitle = "Sources of the data in this directory";
constexpr const char* attributionMark = "Source with sha256 ";

std::string oneLine(std::string text) {
    std::replace_if(
        text.begin(), text.end(), [](char c) { return c == '\n' || c == '\r'; }, ' ');
    return text;
}

}  // namespace

std::string manifestText(const std::vector<ManifestEntry>& entries) {
    std::string text =
        fmt::format("{}\ntool: tessaly-data {}\n", manifestTitle, TESSALY_VERSION_TEXT);
    for (const ManifestEntry& entry : entries) {
        text += fmt::format(
            "\nfile: {}\nsize: {}\nsha256: {}\ncontent: {}\nsource: {}\n"
            "source sha256: {}\nlicence: {}\noptions: {}\n",
            entry.file, entry.size, entry.sha256, oneLine(entry.content), oneLine(entry.source),
            entry.sourceSha256, oneLine(entry.licence), oneLine(entry.options));
        for (const std::string& part : entry.parts) {
            text += fmt::format("part: {}\n", oneLine(part));
        }
    }
    return text;
}

std::vector<ManifestEntry> parseManifest(const std::string& text) {
    std::istringstream lines(text);
    std::string line;
    std::vector<ManifestEntry> entries;
    if (!std::getline(lines, line) || line != manifestTitle) {
        return entries;
    }
    while (std::getline(lines, line)) {
        const std::size_t colon = line.find(": ");
        if (colon == std::string::npos) {
            continue;
        }
        const std::string name = line.substr(0, colon);
        const std::string value = line.substr(colon + 2);
        if (name == "file") {
            entries.emplace_back().file = value;
        }
        if (entries.empty()) {
            continue;
        }
        ManifestEntry& entry = entries.back();
        if (name == "size") {
            std::from_chars(value.data(), value.data() + value.size(), entry.size);
        } else if (name == "sha256") {
            entry.sha256 = value;
        } else if (name == "content") {
            entry.content = value;
        } else if (name == "source") {
            entry.source = value;
        } else if (name == "source sha256") {
            entry.sourceSha256 = value;
        } else if (name == "licence") {
            entry.licence = value;
        } else if (name == "options") {
            entry.options = value;
        } else if (name == "part") {
            entry.parts.push_back(value);
        }
    }
    return entries;
}

std::vector<ManifestEntry> mergeManifest(std::vector<ManifestEntry> entries,
                                         const std::vector<ManifestEntry>& added) {
    for (const ManifestEntry& entry : added) {
        std::erase_if(entries,
                      [&entry](const ManifestEntry& old) { return old.file == entry.file; });
        entries.push_back(entry);
    }
    std::sort(entries.begin(), entries.end(),
              [](const ManifestEntry& a, const ManifestEntry& b) { return a.file < b.file; });
    return entries;
}

std::string attributionText(const Attributions& attributions) {
    std::string text = fmt::format("{}\n", attributionTitle);
    for (const auto& [checksum, terms] : attributions) {
        text += fmt::format("\n{}{}\n\n{}", attributionMark, checksum, terms);
    }
    return text;
}

Attributions parseAttributions(const std::string& text) {
    Attributions attributions;
    std::istringstream lines(text);
    std::string line;
    std::string* terms = nullptr;
    while (std::getline(lines, line)) {
        if (line.rfind(attributionMark, 0) == 0) {
            terms = &attributions[line.substr(std::string(attributionMark).size())];
        } else if (terms != nullptr && !(terms->empty() && line.empty())) {
            *terms += line + "\n";
        }
    }
    for (auto& [checksum, section] : attributions) {
        while (section.size() > 1 && section.substr(section.size() - 2) == "\n\n") {
            section.pop_back();
        }
    }
    return attributions;
}

}  // namespace tessaly::data
