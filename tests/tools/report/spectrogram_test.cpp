// Levels and places of known sounds in the spectrogram, its colours, and its packed picture.
#include "report/spectrogram.h"

#include <gtest/gtest.h>
#include <png.h>

#include <cmath>
#include <numbers>

#include "render/binaural_measures.h"

namespace tessaly {
namespace {

std::vector<float> sine(double hertz, double amplitude, double seconds, int rate) {
    std::vector<float> stereo(2 * static_cast<std::size_t>(seconds * rate));
    for (std::size_t i = 0; i < stereo.size(); i += 2) {
        const double phase = 2.0 * std::numbers::pi * hertz * static_cast<double>(i / 2) / rate;
        stereo[i] = static_cast<float>(amplitude * std::sin(phase));
    }
    return stereo;
}

int loudestRow(const Spectrogram& spectrogram, int column) {
    int loudest = 0;
    for (int row = 1; row < spectrogram.rows; ++row) {
        const auto at = [&](int one) {
            return spectrogram
                .decibels[static_cast<std::size_t>(one * spectrogram.columns + column)];
        };
        loudest = at(row) > at(loudest) ? row : loudest;
    }
    return loudest;
}

TEST(Spectrogram, SinesAreAtTheirFrequencyAndLevel) {
    for (const int rate : {24000, 48000}) {
        for (const double hertz : {100.0, 1000.0, 11000.0}) {
            SCOPED_TRACE(testing::Message() << rate << " " << hertz);
            const Spectrogram left = spectrogramOf(sine(hertz, 0.5, 0.3, rate), 0, rate);
            const int row = loudestRow(left, left.columns / 2);
            const double shown = lowestShownHertz * std::pow(highestShownHertz / lowestShownHertz,
                                                             1.0 - (row + 0.5) / left.rows);
            // A row, or two bins of the transform where they are wider.
            EXPECT_NEAR(shown, hertz, std::max(0.03 * hertz, 24.0));
            // -6.02 dB; a line between two bands gives each a half.
            EXPECT_NEAR(loudestOf(left), -6.02, 3.1);
            EXPECT_LE(loudestOf(left), -5.5);
        }
    }
}

TEST(Spectrogram, EarsAreApart) {
    const std::vector<float> stereo = sine(1000.0, 0.5, 0.2, 48000);
    EXPECT_GT(loudestOf(spectrogramOf(stereo, 0, 48000)), -10.0);
    EXPECT_DOUBLE_EQ(loudestOf(spectrogramOf(stereo, 1, 48000)), silenceDb);
}

TEST(Spectrogram, ColumnsFollowTime) {
    std::vector<float> stereo(2 * 48000);
    stereo[2 * 36000] = 1.0f;
    const Spectrogram spectrogram = spectrogramOf(stereo, 0, 48000);
    std::size_t loudest = 0;
    for (std::size_t column = 0; column < static_cast<std::size_t>(spectrogram.columns); ++column) {
        loudest = spectrogram.decibels[column] > spectrogram.decibels[loudest] ? column : loudest;
    }
    EXPECT_NEAR(static_cast<double>(loudest) / spectrogram.columns, 0.75, 0.01);
}

TEST(Spectrogram, ShortestSoundHasAPicture) {
    const std::vector<float> one = {1.0f, 1.0f};
    const Spectrogram spectrogram = spectrogramOf(one, 1, 48000);
    EXPECT_EQ(spectrogram.columns, 1);
    EXPECT_GT(loudestOf(spectrogram), silenceDb);
}

TEST(ColourScale, BrightnessRisesEvenly) {
    const auto lightness = [](const Rgb& colour) {
        const auto linear = [](int part) {
            const double value = part / 255.0;
            return value <= 0.04045 ? value / 12.92 : std::pow((value + 0.055) / 1.055, 2.4);
        };
        const double y = 0.2126 * linear(colour.red) + 0.7152 * linear(colour.green) +
                         0.0722 * linear(colour.blue);
        return 116.0 * std::cbrt(y) - 16.0;  // CIE L*, above its linear foot
    };
    const ColourScale& scale = levelColours();
    const double first = lightness(scale.front());
    const double last = lightness(scale.back());
    EXPECT_LT(first, 10.0);
    EXPECT_GT(last, 90.0);
    const double step = (last - first) / 16.0;
    for (std::size_t i = 16; i < scale.size(); i += 16) {
        const double rise = lightness(scale[i]) - lightness(scale[i - 16]);
        EXPECT_GT(rise, 0.5 * step) << i;
        EXPECT_LT(rise, 1.6 * step) << i;
    }
}

TEST(PngImage, DecodesToItsColours) {
    IndexedImage image{3, 2, {0, 1, 2, 253, 254, 255}};
    const std::vector<unsigned char> png = encodePng(image, levelColours());
    png_image head{};
    head.version = PNG_IMAGE_VERSION;
    ASSERT_NE(png_image_begin_read_from_memory(&head, png.data(), png.size()), 0);
    EXPECT_EQ(head.width, 3u);
    EXPECT_EQ(head.height, 2u);
    head.format = PNG_FORMAT_RGB;
    std::vector<unsigned char> pixels(PNG_IMAGE_SIZE(head));
    ASSERT_NE(png_image_finish_read(&head, nullptr, pixels.data(), 0, nullptr), 0);
    for (std::size_t i = 0; i < image.pixels.size(); ++i) {
        const Rgb& colour = levelColours()[image.pixels[i]];
        EXPECT_EQ(pixels[3 * i], colour.red);
        EXPECT_EQ(pixels[3 * i + 1], colour.green);
        EXPECT_EQ(pixels[3 * i + 2], colour.blue);
    }
}

TEST(PngImage, LevelsBeyondTheScaleTakeItsEnds) {
    Spectrogram spectrogram{4, 1, {-200.0f, -80.0f, 0.0f, 30.0f}};
    EXPECT_EQ(imageOf(spectrogram, -80.0, 0.0).pixels, (std::vector<std::uint8_t>{0, 0, 255, 255}));
}

}  // namespace
}  // namespace tessaly
