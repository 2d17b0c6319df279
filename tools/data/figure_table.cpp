// Layout of the acceptance table.
#include "data/figure_table.h"

#include <fmt/format.h>

#include <algorithm>
#include <limits>

namespace tessaly::data {

namespace {

constexpr int scientific = -1;

std::string number(double value, int decimals) {
    return decimals == scientific ? fmt::format("{:.1g}", value)
                                  : fmt::format("{:.{}f}", value, decimals);
}

std::string limitNumber(double value) { return fmt::format("{:.4g}", value); }

std::string rangeText(const Range& range) {
    if (!range.limited()) {
        return "-";
    }
    const bool low = range.low > -std::numeric_limits<double>::infinity();
    const bool high = range.high < std::numeric_limits<double>::infinity();
    if (low && high) {
        return limitNumber(range.low) + ".." + limitNumber(range.high);
    }
    return low ? ">= " + limitNumber(range.low) : "<= " + limitNumber(range.high);
}

std::string valuesText(const Figure& figure) {
    std::string text;
    for (std::size_t i = 0; i < figure.values.size(); ++i) {
        text += i == 0 ? "" : " / ";
        text += number(figure.values[i], figure.decimals);
        text += figure.ranges[i].contains(figure.values[i]) ? "" : "!";
    }
    return text;
}

std::string acceptText(const Figure& figure) {
    const bool limited = std::any_of(figure.ranges.begin(), figure.ranges.end(),
                                     [](const Range& range) { return range.limited(); });
    if (!limited) {
        return "";
    }
    std::string text;
    for (std::size_t i = 0; i < figure.ranges.size(); ++i) {
        text += (i == 0 ? "" : " / ") + rangeText(figure.ranges[i]);
    }
    return text;
}

const Figure* find(const FigureColumn& column, const std::string& name) {
    const auto found = std::find_if(column.figures.begin(), column.figures.end(),
                                    [&name](const Figure& figure) { return figure.name == name; });
    return found == column.figures.end() ? nullptr : &*found;
}

/// Names of all rows, in the order of first appearance.
std::vector<std::string> rowNames(const std::vector<FigureColumn>& columns) {
    std::vector<std::string> names;
    for (const FigureColumn& column : columns) {
        for (const Figure& figure : column.figures) {
            if (std::find(names.begin(), names.end(), figure.name) == names.end()) {
                names.push_back(figure.name);
            }
        }
    }
    return names;
}

}  // namespace

std::string figureTable(const std::vector<FigureColumn>& columns) {
    std::vector<std::vector<std::string>> rows;
    std::vector<std::string>& title = rows.emplace_back();
    title.emplace_back("check");
    for (const FigureColumn& column : columns) {
        title.push_back(column.title);
    }
    title.emplace_back("accept");
    for (const std::string& name : rowNames(columns)) {
        std::vector<std::string>& row = rows.emplace_back();
        row.push_back(name);
        std::vector<std::string> accepted;
        for (const FigureColumn& column : columns) {
            const Figure* figure = find(column, name);
            row.push_back(figure != nullptr ? valuesText(*figure) : "");
            const std::string accept = figure != nullptr ? acceptText(*figure) : "";
            if (!accept.empty() &&
                std::find(accepted.begin(), accepted.end(), accept) == accepted.end()) {
                accepted.push_back(accept);
            }
        }
        row.push_back(fmt::format("{}", fmt::join(accepted, " | ")));
    }
    std::vector<std::size_t> widths(rows.front().size(), 0);
    for (const std::vector<std::string>& row : rows) {
        for (std::size_t i = 0; i + 1 < row.size(); ++i) {
            widths[i] = std::max(widths[i], row[i].size());
        }
    }
    std::string text;
    for (const std::vector<std::string>& row : rows) {
        std::string line;
        for (std::size_t i = 0; i < row.size(); ++i) {
            line += fmt::format("{:<{}}  ", row[i], widths[i]);
        }
        line.erase(line.find_last_not_of(' ') + 1);
        text += line + "\n";
    }
    return text;
}

std::vector<std::string> failedFigures(const std::vector<FigureColumn>& columns) {
    std::vector<std::string> lines;
    for (const FigureColumn& column : columns) {
        for (const Figure& figure : column.figures) {
            if (!figure.passed()) {
                lines.push_back(fmt::format("{}: {}: found {}, accepted {}", column.title,
                                            figure.name, valuesText(figure), acceptText(figure)));
            }
        }
    }
    return lines;
}

}  // namespace tessaly::data
