#include "tools/ScratchFile.h"

#include <new>

#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace tools {

ReaderWriter* NewScratchFile(std::int32_t type)
{
    // Each object is held for a moment while the next one is made, so that a failure
    // anywhere frees whatever was made before it.
    MemoryBlock* block = new (std::nothrow) MemoryBlock();
    if (block == nullptr) {
        return nullptr;
    }
    block->addRef();
    DirEnt* entry = new (std::nothrow) MemoryEntry(block);
    block->release();
    if (entry == nullptr) {
        return nullptr;
    }
    entry->addRef();
    ReaderWriter* handle = entry->open(type);
    // The handle holds the entry from now on; without a handle this frees it.
    entry->release();
    return handle;
}

} // namespace tools
