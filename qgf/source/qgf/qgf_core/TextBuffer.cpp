#include "qgf/TextBuffer.h"

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <limits>
#include <new>

namespace QGF {
namespace Core {

void TextBuffer::Free::operator()(char* bytes) const noexcept
{
    std::free(bytes);
}

TextBuffer::TextBuffer(std::size_t length) : fLength(length)
{
    // No object is larger than PTRDIFF_MAX; the check also keeps length + 1 from overflowing.
    if (length < static_cast<std::size_t>(std::numeric_limits<std::ptrdiff_t>::max()))
        fBytes.reset(static_cast<char*>(std::calloc(length + 1, 1)));
    if (!fBytes)
        throw std::bad_alloc();
}

std::string TextBuffer::beforeFirstZero() const
{
    const char* const begin = fBytes.get();
    return {begin, std::find(begin, begin + fLength, '\0')};
}

} // namespace Core
} // namespace QGF
