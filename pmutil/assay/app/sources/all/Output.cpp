#include "Output.h"

#include "pmutil/System.h"

namespace assay {

bool WriteLine(std::ostream& out, std::FILE* file, const std::string& text) noexcept
{
    try {
        out << text << std::endl;
        if (out)
            return true;
        out.clear();
        pmutil::DiscardUnwritten(file);
    } catch (...) {
        // The line is lost like any other that can't be written.
    }
    return false;
}

} // namespace assay
