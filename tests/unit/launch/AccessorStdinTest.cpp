// A launch by an accessor, and the child's standard input through it.
#include <gmock/gmock.h>

#include "ConsoleAppFixture.h"
#include "pmutil/ConsoleAppAccessor.h"

using namespace pmutil;

namespace {

// Takes all that is written, and is then closed: the other end has gone meanwhile.
class ClosingChannel : public FakeChannel {
protected:
    std::uint64_t BinioWriteSome(const void* bytes, std::uint64_t nbytes) override
    {
        const std::uint64_t count = FakeChannel::BinioWriteSome(bytes, nbytes);
        fOpen = false;
        return count;
    }
};

class ClosingLauncher : public FakeLauncher {
public:
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override
    {
        LaunchResult result = FakeLauncher::Launch(program, args);
        fInput = boost::make_shared<ClosingChannel>();
        result.fAppInput = fInput;
        return result;
    }
};

class AccessorStdin : public ConsoleAppFixture {
protected:
    AccessorStdin() { fParams.fKeepStdin = true; }

    void LaunchByAccessor()
    {
        NewData();
        fStdout->fGate.Close();
        fStderr->fGate.Close();
        fClient.Launch(fData, fParams);
    }

    ConsoleAppAccessor fClient{TaskID::kClient, nullptr};
};

TEST_F(AccessorStdin, WritesToTheChildThatItLaunched)
{
    LaunchByAccessor();
    EXPECT_EQ(fClient.GetExecutionData(), fData);
    const unsigned char bytes[] = {'a', 'b', 'c'};
    fClient.WriteAppStdin(bytes, 2);
    fClient.WritelnAppStdin("line");
    fClient.WritelnAppStdin(std::string("another"));
    EXPECT_EQ(fLauncher->fInput->fWritten, "abline\nanother\n");
    EXPECT_TRUE(fLauncher->fInput->IsOpen());
    fClient.CloseAppStdin();
    EXPECT_FALSE(fLauncher->fInput->IsOpen());
    End(kEndedNormally, 4);
    int exitCode = -1;
    EXPECT_EQ(fClient.Wait(&exitCode, kLong), State::kFinished);
    EXPECT_EQ(exitCode, 4);
    EXPECT_EQ(fApp->CountEvents("OnRunning"), 1);
}

TEST_F(AccessorStdin, AnInputThatClosesDuringAWriteIsAFailure)
{
    fLauncher = boost::make_shared<ClosingLauncher>();
    fApp = boost::make_shared<RecordingApp>(fLauncher, [this] { return fLauncher; });
    LaunchByAccessor();
    const unsigned char byte = 'a';
    EXPECT_TRUE(
        ThrowsRuntimeError("pmutil::Channel not open", [&] { fClient.WriteAppStdin(&byte, 1); }));
    EXPECT_EQ(fLauncher->fInput->fWritten, "a");
    End(kEndedNormally);
    EXPECT_EQ(fClient.Wait(nullptr, kLong), State::kFinished);
}

} // namespace
