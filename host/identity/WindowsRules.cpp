// The values are documented: OpenGLDriverName under "Loading an OpenGL Installable Client Driver"
// of the driver kit, OpenCLDriverName and the lists for OpenCL by Khronos' loader
// (loader/windows/icd_windows.c, icd_windows_hkr.c), the list for OpenGL by Mesa
// (docs/drivers/llvmpipe.rst).
#include "identity/WindowsRules.h"

#include <algorithm>
#include <charconv>
#include <map>
#include <string_view>
#include <utility>

#include "identity/Variables.h"

namespace assay_host {

namespace {

constexpr char kEnum[] = R"(SYSTEM\CurrentControlSet\Enum\)";
constexpr char kClass[] = R"(SYSTEM\CurrentControlSet\Control\Class\)";
constexpr char kDisplayClass[] = "{4d36e968-e325-11ce-bfc1-08002be10318}";
constexpr char kComponentClass[] = "{5c4c3332-344d-483c-8739-259e934c9cc8}";
constexpr char kVendors[] = R"(SOFTWARE\Khronos\OpenCL\Vendors)";
constexpr char kLayers[] = R"(SOFTWARE\Khronos\OpenCL\Layers)";
constexpr char kOpenGLDrivers[] = R"(SOFTWARE\Microsoft\Windows NT\CurrentVersion\OpenGLDrivers)";

char ToLower(char letter)
{
    return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
}

bool StartsWith(std::string_view text, std::string_view start)
{
    return text.size() >= start.size() &&
           std::equal(start.begin(), start.end(), text.begin(),
                      [](char left, char right) { return ToLower(left) == ToLower(right); });
}

bool IsSame(std::string_view left, std::string_view right)
{
    return left.size() == right.size() && StartsWith(left, right);
}

// Returns the id after a mark in "PCI\VEN_10DE&DEV_2484&..."; 0 if there is none.
unsigned FindId(const std::string& device, std::string_view mark)
{
    constexpr std::size_t kDigits = 4;
    for (std::string_view rest = device; !rest.empty(); rest.remove_prefix(1)) {
        if (!StartsWith(rest, mark))
            continue;
        const std::string_view digits = rest.substr(mark.size(), kDigits);
        unsigned id = 0;
        const auto result = std::from_chars(digits.data(), digits.data() + digits.size(), id, 16);
        return result.ptr == digits.data() + kDigits ? id : 0;
    }
    return 0;
}

// The values of one key.
class Values {
public:
    Values(WindowsSource& source, const std::string& key) : fValues(source.ListValues(key)) {}

    std::vector<std::string> GetTexts(std::string_view name) const
    {
        const auto value =
            std::find_if(fValues.begin(), fValues.end(), [name](const RegistryValue& candidate) {
                return IsSame(candidate.fName, name);
            });
        return value == fValues.end() ? std::vector<std::string>() : value->fTexts;
    }

    std::string GetText(std::string_view name) const
    {
        const std::vector<std::string> texts = GetTexts(name);
        return texts.empty() ? std::string() : texts.front();
    }

private:
    std::vector<RegistryValue> fValues;
};

class Collector {
public:
    explicit Collector(WindowsSource& source) : fSource(source) {}

    Identity Collect()
    {
        AddFile(DeviceKind::kOpenGL, "opengl32.dll");
        AddFile(DeviceKind::kOpenCL, "OpenCL.dll");
        for (const std::string& device : ListDevices(kDisplayClass))
            AddAdapter(device);
        for (const std::string& device : ListDevices(kComponentClass))
            AddDriverFiles(GetClassKey(Values(fSource, kEnum + device)));
        AddOpenCLLists();
        AddOpenGLList();
        // Windows has no variable without a value.
        fIdentity.fVariables = ListVariables([this](const std::string& name) {
            std::string value = fSource.GetVariable(name);
            return value.empty() ? std::nullopt : std::optional(std::move(value));
        });
        SortIdentity(fIdentity);
        return std::move(fIdentity);
    }

private:
    // A system that lists no present devices, such as Wine, still has their keys.
    std::vector<std::string> ListDevices(const std::string& classId)
    {
        std::vector<std::string> devices = fSource.ListPresentDevices(classId);
        if (!devices.empty())
            return devices;
        for (const std::string& model : fSource.ListKeys(std::string(kEnum) + "PCI")) {
            for (const std::string& instance : fSource.ListKeys(kEnum + ("PCI\\" + model))) {
                const std::string device =
                    std::string("PCI\\").append(model).append("\\").append(instance);
                if (IsSame(Values(fSource, kEnum + device).GetText("ClassGUID"), classId))
                    devices.push_back(device);
            }
        }
        return devices;
    }

