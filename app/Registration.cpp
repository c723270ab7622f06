// Registration is not available in this build: both switches say so and fail.
#include "app/Registration.h"

#include <cstdio>

namespace app {

int RegisterProgram()
{
    std::fprintf(stderr, "harbor: RegServer is not supported by this build\n");
    return 1;
}

int UnregisterProgram()
{
    std::fprintf(stderr, "harbor: UnregServer is not supported by this build\n");
    return 1;
}

} // namespace app
