// Nothing here loads a driver: the registry, the list of devices and the attributes of files are
// the system's.
#include <algorithm>
#include <cstring>
#include <memory>

#include <boost/nowide/convert.hpp>
#include <windows.h>

#include <cfgmgr32.h>

#include "facts/Environment.h"
#include "facts/FileVersion.h"
#include "identity/WindowsRules.h"

namespace assay_host {

namespace {

constexpr DWORD kMaxKeys = 4096;
constexpr DWORD kMaxValueBytes = 1U << 16;
constexpr std::size_t kMaxName = 1U << 14; // of a value, as the registry limits it

class Key {
public:
    explicit Key(const std::string& path)
    {
        if (::RegOpenKeyExW(HKEY_LOCAL_MACHINE, boost::nowide::widen(path).c_str(), 0,
                            KEY_READ | KEY_WOW64_64KEY, &fKey) != ERROR_SUCCESS)
            fKey = nullptr;
    }
    ~Key()
    {
        if (fKey != nullptr)
            ::RegCloseKey(fKey);
    }
    Key(const Key&) = delete;
    Key& operator=(const Key&) = delete;

    HKEY Get() const { return fKey; }

private:
    HKEY fKey = nullptr;
};

std::wstring ExpandVariables(const std::wstring& text)
{
    wchar_t expanded[1024] = {};
    const DWORD size = ::ExpandEnvironmentStringsW(text.c_str(), expanded, 1024);
    return size == 0 || size > 1024 ? text : std::wstring(expanded);
}

// Splits texts that are each ended by a zero.
std::vector<std::string> SplitTexts(const std::wstring& all, bool isExpanded)
{
    std::vector<std::string> texts;
    std::size_t begin = 0;
    while (begin < all.size()) {
        const std::size_t end = std::min(all.find(L'\0', begin), all.size());
        const std::wstring text = all.substr(begin, end - begin);
        if (!text.empty())
            texts.push_back(boost::nowide::narrow(isExpanded ? ExpandVariables(text) : text));
        begin = end + 1;
    }
    return texts;
}

void SetData(DWORD type, const BYTE* data, DWORD size, RegistryValue& value)
{
    if (type == REG_DWORD && size == sizeof(std::uint32_t)) {
        std::uint32_t number = 0;
        std::memcpy(&number, data, sizeof number);
        value.fNumber = number;
    } else if (type == REG_SZ || type == REG_EXPAND_SZ || type == REG_MULTI_SZ) {
        std::wstring all(size / sizeof(wchar_t), L'\0');
        if (!all.empty())
            std::memcpy(all.data(), data, all.size() * sizeof(wchar_t));
        value.fTexts = SplitTexts(all, type == REG_EXPAND_SZ);
    }
}

using GetSize = CONFIGRET(WINAPI*)(PULONG, PCWSTR, ULONG);
using GetList = CONFIGRET(WINAPI*)(PCWSTR, PWCHAR, ULONG, ULONG);

class ThisWindows : public WindowsSource {
public:
    std::vector<std::string> ListKeys(const std::string& path) override
    {
        std::vector<std::string> names;
        const Key key(path);
        for (DWORD index = 0; key.Get() != nullptr && index < kMaxKeys; ++index) {
            wchar_t name[256] = {};
            DWORD size = 256;
            if (::RegEnumKeyExW(key.Get(), index, name, &size, nullptr, nullptr, nullptr,
                                nullptr) != ERROR_SUCCESS)
                break;
            names.push_back(boost::nowide::narrow(name));
        }
        return names;
    }

    std::vector<RegistryValue> ListValues(const std::string& path) override
    {
        std::vector<RegistryValue> values;
        const Key key(path);
        std::vector<wchar_t> name(kMaxName);
        std::vector<BYTE> data(kMaxValueBytes);
        for (DWORD index = 0; key.Get() != nullptr && index < kMaxKeys; ++index) {
            auto nameSize = static_cast<DWORD>(name.size());
            DWORD size = kMaxValueBytes;
            DWORD type = 0;
            const LSTATUS status = ::RegEnumValueW(key.Get(), index, name.data(), &nameSize,
                                                   nullptr, &type, data.data(), &size);
            if (status == ERROR_MORE_DATA)
                continue;
            if (status != ERROR_SUCCESS)
                break;
            RegistryValue value;
            value.fName = boost::nowide::narrow(std::wstring(name.data(), nameSize));
            SetData(type, data.data(), size, value);
            values.push_back(std::move(value));
        }
        return values;
    }

