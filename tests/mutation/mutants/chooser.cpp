// Says which mutant is on, and notes which ones were asked for. Linked into every program of the
// changed tree. BOARD is the path of a file that all processes of a test share: the number of the
// mutant that is on, then a byte for each mutant, set once it was asked for.
#include <cstddef>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

constexpr std::size_t kHeader = sizeof(int);

// The first use comes before main, so that no test sees the file opened.
char* gBoard = nullptr;
std::size_t gSize = 0;

__attribute__((constructor(101))) void OpenBoard()
{
    const int file = open(BOARD, O_RDWR | O_CLOEXEC);
    if (file < 0)
        return;
    struct stat status = {};
    if (fstat(file, &status) == 0) {
        gSize = static_cast<std::size_t>(status.st_size);
        void* const board = mmap(nullptr, gSize, PROT_READ | PROT_WRITE, MAP_SHARED, file, 0);
        if (board != MAP_FAILED)
            gBoard = static_cast<char*>(board);
    }
    close(file);
}

} // namespace

extern "C" bool MutantIsOn(int number) noexcept
{
    if (gBoard == nullptr)
        return false;
    const std::size_t place = kHeader + static_cast<std::size_t>(number);
    if (place < gSize)
        __atomic_store_n(gBoard + place, 1, __ATOMIC_RELAXED);
    return *reinterpret_cast<const int*>(gBoard) == number;
}
