#include "workspace/LiveObjects.h"

#include <atomic>

namespace workspace {
namespace {

// The one counter of live workspace objects; atomic because a test may run several sessions
// on threads of its own.
std::atomic<std::int64_t>& LiveCounter()
{
    static std::atomic<std::int64_t> counter{0};
    return counter;
}

} // namespace

std::int64_t LiveObjectCount()
{
    return LiveCounter().load(std::memory_order_relaxed);
}

namespace detail {

void CountCreated()
{
    LiveCounter().fetch_add(1, std::memory_order_relaxed);
}

void CountDestroyed()
{
    LiveCounter().fetch_sub(1, std::memory_order_relaxed);
}

} // namespace detail
} // namespace workspace
