#include "pmutil/Requirement.h"

#include <atomic>
#include <cstdio>
#include <cstring>
#include <sstream>
#include <stdexcept>

namespace pmutil {

namespace {

constexpr char kNullText[] = "<NULL>";

void WriteToStandardError(const char* text)
{
    std::fputs(text != nullptr ? text : kNullText, stderr);
    std::fputc('\n', stderr);
    std::fflush(stderr);
}

std::atomic<FailureHandler> gFailureHandler{WriteToStandardError};

} // namespace

void RequirementFailed(const char* file, int line, const char* message, bool shouldThrow)
{
    std::ostringstream out;
    if (file != nullptr && std::strcmp(file, kNoFile) != 0)
        out << file << "(" << line << "): ";
    out << (message != nullptr ? message : kNullText);
    const std::string text = out.str();
    CallFailureHandler(text.c_str());
    if (shouldThrow)
        throw std::runtime_error(text);
}

FailureHandler SetFailureHandler(FailureHandler handler)
{
    return gFailureHandler.exchange(handler != nullptr ? handler : WriteToStandardError);
}

FailureHandler GetFailureHandler()
{
    return gFailureHandler;
}

void CallFailureHandler(const char* text)
{
    GetFailureHandler()(text);
}

} // namespace pmutil
