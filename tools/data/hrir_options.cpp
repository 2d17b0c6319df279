// Text forms of the options, and the table of rates.
#include "data/hrir_options.h"

#include <charconv>
#include <sstream>

#include "data/data_error.h"
#include "resources/hrir_grid.h"

namespace tessaly::data {

static_assert(mostHrirTaps == hrirMaxLength);

namespace {

template <typename Number>
Number parseNumber(const std::string& text, const std::string& whole) {
    Number value{};
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size()) {
        throw DataError("options \"{}\": \"{}\" is no number", whole, text);
    }
    return value;
}

}  // namespace

std::string toText(const HrirOptions& options) {
    const char* symmetry = "auto";
    if (options.symmetry != Symmetry::automatic) {
        symmetry = options.symmetry == Symmetry::on ? "on" : "off";
    }
    return fmt::format("dfeq={} symmetry={} taps={} gain={} lowest={}",
                       options.diffuseFieldEqualisation ? "on" : "off", symmetry,
                       options.taps ? fmt::to_string(*options.taps) : "default", options.gainDb,
                       options.lowestElevation ? fmt::to_string(*options.lowestElevation) : "auto");
}

Symmetry symmetryFromText(const std::string& text) {
    if (text == "auto") {
        return Symmetry::automatic;
    }
    if (text == "on" || text == "off") {
        return text == "on" ? Symmetry::on : Symmetry::off;
    }
    throw DataError("symmetry is \"{}\", expected auto, on or off", text);
}

HrirOptions hrirOptionsFromText(const std::string& text) {
    HrirOptions options;
    std::istringstream words(text);
    std::string word;
    while (words >> word) {
        const std::size_t sign = word.find('=');
        const std::string key = word.substr(0, sign);
        const std::string value = sign == std::string::npos ? "" : word.substr(sign + 1);
        if (key == "dfeq" && (value == "on" || value == "off")) {
            options.diffuseFieldEqualisation = value == "on";
        } else if (key == "symmetry") {
            options.symmetry = symmetryFromText(value);
        } else if (key == "taps") {
            if (value != "default") {
                options.taps = parseNumber<int>(value, text);
            }
        } else if (key == "gain") {
            options.gainDb = parseNumber<double>(value, text);
        } else if (key == "lowest") {
            if (value != "auto") {
                options.lowestElevation = parseNumber<double>(value, text);
            }
        } else {
            throw DataError("options \"{}\": \"{}\" is unknown", text, word);
        }
    }
    return options;
}

const std::vector<RateEntry>& rateTable() {
    static const std::vector<RateEntry> table = {
        {44100, 128, "TSLdata120.dat"},
        {48000, 139, "TSLdata121.dat"},
        {24000, 70, "TSLdata122.dat"},
    };
    return table;
}

const RateEntry& rateEntry(int sampleRate) {
    for (const RateEntry& entry : rateTable()) {
        if (entry.sampleRate == sampleRate) {
            return entry;
        }
    }
    throw DataError("unknown rate {} Hz, expected 44100, 48000 or 24000", sampleRate);
}

int rateFromText(const std::string& text) {
    for (const RateEntry& entry : rateTable()) {
        if (fmt::to_string(entry.sampleRate) == text) {
            return entry.sampleRate;
        }
    }
    throw DataError("unknown rate \"{}\", expected 44100, 48000 or 24000", text);
}

}  // namespace tessaly::data
