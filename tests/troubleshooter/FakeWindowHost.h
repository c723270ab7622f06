// A window layer with only what the help link uses: plain windows, a posted-message queue
// and the nested pump. When the queue runs dry, the pump runs the test's next scripted
// action (a command the help "sends"); with none left it reports the quit request, so that
// a faulty run ends instead of waiting for ever.
#pragma once

#include <gtest/gtest.h>

#include <deque>
#include <functional>
#include <map>
#include <string>

#include "ui/Window.h"

class FakeWindowHost final : public ui::WindowHost {
public:
    struct Posted {
        ui::WindowHandle window;
        ui::Message message;
        ui::WParam wParam;
        ui::LParam lParam;
    };

    std::map<ui::WindowHandle, std::pair<std::string, ui::WindowObject*>> windows;
    std::deque<Posted> queue;
    std::deque<std::function<void()>> whenIdle;
    bool quit = false;
    int pumps = 0;
    int destroyed = 0;
    bool refuseWindows = false;

    ui::WindowHandle OnlyWindow() const
    {
        return windows.size() == 1 ? windows.begin()->first : ui::kNoWindow;
    }

    ui::WindowHandle CreateDialogWindow(const ui::DialogTemplate&, ui::WindowObject*) override
    {
        ADD_FAILURE() << "no dialog expected";
        return ui::kNoWindow;
    }
    ui::WindowHandle CreatePlainWindow(const char* className, ui::WindowObject* object) override
    {
        if (refuseWindows) {
            return ui::kNoWindow;
        }
        const ui::WindowHandle handle = next_++;
        windows[handle] = {className, object};
        object->AttachWindow(handle);
        return handle;
    }
    void ShowWindow(ui::WindowHandle) override { ADD_FAILURE() << "the help window stays hidden"; }
    void DestroyWindow(ui::WindowHandle window) override
    {
        const auto found = windows.find(window);
        if (found == windows.end()) {
            return;
        }
        ui::LResult result = 0;
        found->second.second->OnMessage(ui::kMsgDestroy, 0, 0, result);
        found->second.second->DetachWindow();
        windows.erase(found);
        ++destroyed;
    }
    void SetWindowTitle(ui::WindowHandle, const char*) override {}
    void Repaint(ui::WindowHandle) override {}

    bool PostMessage(ui::WindowHandle window, ui::Message message, ui::WParam wParam,
                     ui::LParam lParam) override
    {
        if (windows.count(window) == 0) {
            return false;
        }
        queue.push_back({window, message, wParam, lParam});
        return true;
    }
    ui::LResult SendMessage(ui::WindowHandle window, ui::Message message, ui::WParam wParam,
                            ui::LParam lParam) override
    {
        const auto found = windows.find(window);
        ui::LResult result = 0;
        if (found != windows.end()) {
            found->second.second->OnMessage(message, wParam, lParam, result);
        }
        return result;
    }
    void PostQuit(int) override { quit = true; }
    int RunMessageLoop() override
    {
        while (PumpMessage()) {
        }
        return 0;
    }
    bool PumpMessage() override
    {
        ++pumps;
        while (queue.empty()) {
            if (quit || whenIdle.empty()) {
                quit = true;
                return false;
            }
            auto action = std::move(whenIdle.front());
            whenIdle.pop_front();
            action();
        }
        const Posted posted = queue.front();
        queue.pop_front();
        SendMessage(posted.window, posted.message, posted.wParam, posted.lParam);
        return true;
    }

    void SetControlText(ui::WindowHandle, int, const char*) override {}
    std::uint32_t GetControlText(ui::WindowHandle, int, char* buffer, std::uint32_t size) override
    {
        if (size > 0) {
            buffer[0] = '\0';
        }
        return 0;
    }
    std::uint32_t GetControlTextLength(ui::WindowHandle, int) override { return 0; }
    void SetCheck(ui::WindowHandle, int, bool) override {}
    bool IsChecked(ui::WindowHandle, int) override { return false; }
    void EnableControl(ui::WindowHandle, int, bool) override {}
    bool IsControlEnabled(ui::WindowHandle, int) override { return false; }
    void ShowControl(ui::WindowHandle, int, bool) override {}
    bool IsControlVisible(ui::WindowHandle, int) override { return false; }
    int ListAdd(ui::WindowHandle, int, const char*) override { return -1; }
    void ListSelect(ui::WindowHandle, int, int) override {}
    int ListSelection(ui::WindowHandle, int) override { return -1; }
    int ListCount(ui::WindowHandle, int) override { return 0; }
    void SetEditSelection(ui::WindowHandle, int, std::int32_t, std::int32_t) override {}
    void GetEditSelection(ui::WindowHandle, int, std::int32_t*, std::int32_t*) override {}
    void SetFocus(ui::WindowHandle, int) override {}
    int FocusedControl(ui::WindowHandle) override { return 0; }
    bool AskYesNo(ui::WindowHandle, const char*, const char*) override
    {
        ADD_FAILURE() << "the Trouble Shooter asks nothing itself";
        return false;
    }
    void ShowMessage(ui::WindowHandle, const char*, const char*) override {}
    bool ChooseOpenFile(const ui::FileDialogRequest&) override { return false; }
    bool ChooseSaveFile(const ui::FileDialogRequest&) override { return false; }
    void Beep() override {}
    std::uint32_t TickCount() override { return 0; }

private:
    ui::WindowHandle next_ = 100;
};
