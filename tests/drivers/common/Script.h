// What the scripted drivers share: the lines of a script, the rules ("at ...") in it, and the
// record of calls. tests/drivers/README.md tells the language.
//
// A script that can't be read is a mistake of the test's author: it is told on standard error with
// file and line, and the process ends with status 125.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace scripted {

// A word of a script line: bare, or a quoted text with its escapes already resolved.
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
    // Takes the next word; its absence is an error that names `what`.
    const Word& Take(const char* what);
    // Takes the next word if it is this bare one.
    bool TakeIf(const char* bare);
    // Takes a number: decimal, hexadecimal with 0x, or a name that `names` knows.
    using Names = std::function<std::optional<std::int64_t>(const std::string&)>;
    std::int64_t TakeNumber(const char* what, const Names& names = {});
    // Takes a text: "...", or `repeat N "..."`, or several of them joined by +. `null` gives
    // nothing.
    std::optional<std::string> TakeText(const char* what);
    // Where the line stands.
    const std::string& File() const { return fFile; }
    int Number() const { return fNumber; }
    // Ends the process with `problem`.
    [[noreturn]] void Fail(const std::string& problem) const;

private:
    std::string fFile;
    int fNumber;
    std::vector<Word> fWords;
    std::size_t fNext = 0;
};

// All lines of a file that hold a word; comments are gone.
std::vector<Line> ReadScript(const std::string& path);

// An argument of a call, as the record shows it and as a rule matches it.
struct Argument {
    std::string text;
    std::optional<std::int64_t> number;
};

// What an "at" line does to the calls that it matches. Crashes, exits, throws and the like are done
// by Enter itself and never reach the driver's entry point.
struct Effect {
    std::optional<std::int64_t> error;   // the call fails with this error code
    std::optional<std::int64_t> returns; // the call gives this and does nothing else
    std::optional<std::int64_t> claim;   // the number or size that the call tells
    const std::string* text = nullptr;   // the text that the call gives; stays
};

// What a caller gets from a call, as far as rules change it.
enum class Gives { Neither, Number, Text, TextAndSize };

// The rules of a script, the counters of calls that they go by, and the record. Thread-safe.
class Monitor {
public:
    Monitor();
    ~Monitor();
    Monitor(const Monitor&) = delete;
    Monitor& operator=(const Monitor&) = delete;

    // Takes the rest of an "at" line.
    void AddRule(Line& line, const Line::Names& names);
    // From now on appends each call to that file.
    void RecordTo(const std::string& path);

    // An entry point was called, on that device (negative if it concerns none). Does to the process
    // what the rules say, or throws what they say; else gives what is left to do. A rule with a
    // `claim` or a `text` for a call that gives none is a mistake of the script.
    Effect Enter(const char* name, int device, const std::vector<Argument>& arguments,
                 Gives gives = Gives::Neither);

private:
    struct Rule;
    struct State;
    std::unique_ptr<State> fState;
};

// Quotes and escapes a text for the record: one line whatever it holds, "null" for null.
std::string Quoted(const char* text, std::optional<std::size_t> size = {});

} // namespace scripted
