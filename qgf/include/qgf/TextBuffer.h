// A zero-filled buffer for a text whose length a driver reports. Memory is committed only where the
// driver writes, so an absurd length costs nothing or fails at once.
#pragma once

#include <cstddef>
#include <memory>
#include <string>

namespace QGF {
namespace Core {

class TextBuffer {
public:
    // Throws std::bad_alloc if `length` bytes and a terminating zero byte can't be allocated.
    explicit TextBuffer(std::size_t length);

    // Returns length + 1 writable bytes; the last is the terminating zero.
    char* data() { return fBytes.get(); }

    // Returns the text before the first zero byte. The bytes after it aren't read, since that would
    // commit the whole reported length.
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
