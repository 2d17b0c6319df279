// A value without an end.
#include "base/process_lifetime.h"

#include <gtest/gtest.h>

namespace tessaly::test {
namespace {

int alive = 0;

struct Counted {
    Counted() { ++alive; }
    ~Counted() { --alive; }
    Counted(const Counted&) = delete;
    Counted& operator=(const Counted&) = delete;
    int value = 7;
};

TEST(ProcessLifetime, MakesItsValueAndNeverEndsIt) {
    alive = 0;
    {
        ProcessLifetime<Counted> held;
        EXPECT_EQ(alive, 1);
        EXPECT_EQ(held->value, 7);
        (*held).value = 8;
        EXPECT_EQ(held->value, 8);
    }
    EXPECT_EQ(alive, 1) << "what other threads may still use stays";
}

}  // namespace
}  // namespace tessaly::test
