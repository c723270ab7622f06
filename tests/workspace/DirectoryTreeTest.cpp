// Directories: path walking, linking and removing, enumeration, copying, and the counting that
// lets one release take a whole tree apart.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <random>
#include <string>
#include <vector>

#include "WorkspaceFixture.h"
#include "workspace/DiskFile.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

using workspace_test::DescribeTree;
using workspace_test::PathOf;
using workspace_test::WorkspaceTest;

// The topmost directory, held as the session holds it, and released at the end of each test.
class DirectoryTreeTest : public WorkspaceTest {
protected:
    void SetUp() override
    {
        WorkspaceTest::SetUp();
        top_ = new Directory();
        top_->addRef();
    }
    void TearDown() override
    {
        if (top_ != nullptr) {
            EXPECT_EQ(top_->release(), nullptr) << DescribeTree(top_);
        }
        WorkspaceTest::TearDown();
    }

    static DirEnt* newFile() { return new TextMemoryEntry(new MemoryBlock()); }

    static std::vector<std::string> names(Directory* directory)
    {
        std::vector<std::string> result;
        std::int32_t index = 0;
        const char* name = nullptr;
        while (directory->next(&index, &name) != nullptr) {
            result.emplace_back(name);
        }
        return result;
    }

    static std::int32_t slotOf(Directory* directory, const char* wanted)
    {
        std::int32_t index = 0;
        const char* name = nullptr;
        while (directory->next(&index, &name) != nullptr) {
            if (std::string(name) == wanted) {
                return index - 1;
            }
        }
        return -1;
    }

    Directory* top_ = nullptr;
};

using DirectoryPaths = DirectoryTreeTest;
using DirectoryInsert = DirectoryTreeTest;
using DirectoryRemove = DirectoryTreeTest;
using DirectorySlots = DirectoryTreeTest;
using DirectoryCopy = DirectoryTreeTest;
using DirectoryTree = DirectoryTreeTest;

// ---- walking paths ----

TEST_F(DirectoryPaths, InsertCreatesTheWayAndFindAndPathAgree)
{
    DirEnt* source = newFile();
    ASSERT_EQ(top_->insert("/Script/Temp/source.txt", source), source);
    EXPECT_EQ(top_->find("/Script/Temp/source.txt"), source) << DescribeTree(top_);
    EXPECT_EQ(PathOf(source), "/Script/Temp/source.txt");
    EXPECT_STREQ(source->name(), "source.txt");
    EXPECT_EQ(source->refCount(), 1);
    DirEnt* temp = top_->find("Script/Temp");
    ASSERT_NE(temp, nullptr);
    EXPECT_TRUE(temp->isDirectory());
    EXPECT_EQ(PathOf(temp), "/Script/Temp");
    EXPECT_EQ(PathOf(top_), "");
    EXPECT_EQ(source->root(), top_);
    EXPECT_EQ(top_->root(), top_);
    EXPECT_EQ(source->parent(), temp);
}

TEST_F(DirectoryPaths, DotsSlashesAndTheTop)
{
    DirEnt* source = newFile();
    top_->insert("Script/Temp/source.txt", source);
    DirEnt* script = top_->find("Script");
    DirEnt* temp = top_->find("Script/Temp");
    EXPECT_EQ(top_->find(""), top_);
    EXPECT_EQ(top_->find("."), top_);
    EXPECT_EQ(top_->find("./"), top_);
    EXPECT_EQ(top_->find("././."), top_);
    EXPECT_EQ(top_->find("/"), top_);
    EXPECT_EQ(top_->find("///"), top_);
    EXPECT_EQ(top_->find(".."), nullptr);
    EXPECT_EQ(top_->find("../Script"), nullptr);
    EXPECT_EQ(top_->find(nullptr), nullptr);
    EXPECT_EQ(top_->find("Script/../Script/Temp"), temp);
    EXPECT_EQ(top_->find("Script/./Temp"), temp);
    EXPECT_EQ(top_->find("Script//Temp"), temp);
    EXPECT_EQ(top_->find("Script/Temp/"), temp);
    EXPECT_EQ(top_->find("//Script///Temp//source.txt"), source);
    EXPECT_EQ(top_->find("Script/Temp/source.txt/"), source) << "a trailing / names the entry";
    EXPECT_EQ(top_->find("Script/Temp/source.txt/x"), nullptr) << "a file has no children";
    EXPECT_EQ(temp->find("/"), top_);
    EXPECT_EQ(temp->find(".."), script);
    EXPECT_EQ(temp->find("../.."), top_);
    EXPECT_EQ(temp->find("../../.."), nullptr);
    EXPECT_EQ(temp->find("/Script"), script);
    EXPECT_EQ(temp->find("source.txt"), source);
}

