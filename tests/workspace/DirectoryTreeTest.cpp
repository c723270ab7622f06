// Directories: path walking, linking and removing, enumeration, copying, and the counting that
// lets one release take a whole tree apart.
#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "WorkspaceFixture.h"
#include "workspace/DiskFile.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

using workspace_test::PathOf;
using workspace_test::WorkspaceTest;

// The topmost directory, held as the session holds it, and released at the end of each test.
class DirectoryTree : public WorkspaceTest {
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
            EXPECT_EQ(top_->release(), nullptr);
        }
        WorkspaceTest::TearDown();
    }

    static DirEnt* newFile() { return new TextMemoryEntry(new MemoryBlock()); }
    Directory* dir(const char* path) { return static_cast<Directory*>(top_->find(path)); }

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

    Directory* top_ = nullptr;
};

// ---- walking paths ----

TEST_F(DirectoryTree, FindResolvesDotsSlashesAndTheTop)
{
    DirEnt* source = newFile();
    ASSERT_EQ(top_->insert("/Script/Temp/source.txt", source), source);
    DirEnt* script = top_->find("Script");
    DirEnt* temp = top_->find("Script/Temp");
    ASSERT_TRUE(temp != nullptr && temp->isDirectory());
    EXPECT_EQ(PathOf(source), "/Script/Temp/source.txt");
    EXPECT_EQ(PathOf(top_), "");
    EXPECT_EQ(source->root(), top_);
    for (const char* path : {"", "././.", "///", "Script/..", "Script//../Script/./.."}) {
        EXPECT_EQ(top_->find(path), top_) << path;
    }
    for (const char* path : {"Script/../Script/Temp", "Script/./Temp/", "//Script///Temp"}) {
        EXPECT_EQ(top_->find(path), temp) << path;
    }
    // A trailing "/" names the entry; a file has no children; names compare byte for byte.
    EXPECT_EQ(top_->find("Script/Temp/source.txt/"), source);
    for (const char* path :
         {"..", "../Script", "Script/Temp/source.txt/x", "Script/Temp/Source.txt",
          "Script/Temp/source.tx", "Script/Temp/source.txt "}) {
        EXPECT_EQ(top_->find(path), nullptr) << path;
    }
    EXPECT_EQ(top_->find(nullptr), nullptr);
    EXPECT_EQ(temp->find(".."), script);
    EXPECT_EQ(temp->find("/"), top_);
    EXPECT_EQ(temp->find("../.."), top_);
    EXPECT_EQ(temp->find("../../.."), nullptr);
    EXPECT_EQ(temp->find("/Script"), script);
    // A file resolves paths beside itself.
    EXPECT_EQ(source->find("source.txt"), source);
    EXPECT_EQ(source->find("../Temp"), temp);
    DirEnt* extra = newFile();
    EXPECT_EQ(source->insert("extra.txt", extra), extra);
    EXPECT_EQ(PathOf(extra), "/Script/Temp/extra.txt");
    EXPECT_TRUE(source->remove("extra.txt"));
    EXPECT_EQ(top_->open(0), nullptr) << "a directory has no handle";
}

TEST_F(DirectoryTree, UnusualNamesAreOrdinaryBytes)
{
    const std::vector<std::string> unusual = {
        ".x", "..x", "...", "x.", "a..b", "a\\b", "\xC3\xA9t\xE9\xFF"};
    for (const std::string& name : unusual) {
        SCOPED_TRACE(name);
        DirEnt* file = newFile();
        ASSERT_EQ(top_->insert(name.c_str(), file), file);
        EXPECT_EQ(top_->find(("./" + name).c_str()), file);
        EXPECT_EQ(PathOf(file), "/" + name);
    }
    EXPECT_EQ(top_->find("a"), nullptr) << "the backslash is no separator";
    EXPECT_EQ(names(top_), unusual);
}

TEST_F(DirectoryTree, NextComponentResultsAndCursor)
{
    top_->insert("pad", newFile());
    top_->insert("name", newFile());
    const std::int32_t none = top_->slotCount();
    struct Case {
        const char* path;
        std::int32_t result;
        std::size_t advance;
    };
    const Case cases[] = {{"", none, 0},
                          {"///x", Directory::kRoot, 3},
                          {".", Directory::kCurrent, 1},
                          {".//x", Directory::kCurrent, 3},
                          {"..", Directory::kParent, 2},
                          {"../x", Directory::kParent, 3},
                          {".x", none, 0},
                          {"name//rest", 1, 6},
                          {"name", 1, 4},
                          {"nam", none, 0},
                          {"names", none, 0}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.path);
        const char* cursor = c.path;
        EXPECT_EQ(top_->nextComponent(&cursor), c.result);
        EXPECT_EQ(static_cast<std::size_t>(cursor - c.path), c.advance);
    }
    EXPECT_EQ(top_->nextComponent(nullptr), none);
}

