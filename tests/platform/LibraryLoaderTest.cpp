#include <dlfcn.h>
#include <gtest/gtest.h>

#include <string>

#include "platform/LibraryLoader.h"
#include "testlib/TestSupport.h"

namespace {

TEST(LibraryLoader, ResolvesDecoratedNamesThroughTheTableAndPlainSymbolsDirectly)
{
    platform::LibraryLoader loader;
    ASSERT_TRUE(loader.Load((testsupport::RecordingLibraryDirectory() + "Tessel.dll").c_str()))
        << loader.lastError();
    for (const char* name : tessel::kExportNames) {
        EXPECT_NE(loader.Resolve(name), nullptr) << name;
    }
    EXPECT_EQ(loader.Resolve("?tslNothing@@YAJXZ"), nullptr);
    void* address = loader.Resolve("testlib_plain_symbol");
    ASSERT_NE(address, nullptr);
    EXPECT_EQ(reinterpret_cast<int (*)()>(address)(), 42);

    platform::LibraryLoader bare;
    ASSERT_TRUE(bare.Load((testsupport::BareLibraryDirectory() + "Tessel.dll").c_str()));
    EXPECT_EQ(bare.Resolve(tessel::kExportNames[tessel::SlotExec]), nullptr);
    EXPECT_NE(bare.Resolve("testlib_plain_symbol"), nullptr);
}

TEST(LibraryLoader, NonLibraryMissingFileAndEmptyPathFail)
{
    testsupport::TempDirectory dir;
    const std::string junk = dir.write("Tessel.dll", "this is not a library\n");
    platform::LibraryLoader loader;
    EXPECT_FALSE(loader.Load(junk.c_str()));
    EXPECT_FALSE(loader.isLoaded());
    EXPECT_FALSE(loader.lastError().empty());
    EXPECT_EQ(loader.Resolve("anything"), nullptr);
    EXPECT_FALSE(loader.Load("/nonexistent/dir/Tessel.dll"));
    EXPECT_FALSE(loader.Load(""));
    EXPECT_FALSE(loader.Load(nullptr));
    EXPECT_FALSE(loader.Load("harbor-no-such-library.so"));
}

TEST(LibraryLoader, BareNameIsFoundBesideTheExecutable)
{
    // No system search would find this name: only the program's own folder holds it.
    const std::string beside = platform::ExecutableDirectory() + "harbor-loader-test.so";
    std::filesystem::copy_file(testsupport::RecordingLibraryDirectory() + "Tessel.dll", beside,
                               std::filesystem::copy_options::overwrite_existing);
    platform::LibraryLoader loader;
    const bool loaded = loader.Load("harbor-loader-test.so");
    std::filesystem::remove(beside);
    ASSERT_TRUE(loaded) << loader.lastError();
    EXPECT_NE(loader.Resolve("testlib_plain_symbol"), nullptr);
}

} // namespace
