#include "Firmware.h"

#include <cstdio>

#include "Failure.h"

namespace tessel::lang {
namespace {

int Hex(char c)
{
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    if ((c | 0x20) >= 'a' && (c | 0x20) <= 'f') {
        return (c | 0x20) - 'a' + 10;
    }
    return -1;
}

bool ParseHexField(std::string_view field, std::size_t digits, int& value)
{
    if (field.size() != digits) {
        return false;
    }
    value = 0;
    for (char c : field) {
        const int d = Hex(c);
        if (d < 0) {
            return false;
        }
        value = value * 16 + d;
    }
    return true;
}

} // namespace

std::uint8_t RecordChecksum(std::string_view record)
{
    unsigned sum = 0;
    for (char c : record) {
        sum += static_cast<unsigned char>(c);
    }
    return static_cast<std::uint8_t>(sum & 0xFF);
}

std::string SealRecord(std::string_view record)
{
    char tail[8];
    std::snprintf(tail, sizeof tail, " *%02x", RecordChecksum(record));
    return std::string(record) + tail;
}

Program ReadFirmware(int brickType, std::string_view image)
{
    Program program;
    program.kind = ObjectKind::Firmware;
    program.brickType = brickType;
    bool haveVersion = false;
    bool ended = false;
    std::size_t pos = 0;
    while (pos < image.size()) {
        std::size_t end = image.find('\n', pos);
        if (end == std::string_view::npos) {
            end = image.size();
        }
        const auto at = static_cast<std::int32_t>(pos);
        std::string_view line = image.substr(pos, end - pos);
        pos = end + 1;
        while (!line.empty() &&
               (line.back() == '\r' || line.back() == ' ' || line.back() == '\t')) {
            line.remove_suffix(1);
        }
        std::size_t lead = 0;
        while (lead < line.size() && (line[lead] == ' ' || line[lead] == '\t')) {
            ++lead;
        }
        line.remove_prefix(lead);
        if (line.empty() || line[0] == '#') {
            continue;
        }
        const std::size_t star = line.rfind(" *");
        if (star == std::string_view::npos) {
            Fail(kSyntax, at, line.substr(0, 16));
        }
        const std::string_view record = line.substr(0, star);
        int checksum = 0;
        if (!ParseHexField(line.substr(star + 2), 2, checksum)) {
            Fail(kSyntax, at, line.substr(0, 16));
        }
        if (checksum != RecordChecksum(record)) {
            FailPacked(DriverError(kBadFirmwareChecksum), at, record.substr(0, 16));
        }
        if (ended) {
            Fail(kSyntax, at, record.substr(0, 16));
        }
        if (record.size() >= 6 && record.substr(0, 2) == "V ") {
            const std::string_view digits = record.substr(2);
            int version = 0;
            for (char c : digits) {
                if (c < '0' || c > '9') {
                    Fail(kSyntax, at, record);
                }
                version = version * 10 + (c - '0');
            }
            if (digits.size() != 4 || haveVersion) {
                Fail(kSyntax, at, record);
            }
            haveVersion = true;
            program.firmwareVersion = version;
        } else if (record.size() >= 2 && record.substr(0, 2) == "D ") {
            if (!haveVersion) {
                Fail(kSyntax, at, "version");
            }
            int address = 0;
            if (record.size() < 9 || record[6] != ' ' ||
                !ParseHexField(record.substr(2, 4), 4, address)) {
                Fail(kSyntax, at, record.substr(0, 16));
            }
            const std::string_view data = record.substr(7);
            if (data.empty() || data.size() % 2 != 0 || data.size() > 64 ||
                address + data.size() / 2 > 0x10000) {
                Fail(kSyntax, at, record.substr(0, 16));
            }
            FirmwareRecord out;
            out.address = static_cast<std::uint16_t>(address);
            for (std::size_t i = 0; i < data.size(); i += 2) {
                int byte = 0;
                if (!ParseHexField(data.substr(i, 2), 2, byte)) {
                    Fail(kSyntax, at, record.substr(0, 16));
                }
                out.data.push_back(static_cast<std::uint8_t>(byte));
            }
            program.firmware.push_back(std::move(out));
            ++program.commandCount;
        } else if (record == "E") {
            if (!haveVersion) {
                Fail(kSyntax, at, "version");
            }
            ended = true;
        } else {
            Fail(kSyntax, at, record.substr(0, 16));
        }
    }
    if (!ended) {
        Fail(kSyntax, static_cast<std::int32_t>(image.size()), haveVersion ? "E" : "version");
    }
    return program;
}

} // namespace tessel::lang