// find and remove loop rather than recurse, and insert stops at the depth limit, so that
// neither a long path nor taking a deep tree apart can run the stack dry.
TEST_F(DirectoryTree, LongPathsAndDeepTreesAreSafe)
{
    DirEnt* file = newFile();
    top_->insert("a/f", file);
    std::string dots, wandering, deep;
    for (int i = 0; i < 100000; ++i) {
        dots += "./";
        wandering += "a/../";
    }
    EXPECT_EQ(top_->find(dots.c_str()), top_);
    EXPECT_EQ(top_->find((wandering + "a/f").c_str()), file);
    EXPECT_FALSE(top_->remove((wandering + "missing").c_str()));
    EXPECT_EQ(top_->find(std::string(300000, '/').c_str()), top_);
    const std::string longName(100000, 'n');
    DirEnt* named = newFile();
    EXPECT_EQ(top_->insert(longName.c_str(), named), named);
    EXPECT_EQ(top_->find((longName + "n").c_str()), nullptr);

    for (int i = 0; i < 5000; ++i) {
        deep += "d/";
    }
    const std::int64_t before = live();
    EXPECT_EQ(top_->insert((deep + "leaf").c_str(), newFile()), nullptr);
    EXPECT_GT(live(), before) << "the directories made on the way stay; the file went";
    DirEnt* leaf = newFile();
    const std::string reachable = deep.substr(0, 200) + "leaf";
    EXPECT_EQ(top_->insert(reachable.c_str(), leaf), leaf);
    EXPECT_EQ(top_->find(reachable.c_str()), leaf);
    // The fixture's TearDown releases the deep tree.
}

// ---- inserting ----

// A failed insert destroys an entry nobody holds (it would be lost) and leaves a held one, its
// count untouched.
TEST_F(DirectoryTree, FailedInsertDisposesOnlyUnheldEntries)
{
    DirEnt* held = newFile();
    ASSERT_EQ(top_->insert("held.txt", held), held);
    top_->insert("busy.txt", newFile());
    ReaderWriter* handle = held->open(0);
    for (const char* path :
         {"", ".", "./.", "/", "..", "../x", "busy.txt", "held.txt/x", "busy.txt/x", "a/.."}) {
        SCOPED_TRACE(path);
        const std::int64_t before = live();
        EXPECT_EQ(top_->insert(path, held), nullptr);
        EXPECT_EQ(held->refCount(), 2);
        EXPECT_EQ(top_->insert(path, newFile()), nullptr);
        EXPECT_LE(live(), before + 1) << "at most the directory a/ was made";
    }
    EXPECT_EQ(top_->insert(nullptr, held), nullptr);
    EXPECT_EQ(top_->insert("x", nullptr), nullptr);
    EXPECT_EQ(held->refCount(), 2);
    EXPECT_EQ(handle->write("still here", 10), 10);
    handle->release();

    const std::int64_t before = live();
    DirEnt* orphan = newFile();
    EXPECT_EQ(orphan->insert("x", newFile()), nullptr) << "no parent to ask";
    EXPECT_EQ(live(), before + 2) << "only the orphan and its block remain";
    orphan->addRef();
    orphan->release();

    auto* subtree = new Directory();
    subtree->insert("a/b/c.txt", newFile());
    subtree->insert("d.txt", newFile());
    EXPECT_EQ(top_->insert("busy.txt", subtree), nullptr);
    EXPECT_EQ(live(), before) << "the unheld directory went with its children";

    ASSERT_TRUE(top_->remove("busy.txt"));
    DirEnt* again = newFile();
    EXPECT_EQ(top_->insert("busy.txt", again), again) << "free again once removed";
}

TEST_F(DirectoryTree, DirectoryCannotBeLinkedBelowItself)
{
    top_->insert("Script/Temp/source.txt", newFile());
    Directory* script = dir("Script");
    const std::int32_t topCount = top_->refCount();
    const std::int32_t scriptCount = script->refCount();
    EXPECT_EQ(top_->insert("Script/Temp/loop", top_), nullptr);
    EXPECT_EQ(top_->insert("Script/again", script), nullptr);
    EXPECT_EQ(script->insert("self", script), nullptr);
    EXPECT_EQ(top_->refCount(), topCount);
    EXPECT_EQ(script->refCount(), scriptCount);
    EXPECT_EQ(top_->insert("Other/alias", script), script) << "elsewhere a second link is fine";
    EXPECT_EQ(top_->find("Other/alias/Temp/source.txt"), top_->find("Script/Temp/source.txt"));
}

