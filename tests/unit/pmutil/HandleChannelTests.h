// The tests of every platform's handle channel. Instantiate the suite with a type that has
// `Channel`, the channel's class, and `Calls`, its platform; `MakePipe(read, write)`;
// `Exists(path)`; `PathOf(handle)`; and the texts of failed calls, `kOpenFailed` and so on.
#pragma once

#include <cstdint>
#include <gtest/gtest.h>
#include <string>
#include <vector>

#include "Throws.h"
#include "pmutil/DebugValues.h"
#include "pmutil/HandleChannel.h"
#include "pmutil/PMLogging.h"

template <typename Platform>
class HandleChannelTest : public testing::Test {
protected:
    using Tested = typename Platform::Channel;
    using Path = typename Tested::Path;
    using Handle = typename Tested::Handle;

    ~HandleChannelTest() override
    {
        Tested(Platform::Calls::GetInvalid(), true, &fPath)
            .Reset(Platform::Calls::GetInvalid(), false);
    }

    static Path MakePath(const std::string& ascii) { return Path(ascii.begin(), ascii.end()); }

    // A path in the temporary directory at which there is no file.
    Path NewPath()
    {
        fPath = Tested::MakeTemporaryFileName(MakePath("tst"));
        Tested(Platform::Calls::GetInvalid(), true, &fPath)
            .Reset(Platform::Calls::GetInvalid(), false);
        EXPECT_FALSE(Platform::Exists(fPath));
        return fPath;
    }

    static void WriteFile(const Path& path, const std::string& text)
    {
        Tested::OpenFile(path, pmutil::kOpenWrite, pmutil::kCreateAlways, false)
            ->WriteAll(text.data(), text.size());
    }

    static std::string ReadFile(const Path& path)
    {
        return ReadRest(*Tested::OpenFile(path, pmutil::kOpenRead, pmutil::kOpenExisting, false));
    }

    static std::string ReadRest(pmutil::Reader& reader)
    {
        std::string all;
        char block[256];
        for (auto count = reader.ReadSome(block, sizeof block); count > 0;
             count = reader.ReadSome(block, sizeof block))
            all.append(block, count);
        return all;
    }

    Path fPath;
};

TYPED_TEST_SUITE_P(HandleChannelTest);

TYPED_TEST_P(HandleChannelTest, BadAccessFlagsTouchNothing)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    for (const int access : {0, 4, -1, 7}) {
        EXPECT_TRUE(ThrowsInvalidArgument("OpenFile: bad access flags", [&] {
            Channel::OpenFile(path, access, pmutil::kCreateAlways, false);
        }));
        EXPECT_TRUE(ThrowsInvalidArgument("OpenFile: bad access flags", [&] {
            Channel::OpenFile(path, access, 99, false);
        })) << "access is checked first";
        EXPECT_TRUE(ThrowsInvalidArgument("OpenFile: bad access flags",
                                          [&] { TypeParam::Calls::Open(path, access, 99); }));
    }
    EXPECT_FALSE(TypeParam::Exists(path));
}

TYPED_TEST_P(HandleChannelTest, BadCreationFlagsTouchNothing)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    for (const int creation : {-1, 4, 99}) {
        EXPECT_TRUE(ThrowsInvalidArgument("OpenFile: bad creation flags", [&] {
            Channel::OpenFile(path, pmutil::kOpenReadWrite, creation, false);
        }));
        EXPECT_TRUE(ThrowsInvalidArgument("OpenFile: bad creation flags", [&] {
            TypeParam::Calls::Open(path, pmutil::kOpenReadWrite, creation);
        }));
    }
    EXPECT_FALSE(TypeParam::Exists(path));
}

TYPED_TEST_P(HandleChannelTest, OpenExistingNeedsAFileAndKeepsIt)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kOpenFailed, [&] {
        Channel::OpenFile(path, pmutil::kOpenReadWrite, pmutil::kOpenExisting, false);
    }));
    EXPECT_FALSE(TypeParam::Exists(path));
    this->WriteFile(path, "abcdef");
    auto file = Channel::OpenFile(path, pmutil::kOpenReadWrite, pmutil::kOpenExisting, false);
    file->WriteAll("xy", 2);
    file.reset();
    EXPECT_EQ(this->ReadFile(path), "xycdef");
}

