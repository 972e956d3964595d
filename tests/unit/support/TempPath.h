// Names of files that tests make.
#pragma once

#include <random>
#include <string>

#include <gtest/gtest.h>

namespace assay_host {

// Returns a path that no other process uses, although the tests of several builds run at once.
// UTF-8; whoever makes a file there deletes it.
inline std::string MakeTempPath(const std::string& name)
{
    return testing::TempDir() + name + "-" + std::to_string(std::random_device()());
}

} // namespace assay_host
