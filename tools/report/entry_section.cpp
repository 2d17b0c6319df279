// Puts a section together.
#include "report/entry_section.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "render/binaural_measures.h"
#include "report/base64.h"
#include "report/plot.h"
#include "report/response_graphs.h"
#include "report/sound_data.h"
#include "report/time_graphs.h"
#include "report/top_view.h"

namespace tessaly {

namespace {

constexpr double leastLowering = 0.005;  // dB; what is less is not worth a remark

double peakDb(const std::vector<float>& stereo, std::size_t ear) {
    double peak = 0.0;
    for (std::size_t i = ear; i < stereo.size(); i += 2) {
        peak = std::max(peak, std::abs(static_cast<double>(stereo[i])));
    }
    return peak > 0.0 ? std::max(20.0 * std::log10(peak), silenceDb) : silenceDb;
}

std::string peakWords(double decibels) {
    return decibels <= silenceDb ? std::string("silent") : shownNumber(decibels, 1) + " dBFS";
}

std::string playerMarkup(const ReportEntry& entry, const SoundData& sound) {
    if (sound.flac.empty()) {
        return "<p class=\"note\">There is no sound: the output is empty.</p>\n";
    }
    return fmt::format(
        "<div class=\"player\"><audio controls preload=\"auto\" aria-label=\"Sound: {}\" "
        "src=\"{}\">This browser plays no sound.</audio></div>\n",
        escapedXml(entry.title), dataUri("audio/flac", sound.flac));
}

std::string factsMarkup(const ReportEntry& entry, const std::vector<float>& stereo) {
    const double seconds = secondsOf(stereo, entry.sampleRate);
    return fmt::format(
        "<dl class=\"facts\"><div><dt>Length</dt><dd>{} s</dd></div>"
        "<div><dt>Rate</dt><dd>{} Hz</dd></div>"
        "<div><dt class=\"left\">Peak left</dt><dd>{}</dd></div>"
        "<div><dt class=\"right\">Peak right</dt><dd>{}</dd></div></dl>\n",
        shownNumber(seconds, seconds < 1.0 ? 3 : 1), entry.sampleRate, peakWords(peakDb(stereo, 0)),
        peakWords(peakDb(stereo, 1)));
}

std::string remarksMarkup(const std::vector<std::string>& remarks) {
    std::string items;
    for (const std::string& remark : remarks) {
        items += fmt::format("<li>{}</li>\n", escapedXml(remark));
    }
    return items.empty() ? items : "<ul class=\"remarks\">\n" + items + "</ul>\n";
}

// Neighbours with one owner are a group of the table.
std::string parametersMarkup(const std::vector<ReportParameter>& parameters) {
    if (parameters.empty()) {
        return {};
    }
    std::string bodies;
    for (auto row = parameters.begin(); row != parameters.end();) {
        bodies += fmt::format("<tbody><tr><th scope=\"rowgroup\" colspan=\"2\">{}</th></tr>\n",
                              escapedXml(row->owner));
        const std::string& owner = row->owner;
        for (; row != parameters.end() && row->owner == owner; ++row) {
            const std::string unit =
                row->unit.empty()
                    ? std::string()
                    : fmt::format(" <span class=\"unit\">{}</span>", escapedXml(row->unit));
            bodies += fmt::format("<tr><th scope=\"row\">{}{}</th><td>{}</td></tr>\n",
                                  escapedXml(row->name), unit, escapedXml(row->value));
        }
        bodies += "</tbody>\n";
    }
    return fmt::format(
        "<details><summary><h3>All parameters <span class=\"unit\">{}</span></h3></summary>\n"
        "<div class=\"wide\" tabindex=\"0\" role=\"region\" aria-label=\"All parameters\">"
        "<table class=\"parameters\">\n<thead><tr><th scope=\"col\">Parameter</th>"
        "<th scope=\"col\">Value</th></tr></thead>\n{}</table></div></details>\n",
        parameters.size(), bodies);
}

}  // namespace

std::string sectionId(std::size_t index) { return fmt::format("sound-{}", index + 1); }

std::string entrySection(const ReportEntry& entry, std::size_t index) {
    const CleanSound clean = cleaned(entry.stereo);
    const SoundData sound = encodeFlac(clean.stereo, entry.sampleRate);
    std::vector<std::string> remarks = entry.remarks;
    if (clean.notNumbers > 0) {
        remarks.push_back(
            fmt::format("{} samples were no numbers; they are silent here.", clean.notNumbers));
    }
    if (sound.loweredDb >= leastLowering) {
        remarks.push_back(fmt::format(
            "The output goes above full scale. The player's sound is lowered by {} dB; the "
            "pictures show the output as it is.",
            shownNumber(sound.loweredDb, sound.loweredDb < 0.1 ? 2 : 1)));
    }

    const std::string id = sectionId(index);
    std::string markup = fmt::format(
        "<section class=\"entry\" id=\"{0}\" aria-labelledby=\"{0}-title\">\n"
        "<h2 id=\"{0}-title\">{1}</h2>\n",
        id, escapedXml(entry.title));
    if (!entry.description.empty()) {
        markup += fmt::format("<p class=\"lead\">{}</p>\n", escapedXml(entry.description));
    }
    markup += playerMarkup(entry, sound) + remarksMarkup(remarks);
    if (!sound.flac.empty()) {
        const double duration = secondsOf(clean.stereo, entry.sampleRate);
        markup += factsMarkup(entry, clean.stereo) + "<div class=\"overview\">\n" +
                  topViewMarkup(entry, duration) + "<div class=\"stack\">\n" +
                  binauralGraphs(clean.stereo, entry.sampleRate) + "</div>\n</div>\n" +
                  "<div class=\"pair\">\n" + spectrumGraphs(clean.stereo, entry.sampleRate) +
                  "</div>\n";
    }
    for (const ReportResponse& response : entry.responses) {
        markup += responseMarkup(response, entry.sampleRate);
    }
    return markup + parametersMarkup(entry.parameters) + "</section>\n";
}

}  // namespace tessaly
