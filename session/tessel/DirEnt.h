// An entry of the script workspace tree: a file or a directory.
//
// Part of the library boundary. The brick library calls these operations through the
// virtual table, so their order below is an ABI shared with every library build:
// never reorder, insert or remove a virtual operation. Data members keep their order too.
//
// Reference counting: a new entry starts at 0 and belongs to its first holder (a directory
// link or the session's root pointer), which calls addRef(). release() destroys the entry
// when the count reaches 0 and then returns null. Counts are plain integers: the workspace
// is used from one thread only.
//
// The base behaviour of each operation is implemented by the client's workspace library;
// a library module only calls through the table and never constructs entries.
#pragma once

#include <cstdint>

class Directory;
class ReaderWriter;

class DirEnt {
public:
    DirEnt(const DirEnt&) = delete;
    DirEnt& operator=(const DirEnt&) = delete;

    /* 0 */ virtual ~DirEnt();
    /* 1 */ virtual bool isDirectory();
    // A new entry of the same kind, count 0 and no parent, sharing or copying the content;
    // null when memory is exhausted.
    /* 2 */ virtual DirEnt* clone() = 0;
    /* 3 */ virtual DirEnt* addRef();
    /* 4 */ virtual DirEnt* release();
    // insert(path, entry), then open(type) on what was linked; null when either fails.
    /* 5 */ virtual ReaderWriter* insertAndOpen(const char* path, DirEnt* entry, std::int32_t type);
    // A new handle with count 1 on this entry, or null (directories, exhausted memory).
    /* 6 */ virtual ReaderWriter* open(std::int32_t type) = 0;
    // The base asks the parent directory, so a path given to a file is resolved beside it.
    /* 7 */ virtual DirEnt* find(const char* path);
    /* 8 */ virtual DirEnt* insert(const char* path, DirEnt* entry);
    /* 9 */ virtual bool remove(const char* path);
    /* 10 */ virtual std::int32_t refCount();
    /* 11 */ virtual Directory* parent();
    // The name under which the parent holds this entry; null without a parent. Not a copy.
    /* 12 */ virtual const char* name();
    // The host file behind the entry; "" for everything but disk entries.
    /* 13 */ virtual const char* fileName();
    // A new absolute workspace path ("/Script/Temp/source.txt"; "" for the topmost entry),
    // allocated with std::malloc: the caller frees it with std::free. Null when out of memory.
    /* 14 */ virtual char* path();
    /* 15 */ virtual DirEnt* root();

    // Set by the directory that first links this entry (its primary parent).
    void setParent(Directory* directory) { parent_ = directory; }

protected:
    // Out of line so that the workspace can count live entries.
    DirEnt();

    std::int32_t refCount_ = 0;
    Directory* parent_ = nullptr;
};