    // Returns the path of the key with the settings of a device's driver; empty if it has none.
    static std::string GetClassKey(const Values& device)
    {
        const std::string driver = device.GetText("Driver");
        return driver.empty() ? std::string() : kClass + driver;
    }

    void AddAdapter(const std::string& device)
    {
        const Values values(fSource, kEnum + device);
        const std::string key = GetClassKey(values);
        AdapterIdentity adapter;
        adapter.fSlot = device;
        adapter.fVendor = FindId(device, "VEN_");
        adapter.fDevice = FindId(device, "DEV_");
        adapter.fDriver = values.GetText("Service");
        if (!key.empty())
            adapter.fDriverVersion = Values(fSource, key).GetText("DriverVersion");
        fIdentity.fAdapters.push_back(std::move(adapter));
        AddDriverFiles(key);
    }

    void AddDriverFiles(const std::string& key)
    {
        if (key.empty())
            return;
        const Values values(fSource, key);
        for (const std::string& name : values.GetTexts("OpenGLDriverName"))
            AddFile(DeviceKind::kOpenGL, name);
        for (const std::string& name : values.GetTexts("OpenCLDriverName"))
            AddFile(DeviceKind::kOpenCL, name);
    }

    void AddOpenCLLists()
    {
        // The names of the values are paths. A vendor with another number than 0 is switched off.
        for (const RegistryValue& vendor : fSource.ListValues(kVendors))
            if (vendor.fNumber == 0U)
                AddFile(DeviceKind::kOpenCL, vendor.fName);
        for (const RegistryValue& layer : fSource.ListValues(kLayers))
            if (layer.fNumber)
                AddFile(DeviceKind::kOpenCL, layer.fName);
        for (const char* variable : {"OCL_ICD_FILENAMES", "OPENCL_LAYERS"}) {
            std::string names = fSource.GetVariable(variable);
            while (!names.empty()) {
                const std::size_t end = std::min(names.find(';'), names.size());
                AddFile(DeviceKind::kOpenCL, names.substr(0, end));
                names.erase(0, end + 1);
            }
        }
    }

    // The list is used without a driver of the display device.
    void AddOpenGLList()
    {
        for (const std::string& name : fSource.ListKeys(kOpenGLDrivers))
            AddFile(DeviceKind::kOpenGL,
                    Values(fSource, std::string(kOpenGLDrivers) + "\\" + name).GetText("DLL"));
    }

    // Adds a library by its name in the system folder or by its path. The extension may be missing.
    void AddFile(DeviceKind kind, std::string name)
    {
        static constexpr std::string_view kRoot = "\\SystemRoot\\";
        if (name.empty())
            return;
        if (name.find('.', name.find_last_of("\\/") + 1) == std::string::npos)
            name += ".dll";
        const std::string system = fSource.GetSystemFolder();
        if (StartsWith(name, kRoot))
            name = system.substr(0, system.rfind('\\') + 1) + name.substr(kRoot.size());
        else if (name.find_first_of("\\/:") == std::string::npos)
            name = system + "\\" + name;
        std::optional<DriverFile> file = fSource.FindFile(name);
        if (!file)
            return;
        file->fInterface = kind;
        fIdentity.fFiles.push_back(std::move(*file));
    }

    WindowsSource& fSource;
    Identity fIdentity;
};

} // namespace

Identity GetWindowsIdentity(WindowsSource& source)
{
    return Collector(source).Collect();
}

} // namespace assay_host