TYPED_TEST_P(HandleChannelTest, TruncateExistingNeedsAFileAndEmptiesIt)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kOpenFailed, [&] {
        Channel::OpenFile(path, pmutil::kOpenWrite, pmutil::kTruncateExisting, false);
    }));
    EXPECT_FALSE(TypeParam::Exists(path));
    this->WriteFile(path, "abcdef");
    Channel::OpenFile(path, pmutil::kOpenWrite, pmutil::kTruncateExisting, false);
    EXPECT_EQ(this->ReadFile(path), "");
}

TYPED_TEST_P(HandleChannelTest, OpenAlwaysMakesTheFileOrKeepsIt)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    Channel::OpenFile(path, pmutil::kOpenReadWrite, pmutil::kOpenAlways, false)
        ->WriteAll("abcdef", 6);
    auto file = Channel::OpenFile(path, pmutil::kOpenReadWrite, pmutil::kOpenAlways, false);
    EXPECT_EQ(this->ReadRest(*file), "abcdef");
}

TYPED_TEST_P(HandleChannelTest, CreateAlwaysMakesTheFileOrEmptiesIt)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    Channel::OpenFile(path, pmutil::kOpenWrite, pmutil::kCreateAlways, false)->WriteAll("abc", 3);
    EXPECT_EQ(this->ReadFile(path), "abc");
    Channel::OpenFile(path, pmutil::kOpenWrite, pmutil::kCreateAlways, false);
    EXPECT_EQ(this->ReadFile(path), "");
}

TYPED_TEST_P(HandleChannelTest, AccessFlagsGiveTheRights)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    this->WriteFile(path, "abc");
    char data = 0;
    auto reader = Channel::OpenFile(path, pmutil::kOpenRead, pmutil::kOpenExisting, false);
    EXPECT_EQ(reader->ReadSome(&data, 1), 1U);
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kWriteFailed, [&] { reader->WriteSome("x", 1); }));
    auto writer = Channel::OpenFile(path, pmutil::kOpenWrite, pmutil::kOpenExisting, false);
    EXPECT_EQ(writer->WriteSome("x", 1), 1U);
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kReadFailed, [&] { writer->ReadSome(&data, 1); }));
    auto both = Channel::OpenFile(path, pmutil::kOpenReadWrite, pmutil::kOpenExisting, false);
    EXPECT_EQ(both->ReadSome(&data, 1), 1U);
    EXPECT_EQ(both->WriteSome("x", 1), 1U);
}

TYPED_TEST_P(HandleChannelTest, DeleteOnClose)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    auto file = Channel::OpenFile(path, pmutil::kOpenReadWrite, pmutil::kCreateAlways, true);
    EXPECT_TRUE(TypeParam::Exists(path));
    auto second = file;
    file.reset();
    EXPECT_TRUE(TypeParam::Exists(path));
    second.reset();
    EXPECT_FALSE(TypeParam::Exists(path));
    file = Channel::OpenFile(path, pmutil::kOpenReadWrite, pmutil::kCreateAlways, true);
    file->Close();
    EXPECT_FALSE(TypeParam::Exists(path));
}

TYPED_TEST_P(HandleChannelTest, TemporaryFileIsEmptyAndWritable)
{
    using Channel = typename TypeParam::Channel;
    auto file = Channel::MakeTemporaryFile(this->MakePath("tst"));
    EXPECT_EQ(this->ReadRest(*file), "");
    file->WriteAll("hello", 5);
    file->Seek(1);
    EXPECT_EQ(this->ReadRest(*file), "ello");
}

