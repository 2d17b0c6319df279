// The command line: what is accepted, and the one line for what is not.
#include "render/options.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace tessaly {
namespace {

using ::testing::HasSubstr;

RenderOptions parse(std::vector<const char*> words) {
    words.insert(words.begin(), "tessaly-render");
    return parseOptions(static_cast<int>(words.size()), words.data(), "/default/data");
}

std::string failureOf(const std::vector<const char*>& words) {
    try {
        parse(words);
    } catch (const UsageError& error) {
        return error.what();
    }
    return "";
}

// With what every request needs in front.
std::string failureWith(std::vector<const char*> words) {
    words.insert(words.begin(), {"--sound", "bursts", "-o", "x.wav"});
    return failureOf(words);
}

RenderOptions parseWith(std::vector<const char*> words) {
    words.insert(words.begin(), {"--sound", "bursts", "-o", "x.wav"});
    return parse(words);
}

TEST(Options, DefaultsAreAnOrbitInTheDry) {
    const RenderOptions options = parse({"in.flac", "-o", "out/x.wav"});
    EXPECT_EQ(options.input, "in.flac");
    EXPECT_EQ(options.output, "out/x.wav");
    EXPECT_EQ(options.picture, "out/x.svg");
    EXPECT_EQ(options.sampleRate, 48000);
    EXPECT_EQ(options.blockLength, 512);
    EXPECT_EQ(options.room, 0);
    EXPECT_EQ(options.dataDirectory, "/default/data");
    EXPECT_EQ(options.format, SampleFormat::Float);
    EXPECT_FALSE(options.duration.has_value());
    const auto& orbit = std::get<OrbitPath>(options.path);
    EXPECT_EQ(orbit.radius, 1.5);
    EXPECT_EQ(orbit.turns, 1.0);
    EXPECT_TRUE(orbit.clockwise);
}

TEST(Options, OrbitTakesAllItsNumbers) {
    const RenderOptions options =
        parseWith({"--orbit", "--radius", "0.5", "--period", "4", "--elevation", "-20", "--azimuth",
                   "-90", "--direction", "anticlockwise"});
    const auto& orbit = std::get<OrbitPath>(options.path);
    EXPECT_EQ(orbit.radius, 0.5);
    EXPECT_EQ(orbit.elevation, -20.0);
    EXPECT_EQ(orbit.startAzimuth, -90.0);
    EXPECT_FALSE(orbit.clockwise);
    EXPECT_EQ(options.orbitPeriod, 4.0);
}

TEST(Options, NegativeNumbersAreValuesNotOptions) {
    const RenderOptions at = parseWith({"--at", "-90,-10,2"});
    const Spherical direction = sphericalOf(std::get<FixedPath>(at.path).position);
    EXPECT_NEAR(direction.azimuth, -90.0, 1e-9);
    EXPECT_NEAR(direction.elevation, -10.0, 1e-9);
    EXPECT_NEAR(direction.distance, 2.0, 1e-9);
    const RenderOptions line = parseWith({"--from", "-1,0,2", "--to", "1,-0.5,2"});
    EXPECT_EQ(std::get<LinePath>(line.path).from.x, -1.0);
    EXPECT_EQ(std::get<LinePath>(line.path).to.y, -0.5);
    const RenderOptions rise = parseWith({"--rise", "-30,150", "--radius", "2"});
    EXPECT_EQ(std::get<RisePath>(rise.path).fromElevation, -30.0);
    EXPECT_EQ(std::get<RisePath>(rise.path).toElevation, 150.0);
    EXPECT_EQ(std::get<RisePath>(rise.path).radius, 2.0);
}

TEST(Options, SettingsKeepTheirOrder) {
    const RenderOptions options = parse({"--set", "Direct=-6", "in.wav", "--set", "Reverb Size=2",
                                         "--set", "8=3.5", "-o", "x.wav"});
    ASSERT_EQ(options.parameters.size(), 3u);
    EXPECT_EQ(options.parameters[0], (std::pair<std::string, float>("Direct", -6.0f)));
    EXPECT_EQ(options.parameters[1], (std::pair<std::string, float>("Reverb Size", 2.0f)));
    EXPECT_EQ(options.parameters[2], (std::pair<std::string, float>("8", 3.5f)));
    EXPECT_EQ(options.input, "in.wav");
}

TEST(Options, RoomsByNumberAndName) {
    EXPECT_EQ(parseWith({"--room", "31"}).room, 31);
    EXPECT_EQ(parseWith({"--room", "Warehouse"}).room, 31);
}

TEST(Options, PictureCanBeNamedOrLeftOut) {
    EXPECT_EQ(parseWith({"--picture", "y.svg"}).picture, "y.svg");
    EXPECT_TRUE(parseWith({"--no-picture"}).picture.empty());
}

TEST(Options, ListingNeedsNothingElse) { EXPECT_TRUE(parse({"--list"}).list); }

TEST(Options, HelpIsNoFailure) { EXPECT_THROW(parse({"--help"}), HelpRequest); }

TEST(Options, EveryRoomGoesIntoADirectory) {
    const RenderOptions options = parse({"in.wav", "--room", "all", "-o", "rooms"});
    EXPECT_TRUE(options.everyRoom);
    EXPECT_TRUE(options.roomPictures);
    EXPECT_EQ(options.output, "rooms");
    EXPECT_TRUE(options.picture.empty());
    EXPECT_FALSE(parse({"in.wav", "--room", "All", "-o", "rooms", "--no-picture"}).roomPictures);
    EXPECT_FALSE(parseWith({"--room", "3"}).everyRoom);
    const RenderOptions page = parse({"in.wav", "--room", "all", "--report", "page"});
    EXPECT_TRUE(page.everyRoom);
    EXPECT_TRUE(page.output.empty());
    EXPECT_FALSE(page.roomPictures);
}

TEST(Options, APageCanStandInForTheSound) {
    const RenderOptions options = parse({"in.wav", "--report", "page"});
    EXPECT_EQ(options.report, "page");
    EXPECT_EQ(options.title, "");
    EXPECT_EQ(parse({"in.wav", "--report", "page", "--title", "Rooms"}).title, "Rooms");
    EXPECT_TRUE(options.output.empty());
    EXPECT_TRUE(options.picture.empty());
    EXPECT_EQ(parseWith({"--report", "page"}).output, "x.wav");
}

TEST(Options, ScenesMayBeSeveralOnAPage) {
    const RenderOptions one = parse({"--scene", "a.json", "-o", "a.wav"});
    ASSERT_EQ(one.scenes.size(), 1u);
    EXPECT_EQ(one.scenes[0], "a.json");
    EXPECT_EQ(one.output, "a.wav");
    EXPECT_TRUE(one.picture.empty());
    const RenderOptions two = parse({"--scene", "a.json", "--scene", "b.json", "--report", "page"});
    ASSERT_EQ(two.scenes.size(), 2u);
    EXPECT_EQ(two.scenes[1], "b.json");
}

TEST(Options, RateAndBlockOfASceneAreOverriddenOnRequestOnly) {
    const RenderOptions plain = parse({"--scene", "a.json", "-o", "a.wav"});
    EXPECT_FALSE(plain.rateGiven);
    EXPECT_FALSE(plain.blockGiven);
    const RenderOptions other =
        parse({"--scene", "a.json", "-o", "a.wav", "--rate", "44100", "--block", "256"});
    EXPECT_TRUE(other.rateGiven);
    EXPECT_TRUE(other.blockGiven);
    EXPECT_EQ(other.sampleRate, 44100);
    EXPECT_EQ(other.blockLength, 256);
}

TEST(Options, WhatASceneTellsIsNotTakenFromTheCommandLine) {
    const std::vector<std::vector<const char*>> told = {{"in.wav"},
                                                        {"--sound", "pluck"},
                                                        {"--text", "x"},
                                                        {"--orbit"},
                                                        {"--radius", "2"},
                                                        {"--turns", "2"},
                                                        {"--period", "2"},
                                                        {"--elevation", "2"},
                                                        {"--azimuth", "2"},
                                                        {"--at", "0,0,1"},
                                                        {"--rise", "0,90"},
                                                        {"--room", "3"},
                                                        {"--room", "all"},
                                                        {"--set", "Direct=-6"},
                                                        {"--loop"},
                                                        {"--duration", "2"},
                                                        {"--at-xyz", "0,0,1"},
                                                        {"--from", "0,0,1", "--to", "0,0,2"},
                                                        {"--direction", "clockwise"},
                                                        {"--picture", "x.svg"}};
    for (std::vector<const char*> words : told) {
        const std::string option = words[0][0] == '-' ? words[0] : "a sound file";
        words.insert(words.begin(), {"--scene", "a.json", "-o", "a.wav"});
        EXPECT_THAT(failureOf(words), HasSubstr(option + " has no meaning for --scene"));
    }
}

struct Refusal {
    std::vector<const char*> words;
    const char* says;
};

TEST(Options, RefusalsSayWhatIsWrong) {
    const Refusal refusals[] = {
        {{"--rate", "32000"}, "no data for 32000 Hz"},
        {{"--rate", "fast"}, "--rate needs a number, got \"fast\""},
        {{"--rate", "48000.5"}, "--rate needs a whole number"},
        {{"--block", "500"}, "--block must be a power of two from 32 to 4096, got 500"},
        {{"--block", "16"}, "--block must be a power of two"},
        {{"--block", "8192"}, "--block must be a power of two"},
        {{"--duration", "0"}, "--duration must be"},
        {{"--duration", "nan"}, "--duration needs a number"},
        {{"--duration", "1e9"}, "--duration must be"},
        {{"--radius", "-1"}, "--radius must be"},
        {{"--turns", "x"}, "--turns needs a number, got \"x\""},
        {{"--turns", "2", "--period", "3"}, "either --turns or --period"},
        {{"--direction", "up"}, "--direction must be clockwise or anticlockwise"},
        {{"--at", "1,2"}, "--at needs 3 numbers"},
        {{"--at", "0,91,1"}, "--at takes"},
        {{"--at-xyz", "1,2,x"}, "--at-xyz needs 3 numbers"},
        {{"--at-xyz", "1,2,3e9"}, "--at-xyz must lie within"},
        {{"--from", "1,2,3"}, "both --from and --to"},
        {{"--rise", "0"}, "--rise needs 2 numbers"},
        {{"--rise", "0,400"}, "--rise takes elevations"},
        {{"--at", "0,0,1", "--orbit"}, "only one of"},
        {{"--at", "0,0,1", "--at-xyz", "0,0,1"}, "only one of"},
        {{"--at", "0,0,1", "--turns", "2"}, "--turns has no meaning for a fixed position"},
        {{"--set", "Direct"}, "--set needs NAME=VALUE"},
        {{"--set", "=1"}, "--set needs NAME=VALUE"},
        {{"--set", "Direct=loud"}, "--set needs a number after ="},
        {{"--room", "53"}, "unknown room \"53\""},
        {{"--room", "Kitchen"}, "unknown room \"Kitchen\""},
        {{"--format", "8"}, "--format must be float, 16 or 24"},
        {{"--picture", "x.png"}, "must end in .svg"},
        {{"--no-picture", "--picture", "x.svg"}, "--picture has no meaning"},
        {{"in.wav"}, "either a sound file or --sound"},
        {{"--bogus"}, "--bogus"},
        {{"--rate"}, "--rate"},
        {{"--text", "x"}, "--text has no meaning without --sound speech"},
        {{"--text", ""}, "--text has no meaning without --sound speech"},
    };
    for (const Refusal& refusal : refusals) {
        const std::string failure = failureWith(refusal.words);
        EXPECT_THAT(failure, HasSubstr(refusal.says));
        EXPECT_EQ(failure.find('\n'), std::string::npos) << failure;
    }
    EXPECT_THAT(failureOf({"--sound", "harp", "-o", "x.wav"}), HasSubstr("unknown sound \"harp\""));
    EXPECT_THAT(failureOf({"-o", "x.wav"}), HasSubstr("no sound given"));
    EXPECT_THAT(failureOf({"in.wav", "-o", "x.wav", "--text", "x"}), HasSubstr("--sound speech"));
    for (const char* text : {"", " \n"}) {
        EXPECT_THAT(failureOf({"--sound", "speech", "-o", "x.wav", "--text", text}),
                    HasSubstr("--text needs something to say"));
    }
    EXPECT_EQ(parse({"--sound", "speech", "-o", "x.wav", "--text", "Hello"}).text, "Hello");
    EXPECT_THAT(failureOf({"--scene", "a.json", "-o", "x.wav", "--text", ""}),
                HasSubstr("--text has no meaning for --scene"));
    EXPECT_THAT(failureOf({"in.wav"}), HasSubstr("no output given"));
    EXPECT_THAT(failureOf({"in.wav", "-o", "x.flac"}), HasSubstr("must end in .wav"));
    EXPECT_THAT(failureOf({"in.wav", "--room", "all"}), HasSubstr("-o DIR for all rooms"));
    EXPECT_THAT(failureOf({"in.wav", "--room", "all", "-o", "d", "--picture", "x.svg"}),
                HasSubstr("--picture has no meaning for --room all"));
    EXPECT_THAT(failureOf({"--room", "all", "-o", "d"}), HasSubstr("no sound given"));
    EXPECT_THAT(failureOf({"--scene", "a.json"}), HasSubstr("no output given"));
    EXPECT_THAT(failureOf({"--scene", "a.json", "-o", "x.flac"}), HasSubstr("must end in .wav"));
    EXPECT_THAT(failureOf({"--scene", "a.json", "--scene", "b.json", "-o", "x.wav"}),
                HasSubstr("-o takes one --scene"));
}

}  // namespace
}  // namespace tessaly