TEST_F(DirectoryTree, InsertAndOpenGivesAHandleOrNothing)
{
    ReaderWriter* handle = top_->insertAndOpen("Script/out.txt", newFile(), 5);
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(handle->type(), 5);
    EXPECT_EQ(handle->dirEnt(), top_->find("Script/out.txt"));
    EXPECT_STREQ(handle->name(), "out.txt");
    EXPECT_EQ(PathOf(handle), "/Script/out.txt");
    const std::int64_t before = live();
    EXPECT_EQ(top_->insertAndOpen("Script/out.txt", newFile(), 5), nullptr);
    EXPECT_EQ(top_->insertAndOpen("Script/sub", new Directory(), 5), nullptr);
    EXPECT_NE(top_->find("Script/sub"), nullptr) << "the directory is linked all the same";
    EXPECT_EQ(live(), before + 1);
    handle->release();
}

// ---- sharing and removing ----

TEST_F(DirectoryTree, SharedEntryKeepsItsFirstParentAndMovesWhenItGoes)
{
    DirEnt* file = newFile();
    top_->insert("A/file", file);
    top_->insert("B/Inner/alias", file);
    ASSERT_EQ(dir("A")->insert("second", file), file);
    EXPECT_EQ(file->refCount(), 3);
    EXPECT_EQ(PathOf(file), "/A/file");
    EXPECT_EQ(top_->findParentOf(file), dir("A"));
    EXPECT_STREQ(dir("B/Inner")->nameOf(file), "alias");
    EXPECT_EQ(top_->nameOf(file), nullptr);
    EXPECT_EQ(top_->findParentOf(top_), nullptr);

    Directory* a = dir("A");
    const std::int32_t aCount = a->refCount();
    ASSERT_TRUE(top_->remove("A/file"));
    EXPECT_EQ(PathOf(file), "/A/second") << "still linked in A";
    ASSERT_TRUE(top_->remove("A/second"));
    EXPECT_EQ(a->refCount(), aCount - 1) << "the back reference went with the last link";
    EXPECT_EQ(file->parent(), dir("B/Inner"));
    EXPECT_EQ(PathOf(file), "/B/Inner/alias");
    EXPECT_EQ(file->refCount(), 1);

    top_->insert("C/Shared/file", newFile());
    DirEnt* shared = top_->find("C/Shared");
    top_->insert("D/Link", shared);
    ASSERT_TRUE(top_->remove("C"));
    EXPECT_EQ(shared->parent(), top_->find("D"));
    EXPECT_EQ(PathOf(top_->find("D/Link/file")), "/D/Link/file");
}

TEST_F(DirectoryTree, RemoveFailsForWhatIsNotThere)
{
    top_->insert("dir/file", newFile());
    for (const char* path :
         {"", ".", "/", "..", "nothing", "dir/nothing", "dir/file/x", "../dir/file"}) {
        EXPECT_FALSE(top_->remove(path)) << '"' << path << '"';
    }
    EXPECT_FALSE(top_->remove(nullptr));
    EXPECT_TRUE(top_->remove("/dir/./file/"));
    EXPECT_EQ(top_->find("dir/file"), nullptr);
}

TEST_F(DirectoryTree, RemovingADirectoryReleasesWhatOnlyItHeld)
{
    top_->insert("Gone/a.txt", newFile());
    top_->insert("Gone/Deeper/b.txt", newFile());
    DirEnt* kept = newFile();
    top_->insert("Gone/kept.txt", kept);
    ReaderWriter* handle = kept->open(0);
    handle->write("survivor", 8);
    const std::int64_t before = live();
    ASSERT_TRUE(top_->remove("Gone"));
    EXPECT_EQ(live(), before - 6) << "Gone, Deeper, a.txt and b.txt with their blocks";
    EXPECT_EQ(kept->parent(), nullptr);
    EXPECT_EQ(kept->name(), nullptr);
    EXPECT_EQ(kept->refCount(), 1);
    EXPECT_EQ(handle->size(), 8);
    handle->release();

    // A directory held from outside stays whole; one that nobody holds survives losing its
    // last child, back to the state of a new directory.
    top_->insert("Keep/file", newFile());
    DirEnt* keep = top_->find("Keep")->addRef();
    ASSERT_TRUE(top_->remove("Keep"));
    EXPECT_EQ(keep->parent(), nullptr);
    EXPECT_EQ(keep->refCount(), 2) << "the holder plus the file's back reference";
    EXPECT_NE(keep->find("file"), nullptr);
    EXPECT_EQ(keep->release(), nullptr) << "only the back reference was left";

    auto* loose = new Directory();
    loose->insert("only.txt", newFile());
    EXPECT_TRUE(loose->remove("only.txt"));
    EXPECT_EQ(loose->refCount(), 0);
    EXPECT_EQ(top_->insert("Loose", loose), loose);
}

