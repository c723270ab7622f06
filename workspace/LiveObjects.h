// How many workspace objects (entries, handles, memory blocks) are alive right now.
//
// Every constructor of those kinds counts up and every destructor counts down, so a test can
// prove that releasing a tree left nothing behind. The count is shared by all threads.
#pragma once

#include <cstdint>

namespace workspace {

std::int64_t LiveObjectCount();

namespace detail {
void CountCreated();
void CountDestroyed();
} // namespace detail

} // namespace workspace
