// Owns a file descriptor.
#pragma once

#include <unistd.h>

namespace assay_host {

class Descriptor {
public:
    // A negative value is none.
    explicit Descriptor(int descriptor) : fDescriptor(descriptor) {}
    ~Descriptor()
    {
        if (fDescriptor >= 0)
            ::close(fDescriptor);
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    int Get() const { return fDescriptor; }

private:
    int fDescriptor;
};

} // namespace assay_host
