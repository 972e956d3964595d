// QGF::OCL: OpenCL platforms, devices, contexts and queues, over an OpenCL loader library that is
// opened at run time. Everything here throws QGF::LogicalException with the call and its status,
// unless told otherwise.
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
    // Whether an OpenCL loader library opens and has every entry point that is called; it may lack
    // the others of the FunctionTable. `path` names a library file to open; an empty one stands for
    // the platform's usual names.
    static bool IsOpenCLAvailable(const std::string& path);

    // Opens the library for good. Throws if it isn't available. Repeating it does nothing.
    static void Initialize();
};

// The OpenCL entry points of the process.
class ExtensionManager {
public:
    // Opens the library if that hasn't happened. Throws if it isn't available.
    static ExtensionManager& instance();

    const FunctionTable& table() const { return fTable; }

    // Replaces the table. For tests; null brings the library's own back.
    static void ReplaceTable(const FunctionTable* table);

private:
    FunctionTable fTable;
};

// Releases one kind of OpenCL object; device and platform ids have nothing to release. Whatever the
// driver makes of it is ignored: its status, and an exception that it throws.
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

// A raw OpenCL handle in a C++ object.
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

// Names of device properties, by OpenCL's own numbers.
enum class DeviceProperty : cl_device_info {
    VendorID = 0x1001,
    GlobalMemSize = 0x101F,
};

namespace Enum {
// The name of the C type in which OpenCL answers a property, such as "cl_uint"; "" for one that the
// library doesn't know.
const char* GetPropertyTypeName(DeviceProperty property);
// The names that GetPropertyTypeName uses, for the types that can be asked for.
template <typename T>
const char* TypeName();
template <>
const char* TypeName<cl_uint>();
template <>
const char* TypeName<cl_ulong>();
} // namespace Enum

class Platform;

// A value wrapper around a device id.
class Device : public OpenCLObjectWrapper<cl_device_id> {
public:
    explicit Device(cl_device_id device) : OpenCLObjectWrapper(device) {}

    Platform platform() const;
    // The device's own texts, up to their first zero byte. Throw std::bad_alloc if there is no room
    // for what the driver claims.
    std::string name() const;
    std::string vendor() const;

    // Reads a property of exactly `size` bytes into `value`; `actualSize` may be null. Throws if
    // the driver refuses or answers another size.
    void getInfoImpl(DeviceProperty property, std::size_t size, void* value,
                     std::size_t* actualSize) const;

    // The typed read: throws InternalException "property_typename == type_name" if T is not the
    // property's type.
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

class Platform : public OpenCLObjectWrapper<cl_platform_id> {
public:
    explicit Platform(cl_platform_id platform) : OpenCLObjectWrapper(platform) {}

    // The devices of that type in the platform's order; empty if it says "device not found".
    std::vector<Device> devices(cl_device_type type) const;
    // Up to its first zero byte. Throws std::bad_alloc if there is no room for what the driver
    // claims.
    std::string version() const;
};

// The platforms in the loader's order; empty if there is none.
std::vector<Platform> platforms();

// The properties that put a context on one platform.
class ContextProperties {
public:
    explicit ContextProperties(const Platform& platform);
    const cl_context_properties* data() const { return fProperties.data(); }

private:
    std::vector<cl_context_properties> fProperties;
};

// A function that the driver calls with its own messages, and the data it is called with.
struct ContextCallback {
    void(CL_CALLBACK* function)(const char* text, const void* data, std::size_t size, void* user);
    void* user;
};

// A context on one device, released by the destructor.
class Context : public OpenCLObjectWrapper<cl_context> {
public:
    Context(const ContextProperties& properties, const Device& device,
            const ContextCallback& callback);
    ~Context();
    Context(const Context&) = delete;
    Context& operator=(const Context&) = delete;
};

// A command queue, released by the destructor.
class CommandQueue : public OpenCLObjectWrapper<cl_command_queue> {
public:
    CommandQueue(const Context& context, const Device& device, bool outOfOrder, bool profiling);
    ~CommandQueue();
    CommandQueue(const CommandQueue&) = delete;
    CommandQueue& operator=(const CommandQueue&) = delete;
};

} // namespace OCL
} // namespace QGF
