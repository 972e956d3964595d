#include "pmutil_gpu/GPUImplWin.h"

#include <array>
#include <stdexcept>

#include <boost/make_shared.hpp>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "pmutil_gpu/GPU.h"
#include "support/Allocations.h"
#include "support/CapturedLog.h"
#include "support/FakeOpenGL.h"
#include "support/ScriptedAdapters.h"

namespace {

using namespace assay_test;
using pmutil::ContextsByDeviceString;
using pmutil::DXGIData;
using pmutil::GPUImpl;
using pmutil::GPUImplWin;
using pmutil::GPUImplWins;
using pmutil::WMIData;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::IsSupersetOf;
using testing::Not;
using testing::StartsWith;

constexpr std::uint64_t kMB = 1048576;
constexpr std::uint32_t kAMDQuery = 0x87FC;
constexpr std::uint32_t kNVIDIAQuery = 0x9047;
constexpr char kNothingMatches[] =
    "successful context creation but no matching WMI or DXGI devices found";

QGF::OGL::DisplayDeviceKey Key(int index, const std::string& deviceString)
{
    return {"fake" + std::to_string(index), deviceString, "place" + std::to_string(index)};
}

DXGIData MakeDXGI(std::u16string_view description, std::uint32_t vendorID, std::uint32_t deviceID)
{
    return DXGIData(MakeAdapter(description, vendorID, deviceID).descriptor);
}

WMIData MakeWMI(const std::string& name, const std::string& version)
{
    WMIData data;
    data.fName = name;
    data.fDriverVersion = version;
    return data;
}

class GPUImplWinTest : public testing::Test {
protected:
    // Makes display devices with these device strings.
    void SetDevices(const std::vector<std::string>& deviceStrings)
    {
        fGL.devices.clear();
        for (std::size_t i = 0; i < deviceStrings.size(); ++i) {
            const int index = static_cast<int>(i);
            fGL.devices.emplace_back(index);
            fGL.devices.back().key = Key(index, deviceStrings[i]);
        }
        fGL.reset();
    }

    void SetAdapters(const std::vector<std::u16string>& names)
    {
        std::uint32_t id = 1;
        for (const std::u16string& name : names) {
            fScript.adapters.push_back(MakeAdapter(name, 0x100 + id, 0x200 + id));
            ++id;
        }
    }

    void SetRows(const std::vector<std::u16string>& names)
    {
        for (const std::u16string& name : names)
            fScript.rows.push_back(MakeRow(name));
    }

    GPUImpl::GLGPUs GetGPUs()
    {
        testing::internal::CaptureStderr();
        GPUImplWin factory;
        GPUImpl::GLGPUs gpus = factory.GetGPUs();
        fStandardError = testing::internal::GetCapturedStderr();
        return gpus;
    }

    ContextsByDeviceString CreateContexts()
    {
        testing::internal::CaptureStderr();
        ContextsByDeviceString contexts = GPUImplWin::CreateContexts();
        fStandardError = testing::internal::GetCapturedStderr();
        return contexts;
    }

