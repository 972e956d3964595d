#include "pmutil/ChildCommand.h"

#include <algorithm>
#include <stdexcept>

#include "all/NativeCommand.h"

namespace pmutil {

ChildCommand MakeChildCommand(const std::string& program, const std::vector<std::string>& args)
{
    const auto hasZero = [](const std::string& text) { return text.find('\0') != text.npos; };
    if (hasZero(program) || std::any_of(args.begin(), args.end(), hasZero))
        throw std::invalid_argument("ChildCommand: zero byte");
    return MakeNativeCommand(program, args);
}

} // namespace pmutil
