// The unit tests' main: they find the same process whoever started it.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/InheritedState.h"

int main(int argc, char** argv)
{
    DropInheritedState();
    testing::InitGoogleMock(&argc, argv);
    return RUN_ALL_TESTS();
}
