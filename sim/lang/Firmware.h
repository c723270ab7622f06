// Firmware images (file type 5): text records, each with its own checksum.
//
//   # comment                 ignored, as are blank lines
//   V <vvvv> *<cc>            the firmware version the image installs: four decimal digits
//   D <aaaa> <hh...> *<cc>    data: a 4-digit hexadecimal address and 1 to 32 bytes in hexadecimal
//   E *<cc>                   the end; nothing but comments may follow
//
// <cc> is the sum of the byte values of every character of the record before " *", modulo
// 256, as two hexadecimal digits. A record whose checksum does not match fails with driver
// code 21; a record that is malformed fails with compiler code 1.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "Program.h"

namespace tessel::lang {

// The checksum of a record's text (the part before " *").
std::uint8_t RecordChecksum(std::string_view record);

// A record with its checksum appended ("V 0309" gives "V 0309 *xx").
std::string SealRecord(std::string_view record);

// Throws Failure.
Program ReadFirmware(int brickType, std::string_view image);

} // namespace tessel::lang
