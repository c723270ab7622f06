// Loads the system's font configuration on a thread of its own while the application object
// is being made.
//
// The first text any window measures waits for fontconfig to parse its configuration and
// map its caches; nothing else at start-up needs that, so it can run beside the platform's
// and the session's set-up. Destroying it waits for the thread; do so before the first
// window measures text: fontconfig is safe to call from two threads, but both would then load
// the configuration.
#pragma once

#include <thread>

namespace ui {

class FontWarmUp {
public:
    FontWarmUp();
    ~FontWarmUp();

    FontWarmUp(const FontWarmUp&) = delete;
    FontWarmUp& operator=(const FontWarmUp&) = delete;

private:
    std::thread thread_;
};

} // namespace ui
