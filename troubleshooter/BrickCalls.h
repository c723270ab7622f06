// The library calls the Trouble Shooter makes, as one small interface, so that the diagnosis
// can run against the brick session (SessionBrickCalls) or against a scripted fake in tests.
// Every method has the parameters and result of the session method of the same name.
#pragma once

#include "tessel/TesselApi.h"

class BrickCalls {
public:
    virtual ~BrickCalls() = default;

    virtual tessel::Long FindPort(char* name, tessel::Size size) = 0;
    virtual tessel::Long Create(const char* port) = 0;
    virtual int Destroy(tessel::Long hBrick) = 0;
    virtual tessel::Long Status(tessel::Long hBrick, tessel::Short what, char* text,
                                tessel::Size size) = 0;
    virtual tessel::Long Set(tessel::Long hBrick, tessel::Short property, tessel::Short value) = 0;
    virtual tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value,
                             char* text, tessel::Size size) = 0;
    virtual tessel::Long FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                                   tessel::Size size) = 0;
    virtual tessel::Long FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                                  tessel::Size size) = 0;
    // Translates text as a one-line script for the Onyx2 brick and runs it at once.
    virtual tessel::Long RunImmediate(tessel::Long hBrick, const char* text,
                                      tessel::Long* result) = 0;
};
