// QGF::OCL: OpenCL platforms, devices, contexts and queues, over an OpenCL loader library that is
// opened at run time. Unless stated otherwise, a failed call throws QGF::LogicalException with the
// call's name and its status.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

#include "qgf/Core.h"
#include "qgf/OCLFunctionTable.h"

namespace QGF {
namespace OCL {

class Library {
public:
    // Returns whether an OpenCL loader library can be opened and has every CALLED entry point of
    // OCLFunctionTable.h. `path` is the library's file; if empty, the platform's default names are
    // tried. Doesn't throw for a missing library.
    static bool IsOpenCLAvailable(const std::string& path);

    // Opens the library for the rest of the process. Further calls do nothing. Throws if it isn't
    // available.
    static void Initialize();
};

// The OpenCL entry points of the process.
class ExtensionManager {
public:
    // Opens the library by the first call. Throws if it isn't available.
    static ExtensionManager& instance();

    const FunctionTable& table() const { return fTable; }

    // Replaces the table by a copy of `table`; null restores the library's table. For tests.
    static void ReplaceTable(const FunctionTable* table);

private:
    FunctionTable fTable;
};

// Releases one kind of OpenCL object; device and platform ids need no release. The driver's status
// and an exception thrown by it are ignored.
template <typename Handle>
struct HandleTraits;
template <>
struct HandleTraits<cl_device_id> {
    static void Release(cl_device_id) noexcept {}
};
template <>
struct HandleTraits<cl_platform_id> {
    static void Release(cl_platform_id) noexcept {}
};
template <>
struct HandleTraits<cl_context> {
    static void Release(cl_context context) noexcept;
};
template <>
struct HandleTraits<cl_command_queue> {
    static void Release(cl_command_queue queue) noexcept;
};
template <>
struct HandleTraits<cl_mem> {
    static void Release(cl_mem buffer) noexcept;
};
template <>
struct HandleTraits<cl_event> {
    static void Release(cl_event event) noexcept;
};

// Base of the classes that hold an OpenCL handle.
template <typename Handle>
class OpenCLObjectWrapper {
public:
    explicit OpenCLObjectWrapper(Handle handle) : fHandle(handle) {}

    Handle handle() const { return fHandle; }
    Handle id() const { return fHandle; }

protected:
    ~OpenCLObjectWrapper() = default;
    Handle fHandle;
};

// Device properties, with OpenCL's values.
enum class DeviceProperty : cl_device_info {
    VendorID = 0x1001,
    GlobalMemSize = 0x101F,
};

namespace Enum {
// Returns the name of the property's C type, such as "cl_uint"; "" for an unknown property.
const char* GetPropertyTypeName(DeviceProperty property);
// Returns the same name for a type that getInfo can read.
template <typename T>
const char* TypeName();
template <>
const char* TypeName<cl_uint>();
template <>
const char* TypeName<cl_ulong>();
} // namespace Enum

class Platform;

// A device id. Copyable; owns nothing.
class Device : public OpenCLObjectWrapper<cl_device_id> {
public:
    explicit Device(cl_device_id device) : OpenCLObjectWrapper(device) {}

    Platform platform() const;
    // CL_DEVICE_NAME and CL_DEVICE_VENDOR, up to their first zero byte. Throw std::bad_alloc if
    // memory for the size that the driver reports can't be allocated.
    std::string name() const;
    std::string vendor() const;

    // Reads a property of exactly `size` bytes into `value`; `actualSize` may be null. Throws if
    // the driver's call fails or the driver returns another size.
    void getInfoImpl(DeviceProperty property, std::size_t size, void* value,
                     std::size_t* actualSize) const;

    // Reads a property of type T. Throws InternalException "property_typename == type_name" if T
    // is not the property's type.
    template <typename T>
    T getInfo(DeviceProperty property) const
    {
        if (std::string_view(Enum::GetPropertyTypeName(property)) != Enum::TypeName<T>())
            throw InternalException("qgf/source/qgf/qgf_ocl/Device", 122,
                                    "property_typename == type_name");
        T value{};
        getInfoImpl(property, sizeof value, &value, nullptr);
        return value;
    }
};

// A platform id. Copyable; owns nothing.
class Platform : public OpenCLObjectWrapper<cl_platform_id> {
public:
    explicit Platform(cl_platform_id platform) : OpenCLObjectWrapper(platform) {}

    // The devices of that type in the platform's order; empty if the platform returns
    // CL_DEVICE_NOT_FOUND.
    std::vector<Device> devices(cl_device_type type) const;
    // CL_PLATFORM_VERSION up to its first zero byte. Throws std::bad_alloc if memory for the size
    // that the driver reports can't be allocated.
    std::string version() const;
};

// The platforms in the loader's order; empty if there is none.
std::vector<Platform> platforms();

// The context properties that select a platform.
class ContextProperties {
public:
    explicit ContextProperties(const Platform& platform);
    const cl_context_properties* data() const { return fProperties.data(); }

private:
    std::vector<cl_context_properties> fProperties;
};

// The driver calls `function` with a message and with `user`, possibly on a thread of its own.
struct ContextCallback {
    void(CL_CALLBACK* function)(const char* text, const void* data, std::size_t size, void* user);
    void* user;
};

// A context on one device. The destructor releases it.
class Context : public OpenCLObjectWrapper<cl_context> {
public:
    Context(const ContextProperties& properties, const Device& device,
            const ContextCallback& callback);
    ~Context();
    Context(const Context&) = delete;
    Context& operator=(const Context&) = delete;
};

// A command queue. The destructor releases it.
class CommandQueue : public OpenCLObjectWrapper<cl_command_queue> {
public:
    CommandQueue(const Context& context, const Device& device, bool outOfOrder, bool profiling);
    ~CommandQueue();
    CommandQueue(const CommandQueue&) = delete;
    CommandQueue& operator=(const CommandQueue&) = delete;
};

} // namespace OCL
} // namespace QGF
