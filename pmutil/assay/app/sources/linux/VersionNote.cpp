// The program's version in an ELF note of its file, for a host that doesn't run it to ask. Windows
// has the version resource for that.
#include <cstddef>
#include <cstdint>

namespace {

constexpr std::size_t Align(std::size_t size)
{
    return (size + 3) / 4 * 4;
}

struct Note {
    std::uint32_t fNameSize;
    std::uint32_t fTextSize;
    std::uint32_t fType;
    char fName[Align(sizeof("assay"))];
    char fText[Align(sizeof(ASSAY_VERSION))];
};

[[gnu::used, gnu::section(".note.assay"), gnu::aligned(4)]] const Note kNote = {
    sizeof("assay"), sizeof(ASSAY_VERSION), 1, "assay", ASSAY_VERSION};

} // namespace