TEST_F(DirectoryPaths, NamesCompareByteForByte)
{
    DirEnt* source = newFile();
    top_->insert("source.txt", source);
    EXPECT_EQ(top_->find("Source.txt"), nullptr);
    EXPECT_EQ(top_->find("source.tx"), nullptr);
    EXPECT_EQ(top_->find("source.txt "), nullptr);

    DirEnt* backslashed = newFile();
    ASSERT_EQ(top_->insert("a\\b", backslashed), backslashed);
    EXPECT_EQ(top_->find("a\\b"), backslashed);
    EXPECT_EQ(top_->find("a"), nullptr) << "the backslash is no separator";

    DirEnt* high = newFile();
    const char highName[] = "\xC3\xA9t\xE9\xFF";
    ASSERT_EQ(top_->insert(highName, high), high);
    EXPECT_EQ(top_->find(highName), high);
    EXPECT_EQ(PathOf(high), std::string("/") + highName);
}

TEST_F(DirectoryPaths, DotNamesThatAreOrdinary)
{
    for (const char* name : {".x", "..x", "...", "x.", ".x.", "a..b"}) {
        DirEnt* file = newFile();
        ASSERT_EQ(top_->insert(name, file), file) << name;
        EXPECT_EQ(top_->find(name), file) << name;
        EXPECT_EQ(top_->find((std::string("./") + name).c_str()), file) << name;
    }
    EXPECT_EQ(names(top_), (std::vector<std::string>{".x", "..x", "...", "x.", ".x.", "a..b"}));
}

TEST_F(DirectoryPaths, FileEntryResolvesBesideItself)
{
    DirEnt* source = newFile();
    DirEnt* object = newFile();
    top_->insert("Script/Temp/source.txt", source);
    top_->insert("Script/Temp/object.txt", object);
    EXPECT_EQ(source->find("object.txt"), object);
    EXPECT_EQ(source->find("/Script"), top_->find("Script"));
    DirEnt* extra = newFile();
    EXPECT_EQ(source->insert("extra.txt", extra), extra);
    EXPECT_EQ(PathOf(extra), "/Script/Temp/extra.txt");
    EXPECT_TRUE(source->remove("extra.txt"));
    EXPECT_EQ(top_->find("/Script/Temp/extra.txt"), nullptr);
}

TEST_F(DirectoryPaths, NextComponentResultsAndCursor)
{
    DirEnt* file = newFile();
    top_->insert("name", file);
    const std::int32_t slot = slotOf(top_, "name");
    struct Case {
        const char* path;
        std::int32_t result;
        std::size_t advance;
    };
    const Case cases[] = {
        {"", top_->slotCount(), 0},
        {"///x", Directory::kRoot, 3},
        {".", Directory::kCurrent, 1},
        {".//x", Directory::kCurrent, 3},
        {"..", Directory::kParent, 2},
        {"../x", Directory::kParent, 3},
        {".x", top_->slotCount(), 0},
        {"name//rest", slot, 6},
        {"name", slot, 4},
        {"nam", top_->slotCount(), 0},
        {"names", top_->slotCount(), 0},
    };
    for (const Case& c : cases) {
        const char* cursor = c.path;
        EXPECT_EQ(top_->nextComponent(&cursor), c.result) << '"' << c.path << '"';
        EXPECT_EQ(static_cast<std::size_t>(cursor - c.path), c.advance) << '"' << c.path << '"';
    }
    EXPECT_EQ(top_->nextComponent(nullptr), top_->slotCount());
}

