#include "common/Script.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <map>
#include <mutex>
#include <sstream>
#include <stdexcept>
#include <thread>
#include <utility>

namespace scripted {

namespace {

constexpr int kBadScript = 125;

[[noreturn]] void EndWithError(const std::string& file, int line, const std::string& problem)
{
    std::ostringstream text;
    text << "scripted driver: " << file << ":" << line << ": " << problem << "\n";
    const std::string whole = text.str();
    // Don't run the exit handlers: the run is invalid.
    if (::write(STDERR_FILENO, whole.data(), whole.size()) < 0)
        std::_Exit(kBadScript);
    std::_Exit(kBadScript);
}

int HexDigit(char c)
{
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'a' && c <= 'f')
        return c - 'a' + 10;
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    return -1;
}

// Reads the quoted text that begins after the quote at text[at - 1], and sets `at` to the position
// after its closing quote.
std::string ReadQuoted(const std::string& text, std::size_t& at, const std::string& file, int line)
{
    std::string result;
    while (at < text.size() && text[at] != '"') {
        char c = text[at++];
        if (c == '\\') {
            const char escape = at < text.size() ? text[at++] : '\0';
            switch (escape) {
            case 'n':
                c = '\n';
                break;
            case 't':
                c = '\t';
                break;
            case '"':
            case '\\':
                c = escape;
                break;
            case 'x': {
                const int high = at < text.size() ? HexDigit(text[at]) : -1;
                const int low = at + 1 < text.size() ? HexDigit(text[at + 1]) : -1;
                if (high < 0 || low < 0)
                    EndWithError(file, line, "\\x needs two hexadecimal digits");
                c = static_cast<char>(static_cast<unsigned char>(high * 16 + low));
                at += 2;
                break;
            }
            default:
                EndWithError(file, line, "unknown escape in a text");
            }
        }
        result += c;
    }
    if (at == text.size())
        EndWithError(file, line, "a text lacks its closing quote");
    ++at;
    return result;
}

std::vector<Word> SplitLine(const std::string& text, const std::string& file, int line)
{
    std::vector<Word> words;
    std::size_t at = 0;
    while (at < text.size()) {
        if (text[at] == ' ' || text[at] == '\t' || text[at] == '\r') {
            ++at;
        } else if (text[at] == '#') {
            break;
        } else if (text[at] == '"') {
            ++at;
            words.push_back({ReadQuoted(text, at, file, line), true});
        } else {
            const std::size_t end = std::min(text.find_first_of(" \t\r", at), text.size());
            words.push_back({text.substr(at, end - at), false});
            at = end;
        }
    }
    return words;
}

// Returns false if a write fails, as after the reader has closed the pipe.
bool WriteAll(int file, const std::string& text)
{
    std::size_t done = 0;
    while (done < text.size()) {
        const ssize_t written = ::write(file, text.data() + done, text.size() - done);
        if (written < 0 && errno != EINTR)
            return false;
        done += written > 0 ? static_cast<std::size_t>(written) : 0;
    }
    return true;
}

void Flood(int file, const std::string& line, std::int64_t lines)
{
    // Write many short lines at once.
    constexpr std::size_t kChunk = 65536;
    std::string chunk;
    for (std::int64_t i = 0; i < lines; ++i) {
        chunk += line;
        if (chunk.size() >= kChunk || i + 1 == lines) {
            if (!WriteAll(file, chunk))
                return;
            chunk.clear();
        }
    }
}

// Starts a process that keeps all files of this one open until it is killed.
void LeaveGrandchild()
{
    if (::fork() == 0) {
        ::setsid();
        for (;;)
            ::pause();
    }
}

std::optional<std::int64_t> ToNumber(const std::string& text, const Line::Names& names)
{
    if (names) {
        if (const auto known = names(text))
            return known;
    }
    if (text.empty())
        return {};
    char* end = nullptr;
    errno = 0;
    const long long value = std::strtoll(text.c_str(), &end, 0);
    if (errno != 0 || *end != '\0')
        return {};
    return value;
}

} // namespace

const Word& Line::Take(const char* what)
{
    if (AtEnd())
        Fail(std::string("lacks ") + what);
    return fWords[fNext++];
}

bool Line::TakeIf(const char* bare)
{
    if (AtEnd() || fWords[fNext].quoted || fWords[fNext].text != bare)
        return false;
    ++fNext;
    return true;
}

std::int64_t Line::TakeNumber(const char* what, const Names& names)
{
    const Word& word = Take(what);
    const auto value = ToNumber(word.text, names);
    if (!value || word.quoted)
        Fail("\"" + word.text + "\" is not a number or a known name; expected " + what);
    return *value;
}

std::optional<std::string> Line::TakeText(const char* what)
{
    if (TakeIf("null"))
        return {};
    std::string result;
    do {
        std::int64_t count = 1;
        if (TakeIf("repeat"))
            count = TakeNumber("a count after repeat");
        const Word& word = Take(what);
        if (!word.quoted)
            Fail(std::string("expected ") + what + " in quotes, or null");
        for (std::int64_t i = 0; i < count; ++i)
            result += word.text;
    } while (TakeIf("+"));
    return result;
}

