#include "output/ProgressLine.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <fcntl.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <termios.h>
#include <unistd.h>

#include <memory>
#include <stdexcept>
#include <string>

#include "output/WriterThread.h"

namespace assay_host {
namespace {

// A terminal that is standard error until its text is taken.
class ErrorTerminal {
public:
    explicit ErrorTerminal(unsigned short columns)
        : fControl(::posix_openpt(O_RDWR | O_NOCTTY)), fBefore(::dup(STDERR_FILENO))
    {
        ::grantpt(fControl);
        ::unlockpt(fControl);
        char name[64] = {};
        ::ptsname_r(fControl, name, sizeof name);
        const int terminal = ::open(name, O_RDWR | O_NOCTTY);
        if (terminal < 0)
            throw std::runtime_error("this machine has no pseudo-terminal");
        termios raw = {};
        ::tcgetattr(terminal, &raw);
        ::cfmakeraw(&raw);
        ::tcsetattr(terminal, TCSANOW, &raw);
        winsize size = {};
        size.ws_col = columns;
        ::ioctl(terminal, TIOCSWINSZ, &size);
        ::dup2(terminal, STDERR_FILENO);
        ::close(terminal);
    }
    ~ErrorTerminal()
    {
        Restore();
        ::close(fBefore);
        ::close(fControl);
    }
    ErrorTerminal(const ErrorTerminal&) = delete;
    ErrorTerminal& operator=(const ErrorTerminal&) = delete;

    // False if what is written to it doesn't end so within a minute.
    bool Await(const std::string& end)
    {
        constexpr int kMinute = 60'000;
        pollfd control = {fControl, POLLIN, 0};
        while (fText.size() < end.size() ||
               fText.compare(fText.size() - end.size(), end.size(), end) != 0)
            if (::poll(&control, 1, kMinute) != 1 || !Read())
                return false;
        return true;
    }

    // All that was written to it. Standard error is what it was before.
    std::string Take()
    {
        Restore();
        while (Read()) {
        }
        return fText;
    }

private:
    void Restore() { ::dup2(fBefore, STDERR_FILENO); }

    // False once nobody has the terminal any more.
    bool Read()
    {
        char block[256];
        const ::ssize_t count = ::read(fControl, block, sizeof block);
        fText.append(block, count > 0 ? static_cast<std::size_t>(count) : 0);
        return count > 0;
    }

    const int fControl;
    const int fBefore;
    std::string fText;
};

TEST(ProgressLine, IsWrittenOverAndTakenAway)
{
    ErrorTerminal terminal(80);
    {
        ProgressLine line;
        line.Show("long text");
        line.Show("short");
        line.Clear();
        line.Clear();
        line.Show("again");
    }
    EXPECT_EQ(terminal.Take(), "\rlong text"
                               "\rshort    "
                               "\r     \r"
                               "\ragain"
                               "\r     \r");
}

TEST(ProgressLine, FitsTheTerminalInPlainCharacters)
{
    ErrorTerminal terminal(6);
    {
        ProgressLine line;
        line.Show("caf\xC3\xA9 and more");
    }
    EXPECT_EQ(terminal.Take(), "\rcaf??\r     \r");
    ErrorTerminal other(6);
    {
        ProgressLine line;
        line.Show("} ~\x7F\x1F");
    }
    EXPECT_EQ(other.Take(), "\r} ~??\r     \r");
}

TEST(ProgressLine, TakesATerminalWithoutAWidthForOneOf80)
{
    for (const auto& [width, shown] : {std::pair<unsigned short, int>{0, 79}, {80, 79}, {2, 1}}) {
        ErrorTerminal terminal(width);
        {
            ProgressLine line;
            line.Show(std::string(200, 'x'));
        }
        const std::string text = terminal.Take();
        EXPECT_EQ(std::count(text.begin(), text.end(), 'x'), shown) << width;
    }
}

TEST(ProgressLine, IsNothingWhereStandardErrorIsNoTerminal)
{
    testing::internal::CaptureStderr();
    {
        ProgressLine line;
        line.Show("text");
        line.Clear();
    }
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

class NoOutput : public Output {
public:
    void Write(std::string_view /*text*/) override {}
    void Finish() override {}
};

// The thread that shows the line writes the others too.
TEST(ProgressLine, MakesWayForOtherLinesAndForTheEnd)
{
    ErrorTerminal terminal(80);
    WriterThread writer(std::make_unique<NoOutput>(), [] {});
    writer.ShowProgress("one");
    EXPECT_TRUE(terminal.Await("\rone"));
    writer.WriteError("a line\n");
    EXPECT_TRUE(terminal.Await("a line\n"));
    writer.ShowProgress("two");
    EXPECT_TRUE(terminal.Await("\rtwo"));
    EXPECT_TRUE(writer.Finish(std::nullopt));
    EXPECT_EQ(terminal.Take(), "\rone\r   \ra line\n\rtwo\r   \r");
}

} // namespace
} // namespace assay_host
