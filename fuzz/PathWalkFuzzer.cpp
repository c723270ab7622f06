// Random sequences of find, insert, remove, copyFrom, open and release on one workspace tree,
// from paths built of a few names, ".", ".." and slashes, so that lookups collide, entries get
// shared between directories and directories get moved under each other. At the end every
// reference this target took is given back and the root released: the count of live workspace
// objects must be where it started.
#include <cstdint>
#include <cstdlib>
#include <new>
#include <string>
#include <vector>

#include "FuzzInput.h"
#include "workspace/Directory.h"
#include "workspace/LiveObjects.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

std::string MakePath(fuzz::Input& input)
{
    static const char* const kParts[] = {"a", "b",  "c",  "Script", ".", "..",
                                         "/", "//", "a/", "b/c",    "",  "\\"};
    constexpr int kPartCount = sizeof(kParts) / sizeof(kParts[0]);
    std::string path;
    const int parts = input.byte() % 6;
    for (int i = 0; i < parts; ++i) {
        path += kParts[input.byte() % kPartCount];
    }
    return path;
}

// The entry takes its own reference of the block; without an entry the block goes at once.
DirEnt* Adopt(MemoryBlock* block, DirEnt* entry)
{
    if (block != nullptr && entry == nullptr) {
        block->addRef();
        block->release();
    }
    return entry;
}

DirEnt* NewEntry(fuzz::Input& input)
{
    switch (input.byte() % 3) {
    case 0:
        return new (std::nothrow) Directory();
    case 1: {
        MemoryBlock* block = new (std::nothrow) MemoryBlock();
        return Adopt(block, block != nullptr ? new (std::nothrow) MemoryEntry(block) : nullptr);
    }
    default: {
        MemoryBlock* block = new (std::nothrow) MemoryBlock();
        return Adopt(block, block != nullptr ? new (std::nothrow) TextMemoryEntry(block) : nullptr);
    }
    }
}

struct Held {
    std::vector<DirEnt*> entries; // one reference each
    std::vector<ReaderWriter*> handles;
};

DirEnt* Pick(fuzz::Input& input, DirEnt* root, const Held& held)
{
    const std::uint8_t choice = input.byte();
    if (!held.entries.empty() && (choice & 1) != 0) {
        return held.entries[choice / 2 % held.entries.size()];
    }
    return root;
}

void Step(fuzz::Input& input, DirEnt* root, Held& held)
{
    switch (input.byte() % 10) {
    case 0: { // find, and keep what was found
        DirEnt* from = Pick(input, root, held);
        DirEnt* found = from->find(MakePath(input).c_str());
        if (found != nullptr && (input.byte() & 1) != 0) {
            held.entries.push_back(found->addRef());
        }
        break;
    }
    case 1: { // insert a new entry
        DirEnt* into = Pick(input, root, held);
        const std::string path = MakePath(input);
        if (DirEnt* entry = NewEntry(input)) {
            into->insert(path.c_str(), entry); // on failure the unheld entry is destroyed
        }
        break;
    }
    case 2: { // insert one that exists already (sharing, or moving a directory)
        DirEnt* into = Pick(input, root, held);
        DirEnt* entry = Pick(input, root, held);
        into->insert(MakePath(input).c_str(), entry);
        break;
    }
    case 3: {
        DirEnt* from = Pick(input, root, held);
        from->remove(MakePath(input).c_str());
        break;
    }
    case 4: { // copyFrom between two directories
        DirEnt* target = Pick(input, root, held);
        DirEnt* source = Pick(input, root, held);
        if (target->isDirectory() && source->isDirectory()) {
            static_cast<Directory*>(target)->copyFrom(static_cast<Directory*>(source));
        }
        break;
    }
    case 5: { // release one held reference
        if (!held.entries.empty()) {
            const std::size_t at = input.byte() % held.entries.size();
            held.entries[at]->release();
            held.entries.erase(held.entries.begin() + static_cast<std::ptrdiff_t>(at));
        }
        break;
    }
    case 6: { // insertAndOpen, keep the handle
        DirEnt* into = Pick(input, root, held);
        const std::string path = MakePath(input);
        if (DirEnt* entry = NewEntry(input)) {
            if (ReaderWriter* handle = into->insertAndOpen(path.c_str(), entry, 1)) {
                handle->write("x\n", 2);
                held.handles.push_back(handle);
            }
        }
        break;
    }
    case 7: { // close a handle
        if (!held.handles.empty()) {
            const std::size_t at = input.byte() % held.handles.size();
            held.handles[at]->release();
            held.handles.erase(held.handles.begin() + static_cast<std::ptrdiff_t>(at));
        }
        break;
    }
    case 8: { // the read-only walks
        DirEnt* entry = Pick(input, root, held);
        std::free(entry->path());
        entry->name();
        entry->parent();
        entry->root();
        if (entry->isDirectory()) {
            auto* directory = static_cast<Directory*>(entry);
            std::int32_t index = 0;
            const char* name = nullptr;
            while (directory->next(&index, &name) != nullptr) {
            }
            directory->nameOf(Pick(input, root, held));
            directory->findParentOf(Pick(input, root, held));
        }
        break;
    }
    default: { // clone a file or directory into place
        DirEnt* source = Pick(input, root, held);
        if (DirEnt* copy = source->clone()) {
            Pick(input, root, held)->insert(MakePath(input).c_str(), copy);
        }
        break;
    }
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::int64_t before = workspace::LiveObjectCount();
    {
        fuzz::Input input(data, size);
        DirEnt* root = new (std::nothrow) Directory();
        if (root == nullptr) {
            return 0;
        }
        root->addRef();
        Held held;
        for (int steps = 0; steps < 200 && !input.empty(); ++steps) {
            Step(input, root, held);
        }
        // Give everything back, the root first or last as the input says.
        const bool rootFirst = (input.byte() & 1) != 0;
        if (rootFirst) {
            root->release();
        }
        for (ReaderWriter* handle : held.handles) {
            handle->release();
        }
        for (DirEnt* entry : held.entries) {
            entry->release();
        }
        if (!rootFirst) {
            root->release();
        }
    }
    if (workspace::LiveObjectCount() != before) {
        std::abort();
    }
    return 0;
}