void Line::Fail(const std::string& problem) const
{
    EndWithError(fFile, fNumber, problem);
}

std::vector<Line> ReadScript(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    if (!in)
        EndWithError(path, 0, "can't be read");
    std::vector<Line> lines;
    std::string text;
    for (int number = 1; std::getline(in, text); ++number) {
        std::vector<Word> words = SplitLine(text, path, number);
        if (!words.empty())
            lines.emplace_back(path, number, std::move(words));
    }
    return lines;
}

std::string Quoted(const char* text, std::optional<std::size_t> size)
{
    if (text == nullptr)
        return "null";
    static const char kDigits[] = "0123456789ABCDEF";
    std::string result = "\"";
    const std::size_t length = size ? *size : std::strlen(text);
    for (std::size_t i = 0; i < length; ++i) {
        const auto byte = static_cast<unsigned char>(text[i]);
        if (byte == '"' || byte == '\\') {
            result += '\\';
            result += text[i];
        } else if (byte < 0x20 || byte >= 0x7F) {
            result += "\\x";
            result += kDigits[byte >> 4U];
            result += kDigits[byte & 0xFU];
        } else {
            result += text[i];
        }
    }
    return result + "\"";
}

struct Monitor::Rule {
    std::string name;                                // empty for any call
    std::vector<std::optional<std::int64_t>> values; // the leading arguments; nothing matches all
    std::optional<int> device;
    std::uint64_t first = 1;
    std::uint64_t last = UINT64_MAX;
    std::uint64_t matched = 0;

    enum class Kind {
        Crash,
        Abort,
        Hang,
        Exit,
        QuickExit,
        Signal,
        Sleep,
        Print,
        Flood,
        Grandchild,
        Throw,
        ThrowInt,
        Error,
        Return,
        Claim,
        Text
    };
    Kind kind = Kind::Crash;
    std::int64_t number = 0;
    std::string text;
    std::int64_t lines = 0; // of a flood
    std::string file;       // of the script
    int line = 0;

    bool Matches(const char* call, int callDevice, const std::vector<Argument>& arguments) const
    {
        if ((!name.empty() && name != call) || (device && *device != callDevice) ||
            values.size() > arguments.size())
            return false;
        for (std::size_t i = 0; i < values.size(); ++i)
            if (values[i] && values[i] != arguments[i].number)
                return false;
        return true;
    }
};

struct Monitor::State {
    std::mutex mutex;
    std::vector<std::shared_ptr<Rule>> rules; // never removed: effects point to their texts
    std::uint64_t calls = 0;
    int record = -1;
};

Monitor::Monitor() : fState(std::make_unique<State>()) {}

Monitor::~Monitor()
{
    if (fState->record >= 0)
        ::close(fState->record);
}

void Monitor::RecordTo(const std::string& path)
{
    const int opened = ::open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0666);
    if (opened < 0)
        EndWithError(path, 0, "can't be opened as a record");
    fState->record = opened;
}

void Monitor::AddRule(Line& line, const Line::Names& names)
{
    Rule rule;
    std::string word = line.Take("a call").text;
    if (word.find_first_not_of("0123456789+") == std::string::npos) {
        const bool open = word.back() == '+';
        rule.first = std::strtoull(word.c_str(), nullptr, 10);
        rule.last = open ? UINT64_MAX : rule.first;
        word = line.Take("a call").text;
    }
    const std::size_t bracket = word.find('(');
    rule.name = word.substr(0, bracket);
    if (rule.name == "any")
        rule.name.clear();
    if (bracket != std::string::npos) {
        if (word.back() != ')')
            line.Fail("the arguments of \"" + word + "\" lack their closing bracket");
        std::istringstream list(word.substr(bracket + 1, word.size() - bracket - 2));
        for (std::string value; std::getline(list, value, ',');) {
            std::optional<std::int64_t> number;
            if (value != "*") {
                number = ToNumber(value, names);
                if (!number)
                    line.Fail("\"" + value + "\" is not a number or a known name");
            }
            rule.values.push_back(number);
        }
    }
    if (line.TakeIf("on"))
        rule.device = static_cast<int>(line.TakeNumber("a device's number"));

    static const std::map<std::string, Rule::Kind> kPlain = {
        {"crash", Rule::Kind::Crash},
        {"abort", Rule::Kind::Abort},
        {"hang", Rule::Kind::Hang},
        {"grandchild", Rule::Kind::Grandchild}};
    static const std::map<std::string, Rule::Kind> kWithNumber = {
        {"exit", Rule::Kind::Exit},     {"_exit", Rule::Kind::QuickExit},
        {"signal", Rule::Kind::Signal}, {"sleep", Rule::Kind::Sleep},
        {"error", Rule::Kind::Error},   {"return", Rule::Kind::Return},
        {"claim", Rule::Kind::Claim}};
    const std::string action = line.Take("an action").text;
    if (const auto plain = kPlain.find(action); plain != kPlain.end()) {
        rule.kind = plain->second;
    } else if (const auto other = kWithNumber.find(action); other != kWithNumber.end()) {
        rule.kind = other->second;
        rule.number = line.TakeNumber("the action's number", names);
    } else if (action == "throw") {
        if (line.TakeIf("int")) {
            rule.kind = Rule::Kind::ThrowInt;
            rule.number = line.TakeNumber("the number to throw");
        } else {
            rule.kind = Rule::Kind::Throw;
            rule.text = line.TakeText("the text of the exception").value_or("");
        }
    } else if (action == "print") {
        rule.kind = Rule::Kind::Print;
        rule.number = line.TakeNumber("the number of a file descriptor");
        rule.text = line.TakeText("the text to print").value_or("");
    } else if (action == "text") {
        rule.kind = Rule::Kind::Text;
        rule.text = line.TakeText("the text to return").value_or("");
    } else if (action == "flood") {
        rule.kind = Rule::Kind::Flood;
        rule.number = line.TakeNumber("the number of a file descriptor");
        rule.lines = line.TakeNumber("the number of lines");
        const std::int64_t length = line.TakeNumber("the length of a line");
        rule.text = std::string(static_cast<std::size_t>(length), 'f') + '\n';
    } else {
        line.Fail("unknown action \"" + action + "\"");
    }
    if (!line.AtEnd())
        line.Fail("unexpected words after the action");
    rule.file = line.File();
    rule.line = line.Number();
    fState->rules.push_back(std::make_shared<Rule>(std::move(rule)));
}

