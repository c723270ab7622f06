// Runs every source file under language/, limits/ and errors/ through the translator and
// checks the expectations written in its comments:
//
//   expect: ok                            translates
//   expect error 16 at 42: count          fails with compiler code 16 at offset 42, detail
//   expect error 16 at "count +": count   ... at the first place that text stands (comments
//                                         holding expectations do not count)
//   expect error driver 21 at 0           a driver code (library N: a library code)
//   expect object: <line>                 a line of the object text
//   expect listing: <line>                a line of the CSV listing
//   expect symbol: <line>                 a line of the symbol table
//   expect commands: 7                    "cmd" occurs 7 times in the object
//   expect var total = 10                 after running main to its end (or an immediate
//                                         object; v3 names global 3 in sources without names),
//   expect sent: 1 2 3                    object), a global's value, the messages sent,
//   expect sounds: 4                      the system sounds played,
//   expect tones: 440 50                  the tones (frequency, duration) played
//   expect requests: 2 4                  the brick requests made (Request numbers)
//   brick: 5                              translate for this brick type (default 6)
//
// The source type follows from the extension: .onyx2 script, .opal, .raw, .bin object text,
// .kvo firmware image. Include files come from include/ here, then from resources/include.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "FakeHost.h"
#include "Machine.h"
#include "Program.h"
#include "Status.h"
#include "Translator.h"

namespace fs = std::filesystem;
using namespace tessel::lang;

