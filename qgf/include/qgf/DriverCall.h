// Calls into the libraries of OpenGL and OpenCL: EGL, WGL, the drivers below them, and the loading
// of the libraries themselves. An observer is called before and after each of them.
#pragma once

namespace QGF {
namespace Core {

enum class Interface { kOpenGL, kOpenCL };

// Called on the thread that makes the call. Must keep errno and Windows' last error.
class DriverCallObserver {
public:
    virtual ~DriverCallObserver() = default;
    virtual void BeforeCall(Interface kind) noexcept = 0;
    virtual void AfterCall(Interface kind) noexcept = 0;
};

namespace detail {
inline DriverCallObserver* gDriverCallObserver = nullptr;
} // namespace detail

// Sets the observer, which must outlive all further calls; null ends it. Set it before the first
// use of the library: tables that were filled without an observer aren't observed. No call may be
// running.
inline void ObserveDriverCalls(DriverCallObserver* observer)
{
    detail::gDriverCallObserver = observer;
}

inline bool IsObserved()
{
    return detail::gDriverCallObserver != nullptr;
}

// A call, from the construction to the destruction.
class DriverCall {
public:
    explicit DriverCall(Interface kind) noexcept : fInterface(kind)
    {
        if (IsObserved())
            detail::gDriverCallObserver->BeforeCall(fInterface);
    }

    ~DriverCall()
    {
        if (IsObserved())
            detail::gDriverCallObserver->AfterCall(fInterface);
    }

    DriverCall(const DriverCall&) = delete;
    DriverCall& operator=(const DriverCall&) = delete;

private:
    const Interface fInterface;
};

} // namespace Core
} // namespace QGF
