#include <optional>
#include <utility>

#include "qgf/DriverCall.h"
#include "qgf/OCL.h"
#include "qgf/qgf_ocl/LibraryNames.h"

namespace QGF {
namespace OCL {

namespace {

struct LoadedLibrary {
    std::unique_ptr<Core::DynamicLibrary> loader;
    FunctionTable table;
};

Core::Proc GetProcOf(void* library, const char* name)
{
    return static_cast<const Core::DynamicLibrary*>(library)->getProc(name);
}

LoadedLibrary Load(const char* const* names)
{
    const Core::DriverCall call(Core::Interface::kOpenCL);
    LoadedLibrary loaded{Core::OpenLibrary(names), {}};
    if (!FillFunctionTable(loaded.table, GetProcOf, loaded.loader.get()))
        throw LogicalException("The OpenCL library lacks required entry points");
    return loaded;
}

// Never closed: threads of a driver may outlive all objects of this library.
const LoadedLibrary& GetLoadedLibrary()
{
    static const LoadedLibrary* const loaded = [] {
        auto* const library = new LoadedLibrary(Load(kLibraryNames));
        if (Core::IsObserved())
            ObserveCalls(library->table);
        return library;
    }();
    return *loaded;
}

// Set by ReplaceTable.
std::optional<FunctionTable>& Replacement()
{
    static std::optional<FunctionTable> replacement;
    return replacement;
}

} // namespace

bool Library::IsOpenCLAvailable(const std::string& path)
{
    try {
        if (path.empty()) {
            GetLoadedLibrary();
        } else {
            const char* const names[] = {path.c_str(), nullptr};
            Load(names);
        }
        return true;
    } catch (const LogicalException&) {
        return false;
    }
}

void Library::Initialize()
{
    ExtensionManager::instance();
}

ExtensionManager& ExtensionManager::instance()
{
    static ExtensionManager manager;
    manager.fTable = Replacement() ? *Replacement() : GetLoadedLibrary().table;
    return manager;
}

void ExtensionManager::ReplaceTable(const FunctionTable* table)
{
    Replacement() = table != nullptr ? std::optional<FunctionTable>(*table) : std::nullopt;
}

} // namespace OCL
} // namespace QGF
