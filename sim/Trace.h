// The library's own trace: with trace options set (property 15) it appends one line per entry
// point call, and with option bit 1 one per packet, to "tsltrace.txt" in the current directory,
// after the header the client wrote there.
#pragma once

#include <cstdint>
#include <mutex>

namespace sim {

class Trace {
public:
    static constexpr std::int16_t kCalls = 1;   // any non-zero option traces the calls
    static constexpr std::int16_t kPackets = 2; // and this bit the simulated packets too

    void setOptions(std::int16_t options);
    std::int16_t options() const;
    bool packets() const;

    // printf-style; one line, the newline is added. Lines longer than 511 bytes are cut.
    void line(const char* format, ...) __attribute__((format(printf, 2, 3)));

private:
    mutable std::mutex mutex_;
    std::int16_t options_ = 0;
};

} // namespace sim
