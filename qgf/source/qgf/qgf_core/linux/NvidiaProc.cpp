#include "qgf/qgf_core/linux/NvidiaProc.h"

#include <sstream>

#include "qgf/SystemFiles.h"
#include "qgf/qgf_core/linux/PciAddress.h"

namespace QGF {
namespace {

const char kCards[] = "/proc/driver/nvidia/gpus";

} // namespace

std::string NvidiaField(const std::string& information, const std::string& key)
{
    const char* const blanks = " \t\r";
    std::istringstream lines(information);
    for (std::string line; std::getline(lines, line);) {
        if (line.compare(0, key.size(), key) != 0 || line[key.size()] != ':')
            continue;
        const std::size_t first = line.find_first_not_of(blanks, key.size() + 1);
        if (first == std::string::npos)
            return std::string();
        return line.substr(first, line.find_last_not_of(blanks) - first + 1);
    }
    return std::string();
}

std::string NvidiaModel(const std::string& pciAddress)
{
    // The driver powers the card up before it prints this file (rm_ref_dynamic_power in
    // nv_procfs_read_gpu_info of its published kernel module), so the file of a suspended card
    // isn't read. Reading the power state wakes nothing: the kernel prints a variable of its own
    // (Documentation/ABI/testing/sysfs-devices-power).
    const std::string power =
        ReadSystemLine("/sys/bus/pci/devices/" + pciAddress + "/power/runtime_status");
    if (power == "suspended" || power == "suspending")
        return std::string();
    std::string information;
    ReadSystemFile(std::string(kCards) + "/" + pciAddress + "/information", information);
    const std::string model = NvidiaField(information, "Model");
    return model == "Unknown" ? std::string() : model;
}

std::vector<std::string> NvidiaCards()
{
    std::vector<std::string> cards;
    for (const std::string& name : ListSystemFolder(kCards))
        if (IsPciAddress(name))
            cards.push_back(name);
    return cards;
}

} // namespace QGF
