// The common parts of the scripted drivers: the lines of a script, its rules ("at ...") and the
// record of calls. tests/drivers/README.md describes the language.
//
// An error in a script is printed to standard error with file and line, and the process ends with
// status 125.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace scripted {

// A word of a script line: a bare word, or a quoted text without its escapes.
struct Word {
    std::string text;
    bool quoted = false;
};

// One line of a script.
class Line {
public:
    Line(std::string file, int number, std::vector<Word> words)
        : fFile(std::move(file)), fNumber(number), fWords(std::move(words))
    {}

    bool AtEnd() const { return fNext == fWords.size(); }
    // Reads the next word. If there is none, the script's error names `what`.
    const Word& Take(const char* what);
    // Reads the next word if it is this bare word, and returns whether it is.
    bool TakeIf(const char* bare);
    // Reads a number: decimal, hexadecimal with 0x, or a name that `names` resolves.
    using Names = std::function<std::optional<std::int64_t>(const std::string&)>;
    std::int64_t TakeNumber(const char* what, const Names& names = {});
    // Reads a text: "...", or `repeat N "..."`, or several of them joined by +. Returns nothing for
    // `null`.
    std::optional<std::string> TakeText(const char* what);
    // The line's position.
    const std::string& File() const { return fFile; }
    int Number() const { return fNumber; }
    // Ends the process with an error in this line.
    [[noreturn]] void Fail(const std::string& problem) const;

private:
    std::string fFile;
    int fNumber;
    std::vector<Word> fWords;
    std::size_t fNext = 0;
};

// Returns the lines of a file without comments and empty lines.
std::vector<Line> ReadScript(const std::string& path);

// An argument of a call: its text in the record, and the number that rules compare.
struct Argument {
    std::string text;
    std::optional<std::int64_t> number;
};

// The effect of rules on a call. Enter itself performs crashes, exits, exceptions and the like.
struct Effect {
    std::optional<std::int64_t> error;   // the call fails with this error code
    std::optional<std::int64_t> returns; // the call returns this and does nothing else
    std::optional<std::int64_t> claim;   // the number or size that the call reports
    const std::string* text = nullptr;   // the text that the call returns; never freed
};

// The kind of a call's result, as far as rules can replace it.
enum class Result { Other, Number, Text, TextAndSize };

// The rules of a script with their counters of calls, and the record. Thread-safe.
class Monitor {
public:
    Monitor();
    ~Monitor();
    Monitor(const Monitor&) = delete;
    Monitor& operator=(const Monitor&) = delete;

    // Adds the rule of an "at" line.
    void AddRule(Line& line, const Line::Names& names);
    // Appends the following calls to that file.
    void RecordTo(const std::string& path);

    // Records a call of an entry point on a device (negative for none) and applies the rules: ends
    // or blocks the process, throws, or returns the effect that the caller has to perform. A rule
    // with a `claim` or a `text` for a call with another kind of result is an error in the script.
    Effect Enter(const char* name, int device, const std::vector<Argument>& arguments,
                 Result result = Result::Other);

private:
    struct Rule;
    struct State;
    std::unique_ptr<State> fState;
};

// Quotes and escapes a text for the record, so that it is on one line; "null" for null.
std::string Quoted(const char* text, std::optional<std::size_t> size = {});

} // namespace scripted