    std::vector<std::string> ListPresentDevices(const std::string& classId) override
    {
        // Loaded here, because nothing else needs it.
        const HMODULE library =
            ::LoadLibraryExW(L"cfgmgr32.dll", nullptr, LOAD_LIBRARY_SEARCH_SYSTEM32);
        if (library == nullptr)
            return {};
        const std::unique_ptr<HINSTANCE__, decltype(&::FreeLibrary)> owner(library, ::FreeLibrary);
        const auto getSize = reinterpret_cast<GetSize>(
            reinterpret_cast<void*>(::GetProcAddress(library, "CM_Get_Device_ID_List_SizeW")));
        const auto getList = reinterpret_cast<GetList>(
            reinterpret_cast<void*>(::GetProcAddress(library, "CM_Get_Device_ID_ListW")));
        constexpr ULONG kFlags = CM_GETIDLIST_FILTER_CLASS | CM_GETIDLIST_FILTER_PRESENT;
        const std::wstring filter = boost::nowide::widen(classId);
        ULONG size = 0;
        if (getSize == nullptr || getList == nullptr ||
            getSize(&size, filter.c_str(), kFlags) != CR_SUCCESS)
            return {};
        // A device may be added at the same time.
        constexpr ULONG kReserve = 1024;
        std::wstring list(size + kReserve, L'\0');
        if (getList(filter.c_str(), list.data(), static_cast<ULONG>(list.size()), kFlags) !=
            CR_SUCCESS)
            return {};
        return SplitTexts(list, false);
    }

    std::optional<DriverFile> FindFile(const std::string& path) override
    {
        const HANDLE file = ::CreateFileW(boost::nowide::widen(path).c_str(), FILE_READ_ATTRIBUTES,
                                          FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                                          nullptr, OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
        if (file == INVALID_HANDLE_VALUE)
            return std::nullopt;
        const std::unique_ptr<void, decltype(&::CloseHandle)> owner(file, ::CloseHandle);
        BY_HANDLE_FILE_INFORMATION info{};
        if (::GetFileType(file) != FILE_TYPE_DISK || !::GetFileInformationByHandle(file, &info))
            return std::nullopt;
        DriverFile found;
        found.fPath = GetFinalPath(file, path);
        found.fSize = std::uint64_t{info.nFileSizeHigh} << 32 | info.nFileSizeLow;
        found.fTime = GetUnixTime(info.ftLastWriteTime);
        return found;
    }

    std::string GetSystemFolder() override
    {
        wchar_t folder[MAX_PATH] = {};
        const UINT size = ::GetSystemDirectoryW(folder, MAX_PATH);
        return size == 0 || size >= MAX_PATH ? std::string() : boost::nowide::narrow(folder);
    }

    std::string GetVariable(const std::string& name) override
    {
        constexpr DWORD kMaxValue = 1U << 15;
        const std::wstring wide = boost::nowide::widen(name);
        // Most variables aren't set or are short.
        std::vector<wchar_t> value(256);
        const auto read = [&] {
            return ::GetEnvironmentVariableW(wide.c_str(), value.data(),
                                             static_cast<DWORD>(value.size()));
        };
        DWORD size = read();
        if (size >= value.size()) {
            value.resize(kMaxValue);
            size = read();
        }
        return size == 0 || size >= value.size()
                   ? std::string()
                   : boost::nowide::narrow(std::wstring(value.data(), size));
    }

private:
    // Returns the path without links.
    static std::string GetFinalPath(HANDLE file, const std::string& path)
    {
        constexpr DWORD kMaxPath = 1U << 15;
        std::vector<wchar_t> final(kMaxPath);
        const DWORD size = ::GetFinalPathNameByHandleW(file, final.data(), kMaxPath, 0);
        if (size == 0 || size >= kMaxPath)
            return path;
        const std::string text = boost::nowide::narrow(std::wstring(final.data(), size));
        static const std::string gPrefix = R"(\\?\)";
        return text.compare(0, gPrefix.size(), gPrefix) == 0 ? text.substr(gPrefix.size()) : text;
    }

    static std::int64_t GetUnixTime(FILETIME time)
    {
        constexpr std::int64_t kTo1970 = 116444736000000000; // in 100 ns
        const std::int64_t ticks =
            static_cast<std::int64_t>(time.dwHighDateTime) << 32 | time.dwLowDateTime;
        return (ticks - kTo1970) * 100;
    }
};

} // namespace

Identity GetIdentity(const std::string& assayProgram)
{
    ThisWindows windows;
    Identity identity = GetWindowsIdentity(windows);
    const Environment environment = GetEnvironment(false);
    identity.fSystem = environment.fSystem.fValue + "; " + environment.fBuild.fValue + "; " +
                       environment.fKernel.fValue + "; " + environment.fArchitecture.fValue;
    identity.fAssayVersion = GetFileVersion(assayProgram).fValue;
    return identity;
}

} // namespace assay_host
