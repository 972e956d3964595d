#include "memory/Machine.h"

#include <algorithm>
#include <chrono>
#include <fstream>
#include <sstream>
#include <string>
#include <unistd.h>

#include "memory/Envelope.h"

namespace assay_host {

namespace {

// Returns the first line of a file; empty if it can't be read.
std::string ReadLine(const std::string& path)
{
    std::ifstream file(path);
    std::string line;
    std::getline(file, line);
    return line;
}

// Returns the start of a process in clock ticks after the system's; 0 if it doesn't exist, or has
// ended and is only waited for. The name of the program may have blanks and brackets.
std::uint64_t GetStart(std::uint64_t process)
{
    constexpr int kFieldsBetween = 18; // from the state to the start
    std::ifstream file("/proc/" + std::to_string(process) + "/stat");
    std::ostringstream text;
    text << file.rdbuf();
    const std::string all = text.str();
    const std::size_t name = all.rfind(')');
    if (name == std::string::npos)
        return 0;
    std::istringstream fields(all.substr(name + 1));
    std::string state;
    fields >> state;
    if (state == "Z" || state == "X")
        return 0;
    std::string skipped;
    for (int field = 0; field < kFieldsBetween; ++field)
        fields >> skipped;
    std::uint64_t start = 0;
    fields >> start;
    return start;
}

class SystemMachine : public Machine {
public:
    std::int64_t GetTime() override
    {
        const std::int64_t now = std::chrono::duration_cast<std::chrono::seconds>(
                                     std::chrono::system_clock::now().time_since_epoch())
                                     .count();
        return std::clamp<std::int64_t>(now, 0, kLastTime);
    }

    HostMark GetSelf() override
    {
        HostMark self;
        self.fProcess = static_cast<std::uint64_t>(::getpid());
        self.fStart = GetStart(self.fProcess);
        self.fBoot = ReadLine("/proc/sys/kernel/random/boot_id");
        // machine-id(5): the id itself must not be passed on.
        const std::string id = ReadLine("/etc/machine-id");
        if (!id.empty())
            self.fMachine = MakeDigest("assay-host " + id);
        return self;
    }

    bool IsAlive(const HostMark& host) override
    {
        const std::uint64_t start = GetStart(host.fProcess);
        return start != 0 && start == host.fStart;
    }
};

} // namespace

std::unique_ptr<Machine> MakeSystemMachine()
{
    return std::make_unique<SystemMachine>();
}

} // namespace assay_host
