// Where the running program lives.
#pragma once

#include <string>

namespace platform {

// The absolute path of the running executable; "" when the system cannot tell.
std::string ExecutablePath();

// The directory of the running executable with a trailing "/"; "" when unknown.
std::string ExecutableDirectory();

} // namespace platform
