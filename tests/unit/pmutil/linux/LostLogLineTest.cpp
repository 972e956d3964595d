// A log line that the system doesn't take.
#include "pmutil/LogSinks.h"

#include <cstdio>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <unistd.h>

#include "TempFolder.h"

namespace pmutil {
namespace {

DebugValue gOn{"LostLogLineTest.on", 1};

TEST(LostLogLine, DoesNotSpoilTheStreamForOthers)
{
    InitLogging();
    const TempFolder folder;
    std::FILE* const file = std::fopen("/dev/full", "wb");
    ASSERT_NE(file, nullptr);
    PMStdioLogger logger(file);
    PM_LOG(gOn, "lost");
    EXPECT_EQ(std::ferror(file), 0);

    const int kept = ::open(folder.File("log").c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
    ASSERT_GE(kept, 0);
    ASSERT_GE(::dup2(kept, fileno(file)), 0);
    ::close(kept);
    PM_LOG(gOn, "kept");
    const std::string text = ReadWhole(folder.File("log"));
    EXPECT_THAT(text, testing::StartsWith("00001."));
    EXPECT_THAT(text, testing::EndsWith("] kept\n"));
    std::fclose(file);
}

} // namespace
} // namespace pmutil
