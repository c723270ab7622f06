#include "errors/ErrorText.h"

#include <cstdio>
#include <cstring>

#include "errors/Catalogue.h"
#include "tessel/ErrorValue.h"
#include "tessel/IError.h"

namespace {

// The one message buffer the catalogue promises its callers.
char messageBuffer[kErrorTextSize];

// Appends to the message buffer; a text that does not fit is cut so that the buffer always
// ends with its terminator.
class MessageWriter {
public:
    explicit MessageWriter(char* buffer) : buffer_(buffer) { buffer_[0] = '\0'; }

    void Append(const char* text)
    {
        if (text == nullptr) {
            return;
        }
        std::size_t room = kErrorTextSize - 1 - length_;
        std::size_t count = strnlen(text, room);
        std::memcpy(buffer_ + length_, text, count);
        length_ += count;
        buffer_[length_] = '\0';
    }

private:
    char* buffer_;
    std::size_t length_ = 0;
};

const char* SinkText(IError* sink)
{
    if (sink == nullptr) {
        return nullptr;
    }
    return sink->GetText();
}

// Rule A: ": " and the sink's text, when there is a non-empty one.
void AppendDetail(MessageWriter& writer, IError* sink)
{
    const char* detail = SinkText(sink);
    if (detail != nullptr && detail[0] != '\0') {
        writer.Append(": ");
        writer.Append(detail);
    }
}

// Rule B: detail codes show the sink's text in place of the table's whenever a sink is
// given; the invalid-token code shows both.
void AppendCompilerText(MessageWriter& writer, std::uint32_t code, IError* sink)
{
    bool detail = false;
    const char* text = catalogue::CompilerText(code, &detail);
    if (code == catalogue::kInvalidTokenCode) {
        writer.Append(text);
        writer.Append(SinkText(sink));
    } else if (detail && sink != nullptr) {
        writer.Append(SinkText(sink));
    } else {
        writer.Append(text);
    }
}

void AppendTesselText(MessageWriter& writer, const ErrorValue& value, IError* sink)
{
    writer.Append(" from Tessel");
    switch (value.module()) {
    case 1:
        writer.Append(" driver: ");
        writer.Append(catalogue::DriverText(value.code()));
        break;
    case 2:
        writer.Append(" compiler: ");
        AppendCompilerText(writer, value.code(), sink);
        break;
    case 3:
        writer.Append(" tsl: ");
        writer.Append(catalogue::LibraryText(value.code()));
        AppendDetail(writer, sink);
        break;
    default:
        writer.Append(" unknown module");
        break;
    }
}

} // namespace

const char* GetErrorText(std::int32_t code, IError* sink)
{
    if (code >= 0) {
        return "Ok";
    }
    // The raw value, not the normalised one, leads the text: nothing of it is lost.
    const auto raw = static_cast<std::uint32_t>(code);
    const ErrorValue value(raw);
    MessageWriter writer(messageBuffer);
    char head[32];
    std::snprintf(head, sizeof head, "Error (0x%x)", raw);
    writer.Append(head);

    switch (value.facility()) {
    case 0:
        writer.Append(": unknown");
        break;
    case 1:
        writer.Append(" from KivoError: ");
        break;
    case 2:
        writer.Append(" from ReaderWriter: ");
        break;
    case 3:
        writer.Append(" from Opal: ");
        writer.Append(catalogue::OpalText(value.code()));
        AppendDetail(writer, sink);
        break;
    case 5:
        AppendTesselText(writer, value, sink);
        break;
    case 6:
        writer.Append(" from BLT: ");
        writer.Append(catalogue::BltText(value.code()));
        AppendDetail(writer, sink);
        break;
    case 256:
        writer.Append(" from Wisp: ");
        writer.Append(catalogue::WispText(value.packedCode()));
        break;
    case 512:
        writer.Append(" from Wisp USB Port: ");
        writer.Append(catalogue::WispUsbText(value.packedCode()));
        break;
    default:
        writer.Append(": unknown facility");
        break;
    }
    return messageBuffer;
}

std::int32_t StatusToError(std::int32_t status)
{
    struct StatusCode {
        std::int32_t status;
        std::uint32_t packed;
    };
    // Brick status results as driver errors; 11 is the communication stack's retry error.
    static constexpr StatusCode kStatusCodes[] = {
        {0, 0xE0050425u},  {1, 0u},           {3, 0xE0050401u},  {4, 0xE0050421u},
        {5, 0xE005040Bu},  {6, 0xE0050402u},  {7, 0xE0050422u},  {8, 0xE0050424u},
        {9, 0xE0050403u},  {10, 0xE0050404u}, {11, 0xE1000204u}, {12, 0xE005040Au},
        {14, 0xE0050423u},
    };
    for (const StatusCode& entry : kStatusCodes) {
        if (entry.status == status) {
            return static_cast<std::int32_t>(entry.packed);
        }
    }
    return static_cast<std::int32_t>(0xE0050420u);
}
