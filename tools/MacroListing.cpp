#include "tools/MacroListing.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "tools/CsvText.h"

namespace tools {

namespace {

// One output line, bounded: content is cut so that "\r\n" and the terminator always fit.
class ListingLine {
public:
    void append(const char* format, ...) __attribute__((format(printf, 2, 3)))
    {
        std::size_t room = kContentMax - length_;
        if (room == 0) {
            return;
        }
        va_list args;
        va_start(args, format);
        int n = std::vsnprintf(text_ + length_, room + 1, format, args);
        va_end(args);
        if (n > 0) {
            length_ += static_cast<std::size_t>(n) < room ? static_cast<std::size_t>(n) : room;
        }
    }

    void finish(const ListingLineWriter& write)
    {
        text_[length_] = '\r';
        text_[length_ + 1] = '\n';
        text_[length_ + 2] = 0;
        write(text_, static_cast<std::int32_t>(length_ + 2));
    }

private:
    static constexpr std::size_t kContentMax = kListingLineSize - 3;
    char text_[kListingLineSize] = {};
    std::size_t length_ = 0;
};

class NameTable {
public:
    void add(const char* name)
    {
        if (count_ >= kMaxNames) {
            return;
        }
        std::snprintf(names_[count_], kNameSize, "%s", name);
        ++count_;
    }

    // The name an operand pair refers to, or null.
    const char* lookup(int source, int value) const
    {
        if (source != kNameSource || value < 1 || value > count_) {
            return nullptr;
        }
        return names_[value - 1];
    }

private:
    char names_[kMaxNames][kNameSize] = {};
    int count_ = 0;
};

char* Duplicate(const char* text)
{
    std::size_t length = std::strlen(text);
    char* copy = static_cast<char*>(std::malloc(length + 1));
    if (copy != nullptr) {
        std::memcpy(copy, text, length + 1);
    }
    return copy;
}

// Walks the records of a private copy of listing: NextLine empties the last record in
// place, so each pass needs its own copy to see that record too.
template <typename Visit> bool ForEachRecord(const char* listing, Visit visit)
{
    char* buffer = Duplicate(listing);
    if (buffer == nullptr) {
        return false;
    }
    char* cursor = buffer;
    char* line = nullptr;
    while (cursor[0] != 0) {
        NextLine(&cursor, &line);
        if (line != nullptr) {
            visit(line);
        }
    }
    std::free(line);
    std::free(buffer);
    return true;
}

void CollectDeclarations(const char* listing, char* blockName, std::size_t blockNameSize,
                         NameTable& names, bool& ok)
{
    ok = ForEachRecord(listing, [&](char* record) {
        int number = TakeNumber(record);
        if (number == RecordBlockName) {
            TakeField(record, blockName, blockNameSize);
        } else if (number == RecordDeclare) {
            char field[kDeclareFieldSize];
            if (TakeField(record, field, sizeof field)) {
                names.add(record);
            }
        }
    });
}

void WriteTwoPairs(char* record, const NameTable& names, const ListingLineWriter& write)
{
    ListingLine line;
    int source = TakeNumber(record);
    int value = TakeNumber(record);
    const char* first = names.lookup(source, value);
    if (first == nullptr) {
        line.append("%d,%d,%d,%s", static_cast<int>(RecordTwoPairs), source, value, record);
        line.finish(write);
        return;
    }
    line.append("%d,%s,", static_cast<int>(RecordTwoPairs), first);
    // The second pair is kept as the listing wrote it when it names nothing, so the line
    // still ends and loses no operand.
    char* secondPair = Duplicate(record);
    int source2 = TakeNumber(record);
    int value2 = TakeNumber(record);
    const char* second = names.lookup(source2, value2);
    if (second != nullptr) {
        line.append("%s", second);
    } else if (secondPair != nullptr) {
        line.append("%s", secondPair);
    }
    std::free(secondPair);
    line.finish(write);
}

} // namespace

bool FilterMacroListing(const char* listing, std::size_t blockNameSize,
                        const ListingLineWriter& write)
{
    if (blockNameSize == 0) {
        blockNameSize = 1;
    }
    char* blockName = static_cast<char*>(std::calloc(blockNameSize, 1));
    if (blockName == nullptr) {
        return false;
    }
    NameTable names;
    bool ok = false;
    CollectDeclarations(listing, blockName, blockNameSize, names, ok);
    if (ok) {
        std::size_t blockNameLength = std::strlen(blockName);
        bool capturing = false;
        ok = ForEachRecord(listing, [&](char* record) {
            int number = TakeNumber(record);
            switch (number) {
            case RecordHidden1:
            case RecordHidden2:
                return;
            case RecordBlockStart:
                if (std::strncmp(record, blockName, blockNameLength) == 0) {
                    capturing = true;
                }
                return;
            case RecordBlockEnd:
                capturing = false;
                return;
            default:
                break;
            }
            if (!capturing) {
                return;
            }
            if (number == RecordTwoPairs) {
                WriteTwoPairs(record, names, write);
                return;
            }
            ListingLine line;
            if (number == RecordOnePair) {
                int source = TakeNumber(record);
                int value = TakeNumber(record);
                if (const char* name = names.lookup(source, value)) {
                    line.append("%d,%s", number, name);
                } else {
                    line.append("%d,%d,%d,%s", number, source, value, record);
                }
            } else {
                line.append("%d,%s", number, record);
            }
            line.finish(write);
        });
    }
    std::free(blockName);
    return ok;
}

} // namespace tools