TYPED_TEST_P(HandleChannelTest, TemporaryFileGoesWithItsLastReference)
{
    using Channel = typename TypeParam::Channel;
    auto file = Channel::MakeTemporaryFile(this->MakePath("tst"));
    const auto path = TypeParam::PathOf(file->GetHandle());
    auto other = file;
    file.reset();
    EXPECT_TRUE(TypeParam::Exists(path));
    other->WriteAll("x", 1);
    other.reset();
    EXPECT_FALSE(TypeParam::Exists(path));
}

TYPED_TEST_P(HandleChannelTest, TemporaryFileNamesAreDistinctFilesInTheDirectory)
{
    using Channel = typename TypeParam::Channel;
    const auto first = Channel::MakeTemporaryFileName(this->MakePath("tst"));
    const auto second = Channel::MakeTemporaryFileName(this->MakePath("tst"));
    EXPECT_NE(first, second);
    for (const auto& path : {first, second}) {
        EXPECT_EQ(path.find(Channel::GetTemporaryDirectory()), 0U);
        EXPECT_NE(path.find(this->MakePath("tst")), path.npos);
        EXPECT_TRUE(TypeParam::Exists(path));
        EXPECT_EQ(this->ReadFile(path), "");
        Channel::OpenFile(path, pmutil::kOpenRead, pmutil::kOpenExisting, true);
        EXPECT_FALSE(TypeParam::Exists(path));
    }
}

TYPED_TEST_P(HandleChannelTest, SeeksFromThreeOrigins)
{
    using Channel = typename TypeParam::Channel;
    auto file = Channel::MakeTemporaryFile(this->MakePath("tst"));
    file->WriteAll("0123456789", 10);
    EXPECT_EQ(file->Tell(), 10U);
    file->Seek(4);
    file->SeekRelative(-2);
    EXPECT_EQ(file->Tell(), 2U);
    file->SeekRelative(5);
    EXPECT_EQ(this->ReadRest(*file), "789");
    file->Seek(0);
    file->SeekEnd();
    EXPECT_EQ(file->Tell(), 10U);
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kSeekFailed, [&] { file->SeekRelative(-11); }));
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kSeekFailed, [&] { file->Seek(UINT64_MAX); }));
    EXPECT_EQ(file->Tell(), 10U) << "a failed seek leaves the position";
}

TYPED_TEST_P(HandleChannelTest, SetEOFCutsAndExtends)
{
    using Channel = typename TypeParam::Channel;
    auto file = Channel::MakeTemporaryFile(this->MakePath("tst"));
    file->WriteAll("0123456789", 10);
    file->Seek(4);
    file->SetEOF();
    EXPECT_EQ(file->Tell(), 4U);
    file->Seek(0);
    EXPECT_EQ(this->ReadRest(*file), "0123");
    file->Seek(6);
    file->SetEOF();
    file->Seek(0);
    EXPECT_EQ(this->ReadRest(*file), std::string("0123\0\0", 6));
}

TYPED_TEST_P(HandleChannelTest, SetEOFOfAFileOpenForReadingFails)
{
    using Channel = typename TypeParam::Channel;
    const auto path = this->NewPath();
    this->WriteFile(path, "abc");
    auto file = Channel::OpenFile(path, pmutil::kOpenRead, pmutil::kOpenExisting, false);
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kSetEndFailed, [&] { file->SetEOF(); }));
}

TYPED_TEST_P(HandleChannelTest, SeeksBeyondFourGigabytesInASparseFile)
{
    using Channel = typename TypeParam::Channel;
    constexpr std::uint64_t kGiga = 1ULL << 30;
    auto file = Channel::MakeTemporaryFile(this->MakePath("tst"));
    if (!TypeParam::MakeSparse(*file))
        GTEST_SKIP() << "the file system of temporary files has no sparse files";
    file->Seek(5 * kGiga);
    file->WriteAll("end", 3);
    EXPECT_EQ(file->Tell(), 5 * kGiga + 3);
    file->SeekEnd();
    EXPECT_EQ(file->Tell(), 5 * kGiga + 3);
    file->SeekRelative(-static_cast<std::int64_t>(kGiga));
    EXPECT_EQ(file->Tell(), 4 * kGiga + 3);
    char data = 'x';
    EXPECT_EQ(file->ReadSome(&data, 1), 1U);
    EXPECT_EQ(data, '\0');
    file->Seek(5 * kGiga);
    EXPECT_EQ(this->ReadRest(*file), "end");
    file->Seek(4 * kGiga + 1);
    file->SetEOF();
    file->SeekEnd();
    EXPECT_EQ(file->Tell(), 4 * kGiga + 1);
}

