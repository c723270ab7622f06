// A directory of the script workspace: named links to other entries, resolved by "/" paths.
//
// Names are non-empty byte strings without "/", compared byte by byte ("." and ".." are never
// names: they mean this directory and its parent; the backslash is an ordinary character).
// A new link takes the lowest free slot; the table starts with 16 slots and grows by 16.
//
// Counting: each link holds one reference of its entry. An entry first linked while it has no
// parent takes the directory as its parent, and the directory's count grows by one for that
// back reference. So a directory's count is its outside holders plus one per child whose parent
// it is; release() takes the directory apart when only those back references would be left.
//
// The first sixteen virtual operations are DirEnt's; the eight that follow are this kind's own
// and keep their order too (the brick library reaches them through the table).
#pragma once

#include <cstddef>
#include <cstdint>

#include "tessel/DirEnt.h"

struct DirLink {
    char* name;    // own copy, from std::malloc
    DirEnt* entry; // one reference held
    std::size_t nameLength;
};

class Directory : public DirEnt {
public:
    static constexpr std::int32_t kInitialSlots = 16;
    static constexpr std::int32_t kGrowth = 16;
    // nextComponent() results besides a slot index or slotCount().
    static constexpr std::int32_t kCurrent = -1;
    static constexpr std::int32_t kParent = -2;
    static constexpr std::int32_t kRoot = -3;
    // insert() creates no directory deeper than this below the topmost one, so that taking a
    // tree apart (which recurses once per level) cannot exhaust the stack.
    static constexpr std::int32_t kMaxDepth = 512;

    // Count 0, no parent, 16 free slots.
    Directory();
    // Releases the entry of every link still present, then frees the table.
    ~Directory() override;

    bool isDirectory() override;
    // A new directory with the same slots linking the same entries (each gains a reference);
    // null when memory is exhausted.
    DirEnt* clone() override;
    DirEnt* release() override;
    // Null: a directory has no handle.
    ReaderWriter* open(std::int32_t type) override;
    // The entry named by path ("" and "." give this directory, "/" the topmost), or null.
    DirEnt* find(const char* path) override;
    // Links entry under path, creating missing directories on the way; returns entry, or null.
    // On failure an entry that nobody holds (count 0) is destroyed; a held one is left alone.
    DirEnt* insert(const char* path, DirEnt* entry) override;
    // True when a link was removed.
    bool remove(const char* path) override;

    // True when the table has at least count slots afterwards; false, nothing changed, when
    // memory is exhausted.
    /* 16 */ virtual bool reserve(std::int32_t count);
    // Links entry under a copy of name in the free slot index. False, nothing changed, for an
    // index out of range, an occupied slot, an empty name, a null entry, or exhausted memory.
    /* 17 */ virtual bool setSlot(std::int32_t index, const char* name, DirEnt* entry);
    // Reads one component at *cursor: a slot index, slotCount() (path used up, or no such
    // name; cursor unchanged), kCurrent, kParent or kRoot (cursor past them and their "/").
    /* 18 */ virtual std::int32_t nextComponent(const char** cursor);
    // Removes the link in slot index; false for a free slot or an index out of range.
    /* 19 */ virtual bool removeAt(std::int32_t index);
    // The name of the lowest link to entry (not a copy), or null.
    /* 20 */ virtual const char* nameOf(DirEnt* entry);
    // The directory, searched depth-first from this one, holding a link to entry; or null.
    /* 21 */ virtual Directory* findParentOf(DirEnt* entry);
    // Enumeration: the entry of the next occupied slot at or after *index (its name in *name
    // when name is given), *index moved past it; null at the end. No reference is added.
    /* 22 */ virtual DirEnt* next(std::int32_t* index, const char** name);
    // Copies the tree below source into this directory (own directories, cloned files);
    // this directory, or null on failure or when this directory lies inside source.
    /* 23 */ virtual Directory* copyFrom(Directory* source);

    std::int32_t slotCount() const { return slotCount_; }

private:
    std::int32_t component(const char*& cursor);
    std::int32_t walk(const char*& cursor);
    bool link(std::int32_t index, const char* name, std::size_t length, DirEnt* entry);
    std::int32_t lowestFreeSlot(std::int32_t from) const;
    std::int32_t ownChildCount() const;
    std::int32_t depth() const;
    bool reaches(Directory* target);
    DirEnt* insertLinked(const char* path, DirEnt* entry);

    std::int32_t slotCount_ = 0;
    DirLink** slots_ = nullptr;
};
