// The child of the supervision tests. Executes its arguments one after the other:
//
//   -verbose=N             nothing: assay-host adds it
//   out TEXT, err TEXT     writes a line
//   part TEXT              writes to standard error without a line end
//   raw HEX                writes these bytes, given in hexadecimal, to standard output
//   exit CODE              ends with the code
//   sleep MILLISECONDS
//   await FILE             waits until this file exists
//   touch FILE             makes this file
//   echo                   copies standard input to standard output until it ends
//   flood BYTES            writes this many bytes to standard output
//   flood-errors BYTES     the same to standard error
//   abort                  crashes
//   die HOW                ends as Misbehave() does (Windows only)
//   args ...               writes the other arguments, each in hexadecimal, and ends; on Windows as
//                          the C runtime parses the command line, in UTF-8
//   close                  closes standard output and standard error
//   spawn MILLISECONDS     starts a grandchild with this child's streams that sleeps
//   heir                   starts a grandchild with this child's streams that executes echo
//   line                   writes its command line, each character in hexadecimal (Windows only)
//   self                   writes the path of its program
//   pipes                  writes the number of pipe ends that it has open
//   thread                 ends its first thread, and lives on with another (Linux only)
//   state                  writes its open descriptors and its signal state (Linux only)
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "ChildPlatform.h"

namespace {

void WriteArguments(const std::vector<std::string>& arguments, int first)
{
    static const char kDigits[] = "0123456789abcdef";
    std::string text;
    for (auto index = static_cast<std::size_t>(first); index < arguments.size(); ++index) {
        for (const char byte : arguments[index]) {
            const auto value = static_cast<unsigned char>(byte);
            text += {kDigits[value / 16], kDigits[value % 16]};
        }
        text += '\n';
    }
    std::fwrite(text.data(), 1, text.size(), stdout);
}

void Echo()
{
    std::vector<char> block(4096);
    for (;;) {
        const std::size_t count = ReadInput(block.data(), block.size());
        if (count == 0)
            return;
        std::fwrite(block.data(), 1, count, stdout);
        std::fflush(stdout);
    }
}

void Await(const char* file)
{
    while (!std::ifstream(file))
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
}

void Flood(std::FILE* stream, long long bytes)
{
    const std::string block(65536, 'x');
    while (bytes > 0) {
        const auto count = bytes < 65536 ? static_cast<std::size_t>(bytes) : block.size();
        if (std::fwrite(block.data(), 1, count, stream) != count)
            std::exit(99);
        bytes -= static_cast<long long>(count);
    }
    std::fflush(stream);
}

void WriteRaw(const std::string& digits)
{
    for (std::size_t at = 0; at + 2 <= digits.size(); at += 2)
        std::fputc(std::stoi(digits.substr(at, 2), nullptr, 16), stdout);
    std::fflush(stdout);
}

} // namespace

int main(int argc, char** argv)
{
    PrepareStreams();
    for (int index = 1; index < argc; ++index) {
        const std::string word = argv[index];
        const auto next = [&] { return index + 1 < argc ? argv[++index] : ""; };
        if (word.rfind("-verbose=", 0) == 0)
            continue;
        if (word == "out") {
            std::fprintf(stdout, "%s\n", next());
            std::fflush(stdout);
        } else if (word == "err") {
            std::fprintf(stderr, "%s\n", next());
        } else if (word == "part") {
            std::fprintf(stderr, "%s", next());
        } else if (word == "exit") {
            ExitNow(std::atoi(next()));
        } else if (word == "sleep") {
            std::this_thread::sleep_for(std::chrono::milliseconds(std::atoi(next())));
        } else if (word == "await") {
            Await(next());
        } else if (word == "touch") {
            std::ofstream made(next());
        } else if (word == "echo") {
            Echo();
        } else if (word == "flood") {
            Flood(stdout, std::atoll(next()));
        } else if (word == "flood-errors") {
            Flood(stderr, std::atoll(next()));
        } else if (word == "raw") {
            WriteRaw(next());
        } else if (word == "abort") {
            CrashNow();
        } else if (word == "die") {
            DieOf(next());
        } else if (word == "close") {
            CloseOutputs();
        } else if (word == "spawn") {
            SpawnGrandchild({argv[0], "sleep", next()});
        } else if (word == "heir") {
            SpawnGrandchild({argv[0], "echo"});
        } else if (word == "line") {
            WriteCommandLine();
            return 0;
        } else if (word == "self") {
            std::printf("%s\n", GetOwnPath().c_str());
            std::fflush(stdout);
        } else if (word == "pipes") {
            std::printf("pipes %d\n", CountPipes());
            std::fflush(stdout);
        } else if (word == "thread") {
            EndFirstThread();
        } else if (word == "state") {
            WriteState();
        } else if (word == "args") {
            WriteArguments(GetArguments(argc, argv), index + 1);
            return 0;
        } else {
            std::fprintf(stderr, "unknown word %s\n", word.c_str());
            return 98;
        }
    }
    return 0;
}
