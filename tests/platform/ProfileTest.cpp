#include <gtest/gtest.h>
#include <stdlib.h>

#include <cstring>
#include <string>

#include "platform/Profile.h"
#include "testlib/TestSupport.h"

using platform::ReadProfileString;

namespace {

class ProfileReading : public ::testing::Test {
protected:
    std::string value(const char* section, const char* key, const char* fallback = "dflt",
                      std::uint32_t size = 260)
    {
        std::string buffer(size + 8, '#');
        const std::uint32_t length =
            ReadProfileString(section, key, fallback, buffer.data(), size, path.c_str());
        // Nothing is ever written past the buffer.
        EXPECT_EQ(buffer.substr(size), std::string(8, '#'));
        EXPECT_EQ(length, std::strlen(buffer.c_str()));
        return buffer.c_str();
    }

    // The key-name list as "a|b|" (each name ended by "|"), checking the closing empty name.
    std::string keys(const char* section, std::uint32_t size = 1024,
                     std::uint32_t* returned = nullptr)
    {
        std::string buffer(size + 8, '#');
        const std::uint32_t length =
            ReadProfileString(section, nullptr, "", buffer.data(), size, path.c_str());
        if (returned != nullptr) {
            *returned = length;
        }
        EXPECT_EQ(buffer.substr(size), std::string(8, '#'));
        std::string list;
        std::size_t at = 0;
        while (at < size && buffer[at] != '\0') {
            const std::string name(buffer.c_str() + at);
            list += name + "|";
            at += name.size() + 1;
        }
        EXPECT_LT(at, size) << "list not closed by an empty name";
        return list;
    }

    testsupport::TempDirectory dir;
    std::string path;
};

TEST_F(ProfileReading, ReadsValueIgnoringLetterCaseOfNames)
{
    path = dir.write("a.ini", "[Paths]\nDll = /opt/tessel/ \n[OPTIONS]\nAutoRun=TRUE\n");
    EXPECT_EQ(value("PATHS", "DLL"), "/opt/tessel/");
    EXPECT_EQ(value("paths", "dll"), "/opt/tessel/");
    EXPECT_EQ(value("options", "AUTORUN"), "TRUE");
}

TEST_F(ProfileReading, TrimsBlanksAndRemovesMatchingQuotes)
{
    path = dir.write("a.ini",
                     "  [ S ]  \r\n\t k1 \t=\t \"quoted value \" \r\nk2='single'\r\nk3=\"open\r\n"
                     "k4=\"mixed'\r\nk5=\"\"\r\n");
    EXPECT_EQ(value("S", "k1"), "quoted value ");
    EXPECT_EQ(value("S", "k2"), "single");
    EXPECT_EQ(value("S", "k3"), "\"open");
    EXPECT_EQ(value("S", "k4"), "\"mixed'");
    EXPECT_EQ(value("S", "k5"), "");
}

TEST_F(ProfileReading, IgnoresCommentLinesAndLinesWithoutEquals)
{
    path = dir.write("a.ini", "[S]\n;key=commented\n  ; k2=also\njust text\nkey=real\n");
    EXPECT_EQ(value("S", "key"), "real");
    EXPECT_EQ(value("S", "k2"), "dflt");
    EXPECT_EQ(keys("S"), "key|");
}

TEST_F(ProfileReading, DefaultsForMissingFileSectionAndKey)
{
    path = dir.path() + "absent.ini";
    EXPECT_EQ(value("S", "k"), "dflt");
    path = dir.write("a.ini", "[S]\nk=v\n");
    EXPECT_EQ(value("T", "k"), "dflt");
    EXPECT_EQ(value("S", "other"), "dflt");
    EXPECT_EQ(value("S", "other", nullptr), "");
    // An empty value is a value, not a missing key.
    path = dir.write("b.ini", "[S]\nk=\n");
    EXPECT_EQ(value("S", "k"), "");
}

TEST_F(ProfileReading, DirectoryInPlaceOfFileGivesDefaults)
{
    path = dir.path();
    EXPECT_EQ(value("S", "k"), "dflt");
    EXPECT_EQ(keys("S"), "");
}

TEST_F(ProfileReading, ValueRunsFromTheFirstEqualsSign)
{
    path = dir.write("a.ini", "[S]\nk = a=b ; not a comment\n[T] trailing\nx=1\n");
    EXPECT_EQ(value("S", "k"), "a=b ; not a comment");
    EXPECT_EQ(value("T", "x"), "1");
}

TEST_F(ProfileReading, EmptyFileAndFileWithoutSectionsGiveDefaults)
{
    path = dir.write("empty.ini", "");
    EXPECT_EQ(value("S", "k"), "dflt");
    EXPECT_EQ(keys("S"), "");
    path = dir.write("nosection.ini", "k=v\nother=w\n");
    EXPECT_EQ(value("S", "k"), "dflt");
    EXPECT_EQ(keys("S"), "");
}

TEST_F(ProfileReading, FirstOfDuplicateSectionsAndKeysWins)
{
    path = dir.write("a.ini", "[S]\nk=first\nk=second\n[T]\nx=1\n[s]\nk=third\nonly=later\n");
    EXPECT_EQ(value("S", "k"), "first");
    EXPECT_EQ(value("S", "only"), "dflt");
    EXPECT_EQ(keys("S"), "k|");
}

TEST_F(ProfileReading, CutsValueToBufferWithTerminatorIncluded)
{
    path = dir.write("a.ini", "[S]\nk=abcdefghijklmnop\n");
    EXPECT_EQ(value("S", "k", "", 12), "abcdefghijk");
    EXPECT_EQ(value("S", "k", "", 1), "");
    EXPECT_EQ(value("S", "missing", "0123456789abcdef", 5), "0123");
    char untouched = 'x';
    EXPECT_EQ(ReadProfileString("S", "k", "", &untouched, 0, path.c_str()), 0u);
    EXPECT_EQ(untouched, 'x');
}

TEST_F(ProfileReading, ReadsLinesOfAnyLength)
{
    const std::string longValue(100000, 'v');
    path = dir.write("a.ini", "[S]\nlong=" + longValue + "\nafter=ok\n");
    EXPECT_EQ(value("S", "long", "", 260), longValue.substr(0, 259));
    EXPECT_EQ(value("S", "after"), "ok");
}

TEST_F(ProfileReading, BinaryFileGivesDefaultsOrOddValuesWithoutHarm)
{
    std::string bytes;
    for (int i = 0; i < 4096; ++i) {
        bytes.push_back(static_cast<char>((i * 37 + 11) & 0xFF));
    }
    path = dir.write("bin.ini", bytes);
    value("S", "k");
    keys("S", 64);
    path = dir.write("bin2.ini", std::string("[S]\nk=a\0b\nz=\xff\xfe\n", 16));
    EXPECT_EQ(value("S", "k"), "a");
    EXPECT_EQ(value("S", "z"), "\xff\xfe");
    path = dir.write("bin3.ini", std::string("[S]\n=empty\n\0x=1\nk=2\n", 20));
    EXPECT_EQ(keys("S"), "k|");
}

TEST_F(ProfileReading, ListsKeyNamesEachEndedByZero)
{
    path = dir.write("a.ini", "[HEADERS]\nOne=a.h\ntwo = b.h\nONE=dup.h\n[Other]\nthree=c\n");
    EXPECT_EQ(keys("headers"), "One|two|");
    EXPECT_EQ(keys("missing"), "");
}

TEST_F(ProfileReading, KeyListCutAtBufferStillEndsWithEmptyName)
{
    path = dir.write("a.ini", "[S]\nalpha=1\nbeta=2\ngamma=3\n");
    std::uint32_t returned = 0;
    EXPECT_EQ(keys("S", 9, &returned), "alpha|b|");
    EXPECT_EQ(returned, 7u);
    EXPECT_EQ(keys("S", 18, &returned), "alpha|beta|gamma|");
    EXPECT_EQ(returned, 17u);
    EXPECT_EQ(keys("S", 17, &returned), "alpha|beta|gamm|");
    EXPECT_EQ(returned, 15u);
    EXPECT_EQ(keys("S", 2, &returned), "");
    EXPECT_EQ(returned, 0u);
}

TEST_F(ProfileReading, ListsSectionNamesWithoutSection)
{
    path = dir.write("a.ini", "[A]\nk=1\n[B]\n[a]\n");
    EXPECT_EQ(keys(nullptr), "A|B|");
}

TEST_F(ProfileReading, SkipsByteOrderMark)
{
    path = dir.write("a.ini", "\xEF\xBB\xBF[S]\nk=v\n");
    EXPECT_EQ(value("S", "k"), "v");
}

class ProfileLocation : public ::testing::Test {
protected:
    void SetUp() override
    {
        saveVariable("XDG_CONFIG_HOME", savedXdg, hadXdg);
        saveVariable("HOME", savedHome, hadHome);
    }
    void TearDown() override
    {
        restoreVariable("XDG_CONFIG_HOME", savedXdg, hadXdg);
        restoreVariable("HOME", savedHome, hadHome);
    }

