// What selects the driver files of a process besides the machine's files.
#pragma once

#include <map>
#include <string>
#include <vector>

namespace assay_host {

struct Process {
    std::map<std::string, std::string> fVariables; // its environment
    std::string fFolder = "/";                     // its current folder
    std::string fProgram;                          // its program's file; empty for any

    // Returns a variable's value; empty if it isn't set.
    std::string Get(const std::string& name) const;

    // Returns the path from the root on.
    std::string MakeAbsolute(const std::string& path) const;
};

// Describes this process. A process with other rights than its user's has no environment here,
// since the loaders ignore it then too. Throws only std::bad_alloc. Any thread may call, while no
// other thread changes the environment.
Process GetThisProcess();

// Splits a list of paths. Leaves out empty ones.
std::vector<std::string> SplitPaths(const std::string& list, char separator = ':');

} // namespace assay_host
