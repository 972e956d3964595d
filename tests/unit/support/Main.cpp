// The main function of the unit tests. Drops the state that the process has inherited, so that the
// results don't depend on the parent.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/InheritedState.h"

int main(int argc, char** argv)
{
    DropInheritedState();
    testing::InitGoogleMock(&argc, argv);
    return RUN_ALL_TESTS();
}
