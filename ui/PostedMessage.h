// A message waiting in a host's own queue, and what both hosts do with the queue when a
// window goes away.
#pragma once

#include <deque>

#include "ui/Window.h"

namespace ui {

struct PostedMessage {
    WindowHandle window;
    Message message;
    WParam wParam;
    LParam lParam;
};

// Takes every message queued for window out of queue, in queue order. The caller holds the
// lock that guards the queue and hands the messages back to their object undelivered, so a
// posted result file is released rather than lost.
inline std::deque<PostedMessage> TakeMessagesFor(std::deque<PostedMessage>& queue,
                                                 WindowHandle window)
{
    std::deque<PostedMessage> taken;
    for (auto it = queue.begin(); it != queue.end();) {
        if (it->window == window) {
            taken.push_back(*it);
            it = queue.erase(it);
        } else {
            ++it;
        }
    }
    return taken;
}

} // namespace ui
