// The settings reader on any file: every lookup form (one value, the key list, the section
// list) with any buffer size stays inside its buffer, terminates it and reports a length that
// matches what it wrote.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>
#include <vector>

#include "FuzzInput.h"
#include "platform/Profile.h"

namespace {

std::string ScratchPath()
{
    const char* dir = std::getenv("TMPDIR");
    return std::string(dir != nullptr ? dir : "/tmp") + "/harbor-fuzz-profile-" +
           std::to_string(static_cast<long>(getpid())) + ".ini";
}

void Check(bool condition)
{
    if (!condition) {
        std::abort();
    }
}

void Lookup(const char* section, const char* key, const char* defaultValue, std::uint32_t size,
            const std::string& path)
{
    // Guard bytes on both sides of the caller's buffer catch a write outside it even where
    // the allocator would not.
    constexpr std::uint32_t kGuard = 16;
    std::vector<char> storage(size + 2 * kGuard, '\x5a');
    char* buffer = storage.data() + kGuard;
    const std::uint32_t n =
        platform::ReadProfileString(section, key, defaultValue, buffer, size, path.c_str());
    for (std::uint32_t i = 0; i < kGuard; ++i) {
        Check(storage[i] == '\x5a' && storage[kGuard + size + i] == '\x5a');
    }
    if (size == 0) {
        Check(n == 0);
        return;
    }
    Check(n < size);
    if (key != nullptr) {
        // One value: terminated right after the reported length.
        Check(buffer[n] == '\0');
        Check(std::string(buffer).size() == n);
    } else if (size >= 2) {
        // A list of names ends with two zeros.
        Check(buffer[n] == '\0');
        // Uncut, the last name's terminator comes before it; cut, one more zero follows.
        Check(n == 0 || buffer[n - 1] == '\0' || (n + 2 == size && buffer[n + 1] == '\0'));
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    fuzz::Input input(data, size);
    const std::string section = input.text(24);
    const std::string key = input.text(24);
    const std::string defaultValue = input.text(300);
    const std::uint32_t bufferSize = input.number<std::uint16_t>() % 600;
    const std::string file = input.rest();

    static const std::string path = ScratchPath();
    if (FILE* out = std::fopen(path.c_str(), "wb")) {
        std::fwrite(file.data(), 1, file.size(), out);
        std::fclose(out);
    }
    Lookup(section.c_str(), key.c_str(), defaultValue.c_str(), bufferSize, path);
    Lookup(section.c_str(), nullptr, nullptr, bufferSize, path);
    Lookup(nullptr, nullptr, nullptr, bufferSize, path);
    Lookup(section.c_str(), key.c_str(), nullptr, bufferSize, path);
    return 0;
}
