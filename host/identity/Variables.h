// The variables of the environment that select a driver, a device or the features of one.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace assay_host {

// Returns a variable's value; nothing if it isn't set.
using GetVariableFunction = std::function<std::optional<std::string>(const std::string& name)>;

// Returns "NAME=value" for each of these variables that is set, sorted. Any thread may call.
std::vector<std::string> ListVariables(const GetVariableFunction& get);

} // namespace assay_host
