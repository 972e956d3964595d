#include "qgf/qgf_core/linux/PciAddress.h"

#include <algorithm>

namespace QGF {
namespace {

bool IsHexDigit(char c)
{
    return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f');
}

} // namespace

bool IsPciAddress(const std::string& text)
{
    // Matched from the end, since only the domain's length varies.
    static const char kTail[] = ":xx:xx.x";
    constexpr std::size_t kTailLength = sizeof kTail - 1;
    if (text.size() < kTailLength + 4 || text.size() > kTailLength + 8) {
        return false;
    }
    const std::size_t domain = text.size() - kTailLength;
    for (std::size_t i = 0; i != text.size(); ++i) {
        const char expected = i < domain ? 'x' : kTail[i - domain];
        if (expected == 'x' ? !IsHexDigit(text[i]) : text[i] != expected) {
            return false;
        }
    }
    return text.back() <= '7';
}

std::string LastPciAddress(const std::string& path)
{
    std::size_t end = path.size();
    for (;;) {
        const std::size_t slash = end == 0 ? std::string::npos : path.rfind('/', end - 1);
        const std::size_t begin = slash == std::string::npos ? 0 : slash + 1;
        std::string part = path.substr(begin, end - begin);
        if (IsPciAddress(part)) {
            return part;
        }
        if (slash == std::string::npos) {
            return std::string();
        }
        end = slash;
    }
}

} // namespace QGF
