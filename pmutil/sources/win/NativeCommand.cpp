#include "all/NativeCommand.h"

#include <stdexcept>

#include <boost/nowide/convert.hpp>

#include "win/Quoting.h"

namespace pmutil {

ChildCommand MakeNativeCommand(const std::string& program, const std::vector<std::string>& args)
{
    if (program.find('"') != std::string::npos)
        throw std::invalid_argument("ChildCommand: quotation mark in the path");
    ChildCommand command;
    command.fProgram = L'"' + boost::nowide::widen(program) + L'"';
    for (const std::string& arg : args)
        command.fProgram += L' ' + Quote(boost::nowide::widen(arg));
    return command;
}

} // namespace pmutil
