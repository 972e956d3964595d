// Texts that functions of the C interface return with their sizes.
#pragma once

#include <cstddef>
#include <string>

namespace assay_host {

// Returns the text, and sets `*size` unless `size` is null.
inline const char* ReturnText(const std::string& text, std::size_t* size)
{
    if (size != nullptr)
        *size = text.size();
    return text.c_str();
}

inline const char* ReturnNothing(std::size_t* size)
{
    if (size != nullptr)
        *size = 0;
    return "";
}

} // namespace assay_host