    CapturedLog fLog{pmutil::gGPUAssay};
    ScriptedAdapters fScript;
    FakeOpenGL fGL{0};
    std::string fStandardError;
};

const GPUImplWin& ImplOf(const pmutil::GLGPU& gpu)
{
    return dynamic_cast<const GPUImplWin&>(*gpu.impl);
}

// Contexts.

TEST_F(GPUImplWinTest, ContextsAreMadeInOrderWithALineBeforeEachRiskyCall)
{
    SetDevices({"B", "A"});
    std::vector<std::string> linesAtCreation;
    fGL.devices[1].onCreate = [&] { linesAtCreation = fLog.Lines(); };
    const ContextsByDeviceString contexts = CreateContexts();
    ASSERT_EQ(contexts.size(), 2U);
    EXPECT_EQ(contexts.begin()->first, "A");
    EXPECT_EQ(contexts.begin()->second.second.deviceName(), "fake1");
    EXPECT_EQ(contexts.rbegin()->first, "B");
    EXPECT_NE(contexts.begin()->second.first, nullptr);
    EXPECT_THAT(
        fLog.Lines(),
        ElementsAre(
            "qgfNumDevices=2", "qgfDeviceIndex=0",
            "creating ContextOffscreen for { DeviceName=fake0 DeviceString=B DisplayID=place0}",
            "qgfDevice[0]={ DeviceName=fake0 DeviceString=B DisplayID=place0}", "qgfDeviceIndex=1",
            "creating ContextOffscreen for { DeviceName=fake1 DeviceString=A DisplayID=place1}",
            "qgfDevice[1]={ DeviceName=fake1 DeviceString=A DisplayID=place1}"));
    ASSERT_FALSE(linesAtCreation.empty());
    EXPECT_EQ(linesAtCreation.back(),
              "creating ContextOffscreen for { DeviceName=fake1 DeviceString=A DisplayID=place1}");
    EXPECT_EQ(fStandardError, "");
}

TEST_F(GPUImplWinTest, OfDevicesWithOneDeviceStringTheLastOneIsKept)
{
    SetDevices({"Card", "Card"});
    const ContextsByDeviceString contexts = CreateContexts();
    ASSERT_EQ(contexts.size(), 1U);
    EXPECT_EQ(contexts.begin()->second.second.deviceName(), "fake1");
    EXPECT_EQ(fGL.devices[0].contexts, 0);
    EXPECT_EQ(fGL.devices[1].contexts, 1);
    EXPECT_THAT(fGL.callsOf("create"), ElementsAre("create fake0", "create fake1"));
    EXPECT_THAT(fGL.callsOf("destroy"), ElementsAre("destroy fake0"));
}

TEST_F(GPUImplWinTest, AnIndexWithoutADeviceIsSkippedWithoutALine)
{
    SetDevices({"A", "B", "C"});
    fGL.devices[1].key = QGF::OGL::DisplayDeviceKey("", "B", "");
    fGL.reset();
    EXPECT_EQ(CreateContexts().size(), 2U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("qgfNumDevices=3", "qgfDeviceIndex=0",
                            StartsWith("creating ContextOffscreen for "),
                            StartsWith("qgfDevice[0]="), "qgfDeviceIndex=1", "qgfDeviceIndex=2",
                            StartsWith("creating ContextOffscreen for "),
                            StartsWith("qgfDevice[2]=")));
    EXPECT_EQ(fStandardError, "");
}

TEST_F(GPUImplWinTest, ContextCreationThrowingOnSecondOfThree)
{
    SetDevices({"A", "B", "C"});
    fGL.devices[1].onCreate = [] { throw QGF::LogicalException("no"); };
    const ContextsByDeviceString contexts = CreateContexts();
    EXPECT_EQ(contexts.size(), 2U);
    EXPECT_EQ(contexts.count("A"), 1U);
    EXPECT_EQ(contexts.count("C"), 1U);
    EXPECT_THAT(fLog.Lines(), Contains("ContextOffscreen exception caught and ignored.").Times(1));
    EXPECT_THAT(fLog.Lines(), Not(Contains(StartsWith("qgfDevice[1]="))));
    EXPECT_EQ(fStandardError, "ContextOffscreen exception caught and ignored.\n");
}

TEST_F(GPUImplWinTest, AnyExceptionOfContextCreationIsCaught)
{
    SetDevices({"A", "B"});
    fGL.devices[0].onCreate = [] { throw 7; };
    EXPECT_EQ(CreateContexts().size(), 1U);
    EXPECT_EQ(fStandardError, "ContextOffscreen exception caught and ignored.\n");
}

TEST_F(GPUImplWinTest, FailuresGoToStandardErrorWithLoggingOff)
{
    fLog.SetOn(false);
    SetDevices({"A"});
    fGL.devices[0].onCreate = [] { throw std::bad_alloc(); };
    EXPECT_THAT(CreateContexts(), IsEmpty());
    EXPECT_EQ(fStandardError, "ContextOffscreen exception caught and ignored.\n");
    EXPECT_EQ(fLog.Text(), "");
}

TEST_F(GPUImplWinTest, NoDisplayDevicesGiveNoContexts)
{
    EXPECT_THAT(CreateContexts(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), ElementsAre("qgfNumDevices=0"));
}

// The look-up by name.

TEST_F(GPUImplWinTest, TheFirstWithTheExactNameIsFound)
{
    GPUImplWins impls;
    for (const char16_t* const name : {u"Card", u"card", u"Card 2", u"Card"}) {
        impls.push_back(boost::make_shared<GPUImplWin>());
        impls.back()->fDXGI = MakeDXGI(name, 0, 0);
    }
    const auto find = [&](const std::string& name) {
        return pmutil::FindImplByName(impls.begin(), impls.end(), name) - impls.begin();
    };
    EXPECT_EQ(find("Card"), 0);
    EXPECT_EQ(find("card"), 1);
    EXPECT_EQ(find("Card 2"), 2);
    EXPECT_EQ(find("Car"), 4);
    EXPECT_EQ(find(""), 4);
    EXPECT_EQ(pmutil::FindImplByName(impls.end(), impls.end(), "Card"), impls.end());
}

// The join, on data only.

class JoinTest : public GPUImplWinTest {
protected:
    ContextsByDeviceString Contexts(const std::vector<std::string>& deviceStrings)
    {
        SetDevices(deviceStrings);
        ContextsByDeviceString contexts = CreateContexts();
        fSkipped = fLog.Lines().size();
        return contexts;
    }

