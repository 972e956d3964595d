// The state that a process inherits from its parent, on which no test should depend.
#pragma once

// Call first in a program. Unblocks signals and stops ignoring them, as nohup, shells and some
// hosts do; opens closed standard streams; and continues in a child process if this is the first
// process of a container, which adopts all orphans.
void DropInheritedState();