// ---- slots and enumeration ----

TEST_F(DirectoryTree, TableGrowsBySixteenAndReusesTheLowestFreeSlot)
{
    EXPECT_EQ(top_->slotCount(), 16);
    for (int i = 0; i < 17; ++i) {
        top_->insert(("f" + std::to_string(i)).c_str(), newFile());
        EXPECT_EQ(top_->slotCount(), i < 16 ? 16 : 32);
    }
    for (const char* gone : {"f1", "f3", "f4"}) {
        ASSERT_TRUE(top_->remove(gone));
    }
    top_->insert("again", newFile());
    const std::vector<std::string> listed = names(top_);
    EXPECT_EQ(std::vector<std::string>(listed.begin(), listed.begin() + 4),
              (std::vector<std::string>{"f0", "again", "f2", "f5"}));
    std::int32_t index = 3;
    const char* name = nullptr;
    EXPECT_EQ(top_->next(&index, &name), top_->find("f5"));
    EXPECT_EQ(index, 6) << "past the free slots and the one returned";
    index = -7;
    EXPECT_EQ(top_->next(&index, nullptr), top_->find("f0"));
    index = top_->slotCount() + 5;
    EXPECT_EQ(top_->next(&index, &name), nullptr);
    EXPECT_EQ(top_->next(nullptr, &name), nullptr);
    EXPECT_TRUE(top_->reserve(8));
    EXPECT_EQ(top_->slotCount(), 32);
    EXPECT_TRUE(top_->reserve(40));
    EXPECT_EQ(top_->slotCount(), 40);
}

TEST_F(DirectoryTree, SlotOperationsRefuseBadIndexes)
{
    DirEnt* file = newFile();
    ASSERT_TRUE(top_->setSlot(4, "four", file));
    EXPECT_EQ(top_->find("four"), file);
    EXPECT_EQ(file->parent(), top_);
    DirEnt* other = newFile()->addRef();
    EXPECT_FALSE(top_->setSlot(4, "again", other)) << "occupied";
    EXPECT_FALSE(top_->setSlot(-1, "neg", other));
    EXPECT_FALSE(top_->setSlot(top_->slotCount(), "past", other));
    EXPECT_FALSE(top_->setSlot(5, "", other));
    EXPECT_FALSE(top_->setSlot(5, nullptr, other));
    EXPECT_FALSE(top_->setSlot(5, "null", nullptr));
    EXPECT_EQ(other->refCount(), 1);
    for (std::int32_t bad : {5, -1, 1000}) {
        EXPECT_FALSE(top_->removeAt(bad)) << bad;
    }
    EXPECT_TRUE(top_->removeAt(4));
    EXPECT_EQ(top_->nameOf(file), nullptr);
    EXPECT_EQ(other->release(), nullptr);
}

// ---- clones and copies ----

