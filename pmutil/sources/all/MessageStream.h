// The string stream in which a log message is assembled.
#pragma once

#include <memory>
#include <ostream>

namespace pmutil {

// An empty stream with default formatting. Made, used and destroyed with the log mutex held: as
// making a stream costs more than most messages, one stream serves all messages that aren't
// assembled within another.
class MessageStream {
public:
    MessageStream();
    ~MessageStream();
    MessageStream(const MessageStream&) = delete;
    MessageStream& operator=(const MessageStream&) = delete;

    std::ostream& Out();

    // What was written so far; valid until more is.
    const char* Text();

private:
    class Stream;
    static Stream*& Spare();

    std::unique_ptr<Stream> fStream;
};

} // namespace pmutil
