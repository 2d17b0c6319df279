// Computes the twiddle factors of the real transform.
#include "convolution/transform_tables.h"

#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <new>
#include <numbers>
#include <utility>

#include "base/aligned_array.h"
#include "base/precision.h"

namespace tessaly {
namespace {

constexpr int exponentMin = 1;   // 2 points
constexpr int exponentMax = 15;  // 32768 points
constexpr std::size_t exponentCount = exponentMax - exponentMin + 1;
constexpr std::array<std::int32_t, 4> laneCounts{1, 4, 8, 16};

/// e^(-2 pi i k / n); k n stays far below 2^53, so the angle is exact but for its last rounding.
struct Root {
    double re;
    double im;
    Root(std::int64_t k, std::int64_t n) {
        const double angle =
            2.0 * std::numbers::pi * static_cast<double>(k % n) / static_cast<double>(n);
        re = std::cos(angle);
        im = -std::sin(angle);
    }
};

std::size_t passFloats(std::int32_t columns) {
    std::size_t floats = 0;
    for (std::int32_t n = columns; n > 8; n /= 4) {
        floats += static_cast<std::size_t>(n / 4) * 6;
    }
    return floats;
}

class TableStorage {
public:
    TableStorage(std::int32_t points, std::int32_t lanes)
        : passes_(passFloats(points / lanes)),
          across_(2 * static_cast<std::size_t>(points - points / lanes)),
          split_(2 * static_cast<std::size_t>(points)) {
        tables_.points = points;
        tables_.lanes = lanes;
        tables_.columns = points / lanes;
        tables_.passes = passes_.data();
        tables_.across = across_.data();
        tables_.split = split_.data();
        fillPasses();
        fillAcross();
        fillSplit();
    }

    const TransformTables& tables() const { return tables_; }

private:
    void fillPasses() {
        float* out = passes_.data();
        for (std::int32_t n = tables_.columns; n > 8; n /= 4) {
            for (std::int32_t p = 0; p < n / 4; ++p) {
                for (std::int32_t r = 1; r < 4; ++r) {
                    const Root root(std::int64_t{p} * r, n);
                    *out++ = single(root.re);
                    *out++ = single(root.im);
                }
            }
        }
    }

    void fillAcross() {
        float* out = across_.data();
        for (std::int32_t k0 = 0; k0 < tables_.columns; k0 += tables_.lanes) {
            for (std::int32_t c = 1; c < tables_.lanes; ++c) {
                for (std::int32_t lane = 0; lane < tables_.lanes; ++lane) {
                    const Root root(std::int64_t{c} * (k0 + lane), tables_.points);
                    out[lane] = single(root.re);
                    out[tables_.lanes + lane] = single(root.im);
                }
                out += std::ptrdiff_t{2} * tables_.lanes;
            }
        }
    }

    void fillSplit() {
        float* out = split_.data();
        for (std::int32_t k0 = 0; k0 < tables_.points; k0 += tables_.lanes) {
            for (std::int32_t lane = 0; lane < tables_.lanes; ++lane) {
                const Root root(k0 + lane, 2 * std::int64_t{tables_.points});
                out[lane] = single(0.5 * root.im);
                out[tables_.lanes + lane] = single(-0.5 * root.re);
            }
            out += std::ptrdiff_t{2} * tables_.lanes;
        }
    }

    AlignedArray<float> passes_;
    AlignedArray<float> across_;
    AlignedArray<float> split_;
    TransformTables tables_;
};

// A function-local static for each length and lane count: the language makes each one once, also
// when two engines are built on two threads, and only those asked for exist.
template <std::size_t Index>
const TransformTables& tablesAt() {
    constexpr std::int32_t points = std::int32_t{1} << (exponentMin + Index % exponentCount);
    constexpr std::int32_t lanes = laneCounts[Index / exponentCount];
    static const TableStorage storage(points, lanes);
    return storage.tables();
}

using TablesFunction = const TransformTables& (*)();

template <std::size_t... Index>
constexpr std::array<TablesFunction, sizeof...(Index)> listTables(std::index_sequence<Index...>) {
    return {&tablesAt<Index>...};
}

}  // namespace

const TransformTables* transformTables(std::int32_t points, std::int32_t lanes) noexcept {
    static constexpr auto functions =
        listTables(std::make_index_sequence<exponentCount * laneCounts.size()>());
    if (points < 2 || !std::has_single_bit(static_cast<std::uint32_t>(points)) ||
        points > (std::int32_t{1} << exponentMax)) {
        return nullptr;
    }
    const auto exponent = static_cast<std::size_t>(
        std::countr_zero(static_cast<std::uint32_t>(points)) - exponentMin);
    for (std::size_t i = 0; i < laneCounts.size(); ++i) {
        if (laneCounts[i] == lanes && std::int64_t{lanes} * lanes <= points) {
            try {
                return &functions[i * exponentCount + exponent]();
            } catch (const std::bad_alloc&) {
                return nullptr;
            }
        }
    }
    return nullptr;
}

}  // namespace tessaly
