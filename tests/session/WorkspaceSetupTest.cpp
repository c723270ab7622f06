#include "SessionFixture.h"
#include "workspace/Directory.h"

namespace {

constexpr const char* kWorkingFiles[] = {"source.txt", "object.txt",  "result.txt", "opal.txt",
                                         "temp.tmp",   "context.txt", "symtab.txt", "firmware.txt"};

class WorkspaceSetup : public SessionTest {};

TEST_F(WorkspaceSetup, MemoryModeCreatesTheEightWorkingFilesUnderTemp)
{
    BrickSession& s = open("", "[DEBUG]\nMEMFILES=true\n");
    EXPECT_TRUE(s.memFiles());
    for (const char* name : kWorkingFiles) {
        DirEnt* entry = find((std::string("/Script/Temp/") + name).c_str());
        ASSERT_NE(entry, nullptr) << name;
        EXPECT_STREQ(entry->fileName(), "") << name;
    }
    EXPECT_EQ(s.sourceEntry(), find("/Script/Temp/source.txt"));
    EXPECT_EQ(s.objectEntry(), find("/Script/Temp/object.txt"));
    EXPECT_EQ(s.resultEntry(), find("/Script/Temp/result.txt"));
    EXPECT_EQ(pathOf(s.firmwareEntry()), "/Script/Temp/firmware.txt");
    EXPECT_EQ(find("/Script/Firmware"), nullptr);
}

TEST_F(WorkspaceSetup, DiskModeMountsWorkingFilesFromTempAndFirmwareDirectories)
{
    BrickSession& s = openDisk();
    EXPECT_FALSE(s.memFiles());
    for (int i = 0; i < 7; ++i) {
        DirEnt* entry = find((std::string("/Script/Temp/") + kWorkingFiles[i]).c_str());
        ASSERT_NE(entry, nullptr) << kWorkingFiles[i];
        EXPECT_EQ(std::string(entry->fileName()), dir.path() + "tmp/" + kWorkingFiles[i]);
    }
    EXPECT_EQ(find("/Script/Temp/firmware.txt"), nullptr);
    EXPECT_EQ(pathOf(s.firmwareEntry()), "/Script/Firmware/firmware.txt");
    EXPECT_EQ(std::string(s.firmwareEntry()->fileName()), dir.path() + "fw/firmware.txt");
    // Mounting names host files; it creates none.
    EXPECT_FALSE(std::filesystem::exists(dir.path() + "tmp/source.txt"));
}

TEST_F(WorkspaceSetup, OnlyTrueInAnyCaseSelectsMemoryMode)
{
    for (const char* value : {"TRUE", "True", "tRUE"}) {
        EXPECT_TRUE(open("", std::string("[DEBUG]\nMEMFILES=") + value + "\n").memFiles()) << value;
    }
    for (const char* value : {"1", "yes", "", "truee", "FALSE"}) {
        EXPECT_FALSE(open("", std::string("[DEBUG]\nMEMFILES=") + value + "\n").memFiles())
            << value;
    }
    EXPECT_FALSE(open("", "").memFiles());
}

TEST_F(WorkspaceSetup, EmptyPathsMakeHostPathsRelative)
{
    BrickSession& s = open("", "");
    EXPECT_STREQ(s.sourceEntry()->fileName(), "source.txt");
    EXPECT_STREQ(s.firmwareEntry()->fileName(), "firmware.txt");
}

TEST_F(WorkspaceSetup, IncludeWithCapitalsIsFoundOnlyUnderItsLowerCaseName)
{
    std::filesystem::create_directories(dir.path() + "Include");
    dir.write("Include/Onyx2MLT.h", "#define ONYX 2\n");
    BrickSession& s = open("HEADERS=" + dir.path() + "Include/\n",
                           "[HEADERS]\nMain=Onyx2MLT.h\n[DEBUG]\nMEMFILES=TRUE\n");
    EXPECT_EQ(find("/Script/Include/Onyx2MLT.h"), nullptr);
    DirEnt* include = find("/Script/Include/onyx2mlt.h");
    ASSERT_NE(include, nullptr);
    // The host path keeps its letters, so the file is read on a case-sensitive system.
    EXPECT_EQ(std::string(include->fileName()), dir.path() + "Include/Onyx2MLT.h");
    ReaderWriter* handle = include->open(1);
    EXPECT_EQ(contentOf(handle), "#define ONYX 2\n");
    BrickSession::ReleaseReaderWriter(&handle);
    (void)s;
}

TEST_F(WorkspaceSetup, EveryHeaderIsMountedAndEmptyValuesCreateNothing)
{
    open("HEADERS=/inc/\n", "[HEADERS]\na=one.h\nb=\nc = \"Two.H\"\n[DEBUG]\nMEMFILES=TRUE\n");
    ASSERT_NE(find("/Script/Include/one.h"), nullptr);
    ASSERT_NE(find("/Script/Include/two.h"), nullptr);
    EXPECT_STREQ(find("/Script/Include/two.h")->fileName(), "/inc/Two.H");
    auto* include = static_cast<Directory*>(find("/Script/Include"));
    std::int32_t index = 0;
    int count = 0;
    while (include->next(&index, nullptr) != nullptr) {
        ++count;
    }
    EXPECT_EQ(count, 2);
}

TEST_F(WorkspaceSetup, WithoutHeadersThereIsNoIncludeDirectory)
{
    BrickSession& s = open();
    EXPECT_EQ(find("/Script/Include"), nullptr);
    EXPECT_NE(s.sourceEntry(), nullptr);
    EXPECT_NE(s.objectEntry(), nullptr);
    EXPECT_NE(s.resultEntry(), nullptr);
    EXPECT_NE(s.firmwareEntry(), nullptr);
}

TEST_F(WorkspaceSetup, SecondBuildChangesNothing)
{
    BrickSession& s = open();
    DirEnt* root = s.root();
    DirEnt* source = s.sourceEntry();
    DirEnt* firmware = s.firmwareEntry();
    const std::int64_t live = workspace::LiveObjectCount();
    const std::string other =
        dir.write("other.ini", "[DEBUG]\nMEMFILES=FALSE\n[HEADERS]\nx=extra.h\n");
    EXPECT_FALSE(s.BuildWorkspace(other.c_str()));
    EXPECT_EQ(s.root(), root);
    EXPECT_EQ(s.sourceEntry(), source);
    EXPECT_EQ(s.firmwareEntry(), firmware);
    EXPECT_TRUE(s.memFiles());
    EXPECT_EQ(find("/Script/Include/extra.h"), nullptr);
    EXPECT_EQ(workspace::LiveObjectCount(), live);
}

TEST_F(WorkspaceSetup, MountDiskFileJoinsPlainlyAndLowerCasesTheName)
{
    BrickSession& s = open();
    DirEnt* entry = s.MountDiskFile("Data.TXT", "/Host/Dir", "/Extra/");
    ASSERT_NE(entry, nullptr);
    EXPECT_EQ(find("/Extra/data.txt"), entry);
    EXPECT_STREQ(entry->fileName(), "/Host/DirData.TXT");
    EXPECT_EQ(s.MountDiskFile("", "/Host/", "/Extra/"), nullptr);
    EXPECT_EQ(s.MountDiskFile(nullptr, "/Host/", "/Extra/"), nullptr);
}

TEST_F(WorkspaceSetup, CreateMemoryFileKeepsLetterCase)
{
    BrickSession& s = open();
    DirEnt* entry = s.CreateMemoryFile("Notes.TXT", "/Extra/");
    ASSERT_NE(entry, nullptr);
    EXPECT_EQ(find("/Extra/Notes.TXT"), entry);
    EXPECT_EQ(find("/Extra/notes.txt"), nullptr);
    EXPECT_EQ(s.CreateMemoryFile("", "/Extra/"), nullptr);
}

TEST_F(WorkspaceSetup, RefusedLinkLeavesNothingBehind)
{
    BrickSession& s = open();
    const std::int64_t live = workspace::LiveObjectCount();
    EXPECT_EQ(s.CreateMemoryFile("source.txt", "/Script/Temp/"), nullptr);
    EXPECT_EQ(s.MountDiskFile("source.txt", "/host/", "/Script/Temp/"), nullptr);
    EXPECT_EQ(workspace::LiveObjectCount(), live);
    EXPECT_EQ(find("/Script/Temp/source.txt"), s.sourceEntry());
}

TEST_F(WorkspaceSetup, HeaderListBeyondTheKeyBufferIsCutNotOverrun)
{
    std::string headers = "[HEADERS]\n";
    for (int i = 0; i < 200; ++i) {
        headers += "key" + std::to_string(i) + "=h" + std::to_string(i) + ".h\n";
    }
    open("", headers + "[DEBUG]\nMEMFILES=TRUE\n");
    EXPECT_NE(find("/Script/Include/h0.h"), nullptr);
    EXPECT_EQ(find("/Script/Include/h199.h"), nullptr);
}

} // namespace
