#include "workspace/MemoryBlock.h"

#include <cassert>
#include <cstdlib>
#include <cstring>
#include <limits>

#include "workspace/LiveObjects.h"

namespace {

constexpr std::int64_t kMaxLength = std::numeric_limits<std::int32_t>::max();

} // namespace

MemoryBlock::MemoryBlock()
{
    workspace::detail::CountCreated();
}

MemoryBlock::~MemoryBlock()
{
    // Blocks die only through release(); a count left over means a holder still points here.
    assert(refCount_ == 0);
    std::free(data_);
    workspace::detail::CountDestroyed();
}

MemoryBlock* MemoryBlock::addRef()
{
    ++refCount_;
    return this;
}

MemoryBlock* MemoryBlock::release()
{
    if (--refCount_ == 0) {
        delete this;
        return nullptr;
    }
    return this;
}

void MemoryBlock::clear()
{
    if (data_ != nullptr && length_ > 0) {
        std::memset(data_, 0, static_cast<std::size_t>(length_));
    }
}

bool MemoryBlock::getByte(std::int32_t& position, unsigned char& byte)
{
    if (position < 0 || position >= length_) {
        return false;
    }
    byte = data_[position++];
    return true;
}

bool MemoryBlock::putByte(std::int32_t& position, unsigned char byte)
{
    if (position < 0) {
        return false;
    }
    if (position >= length_ && (position == kMaxLength || !setSize(position + 1))) {
        return false;
    }
    data_[position++] = byte;
    return true;
}

std::int32_t MemoryBlock::read(std::int32_t& position, void* buffer, std::int32_t count)
{
    if (count < 1 || buffer == nullptr || position < 0) {
        return 0;
    }
    const std::int32_t available = length_ - position;
    const std::int32_t n = count < available ? count : available;
    if (n < 1) {
        return 0;
    }
    std::memcpy(buffer, data_ + position, static_cast<std::size_t>(n));
    position += n;
    return n;
}

std::int32_t MemoryBlock::write(std::int32_t& position, const void* buffer, std::int32_t count)
{
    if (count < 1 || buffer == nullptr || position < 0) {
        return 0;
    }
    const std::int64_t end = static_cast<std::int64_t>(position) + count;
    std::int32_t n = count;
    if (end > length_) {
        // A length past the 32-bit range cannot be had, like memory that cannot be had: write
        // what fits in the present length.
        if (end <= kMaxLength) {
            setSize(static_cast<std::int32_t>(end));
        }
        n = length_ - position;
        if (n > count) {
            n = count;
        }
    }
    if (n < 1) {
        return 0;
    }
    std::memcpy(data_ + position, buffer, static_cast<std::size_t>(n));
    position += n;
    return n;
}

bool MemoryBlock::setSize(std::int32_t length)
{
    if (length < 0) {
        return false;
    }
    if (length > capacity_) {
        const std::int64_t rounded = (static_cast<std::int64_t>(length) + (kGrowthStep - 1)) &
                                     ~std::int64_t{kGrowthStep - 1};
        // The last step below 2 GiB is cut at the largest length a block can have.
        const std::int64_t newCapacity = rounded > kMaxLength ? kMaxLength : rounded;
        auto* grown =
            static_cast<unsigned char*>(std::realloc(data_, static_cast<std::size_t>(newCapacity)));
        if (grown == nullptr) {
            return false;
        }
        // Zero the new room so that bytes past the length never hold indeterminate values.
        std::memset(grown + capacity_, 0, static_cast<std::size_t>(newCapacity - capacity_));
        data_ = grown;
        capacity_ = static_cast<std::int32_t>(newCapacity);
    }
    length_ = length;
    return true;
}

std::int32_t MemoryBlock::size()
{
    return length_;
}
