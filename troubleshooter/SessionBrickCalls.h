// BrickCalls over the dialog's brick session: each call goes straight to the session's thin
// method or script runner, which reports a missing library as an ordinary error code.
//
// The adapter reads the dialog's session pointer at every call instead of keeping the
// session: a help session runs a nested message loop, in which the dialog may be closed and
// its session deleted (the pointer is then null). Calls made after that answer as a session
// without library would, instead of reaching freed memory.
#pragma once

#include "session/BrickSession.h"
#include "troubleshooter/BrickCalls.h"

class SessionBrickCalls final : public BrickCalls {
public:
    // session: where the dialog keeps its session; must outlive the adapter.
    explicit SessionBrickCalls(BrickSession* const* session) : session_(session) {}

    tessel::Long FindPort(char* name, tessel::Size size) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->FindPort(name, size) : kMissing;
    }
    tessel::Long Create(const char* port) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->Create(port) : 0;
    }
    int Destroy(tessel::Long hBrick) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->Destroy(hBrick) : 0;
    }
    tessel::Long Status(tessel::Long hBrick, tessel::Short what, char* text,
                        tessel::Size size) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->Status(hBrick, what, text, size) : tessel::kStatusNoLibrary;
    }
    tessel::Long Set(tessel::Long hBrick, tessel::Short property, tessel::Short value) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->Set(hBrick, property, value) : kMissing;
    }
    tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value, char* text,
                     tessel::Size size) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->Get(hBrick, property, value, text, size) : kMissing;
    }
    tessel::Long FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                           tessel::Size size) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->FindFirst(enumType, item, name, size) : kMissing;
    }
    tessel::Long FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                          tessel::Size size) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->FindNext(enumType, item, name, size) : kMissing;
    }
    tessel::Long RunImmediate(tessel::Long hBrick, const char* text, tessel::Long* result) override
    {
        BrickSession* s = *session_;
        return s != nullptr ? s->RunImmediate(hBrick, text, result) : kMissing;
    }

private:
    static constexpr tessel::Long kMissing = static_cast<tessel::Long>(tessel::kLinkFailed);

    BrickSession* const* session_;
};
