#include "workspace/Directory.h"

#include <cstdlib>
#include <cstring>
#include <new>

namespace {

Directory* AsDirectory(DirEnt* entry)
{
    return entry != nullptr && entry->isDirectory() ? dynamic_cast<Directory*>(entry) : nullptr;
}

// An entry that a failed operation could not link and that nobody holds would be lost: it goes
// now. A held entry keeps its count, since the pair below leaves it as it was.
void DisposeIfUnheld(DirEnt* entry)
{
    if (entry != nullptr) {
        entry->addRef();
        entry->release();
    }
}

const char* SkipSlashes(const char* cursor)
{
    while (*cursor == '/') {
        ++cursor;
    }
    return cursor;
}

} // namespace

Directory::Directory()
{
    slots_ = static_cast<DirLink**>(std::calloc(kInitialSlots, sizeof(DirLink*)));
    // Without memory for the table the directory starts with none; reserve() retries later.
    slotCount_ = slots_ != nullptr ? kInitialSlots : 0;
}

Directory::~Directory()
{
    // release() empties the table before it destroys; links are left only when a directory is
    // destroyed some other way, and their references must not be lost then either.
    for (std::int32_t index = 0; index < slotCount_; ++index) {
        DirLink* linkHere = slots_[index];
        if (linkHere == nullptr) {
            continue;
        }
        slots_[index] = nullptr;
        if (linkHere->entry->parent() == this) {
            linkHere->entry->setParent(nullptr);
        }
        linkHere->entry->release();
        std::free(linkHere->name);
        std::free(linkHere);
    }
    std::free(slots_);
}

bool Directory::isDirectory()
{
    return true;
}

DirEnt* Directory::clone()
{
    auto* copy = new (std::nothrow) Directory();
    if (copy == nullptr) {
        return nullptr;
    }
    bool complete = copy->reserve(slotCount_);
    for (std::int32_t index = 0; complete && index < slotCount_; ++index) {
        const DirLink* linkHere = slots_[index];
        if (linkHere != nullptr) {
            complete = copy->link(index, linkHere->name, linkHere->nameLength, linkHere->entry);
        }
    }
    if (!complete) {
        DisposeIfUnheld(copy);
        return nullptr;
    }
    return copy;
}

std::int32_t Directory::ownChildCount() const
{
    // Distinct entries whose parent this is: an entry linked twice here holds one back
    // reference, not two.
    std::int32_t count = 0;
    for (std::int32_t index = 0; index < slotCount_; ++index) {
        const DirLink* linkHere = slots_[index];
        if (linkHere == nullptr || linkHere->entry->parent() != this) {
            continue;
        }
        bool seenBefore = false;
        for (std::int32_t earlier = 0; earlier < index && !seenBefore; ++earlier) {
            seenBefore = slots_[earlier] != nullptr && slots_[earlier]->entry == linkHere->entry;
        }
        if (!seenBefore) {
            ++count;
        }
    }
    return count;
}

DirEnt* Directory::release()
{
    if (refCount_ - 1 != ownChildCount()) {
        --refCount_;
        return this;
    }
    // Only the back references of the children are left: take the directory apart. Each
    // removal drops the back reference of a child whose parent this was.
    for (std::int32_t index = 0; index < slotCount_; ++index) {
        if (slots_[index] != nullptr) {
            removeAt(index);
        }
    }
    --refCount_;
    delete this;
    return nullptr;
}

ReaderWriter* Directory::open(std::int32_t)
{
    return nullptr;
}

std::int32_t Directory::component(const char*& cursor)
{
    const char* at = cursor;
    if (*at == '\0') {
        return slotCount_;
    }
    if (*at == '/') {
        cursor = SkipSlashes(at);
        return kRoot;
    }
    if (at[0] == '.') {
        if (at[1] == '\0' || at[1] == '/') {
            cursor = SkipSlashes(at + 1);
            return kCurrent;
        }
        if (at[1] == '.' && (at[2] == '\0' || at[2] == '/')) {
            cursor = SkipSlashes(at + 2);
            return kParent;
        }
    }
    // An ordinary name, compared in place with every link's name.
    const std::size_t length = std::strcspn(at, "/");
    for (std::int32_t index = 0; index < slotCount_; ++index) {
        const DirLink* linkHere = slots_[index];
        if (linkHere != nullptr && linkHere->nameLength == length &&
            std::memcmp(linkHere->name, at, length) == 0) {
            cursor = SkipSlashes(at + length);
            return index;
        }
    }
    return slotCount_;
}

std::int32_t Directory::walk(const char*& cursor)
{
    std::int32_t result = component(cursor);
    while (result == kCurrent && *cursor != '\0') {
        result = component(cursor);
    }
    return result;
}

std::int32_t Directory::nextComponent(const char** cursor)
{
    if (cursor == nullptr || *cursor == nullptr) {
        return slotCount_;
    }
    return component(*cursor);
}

