#include "Trace.h"

#include <cstdarg>
#include <cstdio>

namespace sim {

void Trace::setOptions(std::int16_t options)
{
    std::lock_guard<std::mutex> lock(mutex_);
    options_ = options;
}

std::int16_t Trace::options() const
{
    std::lock_guard<std::mutex> lock(mutex_);
    return options_;
}

bool Trace::packets() const
{
    std::lock_guard<std::mutex> lock(mutex_);
    return (options_ & kPackets) != 0;
}

void Trace::line(const char* format, ...)
{
    std::lock_guard<std::mutex> lock(mutex_);
    if (options_ == 0) {
        return;
    }
    char text[512];
    va_list args;
    va_start(args, format);
    std::vsnprintf(text, sizeof text, format, args);
    va_end(args);
    // Opened per line so that the client's header and our lines interleave in time order and a
    // trace file removed while running is simply created again.
    std::FILE* file = std::fopen("tsltrace.txt", "ab");
    if (file == nullptr) {
        return;
    }
    std::fprintf(file, "tessel-sim: %s\n", text);
    std::fclose(file);
}

} // namespace sim
