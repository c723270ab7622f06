#include "platform/Profile.h"

#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>
#include <string_view>
#include <vector>

namespace platform {

namespace {

bool IsBlank(char c)
{
    return c == ' ' || c == '\t' || c == '\r' || c == '\v' || c == '\f';
}

std::string_view Trim(std::string_view text)
{
    while (!text.empty() && IsBlank(text.front())) {
        text.remove_prefix(1);
    }
    while (!text.empty() && IsBlank(text.back())) {
        text.remove_suffix(1);
    }
    return text;
}

char LowerAscii(char c)
{
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

bool EqualNoCase(std::string_view a, std::string_view b)
{
    if (a.size() != b.size()) {
        return false;
    }
    for (std::size_t i = 0; i < a.size(); ++i) {
        if (LowerAscii(a[i]) != LowerAscii(b[i])) {
            return false;
        }
    }
    return true;
}

std::string_view Unquote(std::string_view value)
{
    if (value.size() >= 2 && (value.front() == '"' || value.front() == '\'') &&
        value.back() == value.front()) {
        return value.substr(1, value.size() - 2);
    }
    return value;
}

// Copies text cut to the buffer, terminator included; returns the characters copied.
std::uint32_t CopyCut(std::string_view text, char* buffer, std::uint32_t size)
{
    if (buffer == nullptr || size == 0) {
        return 0;
    }
    // A zero byte (a binary file) ends the text, as it would for any reader of the result.
    text = text.substr(0, text.find('\0'));
    const std::size_t count = text.size() < size - 1 ? text.size() : size - 1;
    std::memcpy(buffer, text.data(), count);
    buffer[count] = '\0';
    return static_cast<std::uint32_t>(count);
}

// Copies a list of zero-ended names and its closing empty name. A list that does not fit
// is cut and still closed by two zeros, so a reader walking it always finds the end.
std::uint32_t CopyList(const std::string& list, char* buffer, std::uint32_t size)
{
    if (buffer == nullptr || size == 0) {
        return 0;
    }
    if (list.size() + 1 <= size) {
        std::memcpy(buffer, list.data(), list.size());
        buffer[list.size()] = '\0';
        return static_cast<std::uint32_t>(list.size());
    }
    if (size == 1) {
        buffer[0] = '\0';
        return 0;
    }
    std::memcpy(buffer, list.data(), size - 2);
    buffer[size - 2] = '\0';
    buffer[size - 1] = '\0';
    return size - 2;
}

// One pass over the file's lines, classifying each one.
class ProfileScanner {
public:
    explicit ProfileScanner(const std::string& path) : stream_(path, std::ios::binary) {}

    bool isOpen() const { return stream_.is_open(); }

    enum class Kind { Section, Entry, End };

    // Skips blank, comment and malformed lines. For a section, name is its name; for an
    // entry, name and value are the key and its unquoted value.
    Kind next(std::string_view& name, std::string_view& value)
    {
        while (std::getline(stream_, line_)) {
            std::string_view text(line_);
            if (first_) {
                first_ = false;
                if (text.substr(0, 3) == "\xEF\xBB\xBF") {
                    text.remove_prefix(3);
                }
            }
            text = Trim(text);
            if (text.empty() || text.front() == ';') {
                continue;
            }
            if (text.front() == '[') {
                text.remove_prefix(1);
                const std::size_t close = text.find(']');
                name = Trim(close == std::string_view::npos ? text : text.substr(0, close));
                return Kind::Section;
            }
            const std::size_t equals = text.find('=');
            if (equals == std::string_view::npos) {
                continue;
            }
            name = Trim(text.substr(0, equals));
            value = Unquote(Trim(text.substr(equals + 1)));
            return Kind::Entry;
        }
        return Kind::End;
    }

private:
    std::ifstream stream_;
    std::string line_;
    bool first_ = true;
};

std::uint32_t ReadSectionNames(ProfileScanner& scanner, char* buffer, std::uint32_t size)
{
    std::vector<std::string> names;
    std::string list;
    std::string_view name;
    std::string_view value;
    for (auto kind = scanner.next(name, value); kind != ProfileScanner::Kind::End;
         kind = scanner.next(name, value)) {
        // An empty name would end the list early.
        name = name.substr(0, name.find('\0'));
        if (kind != ProfileScanner::Kind::Section || name.empty()) {
            continue;
        }
        bool known = false;
        for (const std::string& seen : names) {
            known = known || EqualNoCase(seen, name);
        }
        if (!known) {
            names.emplace_back(name);
            list.append(name);
            list.push_back('\0');
        }
    }
    return CopyList(list, buffer, size);
}

} // namespace

std::string ResolveProfilePath(const char* path)
{
    if (path == nullptr || *path == '\0') {
        return {};
    }
    if (std::strchr(path, '/') != nullptr) {
        return path;
    }
    const char* config = std::getenv("XDG_CONFIG_HOME");
    // A relative XDG_CONFIG_HOME is invalid by the XDG rules and is ignored.
    if (config != nullptr && config[0] == '/') {
        std::string directory(config);
        if (directory.back() != '/') {
            directory += '/';
        }
        return directory + "harbor/" + path;
    }
    const char* home = std::getenv("HOME");
    if (home == nullptr || *home == '\0') {
        return {};
    }
    std::string directory(home);
    if (directory.back() != '/') {
        directory += '/';
    }
    return directory + ".config/harbor/" + path;
}

std::uint32_t ReadProfileString(const char* section, const char* key, const char* defaultValue,
                                char* buffer, std::uint32_t size, const char* path)
{
    if (buffer == nullptr || size == 0) {
        return 0;
    }
    ProfileScanner scanner(ResolveProfilePath(path));

    if (section == nullptr) {
        return scanner.isOpen() ? ReadSectionNames(scanner, buffer, size)
                                : CopyList({}, buffer, size);
    }

    std::string keyList;
    std::vector<std::string> keysSeen;
    bool inSection = false;
    std::string_view name;
    std::string_view value;
    if (scanner.isOpen()) {
        for (auto kind = scanner.next(name, value); kind != ProfileScanner::Kind::End;
             kind = scanner.next(name, value)) {
            if (kind == ProfileScanner::Kind::Section) {
                // Only the first section of a name counts; its duplicates are not read.
                if (inSection) {
                    break;
                }
                inSection = EqualNoCase(name, section);
                continue;
            }
            if (!inSection) {
                continue;
            }
            if (key != nullptr) {
                if (EqualNoCase(name, key)) {
                    return CopyCut(value, buffer, size);
                }
                continue;
            }
            // An empty name would end the list early.
            name = name.substr(0, name.find('\0'));
            if (name.empty()) {
                continue;
            }
            bool known = false;
            for (const std::string& seen : keysSeen) {
                known = known || EqualNoCase(seen, name);
            }
            if (!known) {
                keysSeen.emplace_back(name);
                keyList.append(name);
                keyList.push_back('\0');
            }
        }
    }

    if (key == nullptr) {
        return CopyList(keyList, buffer, size);
    }
    // As the platform's reading does, blanks at the end of the default are dropped.
    std::string_view fallback(defaultValue != nullptr ? defaultValue : "");
    while (!fallback.empty() && IsBlank(fallback.back())) {
        fallback.remove_suffix(1);
    }
    return CopyCut(fallback, buffer, size);
}

} // namespace platform