TEST_F(DirectoryTree, CopyMakesNewDirectoriesAndClonesFilesSharingTheirContent)
{
    DirEnt* source = newFile();
    top_->insert("Src/Script/source.txt", source);
    top_->insert("Src/Script/Temp/obj.bin", new MemoryEntry(new MemoryBlock()));
    top_->insert("Src/Include/disk.h", new DiskEntry("/tmp/include/disk.h"));
    top_->insert("Src/Empty/", new Directory());
    Directory* src = dir("Src");
    auto* dst = new Directory();
    ASSERT_EQ(top_->insert("Dst", dst), dst);
    ASSERT_EQ(dst->copyFrom(src), dst);

    EXPECT_EQ(names(dst), names(src));
    DirEnt* copied = dst->find("Script/source.txt");
    ASSERT_NE(copied, nullptr);
    EXPECT_NE(copied, source);
    EXPECT_NE(dst->find("Script"), src->find("Script"));
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

TEST_F(DirectoryTree, CopyIntoItselfIsRefusedAndDuplicateNamesKeepTheLowerSlot)
{
    top_->insert("A/B/file", newFile());
    Directory* a = dir("A");
    Directory* b = dir("A/B");
    EXPECT_EQ(a->copyFrom(a), nullptr);
    EXPECT_EQ(b->copyFrom(a), nullptr);
    EXPECT_EQ(b->copyFrom(top_), nullptr);
    EXPECT_EQ(a->copyFrom(nullptr), a);
    EXPECT_EQ(names(b), (std::vector<std::string>{"file"}));
    EXPECT_EQ(a->copyFrom(b), a) << "a part into an ancestor: the source does not grow";
    EXPECT_EQ(names(a), (std::vector<std::string>{"B", "file"}));

    auto* src = new Directory();
    top_->insert("src", src);
    for (int i = 0; i < 20; ++i) {
        src->insert(("n" + std::to_string(i)).c_str(), newFile());
    }
    auto* dst = new Directory();
    top_->insert("dst", dst);
    DirEnt* own = newFile();
    dst->insert("n0", own);
    ASSERT_EQ(dst->copyFrom(src), dst);
    EXPECT_EQ(dst->slotCount(), 32);
    EXPECT_EQ(names(dst).size(), 21u);
    EXPECT_EQ(dst->find("n0"), own);
}

TEST_F(DirectoryTree, CloneSharesTheEntries)
{
    DirEnt* file = newFile();
    top_->insert("D/file", file);
    top_->insert("D/Sub/deep", newFile());
    Directory* d = dir("D");
    DirEnt* clone = d->clone();
    ASSERT_NE(clone, nullptr);
    EXPECT_EQ(clone->refCount(), 0);
    EXPECT_EQ(clone->find("file"), file);
    EXPECT_EQ(file->refCount(), 2);
    EXPECT_EQ(file->parent(), d) << "the entry keeps its primary parent";
    ASSERT_EQ(top_->insert("Clone", clone), clone);
    EXPECT_EQ(top_->find("Clone/Sub/deep"), top_->find("D/Sub/deep"));
    ASSERT_TRUE(top_->remove("Clone"));
    EXPECT_EQ(file->refCount(), 1);
    EXPECT_EQ(top_->find("D/file"), file);
}

// ---- the whole tree ----

TEST_F(DirectoryTree, ReleasingTheTopTakesEverythingApartExceptOpenHandles)
{
    DirEnt* source = newFile();
    top_->insert("/Script/Temp/source.txt", source);
    top_->insert("/Script/Temp/object.bin", new MemoryEntry(new MemoryBlock()));
    top_->insert("/Script/Include/a.h", new DiskEntry("/tmp/a.h"));
    DirEnt* shared = newFile();
    top_->insert("/Results/shared.txt", shared);
    top_->insert("/Script/shared-again.txt", shared);
    top_->insert("/Results/twice-a", shared);
    top_->insert("/Script/Temp/Deeper/Still/leaf", newFile());
    top_->insert("/Alias", top_->find("Script/Temp"));
    top_->insert("/CloneOfScript", top_->find("Script")->clone());
    auto* copy = new Directory();
    top_->insert("/Copy", copy);
    copy->copyFrom(dir("Script"));
    ReaderWriter* handle = top_->insertAndOpen("/Script/Temp/result.txt", newFile(), 3);
    ReaderWriter* onSource = source->open(1);
    onSource->write("text\n", 5);
    EXPECT_GT(live(), 20);

    EXPECT_EQ(top_->release(), nullptr);
    top_ = nullptr;
    EXPECT_EQ(live(), 6) << "two handles, their entries and the entries' blocks";
    EXPECT_EQ(source->parent(), nullptr);
    EXPECT_EQ(onSource->name(), nullptr);
    EXPECT_EQ(PathOf(onSource), "");
    EXPECT_EQ(onSource->size(), 6);
    EXPECT_EQ(handle->write("late", 4), 4);
    EXPECT_EQ(handle->release(), nullptr);
    EXPECT_EQ(live(), 3);
    EXPECT_EQ(onSource->release(), nullptr);
    EXPECT_EQ(live(), 0);
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
        DirEnt* found = top_->find(path.c_str());
        switch (random() % 8) {
        case 0:
        case 1:
            top_->insert(path.c_str(), random() % 2 == 0 ? newFile() : new Directory());
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
            if (ReaderWriter* handle = found != nullptr ? found->open(1) : nullptr) {
                handle->write("x\n", 2);
                handles.push_back(handle);
            }
            break;
        case 5:
            if (DirEnt* clone = found != nullptr ? found->clone() : nullptr) {
                top_->insert(randomPath().c_str(), clone);
            }
            break;
        case 6:
            if (found != nullptr && found->isDirectory()) {
                auto* copy = new Directory();
                if (top_->insert(randomPath().c_str(), copy) == copy) {
                    copy->copyFrom(static_cast<Directory*>(found));
                }
            }
            break;
        default:
            if (found != nullptr && held.size() < 20) {
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
