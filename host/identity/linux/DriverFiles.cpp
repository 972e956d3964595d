#include "identity/linux/DriverFiles.h"

#include <algorithm>
#include <string>
#include <string_view>

#include "identity/linux/EglVendor.h"
#include "identity/linux/LibrarySearch.h"
#include "identity/linux/LibrarySet.h"

namespace assay_host {

namespace {

bool EndsWith(const std::string& text, std::string_view end)
{
    return text.size() >= end.size() &&
           text.compare(text.size() - end.size(), end.size(), end) == 0;
}

std::string GetFolder(const std::string& path)
{
    return path.substr(0, std::min(path.rfind('/'), path.size()));
}

// Lists of files that each name one driver.
struct DriverLists {
    const char* fFilesVariable;   // a list of such files
    const char* fFoldersVariable; // a list of folders with such files
    const char* fFolders;         // the folders without the variables
};

// libglvnd's lists of drivers (src/EGL/libeglvendor.c), and those of NVIDIA's driver for windowing
// systems.
constexpr DriverLists kEglLists[] = {
    {"__EGL_VENDOR_LIBRARY_FILENAMES", "__EGL_VENDOR_LIBRARY_DIRS",
     "/etc/glvnd/egl_vendor.d:/usr/share/glvnd/egl_vendor.d"},
    {"__EGL_EXTERNAL_PLATFORM_CONFIG_FILENAMES", "__EGL_EXTERNAL_PLATFORM_CONFIG_DIRS",
     "/etc/egl/egl_external_platform.d:/usr/share/egl/egl_external_platform.d"}};

// A folder of libraries that drivers open by names of their own.
struct Parts {
    DeviceKind fKind;
    const char* fVariable; // a list of folders to search first; null for none
    const char* fFolder;   // the folder beside a driver
    const char* fEnd;      // of the libraries' names
};

// Mesa's drivers of a card (src/loader/loader.c), its backends of buffers (src/gbm/main/backend.c)
// and its drivers for OpenCL (src/gallium/auxiliary/pipe-loader/pipe_loader.c), PoCL's devices
// (lib/CL/devices/devices.c).
constexpr Parts kParts[] = {{DeviceKind::kOpenGL, "LIBGL_DRIVERS_PATH", "dri", "_dri.so"},
                            {DeviceKind::kOpenGL, "GBM_BACKENDS_PATH", "gbm", "_gbm.so"},
                            {DeviceKind::kOpenCL, "GALLIUM_PIPE_SEARCH_DIR", "gallium-pipe", ".so"},
                            {DeviceKind::kOpenCL, nullptr, "pocl", ".so"}};

class Lister {
public:
    Lister(const Files& files, const Process& process)
        : fFiles(files), fProcess(process), fSearch(files, process), fSet(files, fSearch)
    {
        if (!process.fProgram.empty())
            fProgram =
                ReadElfFile(files.GetRealPath(process.fProgram), GetFolder(process.fProgram));
    }

    void AddOpenGL();
    void AddOpenCL();
    const std::vector<DriverFile>& Get() const { return fSet.Get(); }

private:
    ElfFile AddLoader(DeviceKind kind, const std::string& name);
    void AddDriver(DeviceKind kind, const std::string& name, const ElfFile& loader);
    void AddParts(DeviceKind kind, const std::string& folder);
    std::vector<std::string> ListFolder(const std::string& folder, std::string_view end) const;
    std::vector<std::string> ListEglFiles(const DriverLists& lists) const;
    std::vector<std::string> ListIcdFiles() const;
    void AddNamedLibraries(const char* variable, const ElfFile& loader);
    void AddNameFile(const std::string& path, const ElfFile& loader);
    bool IsVendorFile() const;

