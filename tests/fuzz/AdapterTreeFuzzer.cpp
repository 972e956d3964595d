// Fills the files of a recorded machine with any bytes and checks that the join never fails and
// that every adapter has the same unique name in all lists.
#include <algorithm>
#include <cstdint>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "Require.h"
#include "pmutil_gpu/GPUImplWin.h"
#include "qgf/AdapterName.h"
#include "support/AdapterTree.h"

namespace {

std::vector<std::string> ReadAll(const std::vector<std::string>& files)
{
    std::vector<std::string> texts;
    for (const std::string& file : files) {
        std::ifstream in(file, std::ios::binary);
        texts.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    return texts;
}

// A machine's files with their original and their current contents.
struct Machine {
    explicit Machine(const std::string& name)
        : tree(name), files(tree.files()), originals(ReadAll(files)), current(originals)
    {}

    const AdapterTree tree;
    const std::vector<std::string> files;
    const std::vector<std::string> originals;
    std::vector<std::string> current;
};

// Splits the input into the contents of the files. A file whose first byte is even keeps its
// original content, so that most of the machine stays intact.
void Spread(Machine& machine, const std::uint8_t* data, std::size_t size)
{
    const std::vector<std::string>& files = machine.files;
    std::size_t at = 0;
    for (std::size_t i = 0; i != files.size(); ++i) {
        std::string text = machine.originals[i];
        if (at < size && data[at++] % 2 != 0) {
            const std::size_t wanted = at < size ? data[at++] : 0;
            const std::size_t length = std::min(wanted, size - at);
            text.assign(data + at, data + at + length);
            at += length;
        }
        if (text != machine.current[i]) {
            std::ofstream(files[i], std::ios::binary | std::ios::trunc) << text;
            machine.current[i] = text;
        }
    }
    machine.tree.refresh();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    // Machines with a suspended card, with recorded driver answers, and with devices outside PCI.
    static Machine gMachines[] = {Machine("hybrid-laptop"),   Machine("intel-arc-asleep"),
                                  Machine("intel-two-tiles"), Machine("radeon"),
                                  Machine("nouveau"),         Machine("soc-beside-pci")};
    if (size == 0)
        return 0;
    Spread(gMachines[data[0] % std::size(gMachines)], data + 1, size - 1);

    pmutil::ContextsByDeviceString contexts;
    for (const std::string& place : QGF::DisplayAdapters()) {
        const std::string name = QGF::AdapterName(place);
        Require(!name.empty() && name.size() <= 127);
        Require(contexts.emplace(name, pmutil::DeviceContext()).second);
    }
    const pmutil::GPUImplWins joined = pmutil::JoinDevices(
        contexts, pmutil::DXGIData::GetAllDevices(), pmutil::WMIData::GetAllDevices());
    Require(joined.size() == contexts.size());
    return 0;
}
