// The platform's part of the child. child.cpp describes the words that these functions implement.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

void PrepareStreams();
std::vector<std::string> GetArguments(int argc, char** argv);
std::size_t ReadInput(char* bytes, std::size_t size);
[[noreturn]] void ExitNow(int code);
[[noreturn]] void CrashNow();
void DieOf(const std::string& how);
void CloseOutputs();
void SpawnGrandchild(const std::vector<std::string>& command); // of words without blanks
void WriteCommandLine();
std::string GetOwnPath();
int CountPipes();
void EndFirstThread();
void WriteState();
