// The filter behind Macro To CSV: reduces the library's CSV listing of a small wrapper
// program to the records of its main block, with operands that refer to a declared name
// replaced by that name.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>

namespace tools {

// Receives each result line (its length, without a terminator); every line ends in "\r\n".
using ListingLineWriter = std::function<void(const char* line, std::int32_t length)>;

// Record numbers the filter gives meaning to.
enum ListingRecord : int {
    RecordBlockName = 250,  // first field: the block name
    RecordDeclare = 251,    // after the first field: one declared name
    RecordBlockStart = 303, // starts capturing when its text begins with the block name
    RecordBlockEnd = 407,   // stops capturing
    RecordHidden1 = 107,    // never copied
    RecordHidden2 = 307,    // never copied
    RecordOnePair = 231,    // one operand pair (source, value)
    RecordTwoPairs = 233,   // two operand pairs
};

// An operand pair (kNameSource, n) with n from 1 to the number of names refers to name n.
inline constexpr int kNameSource = 99;

// The filter's fixed working sizes, terminators included. What does not fit is cut: names
// beyond kMaxNames are not recorded (a reference to one stays numeric), longer names, the
// first field of a 251 record and output lines are shortened. An output line always keeps
// its "\r\n".
inline constexpr int kMaxNames = 24;
inline constexpr std::size_t kNameSize = 10;
inline constexpr std::size_t kDeclareFieldSize = 24;
inline constexpr std::size_t kListingLineSize = 256;

// Runs both passes over listing (zero-terminated, left untouched). The block name is cut to
// blockNameSize - 1 characters (the caller sizes it after the macro call). Both passes see
// every record, also a last one without a line end. Returns false only when working memory
// cannot be had; nothing is written then.
bool FilterMacroListing(const char* listing, std::size_t blockNameSize,
                        const ListingLineWriter& write);

} // namespace tools
