#include "bugreport/Mask.h"

#include <string>

#include <gtest/gtest.h>

#include "Lines.h"

namespace assay_host {
namespace {

const Mask& GetMask()
{
    static const Mask mask({{"alice", "USER"},
                            {"BOX", "HOST"},
                            {"box.example.com", "HOST"},
                            {"/home/alice/", "HOME"},
                            {"C:\\Users\\Alice", "HOME"},
                            {"Alice de Souza", "USER"},
                            {"root", "USER"},
                            {"localhost", "HOST"},
                            {"/", "HOME"},
                            {"", "USER"}});
    return mask;
}

TEST(Mask, HidesNamesAndPaths)
{
    EXPECT_EQ(GetMask().Apply("alice"), "USER");
    EXPECT_EQ(GetMask().Apply("card of Alice, on box."), "card of USER, on HOST.");
    EXPECT_EQ(GetMask().Apply("box.example.com"), "HOST");
    EXPECT_EQ(GetMask().Apply("box.other.com"), "HOST.other.com");
    EXPECT_EQ(GetMask().Apply("/home/alice/x:/home/alice"), "HOME/x:HOME");
    EXPECT_EQ(GetMask().Apply("c:/users/ALICE\\driver.dll"), "HOME\\driver.dll");
    EXPECT_EQ(GetMask().Apply("by alice de souza"), "by USER");
    EXPECT_EQ(GetMask().Apply("x=alice\nalice\t\"alice\""), "x=USER\nUSER\t\"USER\"");
    EXPECT_EQ(GetMask().Apply("alice-box"), "USER-HOST");
}

TEST(Mask, KeepsLongerWords)
{
    for (const char* const text :
         {"malice", "alice2", "_alice", "boxes", "sandbox", "Virtual_Box", "/home/alicette", ""})
        EXPECT_EQ(GetMask().Apply(text), text);
}

TEST(Mask, KeepsWhatNamesNobody)
{
    EXPECT_EQ(GetMask().Apply("root@localhost:/usr/lib"), "root@localhost:/usr/lib");
    EXPECT_EQ(Mask({}).Apply("alice"), "alice");
}

Mask MakeMask(const std::string& name)
{
    return Mask(std::vector<Secret>{{name, "USER"}});
}

bool IsLetter(char character)
{
    return std::string("abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ").find(character) !=
           std::string::npos;
}

bool IsOfAWord(char character)
{
    return IsLetter(character) || std::string("0123456789_").find(character) != std::string::npos;
}

TEST(Mask, AnyByteBesideAName)
{
    const Mask mask = MakeMask("bob");
    for (int code = 0; code < 256; ++code) {
        const char byte = static_cast<char>(code);
        const std::string before = byte + std::string("bob");
        const std::string after = std::string("bob") + byte;
        EXPECT_EQ(mask.Apply(before), IsOfAWord(byte) ? before : byte + std::string("USER"))
            << code;
        EXPECT_EQ(mask.Apply(after), IsOfAWord(byte) ? after : std::string("USER") + byte) << code;
    }
}

// Letters match in both cases, the slashes match each other, all other bytes only themselves.
TEST(Mask, AnyByteOfAName)
{
    for (int hidden = 0; hidden < 256; ++hidden) {
        const char byte = static_cast<char>(hidden);
        const Mask mask = MakeMask(std::string("x") + byte + "x");
        for (int shown = 0; shown < 256; ++shown) {
            const char other = static_cast<char>(shown);
            const std::string text = std::string("X") + other + "X";
            const auto isSlash = [](char character) {
                return character == '/' || character == '\\';
            };
            const bool isSame = hidden == shown || (isSlash(byte) && isSlash(other)) ||
                                (IsLetter(byte) && IsLetter(other) && (hidden ^ shown) == 32);
            EXPECT_EQ(mask.Apply(text), isSame ? "USER" : text) << hidden << " " << shown;
        }
    }
}

TEST(Mask, SecretsWithOtherCharactersAtTheirEnds)
{
    const Mask mask({{"/home/a", "HOME"}, {"Ann.", "USER"}});
    EXPECT_EQ(mask.Apply("x/home/a"), "xHOME");
    EXPECT_EQ(mask.Apply("/home/ab"), "/home/ab");
    EXPECT_EQ(mask.Apply("Ann.x"), "USERx");
    EXPECT_EQ(mask.Apply("xAnn."), "xAnn.");
}

TEST(Mask, TheTextEndsWhereItEnds)
{
    const std::string text = "malices";
    EXPECT_EQ(GetMask().Apply(std::string_view(text).substr(1, 5)), "USER");
    EXPECT_EQ(GetMask().Apply(std::string_view(text).substr(1, 4)), "alic");
}

TEST(Mask, OfEqualSecretsTheFirstIsShown)
{
    EXPECT_EQ(Mask({{"bob", "USER"}, {"BOB", "HOST"}, {"bob", "HOME"}}).Apply("bob"), "USER");
}

TEST(Mask, SlashesAreTrimmedFromTheEnd)
{
    const Mask mask({{"/srv/bob//", "HOME"}, {"D:\\bob\\", "USER"}, {"\\/", "HOST"}});
    EXPECT_EQ(mask.Apply("/srv/bob/x"), "HOME/x");
    EXPECT_EQ(mask.Apply("d:\\bob\\x"), "USER\\x");
    EXPECT_EQ(mask.Apply("\\/ / \\"), "\\/ / \\");
}

TEST(Mask, TheRootsNameAndThisMachinesUsualNameAreNoSecrets)
{
    for (const char* const name : {"", "/", "\\", "root", "Root", "localhost", "LOCALHOST"})
        EXPECT_EQ(MakeMask(name).Apply("root localhost / \\"), "root localhost / \\") << name;
    for (const char* const name : {"roo", "rootx", "localhos", "localhost1"})
        EXPECT_EQ(MakeMask(name).Apply(name), "USER");
}

TEST(Mask, OfAReportsLines)
{
    Report report;
    report.Add({LineKind::kValue, "k=\"alice", "\r\n", true, "k", "alice", true});
    report.Add({LineKind::kValue, "alice=box", "\n", false, "alice", "box", false});
    report.Add({LineKind::kComment, "# alice", "\r\n", true, {}, {}, false});
    report.Add({LineKind::kRaw, "a=alice", "", true, {}, {}, false});
    GetMask().ApplyTo(report);
    const std::vector<ReportLine> wanted = {
        {LineKind::kValue, "k=\"USER", "\r\n", true, "k", "USER", true},
        {LineKind::kValue, "USER=HOST", "\n", false, "USER", "HOST", false},
        {LineKind::kComment, "# USER", "\r\n", true, {}, {}, false},
        {LineKind::kRaw, "a=USER", "", true, {}, {}, false},
    };
    EXPECT_EQ(report.GetLines(), wanted);
}

void ExpectMasked(const std::vector<const std::string*>& texts)
{
    for (std::size_t text = 0; text < texts.size(); ++text)
        EXPECT_EQ(*texts[text], "USER") << "text " << text;
}

TEST(Mask, OfAnOutcomesTexts)
{
    RunOutcome outcome;
    outcome.fCommand = {"alice", "alice"};
    outcome.fErrorLines = {"alice", "alice"};
    outcome.fCauses = {{"alice", "alice"}, {"key", "alice"}};
    outcome.fDrivers.fFiles.resize(2);
    outcome.fTermination = outcome.fReason = outcome.fLastReportLine = outcome.fLastLogLine =
        outcome.fDrivers.fReason = "alice";
    std::vector<const std::string*> texts = {
        &outcome.fCommand[0],      &outcome.fCommand[1],     &outcome.fErrorLines[0],
        &outcome.fErrorLines[1],   &outcome.fTermination,    &outcome.fReason,
        &outcome.fLastReportLine,  &outcome.fLastLogLine,    &outcome.fDrivers.fReason,
        &outcome.fCauses[0].fText, &outcome.fCauses[1].fText};
    for (LoadedFile& file : outcome.fDrivers.fFiles) {
        file = {DeviceKind::kOpenGL, "alice", {"alice", "alice"}, {"alice", "alice"}};
        for (const std::string* const text :
             {&file.fPath, &file.fVersion.fValue, &file.fVersion.fReason, &file.fBuildId.fValue,
              &file.fBuildId.fReason})
            texts.push_back(text);
    }
    GetMask().ApplyTo(outcome);
    ExpectMasked(texts);
    EXPECT_EQ(outcome.fCauses[0].fKey, "alice"); // keys are those of the report
}

TEST(Mask, OfAMachinesFacts)
{
    RunFacts facts;
    Environment& environment = facts.fEnvironment;
    std::vector<const std::string*> texts;
    for (Fact* const fact :
         {&facts.fChildVersion, &environment.fSystem, &environment.fBuild, &environment.fKernel,
          &environment.fArchitecture, &environment.fHost}) {
        *fact = {"alice", "alice"};
        texts.push_back(&fact->fValue);
        texts.push_back(&fact->fReason);
    }
    GetMask().ApplyTo(facts);
    ExpectMasked(texts);
}

TEST(Mask, OfAnIdentity)
{
    Identity identity;
    identity.fAdapters.assign(2, {"alice", 0, 0, "alice", "alice"});
    identity.fFiles.assign(2, {DeviceKind::kOpenGL, "alice", 0, 0, ""});
    identity.fVariables = {"alice", "alice"};
    identity.fSystem = identity.fAssayVersion = "alice";
    std::vector<const std::string*> texts = {&identity.fVariables[0], &identity.fVariables[1],
                                             &identity.fSystem, &identity.fAssayVersion};
    for (const AdapterIdentity& adapter : identity.fAdapters)
        for (const std::string* const text :
             {&adapter.fSlot, &adapter.fDriver, &adapter.fDriverVersion})
            texts.push_back(text);
    for (const DriverFile& file : identity.fFiles)
        texts.push_back(&file.fPath);
    GetMask().ApplyTo(identity);
    ExpectMasked(texts);
}

TEST(Mask, OfThisMachine)
{
    for (const Secret& secret : ListSecrets())
        EXPECT_TRUE(secret.fWord == "HOST" || secret.fWord == "USER" || secret.fWord == "HOME");
    EXPECT_FALSE(ListSecrets().empty());
}

} // namespace
} // namespace assay_host
