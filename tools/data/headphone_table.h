// The headphones that the engine knows, and the equaliser settings behind their filters.
#pragma once

#include <string>
#include <vector>

#include "data/eq_filter.h"

namespace tessaly::data {

inline constexpr std::size_t headphoneRowCount = 10;
inline constexpr int frontalRow = 6;      ///< inverse of the frontal HRIR, not a model
inline constexpr int smallFilterRow = 1;  ///< whose filter is kept for short responses too
inline constexpr const char* smallFilterName = "IP23M3_512_FadeOut";

/// One selection of the engine.
struct HeadphoneRow {
    int number;
    const char* file;
    const char* model;
    const char* measuredBy;
    std::vector<EqFilter> filters;  ///< empty for the frontal row
};

/// Rows 1 to 10 in order.
const std::vector<HeadphoneRow>& headphoneTable();

/// The settings of a row; without the first low shelf the result is neutral for a diffuse field.
std::vector<EqFilter> headphoneFilters(const HeadphoneRow& row, bool flatBass);

/// Checksum of the settings, and the terms they come under.
std::string headphoneTableSha256();
std::string headphoneTableLicence();
std::string headphoneTableAttribution();

}  // namespace tessaly::data
