// Owners of COM references, strings and variants.
#pragma once

#include <windows.h>

#include <oleauto.h>
#include <unknwn.h>

#include <boost/smart_ptr/intrusive_ptr.hpp>

#include "pmutil_gpu/AdapterSource.h"

inline void intrusive_ptr_add_ref(IUnknown* object)
{
    object->AddRef();
}
inline void intrusive_ptr_release(IUnknown* object)
{
    object->Release();
}

namespace pmutil {

// A counted reference to a COM object.
template <typename Interface>
using ComPtr = boost::intrusive_ptr<Interface>;

// Takes ownership of a reference that a COM call returned.
template <typename Interface>
ComPtr<Interface> TakeReference(Interface* object)
{
    constexpr bool kAlreadyCounted = false;
    return ComPtr<Interface>(object, kAlreadyCounted);
}

// Thrown for a failure of COM. It has no text, so it isn't a std::exception.
struct ComError {
    HRESULT result;
};

// A BSTR. The constructor throws ComError E_OUTOFMEMORY.
class BString {
public:
    explicit BString(const wchar_t* text) : fText(SysAllocString(text))
    {
        if (fText == nullptr)
            throw ComError{E_OUTOFMEMORY};
    }
    ~BString() { SysFreeString(fText); }
    BString(const BString&) = delete;
    BString& operator=(const BString&) = delete;

    BSTR get() const { return fText; }

private:
    BSTR fText;
};

// A VARIANT. The destructor clears it.
class Variant {
public:
    Variant() { VariantInit(&fValue); }
    ~Variant() { VariantClear(&fValue); }
    Variant(const Variant&) = delete;
    Variant& operator=(const Variant&) = delete;

    VARIANT* get() { return &fValue; }

private:
    VARIANT fValue;
};

} // namespace pmutil