DirEnt* Directory::find(const char* path)
{
    if (path == nullptr) {
        return nullptr;
    }
    // A loop rather than one call per component, so that a path of any length cannot run the
    // stack dry.
    Directory* directory = this;
    const char* cursor = path;
    for (;;) {
        if (*cursor == '\0') {
            return directory;
        }
        const std::int32_t result = directory->walk(cursor);
        if (result == kRoot) {
            DirEnt* top = directory->root();
            directory = AsDirectory(top);
            if (directory == nullptr) {
                return *cursor == '\0' ? top : nullptr;
            }
        } else if (result == kParent) {
            directory = directory->parent_;
            if (directory == nullptr) {
                return nullptr;
            }
        } else if (result == kCurrent) {
            return directory;
        } else if (result >= directory->slotCount_) {
            return nullptr;
        } else {
            DirEnt* entry = directory->slots_[result]->entry;
            if (*cursor == '\0') {
                return entry;
            }
            directory = AsDirectory(entry);
            if (directory == nullptr) {
                return nullptr;
            }
        }
    }
}

std::int32_t Directory::depth() const
{
    std::int32_t levels = 0;
    for (const Directory* up = parent_; up != nullptr; up = up->parent_) {
        ++levels;
    }
    return levels;
}

bool Directory::reaches(Directory* target)
{
    return target == this || findParentOf(target) != nullptr;
}

DirEnt* Directory::insert(const char* path, DirEnt* entry)
{
    DirEnt* linked = insertLinked(path, entry);
    if (linked == nullptr) {
        // May destroy this very directory when it is the unheld entry: nothing follows.
        DisposeIfUnheld(entry);
    }
    return linked;
}

DirEnt* Directory::insertLinked(const char* path, DirEnt* entry)
{
    if (path == nullptr || entry == nullptr || *path == '\0') {
        return nullptr;
    }
    Directory* directory = this;
    const char* cursor = path;
    for (;;) {
        // Nothing left to name the entry: "/", "..", "a/.." and the like.
        if (*cursor == '\0') {
            return nullptr;
        }
        const std::int32_t result = directory->walk(cursor);
        if (result == kRoot) {
            directory = AsDirectory(directory->root());
            if (directory == nullptr) {
                return nullptr;
            }
        } else if (result == kParent) {
            directory = directory->parent_;
            if (directory == nullptr) {
                return nullptr;
            }
        } else if (result == kCurrent) {
            return nullptr;
        } else if (result < directory->slotCount_) {
            // An existing link is never replaced; it can only lead further down.
            if (*cursor == '\0') {
                return nullptr;
            }
            directory = AsDirectory(directory->slots_[result]->entry);
            if (directory == nullptr) {
                return nullptr;
            }
        } else {
            // A new name. Linking a directory below itself would make a cycle that no lookup,
            // path or release could leave again.
            Directory* entryDirectory = AsDirectory(entry);
            if (entryDirectory != nullptr && entryDirectory->reaches(directory)) {
                return nullptr;
            }
            std::int32_t free = directory->lowestFreeSlot(0);
            if (free == directory->slotCount_ &&
                !directory->reserve(directory->slotCount_ + kGrowth)) {
                return nullptr;
            }
            const char* name = cursor;
            const std::size_t length = std::strcspn(cursor, "/");
            cursor = SkipSlashes(cursor + length);
            if (*cursor == '\0') {
                return directory->link(free, name, length, entry) ? entry : nullptr;
            }
            if (directory->depth() + 1 >= kMaxDepth) {
                return nullptr;
            }
            auto* created = new (std::nothrow) Directory();
            if (created == nullptr) {
                return nullptr;
            }
            if (!directory->link(free, name, length, created)) {
                DisposeIfUnheld(created);
                return nullptr;
            }
            directory = created;
        }
    }
}

bool Directory::remove(const char* path)
{
    if (path == nullptr || *path == '\0') {
        return false;
    }
    Directory* directory = this;
    const char* cursor = path;
    for (;;) {
        if (*cursor == '\0') {
            return false;
        }
        const std::int32_t result = directory->walk(cursor);
        if (result == kRoot) {
            directory = AsDirectory(directory->root());
            if (directory == nullptr) {
                return false;
            }
        } else if (result == kParent) {
            directory = directory->parent_;
            if (directory == nullptr) {
                return false;
            }
        } else if (result == kCurrent || result >= directory->slotCount_) {
            return false;
        } else if (*cursor == '\0') {
            return directory->removeAt(result);
        } else {
            directory = AsDirectory(directory->slots_[result]->entry);
            if (directory == nullptr) {
                return false;
            }
        }
    }
}

bool Directory::reserve(std::int32_t count)
{
    if (count <= slotCount_) {
        return true;
    }
    auto* grown = static_cast<DirLink**>(
        std::realloc(slots_, static_cast<std::size_t>(count) * sizeof(DirLink*)));
    if (grown == nullptr) {
        return false;
    }
    for (std::int32_t index = slotCount_; index < count; ++index) {
        grown[index] = nullptr;
    }
    slots_ = grown;
    slotCount_ = count;
    return true;
}

bool Directory::setSlot(std::int32_t index, const char* name, DirEnt* entry)
{
    if (name == nullptr) {
        return false;
    }
    return link(index, name, std::strlen(name), entry);
}

