// A fake adapter source that a test fills. It records all operations and releases in order, and
// fails or throws where the test sets it.
#pragma once

#include <algorithm>
#include <functional>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "pmutil_gpu/AdapterSource.h"

namespace assay_test {

constexpr pmutil::ResultCode kFail = -2147467259;     // E_FAIL
constexpr pmutil::ResultCode kNotFound = -2147217406; // WBEM_E_NOT_FOUND
constexpr pmutil::ResultCode kNoMore = -2005270526;   // DXGI_ERROR_NOT_FOUND
constexpr pmutil::ResultCode kFalse = 1;              // S_FALSE

inline pmutil::PropertyValue TextValue(std::u16string text)
{
    pmutil::PropertyValue value;
    value.type = pmutil::PropertyValue::kString;
    value.text = std::move(text);
    return value;
}

inline pmutil::PropertyValue IntegerValue(std::int32_t integer)
{
    pmutil::PropertyValue value;
    value.type = pmutil::PropertyValue::kInt32;
    value.integer = integer;
    return value;
}

inline pmutil::PropertyValue ValueOfType(std::uint16_t type)
{
    pmutil::PropertyValue value;
    value.type = type;
    return value;
}

struct ScriptedProperty {
    pmutil::PropertyValue value;
    pmutil::ResultCode result = 0;
};

using ScriptedRow = std::map<std::u16string, ScriptedProperty>;

// A complete row with Status "OK".
inline ScriptedRow MakeRow(const std::u16string& name)
{
    return {
        {u"Status", {TextValue(u"OK")}},
        {u"AdapterRAM", {IntegerValue(0x10000000)}},
        {u"Name", {TextValue(name)}},
        {u"Caption", {TextValue(u"Caption of " + name)}},
        {u"InstalledDisplayDrivers", {TextValue(u"drivers.dll")}},
        {u"VideoModeDescription", {TextValue(u"1920 x 1080")}},
        {u"DriverVersion", {TextValue(u"1.2.3")}},
        {u"DriverDate", {TextValue(u"20240102000000.000000-000")}},
    };
}

template <std::size_t size>
void CopyText(std::array<char16_t, size>& to, std::u16string_view text)
{
    to.fill(0);
    std::copy_n(text.begin(), std::min(text.size(), size), to.begin());
}

struct ScriptedOutput {
    pmutil::OutputDescriptor descriptor;
    pmutil::ResultCode result = 0;
};

inline ScriptedOutput MakeOutput(bool attached)
{
    ScriptedOutput output;
    output.descriptor.AttachedToDesktop = attached ? 1 : 0;
    return output;
}

struct ScriptedAdapter {
    pmutil::AdapterDescriptor descriptor;
    std::vector<ScriptedOutput> outputs;
    pmutil::ResultCode result = 0; // of GetDesc, which fills the descriptor also on failure
};

// An adapter with one attached display.
inline ScriptedAdapter MakeAdapter(std::u16string_view description, std::uint32_t vendorID,
                                   std::uint32_t deviceID)
{
    ScriptedAdapter adapter;
    CopyText(adapter.descriptor.Description, description);
    adapter.descriptor.VendorId = vendorID;
    adapter.descriptor.DeviceId = deviceID;
    adapter.outputs.push_back(MakeOutput(true));
    return adapter;
}

// While it lives, it is the current adapter source.
//
// Calls are recorded as "Initialize", "Next", "Get Name", "EnumAdapters 0", "GetDesc 0",
// "EnumOutputs 0 1", "GetDesc 0 1" and so on, releases as "~factory", "~service", "~rows", "~row",
// "~adapter 0" and "~output 0 1". The keys of `results` and `throws` are such texts, for all calls
// with that text, or a text and "#k" for its k-th call, counted from 1.
class ScriptedAdapters : public pmutil::AdapterSource {
public:
    ScriptedAdapters() { pmutil::ReplaceAdapterSource(this); }
    ~ScriptedAdapters() override { pmutil::ReplaceAdapterSource(nullptr); }
    ScriptedAdapters(const ScriptedAdapters&) = delete;
    ScriptedAdapters& operator=(const ScriptedAdapters&) = delete;

