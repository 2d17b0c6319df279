// Computes the twiddle factors of the transforms.
#include "convolution/transform_tables.h"

#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <new>
#include <numbers>
#include <utility>
#include <vector>

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

/// Floats of the passes over rings.
std::size_t ringFloats(std::int32_t columns, std::int32_t lanes) {
    std::size_t floats = 0;
    std::size_t rings = 1;
    for (std::int32_t n = columns; n > 1;) {
        const std::int32_t radix = ringRadix(lanes, n);
        floats += 2 * static_cast<std::size_t>(radix - 1) * rings;
        rings *= static_cast<std::size_t>(radix);
        n /= radix;
    }
    return floats;
}

/// Floats of the first of them, as sums of few rows take it.
std::size_t firstFloats(std::int32_t columns, std::int32_t lanes) {
    const auto radix = static_cast<std::size_t>(ringRadix(lanes, columns));
    return 2 * radix * radix;
}

/// Floats of the passes across the lanes, four rows at a time.
std::size_t acrossFloats(std::int32_t points, std::int32_t lanes) {
    if (lanes == 1) {
        return 0;
    }
    const std::int32_t groups = lanes / 4;
    const std::int32_t vectors = 3 + (4 - 4 / groups);
    return static_cast<std::size_t>(points / 4) * 2 * static_cast<std::size_t>(vectors);
}

class BlockTableStorage {
public:
    BlockTableStorage(std::int32_t points, std::int32_t lanes)
        : rings_(ringFloats(points / lanes, lanes)),
          first_(firstFloats(points / lanes, lanes)),
          across_(acrossFloats(points, lanes)) {
        tables_.points = points;
        tables_.lanes = lanes;
        tables_.columns = points / lanes;
        tables_.rings = rings_.data();
        tables_.first = first_.data();
        tables_.across = across_.data();
        fillFirst();
        fillRings();
    }

    const BlockTables& tables() const { return tables_; }

private:
    void fillFirst() {
        const std::int32_t radix = ringRadix(tables_.lanes, tables_.columns);
        float* out = first_.data();
        for (std::int32_t power = 0; power < radix; ++power) {
            for (std::int32_t ring = 0; ring < radix; ++ring) {
                out = write(out, 1, (wholeTurn + ring) / radix * power);
            }
        }
    }

    /// A ring of polynomials with u^n = c is known by the turn of c, as a share of the circle: c =
    /// e^(-2 pi i turn), a fraction whose denominator is a power of two.
    void fillRings() {
        std::vector<double> turns{wholeTurn};
        float* out = rings_.data();
        const auto splitBy = [&](std::int32_t radix) {
            std::vector<double> split;
            split.reserve(turns.size() * static_cast<std::size_t>(radix));
            for (const double turn : turns) {
                const double root = turn / radix;
                for (std::int32_t r = 1; r < radix; ++r) {
                    out = write(out, 1, root * r);
                }
                for (std::int32_t r = 0; r < radix; ++r) {
                    split.push_back(root + static_cast<double>(r) / radix);
                }
            }
            turns = std::move(split);
        };
        for (std::int32_t n = tables_.columns; n > 1;) {
            const std::int32_t radix = ringRadix(tables_.lanes, n);
            splitBy(radix);
            n /= radix;
        }

        fillAcross(turns);
    }

    /// Four rows at a time: see the passes across the lanes.
    void fillAcross(const std::vector<double>& turns) {
        float* out = across_.data();
        const std::int32_t lanes = tables_.lanes;
        const std::int32_t groups = lanes / 4;  // of four lanes: 1, 2 or 4
        const auto writeLanes = [&](auto&& turnOf) {
            for (std::int32_t lane = 0; lane < lanes; ++lane) {
                write(out + lane, static_cast<std::size_t>(lanes), turnOf(lane));
            }
            out += std::ptrdiff_t{2} * lanes;
        };
        for (std::size_t first = 0; groups > 0 && first < turns.size(); first += 4) {
            // Vector k has lane group k % groups of the rows k / groups * groups + lane / 4.
            for (std::int32_t k = 0; k < 4; ++k) {
                if (k % groups != 0) {
                    writeLanes([&](std::int32_t lane) {
                        const auto row = static_cast<std::size_t>(k / groups * groups + lane / 4);
                        return turns[first + row] * (k % groups) / groups;
                    });
                }
            }
            // Four by four later, what was vector k is lane k of each group of four.
            for (std::int32_t power = 1; power < 4; ++power) {
                writeLanes([&](std::int32_t lane) {
                    const std::int32_t k = lane % 4;
                    const auto row = static_cast<std::size_t>(k / groups * groups + lane / 4);
                    return (turns[first + row] + k % groups) / groups * power / 4.0;
                });
            }
        }
    }

    /// e^(-2 pi i turn), the imaginary part `apart` floats behind the real one. @return behind both
    static float* write(float* out, std::size_t apart, double turn) {
        const double angle = 2.0 * std::numbers::pi * turn;
        out[0] = single(std::cos(angle));
        out[apart] = single(-std::sin(angle));
        return out + apart + 1;
    }

    static constexpr double wholeTurn = 0.75;  // u^M = i

    AlignedArray<float> rings_;
    AlignedArray<float> first_;
    AlignedArray<float> across_;
    BlockTables tables_;
};

// A function-local static for each length and lane count: the language makes each one once, also
// when two engines are built on two threads, and only those asked for exist.
template <class Storage, std::size_t Index>
const auto& tablesAt() {
    constexpr std::int32_t points = std::int32_t{1} << (exponentMin + Index % exponentCount);
    constexpr std::int32_t lanes = laneCounts[Index / exponentCount];
    static const Storage storage(points, lanes);
    return storage.tables();
}

template <class Storage, class Tables, std::size_t... Index>
constexpr auto listTables(std::index_sequence<Index...>) {
    return std::array<const Tables& (*)(), sizeof...(Index)>{&tablesAt<Storage, Index>...};
}

template <class Storage, class Tables>
const Tables* find(std::int32_t points, std::int32_t lanes) noexcept {
    static constexpr auto functions =
        listTables<Storage, Tables>(std::make_index_sequence<exponentCount * laneCounts.size()>());
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

}  // namespace

const TransformTables* transformTables(std::int32_t points, std::int32_t lanes) noexcept {
    return find<TableStorage, TransformTables>(points, lanes);
}

const BlockTables* blockTables(std::int32_t points, std::int32_t lanes) noexcept {
    return find<BlockTableStorage, BlockTables>(points, lanes);
}

}  // namespace tessaly
