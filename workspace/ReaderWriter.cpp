// Base behaviour of every workspace handle.
#include "tessel/ReaderWriter.h"

#include <cassert>

#include "tessel/DirEnt.h"
#include "workspace/LiveObjects.h"

ReaderWriter::ReaderWriter(DirEnt* entry, std::int32_t type) : dirEnt_(entry), type_(type)
{
    if (dirEnt_ != nullptr) {
        dirEnt_->addRef();
    }
    workspace::detail::CountCreated();
}

ReaderWriter::~ReaderWriter()
{
    // Handles die only through release(); a count left over means a holder still points here.
    assert(refCount_ == 0);
    if (dirEnt_ != nullptr) {
        dirEnt_->release();
    }
    workspace::detail::CountDestroyed();
}

DirEnt* ReaderWriter::dirEnt()
{
    return dirEnt_;
}

const char* ReaderWriter::name()
{
    return dirEnt_ != nullptr ? dirEnt_->name() : nullptr;
}

char* ReaderWriter::path()
{
    return dirEnt_ != nullptr ? dirEnt_->path() : nullptr;
}

const char* ReaderWriter::fileName()
{
    return dirEnt_ != nullptr ? dirEnt_->fileName() : "";
}

std::int32_t ReaderWriter::type()
{
    return type_;
}

std::int32_t ReaderWriter::setType(std::int32_t type)
{
    type_ = type;
    return type_;
}

ErrorValue ReaderWriter::openRead()
{
    return open("r");
}

ErrorValue ReaderWriter::openWrite()
{
    return open("w");
}