    // The log lines of the join.
    std::vector<std::string> Lines() const
    {
        std::vector<std::string> lines = fLog.Lines();
        lines.erase(lines.begin(), lines.begin() + static_cast<std::ptrdiff_t>(fSkipped));
        return lines;
    }

private:
    std::size_t fSkipped = 0;
};

TEST_F(JoinTest, ADXGIRecordAndAWMIRowOfOneNameMakeOneObject)
{
    const auto contexts = Contexts({"Card"});
    const auto impls =
        pmutil::JoinDevices(contexts, {MakeDXGI(u"Card", 1, 2)}, {MakeWMI("Card", "9.8")});
    ASSERT_EQ(impls.size(), 1U);
    EXPECT_EQ(impls[0]->GetGLName(), "Card");
    EXPECT_EQ(impls[0]->GetGLVendorID(), 1U);
    EXPECT_EQ(impls[0]->GetGLRendererID(), 2U);
    EXPECT_EQ(impls[0]->GetGLDriverVersion(), "9.8");
    EXPECT_EQ(impls[0]->context, contexts.at("Card").first);
    EXPECT_THAT(Lines(), IsEmpty());
}

TEST_F(JoinTest, TwoWMIRowsOfOneNameMakeTwoObjectsOnOneContext)
{
    const auto contexts = Contexts({"Card"});
    const auto impls =
        pmutil::JoinDevices(contexts, {}, {MakeWMI("Card", "1"), MakeWMI("Card", "2")});
    ASSERT_EQ(impls.size(), 2U);
    EXPECT_EQ(impls[0]->GetGLDriverVersion(), "1");
    EXPECT_EQ(impls[1]->GetGLDriverVersion(), "2");
    EXPECT_EQ(impls[0]->context, impls[1]->context);
}

TEST_F(JoinTest, OfTwoWMIRowsOfOneNameTheLaterJoinsTheDXGIRecord)
{
    const auto contexts = Contexts({"Card"});
    WMIData first = MakeWMI("Card", "1");
    first.fAdapterRAM = 5;
    const auto impls =
        pmutil::JoinDevices(contexts, {MakeDXGI(u"Card", 1, 2)}, {first, MakeWMI("Card", "2")});
    ASSERT_EQ(impls.size(), 1U);
    EXPECT_EQ(impls[0]->GetGLDriverVersion(), "2");
    EXPECT_EQ(impls[0]->fWMI.fAdapterRAM, 0U); // all nine fields come from the later one
    EXPECT_EQ(impls[0]->fWMI.fName, "Card");
}

TEST_F(JoinTest, OfTwoDXGIRecordsOfOneNameTheLaterIsKept)
{
    const auto contexts = Contexts({"Card"});
    const auto impls =
        pmutil::JoinDevices(contexts, {MakeDXGI(u"Card", 1, 10), MakeDXGI(u"Card", 2, 20)}, {});
    ASSERT_EQ(impls.size(), 1U);
    EXPECT_EQ(impls[0]->GetGLVendorID(), 2U);
    EXPECT_EQ(impls[0]->GetGLRendererID(), 20U);
}

TEST_F(JoinTest, TheOrderIsDXGIThenWMIOnlyDevices)
{
    const auto contexts = Contexts({"A", "B", "C", "D"});
    const auto impls =
        pmutil::JoinDevices(contexts, {MakeDXGI(u"C", 3, 0), MakeDXGI(u"A", 1, 0)},
                            {MakeWMI("D", "d"), MakeWMI("A", "a"), MakeWMI("B", "b")});
    ASSERT_EQ(impls.size(), 4U);
    EXPECT_EQ(impls[0]->context, contexts.at("C").first);
    EXPECT_EQ(impls[1]->context, contexts.at("A").first);
    EXPECT_EQ(impls[1]->GetGLDriverVersion(), "a");
    EXPECT_EQ(impls[2]->context, contexts.at("D").first);
    EXPECT_EQ(impls[3]->context, contexts.at("B").first);
}

TEST_F(JoinTest, RecordsWithoutAContextAreLoggedAndDropped)
{
    const auto contexts = Contexts({"Card"});
    EXPECT_THAT(
        pmutil::JoinDevices(contexts, {MakeDXGI(u"Other", 1, 2)}, {MakeWMI("Another", "1")}),
        IsEmpty());
    EXPECT_THAT(Lines(), ElementsAre("QGF Device for DXGI Other not found",
                                     "QGF Device for WMI Another not found"));
}

TEST_F(JoinTest, CaseBlanksAndPrefixesDoNotMatch)
{
    const auto contexts = Contexts({"My Card"});
    EXPECT_THAT(pmutil::JoinDevices(contexts,
                                    {MakeDXGI(u"my card", 1, 2), MakeDXGI(u"My Card ", 1, 2),
                                     MakeDXGI(u"My", 1, 2)},
                                    {MakeWMI("MY CARD", "1"), MakeWMI(" My Card", "1")}),
                IsEmpty());
    EXPECT_EQ(Lines().size(), 5U);
}

TEST_F(JoinTest, AQuoteMatchesOnTheWMISideOnly)
{
    const auto contexts = Contexts({"A \"B\""});
    const auto impls =
        pmutil::JoinDevices(contexts, {MakeDXGI(u"A \"B\"", 1, 2)}, {MakeWMI("A \"B\"", "1")});
    ASSERT_EQ(impls.size(), 1U);
    EXPECT_EQ(impls[0]->GetGLName(), "");
    EXPECT_EQ(impls[0]->GetGLDriverVersion(), "1");
    EXPECT_THAT(Lines(), ElementsAre("QGF Device for DXGI A \\\"B\\\" not found"));
}

// GetGPUs.

TEST_F(GPUImplWinTest, ADeviceInAllSourcesIsComplete)
{
    SetDevices({"Card"});
    SetAdapters({u"Card"});
    SetRows({u"Card"});
    const auto gpus = GetGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(gpus[0]->GetName(), "Card");
    EXPECT_EQ(gpus[0]->GetVendorID(), 0x101U);
    EXPECT_EQ(gpus[0]->GetDriverVersion(), "1.2.3");
    EXPECT_EQ(gpus[0]->impl->GetGLRendererID(), 0x201U);
    EXPECT_EQ(gpus[0]->impl->GetGLDriver(), "drivers.dll");
    EXPECT_EQ(gpus[0]->impl->GetGLDriverDate(), "20240102000000.000000-000");
    EXPECT_EQ(gpus[0]->impl->GetGLDriverExtra(), "Caption of Card");
    EXPECT_EQ(gpus[0]->GetVendor(), "Fake Vendor");
    EXPECT_FALSE(gpus[0]->IsIntegrated());
    EXPECT_THAT(fLog.Lines(),
                IsSupersetOf({"wmiNumDevices=1", "dxgiNumDevices=1", "qgfNumContexts=1"}));
    EXPECT_THAT(fLog.Lines(), Not(Contains(kNothingMatches)));
    EXPECT_EQ(fStandardError, "");
}

TEST_F(GPUImplWinTest, TheSystemsListsAreReadBeforeAnyContextExists)
{
    SetDevices({"Card"});
    SetAdapters({u"Card"});
    SetRows({u"Card"});
    std::vector<std::string> callsAtCreation;
    fGL.devices[0].onCreate = [&] { callsAtCreation = fScript.calls; };
    GetGPUs();
    EXPECT_EQ(callsAtCreation, fScript.calls);
    EXPECT_EQ(fScript.CountCalls("~factory"), 2U);
    std::vector<std::string> counts;
    for (const std::string& line : fLog.Lines())
        if (line.find("Num") != std::string::npos)
            counts.push_back(line.substr(0, line.find('=')));
    EXPECT_THAT(counts,
                ElementsAre("wmiNumDevices", "dxgiNumDevices", "qgfNumDevices", "qgfNumContexts"));
    EXPECT_EQ(fScript.calls[1], "Initialize"); // WMI's turn comes before DXGI's
}

TEST_F(GPUImplWinTest, WithoutDisplayDevicesTheListIsEmpty)
{
    SetAdapters({u"One"});
    SetRows({u"One", u"Two"});
    EXPECT_THAT(GetGPUs(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), IsSupersetOf({"QGF Device for DXGI One not found",
                                            "QGF Device for WMI One not found",
                                            "QGF Device for WMI Two not found"}));
    EXPECT_THAT(fLog.Lines(), Not(Contains(kNothingMatches)));
}

TEST_F(GPUImplWinTest, AContextWithoutAMatchIsTheLastResort)
{
    SetDevices({"Software"});
    SetAdapters({u"Card"});
    SetRows({u"Card"});
    const auto gpus = GetGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(gpus[0]->GetName(), "");
    EXPECT_EQ(gpus[0]->GetVendorID(), 0U);
    EXPECT_EQ(gpus[0]->impl->GetGLRendererID(), 0U);
    EXPECT_EQ(gpus[0]->GetDriverVersion(), "?");
    EXPECT_EQ(gpus[0]->impl->GetGLDriver(), "?");
    EXPECT_EQ(gpus[0]->impl->GetGLDriverDate(), "?");
    EXPECT_EQ(gpus[0]->impl->GetGLDriverExtra(), "?");
    EXPECT_EQ(gpus[0]->GetMemoryMB(), 0U);
    EXPECT_FALSE(gpus[0]->IsIntegrated());
    EXPECT_EQ(gpus[0]->GetVendor(), "Fake Vendor");
    EXPECT_THAT(fLog.Lines(), Contains(kNothingMatches).Times(1));
    EXPECT_EQ(fStandardError, "");
}

TEST_F(GPUImplWinTest, OfTwoContextsWithoutAMatchTheSmallerDeviceStringIsUsed)
{
    SetDevices({"b", "B", "BB"}); // byte order: capitals first, the shorter first
    const auto gpus = GetGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(gpus[0]->impl->GetGLRenderer(), "Fake Renderer 1");
    EXPECT_THAT(fGL.callsOf("destroy").size(), 2U); // the others died with the map
    EXPECT_EQ(fGL.devices[1].contexts, 1);
}

TEST_F(GPUImplWinTest, AWMIRowOnlyGivesDriverStringsAndNoName)
{
    SetDevices({"Card"});
    SetRows({u"Card"});
    fScript.adapters = {MakeAdapter(u"Card", 0x10DE, 0x20)};
    fScript.adapters[0].outputs.clear(); // no display: WMI uses its ids, DXGI drops it
    const auto gpus = GetGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(gpus[0]->GetName(), "");
    EXPECT_EQ(gpus[0]->GetVendorID(), 0U);
    EXPECT_EQ(gpus[0]->impl->GetGLRendererID(), 0U);
    EXPECT_EQ(gpus[0]->GetDriverVersion(), "1.2.3");
    EXPECT_EQ(ImplOf(*gpus[0]).fWMI.GetVendorID(), 0x10DEU);
}

TEST_F(GPUImplWinTest, ADXGIRecordOnlyGivesQuestionMarksForTheDriver)
{
    SetDevices({"Card"});
    SetAdapters({u"Card"});
    const auto gpus = GetGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(gpus[0]->GetName(), "Card");
    EXPECT_EQ(gpus[0]->GetDriverVersion(), "?");
    EXPECT_EQ(gpus[0]->impl->GetGLDriver(), "?");
    EXPECT_EQ(gpus[0]->impl->GetGLDriverDate(), "?");
}

TEST_F(GPUImplWinTest, NonASCIINamesDoNotMatchARawDeviceString)
{
    SetDevices({"Card\xC2\xAE"});
    SetAdapters({u"Card\u00AE"});
    SetRows({u"Card\u00AE"});
    const auto gpus = GetGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(gpus[0]->GetName(), "");
    EXPECT_EQ(gpus[0]->GetDriverVersion(), "?");
    EXPECT_THAT(fLog.Lines(), IsSupersetOf({"QGF Device for DXGI Card\\x00ae not found",
                                            "QGF Device for WMI Card\\x00ae not found",
                                            static_cast<const char*>(kNothingMatches)}));
}

TEST_F(GPUImplWinTest, AContextLivesAsLongAsItsDevice)
{
    SetDevices({"A", "B"});
    SetAdapters({u"A"});
    auto gpus = GetGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(fGL.devices[0].contexts, 1);
    EXPECT_EQ(fGL.devices[1].contexts, 0);
    gpus.clear();
    EXPECT_EQ(fGL.devices[0].contexts, 0);
}

TEST_F(GPUImplWinTest, FailedListsFallBackToTheLastResort)
{
    SetDevices({"Card"});
    SetAdapters({u"Card"});
    SetRows({u"Card"});
    fScript.results["CreateFactory"] = kFail;
    EXPECT_EQ(GetGPUs().size(), 1U);
    EXPECT_EQ(fStandardError, "CreateDXGIFactory\nCreateGXGIFactory failed\n");
    EXPECT_THAT(fLog.Lines(),
                IsSupersetOf({"WMIData::GetAllDevices() exception: CreateDXGIFactory",
                              "DXGIData::GetAllDevices() exception: CreateGXGIFactory failed",
                              "wmiNumDevices=0", "dxgiNumDevices=0",
                              static_cast<const char*>(kNothingMatches)}));
}

TEST_F(GPUImplWinTest, AnExceptionOfTheEnumerationIsReportedAndLeavesAnEmptyList)
{
    SetAdapters({u"Card"});
    fGL.onDisplayDevices = [] { throw 3; };
    EXPECT_THAT(GetGPUs(), IsEmpty());
    EXPECT_EQ(fStandardError, "DoGetGPUs fails with exception\n");
    EXPECT_EQ(fLog.Lines().back(), "DoGetGPUs fails with exception");
}

TEST_F(GPUImplWinTest, AnExceptionOfTheEnumerationIsReportedWithLoggingOff)
{
    fLog.SetOn(false);
    fGL.onDisplayDevices = [] { throw std::bad_alloc(); };
    EXPECT_THAT(GetGPUs(), IsEmpty());
    EXPECT_EQ(fStandardError, "DoGetGPUs fails with exception\n");
    EXPECT_EQ(fLog.Text(), "");
}

// The result of GetGPUs if one of its allocations fails.
struct AllocationFailure {
    std::vector<std::string> names;
    std::string standardError;
    bool hasContext; // a context was made before the failure
};

class AllocationFailureTest : public GPUImplWinTest {
protected:
    AllocationFailureTest()
    {
        fLog.SetOn(false);
        // The fakes record releases in destructors, which must not fail.
        fScript.calls.reserve(1000);
        fGL.calls.reserve(1000);
    }

