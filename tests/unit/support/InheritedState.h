// What a process inherits from the one that started it and no test should depend on.
#pragma once

// To be called first in a program: makes up for signals that are ignored or blocked, as by nohup,
// in the background of a script or in some hosts, for closed standard streams, and for being the
// first process of a container, which gets everybody's orphans as children.
void DropInheritedState();
