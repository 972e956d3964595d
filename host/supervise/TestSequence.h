// The order in which the child asks its questions, and the form of the lines that answer them: what
// docs/report-format.md says in its tables.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace assay_host {

// How a line's value can be told beforehand, given the line of another run.
enum class Match {
    kExact,
    kStamp,   // a time, between quotes
    kInteger, // a memory size: other programs come and go
    kNumber   // a measurement
};

struct Test {
    enum class Form {
        kKey,      // TAG.NAME=value
        kString,   // TAG.glGetString[NAME]="text", and no step
        kIntegers, // TAG.glGetIntegerv[NAME]=[n]
        kProgram,  // TAG.glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][NAME]=[n]
        kExtension // TAG.extension[NAME]=0 or 1
    };

    Form fForm;
    const char* fName;
    int fCode; // of the name, for its gputag line; 0 for kKey, which has none
    Match fMatch;
    bool fMayBeSilent; // takes its step without a line where the device has no value

    bool TakesStep() const { return fForm != Form::kString; }

    // What stands before the '=' for that device.
    std::string GetKey(const std::string& tag) const;

    // The gputag lines in front of the answer.
    std::vector<std::string> GetTagLines() const;

    // Whether these lines come before the driver is asked, and so even if that fails.
    bool ShowsTagsFirst() const { return fForm != Form::kKey && fForm != Form::kIntegers; }
};

const std::vector<Test>& GetGLTests();
const std::vector<Test>& GetCLTests();

// "glgpu[0]", "clgpu[1]".
std::string MakeGLTag(std::size_t index);
std::string MakeCLTag(std::size_t index);

// The keys before the OpenGL tests, each with its step. The one of the start itself has no line and
// comes before them.
struct GlobalKey {
    const char* fName;
    Match fMatch;
};

const std::vector<GlobalKey>& GetFirstKeys();

constexpr char kGLCountKey[] = "NumGLGPUs";
constexpr char kCLCountKey[] = "NumCLGPUs";
constexpr char kLastKey[] = "assayEnd";

} // namespace assay_host