TEST_F(DirectoryPaths, PathsOfAnyLengthAreSafe)
{
    DirEnt* file = newFile();
    top_->insert("a/f", file);
    std::string dots;
    for (int i = 0; i < 200000; ++i) {
        dots += "./";
    }
    EXPECT_EQ(top_->find(dots.c_str()), top_);
    std::string wandering;
    for (int i = 0; i < 100000; ++i) {
        wandering += "a/../";
    }
    EXPECT_EQ(top_->find((wandering + "a/f").c_str()), file);
    EXPECT_FALSE(top_->remove((wandering + "missing").c_str()));
    std::string slashes(300000, '/');
    EXPECT_EQ(top_->find(slashes.c_str()), top_);
    std::string longName(100000, 'n');
    DirEnt* named = newFile();
    EXPECT_EQ(top_->insert(longName.c_str(), named), named);
    EXPECT_EQ(top_->find(longName.c_str()), named);
    EXPECT_EQ(top_->find((longName + "n").c_str()), nullptr);
    std::string missingDeep;
    for (int i = 0; i < 100000; ++i) {
        missingDeep += "zz/";
    }
    EXPECT_EQ(top_->find(missingDeep.c_str()), nullptr);
}

TEST_F(DirectoryPaths, InsertRefusesToNestBeyondTheDepthLimit)
{
    std::string deep;
    for (int i = 0; i < 5000; ++i) {
        deep += "d/";
    }
    const std::int64_t before = live();
    EXPECT_EQ(top_->insert((deep + "leaf").c_str(), newFile()), nullptr);
    // The directories made on the way stay, as after any failure further down; the file went.
    EXPECT_GT(live(), before);
    std::string reachable;
    for (int i = 0; i < 100; ++i) {
        reachable += "d/";
    }
    DirEnt* leaf = newFile();
    EXPECT_EQ(top_->insert((reachable + "leaf").c_str(), leaf), leaf);
    EXPECT_EQ(top_->find((reachable + "leaf").c_str()), leaf);
    // Releasing the whole deep tree happens in the fixture's TearDown without running dry.
}

// ---- inserting ----

TEST_F(DirectoryInsert, SecondInsertUnderTheSamePathFailsUntilRemoved)
{
    DirEnt* first = newFile();
    ASSERT_EQ(top_->insert("/Script/Temp/source.txt", first), first);
    const std::int64_t before = live();
    DirEnt* second = newFile(); // entry and block
    EXPECT_EQ(top_->insert("/Script/Temp/source.txt", second), nullptr);
    EXPECT_EQ(live(), before) << "the unlinked new entry (and its block) are gone";
    EXPECT_EQ(top_->find("/Script/Temp/source.txt"), first);
    EXPECT_EQ(first->refCount(), 1);

    ASSERT_TRUE(top_->remove("/Script/Temp/source.txt"));
    DirEnt* third = newFile();
    EXPECT_EQ(top_->insert("/Script/Temp/source.txt", third), third);
}

TEST_F(DirectoryInsert, FailedInsertLeavesAHeldEntryAlone)
{
    DirEnt* held = newFile();
    ASSERT_EQ(top_->insert("held.txt", held), held);
    top_->insert("busy.txt", newFile());
    ReaderWriter* handle = held->open(0);
    EXPECT_EQ(held->refCount(), 2);
    const std::int64_t before = live();
    for (const char* path : {"", ".", "./.", "/", "..", "busy.txt", "held.txt/x", "../x"}) {
        EXPECT_EQ(top_->insert(path, held), nullptr) << '"' << path << '"';
        EXPECT_EQ(held->refCount(), 2) << '"' << path << '"';
    }
    EXPECT_EQ(top_->insert(nullptr, held), nullptr);
    EXPECT_EQ(top_->insert("x", nullptr), nullptr);
    EXPECT_EQ(live(), before);
    EXPECT_EQ(handle->write("still here", 10), 10);
    handle->release();
    EXPECT_EQ(held->refCount(), 1);
}

TEST_F(DirectoryInsert, FailedInsertDestroysAnUnheldEntryOnEveryPath)
{
    top_->insert("busy.txt", newFile());
    for (const char* path : {"", ".", "/", "..", "busy.txt", "busy.txt/x", "a/.."}) {
        const std::int64_t before = live();
        EXPECT_EQ(top_->insert(path, newFile()), nullptr) << '"' << path << '"';
        EXPECT_LE(live(), before + 1) << '"' << path << '"' << " at most the directory a/";
    }
    const std::int64_t before = live();
    auto* orphanFile = newFile();
    EXPECT_EQ(orphanFile->insert("x", newFile()), nullptr) << "no parent to ask";
    EXPECT_EQ(live(), before + 2) << "only the orphan (and its block) remain";
    orphanFile->addRef();
    orphanFile->release();
}

