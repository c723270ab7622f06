// A help viewer that records each WinHelp-style call and answers as the test says.
#pragma once

#include <string>
#include <vector>

#include "troubleshooter/HelpViewer.h"

class RecordingViewer final : public HelpViewer {
public:
    int openAnswer = 1;
    int macroAnswer = 1;
    int quitAnswer = 1;
    std::vector<std::string> calls;
    ui::WindowHandle lastOwner = ui::kNoWindow;

    int OpenFile(ui::WindowHandle owner, const char* file) override
    {
        lastOwner = owner;
        calls.push_back(std::string("open ") + file);
        return openAnswer;
    }
    int RunMacro(ui::WindowHandle owner, const char* file, const char* macro) override
    {
        lastOwner = owner;
        calls.push_back(std::string("macro ") + macro);
        return macroAnswer;
    }
    int Quit(ui::WindowHandle owner, const char* file) override
    {
        lastOwner = owner;
        calls.push_back(std::string("quit ") + file);
        return quitAnswer;
    }
    std::vector<std::string> Macros() const
    {
        std::vector<std::string> macros;
        for (const std::string& call : calls) {
            if (call.rfind("macro ", 0) == 0) {
                macros.push_back(call.substr(6));
            }
        }
        return macros;
    }
};
