// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Logs to the debugger's output stream. Windows only.
#pragma once

#include <string>

#include "pmutil/PMLogging.h"

namespace pmutil {

// Passes each part of a line to the debugger as a text of its own: prefix, message and line end,
// which is "\r\n". Its name is "DebugStr".
class PMDebugStrLogger : public PMLogger {
public:
    PMDebugStrLogger();
    ~PMDebugStrLogger() override;
    std::string GetLineEnd() override;
    void Write(const char* data, std::size_t size) override;
};

} // namespace pmutil