Effect Monitor::Enter(const char* name, int device, const std::vector<Argument>& arguments,
                      Result result)
{
    std::vector<std::shared_ptr<const Rule>> due;
    {
        const std::lock_guard<std::mutex> lock(fState->mutex);
        ++fState->calls;
        if (fState->record >= 0) {
            std::ostringstream line;
            line << fState->calls << ' ';
            if (device < 0)
                line << '-';
            else
                line << device;
            line << ' ' << name;
            for (const Argument& argument : arguments)
                line << ' ' << argument.text;
            line << '\n';
            const std::string text = line.str();
            // Write the call in one piece before its effect, so that it is the last one after a
            // crash.
            if (::write(fState->record, text.data(), text.size()) < 0)
                EndWithError("record", 0, std::strerror(errno));
        }
        for (const std::shared_ptr<Rule>& rule : fState->rules) {
            if (rule->Matches(name, device, arguments)) {
                ++rule->matched;
                if (rule->matched >= rule->first && rule->matched <= rule->last)
                    due.push_back(rule);
            }
        }
    }

    Effect effect;
    for (const std::shared_ptr<const Rule>& each : due) {
        const Rule& rule = *each;
        switch (rule.kind) {
        case Rule::Kind::Crash: {
            // The first page is never mapped. Not null, which sanitizers report before the fault.
            volatile std::uintptr_t unmapped = 64;
            *reinterpret_cast<int*>(unmapped) = 1; // NOLINT(performance-no-int-to-ptr)
            break;
        }
        case Rule::Kind::Abort:
            std::abort();
        case Rule::Kind::Hang:
            for (;;)
                ::pause();
        case Rule::Kind::Exit:
            std::exit(static_cast<int>(rule.number));
        case Rule::Kind::QuickExit:
            ::_exit(static_cast<int>(rule.number));
        case Rule::Kind::Signal:
            std::raise(static_cast<int>(rule.number));
            break;
        case Rule::Kind::Sleep:
            std::this_thread::sleep_for(std::chrono::milliseconds(rule.number));
            break;
        case Rule::Kind::Print:
            WriteAll(static_cast<int>(rule.number), rule.text);
            break;
        case Rule::Kind::Flood:
            Flood(static_cast<int>(rule.number), rule.text, rule.lines);
            break;
        case Rule::Kind::Grandchild:
            LeaveGrandchild();
            break;
        case Rule::Kind::Throw:
            throw std::runtime_error(rule.text);
        case Rule::Kind::ThrowInt:
            throw static_cast<int>(rule.number);
        case Rule::Kind::Error:
            effect.error = rule.number;
            break;
        case Rule::Kind::Return:
            effect.returns = rule.number;
            break;
        case Rule::Kind::Claim:
            if (result != Result::Number && result != Result::TextAndSize)
                EndWithError(rule.file, rule.line, std::string(name) + " returns no number");
            effect.claim = rule.number;
            break;
        case Rule::Kind::Text:
            if (result != Result::Text && result != Result::TextAndSize)
                EndWithError(rule.file, rule.line, std::string(name) + " returns no text");
            effect.text = &rule.text;
            break;
        }
    }
    return effect;
}

} // namespace scripted
