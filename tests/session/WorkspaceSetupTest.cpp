#include "SessionFixture.h"
#include "workspace/Directory.h"

namespace {

constexpr const char* kWorkingFiles[] = {"source.txt", "object.txt",  "result.txt", "opal.txt",
                                         "temp.tmp",   "context.txt", "symtab.txt", "firmware.txt"};

class WorkspaceSetup : public SessionTest {};

TEST_F(WorkspaceSetup, MemoryModeMakesTheEightFilesUnderTempAndDiskModeMountsThem)
{
    BrickSession& s = open();
    EXPECT_TRUE(s.memFiles());
    for (const char* name : kWorkingFiles) {
        DirEnt* entry = find((std::string("/Script/Temp/") + name).c_str());
        ASSERT_NE(entry, nullptr) << name;
        EXPECT_STREQ(entry->fileName(), "") << name;
    }
    EXPECT_EQ(s.sourceEntry(), find("/Script/Temp/source.txt"));
    EXPECT_EQ(s.objectEntry(), find("/Script/Temp/object.txt"));
    EXPECT_EQ(s.resultEntry(), find("/Script/Temp/result.txt"));
    EXPECT_EQ(s.firmwareEntry(), find("/Script/Temp/firmware.txt"));
    EXPECT_EQ(find("/Script/Include"), nullptr);

    BrickSession& d = openDisk();
    EXPECT_FALSE(d.memFiles());
    for (int i = 0; i < 7; ++i) {
        DirEnt* entry = find((std::string("/Script/Temp/") + kWorkingFiles[i]).c_str());
        ASSERT_NE(entry, nullptr) << kWorkingFiles[i];
        EXPECT_EQ(std::string(entry->fileName()), dir.path() + "tmp/" + kWorkingFiles[i]);
    }
    EXPECT_EQ(find("/Script/Temp/firmware.txt"), nullptr);
    EXPECT_EQ(d.firmwareEntry(), find("/Script/Firmware/firmware.txt"));
    EXPECT_EQ(std::string(d.firmwareEntry()->fileName()), dir.path() + "fw/firmware.txt");
    // Mounting names host files; it creates none.
    EXPECT_FALSE(std::filesystem::exists(dir.path() + "tmp/source.txt"));

    // Without PATHS the host names are bare, relative to wherever the program runs.
    BrickSession& bare = open("", "");
    EXPECT_STREQ(bare.sourceEntry()->fileName(), "source.txt");
    EXPECT_STREQ(bare.firmwareEntry()->fileName(), "firmware.txt");
}

TEST_F(WorkspaceSetup, OnlyTrueInAnyCaseSelectsMemoryMode)
{
    const struct {
        const char* value;
        bool memory;
    } cases[] = {{"TRUE", true}, {"True", true}, {"tRUE", true},   {"1", false},
                 {"yes", false}, {"", false},    {"truee", false}, {"FALSE", false}};
    for (const auto& c : cases) {
        EXPECT_EQ(open("", std::string("[DEBUG]\nMEMFILES=") + c.value + "\n").memFiles(), c.memory)
            << c.value;
    }
}

TEST_F(WorkspaceSetup, HeadersAreMountedUnderLowerCaseNamesOnly)
{
    std::filesystem::create_directories(dir.path() + "Include");
    dir.write("Include/Onyx2MLT.h", "#define ONYX 2\n");
    open("HEADERS=" + dir.path() + "Include/\n",
         "[HEADERS]\nMain=Onyx2MLT.h\nb=\nc = \"Two.H\"\n[DEBUG]\nMEMFILES=TRUE\n");
    EXPECT_EQ(find("/Script/Include/Onyx2MLT.h"), nullptr);
    DirEnt* include = find("/Script/Include/onyx2mlt.h");
    ASSERT_NE(include, nullptr);
    // The host path keeps its letters, so the file is read on a case-sensitive system.
    ReaderWriter* handle = include->open(1);
    EXPECT_EQ(contentOf(handle), "#define ONYX 2\n");
    BrickSession::ReleaseReaderWriter(&handle);
    ASSERT_NE(find("/Script/Include/two.h"), nullptr);
    EXPECT_EQ(std::string(find("/Script/Include/two.h")->fileName()), dir.path() + "Include/Two.H");
    // The empty value creates nothing.
    std::int32_t index = 0;
    int count = 0;
    while (static_cast<Directory*>(find("/Script/Include"))->next(&index, nullptr) != nullptr) {
        ++count;
    }
    EXPECT_EQ(count, 2);

    // A header list beyond the key buffer is cut, not overrun.
    std::string headers = "[HEADERS]\n";
    for (int i = 0; i < 200; ++i) {
        headers += "key" + std::to_string(i) + "=h" + std::to_string(i) + ".h\n";
    }
    open("", headers + "[DEBUG]\nMEMFILES=TRUE\n");
    EXPECT_NE(find("/Script/Include/h0.h"), nullptr);
    EXPECT_EQ(find("/Script/Include/h199.h"), nullptr);
}

TEST_F(WorkspaceSetup, SecondBuildChangesNothing)
{
    BrickSession& s = open();
    DirEnt* root = s.root();
    DirEnt* source = s.sourceEntry();
    const std::int64_t live = workspace::LiveObjectCount();
    const std::string other =
        dir.write("other.ini", "[DEBUG]\nMEMFILES=FALSE\n[HEADERS]\nx=extra.h\n");
    EXPECT_FALSE(s.BuildWorkspace(other.c_str()));
    EXPECT_EQ(s.root(), root);
    EXPECT_EQ(s.sourceEntry(), source);
    EXPECT_TRUE(s.memFiles());
    EXPECT_EQ(find("/Script/Include/extra.h"), nullptr);
    EXPECT_EQ(workspace::LiveObjectCount(), live);
}

TEST_F(WorkspaceSetup, LinkingFilesLowerCasesDiskNamesAndRefusesTakenOrEmptyNames)
{
    BrickSession& s = open();
    DirEnt* disk = s.MountDiskFile("Data.TXT", "/Host/Dir", "/Extra/");
    ASSERT_NE(disk, nullptr);
    EXPECT_EQ(find("/Extra/data.txt"), disk);
    EXPECT_STREQ(disk->fileName(), "/Host/DirData.TXT");
    DirEnt* memory = s.CreateMemoryFile("Notes.TXT", "/Extra/");
    ASSERT_NE(memory, nullptr);
    EXPECT_EQ(find("/Extra/Notes.TXT"), memory);

    const std::int64_t live = workspace::LiveObjectCount();
    EXPECT_EQ(s.MountDiskFile("", "/Host/", "/Extra/"), nullptr);
    EXPECT_EQ(s.MountDiskFile(nullptr, "/Host/", "/Extra/"), nullptr);
    EXPECT_EQ(s.CreateMemoryFile("", "/Extra/"), nullptr);
    EXPECT_EQ(s.CreateMemoryFile("source.txt", "/Script/Temp/"), nullptr);
    EXPECT_EQ(s.MountDiskFile("source.txt", "/host/", "/Script/Temp/"), nullptr);
    EXPECT_EQ(workspace::LiveObjectCount(), live);
    EXPECT_EQ(find("/Script/Temp/source.txt"), s.sourceEntry());
}

} // namespace
