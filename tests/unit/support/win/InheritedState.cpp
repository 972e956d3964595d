#include "support/InheritedState.h"

#include <windows.h>

void DropInheritedState()
{
    ::SetConsoleCtrlHandler(nullptr, FALSE); // Ctrl-C counts again
}