namespace {

std::string ReadFile(const fs::path& path)
{
    std::ifstream in(path, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

class DirectoryIncludes : public IncludeReader {
public:
    bool readInclude(const std::string& name, std::string& text) override
    {
        for (const char* dir : {SIMLANG_TEST_DIR "/include", SIMLANG_RESOURCES_DIR "/include"}) {
            // Files are kept under their own spelling; the reader is asked in lower case.
            std::error_code error;
            for (const auto& entry : fs::directory_iterator(dir, error)) {
                std::string file = entry.path().filename().string();
                std::transform(file.begin(), file.end(), file.begin(),
                               [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
                if (file == name) {
                    text = ReadFile(entry.path());
                    return true;
                }
            }
        }
        return false;
    }
};

struct Expectations {
    bool ok = false;
    bool error = false;
    std::int32_t code = 0;
    std::string where; // a number or a quoted text
    bool checkDetail = false;
    std::string detail;
    std::vector<std::string> objectLines, listingLines, symbolLines;
    int commands = -1;
    std::vector<std::pair<std::string, int>> vars;
    std::map<std::string, std::vector<int>> effects; // sent, sounds, tones, requests
    int brickType = 6;
};

std::vector<int> Numbers(const std::string& text)
{
    std::vector<int> out;
    std::istringstream in(text);
    int n = 0;
    while (in >> n) {
        out.push_back(n);
    }
    return out;
}

// Reads the expectations and blanks the comments that hold them, so that a quoted position
// text is found in the code and not in its own expectation.
Expectations Parse(std::string& source)
{
    Expectations e;
    static const std::regex kLine(R"((//|;|#)\s*(expect|brick:)(.*))");
    static const std::regex kError(
        R"(\s*error\s+(driver\s+|library\s+)?(\d+)\s+at\s+(\d+|"[^"]*")(:\s?(.*))?)");
    static const std::regex kVar(R"(\s*var\s+(\w+)\s*=\s*(-?\d+)\s*)");
    static const std::regex kEffect(R"(\s*(sent|sounds|tones|requests):(.*))");
    std::size_t pos = 0;
    while (pos < source.size()) {
        std::size_t end = source.find('\n', pos);
        if (end == std::string::npos) {
            end = source.size();
        }
        std::string line = source.substr(pos, end - pos);
        if (!line.empty() && line.back() == '\r') {
            line.pop_back();
        }
        std::smatch m;
        if (std::regex_search(line, m, kLine)) {
            const std::string word = m[2];
            const std::string rest = m[3];
            if (word == "brick:") {
                e.brickType = std::stoi(rest);
            } else if (rest.rfind(": ok", 0) == 0) {
                e.ok = true;
            } else if (std::smatch em; std::regex_match(rest, em, kError)) {
                e.error = true;
                const int code = std::stoi(em[2]);
                const std::string kind = em[1];
                e.code = kind.rfind("driver", 0) == 0    ? DriverError(code)
                         : kind.rfind("library", 0) == 0 ? LibraryError(code)
                                                         : CompilerError(code);
                e.where = em[3];
                e.checkDetail = em[4].matched;
                e.detail = em[5];
            } else if (rest.rfind(" object: ", 0) == 0) {
                e.objectLines.push_back(rest.substr(9));
            } else if (rest.rfind(" listing: ", 0) == 0) {
                e.listingLines.push_back(rest.substr(10));
            } else if (rest.rfind(" symbol: ", 0) == 0) {
                e.symbolLines.push_back(rest.substr(9));
            } else if (rest.rfind(" commands: ", 0) == 0) {
                e.commands = std::stoi(rest.substr(11));
            } else if (std::smatch vm; std::regex_match(rest, vm, kVar)) {
                e.vars.emplace_back(vm[1], std::stoi(vm[2]));
            } else if (std::smatch fm; std::regex_match(rest, fm, kEffect)) {
                e.effects[fm[1]] = Numbers(fm[2]);
            } else {
                ADD_FAILURE() << "unreadable expectation: " << line;
            }
            const std::size_t from = pos + static_cast<std::size_t>(m.position(0));
            std::fill(source.begin() + static_cast<long>(from),
                      source.begin() + static_cast<long>(end), ' ');
        }
        pos = end + 1;
    }
    return e;
}

std::vector<std::string> Lines(const std::string& text)
{
    std::vector<std::string> lines;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        if (!line.empty() && line.back() == '\r') {
            line.pop_back();
        }
        lines.push_back(line);
    }
    return lines;
}

void ExpectLines(const std::string& what, const std::string& text,
                 const std::vector<std::string>& wanted)
{
    const std::vector<std::string> lines = Lines(text);
    for (const std::string& line : wanted) {
        EXPECT_NE(std::find(lines.begin(), lines.end(), line), lines.end())
            << what << " lacks the line \"" << line << "\"; it holds:\n"
            << text;
    }
}

int SourceTypeOf(const fs::path& path)
{
    const std::string ext = path.extension().string();
    if (ext == ".opal")
        return SourceOpal;
    if (ext == ".raw")
        return SourceRaw;
    if (ext == ".bin")
        return SourceObject;
    if (ext == ".kvo")
        return SourceFirmware;
    return SourceScript;
}

int CountCmd(const std::string& text)
{
    int count = 0;
    for (std::size_t at = text.find("cmd"); at != std::string::npos;
         at = text.find("cmd", at + 3)) {
        ++count;
    }
    return count;
}

std::vector<fs::path> ScriptFiles()
{
    std::vector<fs::path> files;
    for (const char* folder : {"language", "limits", "errors"}) {
        const fs::path dir = fs::path(SIMLANG_TEST_DIR) / folder;
        std::error_code error;
        for (const auto& entry : fs::directory_iterator(dir, error)) {
            if (entry.is_regular_file()) {
                files.push_back(entry.path());
            }
        }
    }
    std::sort(files.begin(), files.end());
    return files;
}

class ScriptFile : public testing::TestWithParam<fs::path> {};

TEST_P(ScriptFile, MeetsItsExpectations)
{
    const fs::path path = GetParam();
    std::string source = ReadFile(path);
    const Expectations e = Parse(source);
    ASSERT_TRUE(e.ok || e.error) << path << " states neither 'expect: ok' nor an error";

    DirectoryIncludes includes;
    Translator translator;
    TranslateRequest request;
    request.brickType = e.brickType;
    request.sourceType = SourceTypeOf(path);
    request.source = source;
    request.includes = &includes;
    const TranslateResult result = translator.translate(request);

    if (e.error) {
        std::int32_t where = 0;
        if (e.where[0] == '"') {
            const std::string text = e.where.substr(1, e.where.size() - 2);
            const std::size_t at = source.find(text);
            ASSERT_NE(at, std::string::npos) << "position text " << e.where << " not in the source";
            where = static_cast<std::int32_t>(at);
        } else {
            where = std::stoi(e.where);
        }
        EXPECT_EQ(result.code, e.code)
            << std::hex << "got 0x" << result.code << " want 0x" << e.code << std::dec
            << " (detail \"" << result.detail << "\")";
        EXPECT_EQ(result.offset, where);
        if (e.checkDetail) {
            EXPECT_EQ(result.detail, e.detail);
        }
        EXPECT_TRUE(result.output.empty());
        return;
    }
    ASSERT_EQ(result.code, 0) << std::hex << "0x" << result.code << std::dec << " at "
                              << result.offset << ": " << result.detail;
    ExpectLines("object", result.output, e.objectLines);
    ExpectLines("symbol table", result.symbols, e.symbolLines);
    if (e.commands >= 0) {
        EXPECT_EQ(CountCmd(result.output), e.commands) << result.output;
    }
    // The object must read back, and count as many commands as "cmd" markers.
    Program program;
    const ParseResult parsed = ParseObject(result.output, program);
    ASSERT_EQ(parsed.code, 0) << parsed.detail << " at " << parsed.offset << " in\n"
                              << result.output;
    EXPECT_EQ(program.commandCount, CountCmd(result.output));

    if (!e.listingLines.empty()) {
        request.targetType = TargetListing;
        const TranslateResult listing = translator.translate(request);
        ASSERT_EQ(listing.code, 0);
        ExpectLines("listing", listing.output, e.listingLines);
    }

    if (e.vars.empty() && e.effects.empty()) {
        return;
    }
    simlang_test::FakeHost host(&program);
    Machine machine(e.brickType, host);
    if (program.kind == ObjectKind::Immediate) {
        machine.execute(program);
    } else {
        ASSERT_EQ(machine.startTask(0), 0);
        for (int i = 0; i < 100000 && machine.anyTaskRunning(); ++i) {
            machine.advance(10, 100000);
        }
        EXPECT_FALSE(machine.anyTaskRunning()) << "main did not end";
        EXPECT_EQ(machine.lastFault(), 0);
    }
    for (const auto& [name, value] : e.vars) {
        const std::string prefix = "var,";
        const std::vector<std::string> symbols = Lines(result.symbols);
        int index = -1;
        for (const std::string& line : symbols) {
            const std::size_t comma = line.rfind(',');
            if (line.rfind(prefix, 0) == 0 && line.substr(comma + 1) == name) {
                index = std::stoi(line.substr(prefix.size()));
            }
        }
        if (index < 0 && name.size() > 1 && name[0] == 'v' &&
            std::isdigit(static_cast<unsigned char>(name[1]))) {
            index = std::stoi(name.substr(1)); // sources without names: v<index>
        }
        ASSERT_GE(index, 0) << "no variable " << name;
        EXPECT_EQ(host.variables[index], value) << "variable " << name;
    }
    const std::map<std::string, std::vector<int>> seen = {{"sent", host.messages},
                                                          {"sounds", host.sounds},
                                                          {"tones", host.tones},
                                                          {"requests", host.requests}};
    for (const auto& [what, wanted] : e.effects) {
        EXPECT_EQ(seen.at(what), wanted) << what;
    }
}

std::string TestName(const testing::TestParamInfo<fs::path>& info)
{
    std::string name = info.param.parent_path().filename().string() + "_" +
                       info.param.stem().string() + "_" + info.param.extension().string().substr(1);
    for (char& c : name) {
        if (!std::isalnum(static_cast<unsigned char>(c))) {
            c = '_';
        }
    }
    return name;
}

INSTANTIATE_TEST_SUITE_P(Sources, ScriptFile, testing::ValuesIn(ScriptFiles()), TestName);

} // namespace
