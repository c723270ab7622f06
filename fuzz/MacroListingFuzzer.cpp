// The Macro To CSV filter and its record helpers on any listing: the filter and the walk end,
// every output line fits the working line size and ends in "\r\n", and the helpers never
// write past the buffers they were given.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "FuzzInput.h"
#include "tools/CsvText.h"
#include "tools/MacroListing.h"

namespace {

void Check(bool condition)
{
    if (!condition) {
        std::abort();
    }
}

char* ExactCopy(const std::string& text)
{
    auto* copy = static_cast<char*>(std::malloc(text.size() + 1));
    if (copy != nullptr) {
        std::memcpy(copy, text.c_str(), text.size() + 1);
    }
    return copy;
}

void WalkRecords(const std::string& listing, std::size_t fieldSize)
{
    char* remaining = ExactCopy(listing);
    if (remaining == nullptr) {
        return;
    }
    char* cursor = remaining;
    char* line = nullptr;
    std::size_t lines = 0;
    while (*cursor != '\0') {
        tools::NextLine(&cursor, &line);
        Check(++lines <= listing.size());
        if (line == nullptr) {
            continue;
        }
        tools::TakeNumber(line);
        std::vector<char> field(fieldSize + 1, '\x7f');
        std::size_t fields = 0;
        while (tools::TakeField(line, field.data(), fieldSize)) {
            Check(field[fieldSize] == '\x7f');
            Check(fieldSize == 0 || std::strlen(field.data()) < fieldSize);
            Check(++fields <= listing.size() + 1);
        }
    }
    std::free(line);
    std::free(remaining);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    fuzz::Input input(data, size);
    const std::size_t blockNameSize = 1 + input.byte() % 40;
    const std::size_t fieldSize = 1 + input.byte() % 30;
    const std::string listing = input.rest();
    char* copy = ExactCopy(listing);
    if (copy == nullptr) {
        return 0;
    }
    const std::string before(copy);
    std::size_t written = 0;
    tools::FilterMacroListing(copy, blockNameSize, [&](const char* line, std::int32_t length) {
        Check(line != nullptr && length >= 2);
        Check(static_cast<std::size_t>(length) < tools::kListingLineSize);
        Check(line[length - 2] == '\r' && line[length - 1] == '\n');
        written += static_cast<std::size_t>(length);
    });
    // The listing is left untouched.
    Check(before == copy);
    std::free(copy);
    WalkRecords(listing, fieldSize);
    return 0;
}