TEST_F(DirectoryInsert, FailedInsertDestroysAnUnheldDirectoryWithItsChildren)
{
    top_->insert("taken/x", newFile());
    const std::int64_t before = live();
    auto* subtree = new Directory();
    subtree->insert("a/b/c.txt", newFile());
    subtree->insert("d.txt", newFile());
    EXPECT_EQ(subtree->refCount(), 2) << "back references of a and d.txt";
    EXPECT_EQ(top_->insert("taken", subtree), nullptr);
    EXPECT_EQ(live(), before) << DescribeTree(top_);
}

TEST_F(DirectoryInsert, DirectoryCannotBeLinkedBelowItself)
{
    top_->insert("Script/Temp/source.txt", newFile());
    auto* script = static_cast<Directory*>(top_->find("Script"));
    const std::int32_t topCount = top_->refCount();
    const std::int32_t scriptCount = script->refCount();
    EXPECT_EQ(top_->insert("Script/Temp/loop", top_), nullptr);
    EXPECT_EQ(top_->insert("Script/again", script), nullptr);
    EXPECT_EQ(script->insert("self", script), nullptr);
    EXPECT_EQ(top_->refCount(), topCount);
    EXPECT_EQ(script->refCount(), scriptCount);
    EXPECT_EQ(top_->find("Script/Temp/loop"), nullptr);
    // Elsewhere a directory may have a second link.
    EXPECT_EQ(top_->insert("Other/alias", script), script);
    EXPECT_EQ(top_->find("Other/alias/Temp/source.txt"), top_->find("Script/Temp/source.txt"));
}

TEST_F(DirectoryInsert, InsertAndOpenGivesAHandleOrNothing)
{
    ReaderWriter* handle = top_->insertAndOpen("Script/out.txt", newFile(), 5);
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(handle->type(), 5);
    EXPECT_EQ(handle->dirEnt(), top_->find("Script/out.txt"));
    EXPECT_STREQ(handle->name(), "out.txt");
    char* path = handle->path();
    EXPECT_STREQ(path, "/Script/out.txt");
    std::free(path);
    const std::int64_t before = live();
    EXPECT_EQ(top_->insertAndOpen("Script/out.txt", newFile(), 5), nullptr);
    EXPECT_EQ(top_->insertAndOpen("Script/sub", new Directory(), 5), nullptr)
        << "a directory is linked but has no handle";
    EXPECT_NE(top_->find("Script/sub"), nullptr);
    EXPECT_EQ(live(), before + 1);
    handle->release();
}

TEST_F(DirectoryInsert, EntryLinkedTwiceKeepsItsFirstParent)
{
    DirEnt* file = newFile();
    top_->insert("A/file", file);
    top_->insert("B/alias", file);
    EXPECT_EQ(file->refCount(), 2);
    EXPECT_EQ(PathOf(file), "/A/file");
    EXPECT_EQ(top_->find("B/alias"), file);
    ASSERT_EQ(top_->find("A")->insert("second", file), file);
    EXPECT_STREQ(file->name(), "file") << "the lowest link's name";
}

// ---- removing ----

TEST_F(DirectoryRemove, RemoveReparentsSharedEntry)
{
    DirEnt* file = newFile();
    top_->insert("First/file.txt", file);
    top_->insert("Second/Inner/copy.txt", file);
    auto* first = top_->find("First");
    const std::int32_t firstCount = first->refCount();
    ASSERT_TRUE(top_->remove("First/file.txt"));
    EXPECT_EQ(file->parent(), top_->find("Second/Inner"));
    EXPECT_EQ(PathOf(file), "/Second/Inner/copy.txt");
    EXPECT_EQ(file->refCount(), 1);
    EXPECT_EQ(first->refCount(), firstCount - 1) << "the back reference went with the link";
    ASSERT_TRUE(top_->remove("Second/Inner/copy.txt")) << DescribeTree(top_);
    EXPECT_EQ(top_->find("Second/Inner")->refCount(), 1);
}