TYPED_TEST_P(HandleChannelTest, PipeWhoseWriteEndIsClosedReadsAsEndOfData)
{
    using Channel = typename TypeParam::Channel;
    typename Channel::Handle readEnd{};
    typename Channel::Handle writeEnd{};
    TypeParam::MakePipe(readEnd, writeEnd);
    Channel reader(readEnd, true);
    Channel writer(writeEnd, true);
    writer.WriteAll("last words", 10);
    writer.Close();
    EXPECT_EQ(this->ReadRest(reader), "last words");
    char data = 0;
    EXPECT_EQ(reader.ReadSome(&data, 1), 0U);
    EXPECT_FALSE(reader.ReadAll(&data, 1));
}

TYPED_TEST_P(HandleChannelTest, WriteToAPipeWithoutReaderRaises)
{
    using Channel = typename TypeParam::Channel;
    typename Channel::Handle readEnd{};
    typename Channel::Handle writeEnd{};
    TypeParam::MakePipe(readEnd, writeEnd);
    Channel reader(readEnd, true);
    Channel writer(writeEnd, true);
    reader.Close();
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kBrokenPipe, [&] { writer.WriteSome("x", 1); }));
    EXPECT_TRUE(ThrowsRuntimeError(TypeParam::kBrokenPipe, [&] { writer.WriteAll("x", 1); }));
}

TYPED_TEST_P(HandleChannelTest, CloseOfAnUnownedHandleClosesItOnce)
{
    using Channel = typename TypeParam::Channel;
    typename Channel::Handle readEnd{};
    typename Channel::Handle writeEnd{};
    TypeParam::MakePipe(readEnd, writeEnd);
    Channel reader(readEnd, true);
    Channel writer(writeEnd, false);
    writer.Close();
    EXPECT_FALSE(writer.IsOpen());
    char data = 0;
    EXPECT_EQ(reader.ReadSome(&data, 1), 0U) << "the write end is really closed";
    writer.Close();
    EXPECT_TRUE(ThrowsRuntimeError("pmutil::Channel not open", [&] { writer.WriteSome("x", 1); }));
}

TYPED_TEST_P(HandleChannelTest, UnownedHandleOutlivesTheChannel)
{
    using Channel = typename TypeParam::Channel;
    typename Channel::Handle readEnd{};
    typename Channel::Handle writeEnd{};
    TypeParam::MakePipe(readEnd, writeEnd);
    Channel reader(readEnd, true);
    {
        Channel writer(writeEnd, false);
        writer.WriteAll("a", 1);
    }
    Channel writer(writeEnd, true);
    writer.WriteAll("b", 1);
    writer.Close();
    EXPECT_EQ(this->ReadRest(reader), "ab");
}

TYPED_TEST_P(HandleChannelTest, ResetRepointsAndClosesWhatItOwned)
{
    using Channel = typename TypeParam::Channel;
    typename Channel::Handle firstRead{};
    typename Channel::Handle firstWrite{};
    typename Channel::Handle secondRead{};
    typename Channel::Handle secondWrite{};
    TypeParam::MakePipe(firstRead, firstWrite);
    TypeParam::MakePipe(secondRead, secondWrite);
    Channel first(firstRead, true);
    Channel second(secondRead, true);
    Channel writer(firstWrite, true);
    writer.WriteAll("1", 1);
    writer.Reset(secondWrite, true);
    EXPECT_EQ(writer.GetHandle(), secondWrite);
    EXPECT_EQ(this->ReadRest(first), "1") << "its write end is closed";
    writer.WriteAll("2", 1);
    writer.Close();
    EXPECT_EQ(this->ReadRest(second), "2");
}

