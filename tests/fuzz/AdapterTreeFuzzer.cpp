// A whole machine whose files hold any bytes: the join never fails, and every adapter keeps a name
// that all lists agree on.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <string>
#include <vector>

#include "pmutil_gpu/GPUImplWin.h"
#include "qgf/AdapterName.h"
#include "support/AdapterTree.h"

namespace {

void Require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

// Cuts the input into the contents of the files: each of them keeps its own where its first byte is
// even, so that most of the machine stays sound.
void Spread(const AdapterTree& tree, const std::vector<std::string>& originals,
            const std::uint8_t* data, std::size_t size)
{
    static const std::vector<std::string> files = tree.files();
    static std::vector<std::string> current = originals;
    std::size_t at = 0;
    for (std::size_t i = 0; i != files.size(); ++i) {
        std::string text = originals[i];
        if (at < size && data[at++] % 2 != 0) {
            const std::size_t wanted = at < size ? data[at++] : 0;
            const std::size_t length = std::min(wanted, size - at);
            text.assign(data + at, data + at + length);
            at += length;
        }
        if (text != current[i]) {
            std::ofstream(files[i], std::ios::binary | std::ios::trunc) << text;
            current[i] = text;
        }
    }
    tree.refresh();
}

std::vector<std::string> ReadAll(const std::vector<std::string>& files)
{
    std::vector<std::string> texts;
    for (const std::string& file : files) {
        std::ifstream in(file, std::ios::binary);
        texts.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    return texts;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    static const AdapterTree gTree("hybrid-laptop");
    static const std::vector<std::string> gOriginals = ReadAll(gTree.files());
    Spread(gTree, gOriginals, data, size);

    pmutil::ContextsByDeviceString contexts;
    for (const std::string& address : QGF::DisplayAdapters()) {
        const std::string name = QGF::AdapterName(address);
        Require(!name.empty() && name.size() <= 127);
        Require(contexts.emplace(name, pmutil::DeviceContext()).second);
    }
    const pmutil::GPUImplWins joined = pmutil::JoinDevices(
        contexts, pmutil::DXGIData::GetAllDevices(), pmutil::WMIData::GetAllDevices());
    Require(joined.size() == contexts.size());
    return 0;
}