TEST_F(DirectoryRemove, RemoveFailsForWhatIsNotThere)
{
    top_->insert("dir/file", newFile());
    for (const char* path :
         {"", ".", "/", "..", "nothing", "dir/nothing", "dir/file/x", "../dir/file"}) {
        EXPECT_FALSE(top_->remove(path)) << '"' << path << '"';
    }
    EXPECT_FALSE(top_->remove(nullptr));
    EXPECT_NE(top_->find("dir/file"), nullptr);
    EXPECT_TRUE(top_->remove("/dir/./file/"));
    EXPECT_EQ(top_->find("dir/file"), nullptr);
}

TEST_F(DirectoryRemove, RemovingADirectoryReleasesWhatOnlyItHeld)
{
    top_->insert("Gone/a.txt", newFile());
    top_->insert("Gone/Deeper/b.txt", newFile());
    DirEnt* kept = newFile();
    top_->insert("Gone/kept.txt", kept);
    ReaderWriter* handle = kept->open(0);
    handle->write("survivor", 8);
    const std::int64_t before = live();
    ASSERT_TRUE(top_->remove("Gone"));
    // Gone, Deeper, a.txt and b.txt with their blocks: 2 + 2 * 2.
    EXPECT_EQ(live(), before - 6) << DescribeTree(top_);
    EXPECT_EQ(kept->parent(), nullptr);
    EXPECT_EQ(kept->name(), nullptr);
    EXPECT_EQ(kept->refCount(), 1);
    handle->rewind();
    char buffer[8];
    EXPECT_EQ(handle->read(buffer, 8), 8);
    handle->release();
}

TEST_F(DirectoryRemove, UnheldDirectorySurvivesLosingItsLastChild)
{
    auto* loose = new Directory();
    loose->insert("only.txt", newFile());
    EXPECT_EQ(loose->refCount(), 1);
    EXPECT_TRUE(loose->remove("only.txt"));
    // Still usable: it is back to the state of a new directory, owned by whoever made it.
    EXPECT_EQ(loose->refCount(), 0);
    EXPECT_EQ(loose->find("only.txt"), nullptr);
    EXPECT_EQ(top_->insert("Loose", loose), loose);
}

// ---- slots and enumeration ----

TEST_F(DirectorySlots, TableGrowsBySixteenAndReusesTheLowestFreeSlot)
{
    EXPECT_EQ(top_->slotCount(), 16);
    for (int i = 0; i < 16; ++i) {
        top_->insert(("f" + std::to_string(i)).c_str(), newFile());
    }
    EXPECT_EQ(top_->slotCount(), 16);
    top_->insert("f16", newFile());
    EXPECT_EQ(top_->slotCount(), 32);
    ASSERT_TRUE(top_->remove("f3"));
    top_->insert("again", newFile());
    EXPECT_EQ(slotOf(top_, "again"), 3);
    const std::vector<std::string> listed = names(top_);
    ASSERT_EQ(listed.size(), 17u);
    EXPECT_EQ(listed[3], "again");
    EXPECT_EQ(listed[16], "f16");
    EXPECT_EQ(top_->slotCount(), 32);
}

TEST_F(DirectorySlots, EnumerationVisitsOccupiedSlotsInOrder)
{
    for (const char* name : {"s0", "s1", "s2", "s3", "s4", "s5"}) {
        top_->insert(name, newFile());
    }
    top_->remove("s1");
    top_->remove("s3");
    top_->remove("s4");
    std::int32_t index = 0;
    const char* name = nullptr;
    std::vector<std::int32_t> after;
    std::vector<std::string> seen;
    while (top_->next(&index, &name) != nullptr) {
        seen.emplace_back(name);
        after.push_back(index);
    }
    EXPECT_EQ(seen, (std::vector<std::string>{"s0", "s2", "s5"}));
    EXPECT_EQ(after, (std::vector<std::int32_t>{1, 3, 6}));
    EXPECT_EQ(top_->next(&index, &name), nullptr);

    index = -7;
    EXPECT_EQ(top_->next(&index, nullptr), top_->find("s0"));
    index = top_->slotCount() + 5;
    EXPECT_EQ(top_->next(&index, &name), nullptr);
    EXPECT_EQ(top_->next(nullptr, &name), nullptr);
}

