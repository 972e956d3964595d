#include "supervise/ChildCommand.h"

#include <boost/nowide/convert.hpp>

#include "supervise/win/Quoting.h"

namespace assay_host {

ChildCommand MakeChildCommand(const std::string& program, const std::vector<std::string>& args)
{
    // Of the program's path every character counts as it is, and a quotation mark can't be in it.
    ChildCommand command;
    command.fProgram = L'"' + boost::nowide::widen(program) + L'"';
    for (const std::string& arg : args)
        command.fProgram += L' ' + Quote(boost::nowide::widen(arg));
    return command;
}

boost::shared_ptr<pmutil::Launcher> MakeChildLauncher()
{
    return pmutil::MakeLauncher();
}

} // namespace assay_host
