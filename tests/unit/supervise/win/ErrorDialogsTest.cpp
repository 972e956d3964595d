#include "supervise/ErrorDialogs.h"

#include <windows.h>

#include <gtest/gtest.h>

namespace assay_host {
namespace {

TEST(ErrorDialogs, AreDisabledAndNothingElseChanges)
{
    const UINT before = ::GetErrorMode();
    ::SetErrorMode(SEM_NOALIGNMENTFAULTEXCEPT);
    KeepDialogsAway();
    EXPECT_EQ(::GetErrorMode(),
              static_cast<UINT>(SEM_NOALIGNMENTFAULTEXCEPT | SEM_FAILCRITICALERRORS |
                                SEM_NOGPFAULTERRORBOX | SEM_NOOPENFILEERRORBOX));
    ::SetErrorMode(before);
}

} // namespace
} // namespace assay_host
