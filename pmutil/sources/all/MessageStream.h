// The string stream for the assembly of a log message.
#pragma once

#include <memory>
#include <ostream>

namespace pmutil {

// An empty stream with default formatting. Make, use and destroy it with the log mutex held. One
// stream is cached for all messages that aren't nested, since making a stream costs more than
// most messages.
class MessageStream {
public:
    MessageStream();
    ~MessageStream();
    MessageStream(const MessageStream&) = delete;
    MessageStream& operator=(const MessageStream&) = delete;

    std::ostream& Out();

    // Returns the text written so far; valid until the next write.
    const char* Text();

private:
    class Stream;
    static Stream*& Spare();

    std::unique_ptr<Stream> fStream;
};

} // namespace pmutil
