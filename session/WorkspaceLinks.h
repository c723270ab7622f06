// Linking new workspace entries into the session's tree without leaking them.
#pragma once

class DirEnt;
class MemoryBlock;

namespace session {

// Links a new entry (count 0, no holder yet) under path and returns it; when the tree
// refuses the link, the entry is destroyed and the result is null.
DirEnt* InsertNew(DirEnt* root, const char* path, DirEnt* entry);

// Destroys a new memory block that no entry ended up holding.
void DisposeBlock(MemoryBlock* block);

} // namespace session
