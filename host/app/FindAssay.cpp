#include "app/FindAssay.h"

#include <boost/dll/runtime_symbol_info.hpp>
#include <boost/filesystem/operations.hpp>
#include <boost/process/search_path.hpp>

#include "supervise/Paths.h"

namespace assay_host {

std::string FindAssay()
{
    const boost::filesystem::path self = boost::dll::program_location();
    boost::filesystem::path beside = self.parent_path() / "assay";
    beside += self.extension();
    boost::system::error_code error;
    if (boost::filesystem::is_regular_file(beside, error))
        return ToText(beside);
    const boost::filesystem::path found = boost::process::search_path("assay");
    return ToText(found.empty() ? beside : found);
}

ChildOptions MakeChildOptions(const ChildChoice& choice)
{
    ChildOptions options;
    options.fProgram = choice.fProgram.empty() ? FindAssay() : choice.fProgram;
    options.fArgs = choice.fArgs;
    options.fTimeoutSeconds = choice.fTimeoutSeconds;
    return options;
}

} // namespace assay_host
