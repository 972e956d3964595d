#include "library/DefaultProgram.h"

#include <boost/filesystem/operations.hpp>

#include "library/OwnFile.h"
#include "supervise/Paths.h"

namespace assay_host {

std::string FindProgramIn(const std::vector<boost::filesystem::path>& folders)
{
    for (const boost::filesystem::path& folder : folders) {
        const boost::filesystem::path program = folder / ASSAY_PROGRAM_NAME;
        boost::system::error_code error;
        if (boost::filesystem::is_regular_file(program, error))
            return ToText(program.lexically_normal());
    }
    return ToText(folders.front() / ASSAY_PROGRAM_NAME);
}

std::string FindDefaultProgram()
{
    const boost::filesystem::path folder = GetOwnFile().parent_path();
    return FindProgramIn({folder, folder / ASSAY_PROGRAMS_FROM_LIBRARY});
}

} // namespace assay_host
