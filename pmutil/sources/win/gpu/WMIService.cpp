#include "win/gpu/WMIService.h"

#include "win/gpu/ComTypes.h"

#include <wbemidl.h>

namespace pmutil {

namespace {

static_assert(sizeof(wchar_t) == sizeof(char16_t), "the system's wide texts are UTF-16");

const wchar_t* Wide(const char16_t* text)
{
    return reinterpret_cast<const wchar_t*>(text);
}

const char16_t* Char16(const wchar_t* text)
{
    return reinterpret_cast<const char16_t*>(text);
}

class WMIRow : public AdapterRow {
public:
    explicit WMIRow(ComPtr<IWbemClassObject> row) : fRow(std::move(row)) {}

    ResultCode Get(const char16_t* name, PropertyValue& value) override
    {
        if (name == nullptr)
            return E_INVALIDARG;
        Variant variant;
        const HRESULT result = fRow->Get(Wide(name), 0, variant.get(), nullptr, nullptr);
        const VARIANT& answer = *variant.get();
        value.type = answer.vt;
        if (FAILED(result))
            return result;
        if (answer.vt == VT_I4)
            value.integer = answer.lVal;
        else if (answer.vt == VT_BSTR)
            value.text = answer.bstrVal != nullptr ? Char16(answer.bstrVal) : u"";
        return result;
    }

private:
    ComPtr<IWbemClassObject> fRow;
};

class WMIRows : public AdapterRows {
public:
    explicit WMIRows(ComPtr<IEnumWbemClassObject> rows) : fRows(std::move(rows)) {}

    ResultCode Next(std::unique_ptr<AdapterRow>& row) override
    {
        IWbemClassObject* object = nullptr;
        ULONG count = 0; // unused: a null row is the end
        const HRESULT result = fRows->Next(static_cast<LONG>(WBEM_INFINITE), 1, &object, &count);
        row.reset();
        if (object != nullptr)
            row = std::make_unique<WMIRow>(TakeReference(object));
        return result;
    }

private:
    ComPtr<IEnumWbemClassObject> fRows;
};

class WMIService : public ManagementService {
public:
    ~WMIService() override { Release(); }

    ResultCode Initialize() override { return CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED); }

    ResultCode CreateLocator() override
    {
        void* locator = nullptr;
        const HRESULT result =
            CoCreateInstance(CLSID_WbemLocator, nullptr, CLSCTX_INPROC_SERVER | CLSCTX_LOCAL_SERVER,
                             IID_IWbemLocator, &locator);
        fLocator = TakeReference(static_cast<IWbemLocator*>(locator));
        return result;
    }

    ResultCode ConnectServer() override
    {
        IWbemServices* services = nullptr;
        const BString nameSpace(L"ROOT\\CIMV2");
        const HRESULT result = fLocator->ConnectServer(nameSpace.get(), nullptr, nullptr, nullptr,
                                                       0, nullptr, nullptr, &services);
        fServices = TakeReference(services);
        return result;
    }

    ResultCode SetProxyBlanket() override
    {
        return CoSetProxyBlanket(fServices.get(), RPC_C_AUTHN_WINNT, RPC_C_AUTHZ_NONE, nullptr,
                                 RPC_C_AUTHN_LEVEL_CALL, RPC_C_IMP_LEVEL_IMPERSONATE, nullptr,
                                 EOAC_NONE);
    }

    ResultCode QueryAdapters(std::unique_ptr<AdapterRows>& rows) override
    {
        IEnumWbemClassObject* enumerator = nullptr;
        const BString language(L"WQL");
        const BString query(L"SELECT * FROM Win32_VideoController");
        const HRESULT result = fServices->ExecQuery(
            language.get(), query.get(), WBEM_FLAG_FORWARD_ONLY | WBEM_FLAG_RETURN_IMMEDIATELY,
            nullptr, &enumerator);
        if (enumerator != nullptr)
            rows = std::make_unique<WMIRows>(TakeReference(enumerator));
        return result;
    }

    void Release() override
    {
        fServices.reset();
        fLocator.reset();
    }

    void Uninitialize() override { CoUninitialize(); }

private:
    ComPtr<IWbemLocator> fLocator;
    ComPtr<IWbemServices> fServices;
};

} // namespace

std::unique_ptr<ManagementService> MakeWMIService()
{
    return std::make_unique<WMIService>();
}

} // namespace pmutil
