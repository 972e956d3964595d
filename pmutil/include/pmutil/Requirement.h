// The one form in which a violated condition is reported.
#pragma once

namespace pmutil {

// Receives the text of a violated requirement; null stands for a missing text.
using FailureHandler = void (*)(const char* text);

// The file text of a caller that doesn't tell where it is: RequirementFailed leaves the place out.
inline constexpr char kNoFile[] = "<NULL>";

// Reports a violated condition: calls the failure handler with "file(line): message", or with the
// message alone when `file` is null or kNoFile; "<NULL>" stands for a null message. Then throws
// std::runtime_error with that text if `shouldThrow` is set, and returns otherwise. The handler is
// called first, so that a failure is seen even where the exception is swallowed.
void RequirementFailed(const char* file, int line, const char* message, bool shouldThrow);

// Replaces the process's failure handler and returns the one before it; null restores the default,
// which writes the text and a line end to standard error. Set it before any thread starts.
FailureHandler SetFailureHandler(FailureHandler handler);

// The handler in force, never null.
FailureHandler GetFailureHandler();

// Calls the handler in force.
void CallFailureHandler(const char* text);

} // namespace pmutil