    std::vector<AllocationFailure> EveryAllocationFailure()
    {
        std::vector<AllocationFailure> results;
        for (std::size_t number = 0;; ++number) {
            fScript.calls.clear();
            fGL.reset();
            fGL.calls.clear();
            GPUImplWin factory;
            testing::internal::CaptureStderr();
            bool hasFailed = false;
            GPUImpl::GLGPUs gpus;
            {
                const FailingAllocation failing(number);
                gpus = factory.GetGPUs();
                hasFailed = failing.HasFailed();
            }
            AllocationFailure result{
                {}, testing::internal::GetCapturedStderr(), !fGL.callsOf("create").empty()};
            if (!hasFailed)
                return results;
            for (const auto& gpu : gpus)
                result.names.push_back(gpu->GetName());
            results.push_back(result);
        }
    }
};

TEST_F(AllocationFailureTest, AFailureKeepsTheDevicesListedBefore)
{
    SetDevices({"A", "B"});
    SetAdapters({u"A", u"B"});
    std::size_t kept = 0;
    for (const AllocationFailure& result : EveryAllocationFailure()) {
        if (result.standardError != "DoGetGPUs fails with exception\n" || !result.hasContext)
            continue;
        ASSERT_EQ(result.names.size(), 1U);
        kept += result.names[0] == "A" ? 1U : 0U;
    }
    EXPECT_GT(kept, 0U);
}

TEST_F(AllocationFailureTest, AFailureOfTheLastResortIsSilent)
{
    SetDevices({"Software"});
    std::size_t silent = 0;
    for (const AllocationFailure& result : EveryAllocationFailure())
        silent +=
            result.hasContext && result.names.empty() && result.standardError.empty() ? 1U : 0U;
    EXPECT_GT(silent, 0U);
}

TEST_F(GPUImplWinTest, AMachineWithoutOpenGLHasNoDevices)
{
    fGL.onDisplayDevices = [] { throw QGF::LogicalException("no binding"); };
    EXPECT_THAT(GetGPUs(), IsEmpty());
    EXPECT_THAT(fLog.Lines(), Contains("qgfNumDevices=0"));
    EXPECT_EQ(fStandardError, "");
}

TEST_F(GPUImplWinTest, ClassificationIsThatOfDXGI)
{
    GPUImplWin impl;
    EXPECT_FALSE(impl.IsIntegratedGLGPU());
    impl.fDXGI.fAdapterDesc.VendorId = pmutil::kVendorIntel;
    EXPECT_TRUE(impl.IsIntegratedGLGPU());
}

// Memory.

class GLMemoryTest : public GPUImplWinTest {
protected:
    GLMemoryTest()
    {
        SetDevices({"Card"});
        fImpl.context = boost::make_shared<QGF::OGL::ContextOffscreen>(fGL.devices[0].key);
    }

