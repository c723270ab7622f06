// A message waiting in a host's own queue, and what both hosts do with the queue when a
// window goes away.
#pragma once

#include <deque>
#include <mutex>
#include <set>

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

// What a host does with its queue when a window goes: posting threads stop seeing the window
// before its object lets go of what it owns (so nothing new is queued for it meanwhile), the
// object hears it is destroyed, and the messages still queued for it come back undelivered.
// mutex guards live and queue; it is not held while the object runs.
inline void RetireWindow(std::mutex& mutex, std::set<WindowHandle>& live,
                         std::deque<PostedMessage>& queue, WindowHandle window,
                         WindowObject& object)
{
    {
        std::lock_guard<std::mutex> lock(mutex);
        live.erase(window);
    }
    LResult ignored = 0;
    object.OnMessage(kMsgDestroy, 0, 0, ignored);

    std::deque<PostedMessage> dropped;
    {
        std::lock_guard<std::mutex> lock(mutex);
        dropped = TakeMessagesFor(queue, window);
    }
    for (const PostedMessage& posted : dropped) {
        object.OnUndelivered(posted.message, posted.wParam, posted.lParam);
    }
    object.DetachWindow();
}

} // namespace ui
