#include <string>

#include <dlfcn.h>

#include "qgf/Core.h"
#include "qgf/qgf_core/LibraryLoader.h"

namespace QGF {
namespace Core {

namespace {

std::string LoaderError()
{
    const char* const text = dlerror(); // NOLINT(concurrency-mt-unsafe): per thread in glibc
    return text != nullptr ? text : "no reason given";
}

class SharedObject : public DynamicLibrary {
public:
    explicit SharedObject(void* handle) : fHandle(handle) {}
    ~SharedObject() override { dlclose(fHandle); }
    SharedObject(const SharedObject&) = delete;
    SharedObject& operator=(const SharedObject&) = delete;

    Proc getProc(const char* name) const override
    {
        return reinterpret_cast<Proc>(dlsym(fHandle, name));
    }

private:
    void* fHandle;
};

} // namespace

std::unique_ptr<DynamicLibrary> OpenLibrary(const char* const* names)
{
    std::string reasons;
    for (; *names != nullptr; ++names) {
        if (void* const handle = dlopen(*names, RTLD_NOW | RTLD_LOCAL))
            return std::make_unique<SharedObject>(handle);
        if (!reasons.empty())
            reasons += "; ";
        reasons += std::string(*names) + " can't be opened (" + LoaderError() + ")";
    }
    throw LogicalException(reasons.empty() ? "No library was named" : reasons);
}

void CheckNativeLoader()
{
    void* const self = dlopen(nullptr, RTLD_LAZY);
    if (self == nullptr)
        throw LogicalException("The dynamic loader can't open the program itself (" +
                               LoaderError() + ")");
    dlclose(self);
}

} // namespace Core
} // namespace QGF
