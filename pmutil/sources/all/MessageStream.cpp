#include "all/MessageStream.h"

#include <locale>
#include <streambuf>
#include <string>

namespace pmutil {

namespace {

// Appends to a string that can be read without a copy.
class StringBuffer : public std::streambuf {
public:
    std::string text;

protected:
    int_type overflow(int_type code) override
    {
        if (!traits_type::eq_int_type(code, traits_type::eof()))
            text += traits_type::to_char_type(code);
        return traits_type::not_eof(code);
    }
    std::streamsize xsputn(const char* added, std::streamsize size) override
    {
        text.append(added, static_cast<std::size_t>(size));
        return size;
    }
};

} // namespace

class MessageStream::Stream {
public:
    // Does the same as copyfmt from a new stream, without its look-up of all facets.
    void Reset()
    {
        fBuffer.text.clear();
        fOut.exceptions(std::ios::goodbit);
        fOut.clear();
        fOut.tie(nullptr);
        fOut.flags(std::ios::skipws | std::ios::dec);
        fOut.precision(6);
        fOut.width(0);
        if (fOut.getloc() != std::locale())
            fOut.imbue(std::locale());
        fOut.fill(' ');
    }
    std::ostream& Out() { return fOut; }
    const char* Text() const { return fBuffer.text.c_str(); }

private:
    StringBuffer fBuffer;
    std::ostream fOut{&fBuffer};
};

// The cached stream; null while a message uses it.
MessageStream::Stream*& MessageStream::Spare()
{
    static Stream* spare = nullptr;
    return spare;
}

MessageStream::MessageStream() : fStream(Spare())
{
    Spare() = nullptr;
    if (fStream != nullptr)
        fStream->Reset();
    else
        fStream = std::make_unique<Stream>();
}

MessageStream::~MessageStream()
{
    if (Spare() == nullptr)
        Spare() = fStream.release();
}

std::ostream& MessageStream::Out()
{
    return fStream->Out();
}

const char* MessageStream::Text()
{
    return fStream->Text();
}

} // namespace pmutil