    static void saveVariable(const char* name, std::string& saved, bool& had)
    {
        const char* current = getenv(name);
        had = current != nullptr;
        saved = had ? current : "";
    }
    static void restoreVariable(const char* name, const std::string& saved, bool had)
    {
        if (had) {
            setenv(name, saved.c_str(), 1);
        } else {
            unsetenv(name);
        }
    }

    std::string savedXdg, savedHome;
    bool hadXdg = false, hadHome = false;
    testsupport::TempDirectory dir;
};

TEST_F(ProfileLocation, NameWithoutDirectoryIsReadFromXdgConfigHome)
{
    std::filesystem::create_directories(dir.path() + "config/harbor");
    dir.write("config/harbor/Harbor.ini", "[S]\nk=from-xdg\n");
    setenv("XDG_CONFIG_HOME", (dir.path() + "config").c_str(), 1);
    char buffer[32];
    ReadProfileString("S", "k", "", buffer, sizeof buffer, "Harbor.ini");
    EXPECT_STREQ(buffer, "from-xdg");
    EXPECT_EQ(platform::ResolveProfilePath("Harbor.ini"), dir.path() + "config/harbor/Harbor.ini");
}

TEST_F(ProfileLocation, WithoutXdgConfigHomeUsesDotConfigInHome)
{
    unsetenv("XDG_CONFIG_HOME");
    setenv("HOME", (dir.path() + "home").c_str(), 1);
    std::filesystem::create_directories(dir.path() + "home/.config/harbor");
    dir.write("home/.config/harbor/Harbor.ini", "[S]\nk=from-home\n");
    char buffer[32];
    ReadProfileString("S", "k", "", buffer, sizeof buffer, "Harbor.ini");
    EXPECT_STREQ(buffer, "from-home");
}

TEST_F(ProfileLocation, PathWithDirectoryIsUsedAsWritten)
{
    EXPECT_EQ(platform::ResolveProfilePath("./Harbor.ini"), "./Harbor.ini");
    EXPECT_EQ(platform::ResolveProfilePath("/etc/x.ini"), "/etc/x.ini");
}

} // namespace
