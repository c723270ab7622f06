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

TEST_F(ProfileReading, ReadsValuesOfWellAndBadlyFormedFiles)
{
    const struct {
        const char* what;
        std::string content;
        const char* section;
        const char* key;
        const char* expected;
    } cases[] = {
        {"names in any case", "[Paths]\nDll = /opt/tessel/ \n", "paths", "DLL", "/opt/tessel/"},
        {"blanks and quotes", "  [ S ]  \r\n\t k \t=\t \"quoted value \" \r\n", "S", "k",
         "quoted value "},
        {"single quotes", "[S]\nk='single'\n", "S", "k", "single"},
        {"unclosed quote", "[S]\nk=\"open\r\n", "S", "k", "\"open"},
        {"mismatched quotes", "[S]\nk=\"mixed'\n", "S", "k", "\"mixed'"},
        {"empty quotes", "[S]\nk=\"\"\n", "S", "k", ""},
        {"empty value is a value", "[S]\nk=\n", "S", "k", ""},
        {"commented key", "[S]\n  ; k=also\njust text\nkey=real\n", "S", "k", "dflt"},
        {"from the first equals", "[S]\nk = a=b ; not a comment\n", "S", "k",
         "a=b ; not a comment"},
        {"text after a section", "[T] trailing\nx=1\n", "T", "x", "1"},
        {"missing section", "[S]\nk=v\n", "T", "k", "dflt"},
        {"missing key", "[S]\nk=v\n", "S", "other", "dflt"},
        {"empty file", "", "S", "k", "dflt"},
        {"no sections", "k=v\nother=w\n", "S", "k", "dflt"},
        {"first key wins", "[S]\nk=first\nk=second\n", "S", "k", "first"},
        {"first section wins", "[S]\nk=1\n[T]\n[s]\nk=third\nonly=later\n", "S", "only", "dflt"},
        {"byte order mark", "\xEF\xBB\xBF[S]\nk=v\n", "S", "k", "v"},
        {"zero byte ends a line", std::string("[S]\nk=a\0b\n", 10), "S", "k", "a"},
        {"high bytes", "[S]\nz=\xff\xfe\n", "S", "z", "\xff\xfe"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        path = dir.write("a.ini", c.content);
        EXPECT_EQ(value(c.section, c.key), c.expected);
    }
}

TEST_F(ProfileReading, MissingOrUnreadableFilesGiveDefaults)
{
    path = dir.write("a.ini", "[S]\nk=v\n");
    EXPECT_EQ(value("S", "other", nullptr), "");
    for (const std::string& unreadable : {dir.path() + "absent.ini", dir.path()}) {
        path = unreadable;
        EXPECT_EQ(value("S", "k"), "dflt");
        EXPECT_EQ(keys("S"), "");
    }
    std::string bytes;
    for (int i = 0; i < 4096; ++i) {
        bytes.push_back(static_cast<char>((i * 37 + 11) & 0xFF));
    }
    path = dir.write("bin.ini", bytes);
    value("S", "k");
    keys("S", 64);
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

TEST_F(ProfileReading, ListsKeyAndSectionNamesEachEndedByZero)
{
    path = dir.write("a.ini",
                     "[HEADERS]\nOne=a.h\n;c=1\njust text\ntwo = b.h\nONE=dup.h\n[Other]\nthree=c\n"
                     "[headers]\nlater=1\n");
    EXPECT_EQ(keys("headers"), "One|two|");
    EXPECT_EQ(keys("missing"), "");
    EXPECT_EQ(keys(nullptr), "HEADERS|Other|");
    path = dir.write("bin3.ini", std::string("[S]\n=empty\n\0x=1\nk=2\n", 20));
    EXPECT_EQ(keys("S"), "k|");
}

TEST_F(ProfileReading, KeyListCutAtBufferStillEndsWithEmptyName)
{
    path = dir.write("a.ini", "[S]\nalpha=1\nbeta=2\ngamma=3\n");
    const struct {
        std::uint32_t size;
        const char* list;
        std::uint32_t returned;
    } cases[] = {{9, "alpha|b|", 7},
                 {18, "alpha|beta|gamma|", 17},
                 {17, "alpha|beta|gamm|", 15},
                 {2, "", 0}};
    for (const auto& c : cases) {
        std::uint32_t returned = 99;
        EXPECT_EQ(keys("S", c.size, &returned), c.list) << c.size;
        EXPECT_EQ(returned, c.returned) << c.size;
    }
}

// Puts a variable of the environment back as it was.
class SavedVariable {
public:
    explicit SavedVariable(const char* name) : name_(name), had_(getenv(name) != nullptr)
    {
        saved_ = had_ ? getenv(name) : "";
    }
    ~SavedVariable() { had_ ? setenv(name_, saved_.c_str(), 1) : unsetenv(name_); }

private:
    const char* name_;
    bool had_;
    std::string saved_;
};

class ProfileLocation : public ::testing::Test {
protected:
    SavedVariable xdg{"XDG_CONFIG_HOME"}, home{"HOME"};
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