TEST_F(DirectorySlots, SlotOperationsRefuseBadIndexes)
{
    DirEnt* file = newFile();
    ASSERT_TRUE(top_->setSlot(4, "four", file));
    EXPECT_EQ(top_->find("four"), file);
    EXPECT_EQ(file->parent(), top_);
    DirEnt* other = newFile();
    other->addRef();
    EXPECT_FALSE(top_->setSlot(4, "again", other)) << "occupied";
    EXPECT_FALSE(top_->setSlot(-1, "neg", other));
    EXPECT_FALSE(top_->setSlot(top_->slotCount(), "past", other));
    EXPECT_FALSE(top_->setSlot(5, "", other));
    EXPECT_FALSE(top_->setSlot(5, nullptr, other));
    EXPECT_FALSE(top_->setSlot(5, "null", nullptr));
    EXPECT_EQ(other->refCount(), 1);
    EXPECT_FALSE(top_->removeAt(5));
    EXPECT_FALSE(top_->removeAt(-1));
    EXPECT_FALSE(top_->removeAt(1000));
    EXPECT_TRUE(top_->removeAt(4));
    EXPECT_EQ(top_->nameOf(file), nullptr);
    EXPECT_EQ(other->release(), nullptr);

    EXPECT_TRUE(top_->reserve(8));
    EXPECT_EQ(top_->slotCount(), 16);
    EXPECT_TRUE(top_->reserve(40));
    EXPECT_EQ(top_->slotCount(), 40);
}

TEST_F(DirectorySlots, NameOfAndFindParentOf)
{
    DirEnt* file = newFile();
    top_->insert("A/B/file", file);
    top_->insert("C/alias", file);
    EXPECT_EQ(top_->findParentOf(file), top_->find("A/B"));
    EXPECT_EQ(static_cast<Directory*>(top_->find("C"))->findParentOf(file), top_->find("C"));
    EXPECT_EQ(top_->findParentOf(top_), nullptr);
    EXPECT_EQ(top_->findParentOf(nullptr), nullptr);
    EXPECT_STREQ(static_cast<Directory*>(top_->find("C"))->nameOf(file), "alias");
    EXPECT_EQ(top_->nameOf(file), nullptr);
}

TEST_F(DirectorySlots, DirectoryHasNoHandleAndNoHostFile)
{
    EXPECT_TRUE(top_->isDirectory());
    EXPECT_EQ(top_->open(0), nullptr);
    EXPECT_STREQ(top_->fileName(), "");
    EXPECT_EQ(top_->name(), nullptr);
    EXPECT_EQ(top_->parent(), nullptr);
}

// ---- clones and copies ----

TEST_F(DirectoryCopy, CopyReproducesNamesAndNestingAndSharesFileContent)
{
    DirEnt* source = newFile();
    top_->insert("Src/Script/source.txt", source);
    top_->insert("Src/Script/Temp/obj.bin", new MemoryEntry(new MemoryBlock()));
    top_->insert("Src/Include/disk.h", new DiskEntry("/tmp/include/disk.h"));
    top_->insert("Src/Empty/", new Directory());
    auto* src = static_cast<Directory*>(top_->find("Src"));
    auto* dst = new Directory();
    ASSERT_EQ(top_->insert("Dst", dst), dst);
    ASSERT_EQ(dst->copyFrom(src), dst);

    EXPECT_EQ(names(dst), names(src));
    DirEnt* copied = dst->find("Script/source.txt");
    ASSERT_NE(copied, nullptr) << DescribeTree(top_);
    EXPECT_NE(copied, source) << "files are clones";
    EXPECT_NE(dst->find("Script"), src->find("Script")) << "directories are new";
    EXPECT_NE(dst->find("Script/Temp/obj.bin"), nullptr);
    EXPECT_NE(dst->find("Empty"), nullptr);
    EXPECT_STREQ(dst->find("Include/disk.h")->fileName(), "/tmp/include/disk.h");
    EXPECT_EQ(PathOf(copied), "/Dst/Script/source.txt");

    ReaderWriter* writer = copied->open(0);
    writer->write("through the copy", 16);
    writer->release();
    ReaderWriter* reader = source->open(0);
    EXPECT_EQ(reader->size(), 16);
    reader->release();
}

