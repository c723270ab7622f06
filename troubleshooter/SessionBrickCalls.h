// BrickCalls over the dialog's brick session: each call goes straight to the session's thin
// method or script runner, which reports a missing library as an ordinary error code.
#pragma once

#include "session/BrickSession.h"
#include "troubleshooter/BrickCalls.h"

class SessionBrickCalls final : public BrickCalls {
public:
    explicit SessionBrickCalls(BrickSession& session) : session_(session) {}

    tessel::Long FindPort(char* name, tessel::Size size) override
    {
        return session_.FindPort(name, size);
    }
    tessel::Long Create(const char* port) override { return session_.Create(port); }
    int Destroy(tessel::Long hBrick) override { return session_.Destroy(hBrick); }
    tessel::Long Status(tessel::Long hBrick, tessel::Short what, char* text,
                        tessel::Size size) override
    {
        return session_.Status(hBrick, what, text, size);
    }
    tessel::Long Set(tessel::Long hBrick, tessel::Short property, tessel::Short value) override
    {
        return session_.Set(hBrick, property, value);
    }
    tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value, char* text,
                     tessel::Size size) override
    {
        return session_.Get(hBrick, property, value, text, size);
    }
    tessel::Long FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                           tessel::Size size) override
    {
        return session_.FindFirst(enumType, item, name, size);
    }
    tessel::Long FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                          tessel::Size size) override
    {
        return session_.FindNext(enumType, item, name, size);
    }
    tessel::Long RunImmediate(tessel::Long hBrick, const char* text, tessel::Long* result) override
    {
        return session_.RunImmediate(hBrick, text, result);
    }

private:
    BrickSession& session_;
};
