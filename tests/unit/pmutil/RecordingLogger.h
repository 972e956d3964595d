// A sink that keeps its lines.
#pragma once

#include <string>
#include <vector>

#include "pmutil/PMLogging.h"

namespace pmutil {

class RecordingLogger : public PMLogger {
public:
    explicit RecordingLogger(const std::string& name = "recording") : PMLogger(name) {}

    void Write(const char* data, std::size_t size) override { pieces.emplace_back(data, size); }
    void Flush() override
    {
        ++flushes;
        lines.push_back(Text());
        pieces.clear();
    }

    // The text since the end of the last line.
    std::string Text() const
    {
        std::string text;
        for (const std::string& piece : pieces)
            text += piece;
        return text;
    }

    std::vector<std::string> pieces;
    std::vector<std::string> lines;
    int flushes = 0;
};

// Returns the text after a line's prefix.
inline std::string MessageOf(const std::string& line)
{
    const auto end = line.find("] ");
    return end == std::string::npos ? "no prefix: " + line : line.substr(end + 2);
}

} // namespace pmutil