    std::vector<ScriptedRow> rows;
    std::vector<ScriptedAdapter> adapters;
    std::uint64_t physicalMemory = 0;
    bool knowsPhysicalMemory = true;
    bool returnsFactory = true; // if false, CreateFactory succeeds without a factory
    bool returnsRows = true;    // if false, QueryAdapters succeeds without rows
    // The texts of calls whose object doesn't match their result: a success without an object, or a
    // failure with one.
    std::set<std::string> contrary;
    std::map<std::string, pmutil::ResultCode> results;
    std::map<std::string, std::function<void()>> throws;

    std::vector<std::string> calls;

    std::size_t CountCalls(const std::string& call) const
    {
        return static_cast<std::size_t>(std::count(calls.begin(), calls.end(), call));
    }

    pmutil::ResultCode CreateFactory(std::unique_ptr<pmutil::AdapterFactory>& factory) override
    {
        const pmutil::ResultCode result = Record("CreateFactory", 0);
        if (!pmutil::Failed(result) && returnsFactory)
            factory = std::make_unique<Factory>(*this);
        return result;
    }

    std::unique_ptr<pmutil::ManagementService> CreateManagementService() override
    {
        return std::make_unique<Service>(*this);
    }

    bool GetPhysicalMemory(std::uint64_t& bytes) override
    {
        Record("GetPhysicalMemory", 0);
        if (knowsPhysicalMemory)
            bytes = physicalMemory;
        return knowsPhysicalMemory;
    }

    // Records the call and returns its result, `natural` unless the test has set another.
    pmutil::ResultCode Record(const std::string& call, pmutil::ResultCode natural)
    {
        calls.push_back(call);
        for (const std::string& key : {call, call + "#" + std::to_string(CountCalls(call))}) {
            if (const auto found = throws.find(key); found != throws.end())
                found->second();
            if (const auto found = results.find(key); found != results.end())
                return found->second;
        }
        return natural;
    }

    // Returns whether the call returns an object.
    bool ReturnsObject(const std::string& call, pmutil::ResultCode result) const
    {
        return pmutil::Failed(result) == (contrary.count(call) != 0);
    }

private:
    // Records its destruction.
    class Tracked {
    public:
        Tracked(ScriptedAdapters& script, std::string name)
            : fScript(script), fName(std::move(name))
        {}
        ~Tracked() { fScript.calls.push_back("~" + fName); }
        Tracked(const Tracked&) = delete;
        Tracked& operator=(const Tracked&) = delete;

        ScriptedAdapters& Script() const { return fScript; }

    private:
        ScriptedAdapters& fScript;
        std::string fName;
    };

    class Row : public pmutil::AdapterRow {
    public:
        Row(ScriptedAdapters& script, ScriptedRow properties)
            : fTracked(script, "row"), fProperties(std::move(properties))
        {}
        pmutil::ResultCode Get(const char16_t* name, pmutil::PropertyValue& value) override
        {
            const std::u16string wide(name == nullptr ? u"(null)" : name);
            const pmutil::ResultCode scripted =
                fTracked.Script().Record("Get " + std::string(wide.begin(), wide.end()), 0);
            if (pmutil::Failed(scripted))
                return scripted;
            const auto found = fProperties.find(wide);
            if (found == fProperties.end())
                return kNotFound;
            value = found->second.value;
            return found->second.result;
        }

    private:
        Tracked fTracked;
        ScriptedRow fProperties;
    };

    class Rows : public pmutil::AdapterRows {
    public:
        explicit Rows(ScriptedAdapters& script) : fTracked(script, "rows") {}
        pmutil::ResultCode Next(std::unique_ptr<pmutil::AdapterRow>& row) override
        {
            ScriptedAdapters& script = fTracked.Script();
            const pmutil::ResultCode result = script.Record("Next", 0);
            if (!pmutil::Failed(result) && fNext < script.rows.size())
                row = std::make_unique<Row>(script, script.rows[fNext++]);
            return result;
        }

