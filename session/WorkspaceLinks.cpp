#include "session/WorkspaceLinks.h"

#include "tessel/DirEnt.h"
#include "workspace/MemoryBlock.h"

namespace session {

DirEnt* InsertNew(DirEnt* root, const char* path, DirEnt* entry)
{
    if (entry == nullptr) {
        return nullptr;
    }
    if (root == nullptr) {
        entry->addRef();
        entry->release();
        return nullptr;
    }
    // The tree destroys an entry of count 0 that it refuses, so nothing is left to free.
    return root->insert(path, entry);
}

void DisposeBlock(MemoryBlock* block)
{
    if (block != nullptr && block->refCount() == 0) {
        block->addRef();
        block->release();
    }
}

} // namespace session
