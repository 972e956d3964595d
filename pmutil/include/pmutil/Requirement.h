// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Reports violated conditions.
#pragma once

namespace pmutil {

// Gets the text of a violated requirement; may be null.
using FailureHandler = void (*)(const char* text);

// The file text of a caller without a source position: RequirementFailed leaves the position out.
inline constexpr char kNoFile[] = "<NULL>";

// Reports a violated condition: calls the failure handler with "file(line): message", or with the
// message only if `file` is null or kNoFile. A null message prints as "<NULL>". Then throws
// std::runtime_error with that text if `shouldThrow` is true, else returns. The handler is called
// first, so that the failure is reported even if the exception is ignored.
void RequirementFailed(const char* file, int line, const char* message, bool shouldThrow);

// Replaces the process's failure handler and returns the previous one; null restores the default,
// which writes the text and a line end to standard error. Call it before any thread starts.
FailureHandler SetFailureHandler(FailureHandler handler);

// Returns the current handler, never null.
FailureHandler GetFailureHandler();

// Calls the current handler.
void CallFailureHandler(const char* text);

} // namespace pmutil