    private:
        Tracked fTracked;
        std::size_t fNext = 0;
    };

    class Service : public pmutil::ManagementService {
    public:
        explicit Service(ScriptedAdapters& script) : fTracked(script, "service") {}
        pmutil::ResultCode Initialize() override { return Record("Initialize"); }
        pmutil::ResultCode CreateLocator() override { return Record("CreateLocator"); }
        pmutil::ResultCode ConnectServer() override { return Record("ConnectServer"); }
        pmutil::ResultCode SetProxyBlanket() override { return Record("SetProxyBlanket"); }
        pmutil::ResultCode QueryAdapters(std::unique_ptr<pmutil::AdapterRows>& enumerator) override
        {
            const pmutil::ResultCode result = Record("QueryAdapters");
            if (!pmutil::Failed(result) && fTracked.Script().returnsRows)
                enumerator = std::make_unique<Rows>(fTracked.Script());
            return result;
        }
        void Release() override { Record("Release"); }
        void Uninitialize() override { Record("Uninitialize"); }

    private:
        pmutil::ResultCode Record(const char* call) { return fTracked.Script().Record(call, 0); }

        Tracked fTracked;
    };

    class Output : public pmutil::AdapterOutput {
    public:
        Output(ScriptedAdapters& script, std::string place, ScriptedOutput output)
            : fTracked(script, "output " + place), fPlace(std::move(place)), fOutput(output)
        {}
        pmutil::ResultCode GetDesc(pmutil::OutputDescriptor& description) override
        {
            description = fOutput.descriptor;
            return fTracked.Script().Record("GetDesc " + fPlace, fOutput.result);
        }

    private:
        Tracked fTracked;
        std::string fPlace;
        ScriptedOutput fOutput;
    };

    class ListedAdapter : public pmutil::Adapter {
    public:
        ListedAdapter(ScriptedAdapters& script, const std::string& place, ScriptedAdapter adapter)
            : fTracked(script, "adapter " + place), fPlace(place), fAdapter(std::move(adapter))
        {}
        pmutil::ResultCode GetDesc(pmutil::AdapterDescriptor& description) override
        {
            description = fAdapter.descriptor;
            return fTracked.Script().Record("GetDesc " + fPlace, fAdapter.result);
        }
        pmutil::ResultCode EnumOutputs(std::uint32_t index,
                                       std::unique_ptr<pmutil::AdapterOutput>& output) override
        {
            ScriptedAdapters& script = fTracked.Script();
            const std::string place = fPlace + " " + std::to_string(index);
            const bool exists = index < fAdapter.outputs.size();
            const pmutil::ResultCode result =
                script.Record("EnumOutputs " + place, exists ? 0 : kNoMore);
            if (script.ReturnsObject("EnumOutputs " + place, result) && exists)
                output = std::make_unique<Output>(script, place, fAdapter.outputs[index]);
            return result;
        }

    private:
        Tracked fTracked;
        std::string fPlace;
        ScriptedAdapter fAdapter;
    };

    class Factory : public pmutil::AdapterFactory {
    public:
        explicit Factory(ScriptedAdapters& script) : fTracked(script, "factory") {}
        pmutil::ResultCode EnumAdapters(std::uint32_t index,
                                        std::unique_ptr<pmutil::Adapter>& adapter) override
        {
            ScriptedAdapters& script = fTracked.Script();
            const std::string place = std::to_string(index);
            const bool exists = index < script.adapters.size();
            const pmutil::ResultCode result =
                script.Record("EnumAdapters " + place, exists ? 0 : kNoMore);
            if (script.ReturnsObject("EnumAdapters " + place, result) && exists)
                adapter = std::make_unique<ListedAdapter>(script, place, script.adapters[index]);
            return result;
        }

    private:
        Tracked fTracked;
    };
};

} // namespace assay_test
