// Reading the brick's answers that come back as text: byte values written "0x" followed by
// hexadecimal digits and separated by commas ("0x00,0x03,0x0a").
#pragma once

#include <cstdint>

class ReaderWriter;

namespace tools {

// Parses one comma-separated field the way "0x%x" would, keeping only the low 8 bits, so a
// field of any length is read without a buffer of its own. Leading blanks are skipped;
// anything after the digits (a line end, say) is ignored.
class HexByteField {
public:
    void feed(char c);
    // True once "0x" and at least one hexadecimal digit were seen.
    bool parsed() const { return digits_ > 0; }
    std::uint8_t value() const { return value_; }

private:
    enum class State { Blank, Zero, Digits, Done };
    State state_ = State::Blank;
    int digits_ = 0;
    std::uint8_t value_ = 0;
};

// Reads the whole file and stores up to max byte values into out; returns how many were
// stored. 0 for a null file, a file that does not open for reading with RwOk, or an empty
// file. Values are taken field by field between the commas, so a value written with more
// or fewer than two digits does not throw the following ones out of step; a field that does
// not parse stores nothing. The file is closed again.
int ParseByteList(ReaderWriter* file, unsigned char* out, int max);

// Reads one field from an open file, a character at a time up to a comma or until a read
// gives no character, and returns its value's low 8 bits; 0 when the field does not parse
// (also at the end of the file).
std::uint8_t ReadByteValue(ReaderWriter* file);

// Two values, the first one the high byte.
std::uint16_t ReadWord(ReaderWriter* file);

} // namespace tools
