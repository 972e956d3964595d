// The platform's part of ChildCommand.
#pragma once

#include "pmutil/ChildCommand.h"

namespace pmutil {

// As MakeChildCommand, for texts without zero bytes.
ChildCommand MakeNativeCommand(const std::string& program, const std::vector<std::string>& args);

} // namespace pmutil
