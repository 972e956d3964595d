// A stream buffer that passes the written bytes to a function in blocks.
#pragma once

#include <functional>
#include <streambuf>
#include <string>
#include <string_view>
#include <utility>

namespace assay_host {

// Flush the stream at the end. One thread at a time.
class SinkBuffer : public std::streambuf {
public:
    using Sink = std::function<void(std::string_view)>;

    explicit SinkBuffer(Sink sink) : fSink(std::move(sink)) {}

protected:
    int_type overflow(int_type byte) override
    {
        if (!traits_type::eq_int_type(byte, traits_type::eof())) {
            const char character = traits_type::to_char_type(byte);
            xsputn(&character, 1);
        }
        return traits_type::not_eof(byte);
    }

    std::streamsize xsputn(const char* text, std::streamsize size) override
    {
        fBlock.append(text, static_cast<std::size_t>(size));
        if (fBlock.size() >= kBlockBytes)
            sync();
        return size;
    }

    // The stream rethrows the sink's exceptions if its exception mask has badbit.
    int sync() override
    {
        const std::string block = std::exchange(fBlock, {});
        if (!block.empty())
            fSink(block);
        return 0;
    }

private:
    static constexpr std::size_t kBlockBytes = std::size_t{1} << 16;

    const Sink fSink;
    std::string fBlock;
};

} // namespace assay_host