bool Directory::link(std::int32_t index, const char* name, std::size_t length, DirEnt* entry)
{
    if (index < 0 || index >= slotCount_ || slots_[index] != nullptr || entry == nullptr ||
        length == 0) {
        return false;
    }
    auto* created = static_cast<DirLink*>(std::malloc(sizeof(DirLink)));
    auto* copy = static_cast<char*>(std::malloc(length + 1));
    if (created == nullptr || copy == nullptr) {
        std::free(created);
        std::free(copy);
        return false;
    }
    std::memcpy(copy, name, length);
    copy[length] = '\0';
    created->name = copy;
    created->entry = entry;
    created->nameLength = length;
    slots_[index] = created;
    entry->addRef();
    if (entry->parent() == nullptr) {
        entry->setParent(this);
        addRef();
    }
    return true;
}

std::int32_t Directory::lowestFreeSlot(std::int32_t from) const
{
    std::int32_t index = from < 0 ? 0 : from;
    while (index < slotCount_ && slots_[index] != nullptr) {
        ++index;
    }
    return index;
}

bool Directory::removeAt(std::int32_t index)
{
    if (index < 0 || index >= slotCount_ || slots_[index] == nullptr) {
        return false;
    }
    DirLink* linkHere = slots_[index];
    slots_[index] = nullptr;
    DirEnt* entry = linkHere->entry;
    std::free(linkHere->name);
    std::free(linkHere);

    if (entry->parent() != this) {
        entry->release();
        return true;
    }
    // The back reference goes without the take-apart test of release(): a directory that nobody
    // else holds must not destroy itself in the middle of its own operation. It is then unheld,
    // as a new directory is.
    --refCount_;
    // Another directory still linking the entry becomes its parent, so that its name and path
    // stay meaningful.
    Directory* top = AsDirectory(root());
    Directory* other = top != nullptr ? top->findParentOf(entry) : nullptr;
    if (other != nullptr) {
        entry->setParent(other);
        other->addRef();
        entry->release();
        return true;
    }
    // Without another link the entry keeps this directory as parent while it is released, so
    // that a directory taken apart by that release still searches the whole tree for other
    // links of its own children (its root() is then the real top, not itself). An entry that
    // survives, held elsewhere, is left without parent.
    if (entry->release() != nullptr) {
        entry->setParent(nullptr);
    }
    return true;
}

const char* Directory::nameOf(DirEnt* entry)
{
    for (std::int32_t index = 0; index < slotCount_; ++index) {
        if (slots_[index] != nullptr && slots_[index]->entry == entry) {
            return slots_[index]->name;
        }
    }
    return nullptr;
}

Directory* Directory::findParentOf(DirEnt* entry)
{
    for (std::int32_t index = 0; index < slotCount_; ++index) {
        const DirLink* linkHere = slots_[index];
        if (linkHere == nullptr) {
            continue;
        }
        if (linkHere->entry == entry) {
            return this;
        }
        Directory* below = AsDirectory(linkHere->entry);
        if (below != nullptr) {
            if (Directory* found = below->findParentOf(entry)) {
                return found;
            }
        }
    }
    return nullptr;
}

DirEnt* Directory::next(std::int32_t* index, const char** name)
{
    if (index == nullptr) {
        return nullptr;
    }
    std::int32_t at = *index < 0 ? 0 : *index;
    while (at < slotCount_ && slots_[at] == nullptr) {
        ++at;
    }
    if (at >= slotCount_) {
        *index = at;
        return nullptr;
    }
    if (name != nullptr) {
        *name = slots_[at]->name;
    }
    *index = at + 1;
    return slots_[at]->entry;
}

Directory* Directory::copyFrom(Directory* source)
{
    if (source == nullptr) {
        return this;
    }
    // Copying a tree into a part of itself would copy its own copies without end.
    if (source->reaches(this)) {
        return nullptr;
    }
    std::int32_t free = 0;
    for (std::int32_t index = 0; index < source->slotCount_; ++index) {
        const DirLink* linkHere = source->slots_[index];
        if (linkHere == nullptr) {
            continue;
        }
        free = lowestFreeSlot(free);
        if (free == slotCount_ && !reserve(slotCount_ + kGrowth)) {
            return nullptr;
        }
        Directory* sourceDirectory = AsDirectory(linkHere->entry);
        if (sourceDirectory == nullptr) {
            DirEnt* copy = linkHere->entry->clone();
            if (copy == nullptr) {
                return nullptr;
            }
            if (!link(free, linkHere->name, linkHere->nameLength, copy)) {
                DisposeIfUnheld(copy);
                return nullptr;
            }
        } else {
            auto* copy = new (std::nothrow) Directory();
            if (copy == nullptr) {
                return nullptr;
            }
            if (!link(free, linkHere->name, linkHere->nameLength, copy)) {
                DisposeIfUnheld(copy);
                return nullptr;
            }
            if (copy->copyFrom(sourceDirectory) == nullptr) {
                return nullptr;
            }
        }
    }
    return this;
}
