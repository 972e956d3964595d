#include "support/InheritedState.h"

#include <windows.h>

void DropInheritedState()
{
    ::SetConsoleCtrlHandler(nullptr, FALSE); // stop ignoring Ctrl-C
}
