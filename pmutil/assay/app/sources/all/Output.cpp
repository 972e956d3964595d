#include "Output.h"

#include "pmutil/PutLine.h"

namespace assay {

void PrepareOutput()
{
    std::setvbuf(stdout, nullptr, _IONBF, 0);
}

bool WriteLine(std::ostream& out, std::FILE* file, const std::string& text) noexcept
{
    try {
        std::streambuf& buffer = *out.rdbuf();
        const bool isWhole = pmutil::PutLine(file, text + '\n', [&buffer](const std::string& line) {
            return static_cast<std::size_t>(
                buffer.sputn(line.data(), static_cast<std::streamsize>(line.size())));
        });
        if (isWhole && buffer.pubsync() == 0)
            return true;
        if (isWhole)
            pmutil::DiscardUnwritten(file); // a part of the buffer may have been written
    } catch (...) {
        // The line is lost, as after a failed write.
    }
    return false;
}

} // namespace assay
