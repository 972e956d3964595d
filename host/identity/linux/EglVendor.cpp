#include "identity/linux/EglVendor.h"

#include <nlohmann/json.hpp>

namespace assay_host {

std::string FindEglLibrary(const std::string& text)
{
    const auto file = nlohmann::json::parse(text, nullptr, false);
    if (!file.is_object())
        return {};
    const auto driver = file.find("ICD");
    if (driver == file.end() || !driver->is_object())
        return {};
    const auto path = driver->find("library_path");
    return path != driver->end() && path->is_string() ? path->get<std::string>() : std::string();
}

} // namespace assay_host
