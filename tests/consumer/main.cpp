// Uses a little of everything that an installed pmutil offers.
#include <cstdio>
#include <string>

#include <pmutil/Buffer.h>
#include <pmutil/Fmt.h>
#include <pmutil/LogSinks.h>
#include <pmutil/PMLogging.h>
#include <pmutil/Previewer.h>
#include <pmutil/RunProgram.h>

namespace {

pmutil::DebugValue gLog{"ConsumerLog", 1};

} // namespace

int main()
{
    pmutil::InitLogging();
    const pmutil::PMStdioLogger logger(stderr);

    pmutil::Buffer buffer(0);
    buffer.WriteAll("hello", 5);
    buffer.Seek(0);
    std::string text(5, ' ');
    {
        pmutil::Previewer preview(buffer);
        preview.ReadSome(text.data(), 2);
    }
    if (!buffer.ReadAll(text.data(), 5))
        return 1;
    const pmutil::RunResult run = pmutil::RunProgram("/bin/sh", {"-c", "echo hello; exit 7"});
    if (run.fEnd != pmutil::State::kFinished || run.fExitCode != 7 || run.fOutput != "hello\n")
        return 1;
    std::string quoted;
    pmutil::Fmt::ToText(quoted, text.c_str());
    PM_LOG(gLog, "read " << quoted);
    std::puts(quoted.c_str());
    return quoted == "\"hello\"" ? 0 : 1;
}
