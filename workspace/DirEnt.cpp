// Base behaviour of every workspace entry.
#include "tessel/DirEnt.h"

#include <cassert>
#include <cstdlib>
#include <cstring>

#include "tessel/ReaderWriter.h"
#include "workspace/Directory.h"
#include "workspace/LiveObjects.h"

DirEnt::DirEnt()
{
    workspace::detail::CountCreated();
}

DirEnt::~DirEnt()
{
    // Entries die only through release(); a count left over means a holder still points here.
    assert(refCount_ == 0);
    workspace::detail::CountDestroyed();
}

bool DirEnt::isDirectory()
{
    return false;
}

DirEnt* DirEnt::addRef()
{
    ++refCount_;
    return this;
}

DirEnt* DirEnt::release()
{
    if (--refCount_ == 0) {
        delete this;
        return nullptr;
    }
    return this;
}

ReaderWriter* DirEnt::insertAndOpen(const char* path, DirEnt* entry, std::int32_t type)
{
    DirEnt* linked = insert(path, entry);
    return linked != nullptr ? linked->open(type) : nullptr;
}

DirEnt* DirEnt::find(const char* path)
{
    return parent_ != nullptr ? parent_->find(path) : nullptr;
}

DirEnt* DirEnt::insert(const char* path, DirEnt* entry)
{
    if (parent_ != nullptr) {
        return parent_->insert(path, entry);
    }
    // Nothing to link into. An entry nobody holds would be lost, so it goes now; a held one
    // keeps its count (the addRef/release pair leaves it untouched).
    if (entry != nullptr) {
        entry->addRef();
        entry->release();
    }
    return nullptr;
}

bool DirEnt::remove(const char* path)
{
    return parent_ != nullptr && parent_->remove(path);
}

std::int32_t DirEnt::refCount()
{
    return refCount_;
}

Directory* DirEnt::parent()
{
    return parent_;
}

const char* DirEnt::name()
{
    return parent_ != nullptr ? parent_->nameOf(this) : nullptr;
}

const char* DirEnt::fileName()
{
    return "";
}

char* DirEnt::path()
{
    // First the length: one "/" plus the name for every entry that has a parent.
    std::size_t total = 0;
    for (DirEnt* entry = this; entry->parent_ != nullptr; entry = entry->parent_) {
        const char* part = entry->name();
        total += (part != nullptr ? std::strlen(part) : 0) + 1;
    }
    char* result = static_cast<char*>(std::malloc(total + 1));
    if (result == nullptr) {
        return nullptr;
    }
    result[total] = '\0';
    // Then fill from the end, so the topmost directory's child comes first.
    std::size_t end = total;
    for (DirEnt* entry = this; entry->parent_ != nullptr; entry = entry->parent_) {
        const char* part = entry->name();
        const std::size_t length = part != nullptr ? std::strlen(part) : 0;
        end -= length;
        if (length > 0) {
            std::memcpy(result + end, part, length);
        }
        result[--end] = '/';
    }
    return result;
}

DirEnt* DirEnt::root()
{
    DirEnt* entry = this;
    while (entry->parent_ != nullptr) {
        entry = entry->parent_;
    }
    return entry;
}
