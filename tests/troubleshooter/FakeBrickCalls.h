// A scripted BrickCalls: every answer is set by the test, every call is recorded as one
// line, and a test can forbid all calls to prove that none was made.
#pragma once

#include <gtest/gtest.h>

#include <cstdio>
#include <deque>
#include <map>
#include <string>
#include <vector>

#include "troubleshooter/BrickCalls.h"

struct EnumItem {
    tessel::Long result;
    tessel::Short item;
    std::string name;
};

class FakeBrickCalls final : public BrickCalls {
public:
    // --- answers ---
    std::deque<std::pair<tessel::Long, std::string>> findPortAnswers; // then kNoMorePorts
    tessel::Long createHandle = 77;
    std::map<tessel::Short, std::deque<tessel::Long>> statusAnswers; // by what; then last
    std::map<tessel::Short, tessel::Long> lastStatus{{2, 1}, {3, 1}};
    tessel::Long getBrickTypeResult = 0;
    tessel::Short brickType = 6;
    tessel::Long getPortResult = 0;
    tessel::Short portKind = 1;
    std::string portName = "COM1";
    tessel::Long setResult = 0;
    std::map<tessel::Short, std::deque<EnumItem>> enumAnswers; // by enum type; then end
    tessel::Long runResult = 0;

    // --- what happened ---
    std::vector<std::string> calls;
    bool forbidCalls = false;

    tessel::Long FindPort(char* name, tessel::Size size) override
    {
        Record("FindPort(" + std::string(name) + ")");
        if (findPortAnswers.empty()) {
            return static_cast<tessel::Long>(0xE0050444u);
        }
        auto answer = findPortAnswers.front();
        findPortAnswers.pop_front();
        std::snprintf(name, size, "%s", answer.second.c_str());
        return answer.first;
    }
    tessel::Long Create(const char* port) override
    {
        Record("Create(" + std::string(port) + ")");
        return createHandle;
    }
    int Destroy(tessel::Long hBrick) override
    {
        Record("Destroy(" + std::to_string(hBrick) + ")");
        return 1;
    }
    tessel::Long Status(tessel::Long hBrick, tessel::Short what, char* text,
                        tessel::Size size) override
    {
        Record("Status(" + std::to_string(hBrick) + "," + std::to_string(what) + ")");
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
        Record("Set(" + std::to_string(hBrick) + "," + std::to_string(property) + "," +
               std::to_string(value) + ")");
        return setResult;
    }
    tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value, char* text,
                     tessel::Size size) override
    {
        Record("Get(" + std::to_string(hBrick) + "," + std::to_string(property) + ")");
        if (property == tessel::PropBrickType) {
            if (getBrickTypeResult >= 0) {
                *value = brickType;
            }
            return getBrickTypeResult;
        }
        if (property == tessel::PropPort) {
            if (getPortResult >= 0) {
                *value = portKind;
                std::snprintf(text, size, "%s", portName.c_str());
            }
            return getPortResult;
        }
        ADD_FAILURE() << "unexpected property " << property;
        return -1;
    }
    tessel::Long FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                           tessel::Size size) override
    {
        Record("FindFirst(" + std::to_string(enumType) + ")");
        return NextItem(enumType, item, name, size);
    }
    tessel::Long FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                          tessel::Size size) override
    {
        Record("FindNext(" + std::to_string(enumType) + ")");
        return NextItem(enumType, item, name, size);
    }
    tessel::Long RunImmediate(tessel::Long hBrick, const char* text, tessel::Long* result) override
    {
        Record("RunImmediate(" + std::to_string(hBrick) + "," + text + ")");
        return runResult;
    }

private:
    void Record(const std::string& call)
    {
        if (forbidCalls) {
            ADD_FAILURE() << "forbidden call " << call;
        }
        calls.push_back(call);
    }
    tessel::Long NextItem(tessel::Short enumType, tessel::Short* item, char* name,
                          tessel::Size size)
    {
        auto& queue = enumAnswers[enumType];
        if (queue.empty()) {
            // The end of the list leaves the name buffer holding rubbish.
            std::snprintf(name, size, "%s", "garbage");
            return static_cast<tessel::Long>(tessel::kNoMoreItems);
        }
        EnumItem answer = queue.front();
        queue.pop_front();
        *item = answer.item;
        std::snprintf(name, size, "%s", answer.name.c_str());
        return answer.result;
    }
};
