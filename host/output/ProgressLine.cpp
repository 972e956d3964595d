#include "output/ProgressLine.h"

#include <algorithm>

#include "output/Stream.h"
#include "output/Terminal.h"

namespace assay_host {

ProgressLine::ProgressLine() : fShows(IsErrorTerminal()) {}

ProgressLine::~ProgressLine()
{
    Clear();
}

void ProgressLine::Show(std::string text)
{
    if (!fShows)
        return;
    // A character in the last column would wrap the line. The width of other characters is unknown.
    text.resize(std::min(text.size(), static_cast<std::size_t>(GetErrorWidth() - 1)));
    std::replace_if(
        text.begin(), text.end(), [](char byte) { return byte < ' ' || byte > '~'; }, '?');
    const std::size_t length = text.size();
    if (length < fLength)
        text.append(fLength - length, ' ');
    fLength = length;
    WriteStream(StandardStream::kError, "\r" + text);
}

void ProgressLine::Clear()
{
    if (fLength == 0)
        return;
    WriteStream(StandardStream::kError, "\r" + std::string(fLength, ' ') + "\r");
    fLength = 0;
}

} // namespace assay_host