    // Sets the DXGI record to a discrete card of that vendor.
    void SetDXGI(std::uint32_t vendorID, std::uint64_t megabytes)
    {
        fImpl.fDXGI.fAdapterDesc.VendorId = vendorID;
        fImpl.fDXGI.fAdapterDesc.DedicatedVideoMemory = megabytes * kMB;
    }

    std::uint32_t GetMemoryMB()
    {
        testing::internal::CaptureStderr();
        const std::uint32_t megabytes = fImpl.GetGLMemoryMB();
        fStandardError = testing::internal::GetCapturedStderr();
        return megabytes;
    }

    GPUImplWin fImpl;
};

TEST_F(GLMemoryTest, TheAMDQueryRaisesTheWMIFigure)
{
    SetDXGI(pmutil::kVendorAMD, 1024);
    fImpl.fWMI.fAdapterRAM = static_cast<std::uint32_t>(4095 * kMB);
    fGL.devices[0].integers[kAMDQuery] = {8388608, 1, 2, 3};
    EXPECT_EQ(GetMemoryMB(), 8192U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("DXGI RAM=1073741824=1024MB", "wmiVRAM=8192 dxgiVRAM=1024"));
}

TEST_F(GLMemoryTest, TheNVIDIAQueryRaisesTheWMIFigure)
{
    SetDXGI(pmutil::kVendorNVIDIA, 0);
    fGL.devices[0].integers[kNVIDIAQuery] = {81920 * 1024};
    EXPECT_EQ(GetMemoryMB(), 81920U);
    EXPECT_THAT(fGL.callsOf("glGetIntegerv"), ElementsAre("glGetIntegerv(0x9047)"));
    EXPECT_EQ(fLog.Lines().back(), "wmiVRAM=81920 dxgiVRAM=0");
}

TEST_F(GLMemoryTest, AQueryBelowTheWMIFigureChangesNothing)
{
    SetDXGI(pmutil::kVendorAMD, 0);
    fImpl.fWMI.fAdapterRAM = static_cast<std::uint32_t>(4095 * kMB);
    fGL.devices[0].integers[kAMDQuery] = {1024, 0, 0, 0};
    EXPECT_EQ(GetMemoryMB(), 4095U);
}

TEST_F(GLMemoryTest, TheVendorIsThatOfDXGI)
{
    SetDXGI(pmutil::kVendorIntel, 200);
    fImpl.fWMI.fVendorID = pmutil::kVendorNVIDIA;
    EXPECT_EQ(GetMemoryMB(), 200U);
    EXPECT_THAT(fGL.callsOf("gl"), IsEmpty());
    SetDXGI(pmutil::kVendorNVIDIA, 0);
    fImpl.fWMI.fVendorID = pmutil::kVendorAMD;
    fGL.devices[0].integers[kNVIDIAQuery] = {1024 * 1024};
    EXPECT_EQ(GetMemoryMB(), 1024U);
    EXPECT_THAT(fGL.callsOf("glGetIntegerv"), ElementsAre("glGetIntegerv(0x9047)"));
}

// Records the block that is passed to a query and overwrites all of it.
class RecordingImpl : public GPUImplWin {
public:
    std::array<std::int32_t, 4> block{};

private:
    void DoGLGetIntegerv(std::uint32_t /*name*/, std::int32_t* result) override
    {
        std::copy_n(result, block.size(), block.begin());
        std::fill_n(result, block.size(), 2048);
    }
};

// Fills the stack below with non-zero bytes, where the next call has its variables.
__attribute__((noinline)) void DirtyStack()
{
    volatile unsigned char block[8192];
    for (volatile unsigned char& byte : block)
        byte = 0xA5;
}

TEST_F(GLMemoryTest, AVendorsQueryFillsABlockOfFourZeroes)
{
    for (const std::uint32_t vendorID : {pmutil::kVendorAMD, pmutil::kVendorNVIDIA}) {
        RecordingImpl impl;
        impl.block.fill(-1);
        impl.fDXGI.fAdapterDesc.VendorId = vendorID;
        DirtyStack();
        EXPECT_EQ(impl.GetGLMemoryMB(), 2U);
        EXPECT_THAT(impl.block, ElementsAre(0, 0, 0, 0));
    }
}

TEST_F(GLMemoryTest, TheLargerFigureIsReturned)
{
    SetDXGI(0x1234, 3000);
    fImpl.fWMI.fAdapterRAM = static_cast<std::uint32_t>(2000 * kMB);
    EXPECT_EQ(GetMemoryMB(), 3000U);
    EXPECT_EQ(fLog.Lines().back(), "wmiVRAM=2000 dxgiVRAM=3000");
}

TEST_F(GLMemoryTest, OtherVendorsAreNotQueried)
{
    for (const std::uint32_t vendorID : {pmutil::kVendorIntel, 0U, 0x1AF4U}) {
        SetDXGI(vendorID, 200);
        EXPECT_EQ(GetMemoryMB(), 200U);
    }
    EXPECT_THAT(fGL.callsOf("gl"), IsEmpty());
}

TEST_F(GLMemoryTest, AnAMDQueryThatThrowsLeavesTheWMIFigureAndOneLine)
{
    SetDXGI(pmutil::kVendorAMD, 0);
    fImpl.fWMI.fAdapterRAM = static_cast<std::uint32_t>(512 * kMB);
    EXPECT_EQ(GetMemoryMB(), 512U);
    EXPECT_THAT(fLog.Lines(),
                ElementsAre("GPUImplHardware::DoGLGetIntegerv(34812): glGetError() returns 1280",
                            "GPUImplWin::DoGetGLMemoryMB: vendorID=kVendorAMD, GLGetIntegerv "
                            "failure",
                            "DXGI RAM=0=0MB", "wmiVRAM=512 dxgiVRAM=0"));
    EXPECT_EQ(fStandardError, "Failed requirement: glStatus == GL_NO_ERROR\n");
}

TEST_F(GLMemoryTest, AnNVIDIAQueryThatThrowsAnythingLeavesTheWMIFigureAndOneLine)
{
    SetDXGI(pmutil::kVendorNVIDIA, 0);
    fImpl.fWMI.fAdapterRAM = static_cast<std::uint32_t>(512 * kMB);
    fGL.devices[0].onCall["glGetIntegerv"] = [] { throw 'x'; };
    EXPECT_EQ(GetMemoryMB(), 512U);
    EXPECT_THAT(fLog.Lines(), ElementsAre("GPUImplWin::DoGetGLMemoryMB: vendorID=kVendorNVIDIA, "
                                          "GLGetIntegerv failure",
                                          "DXGI RAM=0=0MB", "wmiVRAM=512 dxgiVRAM=0"));
}

TEST_F(GLMemoryTest, ANegativeValueIsSignExtendedAndComparedUnsigned)
{
    SetDXGI(pmutil::kVendorNVIDIA, 100);
    fGL.devices[0].integers[kNVIDIAQuery] = {-1};
    EXPECT_EQ(GetMemoryMB(), 0xFFFFFFFFU);
    EXPECT_EQ(fLog.Lines().back(), "wmiVRAM=4294967295 dxgiVRAM=100");
}

TEST_F(GLMemoryTest, UnknownPhysicalMemoryThrows)
{
    SetDXGI(pmutil::kVendorIntel, 64);
    fImpl.fDXGI.fAdapterDesc.SharedSystemMemory = 1024 * kMB;
    fScript.knowsPhysicalMemory = false;
    testing::internal::CaptureStderr();
    try {
        fImpl.GetGLMemoryMB();
        ADD_FAILURE() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "GlobalMemoryStatusEx failed");
    }
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST_F(GLMemoryTest, ADeviceWithoutRecordsReportsTheWMIFigure)
{
    EXPECT_EQ(GetMemoryMB(), 0U);
    fImpl.fWMI.fAdapterRAM = static_cast<std::uint32_t>(256 * kMB);
    EXPECT_EQ(GetMemoryMB(), 256U);
}

} // namespace