TEST_F(DirectoryCopy, CopyIntoItselfIsRefused)
{
    top_->insert("A/B/file", newFile());
    auto* a = static_cast<Directory*>(top_->find("A"));
    auto* b = static_cast<Directory*>(top_->find("A/B"));
    EXPECT_EQ(a->copyFrom(a), nullptr);
    EXPECT_EQ(b->copyFrom(a), nullptr);
    EXPECT_EQ(b->copyFrom(top_), nullptr);
    EXPECT_EQ(a->copyFrom(nullptr), a);
    EXPECT_EQ(names(b), (std::vector<std::string>{"file"}));
    // Copying a part into an ancestor is fine: the source does not grow while it is read.
    EXPECT_EQ(a->copyFrom(b), a);
    EXPECT_EQ(names(a), (std::vector<std::string>{"B", "file"}));
}

TEST_F(DirectoryCopy, CopyGrowsTheTableAndKeepsDuplicateNames)
{
    auto* src = new Directory();
    top_->insert("src", src);
    for (int i = 0; i < 20; ++i) {
        src->insert(("n" + std::to_string(i)).c_str(), newFile());
    }
    auto* dst = new Directory();
    top_->insert("dst", dst);
    dst->insert("n0", newFile());
    DirEnt* own = dst->find("n0");
    ASSERT_EQ(dst->copyFrom(src), dst);
    EXPECT_EQ(dst->slotCount(), 32);
    EXPECT_EQ(names(dst).size(), 21u);
    EXPECT_EQ(dst->find("n0"), own) << "the lower slot wins";
}

TEST_F(DirectoryCopy, CloneSharesTheEntries)
{
    DirEnt* file = newFile();
    top_->insert("D/file", file);
    top_->insert("D/Sub/deep", newFile());
    auto* d = static_cast<Directory*>(top_->find("D"));
    DirEnt* clone = d->clone();
    ASSERT_NE(clone, nullptr);
    EXPECT_TRUE(clone->isDirectory());
    EXPECT_EQ(clone->refCount(), 0);
    EXPECT_EQ(clone->find("file"), file);
    EXPECT_EQ(file->refCount(), 2);
    EXPECT_EQ(file->parent(), d) << "the entry keeps its primary parent";
    EXPECT_EQ(static_cast<Directory*>(clone)->slotCount(), d->slotCount());
    ASSERT_EQ(top_->insert("Clone", clone), clone);
    EXPECT_EQ(top_->find("Clone/Sub/deep"), top_->find("D/Sub/deep"));
    ASSERT_TRUE(top_->remove("Clone"));
    EXPECT_EQ(file->refCount(), 1);
    EXPECT_EQ(top_->find("D/file"), file);
}

// ---- the whole tree ----

TEST_F(DirectoryTree, ReleasingTheTopTakesEverythingApart)
{
    top_->insert("/Script/Temp/source.txt", newFile());
    top_->insert("/Script/Temp/object.bin", new MemoryEntry(new MemoryBlock()));
    top_->insert("/Script/Include/a.h", new DiskEntry("/tmp/a.h"));
    top_->insert("/Results/out.txt", newFile());
    DirEnt* shared = newFile();
    top_->insert("/Results/shared.txt", shared);
    top_->insert("/Script/shared-again.txt", shared);
    top_->insert("/Results/twice-a", shared);
    top_->insert("/Script/Temp/Deeper/Still/leaf", newFile());
    auto* alias = static_cast<Directory*>(top_->find("Script/Temp"));
    top_->insert("/Alias", alias);
    DirEnt* clone = top_->find("Script")->clone();
    top_->insert("/CloneOfScript", clone);
    auto* copy = new Directory();
    top_->insert("/Copy", copy);
    copy->copyFrom(static_cast<Directory*>(top_->find("Script")));
    EXPECT_GT(live(), 20);

    EXPECT_EQ(top_->release(), nullptr);
    top_ = nullptr;
    EXPECT_EQ(live(), 0);
}

TEST_F(DirectoryTree, OpenHandleKeepsItsEntryUntilItGoes)
{
    DirEnt* source = newFile();
    top_->insert("/Script/Temp/source.txt", source);
    top_->insert("/Script/Temp/other.txt", newFile());
    ReaderWriter* handle = top_->insertAndOpen("/Script/Temp/result.txt", newFile(), 3);
    ReaderWriter* onSource = source->open(1);
    onSource->write("text\n", 5);
    EXPECT_EQ(top_->release(), nullptr);
    top_ = nullptr;
    // Two handles, their two entries and the entries' blocks.
    EXPECT_EQ(live(), 6);
    EXPECT_EQ(source->parent(), nullptr);
    EXPECT_EQ(onSource->name(), nullptr);
    char* path = onSource->path();
    EXPECT_STREQ(path, "");
    std::free(path);
    EXPECT_EQ(onSource->size(), 6);
    EXPECT_EQ(handle->write("late", 4), 4);
    EXPECT_EQ(handle->release(), nullptr);
    EXPECT_EQ(live(), 3);
    EXPECT_EQ(onSource->release(), nullptr);
    EXPECT_EQ(live(), 0);
}

