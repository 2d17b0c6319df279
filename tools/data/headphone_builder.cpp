// Rows to files.
#include "data/headphone_builder.h"

#include <fmt/format.h>

#include <sstream>

#include "data/data_error.h"
#include "data/headphone_table.h"
#include "data/hrir_options.h"

namespace tessaly::data {

std::string toText(const HeadphoneOptions& options) {
    return fmt::format("rate={} flat-bass={}", options.sampleRate, options.flatBass ? "on" : "off");
}

HeadphoneOptions headphoneOptionsFromText(const std::string& text) {
    HeadphoneOptions options;
    std::istringstream words(text);
    std::string rate;
    std::string bass;
    words >> rate >> bass;
    if (rate.rfind("rate=", 0) != 0 || (bass != "flat-bass=on" && bass != "flat-bass=off")) {
        throw DataError("options \"{}\" are unknown", text);
    }
    options.sampleRate = rateFromText(rate.substr(std::string("rate=").size()));
    options.flatBass = bass == "flat-bass=on";
    return options;
}

HeadphoneCurve builtInCurve(int row, const HeadphoneOptions& options, const ResponseField& field) {
    if (row == frontalRow) {
        return headphoneCurve(frontalInverse(field, options.sampleRate), options.sampleRate);
    }
    const HeadphoneRow& entry = headphoneTable()[static_cast<std::size_t>(row - 1)];
    const std::vector<EqFilter> filters = headphoneFilters(entry, options.flatBass);
    return headphoneCurve([&](double hertz) { return eqLevel(filters, hertz); },
                          options.sampleRate);
}

std::vector<HeadphoneFile> buildHeadphones(const HeadphoneOptions& options,
                                           const ImportedFilters& imported,
                                           const ResponseField& field) {
    std::vector<HeadphoneFile> files;
    HeadphoneFile small;
    for (const HeadphoneRow& row : headphoneTable()) {
        HeadphoneFile& file = files.emplace_back();
        file.name = row.file;
        file.row = row.number;
        const auto found = imported.find(row.number);
        std::vector<float> smallTaps;
        if (found != imported.end()) {
            file.imported = &found->second;
            file.content = fmt::format("headphone filter {}, imported", row.number);
            file.taps = found->second.taps;
            smallTaps = found->second.smallTaps;
        } else {
            const HeadphoneCurve curve = builtInCurve(row.number, options, field);
            file.content = fmt::format("headphone filter {}, {}", row.number, row.model);
            file.taps = headphoneFilter(curve, headphoneTaps, headphoneFade);
            smallTaps = smallHeadphoneFilter(curve);
        }
        if (row.number == smallFilterRow) {
            small = file;
            small.name = smallFilterName;
            small.content += ", for short responses";
            small.taps = smallTaps;
        }
    }
    files.push_back(std::move(small));
    return files;
}

}  // namespace tessaly::data
