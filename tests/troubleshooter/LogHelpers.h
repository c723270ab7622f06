// A log file path of its own for each test, and reading the log back whole.
#pragma once

#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <sstream>
#include <string>
#include <unistd.h>
#include <vector>

#include "troubleshooter/OutcomeView.h"

class TempLog {
public:
    TempLog()
    {
        const auto* info = testing::UnitTest::GetInstance()->current_test_info();
        std::string leaf = "harbor_ts_" + std::to_string(getpid()) + "_" + info->test_suite_name() +
                           "_" + info->name() + ".log";
        for (char& c : leaf) {
            if (c == '/') {
                c = '_';
            }
        }
        path_ = testing::TempDir() + leaf;
        std::remove(path_.c_str());
    }
    ~TempLog() { std::remove(path_.c_str()); }

    const char* path() const { return path_.c_str(); }
    bool exists() const { return std::ifstream(path_).good(); }
    std::string contents() const
    {
        std::ifstream in(path_, std::ios::binary);
        std::stringstream text;
        text << in.rdbuf();
        return text.str();
    }
    // The log after the banner (the first blank line).
    std::string body() const
    {
        const std::string all = contents();
        const auto end = all.find("\n\n");
        return end == std::string::npos ? all : all.substr(end + 2);
    }

private:
    std::string path_;
};

// Records the outcomes shown; no help is ever open unless a test says so.
class RecordingView final : public OutcomeView {
public:
    std::vector<int> shown;
    bool topicsExist = true;
    int pumpsLeft = 0; // PumpMessage calls before the help reports itself closed
    int pumps = 0;

    bool ShowOutcome(int outcome) override
    {
        shown.push_back(outcome);
        return topicsExist;
    }
    bool PumpMessage() override
    {
        ++pumps;
        if (pumpsLeft > 0) {
            --pumpsLeft;
        }
        return pumpsLeft > 0;
    }
    bool HelpOpen() const override { return pumpsLeft > 0; }
};
