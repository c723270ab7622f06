// Shared fixture of the workspace suites: every test must leave no workspace object alive.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <string>

#include "tessel/ReaderWriter.h"
#include "workspace/Directory.h"
#include "workspace/LiveObjects.h"

namespace workspace_test {

// The path of an entry or handle as a std::string (the malloc'd buffer freed here).
template <typename Holder> std::string PathOf(Holder* holder)
{
    char* path = holder->path();
    std::string result = path != nullptr ? path : "<null>";
    std::free(path);
    return result;
}

inline std::int32_t Put(ReaderWriter* handle, const std::string& bytes)
{
    return handle->write(bytes.data(), static_cast<std::int32_t>(bytes.size()));
}

// Up to count bytes read from the handle, with a guard byte to catch a read past the count.
inline std::string Take(ReaderWriter* handle, std::int32_t count)
{
    const std::size_t room = static_cast<std::size_t>(count > 0 ? count : 0);
    std::string bytes(room + 1, '~');
    const std::int32_t got = handle->read(bytes.data(), count);
    EXPECT_EQ(bytes[room], '~') << "read past its count";
    bytes.resize(static_cast<std::size_t>(got > 0 ? got : 0));
    return bytes;
}

class WorkspaceTest : public ::testing::Test {
protected:
    void SetUp() override { baseline_ = workspace::LiveObjectCount(); }
    void TearDown() override
    {
        EXPECT_EQ(workspace::LiveObjectCount(), baseline_) << "workspace objects left alive";
    }

    std::int64_t live() const { return workspace::LiveObjectCount() - baseline_; }

private:
    std::int64_t baseline_ = 0;
};

} // namespace workspace_test
