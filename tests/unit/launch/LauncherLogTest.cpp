// The log of the pipes that a launch makes.
#include <gmock/gmock.h>
#include <set>
#include <string>

#include "RecordingLogger.h"
#include "TestChild.h"
#include "pmutil/Launcher.h"
#include "support/Waits.h"

using namespace pmutil;

namespace {

TEST(LauncherLog, EachPipeIsLoggedWithItsHandlesInOrder)
{
    const DebugValueSetter log("BINIO_LOG", 1);
    const RecordingLogger recorder;
    const boost::shared_ptr<Launcher> launcher = MakeLauncher();
    const LaunchResult ends = launcher->Launch(TEST_CHILD, {"exit", "0"});
    int exitCode = -1;
    launcher->Wait(&exitCode);

    ASSERT_GE(recorder.lines.size(), 3U);
    std::set<std::string> handles;
    for (const auto& [line, stream] : {std::pair{0, "Stdin"}, {1, "Stdout"}, {2, "Stderr"}}) {
        std::istringstream text(MessageOf(recorder.lines[static_cast<std::size_t>(line)]));
        for (const char* const end : {"Rd=", "Wr="}) {
            std::string word;
            text >> word;
            const std::string prefix = std::string("child") + stream + end;
            EXPECT_THAT(word, testing::StartsWith(prefix));
            handles.insert(word.substr(prefix.size()));
        }
        EXPECT_TRUE((text >> std::ws).eof());
    }
    EXPECT_EQ(handles.size(), 6U);
    EXPECT_EQ(handles.count(""), 0U);
}

} // namespace
