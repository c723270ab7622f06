// The fakes the Trouble Shooter tests share: scripted brick calls that record every call, a
// log file of each test's own, an outcome view and a help viewer that record what they show.
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <deque>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "platform/SystemInfoScripted.h"
#include "troubleshooter/BrickCalls.h"
#include "troubleshooter/HelpViewer.h"
#include "troubleshooter/OutcomeView.h"

using Strings = std::vector<std::string>;

inline std::string HelpDirectory()
{
    const std::string file = HARBOR_HELP_FILE;
    return file.substr(0, file.rfind('/') + 1);
}

constexpr std::int32_t Packed(std::uint32_t value)
{
    return static_cast<std::int32_t>(value);
}

struct EnumItem {
    tessel::Long result;
    tessel::Short item;
    std::string name;
};

class FakeBrickCalls final : public BrickCalls {
public:
    std::deque<std::pair<tessel::Long, std::string>> findPortAnswers; // then no more ports
    tessel::Long createHandle = 77;
    std::map<tessel::Short, std::deque<tessel::Long>> statusAnswers; // by what; then last
    std::map<tessel::Short, tessel::Long> lastStatus{{2, 1}, {3, 1}};
    tessel::Long getBrickTypeResult = 0;
    tessel::Short brickType = 5;
    tessel::Long getPortResult = 0;
    tessel::Short portKind = 1;
    std::string portName = "COM1";
    tessel::Long setResult = 0;
    std::map<tessel::Short, std::deque<EnumItem>> enumAnswers; // by enum type; then the end
    tessel::Long runResult = 0;

    Strings calls;
    bool forbidCalls = false; // any call fails the test

    tessel::Long FindPort(char* name, tessel::Size size) override
    {
        Record("FindPort", name);
        if (findPortAnswers.empty()) {
            return Packed(0xE0050444u);
        }
        const auto answer = findPortAnswers.front();
        findPortAnswers.pop_front();
        std::snprintf(name, size, "%s", answer.second.c_str());
        return answer.first;
    }
    tessel::Long Create(const char* port) override
    {
        Record("Create", port);
        return createHandle;
    }
    int Destroy(tessel::Long hBrick) override
    {
        Record("Destroy", hBrick);
        return 1;
    }
    tessel::Long Status(tessel::Long hBrick, tessel::Short what, char*, tessel::Size) override
    {
        Record("Status", hBrick, what);
        auto& queue = statusAnswers[what];
        if (queue.empty()) {
            return lastStatus[what];
        }
        const tessel::Long answer = queue.front();
        queue.pop_front();
        return answer;
    }
    tessel::Long Set(tessel::Long hBrick, tessel::Short property, tessel::Short value) override
    {
        Record("Set", hBrick, property, value);
        return setResult;
    }
    tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value, char* text,
                     tessel::Size size) override
    {
        Record("Get", hBrick, property);
        const bool port = property == tessel::PropPort;
        const tessel::Long result = port ? getPortResult : getBrickTypeResult;
        if (result >= 0) {
            *value = port ? portKind : brickType;
            if (port) {
                std::snprintf(text, size, "%s", portName.c_str());
            }
        }
        return result;
    }
    tessel::Long FindFirst(tessel::Short type, tessel::Short* item, char* name,
                           tessel::Size size) override
    {
        Record("FindFirst", type);
        return NextItem(type, item, name, size);
    }
    tessel::Long FindNext(tessel::Short type, tessel::Short* item, char* name,
                          tessel::Size size) override
    {
        Record("FindNext", type);
        return NextItem(type, item, name, size);
    }
    tessel::Long RunImmediate(tessel::Long hBrick, const char* text, tessel::Long*) override
    {
        Record("RunImmediate", hBrick, text);
        return runResult;
    }

private:
    // Records "Name(arg,arg)".
    template <typename... Args> void Record(const char* name, const Args&... args)
    {
        std::ostringstream call;
        const char* separator = "";
        call << name << '(';
        ((call << separator << args, separator = ","), ...);
        call << ')';
        EXPECT_FALSE(forbidCalls) << "forbidden call " << call.str();
        calls.push_back(call.str());
    }
    tessel::Long NextItem(tessel::Short type, tessel::Short* item, char* name, tessel::Size size)
    {
        auto& queue = enumAnswers[type];
        if (queue.empty()) {
            // The end of the list leaves the name buffer holding rubbish.
            std::snprintf(name, size, "%s", "garbage");
            return static_cast<tessel::Long>(tessel::kNoMoreItems);
        }
        const EnumItem answer = queue.front();
        queue.pop_front();
        *item = answer.item;
        std::snprintf(name, size, "%s", answer.name.c_str());
        return answer.result;
    }
};

inline std::string ReadFile(const std::string& path)
{
    std::stringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

// The log after the banner (up to the first blank line).
inline std::string LogBody(const std::string& log)
{
    const auto end = log.find("\n\n");
    return end == std::string::npos ? log : log.substr(end + 2);
}

// A log file path of each test's own, removed before and after.
class TempLog {
public:
    TempLog()
    {
        const auto* info = testing::UnitTest::GetInstance()->current_test_info();
        path_ = testing::TempDir() + "harbor_ts_" + std::to_string(getpid()) + "_" +
                info->test_suite_name() + "_" + info->name() + ".log";
        std::remove(path_.c_str());
    }
    ~TempLog() { std::remove(path_.c_str()); }

    const char* path() const { return path_.c_str(); }
    bool exists() const { return std::ifstream(path_).good(); }
    std::string contents() const { return ReadFile(path_); }
    std::string body() const { return LogBody(contents()); }

private:
    std::string path_;
};

// Records the outcomes shown; the help stays open for pumpsLeft pumps.
class RecordingView final : public OutcomeView {
public:
    std::vector<int> shown;
    int pumpsLeft = 0;
    int pumps = 0;

    bool ShowOutcome(int outcome) override
    {
        shown.push_back(outcome);
        return true;
    }
    bool PumpMessage() override
    {
        ++pumps;
        pumpsLeft -= pumpsLeft > 0 ? 1 : 0;
        return pumpsLeft > 0;
    }
    bool HelpOpen() const override { return pumpsLeft > 0; }
};

// Records each help-viewer call and answers as the test says.
class RecordingViewer final : public HelpViewer {
public:
    int openAnswer = 1;
    Strings calls;
    Strings macros; // the macros alone
    ui::WindowHandle lastOwner = ui::kNoWindow;

    int OpenFile(ui::WindowHandle owner, const char* file) override
    {
        return Record(owner, std::string("open ") + file, openAnswer);
    }
    int RunMacro(ui::WindowHandle owner, const char*, const char* macro) override
    {
        macros.push_back(macro);
        return Record(owner, std::string("macro ") + macro, 1);
    }
    int Quit(ui::WindowHandle owner, const char* file) override
    {
        return Record(owner, std::string("quit ") + file, 1);
    }

private:
    int Record(ui::WindowHandle owner, const std::string& call, int answer)
    {
        lastOwner = owner;
        calls.push_back(call);
        return answer;
    }
};

// A log, scripted brick calls and system, and the dialog's handle slot holding 5.
class ShooterFixture : public testing::Test {
protected:
    TempLog log;
    FakeBrickCalls calls;
    platform::ScriptedSystemInfo system;
    tessel::Long handle = 5;
};
