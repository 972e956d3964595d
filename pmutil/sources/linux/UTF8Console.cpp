#include "pmutil/UTF8Console.h"

namespace pmutil {

UTF8Console::UTF8Console() = default;
UTF8Console::~UTF8Console() = default;

} // namespace pmutil
