// Results of the public AutoEq project: equaliser settings of measured headphones.
#include "data/headphone_table.h"

#include <fmt/format.h>

#include <algorithm>

#include "data/sha256.h"

namespace tessaly::data {

namespace {

EqFilter pk(double hertz, double gainDb, double q) { return {EqType::peaking, hertz, gainDb, q}; }
EqFilter ls(double hertz, double gainDb, double q) { return {EqType::lowShelf, hertz, gainDb, q}; }
EqFilter hs(double hertz, double gainDb, double q) { return {EqType::highShelf, hertz, gainDb, q}; }

constexpr const char* oratory = "oratory1990";
constexpr const char* innerfidelity = "Innerfidelity";
constexpr const char* rtings = "Rtings";

}  // namespace

const std::vector<HeadphoneRow>& headphoneTable() {
    // Each filter: Hz, dB, Q.
    // clang-format off
    static const std::vector<HeadphoneRow> rows = {
        {1, "IPALLI_16", "Apple EarPods", oratory,
         {ls(105, 5.8, .70), pk(465, 4.3, .28), pk(1952, -7.4, 1.22), pk(5776, -6.6, 2.50), pk(2884, -2.9, 2.45),
          hs(10000, 2.3, .70), pk(8834, -2.5, 3.07), pk(121, -.5, 2.70), pk(209, .4, 2.16), pk(6698, 1.0, 6.00)}},
        {2, "IINALLIH", "Apple In-Ear 2013", innerfidelity,
         {ls(105, 2.0, .70), pk(5347, 4.9, .44), pk(230, -3.9, .44), pk(73, .8, .77), pk(2931, -3.4, 4.70),
          hs(10000, -3.4, .70), pk(1344, -1.1, 3.17), pk(897, .6, 2.75), pk(2028, .7, 4.05), pk(5302, .8, 6.00)}},
        {3, "770ALIF3_CUB_Mono.wav", "Beyerdynamic DT 770 Pro", oratory,
         {ls(105, -3.0, .70), pk(6424, -4.2, .97), pk(3684, 6.8, 2.87), pk(213, 3.5, 2.46), pk(139, -3.9, 4.94),
          hs(10000, -5.4, .70), pk(92, 3.5, 3.00), pk(9557, 2.3, 1.86), pk(45, -1.3, 1.75), pk(119, -2.1, 5.81)}},
        {4, "25AINBS_16bit", "Sennheiser HD25-1 II", oratory,
         {ls(105, 4.8, .70), pk(88, -5.8, .76), pk(495, 4.2, 1.19), pk(4682, 5.6, 3.25), pk(231, -3.2, 1.56),
          hs(10000, 4.1, .70), pk(9029, -3.6, 2.60), pk(2558, -1.5, 2.58), pk(43, -1.3, 2.57), pk(61, 2.0, 5.37)}},
        {5, "FFIH03GL", "Sennheiser HD 600", oratory,
         {ls(105, 6.5, .70), pk(125, -2.7, .55), pk(8445, 3.3, 1.61), pk(522, .7, 1.02), pk(1298, -1.2, 2.14),
          hs(10000, -3.1, .70), pk(3158, -1.8, 3.67), pk(2166, .9, 3.32), pk(6639, 2.2, 5.82), pk(5434, -1.2, 5.70)}},
        {6, "ITA-Kunstkopf_HRIR_Mess01_D180_5x5_256_A000_B090", "inverse of the frontal HRIR", "this data set", {}},
        {7, "I15I12_32.wav", "Bose QuietComfort 15", innerfidelity,
         {ls(105, 2.9, .70), pk(102, -3.6, .23), pk(585, 3.1, .80), pk(5913, -5.1, 6.00), pk(4324, -3.4, 6.00),
          hs(10000, .2, .70), pk(3408, 2.4, 6.00), pk(1216, -.9, 4.24), pk(8293, 3.3, 5.26), pk(43, -.2, 1.84)}},
        {8, "20H114_32.wav", "Bose QuietComfort 20", oratory,
         {ls(105, 4.9, .70), pk(159, -2.2, .18), pk(887, 5.7, 1.33), pk(1800, -5.3, 2.44), pk(5941, 4.8, 3.83),
          hs(10000, 7.1, .70), pk(4129, -3.1, 4.28), pk(36, -.9, 2.33), pk(203, .3, 1.83), pk(61, .6, 2.42)}},
        {9, "I20H111_32.wav", "Bose QuietComfort 20", rtings,
         {ls(105, 9.8, .70), pk(52, -7.2, .51), pk(850, 8.3, 1.26), pk(376, -2.7, .18), pk(33, -2.9, 2.16),
          hs(10000, 7.4, .70), pk(4117, -3.7, 4.64), pk(2916, 1.2, 2.87), pk(6499, -3.5, 6.00), pk(5302, 2.6, 5.99)}},
        {10, "20H1103_32.wav", "Bose QuietComfort 20, cancelling off", innerfidelity,
         {pk(30, 9.9, .61), pk(82, -6.4, .35), pk(1529, -15.1, 1.77), pk(1859, 11.0, .64), pk(5781, 4.6, 4.96),
          pk(332, -4.9, 1.63), pk(783, 7.2, .44), pk(1034, -7.4, .83), pk(4180, -5.6, 10.38), pk(21777, -1.6, 1.26)}},
    };
    // clang-format on
    return rows;
}

std::vector<EqFilter> headphoneFilters(const HeadphoneRow& row, bool flatBass) {
    std::vector<EqFilter> filters = row.filters;
    if (flatBass) {
        const auto shelf = std::find_if(filters.begin(), filters.end(), [](const EqFilter& filter) {
            return filter.type == EqType::lowShelf;
        });
        if (shelf != filters.end()) {
            filters.erase(shelf);
        }
    }
    return filters;
}

std::string headphoneTableSha256() {
    std::string text;
    for (const HeadphoneRow& row : headphoneTable()) {
        text += fmt::format("{} {}\n", row.number, row.model);
        for (const EqFilter& filter : row.filters) {
            text += fmt::format("{} {} {} {}\n", static_cast<int>(filter.type), filter.hertz,
                                filter.gainDb, filter.q);
        }
    }
    return sha256(text);
}

std::string headphoneTableLicence() { return "MIT; results of the AutoEq project"; }

std::string headphoneTableAttribution() {
    return "Equaliser settings of headphones: results of the AutoEq project (repository\n"
           "jaakkopasanen/AutoEq), from measurements by oratory1990, Innerfidelity and Rtings.\n\n"
           "MIT License, Copyright (c) Jaakko Pasanen\n\n"
           "Permission is hereby granted, free of charge, to any person obtaining a copy\n"
           "of this software and associated documentation files (the \"Software\"), to deal\n"
           "in the Software without restriction, including without limitation the rights\n"
           "to use, copy, modify, merge, publish, distribute, sublicense, and/or sell\n"
           "copies of the Software, and to permit persons to whom the Software is\n"
           "furnished to do so, subject to the following conditions:\n\n"
           "The above copyright notice and this permission notice shall be included in all\n"
           "copies or substantial portions of the Software.\n\n"
           "THE SOFTWARE IS PROVIDED \"AS IS\", WITHOUT WARRANTY OF ANY KIND, EXPRESS OR\n"
           "IMPLIED, INCLUDING BUT NOT LIMITED TO THE WARRANTIES OF MERCHANTABILITY,\n"
           "FITNESS FOR A PARTICULAR PURPOSE AND NONINFRINGEMENT. IN NO EVENT SHALL THE\n"
           "AUTHORS OR COPYRIGHT HOLDERS BE LIABLE FOR ANY CLAIM, DAMAGES OR OTHER\n"
           "LIABILITY, WHETHER IN AN ACTION OF CONTRACT, TORT OR OTHERWISE, ARISING FROM,\n"
           "OUT OF OR IN CONNECTION WITH THE SOFTWARE OR THE USE OR OTHER DEALINGS IN THE\n"
           "SOFTWARE.\n";
}

}  // namespace tessaly::data
