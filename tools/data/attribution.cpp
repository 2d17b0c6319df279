// Quotes the package's copyright file for the KEMAR set.
#include "data/attribution.h"

#include <algorithm>
#include <fstream>
#include <sstream>
#include <string_view>

namespace tessaly::data {

namespace {

constexpr const char* packageCopyright = "/usr/share/doc/libmysofa1/copyright";
constexpr const char* kemarFile = "MIT_KEMAR_normal_pinna.sofa";
constexpr const char* knownTerms =
    "Copyright: 1994, Bill Gardner, Keith Martin, MIT Media Lab Machine Listening Group\n"
    " This data is Copyright 1994 by the MIT Media Laboratory.  It is\n"
    " provided free with no restrictions on use, provided the authors\n"
    " are cited when the data is used in any research or commercial\n"
    " application.\n";

}  // namespace

std::string kemarLicence() {
    return "Copyright 1994 MIT Media Laboratory (Bill Gardner, Keith Martin); free to use, "
           "provided the authors are cited";
}

std::string kemarStanza(const std::string& copyrightText) {
    std::istringstream lines(copyrightText);
    std::string stanza;
    std::string line;
    const auto covers = [&stanza] { return stanza.find(kemarFile) != std::string::npos; };
    while (std::getline(lines, line)) {
        if (!line.empty()) {
            stanza += line + "\n";
            continue;
        }
        if (covers()) {
            return stanza;
        }
        stanza.clear();
    }
    return covers() ? stanza : "";
}

std::string kemarAttribution() {
    std::ifstream file(packageCopyright);
    std::ostringstream text;
    text << file.rdbuf();
    const std::string stanza = kemarStanza(text.str());
    return std::string("HRTF measurements of a KEMAR dummy head microphone, ") +
           "Bill Gardner and Keith Martin, MIT Media Laboratory, 1994.\n\n" +
           (stanza.empty() ? std::string(knownTerms)
                           : "From the copyright file of the package libmysofa1:\n\n" + stanza);
}

std::string describeContent(const std::filesystem::path& path, const std::string& fallback) {
    std::ifstream file(path, std::ios::binary);
    std::string start(512, '\0');
    file.read(start.data(), static_cast<std::streamsize>(start.size()));
    start.resize(static_cast<std::size_t>(file.gcount()));
    const auto begins = [&start](std::string_view magic) {
        return std::string_view(start).substr(0, magic.size()) == magic;
    };
    if (start.empty()) {
        return "an empty or unreadable file";
    }
    if (begins("\x89HDF")) {
        return "an HDF5 file, " + fallback;
    }
    if (begins("\x89PNG")) {
        return "a PNG picture";
    }
    if (begins("\xff\xd8\xff")) {
        return "a JPEG picture";
    }
    if (begins("RIFF")) {
        return "a RIFF (WAV) file";
    }
    if (begins("PK\x03\x04")) {
        return "a ZIP archive";
    }
    if (begins("\x1f\x8b")) {
        return "a gzip archive";
    }
    const bool text = std::all_of(start.begin(), start.end(), [](char c) {
        const auto byte = static_cast<unsigned char>(c);
        return byte >= 32 || byte == '\n' || byte == '\r' || byte == '\t';
    });
    return text ? "a text file" : "unknown binary data";
}

std::string firstLine(const std::string& text) {
    return text.substr(0, text.find_first_of("\r\n"));
}

}  // namespace tessaly::data
