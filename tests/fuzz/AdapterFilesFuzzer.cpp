// Feeds any bytes to the parsers of the system's files and checks that their results are valid.
#include <cstdint>
#include <string>

#include "Require.h"
#include "linux/gpu/DrmAdapters.h"
#include "linux/gpu/DrmMemory.h"
#include "linux/gpu/NvidiaVersion.h"
#include "linux/gpu/SystemNumbers.h"
#include "qgf/qgf_core/linux/NvidiaProc.h"
#include "qgf/qgf_core/linux/PciAddress.h"
#include "qgf/qgf_core/linux/PciIds.h"
#include "qgf/qgf_core/linux/Uevent.h"

namespace {

bool IsOneLine(const std::string& text)
{
    return text.find('\n') == std::string::npos;
}

void CheckNames(const std::string& text)
{
    const std::string name = QGF::FindPciName(text, 0x1002, 0x744C);
    Require(IsOneLine(name) && name.size() <= text.size());
    const std::string model = QGF::NvidiaField(text, "Model");
    Require(IsOneLine(model));
    Require(model.empty() || (model.front() != ' ' && model.back() != ' '));
    Require(!QGF::IsPciAddress(text) || (text.size() >= 12 && IsOneLine(text)));
}

void CheckMemory(const std::string& text)
{
    for (const char* driver : {"i915", "xe", "radeon", "nouveau", "amdgpu"}) {
        // Each driver's answer has at least 16 bytes.
        Require(!pmutil::ParseDedicatedMemory(driver, text) || text.size() >= 16);
    }
    Require(pmutil::LargestPrefetchableBar(text) != 1);
    Require(pmutil::LargestPrefetchableBar("0x0 0xfffffff 0x220c\n" + text) >= 0x10000000);
}

void CheckNumbers(const std::string& text)
{
    std::uint64_t number = 0;
    if (pmutil::ParseSystemNumber(text, number))
        Require(pmutil::ParseSystemNumber(std::to_string(number), number));
    std::uint64_t bytes = 0;
    if (pmutil::ParseMemoryTotal(text, bytes))
        Require(bytes % 1024 == 0);
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    if (pmutil::ParseModeSize(text, width, height))
        Require(width != 0 && height != 0 && width <= 65536 && height <= 65536);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(data, data + size);
    CheckNames(text);
    CheckNames("1002  A\n\t744c  " + text);
    CheckNames("Model: " + text);
    CheckMemory(text);
    Require(IsOneLine(QGF::UeventValue(text, "OF_COMPATIBLE_0")));
    CheckNumbers(text);
    CheckNumbers("MemTotal: " + text);
    for (const std::string& version : {text, "NVRM version: 1.2 " + text}) {
        const pmutil::NvidiaVersion found = pmutil::ParseNvidiaVersion(version);
        Require(found.date.empty() || found.date.size() == 25);
        Require(IsOneLine(found.version));
    }
    return 0;
}
