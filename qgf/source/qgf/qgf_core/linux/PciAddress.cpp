#include "qgf/qgf_core/linux/PciAddress.h"

namespace QGF {
namespace {

bool IsHexDigit(char c)
{
    return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f');
}

} // namespace

bool IsPciAddress(const std::string& text)
{
    // Match from the end, since only the domain's length varies (4 to 8 digits).
    static const char kTail[] = ":xx:xx.x";
    constexpr std::size_t kTailLength = sizeof kTail - 1;
    if (text.size() < kTailLength + 4 || text.size() > kTailLength + 8)
        return false;
    const std::size_t domain = text.size() - kTailLength;
    for (std::size_t i = 0; i != text.size(); ++i) {
        const char expected = i < domain ? 'x' : kTail[i - domain];
        if (expected == 'x' ? !IsHexDigit(text[i]) : text[i] != expected)
            return false;
    }
    return text.back() <= '7';
}

} // namespace QGF
