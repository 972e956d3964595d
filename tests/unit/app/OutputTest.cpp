#include "Output.h"

#include <functional>
#include <stdexcept>

#include <gmock/gmock.h>

#include "AppFixtures.h"

namespace assay {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

// The first `failures` writes and flushes fail; later ones are recorded.
class UnreliableBuffer : public std::stringbuf {
public:
    explicit UnreliableBuffer(int failures) : fFailures(failures) {}

protected:
    std::streamsize xsputn(const char* text, std::streamsize size) override
    {
        return Refuse() ? 0 : std::stringbuf::xsputn(text, size);
    }
    int_type overflow(int_type character) override
    {
        return Refuse() ? traits_type::eof() : std::stringbuf::overflow(character);
    }

private:
    bool Refuse() { return fFailures > 0 && fFailures-- > 0; }
    int fFailures;
};

// Accepts all writes; all flushes fail.
class UnflushableBuffer : public std::stringbuf {
protected:
    int sync() override { return -1; }
};

class ThrowingBuffer : public std::streambuf {
protected:
    int_type overflow(int_type) override { throw std::runtime_error("broken"); }
};

// Records each write separately and counts the flushes.
class WritesBuffer : public std::streambuf {
public:
    Lines writes;
    int flushes = 0;

protected:
    std::streamsize xsputn(const char* text, std::streamsize size) override
    {
        writes.emplace_back(text, static_cast<std::size_t>(size));
        return size;
    }
    int_type overflow(int_type character) override
    {
        writes.emplace_back(1, traits_type::to_char_type(character));
        return character;
    }
    int sync() override
    {
        ++flushes;
        return 0;
    }
};

// An application with the real standard output stream.
class PlainApp : public GPUAssayApp {};

TEST(Output, TextOrNullOfANullPointer)
{
    EXPECT_STREQ(TextOrNull("x"), "x");
    EXPECT_STREQ(TextOrNull(nullptr), "<NULL>");
}

TEST(Output, StdoutWritesTheTextAndALineEnd)
{
    PlainApp app;
    std::stringbuf buffer;
    {
        const RedirectStream redirect(std::cout, &buffer);
        app.Stdout("key=\"a\"b\"");
        app.Stdout("");
        app.Comment("text");
    }
    EXPECT_EQ(buffer.str(), "key=\"a\"b\"\n\n# text\n");
}

// If the process dies between two writes, half a line would be left.
TEST(Output, ALineIsOneWriteAndOneFlush)
{
    PlainApp app;
    WritesBuffer out;
    WritesBuffer err;
    {
        const RedirectStream redirectOut(std::cout, &out);
        const RedirectStream redirectErr(std::cerr, &err);
        app.Stdout("key=1");
        app.Comment("text");
        app.Stdout("");
        app.Stderr("failure");
    }
    EXPECT_THAT(out.writes, ElementsAre("key=1\n", "# text\n", "\n"));
    EXPECT_EQ(out.flushes, 3);
    EXPECT_THAT(err.writes, ElementsAre("failure\n"));
    EXPECT_EQ(err.flushes, 1);
}

TEST(Output, ALineMayHoldAnyByte)
{
    PlainApp app;
    std::stringbuf buffer;
    const std::string text("a\0b\n\xFF", 5);
    {
        const RedirectStream redirect(std::cout, &buffer);
        app.Stdout(text);
    }
    EXPECT_EQ(buffer.str(), text + "\n");
}

TEST(Output, ALostLineIsReportedAndTheNextOneIsWritten)
{
    PlainApp app;
    CapturedStderr err;
    UnreliableBuffer buffer(1);
    {
        const RedirectStream redirect(std::cout, &buffer);
        app.Stdout("lost");
        app.Stdout("kept");
    }
    EXPECT_EQ(buffer.str(), "kept\n");
    EXPECT_THAT(err.Take(), ElementsAre("DoStdout failed"));
}

TEST(Output, AFailedFlushLosesTheLine)
{
    PlainApp app;
    CapturedStderr err;
    UnflushableBuffer buffer;
    {
        const RedirectStream redirect(std::cout, &buffer);
        app.Stdout("one");
        app.Stdout("two");
    }
    EXPECT_THAT(err.Take(), ElementsAre("DoStdout failed", "DoStdout failed"));
}

TEST(Output, AThrowingStreamLosesTheLine)
{
    PlainApp app;
    CapturedStderr err;
    ThrowingBuffer buffer;
    {
        const RedirectStream redirect(std::cout, &buffer);
        app.Stdout("one");
    }
    EXPECT_THAT(err.Take(), ElementsAre("DoStdout failed"));
}

// What an override that calls the base sees.
class OpenApp : public GPUAssayApp {
public:
    using GPUAssayApp::DoStderr;
    using GPUAssayApp::DoStdout;
};

std::string FailureOf(const std::function<void()>& action)
{
    try {
        action();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "no failure";
}

TEST(Output, ALostLineIsAnExceptionWithAText)
{
    OpenApp app;
    UnreliableBuffer out(1);
    UnreliableBuffer err(1);
    const RedirectStream redirectOut(std::cout, &out);
    const RedirectStream redirectErr(std::cerr, &err);
    EXPECT_EQ(FailureOf([&] { app.DoStdout("lost"); }), "can't write to standard output");
    EXPECT_EQ(FailureOf([&] { app.DoStderr("lost"); }), "can't write to standard error");
    EXPECT_EQ(FailureOf([&] { app.DoStdout("kept"); }), "no failure");
    EXPECT_EQ(FailureOf([&] { app.DoStderr("kept"); }), "no failure");
}

TEST(Output, StderrWritesTheTextAndALineEnd)
{
    PlainApp app;
    CapturedStderr err;
    app.Stderr("one");
    app.Stderr("two");
    EXPECT_THAT(err.Take(), ElementsAre("one", "two"));
}

TEST(Output, StderrRetriesOnceAndNeverThrows)
{
    PlainApp app;
    UnreliableBuffer once(1);
    {
        const RedirectStream redirect(std::cerr, &once);
        app.Stderr("text");
    }
    EXPECT_EQ(once.str(), "text\n");

    ThrowingBuffer never;
    {
        const RedirectStream redirect(std::cerr, &never);
        EXPECT_NO_THROW(app.Stderr("text"));
    }
    CapturedStderr err;
    app.Stderr("later");
    EXPECT_THAT(err.Take(), ElementsAre("later"));
}

// Overrides of the three operations.
class ThrowingApp : public GPUAssayApp {
public:
    void DoComment(const std::string& text) override { Stdout("; " + text); }
    void DoStdout(const std::string& text) override
    {
        if (text == "bad")
            throw 1; // NOLINT(hicpp-exception-baseclass): not a std::exception on purpose
        out.push_back(text);
    }
    void DoStderr(const std::string& text) override
    {
        if (throwFromStderr)
            throw 2; // NOLINT(hicpp-exception-baseclass): not a std::exception on purpose
        err.push_back(text);
    }

    bool throwFromStderr = false;
    Lines out;
    Lines err;
};

TEST(Output, OverridesAreCalled)
{
    ThrowingApp app;
    app.Comment("c");
    app.Stdout("bad");
    app.Stderr("e");
    EXPECT_THAT(app.out, ElementsAre("; c"));
    EXPECT_THAT(app.err, ElementsAre("DoStdout failed", "e"));
}

TEST(Output, AThrowingStderrOverrideFallsBackToTheStream)
{
    ThrowingApp app;
    app.throwFromStderr = true;
    CapturedStderr err;
    app.Stderr("text");
    EXPECT_THAT(err.Take(), ElementsAre("text"));
    EXPECT_THAT(app.err, IsEmpty());
}

} // namespace
} // namespace assay
