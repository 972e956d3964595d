#include "pmutil/UTF8Console.h"

namespace pmutil {

UTF8Console::UTF8Console() = default;
UTF8Console::~UTF8Console() = default;

void UTF8Console::Restore() {}

} // namespace pmutil
