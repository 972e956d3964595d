#include "pmutil/StopRequest.h"

#include <gtest/gtest.h>

using namespace pmutil;

namespace {

TEST(StopRequest, CallsAllItsListeners)
{
    StopRequest stop;
    int calls = 0;
    int otherCalls = 0;
    const StopListener listener(stop, [&calls] { ++calls; });
    {
        const StopListener other(stop, [&otherCalls] { ++otherCalls; });
        EXPECT_FALSE(stop.IsRaised());
        stop.Raise();
    }
    EXPECT_TRUE(stop.IsRaised());
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(otherCalls, 1);
    stop.Raise();
    EXPECT_EQ(calls, 2);
    EXPECT_EQ(otherCalls, 1) << "it is not registered any more";
}

TEST(StopRequest, CallsAListenerThatIsRegisteredLater)
{
    StopRequest stop;
    stop.Raise();
    int calls = 0;
    const StopListener listener(stop, [&calls] { ++calls; });
    EXPECT_EQ(calls, 1);
}

} // namespace
