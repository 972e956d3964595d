#include "library/DefaultProgram.h"

#include <boost/filesystem/operations.hpp>

#include "library/OwnFile.h"
#include "supervise/Paths.h"

namespace assay_host {

std::string FindDefaultProgram()
{
    const boost::filesystem::path folder = GetOwnFile().parent_path();
    for (const char* place : {".", ASSAY_PROGRAMS_FROM_LIBRARY}) {
        const boost::filesystem::path program = folder / place / ASSAY_PROGRAM_NAME;
        boost::system::error_code error;
        if (boost::filesystem::is_regular_file(program, error))
            return ToText(program.lexically_normal());
    }
    return ToText(folder / ASSAY_PROGRAM_NAME);
}

} // namespace assay_host
