#include "pmutil/PMDebugStrLogger.h"

#include <windows.h>

#include "all/LogTimer.h"

namespace pmutil {

PMDebugStrLogger::PMDebugStrLogger() : PMLogger("DebugStr") {}

PMDebugStrLogger::~PMDebugStrLogger() = default;

std::string PMDebugStrLogger::GetLineEnd()
{
    return "\r\n";
}

void PMDebugStrLogger::Write(const char* data, std::size_t size)
{
    const LogTimer timer;
    const std::string text(data, size); // adds the terminating zero
    OutputDebugStringA(text.c_str());
}

} // namespace pmutil
