// What the child asks of its platform.
#pragma once

#include <cstddef>

void PrepareStreams();
std::size_t ReadInput(char* bytes, std::size_t size);
[[noreturn]] void ExitNow(int code);
[[noreturn]] void CrashNow();
void CloseOutputs();
void SpawnGrandchild(const char* program, const char* word);
void WriteState();
