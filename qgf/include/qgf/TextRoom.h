// Room for a text that a driver claims to be so long. All of it is zero at first and costs memory
// only where the driver writes, so that an absurd claim costs nothing or fails at once.
#pragma once

#include <cstddef>
#include <memory>
#include <string>

namespace QGF {
namespace Core {

class TextRoom {
public:
    // Throws std::bad_alloc if there is no room for `length` bytes and a terminating zero byte.
    explicit TextRoom(std::size_t length);

    // length + 1 bytes to write to; the last one doesn't count as text.
    char* data() { return fBytes.get(); }

    // The text up to its first zero byte. What follows isn't looked at: reading it would cost as
    // much as the driver claims.
    std::string beforeFirstZero() const;

private:
    struct Free {
        void operator()(char* bytes) const noexcept;
    };

    std::size_t fLength;
    std::unique_ptr<char, Free> fBytes;
};

} // namespace Core
} // namespace QGF
