// Engines of several threads do not meet in what the convolvers of a thread share.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <thread>

#include "convolution/convolver_rig.h"
#include "convolution/kernel_fixture.h"

namespace tessaly::test {
namespace {

/// A source that moves in every block.
class Player {
public:
    Player(std::int32_t blockLength, std::int16_t partitions) : rig_(blockLength, partitions) {}

    void make() {
        rig_.makeBoth();
        rig_.heardOfOld = 64;
        rig_.first->watch(&notes_, 0);
        rig_.first->continueResults();
    }
    void play() {
        const auto length = static_cast<std::size_t>(rig_.blockLength);
        Noise noise{5};
        for (int n = 0; n < 400; ++n) {
            rig_.first->beforeWriting(n > 0);
            std::ranges::copy(noise.samples(length), rig_.filterLeft.begin());
            notes_.written.include(0, rig_.blockLength);
            rig_.feed(noise.samples(length));
            rig_.run(true);
            continued += rig_.first->oldContinued() ? 1 : 0;
            heard.insert(heard.end(), rig_.firstLeft.begin() + rig_.blockLength,
                         rig_.firstLeft.end());
            heard.insert(heard.end(), rig_.secondLeft.begin() + rig_.blockLength,
                         rig_.secondLeft.begin() + rig_.blockLength + (n > 0 ? 64 : 0));
        }
    }

    std::vector<float> heard;
    int continued = 0;

private:
    ConvolverRig rig_;
    FirNotes notes_;
};

class ConvolversOfTwoThreads : public testing::Test {
protected:
    ConvolversOfTwoThreads() { resetConvolutionState(); }
    ~ConvolversOfTwoThreads() override { resetConvolutionState(); }
    ConvolversOfTwoThreads(const ConvolversOfTwoThreads&) = delete;
    ConvolversOfTwoThreads& operator=(const ConvolversOfTwoThreads&) = delete;
};

TEST_F(ConvolversOfTwoThreads, DoNotDisturbEachOther) {
    for (const auto& [blockLength, partitions] :
         {std::pair<std::int32_t, std::int16_t>{64, 1}, {256, 4}}) {
        Player alone(blockLength, partitions);
        alone.make();
        alone.play();
        EXPECT_GT(alone.continued, 300);
        // Built by this thread, which does not play meanwhile.
        Player first(blockLength, partitions);
        Player second(blockLength, partitions);
        first.make();
        second.make();
        std::thread one([&] { first.play(); });
        std::thread two([&] { second.play(); });
        one.join();
        two.join();
        // Built where it plays.
        Player third(blockLength, partitions);
        std::thread three([&] {
            third.make();
            third.play();
        });
        three.join();
        EXPECT_EQ(third.heard, alone.heard);
        double peak = 0.0;
        double difference = 0.0;
        ASSERT_EQ(first.heard.size(), alone.heard.size());
        ASSERT_EQ(second.heard.size(), alone.heard.size());
        for (std::size_t i = 0; i < alone.heard.size(); ++i) {
            const auto expected = static_cast<double>(alone.heard[i]);
            peak = std::max(peak, std::abs(expected));
            difference =
                std::max({difference, std::abs(expected - static_cast<double>(first.heard[i])),
                          std::abs(expected - static_cast<double>(second.heard[i]))});
        }
        EXPECT_LT(difference, 1e-6 * peak);
    }
}

}  // namespace
}  // namespace tessaly::test