    const Files& fFiles;
    const Process& fProcess;
    LibrarySearch fSearch;
    LibrarySet fSet;
    ElfFile fProgram;
};

// Returns what the loader library tells the dynamic loader, for the drivers that it opens.
ElfFile Lister::AddLoader(DeviceKind kind, const std::string& name)
{
    for (const char* end : {".1", ""}) {
        const std::vector<std::string> paths = fSet.Add(kind, name + end, fProgram);
        if (!paths.empty())
            return fSet.GetElfFile(paths.back());
    }
    return {};
}

void Lister::AddDriver(DeviceKind kind, const std::string& name, const ElfFile& loader)
{
    for (const std::string& path : fSet.Add(kind, name, loader))
        AddParts(kind, GetFolder(path));
}

void Lister::AddParts(DeviceKind kind, const std::string& folder)
{
    for (const Parts& parts : kParts) {
        if (parts.fKind != kind)
            continue;
        std::vector<std::string> folders;
        if (parts.fVariable != nullptr)
            folders = SplitPaths(fProcess.Get(parts.fVariable));
        if (folders.empty())
            folders = {folder + "/" + parts.fFolder, std::string("/usr/lib/") + parts.fFolder};
        for (const std::string& place : folders)
            for (const std::string& path : ListFolder(place, parts.fEnd))
                fSet.Add(kind, path, {});
    }
}

// Returns the paths of the files whose name has this end, in the order of their names.
std::vector<std::string> Lister::ListFolder(const std::string& folder, std::string_view end) const
{
    std::vector<std::string> paths;
    const std::string place = fFiles.Resolve(fProcess.MakeAbsolute(folder));
    for (const std::string& name : fFiles.List(place))
        if (EndsWith(name, end))
            paths.push_back(JoinPath(place, name));
    return paths;
}

std::vector<std::string> Lister::ListEglFiles(const DriverLists& lists) const
{
    if (fProcess.fVariables.count(lists.fFilesVariable) != 0)
        return SplitPaths(fProcess.Get(lists.fFilesVariable));
    const bool isSet = fProcess.fVariables.count(lists.fFoldersVariable) != 0;
    std::vector<std::string> paths;
    for (const std::string& folder :
         SplitPaths(isSet ? fProcess.Get(lists.fFoldersVariable) : lists.fFolders))
        for (std::string& path : ListFolder(folder, ".json"))
            paths.push_back(std::move(path));
    return paths;
}

void Lister::AddOpenGL()
{
    const ElfFile loader = AddLoader(DeviceKind::kOpenGL, "libEGL.so");
    for (const DriverLists& lists : kEglLists) {
        for (const std::string& path : ListEglFiles(lists)) {
            const auto status = fFiles.Find(fProcess.MakeAbsolute(path));
            if (!status)
                continue;
            fSet.AddFile(DeviceKind::kOpenGL, *status);
            AddDriver(DeviceKind::kOpenGL, FindEglLibrary(fFiles.Read(status->fPath)), loader);
        }
    }
}

// A loader with OCL_ICD_VENDORS may read one such file, or take the value for a library's name.
bool Lister::IsVendorFile() const
{
    const std::string vendors = fProcess.Get("OCL_ICD_VENDORS");
    return !vendors.empty() && fFiles.List(fFiles.Resolve(fProcess.MakeAbsolute(vendors))).empty();
}

std::vector<std::string> Lister::ListIcdFiles() const
{
    constexpr std::string_view kEnd = ".icd";
    std::string folder = fProcess.Get("OPENCL_VENDOR_PATH");
    if (folder.empty())
        folder = "/etc/OpenCL/vendors";
    const std::string vendors = fProcess.Get("OCL_ICD_VENDORS");
    if (vendors.empty())
        return ListFolder(folder, kEnd);
    if (!IsVendorFile())
        return ListFolder(vendors, kEnd);
    if (!EndsWith(vendors, kEnd))
        return {};
    return {vendors, folder + "/" + vendors};
}

// Adds a file whose first line names a library, and the library.
void Lister::AddNameFile(const std::string& path, const ElfFile& loader)
{
    const auto status = fFiles.Find(fProcess.MakeAbsolute(path));
    if (!status)
        return;
    fSet.AddFile(DeviceKind::kOpenCL, *status);
    AddDriver(DeviceKind::kOpenCL, fFiles.ReadLine(status->fPath), loader);
}

void Lister::AddNamedLibraries(const char* variable, const ElfFile& loader)
{
    for (const std::string& name : SplitPaths(fProcess.Get(variable)))
        AddDriver(DeviceKind::kOpenCL, name, loader);
}

// The rules of both loaders, ocl-icd (ocl_icd_loader.c) and the one of Khronos
// (loader/linux/icd_linux.c).
void Lister::AddOpenCL()
{
    const ElfFile loader = AddLoader(DeviceKind::kOpenCL, "libOpenCL.so");
    for (const std::string& path : ListIcdFiles())
        AddNameFile(path, loader);
    if (IsVendorFile())
        AddDriver(DeviceKind::kOpenCL, fProcess.Get("OCL_ICD_VENDORS"), loader);
    AddNamedLibraries("OCL_ICD_FILENAMES", loader);
    AddNamedLibraries("OPENCL_LAYERS", loader);
    const std::string layers = fProcess.Get("OPENCL_LAYER_PATH");
    for (const std::string& path :
         ListFolder(layers.empty() ? "/etc/OpenCL/layers" : layers, ".lay"))
        AddNameFile(path, loader);
}

} // namespace

std::vector<DriverFile> ListDriverFiles(const Files& files, const Process& process)
{
    Lister lister(files, process);
    lister.AddOpenGL();
    lister.AddOpenCL();
    return lister.Get();
}

} // namespace assay_host
