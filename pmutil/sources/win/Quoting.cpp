#include "win/Quoting.h"

namespace pmutil {

// A backslash is literal except before a quotation mark, where two backslashes mean one.
std::wstring Quote(const std::wstring& argument)
{
    std::wstring result = L"\"";
    std::size_t backslashes = 0;
    for (const wchar_t unit : argument) {
        if (unit == L'"')
            result.append(backslashes + 1, L'\\');
        backslashes = unit == L'\\' ? backslashes + 1 : 0;
        result += unit;
    }
    result.append(backslashes, L'\\');
    return result + L'"';
}

} // namespace pmutil
