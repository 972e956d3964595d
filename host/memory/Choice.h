// What the user decided, apart from what was found. Any thread may call.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include <nlohmann/json.hpp>

#include "report/KnownKeys.h"
#include "report/Usable.h"

namespace assay_host {

struct InterfaceChoice {
    Usability fUsability = Usability::kUnknown; // hardware, software or absent
    std::int64_t fTime = 0;                     // of the decision, seconds since 1970 in UTC
};

struct Choice {
    std::optional<InterfaceChoice> fOpenGL;
    std::optional<InterfaceChoice> fOpenCL;

    std::optional<InterfaceChoice>& Get(DeviceKind kind)
    {
        return kind == DeviceKind::kOpenGL ? fOpenGL : fOpenCL;
    }
    const std::optional<InterfaceChoice>& Get(DeviceKind kind) const
    {
        return kind == DeviceKind::kOpenGL ? fOpenGL : fOpenCL;
    }
    bool IsEmpty() const { return !fOpenGL && !fOpenCL; }
};

// A part of "opengl=software": nothing stands for "auto".
struct ChoiceWord {
    DeviceKind fKind = DeviceKind::kOpenGL;
    std::optional<Usability> fUsability;
};

// Reads "opengl=VALUE" or "opencl=VALUE", where VALUE is hardware, software, absent or auto.
// Returns nothing for any other text.
std::optional<ChoiceWord> ReadChoiceWord(const std::string& word);

// Makes the content of the state file.
nlohmann::ordered_json MakeChoiceJson(const Choice& choice);

// Reads the content. Throws std::exception if a member has a wrong type or value.
Choice ReadChoiceJson(const nlohmann::ordered_json& content);

} // namespace assay_host
