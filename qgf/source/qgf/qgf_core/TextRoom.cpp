#include "qgf/TextRoom.h"

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <limits>
#include <new>

namespace QGF {
namespace Core {

void TextRoom::Free::operator()(char* bytes) const noexcept
{
    std::free(bytes);
}

TextRoom::TextRoom(std::size_t length) : fLength(length)
{
    // No object is larger, and the byte after the text must not make the size wrap around.
    if (length < static_cast<std::size_t>(std::numeric_limits<std::ptrdiff_t>::max()))
        fBytes.reset(static_cast<char*>(std::calloc(length + 1, 1)));
    if (!fBytes)
        throw std::bad_alloc();
}

std::string TextRoom::beforeFirstZero() const
{
    const char* const begin = fBytes.get();
    return {begin, std::find(begin, begin + fLength, '\0')};
}

} // namespace Core
} // namespace QGF