TEST_F(DirectoryTree, ReleaseWithOutsideHoldersOnlyLowersTheCount)
{
    top_->insert("Keep/file", newFile());
    auto* keep = top_->find("Keep");
    keep->addRef(); // an outside holder besides the link
    ASSERT_TRUE(top_->remove("Keep"));
    EXPECT_EQ(keep->parent(), nullptr);
    EXPECT_NE(keep->find("file"), nullptr) << "still whole while held";
    EXPECT_EQ(keep->refCount(), 2) << "the holder plus the file's back reference";
    EXPECT_EQ(keep->release(), nullptr);
}

TEST_F(DirectoryTree, SharedDirectoryMovesToItsOtherParent)
{
    top_->insert("A/Shared/file", newFile());
    auto* shared = top_->find("A/Shared");
    top_->insert("B/Link", shared);
    ASSERT_TRUE(top_->remove("A"));
    EXPECT_EQ(shared->parent(), top_->find("B"));
    EXPECT_EQ(PathOf(top_->find("B/Link/file")), "/B/Link/file");
    EXPECT_EQ(top_->find("A"), nullptr);
}

// Any mix of linking, unlinking, cloning, copying and open handles, on paths with dots and
// slashes, must still come apart completely once the last holders let go.
TEST_F(DirectoryTree, RandomOperationsLeaveNothingBehind)
{
    std::mt19937 random(7);
    const char* const parts[] = {"a", "b", "c", ".", "..", "", "a.b"};
    auto randomPath = [&] {
        std::string path = random() % 3 == 0 ? "/" : "";
        const int components = 1 + static_cast<int>(random() % 4);
        for (int i = 0; i < components; ++i) {
            path += parts[random() % std::size(parts)];
            if (i + 1 < components || random() % 4 == 0) {
                path += random() % 5 == 0 ? "//" : "/";
            }
        }
        return path;
    };
    std::vector<ReaderWriter*> handles;
    std::vector<DirEnt*> held;
    for (int round = 0; round < 4000; ++round) {
        const std::string path = randomPath();
        switch (random() % 8) {
        case 0:
            top_->insert(path.c_str(), newFile());
            break;
        case 1:
            top_->insert(path.c_str(), new Directory());
            break;
        case 2:
            if (DirEnt* existing = top_->find(randomPath().c_str())) {
                top_->insert(path.c_str(), existing);
            }
            break;
        case 3:
            top_->remove(path.c_str());
            break;
        case 4:
            if (DirEnt* found = top_->find(path.c_str())) {
                if (ReaderWriter* handle = found->open(1)) {
                    handle->write("x\n", 2);
                    handles.push_back(handle);
                }
            }
            break;
        case 5:
            if (DirEnt* found = top_->find(path.c_str())) {
                if (DirEnt* clone = found->clone()) {
                    top_->insert(randomPath().c_str(), clone);
                }
            }
            break;
        case 6:
            if (DirEnt* found = top_->find(path.c_str());
                found != nullptr && found->isDirectory()) {
                auto* copy = new Directory();
                if (top_->insert(randomPath().c_str(), copy) == copy) {
                    copy->copyFrom(static_cast<Directory*>(found));
                }
            }
            break;
        default:
            if (DirEnt* found = top_->find(path.c_str()); found != nullptr && held.size() < 20) {
                held.push_back(found->addRef());
            }
            break;
        }
    }
    // Held entries may include the top itself, so the tree may go only with the last of them.
    top_->release();
    top_ = nullptr;
    for (ReaderWriter* handle : handles) {
        EXPECT_GE(handle->size(), 0);
        handle->release();
    }
    for (DirEnt* entry : held) {
        entry->release();
    }
    EXPECT_EQ(live(), 0);
}

} // namespace
