// Reading the settings file, a file in the Windows profile (INI) format, with the
// semantics of GetPrivateProfileStringA.
//
// Lines are "[section]" headers and "key=value" entries; lines starting with ";" are
// comments. Section and key names match without regard to letter case; blanks around names
// and values are trimmed and a value's surrounding pair of matching quotes (" or ') is
// removed. When a section or a key occurs twice, the first occurrence wins. Lines may be of
// any length; bytes the format does not expect (a binary file) give odd names or values,
// never a failure.
#pragma once

#include <cstdint>
#include <string>

namespace platform {

// Reads one value into buffer, or the default when the file, the section or the key is
// missing; a null default counts as "". The text is cut to the buffer, terminator included.
// Returns the number of characters copied, without the terminator.
//
// With a null key, fills the buffer with the key names of the section, each ended by a zero
// character and the list ended by an empty name; a list longer than the buffer is cut, and
// still ends with two zero characters. Returns the length without the final zero (size - 2
// when cut). With a null section too, lists the section names the same way.
//
// A path without a directory is looked up in the user's configuration directory
// ($XDG_CONFIG_HOME/harbor/, by default ~/.config/harbor/).
std::uint32_t ReadProfileString(const char* section, const char* key, const char* defaultValue,
                                char* buffer, std::uint32_t size, const char* path);

// Where a settings file named by path is read from (see above); "" when a directory-less
// name cannot be placed because neither XDG_CONFIG_HOME nor HOME is set.
std::string ResolveProfilePath(const char* path);

} // namespace platform
