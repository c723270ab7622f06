// Shared fixture of the workspace suites: every test must leave no workspace object alive.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <string>

#include "workspace/Directory.h"
#include "workspace/LiveObjects.h"

namespace workspace_test {

// One line per link, indented by depth, so that a failed tree assertion shows the whole tree.
inline void DescribeInto(Directory* directory, int depth, std::string& out)
{
    std::int32_t index = 0;
    const char* name = nullptr;
    while (DirEnt* entry = directory->next(&index, &name)) {
        out += std::string(static_cast<std::size_t>(depth) * 2, ' ') + name +
               (entry->isDirectory() ? "/" : "") + " (count " + std::to_string(entry->refCount()) +
               ")\n";
        if (entry->isDirectory() && entry->parent() == directory) {
            DescribeInto(static_cast<Directory*>(entry), depth + 1, out);
        }
    }
}

inline std::string DescribeTree(Directory* top)
{
    std::string out = "tree (count " + std::to_string(top->refCount()) + "):\n";
    DescribeInto(top, 1, out);
    return out;
}

// The path of an entry or handle as a std::string (the malloc'd buffer freed here).
template <typename Holder> std::string PathOf(Holder* holder)
{
    char* path = holder->path();
    std::string result = path != nullptr ? path : "<null>";
    std::free(path);
    return result;
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