TYPED_TEST_P(HandleChannelTest, ResetForgetsWhatWasPutBack)
{
    using Channel = typename TypeParam::Channel;
    typename Channel::Handle read{};
    typename Channel::Handle write{};
    TypeParam::MakePipe(read, write);
    auto channel = Channel::MakeTemporaryFile(this->MakePath("tst"));
    channel->Unread("old", 3);
    channel->Reset(read, true);
    Channel(write, true).WriteAll("new", 3);
    EXPECT_EQ(this->ReadRest(*channel), "new");
}

TYPED_TEST_P(HandleChannelTest, ReadAllThatComesShortPutsBack)
{
    using Channel = typename TypeParam::Channel;
    auto file = Channel::MakeTemporaryFile(this->MakePath("tst"));
    file->WriteAll("abcd", 4);
    file->Seek(0);
    char bytes[10];
    EXPECT_FALSE(file->ReadAll(bytes, 10));
    EXPECT_EQ(this->ReadRest(*file), "abcd");
}

TYPED_TEST_P(HandleChannelTest, ResetLogsTheHandleItCloses)
{
    using Channel = typename TypeParam::Channel;
    class Recorder : public pmutil::PMLogger {
    public:
        Recorder() : PMLogger("recorder") {}
        void Write(const char* data, std::size_t size) override { fText.append(data, size); }
        std::string fText;
    };
    pmutil::InitLogging();
    static pmutil::DebugValue log{"BINIO_LOG", 0};
    const Recorder recorder;
    auto file = Channel::MakeTemporaryFile(this->MakePath("tst"));
    const std::string expected = TypeParam::ClosingText(file->GetHandle());
    pmutil::GetDebugValue(log) = 1;
    file->Close();
    pmutil::GetDebugValue(log) = 0;
    EXPECT_NE(recorder.fText.find(expected), std::string::npos) << recorder.fText;
}

TYPED_TEST_P(HandleChannelTest, StandardChannelsAreMadeOnce)
{
    using Channel = typename TypeParam::Channel;
    EXPECT_EQ(&Channel::GetStandardInput(), &Channel::GetStandardInput());
    EXPECT_EQ(&Channel::GetStandardOutput(), &Channel::GetStandardOutput());
    EXPECT_EQ(&Channel::GetStandardError(), &Channel::GetStandardError());
    EXPECT_NE(&Channel::GetStandardOutput(), &Channel::GetStandardError());
    EXPECT_TRUE(Channel::GetStandardError().IsOpen());
    Channel::GetStandardOutput().Flush();
}

REGISTER_TYPED_TEST_SUITE_P(
    HandleChannelTest, BadAccessFlagsTouchNothing, BadCreationFlagsTouchNothing,
    OpenExistingNeedsAFileAndKeepsIt, TruncateExistingNeedsAFileAndEmptiesIt,
    OpenAlwaysMakesTheFileOrKeepsIt, CreateAlwaysMakesTheFileOrEmptiesIt, AccessFlagsGiveTheRights,
    DeleteOnClose, TemporaryFileIsEmptyAndWritable, TemporaryFileGoesWithItsLastReference,
    TemporaryFileNamesAreDistinctFilesInTheDirectory, SeeksFromThreeOrigins, SetEOFCutsAndExtends,
    SetEOFOfAFileOpenForReadingFails, SeeksBeyondFourGigabytesInASparseFile,
    PipeWhoseWriteEndIsClosedReadsAsEndOfData, WriteToAPipeWithoutReaderRaises,
    CloseOfAnUnownedHandleClosesItOnce, UnownedHandleOutlivesTheChannel,
    ResetRepointsAndClosesWhatItOwned, ResetForgetsWhatWasPutBack, ReadAllThatComesShortPutsBack,
    ResetLogsTheHandleItCloses, StandardChannelsAreMadeOnce);
