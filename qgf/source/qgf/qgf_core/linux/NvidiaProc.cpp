#include "qgf/qgf_core/linux/NvidiaProc.h"

#include "qgf/SystemFiles.h"
#include "qgf/qgf_core/linux/PciAddress.h"

namespace QGF {
namespace {

const char kCards[] = "/proc/driver/nvidia/gpus";

} // namespace

std::string NvidiaField(const std::string& information, const std::string& key)
{
    const char* const blanks = " \t\r";
    std::size_t begin = 0;
    while (begin < information.size()) {
        const std::size_t end = std::min(information.find('\n', begin), information.size());
        if (information.compare(begin, key.size(), key) == 0 && begin + key.size() < end &&
            information[begin + key.size()] == ':') {
            const std::size_t first = information.find_first_not_of(blanks, begin + key.size() + 1);
            if (first == std::string::npos || first >= end)
                return std::string();
            return information.substr(first,
                                      information.find_last_not_of(blanks, end - 1) - first + 1);
        }
        begin = end + 1;
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
