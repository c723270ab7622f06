// The message catalogue with any packed value and any sink: the text always fits the shared
// buffer and ends in a terminator, whatever the sink's detail holds (any length, any bytes,
// or no text at all).
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

#include "FuzzInput.h"
#include "errors/ErrorSink.h"
#include "errors/ErrorText.h"
#include "tessel/IError.h"

namespace {

// A sink as a careless library might leave it: a text of any length, or none.
class RawSink final : public IError {
public:
    RawSink(std::int32_t value, std::int32_t position, const char* text)
        : value_(value), position_(position), text_(text)
    {
    }
    void Reset() override {}
    void SetError(std::int32_t, std::int32_t, const char*) override {}
    std::int32_t GetValue() override { return value_; }
    std::int32_t GetPosition() override { return position_; }
    const char* GetText() override { return text_; }

private:
    std::int32_t value_;
    std::int32_t position_;
    const char* text_;
};

void CheckText(const char* text)
{
    if (text == nullptr || std::strlen(text) >= static_cast<std::size_t>(kErrorTextSize)) {
        std::abort();
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    fuzz::Input input(data, size);
    const auto code = input.number<std::int32_t>();
    const auto sinkValue = input.number<std::int32_t>();
    const auto position = input.number<std::int32_t>();
    const std::uint8_t form = input.byte();
    const std::string detail = input.rest();
    // An exact-size copy: a read past the detail's terminator is an ASan report.
    auto* text = static_cast<char*>(std::malloc(detail.size() + 1));
    if (text == nullptr) {
        return 0;
    }
    std::memcpy(text, detail.c_str(), detail.size() + 1);

    CheckText(GetErrorText(code, nullptr));
    RawSink raw(sinkValue, position, (form & 1) != 0 ? text : nullptr);
    CheckText(GetErrorText(code, &raw));
    ErrorSink sink;
    sink.SetError(sinkValue, position, text);
    CheckText(sink.GetText());
    CheckText(GetErrorText(code, &sink));
    // A code that is not negative is "Ok", whatever the sink says.
    if (code >= 0 && std::strcmp(GetErrorText(code, &raw), "Ok") != 0) {
        std::abort();
    }
    StatusToError(code);
    std::free(text);
    return 0;
}
